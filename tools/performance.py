#!/usr/bin/env python3
"""Time every intrinsic on every target that this processor runs; write a summary and the table of them all.

    tools/performance.py BUILD [--clang BUILD] [--summary FILE] [--table FILE] [--costs FILE] [--filter REGEX]
                         [--repetitions N] [--seconds S]

BUILD is a build directory with the benchmarks in it. Every figure is in cycles, which a chain of multiplications of
the same run tells: medians of the repetitions. bench/limits.txt says how much an intrinsic may cost on the processor
that it names; what is above is printed, and marked in the table. The summary has whole kernels, too (kernels.py).
"""

import argparse
import csv
import io
import os
import re
import statistics
import subprocess
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import generate_headers  # noqa: E402
import kernels  # noqa: E402
from cmake_cache import cached  # noqa: E402

TARGETS = ["avx512", "avx2", "sse2"]
BASELINE = "rk_zra32_qv_vecNx16_move"
CYCLES = "3000 cycles"
DIRECTED = ["zero", "up", "down"]
MAGNITUDES = ["spread", "fresh"]
SPECIAL = 10

KERNELS = [
    "Nanoseconds an item, the shortest of many runs by turns. Scalar C is built with `-O2 -fno-tree-vectorize`. The loops of",
    "g++ and clang++ are the same work as compilers vectorise it best: in blocks of 8, 16 or 32 neighbouring results, of which",
    "the quickest counts, with taps hoisted and sums as wide as the core's, for the same instruction set. The kernels are",
    "compiled for it too, and call the shared library or have the static one inlined. The last column says how many times as",
    "fast as the better compiler's loop the inlined kernel is. `chain at 16 mod 64` is a FIR of 16 `MULANX16` taps whose registers",
    "begin 16 bytes after a cache line.",
]


def run(build, target, pattern, repetitions, seconds):
    """Benchmark -> median time in nanoseconds, or None where the processor does not run the target."""
    environment = dict(os.environ, LD_LIBRARY_PATH=os.path.join(build, "tests", "only", target))
    command = [os.path.join(build, "bench", "kastarri_bench"),
               f"--benchmark_filter=^({BASELINE}|{CYCLES})(/repeats:[0-9]+)?$|{pattern}",
               f"--benchmark_repetitions={repetitions}", f"--benchmark_min_time={seconds}", "--benchmark_format=csv",
               "--benchmark_enable_random_interleaving=true"]
    result = subprocess.run(command, env=environment, capture_output=True, text=True, check=False)
    if f"target: {target}" not in result.stderr:
        return None
    if result.returncode != 0:
        sys.exit(f"{' '.join(command)}\n{result.stderr}")
    times = {}
    table = result.stdout[result.stdout.index("name,"):]
    for row in csv.DictReader(io.StringIO(table)):
        name = re.sub(r"/repeats:[0-9]+", "", row["name"])
        if not re.search(r"_(mean|median|stddev|cv)$", name):
            times.setdefault(name, []).append(float(row["cpu_time"]))
    return {name: statistics.median(values) for name, values in times.items()}


def read_limits():
    """The processor that they are for, and [(pattern, {target: cycles})], of which the first that matches counts."""
    named, limits = None, []
    with open(os.path.join(ROOT, "bench", "limits.txt"), encoding="utf-8") as file:
        for line in file:
            if line.startswith("processor:"):
                named = line.partition(":")[2].strip()
            elif line.strip() and not line.startswith("#"):
                pattern, *cycles = line.split()
                limits.append((re.compile(pattern), dict(zip(TARGETS, map(float, cycles)))))
    return named, limits


def limit_of(name, target, limits):
    """A limit holds in every rounding mode; operands with special values may take SPECIAL times as long."""
    name, _, variant = name.partition("/")
    for pattern, cycles in limits:
        if pattern.fullmatch(name):
            return cycles[target] * (SPECIAL if variant == "special" else 1)
    return None


def processor():
    """Its name, with family and model, as many have the same name."""
    with open("/proc/cpuinfo", encoding="utf-8") as file:
        told = dict(re.findall(r"^(.+?)\s*: (.*)$", file.read(), re.M))
    return f"{told['model name']} (family {told['cpu family']}, model {told['model']})"


