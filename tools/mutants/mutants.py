#!/usr/bin/env python3
"""Plant faults, one at a time, and say which of them nothing finds.

    tools/mutants/mutants.py BUILD [--rows N|all] [--built N] [--rules N] [--seed N] [--only REGEX] [--target T] [--no-names]

Faults in rows are judged by what is read without building: the committed prototypes, then the names of the rows. Those
that pass are built, many rows at once, and judged by the tests of the rows that they touch (--built: how many at most).
Faults in rules are built one by one and judged by the tests of their family. BUILD has the test program and a library
for TARGET alone. equivalent.txt lists the faults that change nothing. Exit status 1 if a fault survives.
"""

import argparse
import collections
import concurrent.futures
import hashlib
import os
import re
import sys
import tempfile

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import build as building  # noqa: E402
import cells  # noqa: E402
import rules  # noqa: E402
import static  # noqa: E402

ROOT = static.ROOT
SOURCES = os.path.join(ROOT, "src")


def progress(text):
    if sys.stderr.isatty():
        print(f"\r\033[K{text}", end="", file=sys.stderr, flush=True)


def in_order(mutants, seed):
    """The mutants in an order that the seed gives, in which one keeps its place when sources change elsewhere."""
    return sorted(mutants, key=lambda mutant: hashlib.sha256(f"{seed} {mutant.key}".encode()).digest())


class Equivalent:
    """The known faults that change nothing."""

    def __init__(self, path):
        with open(path, encoding="utf-8") as file:
            lines = [line.rstrip("\n") for line in file]
        self.patterns = [re.compile(line) for line in lines if line and not line.startswith("#")]

    def __contains__(self, mutant):
        return any(pattern.fullmatch(mutant.key) for pattern in self.patterns)


def write_faulty(scratch, mutants):
    """The files of the mutants, with all of them in."""
    for path, group in static.by_path(mutants).items():
        with open(os.path.join(SOURCES, path), encoding="utf-8") as file:
            lines = file.read().split("\n")
        for mutant in group:
            lines[mutant.number - 1] = mutant.apply(lines[mutant.number - 1])
        os.makedirs(os.path.join(scratch, "src", os.path.dirname(path)), exist_ok=True)
        with open(os.path.join(scratch, "src", path), "w", encoding="utf-8") as file:
            file.write("\n".join(lines))


# --- Rows -------------------------------------------------------------------------------------------------


def operation(row):
    """The name that a row's test has."""
    return row.partition("_ZRA_")[2] or row


def judge_built(builder, group, touched):
    """Mutant -> what finds it, of mutants in different rows that are built together."""
    found, group = {}, list(group)
    while group:
        with tempfile.TemporaryDirectory() as scratch:
            write_faulty(scratch, group)
            try:
                if not builder.rebuild(scratch, {mutant.path for mutant in group}):
                    return {**found, **dict.fromkeys(group, "same code")}
            except building.Failed as failed:
                culprits = [m for m in group if re.search(rf"/src/{re.escape(m.path)}:{m.number}:", str(failed))]
                if not culprits and len(group) > 1:
                    for half in (group[::2], group[1::2]):
                        found.update(judge_built(builder, half, touched))
                    return found
                found.update(dict.fromkeys(culprits or group, "compiler"))
                group = [mutant for mutant in group if mutant not in found]
                continue
            names = {m: {operation(row) for row in touched[static.place(m)]} for m in group}
            pattern = ":".join(f"*.{name}" for name in sorted(set().union(*names.values())))
            status, output = builder.run(scratch, pattern or "*")
            if not pattern:  # a register type, alone
                return {**found, **dict.fromkeys(group if status != 0 else [], "tests")}
            failed = {name.partition(".")[2] for name in re.findall(r"\[  FAILED  \] (\w+\.\w+)", output)}
            found.update((m, "tests") for m in group if names[m] & failed)
            return found
    return found


def judge_rows(arguments, equivalent, builder):
    lines = cells.read_lines(SOURCES)
    planted = [m for m in cells.all_mutants(lines) if re.search(arguments.only, m.path)]
    if arguments.rows != "all":
        planted = in_order(planted, arguments.seed)[:int(arguments.rows)]
    done = [0]

    def count(number):
        done[0] += number
        progress(f"rows: {done[0]} judged without building")

    with tempfile.TemporaryDirectory() as directory:
        found, touched = static.judge(directory, lines, planted, count, arguments.names)
    found.update((m, "equivalent") for m in planted if m not in found and m in equivalent)
    left = [m for m in planted if m not in found]
    if len(left) > arguments.built:
        chosen = set(in_order(left, arguments.seed)[:arguments.built])
        found.update((m, "not built") for m in left if m not in chosen)
        left = [m for m in left if m in chosen]
    groups = [[m] for m in left if not touched[static.place(m)]]
    groups += static.passes([m for m in left if touched[static.place(m)]])
    for number, group in enumerate(groups, 1):
        progress(f"rows: batch {number} of {len(groups)}, {len(group)} faults")
        found.update(judge_built(builder(), group, touched))
    return planted, found


