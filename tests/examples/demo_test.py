#!/usr/bin/env python3
"""The demo: its verdict is that of the programs, and its page shows what they made.

    demo_test.py BUILD
"""

import os
import re
import subprocess
import sys
import unittest
import xml.etree.ElementTree

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
BUILD = sys.argv.pop(1)


def demo(*wrapper):
    """The last line and the exit status."""
    run = subprocess.run([os.path.join(ROOT, "tools", "demo", "run.py"), BUILD, *wrapper], stdout=subprocess.PIPE,
                         text=True, check=False)
    return run.stdout.splitlines()[-1], run.returncode


class Demo(unittest.TestCase):
    def test_one_kernel_that_differs_is_told(self):
        for script, told in [('case $0 in */fir) exit 1;; esac; exec "$0" "$@"', "fir ended with 1"),
                             ('case $0 in */fir) exec true;; esac; exec "$0" "$@"', "fir checked nothing")]:
            self.assertEqual(demo("sh", "-c", script), ("6 of 7 kernels equal to plain C: " + told, 1))

    def test_page_shows_what_the_kernels_made(self):
        verdict, status = demo()
        self.assertRegex(verdict, r"^7 kernels, every value equal to plain C \([\d,]+ values\)$")
        self.assertEqual(status, 0)
        with open(os.path.join(BUILD, "index.html"), encoding="utf-8") as file:
            page = file.read()
        self.assertIn(verdict, page)
        shown = re.findall(r'src="(.*?)"', page)
        self.assertEqual(len(shown), 7 * 2 + 4)
        for path in (os.path.join(BUILD, name) for name in shown):
            with open(path, "rb") as file:
                start = {".wav": b"RIFF", ".png": b"\x89PNG", ".svg": b"<svg"}[os.path.splitext(path)[1]]
                self.assertTrue(file.read().startswith(start), path)
            if path.endswith(".svg"):
                tags = [element.tag.rpartition("}")[2] for element in xml.etree.ElementTree.parse(path).getroot()]
                self.assertEqual(tags[:2], ["title", "desc"], path)


if __name__ == "__main__":
    unittest.main()
