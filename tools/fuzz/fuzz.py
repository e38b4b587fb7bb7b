#!/usr/bin/env python3
"""Run random programs of intrinsics against every library there is, and say where they differ.

    tools/fuzz/fuzz.py BUILD [BUILD...] [--seconds S] [--seed N] [--programs N] [--inlined N]

A BUILD is a build directory with the target `sequences`. Compared are its library as shipped, those for one target
each, the static library, called and inlined, and the same of all other builds: by the other compiler, for the other
width. A program is given by the seed and its number, so that what differed once differs again. A program that differs is
made as short as it can be, and printed as C++ that stands alone. Exit status 1 if any differs.
"""

import argparse
import concurrent.futures
import glob
import json
import os
import subprocess
import sys
import tempfile
import time

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import source  # noqa: E402

ROOT = source.ROOT
IN_A_RUN = 2000  # programs


class Variant:
    """A library, and the program that runs against it."""

    def __init__(self, label, program, library=None, preload=None):
        self.label, self.program = label, program
        changes = {"LD_LIBRARY_PATH": library, "LD_PRELOAD": preload}
        self.environment = dict(os.environ, **{name: value for name, value in changes.items() if value})

    def run(self, *arguments):
        return subprocess.run([self.program, *map(str, arguments)], env=self.environment, capture_output=True, text=True,
                              check=False)

    @property
    def is_runnable(self):
        """Not where the processor does not have the library's instruction set."""
        return self.run("run", 0, 0, 0).returncode != 77

    def numbers(self, seed, first, count):
        """Program -> its number or how it ended, and what was called."""
        result = self.run("run", seed, first, count)
        lines = [line.split() for line in result.stdout.splitlines()[1:]]
        numbers = {int(words[0]): words[1] for words in lines if words[0].isdigit()}
        if result.returncode:
            numbers[first + len(numbers)] = f"ended with {result.returncode}: {result.stderr.strip()[-300:]}"
        told = {words[0]: int(words[1]) for words in lines if words[0] in ("steps", "of")}
        return numbers, told, {words[1] for words in lines if words[0] == "called"}

    def steps(self, seed, program, kept=()):
        """(step, number after it, intrinsic) of each, and how the program ended."""
        result = self.run("steps", seed, program, *kept)
        lines = [line.split() for line in result.stdout.splitlines()]
        return [(int(step), number, name) for step, number, name in lines], result.returncode

    def values(self, seed, program, kept):
        result = self.run("values", seed, program, *kept)
        return dict(line.split() for line in result.stdout.splitlines()), result.returncode

    def show(self, seed, program, kept=()):
        return json.loads(self.run("show", seed, program, *kept).stdout)


def variants_of(build):
    """Those of a build directory. The first is the library as shipped."""
    name, tests = os.path.basename(os.path.normpath(build)), os.path.join(build, "tests")
    program = os.path.join(tests, "sequences", "kastarri_sequences")
    found = [Variant(f"{name}, shipped", program)]
    for library in sorted(glob.glob(os.path.join(tests, "only", "*", "libkastarri.so"))):
        directory = os.path.dirname(library)
        found.append(Variant(f"{name}, {os.path.basename(directory)}", program, directory))
    if os.path.exists(program + "_static"):
        found.append(Variant(f"{name}, static", program + "_static"))
    return [variant for variant in found if variant.is_runnable]


# --- A difference -------------------------------------------------------------------------------------


def differ(one, other, seed, program, kept):
    return one.steps(seed, program, kept) != other.steps(seed, program, kept) if kept else False


def shortest(one, other, seed, program):
    """The steps that it takes to differ: each is left out that can be, from the last to the first."""
    all_steps, _ = one.steps(seed, program)
    others, _ = other.steps(seed, program)
    same = next((i for i, (a, b) in enumerate(zip(all_steps, others)) if a != b), len(others))
    kept = [step for step, *_ in all_steps[:same + 1]]
    if not differ(one, other, seed, program, kept):
        return [step for step, *_ in all_steps]
    for step in reversed(list(kept)):
        fewer = [k for k in kept if k != step]
        if differ(one, other, seed, program, fewer):
            kept = fewer
    return kept


def explain(one, other, seed, program):
    """What differs, as text."""
    kept = shortest(one, other, seed, program)
    (steps, _), (others, status) = one.steps(seed, program, kept), other.steps(seed, program, kept)
    first = next((a for a, b in zip(steps, others) if a != b), steps[len(others)] if len(others) < len(steps) else steps[-1])
    lines = [f"Program {program} of seed {seed} differs: {one.label} | {other.label}",
             f"first in step {first[0]}, {first[2]}; it takes {len(kept)} of its steps: {' '.join(map(str, kept))}"]
    if status:
        lines.append(f"{other.label} ends with status {status}")
    here, there = one.values(seed, program, kept)[0], other.values(seed, program, kept)[0]
    for name, value in here.items():
        if there and value != there.get(name):
            lines += difference(name, value, there.get(name, ""))
    shown = source.snippet(one.show(seed, program, kept))
    return "\n".join(lines + ["", shown])


