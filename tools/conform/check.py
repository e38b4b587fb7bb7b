#!/usr/bin/env python3
"""Run the programs of kastarri-conform in every form that this machine has, and hold all their reports to be equal.

    tools/conform/check.py [--sample] BUILD...

BUILD are build directories of the test presets, of any width and compiler. Of each, the programs call the shared libraries
of all targets, compiled by both compilers without optimisation and with all of it, on hosts that flush subnormals or round
another way, and have the static library inlined. --sample takes fewer of these forms. Exit status 1 if reports differ.
"""

import argparse
import itertools
import os
import sys
import tempfile
import time

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import runs  # noqa: E402

COMPILERS = ["g++", "clang++"]
LEVELS = ["-O0", "-O1", "-O2", "-O3"]

# What a host may have set before a kernel is called: the SSE's control word, and that of the x87.
HOSTS = {
    "subnormals flushed": (0x9FC0, 0x037F), "rounding down": (0x3F80, 0x077F), "rounding up": (0x5F80, 0x0B7F),
    "rounding toward zero, x87 in single precision": (0x7F80, 0x0C7F),
}
HOST_SOURCE = """
__attribute__((constructor)) static void set() {{
  const unsigned sse = {:#x};
  const unsigned short x87 = {:#x};
  __asm__ volatile("ldmxcsr %0\\n\\tfldcw %1" : : "m"(sse), "m"(x87));
}}
"""
PROBE = """
#include <stdio.h>
#include "kastarri/library.h"
int main() { puts(cstub_Km_ZNB_Orbis_R5_64k_target()); }
"""


class Check:
    def __init__(self, directory, sample):
        self.directory, self.sample = directory, sample
        self.first, self.forms, self.different = None, 0, []

    def take(self, form, found):
        """The report of a form: it has to be the first one's."""
        self.forms += 1
        if self.first is None:
            self.first = found
            print(f"{len(found)} results, {sum(int(line.split()[1]) for line in found.values())} calls: {form}")
            return
        names = [name for name in {**self.first, **found} if self.first.get(name) != found.get(name)]
        print(f"{'the same' if not names else f'{len(names)} DIFFERENT'}: {form}", flush=True)
        if names:
            self.different.append((form, names))

    def path(self, *parts):
        return os.path.join(self.directory, *parts)

    def write(self, name, text):
        os.makedirs(self.directory, exist_ok=True)
        with open(self.path(name), "w", encoding="utf-8") as file:
            file.write(text)
        return self.path(name)

    def targets(self, build):
        """Form -> the library, of the shared ones whose target this processor runs."""
        libraries = build.libraries()
        probe, = runs.compile_programs([self.write("probe.cpp", PROBE)], self.path("probe" + build.bits), "g++", [build.width],
                                       ["-L", next(iter(libraries.values())), "-lkastarri"])
        found = {}
        for target, library in libraries.items():
            form = f"library by {os.path.basename(build.compiler)} for {target}"
            if runs.run([probe], env=dict(os.environ, LD_LIBRARY_PATH=library)).strip() == "none":
                print(f"this processor does not run {target}")
            else:
                found[form] = library
        return found

    def hosts(self, build):
        """Name -> what is loaded before a program to make its host such a one."""
        for number, (name, words) in enumerate(HOSTS.items()):
            source = self.write(f"host{number}.c", HOST_SOURCE.format(*words))
            library = self.path(f"host{number}_{build.bits}.so")
            runs.run(["gcc", build.width, "-shared", "-fPIC", source, "-o", library])
            yield name, library

    def shared(self, builds, sources):
        """The libraries of builds for one width."""
        bits, width = builds[0].bits, builds[0].width
        libraries = {form: library for build in builds for form, library in self.targets(build).items()}
        link = ["-L", next(iter(libraries.values())), "-lkastarri"]
        forms = list(itertools.product(COMPILERS, LEVELS))
        if self.sample:
            forms = [("g++", "-O1")] if bits == "32" else [("clang++", "-O2")]
        for compiler, level in forms:
            programs = runs.compile_programs(sources, self.path("shared"), compiler, [width, level, *runs.USER_FLAGS], link)
            for form, library in libraries.items():
                self.take(f"{bits} bits, {form}, programs by {compiler} {level}", runs.report(programs, library))
        for host, preload in self.hosts(builds[0]):
            for form, library in libraries.items():
                self.take(f"{bits} bits, {form}, {host}", runs.report(programs, library, preload))

    def inlined(self, build, sources):
        settings = build.inlined()
        if not settings:
            return
        compiler, link = settings["compiler"], [settings["library"], *settings["link_flags"]]
        target = build.cached("KASTARRI_STATIC_TARGET")
        for level in LEVELS[1:]:
            programs = runs.compile_programs(sources, self.path("static"), compiler, [*settings["flags"], level], link)
            form = f"{build.bits} bits, inlined for {target} by {os.path.basename(compiler)} {level}"
            self.take(form, runs.report(programs))

    def check(self, builds):
        sources = runs.write_programs(builds[0], self.path("sources"))
        for bits in sorted({build.bits for build in builds}):
            self.shared([build for build in builds if build.bits == bits], sources)
        for build in [] if self.sample else builds:
            self.inlined(build, sources)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("builds", nargs="+", metavar="BUILD")
    parser.add_argument("--sample", action="store_true", help="one compiler and one level of optimisation a width, nothing inlined")
    arguments = parser.parse_args()
    start = time.monotonic()
    with tempfile.TemporaryDirectory() as directory:
        check = Check(directory, arguments.sample)
        check.check([runs.Build(build) for build in arguments.builds])
    print(f"{check.forms} reports, {len(check.different)} different from the first, in {time.monotonic() - start:.0f} s")
    for form, names in check.different:
        print(f"{form}: {' '.join(names[:20])}{' ...' * (len(names) > 20)}")
    return int(bool(check.different))


if __name__ == "__main__":
    sys.exit(main())
