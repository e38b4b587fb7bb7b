"""What kastarri/print.h and the printers for gdb show, against Python's own integers and floats.

Run as: print_test.py LIBRARY
"""

import decimal
import functools
import os
import random
import re
import struct
import subprocess
import sys
import tempfile
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tests", "support")]
import generate_headers  # noqa: E402
from commands import bits_of  # noqa: E402

LIBRARY = os.path.abspath(sys.argv[1])
COMPILERS = ["g++", "clang++"]
BITS = bits_of(LIBRARY)
FLAGS = [f"-m{BITS}", "-std=c++11", "-Wall", "-Wextra", "-Wpedantic", "-Wconversion", "-Wshadow", "-Werror",
         "-I", os.path.join(ROOT, "include")]
FORMS = ["decimal", "hex", "float", "half", "halves", "bytes", "q0", "q7", "q8", "q15", "q16", "q31", "q63"]
TYPES = generate_headers.read_types()
DIRECTORY = tempfile.TemporaryDirectory()


def setUpModule():
    for compiler in COMPILERS:
        build(compiler, "registers", "-O0")
        build(compiler, "optimised", "-O2")


def tearDownModule():
    DIRECTORY.cleanup()


def path(name):
    return os.path.join(DIRECTORY.name, name)


def build(compiler, program, *flags):
    subprocess.run([compiler, *FLAGS, "-Wno-uninitialized", "-Wno-unused-but-set-variable", "-Wno-unused-variable", "-g", *flags,
                    os.path.join(HERE, program + ".cpp"), "-Wl,--no-as-needed", LIBRARY, "-Wl,-rpath," + os.path.dirname(LIBRARY),
                    "-o", path(f"{program}_{compiler}")], check=True)


def lanes(register):
    """Kind, bits, number and share of the lanes."""
    bits_of_all = register.units * register.unit_bits
    if "bool" in register.name:
        kind, bits, count = re.match(r"(.)(\d+)x(\d+)$", register.layout).groups()
        return "b", 1, int(bits) * int(count), 1
    match = re.match(r"([iufw])(\d+)x(\d+)$", register.layout)
    if not match:
        return "w", register.unit_bits, register.units, register.unit_bits
    return match[1], int(match[2]), int(match[3]), bits_of_all // int(match[3])


def patterns_of_interest(bits):
    top = 1 << bits - 1
    patterns = [0, 1, top, top - 1, 2 * top - 1, top + 1, top >> 1]
    if bits == 16:
        patterns += [0x7C00, 0xFC00, 0x7E01, 0xFD00, 0x03FF, 0x0400, 0x7BFF, 0x2E66]
    if bits == 32:
        patterns += [0x7F800000, 0xFF800000, 0x7FC00001, 0xFFA00000, 0x007FFFFF, 0x00800000, 0x7F7FFFFF, 0x3DCCCCCD]
    return patterns


def image(seed):
    """Bytes for every type: lanes of interest among random ones, with anything in the bits beside them."""
    chance = random.Random(seed)
    bytes_of = {}
    for register in TYPES.values():
        _, bits, count, share = lanes(register)
        size = register.units * register.unit_bits // 8
        whole = chance.getrandbits(8 * size)
        for i in range(count):
            if bits > 1 and chance.random() < 0.7:
                mask = (1 << bits) - 1 << i * share
                whole = whole & ~mask | chance.choice(patterns_of_interest(bits)) << i * share
        bytes_of[register.name] = whole.to_bytes(size, "little")
    return bytes_of