# --- Rules ------------------------------------------------------------------------------------------------


def tests_of(builder, objects):
    """A filter of the tests of the families whose tables the objects are compiled from."""
    def tables(name):
        return {path for path in builder.dependencies.get(name, ()) if path.endswith(".def") and path != "src/frame/types.def"}

    wanted = set().union(*(tables(name) for name in objects))
    directories = {re.search(r"\.dir/(.*)/", name)[1] for name in builder.objects[builder.program] if tables(name) & wanted}
    suites = set()
    for directory in directories:
        for name in os.listdir(os.path.join(ROOT, "tests", directory)):
            if name.endswith(".cpp"):
                with open(os.path.join(ROOT, "tests", directory, name), encoding="utf-8") as file:
                    suites.update(re.findall(r'(?:\bTEST\(|\badd_test\("|KASTARRI_TEST_SUITE ")(\w+)', file.read()))
    return ":".join(f"{suite}.*" for suite in sorted(suites)) or "*"


def judge_rule(builder, mutant):
    """What finds the mutant, or nothing."""
    with tempfile.TemporaryDirectory() as scratch:
        write_faulty(scratch, [mutant])
        try:
            if not builder.rebuild(scratch, [mutant.path]):
                return "same code"
        except building.Failed:
            return "compiler"
        status, _ = builder.run(scratch, tests_of(builder, builder.dependents(builder.library, [mutant.path])), "--gtest_fail_fast")
        return "tests" if status != 0 else None


def judge_rules(arguments, equivalent, builder):
    """As many mutants as are wanted, of what this target is compiled from."""
    everything = in_order([m for m in rules.all_mutants(SOURCES) if re.search(arguments.only, m.path)], arguments.seed)
    planted, found = [], {}
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        waiting = {}
        for mutant in everything:
            objects = len(builder().dependents(builder().library, [mutant.path]))
            if not 0 < objects <= arguments.objects:
                continue
            if len(planted) >= arguments.rules:
                break
            planted.append(mutant)
            if mutant in equivalent:
                found[mutant] = "equivalent"
            else:
                waiting[pool.submit(judge_rule, builder(), mutant)] = mutant
        for number, future in enumerate(concurrent.futures.as_completed(waiting), 1):
            progress(f"rules: {number} of {len(waiting)}")
            if future.result():
                found[waiting[future]] = future.result()
    return planted, found


# --- Report -----------------------------------------------------------------------------------------------


def report(title, planted, found):
    """A table by family, and the survivors."""
    verdicts = [v for v in ("prototype", "name", "compiler", "tests", "report", "same code", "equivalent", "not built") if v in found.values()]
    counts = collections.defaultdict(collections.Counter)
    for mutant in planted:
        counts[mutant.path.split("/")[0]][found.get(mutant, "survive")] += 1
        counts["all"][found.get(mutant, "survive")] += 1
    widths = [max(9, len(v)) for v in verdicts]
    progress("")
    print(f"{title + ' in':12} {'planted':>8}", *(f"{v:>{w}}" for v, w in zip(verdicts, widths)), f"{'survive':>8}")
    for family in sorted(counts, key=lambda name: (name == "all", name)):
        print(f"{family:12} {sum(counts[family].values()):8}", *(f"{counts[family][v]:{w}}" for v, w in zip(verdicts, widths)),
              f"{counts[family]['survive']:8}")
    survivors = [m for m in planted if m not in found]
    for mutant in survivors:
        path, what = mutant.key.split(" ", 1)
        print(f"survives: src/{path}:{mutant.number}: {what}")
    return survivors


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build")
    parser.add_argument("--rows", default="all", help="how many faults in rows, or all of them")
    parser.add_argument("--built", type=int, default=sys.maxsize, help="how many of those that pass the static checks are built")
    parser.add_argument("--rules", type=int, default=40, help="how many faults in rules")
    parser.add_argument("--objects", type=int, default=sys.maxsize, help="leave out rules that more objects than this have")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--only", default="", help="a regular expression of tables and sources, as integer/ or pack")
    parser.add_argument("--target", default="sse2")
    parser.add_argument("--no-names", dest="names", action="store_false", help="go without the check of rows against names")
    arguments = parser.parse_args()
    equivalent = Equivalent(os.path.join(os.path.dirname(os.path.abspath(__file__)), "equivalent.txt"))
    builders = []

    def builder():
        if not builders:
            builders.append(building.Build(ROOT, arguments.build, arguments.target))
        return builders[0]

    survivors = report("rows", *judge_rows(arguments, equivalent, builder)) if arguments.rows != "0" else []
    if arguments.rules:
        survivors += report("rules", *judge_rules(arguments, equivalent, builder))
    return 1 if survivors else 0


if __name__ == "__main__":
    sys.exit(main())
