"""Random programs of intrinsics: libraries agree, and what is wrong with one is found, made short and written out.

Run as: sequences_test.py BUILD WRONG-LIBRARY COMPILER [FLAG...]
"""

import os
import re
import sys
import tempfile
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path[:0] = [os.path.join(ROOT, "tools", "fuzz"), os.path.join(ROOT, "tests", "support")]
import fuzz  # noqa: E402
from commands import run_apart as run  # noqa: E402

BUILD, WRONG, *COMPILER = sys.argv[1:]
FUZZ = os.path.join(ROOT, "tools", "fuzz", "fuzz.py")


class Programs(unittest.TestCase):
    def test_every_library_of_the_build_gives_the_same(self):
        # Inlined, program 24 of this seed once gathered what the stack held where a predicate was 0 (32 bits, g++).
        result = run(FUZZ, BUILD, "--programs", "2000", "--seed", "1", "--inlined", "30")
        self.assertEqual(result.returncode, 0, result.stdout)
        self.assertTrue(result.stdout.endswith(": all the same\n"), result.stdout)
        called, intrinsics = map(int, re.search(r"seed 1: 2000 programs, \d+ calls of (\d+) of (\d+) intrinsics", result.stdout).groups())
        self.assertGreater(intrinsics, 2500)
        self.assertGreater(called, 0.99 * intrinsics)

    def test_a_seed_gives_the_same_programs_wherever_they_begin(self):
        library = fuzz.called_of(BUILD)[0]
        numbers = library.numbers(7, 0, 40)[0]
        self.assertEqual(len(set(numbers.values())), 40)
        self.assertEqual(library.numbers(7, 20, 20)[0], {n: numbers[n] for n in range(20, 40)})
        self.assertFalse(set(library.numbers(8, 0, 40)[0].values()) & set(numbers.values()))

    def test_programs_pass_results_on(self):
        """Most steps take what an earlier one wrote, a part of them in place."""
        library = fuzz.called_of(BUILD)[0]
        steps = taking = in_place = predicated = through_memory = 0
        for n in range(30):
            written, stored = set(), False
            for step in library.show(3, n)["steps"]:
                steps += 1
                taking += any(argument in written for argument in step["arguments"])
                in_place += step["result"] in step["arguments"] or len(set(step["arguments"])) < len(step["arguments"])
                predicated += step["intrinsic"].endswith(("T", "T_I", "T_X", "T_IP", "T_XP"))
                points = any(re.fullmatch(r"&?p\d+", argument) for argument in step["arguments"])
                through_memory += points and stored
                stored = stored or points
                written |= {step["result"], *step["arguments"]}
        self.assertGreater(taking / steps, 0.5)
        self.assertGreater(min(in_place, predicated, through_memory) / steps, 0.03)


@unittest.skipIf(WRONG == "none", "a library with sanitizers is loaded first or not at all")
class Faults(unittest.TestCase):
    def found(self, fault, intrinsic, most_steps):
        """What is printed of a program that differs, and the program."""
        result = run(FUZZ, BUILD, "--programs", "20000", "--inlined", "0", "--preload", WRONG, WRONG=fault)
        self.assertEqual(result.returncode, 1, result.stdout)
        said, _, program = result.stdout.partition("#include")
        program = "#include" + program[:program.rindex("\n}\n") + 3]
        self.assertIn(f", {intrinsic}\n", said)
        self.assertLessEqual(int(re.search(r"it takes (\d+) of", said)[1]), most_steps, result.stdout)
        return said, program

    def outputs(self, program, fault):
        """Of the program that was written out, with the library as it is and with the wrong one."""
        with tempfile.TemporaryDirectory() as directory:
            text, made = os.path.join(directory, "program.cpp"), os.path.join(directory, "program")
            with open(text, "w", encoding="utf-8") as file:
                file.write(program)
            result = run(*COMPILER, f"-I{ROOT}/include", text, f"-L{BUILD}", "-lkastarri", f"-Wl,-rpath,{BUILD}", "-o", made)
            self.assertEqual(result.returncode, 0, result.stderr)
            right, wrong = run(made), run(made, LD_PRELOAD=WRONG, WRONG=fault)
        self.assertEqual(right.returncode, 0)
        return right.stdout, wrong.stdout

    def test_a_result_that_is_an_operand_too(self):
        said, program = self.found("in place", "rk_zra32_ZRA_ADDNX16T", 1)
        self.assertIn("qv_vecNx16_r", said)
        right, wrong = (output.splitlines() for output in self.outputs(program, "in place"))
        self.assertEqual([a.split()[0] in said for a, b in zip(right, wrong) if a != b], [True])

    def test_a_pointer_that_a_later_access_uses(self):
        _, program = self.found("pointer", "rk_zra32_ZRA_LVNX16_IP", 1)
        right, wrong = (dict(map(str.split, output.splitlines())) for output in self.outputs(program, "pointer"))
        pointer = re.search(r"ZRA_LVNX16_IP\(\w+, &(p\d+)", program)[1]
        self.assertEqual(int(wrong.pop(pointer)), int(right.pop(pointer)) - 1)
        self.assertEqual(wrong, right)

    def test_a_program_that_ends_under_a_state(self):
        said, program = self.found("mode", "rk_zra32_ZRA_NEGNX16", 1)
        self.assertIn("ended with status -6", said)
        self.assertIn("RoundMode = 2;", program)
        right, wrong = self.outputs(program, "mode")
        self.assertIn("RoundMode 2", right)
        self.assertEqual(wrong, "")

    def test_the_wrong_library_is_right_but_for_its_faults(self):
        result = run(FUZZ, BUILD, "--programs", "2000", "--inlined", "0", "--preload", WRONG, WRONG="")
        self.assertEqual(result.returncode, 0, result.stdout)


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
