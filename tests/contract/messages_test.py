"""What compilers and editors tell of slips in a kernel: the first words that a person reads, and how much follows.

    messages_test.py BITS [test...]    the width of the programs
"""

import os
import re
import subprocess
import sys
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import read_tables  # noqa: E402
import rules  # noqa: E402

BOTH = ("g++", "clang++")
KERNEL = """#include "kastarri/names.h"
#include "kastarri/print.h"
void kernel(qv_vecNx16 v, qv_vecNx16 w, qv_vecNx48 acc, qv_vecNx16* p, vboolN b, int n) {{
  {statement}
  (void)v, (void)w, (void)acc, (void)p, (void)b, (void)n;
}}
"""

# A statement -> of each compiler a pattern of what it says of that line, and of how many lines that may be in all.
SLIPS = [
    # A result that is not used
    ("ZRA_ADDNX16(v, w);", {"g++": r"warning: ignoring return value of .qv_vecNx16 ZRA_ADDNX16\(",
                            "clang++": r"warning: ignoring return value of function"}, 9),
    ("ZRA_LVNX16_I(p, 0);", dict.fromkeys(BOTH, "warning: ignoring return value"), 9),
    ("RK_ADD(n, 1);", dict.fromkeys(BOTH, "warning: ignoring return value"), 9),
    ("cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_ZRA_ADDNX16(v, w);", dict.fromkeys(BOTH, "warning: ignoring return value"), 9),
    # An immediate out of range
    ("v = ZRA_SRAINX16(v, 16);", dict.fromkeys(BOTH, "warning: .*is not below 16: it is taken modulo 16"), 14),
    ("v = ZRA_SRAINX16(v, -1);", dict.fromkeys(BOTH, "warning: .*is not below 16"), 14),
    ("ZRA_REPNX16T(v, w, 32, b);", dict.fromkeys(BOTH, "warning: .*is not below 32"), 14),
    ("qv_int8 s = ZRA_SELS2NX8(qv_vec2Nx8(), 64); (void)s;", dict.fromkeys(BOTH, "warning: .*is not below 64"), 14),
    ("b = ZRA_LTRNI(32);", dict.fromkeys(BOTH, "warning: .*is not below 32"), 14),
    ("RK_SETB_EXPSTATE(32);", dict.fromkeys(BOTH, "warning: .*is not below 32"), 14),
    # What a register is not made of
    ("v = 1.5;", {"g++": r"error: use of deleted function [^\n]*double", "clang++": r"error: .*deleted"}, 60),
    ("qv_vecNx16 c = 1LL << 40; (void)c;", {"g++": "error: use of deleted function", "clang++": "error: .*deleted"}, 8),
    ("v = ZRA_ADDNX16(v, 0.5);", {"g++": "error: use of deleted function", "clang++": "error: .*deleted"}, 16),
    # Operands of another type, a result that is not there
    ("acc = ZRA_MULANX16(acc, v, w);",
     {"g++": r"error: no match for .operator=. \(operand types are .qv_vecNx48. .*and .void.\)", "clang++": "error: no viable overloaded '='"}, 70),
    ("acc = ZRA_MULNX16(acc, v);", {"g++": r"error: .*initialization of reference of type .const qv_vecNx16&. .*of type .qv_vecNx48.",
                                    "clang++": "error: no matching function for call to 'ZRA_MULNX16'"}, 9),
    ("v = ZRA_SELNX16(v, w);", dict.fromkeys(BOTH, "error: .*ZRA_SELNX16.*")
     | {"clang++": "error: use of undeclared identifier 'ZRA_SELNX16'"}, 6),
]
# What is none, and is compiled without a word.
FINE = ["v = ZRA_ADDNX16(v, w);", "(void)ZRA_ADDNX16(v, w);", "ZRA_MULANX16(acc, v, 16384);", "v = ZRA_SRAINX16(v, 15);",
        "v = ZRA_SRAINX16(v, 0);", "v = ZRA_SRAINX16(v, n);", "b = ZRA_LTRN(32);", "n = RK_ADDI(n, 1000);", "v = 'a'; v = true;",
        "RK_READ_IPQ();", "ZRA_ADDNXF16(qv_vecNxf16(0), qv_vecNxf16(0));", "RK_SSAI_SRC(1u, 2u, 3);", "qv_vecNx16 (*f)(const qv_vecNx16&, int) = &ZRA_SRAINX16; v = f(v, 3);",
        "qv_vecN_2xf32 x = 1.5f; x = 1;", "qv_vecN_4x64 x = 1LL << 40; x = 1;", "qv_int48 x = 1LL << 40; x = 2LL;"]


