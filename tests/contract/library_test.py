"""The contract of the built library and its headers: what is exported, what is needed, what compiles.

Run as: library_test.py LIBRARY OBJECT... (the library's object files).
"""

import glob
import os
import re
import subprocess
import sys
import tempfile
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import generate_headers  # noqa: E402

LIBRARY, OBJECTS = sys.argv[1], sys.argv[2:]
COMPILERS = ["g++", "clang++"]
USER_FLAGS = ["-m32", "-std=c++11", "-Wall", "-Wextra", "-Wpedantic", "-Wconversion", "-Wshadow", "-Werror",
              "-I", os.path.join(ROOT, "include")]


def output(*command):
    return subprocess.run(command, capture_output=True, text=True, check=True).stdout


def exported():
    """The names of the exported symbols, without the arguments that C++ encodes in them."""
    lines = output("nm", "-D", "-C", "--defined-only", LIBRARY).splitlines()
    return [re.sub(r"^\S+ \S ", "", line).split("(")[0] for line in lines]


def declared():
    """The names that the public headers declare as exported."""
    names = set()
    for path in glob.glob(os.path.join(ROOT, "include", "kastarri", "*.h")):
        for declaration in re.findall(r"^(?:extern |\[\[noreturn\]\] )*KASTARRI_API ([^;]*);", open(path, encoding="utf-8").read(), re.M):
            names.add(re.findall(r"\bcstub_\w+(?=\(|\[|$)", declaration)[0])
    return names


class Library(unittest.TestCase):
    def test_exports_are_the_rows_and_the_declared_rest(self):
        names = exported()
        self.assertEqual(len(names), len(set(names)), "an intrinsic is exported once")
        self.assertEqual([n for n in names if not n.startswith("cstub_")], [])
        rows = {generate_headers.symbol(row[0]) for _, tables, family in generate_headers.all_rows().values() for row in family
                if row[3] in DEFINED_TABLES}
        self.assertEqual(rows - set(names), set(), "rows that are not exported")
        undefined = {generate_headers.symbol(row[0]) for _, tables, family in generate_headers.all_rows().values()
                     for row in family} - rows
        self.assertEqual(set(names) - (declared() - undefined), set(), "exported but in no public header")
        self.assertEqual(declared() - undefined - set(names), set(), "in a public header but not exported")

    def test_file_is_a_plain_32_bit_library(self):
        self.assertIn("ELF32", output("readelf", "-h", LIBRARY))
        dynamic = output("readelf", "-d", LIBRARY)
        major = re.search(r"KASTARRI_VERSION_MAJOR (\d+)", open(os.path.join(ROOT, "include/kastarri/library.h")).read())[1]
        self.assertEqual(re.findall(r"SONAME.*\[(.*)\]", dynamic), [f"libkastarri.so.{major}"])
        self.assertLessEqual(set(re.findall(r"NEEDED.*\[(.*)\]", dynamic)), {"libc.so.6"})
        self.assertNotIn("TEXTREL", dynamic)
        sections = output("readelf", "-lW", LIBRARY)
        self.assertRegex(sections, r"GNU_STACK.* RW ", "no executable stack")

    def test_nothing_runs_when_the_library_is_loaded(self):
        symbols = output("nm", *OBJECTS)
        self.assertNotIn("_GLOBAL__sub_I", symbols, "a constructor of static data")

    def test_objects_hold_nothing_weak(self):
        # A weak function compiled for one target could be picked by the linker for all of them.
        weak = [line for line in output("nm", "-C", *OBJECTS).splitlines() if re.search(r" [WVu] ", line)]
        self.assertEqual(weak, [])


class Headers(unittest.TestCase):
    def compile(self, compiler, *arguments, text=None):
        command = [compiler, *USER_FLAGS, "-fsyntax-only", *arguments]
        result = subprocess.run(command, input=text, capture_output=True, text=True, check=False)
        self.assertEqual(result.returncode, 0, " ".join(command) + "\n" + result.stderr[:2000])

    def test_headers_are_those_of_the_rows(self):
        stale = [path for path, text in generate_headers.outputs().items() if open(path, encoding="utf-8").read() != text]
        self.assertEqual(stale, [], "run `make headers`")

    def test_each_header_compiles_alone(self):
        headers = sorted(glob.glob(os.path.join(ROOT, "include", "kastarri", "*.h")))
        for compiler in COMPILERS:
            for header in [os.path.join(ROOT, "include", "kastarri.h")] + headers:
                with self.subTest(compiler=compiler, header=os.path.basename(header)):
                    self.compile(compiler, "-x", "c++", "-", text=f'#include "{header}"\n')

    def test_every_conversion_compiles_in_every_form(self):
        for compiler in COMPILERS:
            with self.subTest(compiler=compiler):
                self.compile(compiler, "-I", os.path.join(ROOT, "src"),
                             os.path.join(ROOT, "tests", "contract", "conversions_compile.cpp"))

    def test_short_names_come_and_go(self):
        program = """
            #include <algorithm>
            #include "kastarri/names.h"
            #include <cmath>
            #include <vector>
            #include <sys/param.h>
            qv_vecNx16 twice(const qv_vecNx16& v) { return ZRA_ADDNX16(v, v); }
            #include "kastarri/names_undo.h"
            struct qv_vecNx16 { int ZRA_ADDNX16; };
            int mine(const qv_vecNx16& v) { return v.ZRA_ADDNX16; }
            #include "kastarri/names.h"
            qv_vecNx16 again(const qv_vecNx16& v) { return ZRA_ADDNX16(v, v); }
        """
        for compiler in COMPILERS:
            with self.subTest(compiler=compiler):
                self.compile(compiler, "-x", "c++", "-", text=program)


class Documents(unittest.TestCase):
    def test_coverage_is_that_of_the_rows(self):
        check = subprocess.run([sys.executable, os.path.join(ROOT, "tools", "coverage.py"), "--check"], check=False)
        self.assertEqual(check.returncode, 0, "run `make headers`")

    def test_the_kernel_of_the_readme_prints_what_the_readme_says(self):
        readme = open(os.path.join(ROOT, "README.md"), encoding="utf-8").read()
        program = re.search(r"```cpp\n(.*?)```", readme, re.S)[1]
        printed = re.search(r"It prints `(.*?)`", readme)[1]
        with tempfile.TemporaryDirectory() as directory:
            binary = os.path.join(directory, "kernel")
            subprocess.run(["g++", *USER_FLAGS, "-x", "c++", "-", "-x", "none", LIBRARY, "-o", binary,
                            "-Wl,-rpath," + os.path.dirname(LIBRARY)], input=program, text=True, check=True)
            self.assertEqual(output(binary).strip(), printed)


DEFINED_TABLES = set(generate_headers.listed_tables())

if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
