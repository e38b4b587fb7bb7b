"""kastarri-conform: what its programs are made of and print, and how reports are compared.

Run as: conform_test.py PROGRAM LIBRARY WIDTH COMPILER (the directory of libkastarri.so; 32 or 64).
"""

import csv
import itertools
import json
import os
import re
import subprocess
import sys
import tempfile
import unittest
import xml.etree.ElementTree

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
PROGRAM, LIBRARY, WIDTH, COMPILER = sys.argv[1:5]
FILES = os.path.join(os.path.dirname(os.path.dirname(PROGRAM)), "share", "kastarri", "conform")
sys.path.insert(0, os.path.join(ROOT, "tools", "conform"))
import programs  # noqa: E402

MOST_BYTES = 500_000


def conform(*arguments):
    done = subprocess.run([PROGRAM, *arguments], capture_output=True, text=True, check=False)
    return done.returncode, done.stdout, done.stderr


def signed(bits, text):
    value = int(text, 16)
    return value - (1 << bits) if value >> (bits - 1) else value


class Conform(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        scratch = tempfile.TemporaryDirectory()
        cls.addClassCleanup(scratch.cleanup)
        cls.directory = scratch.name
        cls.sources = cls.write("all")
        cls.texts = {}
        for source in cls.sources:
            with open(source, encoding="utf-8") as file:
                cls.texts[os.path.basename(source)] = file.read()
        with open(os.path.join(FILES, "conform.json"), encoding="utf-8") as file:
            cls.library = json.load(file)
        cls.report = cls.run_programs("report", "--family", "scalar", "--family", "multiply")

    @classmethod
    def path(cls, *parts):
        return os.path.join(cls.directory, *parts)

    @classmethod
    def write(cls, directory, *options):
        status, _, errors = conform("-o", cls.path(directory), *options)
        assert status == 0, errors
        return sorted(os.path.join(cls.path(directory), name) for name in os.listdir(cls.path(directory)))

    @classmethod
    def run_programs(cls, directory, *options):
        """What the programs print, all together."""
        printed = ""
        for source in cls.write(directory, *options):
            program = source.removesuffix(".cpp")
            subprocess.run([COMPILER, f"-m{WIDTH}", "-std=c++11", "-O1", "-msse2", "-mfpmath=sse", "-Wall", "-Wextra", "-Werror",
                            "-I", os.path.join(ROOT, "include"), source, "-o", program, "-L", LIBRARY, "-lkastarri"], check=True)
            printed += subprocess.run([program], env={**os.environ, "LD_LIBRARY_PATH": LIBRARY}, check=True, capture_output=True,
                                      text=True).stdout
        return printed

    def file(self, name, text):
        with open(self.path(name), "w", encoding="utf-8") as file:
            file.write(text)
        return self.path(name)

    def values(self, name):
        """Case -> operand -> lanes, and the text."""
        printed = self.run_programs(f"values_{name}", "--values", name)
        cases = {}
        for line in printed.splitlines():
            match = re.fullmatch(rf"{name} (\d+) (=?\w+)((?: [0-9a-f]+)+)", line)
            if match and match[2] not in ("flags",):
                cases.setdefault(int(match[1]), {})[match[2]] = match[3].split()
        return list(cases.values()), printed

    # --- The programs ---

    def test_every_intrinsic_is_called_by_one_program_or_left_out_for_a_reason(self):
        called = [name for text in self.texts.values() for name in re.findall(r"^static void run_(\w+)\(\)", text, re.M)]
        left_out = [data["name"] for data in self.library["intrinsics"] if programs.is_left_out(data)]
        self.assertEqual(sorted(called + left_out), sorted(data["name"] for data in self.library["intrinsics"]))
        self.assertLess(len(left_out), 20)

    def test_programs_ask_for_nothing_but_the_core_and_printf(self):
        for name, text in self.texts.items():
            with self.subTest(name):
                self.assertLess(len(text), MOST_BYTES)
                self.assertEqual(re.findall(r"#include (.*)", text), ["<stdio.h>", '"kastarri/names.h"'])
                self.assertEqual(re.findall(r"\._|->|cstub_|kastarri(?!-conform|/names)|\b(?:new|malloc|fopen|time|clock|std)\b", text), [])

    def test_header_and_left_out_names_are_parameters(self):
        errors = self.file("errors", "part.cpp:7: error: 'ZRA_ADDNX16' was not declared in run_ZRA_SUBNX16()")
        sources = self.write("part", "--family", "integer", "--header", "<core/all.h>", "--without", errors)
        for source in sources:
            with open(source, encoding="utf-8") as file:
                text = file.read()
            self.assertIn("#include <core/all.h>\n", text)
            self.assertNotRegex(text, r"\bZRA_(ADD|SUB)NX16\b")

    def test_a_report_has_a_line_for_each(self):
        lines = [line for line in self.report.splitlines() if not line.startswith("#")]
        for line in lines:
            self.assertRegex(line, r"^\w+(/spill)? [1-9]\d* [0-9a-f]{16}$")
        names = [line.split()[0] for line in lines]
        called = [data["name"] for data in self.library["intrinsics"] if data["family"] in ("scalar", "multiply")
                  and not programs.is_left_out(data)]
        self.assertEqual(sorted(name for name in names if "/" not in name), sorted(called))
        self.assertEqual(len({line.split()[2] for line in lines}), len(lines), "every hash another")
        self.assertIn("ZRA_MULANX16/spill", names)

    # --- Operands and values ---

    def test_corners_meet_and_results_are_those_of_the_operands(self):
        cases, _ = self.values("ZRA_ADDSNX16")
        met = set()
        for case in cases:
            for a, b, result in zip(case["a"], case["b"], case["=result"]):
                total = signed(16, a) + signed(16, b)
                self.assertEqual(signed(16, result), max(-32768, min(32767, total)))
                met.add((a, b))
        corners = ["0000", "0001", "0002", "ffff", "fffe", "7fff", "7ffe", "8000", "8001", "5555", "4000"]
        self.assertEqual(set(itertools.product(corners, corners)) - met, set())

    def test_predicates_enable_all_none_and_some(self):
        cases, _ = self.values("ZRA_ADDNX16T")
        self.assertTrue({"ffffffff", "00000000", "55555555", "aaaaaaaa", "0000ffff"} <= {case["p"][0] for case in cases})
        for case in cases:
            for lane, result in enumerate(case["=r"]):
                enabled = int(case["p"][0], 16) >> lane & 1
                total = (int(case["a"][lane], 16) + int(case["b"][lane], 16)) & 0xFFFF
                self.assertEqual(int(result, 16), total if enabled else int(case["r"][lane], 16))

    def test_wide_lanes_are_filled_and_read_whole(self):
        printed = self.run_programs("wide", "--values", "ZRA_MULANX16", "--values", "ZRA_MULAN_2X32")
        wide = re.findall(r"ZRA_MULANX16/spill \d+ (=?\w+) (.*)", printed)
        for a, b, acc, low, high in zip(*[iter(lanes.split() for _, lanes in wide)] * 5):
            for i in range(32):
                total = signed(48, acc[i]) + signed(16, a[i]) * signed(16, b[i])
                self.assertEqual(int(high[i] + low[i], 16), total & ((1 << 48) - 1))
        words = re.findall(r"ZRA_MULAN_2X32 \d+ (=?\w+) (.*)", printed)
        for a, b, acc, result in zip(*[iter(lanes.split() for _, lanes in words)] * 4):
            for i in range(16):
                total = signed(64, acc[i]) + signed(32, a[i]) * signed(32, b[i])
                self.assertEqual(int(result[16 + i] + result[i], 16), total & ((1 << 64) - 1))
        self.assertGreater(len(wide), 50)
        self.assertGreater(len(words), 50)

    # --- Comparison ---

    def changed(self, pattern, name="changed.txt"):
        """The report with other hashes for what matches."""
        return self.file(name, re.sub(rf"(?m)^((?:{pattern}) \d+ ).*$", r"\g<1>0123456789abcdef", self.report))

    def test_equal_reports(self):
        a = self.file("a.txt", self.report)
        os.makedirs(self.path("parts"), exist_ok=True)
        lines = self.report.splitlines(keepends=True)
        for number, part in enumerate((lines[:100], lines[100:])):
            self.file(f"parts/{number}.txt", "".join(part))
        status, out, _ = conform("compare", a, self.path("parts"))
        self.assertEqual(status, 0, out)
        self.assertRegex(out, r"^\d+ results: \d+ same\n$")

    def test_differences_are_named_by_the_choice_that_explains_most(self):
        a = self.file("a.txt", self.report)
        b = self.changed(r"ZRA_MULSGNS\w+|ZRA_SQRPDNX16|ZRA_MULPDNX16|ZRA_MUL\w+PDNX16|ZRA_MULNX16")
        table, picture = self.path("table.csv"), self.path("picture.svg")
        status, out, _ = conform("compare", a, b, "--csv", table, "--svg", picture)
        self.assertEqual(status, 1)
        first = out.partition("first against the choice:")[2].partition("then against")[0]
        self.assertIn("`MULSGNS` saturates", first)
        self.assertIn("2 of the 2 that it touches", first)
        self.assertIn("Paired differences subtract", out.partition("then against")[2])
        self.assertIn("ZRA_MULNX16", out.partition("No choice")[2])
        with open(table, encoding="utf-8", newline="") as file:
            rows = {row["name"]: row for row in csv.DictReader(file)}
        self.assertEqual((rows["ZRA_MULNX16"]["state"], rows["RK_MAX"]["state"], rows["ZRA_MULNX16"]["choice"]), ("different", "same", ""))
        self.assertIn("subtract", rows["ZRA_MULPDNX16"]["choice"])
        self.assertEqual(xml.etree.ElementTree.parse(picture).getroot().tag, "{http://www.w3.org/2000/svg}svg")

    def test_other_spill_images_are_told_from_other_products(self):
        a = self.file("a.txt", self.report)
        _, out, _ = conform("compare", a, self.changed(r"\w+/spill"))
        self.assertIn("The spill image of a wide register", out.partition("first against the choice:")[2].partition("then")[0])

    def test_what_registers_are_read_with_is_named_before_all(self):
        _, out, _ = conform("compare", self.file("a.txt", self.report), self.changed("ZRA_PACKVRNRNX48"))
        self.assertIn("settle them first: ZRA_PACKVRNRNX48\n", out)

    def test_reports_of_other_programs(self):
        other = re.sub(r"(?m)^RK_MIN \d+", "RK_MIN 7", self.report.replace("RK_MAX ", "RK_UNHEARD_OF "))
        status, out, _ = conform("compare", self.file("a.txt", self.report), self.file("b.txt", other))
        self.assertEqual(status, 1)
        for text in "other cases: the programs are not the same\n  RK_MIN\n", "only in A\n  RK_MAX\n", "only in B\n  RK_UNHEARD_OF\n":
            self.assertIn(text, out)

    def test_values_differ_in_a_lane(self):
        cases, printed = self.values("ZRA_SUBNX16")
        lines = printed.splitlines()
        at = next(n for n, line in enumerate(lines) if line.startswith("ZRA_SUBNX16 3 =result"))
        words = lines[at].split()
        words[3 + 9] = "beef"
        lines[at] = " ".join(words)
        a, b = self.file("va.txt", printed), self.file("vb.txt", "\n".join(lines))
        self.assertEqual(conform("compare", a, a)[0], 0)
        status, out, _ = conform("compare", a, b)
        self.assertEqual(status, 1)
        third = cases[2]
        self.assertIn("ZRA_SUBNX16, case 3: result differs first in lane 9\n", out)
        for name, value in (("a", third["a"][9]), ("b", third["b"][9]), ("result", third["=result"][9]), ("result", "beef")):
            self.assertRegex(out, rf"(?m)^ +=?{name} +{value}\b")

    def test_what_cannot_be_done_has_status_2(self):
        a = self.file("a.txt", self.report)
        for arguments in (["compare", a, self.path("nowhere")], ["compare", a, self.file("empty.txt", "Hello\n")],
                          ["compare", a, self.file("twice.txt", self.report + "RK_MIN 1 0000000000000000\n")],
                          ["--values", "ZRA_NOSUCH"], ["--values", "RK_NOP", "-o", self.path("none")], ["-o", a]):
            with self.subTest(arguments):
                status, out, errors = conform(*arguments)
                self.assertEqual(status, 2, out)
                self.assertRegex(errors, "^kastarri-conform: ")


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[5:]])
