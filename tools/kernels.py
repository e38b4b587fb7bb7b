#!/usr/bin/env python3
"""Time whole kernels: scalar C, loops that g++ and clang++ vectorise, the core's intrinsics as calls and inlined.

    tools/kernels.py BUILD [BUILD-OF-CLANG] [--rounds N]

BUILD has the target kernel_modules built. Prints a table in Markdown for each target that this processor runs:
nanoseconds an item, the shortest of N rounds by turns in each of several processes: where the system loads a module
makes a difference of a third to calls.
"""

import argparse
import collections
import glob
import os
import subprocess
import sys

PROCESSES = 5
TARGETS = ["avx512", "avx2", "sse2"]
COMPILERS = ["g++", "clang++"]


def module(build, name):
    return os.path.join(build, "bench", "kernels", name + ".so")


def modules(build, clang_build, target):
    """Way -> module. A way may have several, of which the quickest counts: they differ in the size of their blocks."""
    ways = {"scalar C": [module(build, "scalar")]}
    for compiler in COMPILERS:
        ways[compiler] = sorted(glob.glob(module(build, f"native_{glob.escape(compiler)}_*_{target}")))
    ways["calls"] = [module(build, f"shared_{target}")]
    ways["inlined"] = [module(build, f"inlined_{target}")]
    if clang_build:
        ways["inlined by clang++"] = [module(clang_build, f"inlined_{target}")]
    return {way: found for way, found in ways.items() if found}


def runs(build, target):
    """Whether this processor runs a target: what the library that has no other says."""
    library = os.path.join(build, "tests", "only", target)
    told = subprocess.run([os.path.join(build, "bench", "kastarri_bench"), "--benchmark_filter=vecNx16_move", "--benchmark_min_time=0.0001"],
                          env=dict(os.environ, LD_LIBRARY_PATH=library), capture_output=True, text=True, check=False)
    return f"target: {target}" in told.stderr


def measure(build, clang_build, target, rounds):
    """Kernel -> way -> nanoseconds."""
    ways = modules(build, clang_build, target)
    arguments = [f"{way}={path}" for way, paths in ways.items() for path in paths]
    found = collections.defaultdict(dict)
    for _ in range(PROCESSES):
        bench = subprocess.run([os.path.join(build, "bench", "kernels", "kernel_bench"), f"--rounds={rounds}", *arguments],
                               stdout=subprocess.PIPE, text=True, check=False)
        if bench.returncode != 0:
            sys.exit(bench.returncode)
        for kernel, way, time in (line.split(",") for line in bench.stdout.splitlines()):
            found[kernel][way] = min(float(time), found[kernel].get(way, float("inf")))
    return found


def table(found):
    """The last column: how many times as fast as the better compiler's loop the better inlined kernel is."""
    ways = list(dict.fromkeys(way for times in found.values() for way in times))
    yield "| kernel | " + " | ".join(ways) + " | inlined to loop |"
    yield "|---|" + "---|" * (len(ways) + 1)
    for kernel, times in found.items():
        cells = [f"{times[way]:.2f}" if way in times else "" for way in ways]
        loops = [times[compiler] for compiler in COMPILERS if compiler in times]
        inlined = min(time for way, time in times.items() if way.startswith("inlined"))
        cells.append(f"{min(loops) / inlined:.2f}" if loops else "")
        yield f"| {kernel} | " + " | ".join(cells) + " |"


def all_targets(build, clang_build=None, rounds=21):
    """Each target that is built and that this processor runs, and its times."""
    for target in TARGETS:
        if os.path.exists(module(build, f"inlined_{target}")) and runs(build, target):
            yield target, measure(build, clang_build, target, rounds)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build")
    parser.add_argument("clang_build", nargs="?")
    parser.add_argument("--rounds", type=int, default=21)
    arguments = parser.parse_args()
    for target, found in all_targets(arguments.build, arguments.clang_build, arguments.rounds):
        print("\n".join(["", f"### {target}", "", *table(found)]), flush=True)


if __name__ == "__main__":
    main()
