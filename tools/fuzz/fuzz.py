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
import itertools
import json
import os
import subprocess
import sys
import tempfile
import time

HERE = os.path.dirname(os.path.abspath(__file__))
sys.path[:0] = [HERE, os.path.dirname(HERE)]
import source  # noqa: E402
from cmake_cache import inlined  # noqa: E402

ROOT = source.ROOT
IN_A_RUN = 2000  # programs


class Called:
    """A library whose intrinsics are called, by a program that makes up programs."""

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
        """Program -> its number or how it ended; the number of calls, and of intrinsics; which were called."""
        result = self.run("run", seed, first, count)
        lines = [line.split() for line in result.stdout.splitlines()[1:]]
        numbers = {int(words[0]): words[1] for words in lines if words[0].isdigit()}
        if result.returncode:
            numbers[first + len(numbers)] = ending(result)
        told = {words[0]: int(words[1]) for words in lines if words[0] in ("steps", "of")}
        return numbers, told, {words[1] for words in lines if words[0] == "called"}

    def steps(self, seed, program, kept=()):
        """(step, number after it, intrinsic) of each; the last has no number if the program crashed."""
        result = self.run("steps", seed, program, *kept)
        steps = [(int(step), number, name) for step, number, name in map(str.split, result.stdout.splitlines())]
        return steps + [(-1, ending(result), "")] if result.returncode else steps

    def number(self, seed, program, kept):
        return self.steps(seed, program, kept)[-1][1]

    def values(self, seed, program, kept):
        return dict(map(str.split, self.run("values", seed, program, *kept).stdout.splitlines()))

    def show(self, seed, program, kept=()):
        return json.loads(self.run("show", seed, program, *kept).stdout)


def ending(result):
    return f"ended with status {result.returncode} {result.stderr.strip()[-300:]}"


class Inlined:
    """A static library, whose intrinsics the compiler that built it inlines into programs."""

    def __init__(self, label, settings, reference):
        self.label, self.settings, self.reference = label, settings, reference

    def numbers(self, seed, programs):
        """Program -> its number, of the given ones: program -> the steps that are kept, none for all."""
        settings = self.settings
        with tempfile.TemporaryDirectory() as directory:
            text, made = (os.path.join(directory, name) for name in ("programs.cpp", "programs"))
            with open(text, "w", encoding="utf-8") as file:
                file.write(source.batch({n: self.reference.show(seed, n, kept) for n, kept in programs.items()}))
            includes = [f"-I{os.path.join(ROOT, directory)}" for directory in ("include", "tests")]
            result = subprocess.run([settings["compiler"], "-std=c++17", *settings["flags"], *includes, text,
                                     settings["library"], *settings["link_flags"], "-o", made],
                                    capture_output=True, text=True, check=False)
            if result.returncode:
                raise SystemExit("programs do not compile:\n" + result.stderr[:4000])
            result = subprocess.run([made], capture_output=True, text=True, check=False)
        numbers = {int(n): number for n, number in map(str.split, result.stdout.splitlines())}
        return {n: numbers.get(n, ending(result)) for n in programs}

    def number(self, seed, program, kept):
        return self.numbers(seed, {program: kept})[program]


def called_of(build):
    """The libraries of a build directory. The first is the one as shipped."""
    name, tests = os.path.basename(os.path.normpath(build)), os.path.join(build, "tests")
    program = os.path.join(tests, "sequences", "kastarri_sequences")
    found = [Called(f"{name} as shipped", program)]
    for library in sorted(glob.glob(os.path.join(tests, "only", "*", "libkastarri.so"))):
        directory = os.path.dirname(library)
        found.append(Called(f"{name} {os.path.basename(directory)}", program, directory))
    if os.path.exists(program + "_static"):
        found.append(Called(f"{name} static", program + "_static"))
    return [library for library in found if library.is_runnable]


def inlined_of(build, reference):
    """None or one."""
    program = os.path.join(build, "tests", "sequences", "kastarri_sequences_static")
    if not os.path.exists(program) or not Called("", program).is_runnable:
        return []
    return [Inlined(f"{os.path.basename(os.path.normpath(build))} inlined", inlined(build), reference)]


# --- A difference -------------------------------------------------------------------------------------


def shortest(kept, differs):
    """The steps that it takes to differ: each is left out that can be, from the last to the first."""
    for step in reversed(kept):
        fewer = [k for k in kept if k != step]
        if fewer and differs(fewer):
            kept = fewer
    return kept