def compiled(compiler, text, *flags, language="c++"):
    command = [compiler, f"-m{BITS}", "-Wall", "-Wextra", "-Wpedantic", "-I", os.path.join(ROOT, "include"), *flags,
               "-x", language, "-c", "-", "-o", os.devnull]
    return subprocess.run(command, input=text, capture_output=True, text=True, check=False).stderr


class Compilers(unittest.TestCase):
    def test_a_slip_is_told(self):
        for statement, said, lines in SLIPS:
            for compiler, pattern in said.items():
                with self.subTest(statement=statement, compiler=compiler):
                    told = compiled(compiler, KERNEL.format(statement=statement), "-std=c++11", "-O2")
                    self.assertRegex(told, pattern)
                    self.assertLessEqual(len(told.splitlines()), lines, told)

    def test_what_is_no_slip_is_not(self):
        for statement in FINE:
            for compiler, level in (("g++", "-O0"), ("g++", "-O2"), ("clang++", "-O2")):
                with self.subTest(statement=statement, compiler=compiler, level=level):
                    self.assertEqual(compiled(compiler, KERNEL.format(statement=statement), "-std=c++11", level), "")

    def test_what_would_be_ambiguous_is_explained(self):
        for statement, words in (("v = 1.5;", "cast it"), ("qv_vecNx16 c = 1LL << 40;", "to one of the types above"),
                                 ("acc = ZRA_MULANX16(acc, v, w);", "what returns void changes its first operand")):
            for compiler in BOTH:
                with self.subTest(statement=statement, compiler=compiler):
                    self.assertIn(words, compiled(compiler, KERNEL.format(statement=statement), "-std=c++11"))

    def test_c_stops_at_one_line(self):
        headers = [os.path.relpath(os.path.join(directory, name), os.path.join(ROOT, "include"))
                   for directory, _, names in os.walk(os.path.join(ROOT, "include")) for name in names]
        self.assertGreater(len(headers), 20)
        for header in headers:
            for compiler in ("gcc", "clang"):
                with self.subTest(header=header, compiler=compiler):
                    told = compiled(compiler, f'#include "{header}"\nqv_vecNx16 f(void);\n', language="c")
                    first, *others = re.findall(r"error: (.*)", told)
                    self.assertIn("kastarri is for C++: compile with g++ or clang++", first)
                    self.assertEqual([other for other in others if "cstddef" not in other], [])

    def test_every_immediate_that_is_taken_modulo_has_its_limit(self):
        declared = {}
        for family in read_tables.FAMILIES:
            with open(os.path.join(ROOT, "include", "kastarri", "names", family + ".h"), encoding="utf-8") as file:
                declared.update(re.findall(r"(\w+)\([^()]*\)\n    KASTARRI_BELOW\((\d+),", file.read()))
        rows = [row for _, _, rows in read_tables.all_rows().values() for row in rows if "immediate" in row.prototype]
        unlimited = {read_tables.short_name(row.name) for row in rows} - set(declared)
        self.assertEqual({re.sub(r"_[NA]$", "", name) for name in unlimited}, {"RK_ADDI", "RK_ADDMI", "RK_MOVI"})
        # Shifts and rotations by the width of a lane, which the name tells.
        for name, limit in declared.items():
            lanes = re.match(r"ZRA_(?:S[LR][LAS]|ROTR)I(?:2NX|NX|N_2X)?(\d+)", name)
            if lanes:
                self.assertEqual(limit, lanes[1], name)
        self.assertGreater(len(declared), 80)


class Editors(unittest.TestCase):
    """An editor shows the comment that clang attaches to a declaration."""

    def test_each_short_name_shows_its_rule(self):
        tree = subprocess.run(["clang++", f"-m{BITS}", "-I", os.path.join(ROOT, "include"), "-x", "c++", "-fsyntax-only", "-Xclang",
                               "-ast-dump", "-fno-color-diagnostics", "-"], input='#include "kastarri/names.h"\n',
                              capture_output=True, text=True, check=True).stdout
        shown = {}
        for declaration in re.split(r"\n[|`]-", tree):
            name = re.match(r"(?:FunctionDecl|TypeAliasDecl) 0x\w+ .*?\b(\w+) '", declaration)
            words = re.findall(r'TextComment 0x\w+ <[^>]*> Text="(.*)"', declaration)
            if name:
                shown.setdefault(name[1], "".join(words))
        types = read_tables.read_types()
        told = {name: t.about for name, t in types.items()}
        for row in (row for _, _, rows in read_tables.all_rows().values() for row in rows):
            told[read_tables.short_name(row.name)] = told[read_tables.symbol(row.name)] = rules.own(row, types)

        def words(text):
            return text.replace(" ", "").rstrip(".")
        self.assertEqual([name for name, text in told.items() if words(shown.get(name, "")) != words(text)], [])


if __name__ == "__main__":
    BITS = sys.argv.pop(1)
    unittest.main()