def number_text(kind, bits, pattern, form):
    own = pattern.to_bytes(bits // 8, "little")
    hexadecimal = "0x" + own[::-1].hex()
    if form == "hex" or kind == "w":
        return hexadecimal
    if kind == "f" or form in ("float", "half"):
        value, = struct.unpack("<e" if bits == 16 else "<f", own)
        return f"nan({hexadecimal})" if value != value else f"{value:.9g}"
    value = int.from_bytes(own, "little", signed=kind == "i")
    if form == "decimal":
        return str(value)
    with decimal.localcontext() as context:
        context.prec = 200
        fraction_bits = int(form[1:])
        digits = next(d for d in range(20) if 10**d >= 2**fraction_bits)
        exact = decimal.Decimal(value) / 2**fraction_bits
        return f"{exact.quantize(decimal.Decimal(1).scaleb(-digits), decimal.ROUND_HALF_UP):f}"


def fits(kind, bits, form):
    return (form in ("decimal", "hex") or kind in "iu" and form[0] == "q"
            or kind in "iuf" and form == {16: "half", 32: "float"}.get(bits))


@functools.lru_cache(maxsize=None)
def expected(register, data, form):
    kind, bits, count, share = lanes(register)
    parts = {"halves": 16, "bytes": 8, "q7": 8, "q8": 16, "q15": 16}.get(form)
    if register.name.endswith("pr") and parts:
        kind, bits, count, share = "i", parts, bits // parts, parts
    form = form if fits(kind, bits, form) else "decimal"
    whole = int.from_bytes(data, "little")
    if kind == "b":
        own = [whole >> i & 1 for i in range(count)]
        if form == "hex":
            return f"0x{sum(b << i for i, b in enumerate(own)):0{(count + 3) // 4}x}"
        text = " ".join("".join(map(str, own[i:i + 8])) for i in range(0, count, 8))
        return text if count == 1 else f"bits 0..{count - 1}: {text}"
    texts = [number_text(kind, bits, whole >> i * share & (1 << bits) - 1, form) for i in range(count)]
    told = "" if form == "decimal" or kind == "w" or kind == "f" and form != "hex" else form
    if count == 1:
        return texts[0] + (f" ({told})" if told not in ("", "hex") else "")
    name = {"i": f"int{bits}", "u": f"uint{bits}", "w": f"bits{bits}", "f": {16: "half", 32: "float"}.get(bits)}[kind]
    return " ".join([f"{count} x", name] + [told] * bool(told)) + " = {" + ", ".join(texts) + "}"


def write_image(name, bytes_of):
    with open(path(name), "wb") as file:
        file.write(b"".join(bytes_of.values()))
    return path(name)


def gdb(program, *commands, arguments=()):
    """What gdb prints for the commands, and its errors, having loaded the printers by itself."""
    result = subprocess.run(
        ["gdb", "-nx", "-q", "-batch", "-iex", "add-auto-load-safe-path " + os.path.dirname(LIBRARY), "-ex", "set width 0",
         "-ex", "set disable-randomization off",  # which containers refuse, with a warning
         "-ex", "set debuginfod enabled off", "-ex", "break stop_here", "-ex", f"run {' '.join(arguments)} > {os.devnull}",
         *(word for command in commands for word in ("-ex", command)), path(program)],
        capture_output=True, text=True, timeout=600, check=False)
    return result.stdout, result.stderr


class Header(unittest.TestCase):
    maxDiff = None

    def test_text_is_that_of_the_numbers(self):
        for compiler in COMPILERS:
            for seed in range(3):
                bytes_of = image(seed)
                output = subprocess.run([path("registers_" + compiler), write_image("image", bytes_of)],
                                        capture_output=True, text=True, check=True).stdout
                shown = {tuple(line.split(" ", 3)[:3]): line.split(" ", 3)[3] for line in output.splitlines()}
                self.assertEqual(len(shown), len(TYPES) * (2 * len(FORMS) + 1))
                for (name, how, form), text in shown.items():
                    with self.subTest(compiler=compiler, seed=seed, type=name, how=how, form=form):
                        self.assertEqual(text, expected(TYPES[name], bytes_of[name], form))

    def test_it_stands_beside_the_short_names_in_any_order(self):
        body = """
            #include <iostream>
            using namespace std;
            using namespace kastarri;
            void log(const qv_vecNx16& v, const vboolN& p, const rkfloat& x) {
              cout << v << p << x << as(v, form::q(15)) << kastarri::to_string(p, form::hex) << 5 << true;
              kastarri::print(stderr, x, form::decimal);
            }
        """
        for compiler, headers in (("g++", ["print", "names"]), ("g++", ["names", "print"]), ("clang++", ["print", "names"])):
            with self.subTest(compiler=compiler, headers=headers):
                result = subprocess.run([compiler, *FLAGS, "-fno-exceptions", "-fsyntax-only", "-x", "c++", "-"],
                                        input="".join(f'#include "kastarri/{h}.h"\n' for h in headers) + body,
                                        capture_output=True, text=True, check=False)
                self.assertEqual(result.returncode, 0, result.stderr[:2000])


class Debugger(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        self.bytes_of = image(7)
        self.arguments = [write_image("image", self.bytes_of)]

    def stopped(self, *commands):
        return gdb("registers_g++", *commands, arguments=self.arguments)

    def test_text_is_that_of_the_numbers(self):
        for compiler, forms in (("g++", FORMS), ("clang++", ["decimal", "q15"])):
            output, errors = gdb("registers_" + compiler, f"""python
for name in {list(TYPES)}:
    for form in {forms}:
        gdb.execute("set kastarri format " + form)
        print("@", name, form, gdb.execute("output a_" + name, to_string=True))""", arguments=self.arguments)
            shown = re.findall(r"^@ (\w+) (\w+) (.*)$", output, re.M)
            self.assertEqual(len(shown), len(TYPES) * len(forms), errors)
            for name, form, text in shown:
                with self.subTest(compiler=compiler, type=name, form=form):
                    self.assertEqual(text, expected(TYPES[name], self.bytes_of[name], form))

    def test_one_value_in_a_form_of_its_own(self):
        output, errors = self.stopped("set kastarri format hex", "kastarri print/q15 a_qv_vecNx16", "kastarri print argument",
                                      "kastarri print *&a_vboolN", "kastarri print/bytes a_qv_int64pr", "print filter")
        register = TYPES["qv_vecNx16"]
        data = self.bytes_of["qv_vecNx16"]
        self.assertEqual(output.splitlines()[-5:], [
            expected(register, data, "q15"), expected(register, data, "hex"),
            expected(TYPES["vboolN"], self.bytes_of["vboolN"], "hex"),
            expected(TYPES["qv_int64pr"], self.bytes_of["qv_int64pr"], "bytes"), "$1 = {taps = {0xfffd, 0x0007}}"])

    def test_gdbs_own_output_formats_apply_to_numbers(self):
        output, _ = self.stopped("print/x a_qv_int48", "print/x a_qv_vecN_4x64")
        lanes_64 = struct.unpack("<8Q", self.bytes_of["qv_vecN_4x64"])
        self.assertIn("= 8 x int64 = {" + ", ".join(f"{lane:#x}" for lane in lanes_64) + "}", output)

    def test_lanes_are_children_in_an_ide(self):
        cases = [("decimal", "qv_vec2Nx24"), ("hex", "qv_vecNx48"), ("q15", "qv_vecNx16"), ("half", "qv_vecNxf16"),
                 ("q15", "qv_int32pr"), ("bytes", "qv_int64pr")]
        commands = []
        for form, name in cases:
            commands += [f"set kastarri format {form}", f'interpreter-exec mi "-var-create {name} * a_{name}"',
                         f'interpreter-exec mi "-var-list-children --all-values {name}"']
        output, _ = self.stopped('interpreter-exec mi "-enable-pretty-printing"', *commands)
        answers = re.findall(r"^\^done,numchild.*", output, re.M)
        self.assertEqual(len(answers), len(cases))
        for (form, name), answer in zip(cases, answers):
            with self.subTest(form=form, type=name):
                self.assertIn('displayhint="array"', answer)
                children = re.findall(r'exp="(.*?)",numchild="(\d+)",value="(.*?)"', answer)
                text = expected(TYPES[name], self.bytes_of[name], form)
                values = text[text.index("{") + 1:-1].split(", ")
                self.assertEqual(children, [(f"[{i}]", "0", value) for i, value in enumerate(values)])

    def test_settings_last_and_errors_are_clear(self):
        output, errors = self.stopped(
            "show kastarri format", "set kastarri format q14", "run", "show kastarri format", "set kastarri format q64",
            "show kastarri", "set kastarri format", "kastarri print/octal a_vboolN", "kastarri print",
            "kastarri print argc_", "kastarri print 3 + 4", "kastarri print/half a_qv_vecNx48", "kastarri print/q3 a_vboolN",
            "kastarri print/halves a_qv_int32v", "kastarri print *(cstub_Km_ZNB_Orbis_R5_64k_qv_vecNx16*)0")
        self.assertEqual(re.findall(r"shown in the form (\w+)\.", output), ["decimal", "q14", "q14"])
        forms = "a register is shown as decimal, hex, float, half, halves, bytes, or q0 to q63 (fixed point with so many fraction bits)."
        self.assertEqual(errors.splitlines(), [
            f'Unknown form "q64": {forms}', f'Unknown form "": {forms}', f'Unknown form "octal": {forms}',
            "Usage: kastarri print[/FORM] EXPRESSION", 'No symbol "argc_" in current context.',
            "3 + 4 is of type int, which is not a register type.", "The form half does not fit lanes of 48 bits.",
            "The form q3 does not fit bits.", "The form halves does not fit lanes of 32 bits.", "Cannot access memory at address 0x0"])

    def test_help_lists_the_forms(self):
        output, _ = self.stopped("help kastarri")
        for form in "decimal", "hex", "q0 to q63", "float, half", "halves, bytes":
            self.assertRegex(output, rf"(?m)^  {form} ")

    def test_values_that_cannot_be_read_are_said_so(self):
        for compiler in COMPILERS:
            with self.subTest(compiler=compiler):
                output, errors = gdb("optimised_" + compiler, "up", "info locals", "set kastarri format q15", "info locals",
                                     "print *nothing", 'interpreter-exec mi "-enable-pretty-printing"',
                                     'interpreter-exec mi "-stack-list-variables --all-values"')
                self.assertEqual(output.count("uninitialised = <optimized out>"), 2)
                self.assertIn("part = 32 x int16 = {1, 0, 5, 0, ", output)
                self.assertIn("part = 32 x int16 q15 = {0.00003, 0.00000, 0.00015, 0.00000, ", output)
                if compiler == "g++":  # clang says that what was never written is 0
                    self.assertRegex(output, r"part = .* 0.00000, <optimized out>, <optimized out>")
                    self.assertIn("half_gone = 32 x int48 = {<optimized out>, <optimized out>, ", output)
                self.assertIn("^done,variables=", output)
                self.assertNotIn("Python", output + errors)

    def test_gdb_can_switch_the_printers_off(self):
        output, _ = self.stopped("disable pretty-printer .* kastarri", "print a_vboolN")
        self.assertRegex(output, r"\$1 = \{_ = \{\d+\}\}")


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