def explain(reference, other, seed, program):
    """What differs, as text."""
    steps = reference.steps(seed, program)
    lines = [f"Program {program} of seed {seed} differs: {reference.label} | {other.label}"]
    kept = [step for step, *_ in steps if step >= 0]
    if isinstance(other, Called):
        first = next((i for i, pair in enumerate(itertools.zip_longest(steps, other.steps(seed, program))) if pair[0] != pair[1]), 0)
        lines.append(f"first in step {steps[first][0]}, {steps[first][2]}")
        kept = kept[:first + 1]
    kept = shortest(kept, lambda few: reference.number(seed, program, few) != other.number(seed, program, few))
    lines.append(f"it takes {len(kept)} of {len(steps)} steps: {' '.join(map(str, kept))}")
    one, two = reference.number(seed, program, kept), other.number(seed, program, kept)
    lines.append(f"their numbers: {one} | {two}")
    if isinstance(other, Called):
        values = other.values(seed, program, kept)
        lines += [difference(name, value, values[name]) for name, value in reference.values(seed, program, kept).items()
                  if value != values.get(name, value)]
    return "\n".join(lines + ["", source.snippet(reference.show(seed, program, kept))])


def difference(name, value, other):
    """A few bytes around the first that differs; numbers as they are."""
    if len(value) < 8 or len(value) != len(other):
        return f"  {name}: {value} | {other}"
    begin = max(0, next(i for i, (a, b) in enumerate(zip(value, other)) if a != b) // 2 - 4)
    return f"  {name} from byte {begin} on: {value[2 * begin:2 * begin + 32]} | {other[2 * begin:2 * begin + 32]}"


# --- The run ------------------------------------------------------------------------------------------


class Run:
    def __init__(self, builds, seed):
        self.seed = seed
        self.called = [library for build in builds for library in called_of(build)]
        if not self.called:
            raise SystemExit("no library here is for this processor")
        self.reference = self.called[0]
        self.inlined = [library for build in builds for library in inlined_of(build, self.reference)]
        self.programs, self.calls, self.seen, self.intrinsics = 0, 0, set(), 0
        self.programs_inlined = 0

    def compare(self, count, inlined):
        """The next programs: the first that differs of each library, as text. Some are compiled, too."""
        first = self.programs
        with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
            found = list(pool.map(lambda library: library.numbers(self.seed, first, count), self.called))
        expected, told, seen = found[0]
        found = [numbers for numbers, *_ in found[1:]]
        if " " in list(expected.values())[-1]:
            return [explain(self.reference, self.reference, self.seed, first + len(expected) - 1)]
        self.seen |= seen
        self.calls, self.intrinsics, self.programs = self.calls + told["steps"], told["of"], first + count
        some = {n: () for n in range(first, first + min(inlined, count))}
        if some:
            self.programs_inlined += len(some)
            found += [library.numbers(self.seed, some) for library in self.inlined]
        return [explain(self.reference, library, self.seed, n) for library, numbers in zip(self.called[1:] + self.inlined, found)
                for n in [n for n in numbers if numbers[n] != expected[n]][:1]]

    def summary(self, texts):
        labels = "; ".join(library.label for library in self.called + (self.inlined if self.programs_inlined else []))
        return (f"seed {self.seed}: {self.programs} programs, {self.calls} calls of {len(self.seen)} of {self.intrinsics} "
                f"intrinsics, {self.programs_inlined} programs inlined: {labels}: "
                + (f"{len(texts)} differ" if texts else "all the same"))


def parse(arguments):
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("builds", nargs="+", metavar="BUILD")
    parser.add_argument("--seconds", type=float, default=60, help="how long (default: %(default)s)")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--programs", type=int, help="how many, however long it takes")
    parser.add_argument("--inlined", type=int, default=8, metavar="N",
                        help=f"how many of each {IN_A_RUN} are compiled with the static library (default: %(default)s)")
    parser.add_argument("--preload", metavar="LIBRARY", help="compare with the first library behind this one, too")
    return parser.parse_args(arguments)


def main(arguments=None):
    settings = parse(arguments)
    run = Run(settings.builds, settings.seed)
    if settings.preload:
        run.called.append(Called(settings.preload, run.reference.program, preload=settings.preload))
    end, texts = time.monotonic() + settings.seconds, []
    left = settings.programs
    while not texts and (left > 0 if left is not None else time.monotonic() < end):
        count = IN_A_RUN if left is None else min(IN_A_RUN, left)
        texts = run.compare(count, settings.inlined)
        left = None if left is None else left - count
    print(*texts, run.summary(texts), sep="\n")
    return 1 if texts else 0


if __name__ == "__main__":
    sys.exit(main())
