#!/usr/bin/env python3
"""The cookbook: each of its programs is the source that is built, and prints what the page says.

    cookbook_test.py DIRECTORY     with the programs, built
"""

import glob
import os
import re
import subprocess
import sys
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
PROGRAMS = sys.argv.pop(1)
LINES = 50  # a recipe that needs more is an example


def read(*path):
    with open(os.path.join(ROOT, *path), encoding="utf-8") as file:
        return file.read()


class Cookbook(unittest.TestCase):
    def test_every_recipe_stands_in_the_page_as_it_is_built_and_prints_what_it_says(self):
        quoted = re.findall(r"^`(examples/cookbook/\w+\.cpp)`:\n\n```cpp\n(.*?)```\n\n```text\n(.*?)```$",
                            read("docs", "cookbook.md"), re.M | re.S)
        sources = glob.glob(os.path.join(ROOT, "examples", "cookbook", "*.cpp"))
        self.assertEqual(sorted(path for path, *_ in quoted), sorted(os.path.relpath(path, ROOT) for path in sources))
        for path, program, printed in quoted:
            with self.subTest(path=path):
                self.assertEqual(program, read(path))
                self.assertLessEqual(program.count("\n"), LINES)
                built = os.path.join(PROGRAMS, os.path.basename(path)[:-len(".cpp")])
                run = subprocess.run([built], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, timeout=100, check=True)
                self.assertEqual(run.stdout, printed)


if __name__ == "__main__":
    unittest.main()