def difference(name, value, other):
    """A few bytes around the first that differs."""
    place = next((i for i, (a, b) in enumerate(zip(value, other)) if a != b), 0) // 2
    begin = max(0, place - 4)
    return [f"  {name} from byte {begin} on: {value[2 * begin:2 * begin + 32]} | {other[2 * begin:2 * begin + 32]}"]


# --- Inlined ------------------------------------------------------------------------------------------


def inlined(build, reference, seed, programs):
    """Program -> its number, inlined by the compiler and with the library of the build; None if it has no static one."""
    path = os.path.join(build, "tests", "sequences", "inlined.json")
    if not os.path.exists(path):
        return None
    with open(path, encoding="utf-8") as file:
        settings = json.load(file)
    with tempfile.TemporaryDirectory() as directory:
        text, program = (os.path.join(directory, name) for name in ("programs.cpp", "programs"))
        with open(text, "w", encoding="utf-8") as file:
            file.write(source.batch({n: reference.show(seed, n) for n in programs}))
        includes = [f"-I{os.path.join(ROOT, directory)}" for directory in ("include", "tests")]
        made = subprocess.run([settings["compiler"], "-std=c++17", *settings["flags"], *includes, text,
                               settings["library"], *settings["link_flags"], "-o", program],
                              capture_output=True, text=True, check=False)
        if made.returncode:
            raise SystemExit("programs do not compile:\n" + made.stderr[:4000])
        result = subprocess.run([program], capture_output=True, text=True, check=False)
        return {int(n): number for n, number in map(str.split, result.stdout.splitlines())}


# --- The run ------------------------------------------------------------------------------------------


class Run:
    def __init__(self, builds, seed):
        self.builds, self.seed = builds, seed
        self.variants = [variant for build in builds for variant in variants_of(build)]
        if not self.variants:
            raise SystemExit("no library here is for this processor")
        self.called, self.told = set(), {"steps": 0, "of": 0}
        self.programs = 0

    @property
    def reference(self):
        return self.variants[0]

    def compare(self, first, count):
        """(program, variant) where numbers differ, the first of each variant."""
        with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
            found = list(pool.map(lambda variant: variant.numbers(self.seed, first, count), self.variants))
        expected, told, called = found[0]
        self.called |= called
        self.told = {"steps": self.told["steps"] + told.get("steps", 0), "of": told.get("of", 0)}
        self.programs += len(expected)
        different = []
        for variant, (numbers, *_) in zip(self.variants[1:], found[1:]):
            programs = [n for n in expected if numbers.get(n) != expected[n]]
            different += [(n, variant) for n in programs[:1]]
        crashed = [(n, self.reference) for n, number in expected.items() if " " in number]
        return crashed + different

    def compare_inlined(self, programs):
        """Text for each build that differs."""
        expected = {n: self.reference.steps(self.seed, n)[0][-1][1] for n in programs}
        texts = []
        for build in self.builds:
            numbers = inlined(build, self.reference, self.seed, programs)
            if numbers is None:
                continue
            different = [n for n in programs if numbers.get(n) != expected[n]]
            texts += [f"Inlined with {build}, program {n} of seed {self.seed} differs from calls:\n"
                      + source.snippet(self.reference.show(self.seed, n)) for n in different[:1]]
        return texts


def parse(arguments):
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("builds", nargs="+", metavar="BUILD")
    parser.add_argument("--seconds", type=float, default=60, help="how long (default: %(default)s)")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--programs", type=int, help="how many, however long it takes")
    parser.add_argument("--inlined", type=int, default=8, help="how many are compiled with the static library")
    parser.add_argument("--preload", metavar="LIBRARY", help="one more variant: what is loaded before the first library")
    return parser.parse_args(arguments)


def main(arguments=None):
    settings = parse(arguments)
    run = Run(settings.builds, settings.seed)
    if settings.preload:
        run.variants.append(Variant(f"with {settings.preload}", run.reference.program, preload=settings.preload))
    begin, texts = time.monotonic(), []
    while not texts and (run.programs < settings.programs if settings.programs else time.monotonic() - begin < settings.seconds):
        count = min(IN_A_RUN, settings.programs - run.programs) if settings.programs else IN_A_RUN
        texts += [explain(run.reference, variant, settings.seed, n) for n, variant in run.compare(run.programs, count)]
    if settings.inlined and not texts:
        texts += run.compare_inlined(range(settings.inlined))
    print(*texts, sep="\n")
    print(f"seed {settings.seed}: {run.programs} programs, {run.told['steps']} calls of {len(run.called)} of {run.told['of']} "
          f"intrinsics, {len(run.variants)} libraries ({'; '.join(variant.label for variant in run.variants)}): "
          + (f"{len(texts)} differ" if texts else "all the same"))
    return 1 if texts else 0


if __name__ == "__main__":
    sys.exit(main())