def cell(name, target, cycles, limits):
    taken, limit = cycles[target].get(name), limit_of(name, target, limits)
    if taken is None:
        return ""
    return f"**{taken:.1f}** (limit {limit:g})" if limit and taken > limit else f"{taken:.1f}"


def table_lines(names, cycles, limits):
    yield from headed(cycles, "intrinsic")
    for name in names:
        yield f"| `{name}` | " + " | ".join(cell(name, target, cycles, limits) for target in cycles) + " |"


def variant_lines(cycles, limits):
    """The slowest of the directed rounding modes, of operands of many magnitudes, and those with special values."""
    measured = next(iter(cycles.values()))
    yield from headed([f"{t} {kind}" for t in cycles for kind in ("directed", "many magnitudes", "special")], "intrinsic")
    for name in dict.fromkeys(n.partition("/")[0] for n in measured if "/" in n):
        cells = []
        for target in cycles:
            for variants in DIRECTED, MAGNITUDES, ["special"]:
                found = [f"{name}/{variant}" for variant in variants if f"{name}/{variant}" in cycles[target]]
                cells.append(cell(max(found, key=cycles[target].get, default=name + "/none"), target, cycles, limits))
        yield f"| `{name}` | " + " | ".join(cells) + " |"


def headed(cycles, *columns):
    """The head of a table of targets."""
    columns = [*columns, *cycles]
    return ["| " + " | ".join(columns) + " |", "|---|" + "---|" * (len(columns) - 1)]


def family_lines(families, cycles):
    """The middle intrinsic of each family."""
    yield from headed(cycles, "family")
    for title, names in families.items():
        medians = [f"{statistics.median(found[n] for n in names):.1f}" for found in cycles.values()]
        yield f"| {title} | " + " | ".join(medians) + " |"


def slowest_lines(families, cycles, limits):
    """The slowest intrinsic of each family, and how many of the family are above their limits."""
    yield from headed(cycles, "family")
    for title, names in families.items():
        cells = []
        for target, found in cycles.items():
            slowest = max(names, key=found.get)
            above = sum(found[n] > (limit_of(n, target, limits) or found[n]) for n in names)
            cells.append(f"`{slowest}` {found[slowest]:.1f}; {above} above")
        yield f"| {title} | " + " | ".join(cells) + " |"


class Measured:
    """Cycles by target and name, and what the documents say of where they come from."""

    def __init__(self, times, processor_name, bits):
        def known_as(name):
            symbol, slash, variant = name.partition("/")
            return (generate_headers.short_name(symbol) if symbol.startswith("rk_") else symbol) + slash + variant

        self.processor, self.bits = processor_name, bits
        self.cycle = {t: found.pop(CYCLES) / 3000 for t, found in times.items()}
        self.copies = {t: found[BASELINE] / self.cycle[t] for t, found in times.items()}
        self.cycles = {t: {known_as(n): v / self.cycle[t] for n, v in found.items()} for t, found in times.items()}
        self.names = next(iter(self.cycles.values()))
        families = {}
        for title, _, rows in generate_headers.all_rows().values():
            names = dict.fromkeys(generate_headers.short_name(row[0]) for row in rows)
            families[title] = [n for n in names if n in self.names]
        self.families = {title: names for title, names in families.items() if names}

    def introduction(self, what):
        copies = ", ".join(f"{cycles:.1f} ({target})" for target, cycles in self.copies.items())
        return [f"# Performance of {self.bits}-bit programs", "",
                f"{what}, operands in memory, in cycles. Medians.", "",
                f"Measured on: {self.processor}, where a call that copies one register (64 bytes) took",
                f"{copies} cycles. A cycle, {min(self.cycle.values()):.2f} ns, is a third of what an integer multiplication takes in a",
                "chain of them, timed in the same run.", ""]


def kernel_lines(build, clang_build):
    """Whole kernels, and what they gain over scalar C."""
    yield from ("## Whole kernels", "", *KERNELS)
    gains = {}
    for target, found in kernels.all_targets(build, clang_build):
        yield from ("", f"### {target}", "", *kernels.table(found))
        times = found["FIR of 16 taps"]
        gains[target] = times["scalar C"] / times["calls"]
    yield from ("", "The FIR of 16 taps, as calls of the shared library, against scalar C:", "", "| target | speed-up |", "|---|---|")
    yield from (f"| {target} | {gain:.2f} |" for target, gain in gains.items())
    yield ""


