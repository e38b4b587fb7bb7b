#!/usr/bin/env python3
"""Plant faults in rows, and say of which the programs of kastarri-conform give the same report.

    tools/mutants/conformance.py BUILD [--faults N] [--seed N] [--only REGEX] [--target T]

Planted are, in each line of a table and each expression of the scalar core, N faults that leave all prototypes as they are:
others do not compile. A fault is found if the report's line of an intrinsic that it touches changes, or is the first that is
missing. indistinguishable.txt lists faults that no program can tell, with the reason. BUILD has a library for TARGET alone.
Exit status 1 if another fault is not found.
"""

import argparse
import collections
import os
import re
import sys
import tempfile

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import build as building  # noqa: E402
import cells  # noqa: E402
import mutants as planting  # noqa: E402
import rules  # noqa: E402
import static  # noqa: E402

sys.path[:0] = [os.path.join(static.ROOT, "tools"), os.path.join(static.ROOT, "tools", "conform")]
import generate_headers  # noqa: E402
import programs  # noqa: E402
import register_access  # noqa: E402
import runs  # noqa: E402

HERE = os.path.dirname(os.path.abspath(__file__))


class Reports:
    """The programs, and what they print with libraries that have faults."""

    def __init__(self, build, builder, directory):
        self.directory = os.path.dirname(os.path.join(builder.directory, builder.library))
        sources = runs.write_programs(build, os.path.join(directory, "sources"))
        self.programs = runs.compile_programs(sources, os.path.join(directory, "programs"), "g++",
                                              [build.width, "-O1", *runs.USER_FLAGS], ["-L", self.directory, "-lkastarri"])
        self.right = self.run(self.directory)

    def run(self, library):
        """Of each program, in order, what it prints of each intrinsic."""
        return runs.in_parallel(lambda program: runs.run_program(program, library, timeout=300), self.programs)

    def changed(self, library):
        """The intrinsics of which something else is printed or that ended a program, and those behind them that were not
        reached."""
        changed, unknown = set(), set()
        for right, found in zip(self.right, self.run(library)):
            missing = [name for name in right if name not in found]
            changed.update(name for name in right if name in found and found[name] != right[name])
            changed.update(missing[:1])
            unknown.update(missing[1:])
        plain = {name.partition("/")[0] for name in changed}
        return plain, {name.partition("/")[0] for name in unknown} - plain


def place(mutant):
    return mutant.path, mutant.number


def names_of(rows):
    return {generate_headers.short_name(row) for row in rows}


def judge(reports, builder, group, touched):
    """Mutant -> what finds it, of mutants in different rows that are built together."""
    found, group = {}, list(group)
    while group:
        with tempfile.TemporaryDirectory() as scratch:
            planting.write_faulty(scratch, group)
            try:
                if not builder.rebuild_library(scratch, {mutant.path for mutant in group}):
                    return {**found, **dict.fromkeys(group, "same code")}
            except building.Failed as failed:
                culprits = [m for m in group if re.search(rf"/src/{re.escape(m.path)}:{m.number}:", str(failed))]
                if not culprits and len(group) > 1:
                    for half in (group[::2], group[1::2]):
                        found.update(judge(reports, builder, half, touched))
                    return found
                found.update(dict.fromkeys(culprits or group, "compiler"))
            else:
                changed, unknown = reports.changed(scratch)
                for mutant in group:
                    names = names_of(touched[place(mutant)])
                    if names & changed or (unknown and len(group) == 1):
                        found[mutant] = "report"
                    elif not names & unknown:
                        found[mutant] = "survive"
            group = [mutant for mutant in group if mutant not in found]
    return {mutant: verdict for mutant, verdict in found.items() if verdict != "survive"}


def is_called(mutant, touched):
    """Whether the programs call a row that the fault is in."""
    rows = names_of(touched[place(mutant)])
    return mutant.path not in programs.LEFT_OUT and any(name not in programs.LEFT_OUT for name in rows)


def plant(arguments):
    """Of each line some faults that the headers do not tell; and the rows that each touches."""
    lines = cells.read_lines(planting.SOURCES)
    in_cells = [m for m in cells.all_mutants(lines) if re.search(arguments.only, m.path) and m.line.kind != "TYPE"]
    with tempfile.TemporaryDirectory() as directory:
        found, touched = static.judge(directory, lines, in_cells, lambda _: None, by_names=False)
    in_expressions = [m for m in rules.all_mutants(planting.SOURCES)
                      if m.path.endswith(".def") and re.search(arguments.only, m.path)]
    by_line = collections.defaultdict(list)
    for mutant in planting.in_order(in_cells + in_expressions, arguments.seed):
        if mutant not in found and is_called(mutant, touched) and len(by_line[place(mutant)]) < arguments.faults:
            by_line[place(mutant)].append(mutant)
    return [mutant for group in by_line.values() for mutant in group], touched


def groups_of(mutants):
    """Groups that can be built together: expressions of the scalar core's rows, which are all there is of them, one a line."""
    turns = collections.defaultdict(list)
    for mutant in (m for m in mutants if isinstance(m, rules.Mutant)):
        turns[sum(place(m) == place(mutant) for group in turns.values() for m in group)].append(mutant)
    return [*turns.values(), *static.passes([m for m in mutants if isinstance(m, cells.Mutant)])]


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build")
    parser.add_argument("--faults", type=int, default=1, help="how many in a line (default: %(default)s)")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--only", default="", help="a regular expression of tables, as integer/ or pack")
    parser.add_argument("--target", default="sse2")
    arguments = parser.parse_args()
    builder = building.Build(static.ROOT, arguments.build, arguments.target)
    known = [planting.Equivalent(os.path.join(HERE, name)) for name in ("equivalent.txt", "indistinguishable.txt")]
    planted, touched = plant(arguments)
    found = {}
    with tempfile.TemporaryDirectory() as directory:
        reports = Reports(runs.Build(arguments.build), builder, directory)
        left = []
        for mutant in planted:
            if any(mutant in faults for faults in known):
                found[mutant] = "equivalent"
            else:
                left.append(mutant)
        # What programs fill and read registers with changes all reports: alone.
        single = [m for m in left if names_of(touched[place(m)]) & register_access.FOUNDATIONS]
        groups = [[m] for m in single] + groups_of([m for m in left if m not in single])
        for number, group in enumerate(groups, 1):
            planting.progress(f"batch {number} of {len(groups)}, {len(group)} faults")
            found.update(judge(reports, builder, group, touched))
        for mutant in [m for m in left if m not in found]:  # of many that are built together few change no code
            found.update(judge(reports, builder, [mutant], touched))
    return 1 if planting.report("rows", planted, found) else 0


if __name__ == "__main__":
    sys.exit(main())
