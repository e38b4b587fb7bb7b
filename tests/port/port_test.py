"""kastarri-port on sources that have all their names, and on some that have not.

Run as: port_test.py PROGRAM.
"""

import os
import re
import subprocess
import sys
import tempfile
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
PROGRAM = sys.argv.pop(1)
FULL = "cstub_Km_ZNB_Orbis_R5_64k_"

KERNEL = f"""#include "kastarri/names.h"
// ZRA_IN_A_COMMENT, /* ZRA_THERE_TOO
#define ZRA_OWN_MACRO(a) a
const char* text = "ZRA_IN_A_STRING \\" ZRA_STILL", *raw = R"x(ZRA_RAW " )" ZRA_YET)x";
/* ZRA_IN_LINES
   ZRA_OF_A_COMMENT */ qv_vecNx16 ZRA_SELNX8(const qv_vecNx16& a) {{ return a; }}
void kernel(qv_vecNx16 a, vboolN p, const qv_vecNx17* wrong) {{
  ZRA_OWN_MACRO(a), ZRA_SELNX8(a), settings.ZRA_MEMBER = 1, settings->ZRA_MEMBER = 2;
  a = ZRA_ADDSNX61(a, a);
  a = ZRA_SELNX16(a, a, p);  // once
  a = ZRA_SELNX16(a, a, p);  // twice
  a = {FULL}_KOR_rk_zra32_ZRA_ADDNX16(a, {FULL}_KOR_rk_zra32_ZRA_RADDANX16(a, a));
  ZRA_addnx16(a, a), qv_vecNx16_rtor_int16(a), RK_CLAMPS(1, 2), {FULL}_KOR_rk_core_QUOS(1, 2), ZRA_SHFLNX16I(a, a, 1);
}}
"""
MISSING = {"qv_vecNx17": 7, "ZRA_ADDSNX61": 9, "ZRA_SELNX16": 10, "ZRA_RADDANX16": 12, "ZRA_addnx16": 13, "ZRA_SHFLNX16I": 13}


def port(*arguments):
    done = subprocess.run([PROGRAM, *arguments], capture_output=True, text=True, check=False)
    return done.returncode, done.stdout, done.stderr


class Port(unittest.TestCase):
    def setUp(self):
        directory = tempfile.TemporaryDirectory()
        self.addCleanup(directory.cleanup)
        self.directory = directory.name
        self.kernel = self.write("kernel.cpp", KERNEL)

    def write(self, name, text):
        path = os.path.join(self.directory, name)
        os.makedirs(os.path.dirname(path), exist_ok=True)
        with open(path, "w", encoding="utf-8") as file:
            file.write(text)
        return path

    def test_trees_that_lack_nothing(self):
        status, out, errors = port(os.path.join(ROOT, "examples"))
        self.assertEqual((status, errors), (0, ""), out)
        self.assertRegex(out, r"^\d\d files, \d\d+ names .*: all there\n$")

    def test_names_that_are_not_there(self):
        status, out, _ = port(self.kernel)
        self.assertEqual(status, 1)
        found = {name: int(line) for line, name in re.findall(r"^\S+:(\d+): (\w+) is not there", out, re.M)}
        self.assertEqual(found, MISSING)
        for text in ("ZRA_SELNX16 is not there (and 1 more use)\n    not built: Select", "why: the patterns are tables",
                     "instead: Select by a predicate", "near it: ZRA_ADDSNX16", "near it: ZRA_ADDNX16\n", "as ZRA_SELNX16 above",
                     "how wide the accumulator is"):
            self.assertIn(text, out)
        self.assertIn(f"1 file, 12 names of intrinsics and register types: 6 there, {len(MISSING)} not", out)

    def test_whole_trees_and_scripts(self):
        self.write("deep/er/one.H", "auto x = ZRA_NOSUCH(1);")
        self.write("deep/notes.txt", "ZRA_NO_SOURCE")
        self.write(".hidden/two.cpp", "ZRA_HIDDEN();")
        status, out, _ = port("--names", self.directory)
        self.assertEqual((status, out.split()), (1, sorted([*MISSING, "ZRA_NOSUCH"])))
        self.assertEqual(port(os.path.join(self.directory, "nowhere.cpp"))[0], 2)

    def test_what_a_tree_defines_is_there_in_all_of_it(self):
        self.write("a/use.cpp", "qv_vecNx16 v = ZRA_MINE(1);")
        self.write("b/own.h", "#define ZRA_MINE(x) (x)")
        self.assertEqual(port(os.path.join(self.directory, "a"), os.path.join(self.directory, "b"))[0], 0)


if __name__ == "__main__":
    unittest.main()
