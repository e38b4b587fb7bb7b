"""kastarri-check: kernels' slips are reported with their line, and nothing else is; what valgrind tells of registers.

Run as: check_test.py BUILD
"""

import glob
import os
import re
import shutil
import sys
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
sys.path.insert(0, os.path.join(os.path.dirname(HERE), "support"))
from commands import run_apart as run  # noqa: E402

BUILD = sys.argv[1]
CHECKER = os.path.join(BUILD, "bin", "kastarri-check")
SLIPS, UNINITIALISED, TOUCHED = (os.path.join(BUILD, "tests", "check", name)
                                 for name in ("slips", "uninitialised", "touched_bytes"))

READ, WRITE = "READ", "WRITE"
# Mode -> the intrinsic, what it does with how many bytes, and what the sanitizer calls that.
HEAP = "heap-buffer-overflow"
EXPECTED = {
    "load": ("ZRA_LVNX16_I", READ, 64, HEAP), "before": ("ZRA_LVNX16_X", READ, 64, HEAP),
    "predicated": ("ZRA_LVNX16T_I", READ, 2, HEAP), "widening": ("ZRA_LVNX8S_I", READ, 32, HEAP),
    "store": ("ZRA_SVNX16_I", WRITE, 64, HEAP), "predicated_store": ("ZRA_SVNX16T_I", WRITE, 2, HEAP),
    "pointer": ("ZRA_LVNX16_IP", READ, 64, HEAP), "element": ("ZRA_SSNX16_I", WRITE, 2, HEAP),
    "gather": ("ZRA_GATHERANX16", READ, 2, HEAP), "scatter": ("ZRA_SCATTERNX16T", WRITE, 2, HEAP),
    "increment": ("ZRA_SCATTERINCNX16", WRITE, 2, HEAP), "stack": ("ZRA_LVNX16_I", READ, 64, "stack-buffer-overflow"),
    "global": ("ZRA_LVNX16_I", READ, 64, "global-buffer-overflow"), "freed": ("ZRA_LVNX16_I", READ, 64, "heap-use-after-free"),
    "copied": ("qv_vecNx16_loadi", READ, 64, HEAP), "converted": ("int16_mtor_qv_vecNx16", READ, 2, HEAP),
    "operand": ("ZRA_ADDNX16", READ, 64, HEAP), "words": ("RK_S32I", WRITE, 4, HEAP),
}


def line_of(mode):
    with open(os.path.join(HERE, "slips.cpp"), encoding="utf-8") as file:
        return next(number for number, line in enumerate(file, 1) if line.rstrip().endswith("// slip: " + mode))


class Slips(unittest.TestCase):
    def assert_reported(self, result, mode, intrinsic, kind, size, what):
        self.assertEqual((result.returncode, result.stdout), (1, ""), result.stderr)
        plural = "s" if size > 1 else ""
        verb = "reads" if kind == READ else "writes"
        self.assertRegex(result.stderr, rf"\Akastarri-check: {intrinsic} {verb} {size} byte{plural} at 0x\w+\n")
        self.assertIn(f"ERROR: AddressSanitizer: {what} ", result.stderr)
        self.assertRegex(result.stderr, rf"\n{kind} of size \d+ at ")
        stack = result.stderr[:result.stderr.index("\n\n")]
        self.assertRegex(stack, rf"slips\.cpp:{line_of(mode)}\b")

    def test_slips_are_reported_with_the_kernels_line(self):
        for mode, expected in EXPECTED.items():
            with self.subTest(mode=mode):
                self.assert_reported(run(CHECKER, SLIPS, mode), mode, *expected)

    def test_the_sanitizer_alone_sees_none_of_them(self):
        """Or what is checked here would be no more than what it does by itself."""
        for mode in "load", "predicated", "gather", "operand":
            self.assertEqual(run(SLIPS, mode).stdout, "finished\n")

    def test_the_bytes_of_every_row_are_those_that_it_touches(self):
        library, = glob.glob(os.path.join(BUILD, "lib", "kastarri", "check", "*", "libkastarri-check.so"))
        result = run(TOUCHED, LD_PRELOAD=library)
        self.assertEqual(result.returncode, 0, result.stdout)
        self.assertGreater(int(result.stdout.split()[0]), 700)

    def test_what_is_no_slip_is_not_reported(self):
        for mode in "clean", "last_byte", "disabled":
            result = run(CHECKER, SLIPS, mode)
            self.assertEqual((result.returncode, result.stdout, result.stderr), (0, "finished\n", ""))

    def test_bytes_that_no_result_depends_on_are_checked_when_asked_for(self):
        for mode, expected in {"last_byte": ("ZRA_GATHERANX8U", READ, 2, HEAP), "disabled": ("ZRA_LVNX16T_I", READ, 64, HEAP)}.items():
            with self.subTest(mode=mode):
                self.assert_reported(run(CHECKER, "--all-bytes", SLIPS, mode), mode, *expected)

    def test_the_sanitizers_options_hold(self):
        result = run(CHECKER, SLIPS, "two", ASAN_OPTIONS="halt_on_error=0")
        self.assertEqual(result.stdout, "finished\n")
        self.assertEqual(re.findall(r"kastarri-check: (\S+)", result.stderr), ["ZRA_LVNX16_I", "ZRA_SVNX16_I"])
        self.assertEqual(result.stderr.count("ERROR: AddressSanitizer"), 2)
        self.assertEqual(run(CHECKER, SLIPS, "load", ASAN_OPTIONS="exitcode=42").returncode, 42)

    def test_programs_that_cannot_be_checked_are_named(self):
        for program, message, status in ((UNINITIALISED, "is not built with -fsanitize=address", 126),
                                         (CHECKER, "is not a program but a script", 126), ("./none", "there is no program", 127)):
            result = run(CHECKER, program)
            self.assertEqual((result.returncode, result.stdout), (status, ""))
            self.assertIn(message, result.stderr)


@unittest.skipUnless(shutil.which("valgrind") or "CI" in os.environ, "valgrind is not installed")
class Uninitialised(unittest.TestCase):
    def valgrind(self, *arguments):
        return run("valgrind", "--track-origins=yes", "--error-exitcode=9", UNINITIALISED, *arguments)

    def test_valgrind_tells_where_a_register_matters_that_was_not_set(self):
        # Valgrind shows a file as the compiler wrote it down: by its name, or with directories before it.
        result = self.valgrind()
        self.assertEqual(result.returncode, 9, result.stderr)
        self.assertIn("depends on uninitialised value", result.stderr)
        self.assertRegex(result.stderr, r"created by a stack allocation\n.*main \(\S*\buninitialised\.cpp:\d+\)")
        with open(os.path.join(HERE, "uninitialised.cpp"), encoding="utf-8") as file:
            line = next(number for number, text in enumerate(file, 1) if "matters here" in text)
        self.assertIn(f"uninitialised.cpp:{line})", result.stderr)

    def test_valgrind_tells_nothing_else(self):
        result = self.valgrind("cleared")
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertIn("ERROR SUMMARY: 0 errors", result.stderr)


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
