#!/usr/bin/env python3
"""Time every intrinsic on every target that this processor runs, and write the table.

    tools/performance.py BUILD [OUTPUT] [--filter REGEX] [--repetitions N] [--seconds S]

BUILD is a build directory with the benchmarks in it. Every figure is a ratio, within one run, to an exported
call that copies one register (qv_vecNx16_move): medians of the repetitions. bench/limits.txt says how much an
intrinsic may cost; what is above is printed, and marked in the table.
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

TARGETS = ["avx512", "avx2", "sse2"]
BASELINE = "rk_zra32_qv_vecNx16_move"
CYCLES = "3000 cycles"
DIRECTED = ["zero", "up", "down"]
MAGNITUDES = ["spread", "fresh"]
SPECIAL = 10


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
    """[(pattern, {target: ratio})], the first that matches counts."""
    limits = []
    with open(os.path.join(ROOT, "bench", "limits.txt"), encoding="utf-8") as file:
        for line in file:
            if line.strip() and not line.startswith("#"):
                pattern, *ratios = line.split()
                limits.append((re.compile(pattern), dict(zip(TARGETS, map(float, ratios)))))
    return limits


def limit_of(name, target, limits):
    """A limit holds in every rounding mode; operands with special values may take SPECIAL times as long."""
    name, _, variant = name.partition("/")
    for pattern, ratios in limits:
        if pattern.fullmatch(name):
            return ratios[target] * (SPECIAL if variant == "special" else 1)
    return None


def processor():
    with open("/proc/cpuinfo", encoding="utf-8") as file:
        text = file.read()
    family, model, name = (re.search(rf"^{key}\s*: (.*)", text, re.M)[1] for key in ("cpu family", "model", "model name"))
    return f"{name} (family {family}, model {model})"


def cell(name, target, ratios, limits):
    ratio, limit = ratios[target].get(name), limit_of(name, target, limits)
    if ratio is None:
        return ""
    return f"**{ratio:.1f}** (limit {limit:g})" if limit and ratio > limit else f"{ratio:.1f}"


def table_lines(names, ratios, limits):
    targets = [t for t in TARGETS if t in ratios]
    yield "| intrinsic | " + " | ".join(targets) + " |"
    yield "|---|" + "---|" * len(targets)
    for name in names:
        yield f"| `{name}` | " + " | ".join(cell(name, target, ratios, limits) for target in targets) + " |"


def variant_lines(ratios, limits):
    """The slowest of the directed rounding modes, of operands of many magnitudes, and those with special values."""
    targets = [t for t in TARGETS if t in ratios]
    measured = next(iter(ratios.values()))
    yield "| intrinsic | " + " | ".join(f"{t} directed | {t} many magnitudes | {t} special" for t in targets) + " |"
    yield "|---|" + "---|---|---|" * len(targets)
    for name in dict.fromkeys(n.partition("/")[0] for n in measured if "/" in n):
        cells = []
        for target in targets:
            for variants in DIRECTED, MAGNITUDES, ["special"]:
                found = [f"{name}/{variant}" for variant in variants if f"{name}/{variant}" in ratios[target]]
                cells.append(cell(max(found, key=ratios[target].get, default=name + "/none"), target, ratios, limits))
        yield f"| `{name}` | " + " | ".join(cells) + " |"


def family_lines(families, ratios):
    """The middle intrinsic of each family."""
    targets = [t for t in TARGETS if t in ratios]
    yield "| family | intrinsics | " + " | ".join(targets) + " |"
    yield "|---|---|" + "---|" * len(targets)
    for title, names in families.items():
        medians = [f"{statistics.median(ratios[t][n] for n in names):.1f}" for t in targets]
        yield f"| {title} | {len(names)} | " + " | ".join(medians) + " |"


def document(times, limits):
    def known_as(name):
        symbol, slash, variant = name.partition("/")
        return (generate_headers.short_name(symbol) if symbol.startswith("rk_") else symbol) + slash + variant

    cycle = {t: found.pop(CYCLES) / 3000 for t, found in times.items()}
    ratios = {t: {known_as(n): v / times[t][BASELINE] for n, v in found.items()} for t, found in times.items()}
    measured = next(iter(ratios.values()))
    lines = ["# Performance", "",
             "A call of each intrinsic, operands in memory, as a multiple of an exported call that copies one",
             "register (`qv_vecNx16_move`, 64 bytes) in the same run. Medians. Measured on " + processor() + " by", "",
             "    make bench", "",
             "On that machine the copy took " +
             ", ".join(f"{times[t][BASELINE]:.1f} ns or {times[t][BASELINE] / cycle[t]:.1f} cycles ({t})"
                       for t in TARGETS if t in times) + ";",
             "a cycle is a third of what an integer multiplication takes in a chain of them, timed in the same run.",
             "Figures in bold are above the limit set in `bench/limits.txt`; the notes at the end say why.", ""]
    if any("fir_scalar" in n for n in measured):
        lines += ["## A whole kernel", "",
                  "FIR filter of 16 taps (`examples/fir`), samples a second, against the scalar C loop built with",
                  "`-O2 -fno-tree-vectorize`:", "", "| target | speed-up |", "|---|---|"]
        lines += [f"| {t} | {ratios[t]['fir_scalar'] / ratios[t]['fir_kernel']:.2f} |" for t in TARGETS if t in ratios]
        lines += [""]
    families = {}
    for title, _, rows in generate_headers.all_rows().values():
        names = dict.fromkeys(generate_headers.short_name(row[0]) for row in rows)
        families[title] = [n for n in names if n in measured]
    families = {title: names for title, names in families.items() if names}
    lines += ["## Families", "", "The median of each family's intrinsics.", ""] + list(family_lines(families, ratios)) + [""]
    for title, names in families.items():
        lines += [f"## {title}", ""] + list(table_lines(names, ratios, limits)) + [""]
    if any("/" in n for n in measured):
        lines += ["## Rounding modes and special values", "",
                  "Directed: the slowest of rounding toward zero, up and down; the limit is that of rounding to nearest.",
                  "Many magnitudes: exponents from -12 to 11 (of halves from -6 to 5), with a zero in every register, or with",
                  "an accumulator of 0, the slower of both; an accumulator is put back before every call, by a copy.",
                  "Special: a NaN, an infinity, a subnormal number and a zero among the lanes of each operand; the limit",
                  f"is {SPECIAL} times as high.", ""] + list(variant_lines(ratios, limits)) + [""]
    notes = os.path.join(ROOT, "bench", "notes.md")
    if os.path.exists(notes):
        lines += [open(notes, encoding="utf-8").read().rstrip(), ""]
    above = [(n, t, r, limit_of(n, t, limits)) for t, found in ratios.items() for n, r in found.items()
             if (limit_of(n, t, limits) or r) < r]
    return "\n".join(lines), above


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build")
    parser.add_argument("output", nargs="?")
    parser.add_argument("--filter", default=".")
    parser.add_argument("--repetitions", type=int, default=5)
    parser.add_argument("--seconds", type=float, default=0.005, help="the least time of one repetition")
    arguments = parser.parse_args()
    times = {}
    for target in TARGETS:
        found = run(arguments.build, target, arguments.filter, arguments.repetitions, arguments.seconds)
        if found:
            times[target] = found
    text, above = document(times, read_limits())
    if arguments.output:
        with open(arguments.output, "w", encoding="utf-8") as file:
            file.write(text)
    else:
        print(text)
    for name, target, ratio, limit in above:
        print(f"above its limit: {name} {target} {ratio:.2f} > {limit:g}")


if __name__ == "__main__":
    main()