OTHER_WIDTH = {
    32: ["`make bench` measures it on your machine, writes this page anew and every intrinsic to `build/performance.md`.",
         "[performance-64.md](performance-64.md) has the figures of 64-bit programs."],
    64: ["`make bench BITS=64` measures it on your machine, writes this page anew and every intrinsic to `build/performance-64.md`.",
         "What costs much, and why, is the same as in 32-bit programs: [performance.md](performance.md)."],
}


def summary(measured, limits, kernels_of):
    """What stands in the repository: whole kernels, the families, their slowest, and, once for both widths, why."""
    cycles = measured.cycles
    lines = [*measured.introduction("What a call costs"), *OTHER_WIDTH[measured.bits], ""]
    lines += kernel_lines(*kernels_of)
    lines += ["## Families", "", "The median of each family's intrinsics.", "", *family_lines(measured.families, cycles), "",
              "The slowest of each family, and how many are above the limits that `bench/limits.txt` sets.", "",
              *slowest_lines(measured.families, cycles, limits), ""]
    if measured.bits == 64:
        return "\n".join(lines)
    with open(os.path.join(ROOT, "bench", "notes.md"), encoding="utf-8") as notes:
        return "\n".join(lines) + "\n" + notes.read()


def full_table(measured, limits):
    lines = measured.introduction("A call of each intrinsic")
    lines += ["Figures in bold are above the limit set in `bench/limits.txt`.", ""]
    for title, names in measured.families.items():
        lines += [f"## {title}", "", *table_lines(names, measured.cycles, limits), ""]
    if any("/" in n for n in measured.names):
        lines += ["## Rounding modes and special values", "",
                  "Directed: the slowest of rounding toward zero, up and down; the limit is that of rounding to nearest.",
                  "Many magnitudes: exponents from -12 to 11 (of halves from -6 to 5), with a zero in every register, or with",
                  "an accumulator of 0, the slower of both; an accumulator is put back before every call, by a copy.",
                  "Special: a NaN, an infinity, a subnormal number and a zero among the lanes of each operand; the limit",
                  f"is {SPECIAL} times as high.", "", *variant_lines(measured.cycles, limits), ""]
    return "\n".join(lines)


def costs(measured):
    """Cycles for programs to read: a line with the processor, then name and cycles on each target."""
    yield f"# cycles a call costs, operands in memory, measured on: {measured.processor}"
    yield ",".join(["name", *measured.cycles])
    for name in (name for names in measured.families.values() for name in names):
        yield ",".join([name, *(f"{found[name]:.1f}" for found in measured.cycles.values())])


def write(path, text):
    os.makedirs(os.path.dirname(os.path.abspath(path)), exist_ok=True)
    with open(path, "w", encoding="utf-8") as file:
        file.write(text)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build")
    parser.add_argument("--clang", help="a build directory of clang, for kernels that it inlines")
    parser.add_argument("--summary", help="where the summary goes")
    parser.add_argument("--table", help="where the table of every intrinsic goes; without it, to the standard output")
    parser.add_argument("--costs", help="where the costs go for programs to read, as name and cycles on each target")
    parser.add_argument("--filter", default=".")
    parser.add_argument("--repetitions", type=int, default=5)
    parser.add_argument("--seconds", type=float, default=0.005, help="the least time of one repetition")
    arguments = parser.parse_args()
    times = {}
    for target in TARGETS:
        found = run(arguments.build, target, arguments.filter, arguments.repetitions, arguments.seconds)
        if found:
            times[target] = found
    measured, (limited, limits) = Measured(times, processor(), int(cached(arguments.build, "KASTARRI_BITS"))), read_limits()
    if limited != measured.processor:
        print(f"the limits are of another processor: {limited}", file=sys.stderr)
    if arguments.summary:
        write(arguments.summary, summary(measured, limits, (arguments.build, arguments.clang)))
    if arguments.costs:
        write(arguments.costs, "".join(line + "\n" for line in costs(measured)))
    if arguments.table:
        write(arguments.table, full_table(measured, limits))
    else:
        print(full_table(measured, limits))
    for target, found in measured.cycles.items():
        for name, taken in found.items():
            limit = limit_of(name, target, limits)
            if limit and taken > limit:
                print(f"above its limit: {name} {target} {taken:.1f} > {limit:g}")


if __name__ == "__main__":
    main()
