"""The Python package: arrays of all shapes, errors, memory, states, ports, documentation, wheels.

Run as: package_test.py BUILD.
"""

import ctypes
import doctest
import inspect
import mmap
import os
import pydoc
import re
import subprocess
import sys
import tempfile
import unittest
import zipfile

import numpy as np

import kastarri
from kastarri import _core

BUILD = os.path.abspath(sys.argv.pop(1))
ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
RAMP = np.arange(32, dtype=np.int16)


class Arrays(unittest.TestCase):
    def setUp(self):
        self.random = np.random.default_rng(1)

    def halves(self, *axes):
        return self.random.integers(-2**15, 2**15, (*axes, 32)).astype(np.int16)

    def test_axes_are_broadcast(self):
        for first, second in (((), ()), ((5,), (5,)), ((5,), ()), ((4, 1, 3), (2, 1)), ((2, 0, 3), (3,)), ((70,), (3, 1))):
            a, b = self.halves(*first), self.halves(*second)
            total = np.clip(a.astype(int) + b, -2**15, 2**15 - 1)
            np.testing.assert_array_equal(kastarri.ADDSNX16(a, b), total)

    def test_operands_lie_anywhere(self):
        a = self.halves(6, 7)
        shifted = np.zeros(a.nbytes + 1, np.uint8)[1:].view(np.int16).reshape(a.shape)
        shifted[:] = a
        backward = a[::-1, ::2]
        swapped = a.astype(">i2")
        wide = np.zeros((6, 7, 64), np.int16)
        wide[..., ::2] = a
        frozen = a.copy()
        frozen.setflags(write=False)
        for b in (shifted, a.transpose(1, 0, 2).copy().transpose(1, 0, 2), swapped, wide[..., ::2], frozen):
            np.testing.assert_array_equal(kastarri.SUBNX16(b, 0), a)
        np.testing.assert_array_equal(kastarri.SUBNX16(backward, backward[0]), backward - backward[0])

    def test_sums_and_predicates_of_all_strides(self):
        for acc_type, words, byte_type in (("qv_vecNx48", 32, np.int16), ("qv_vec2Nx24", 64, np.int8)):
            multiply = kastarri.MULANX16 if words == 32 else kastarri.MULA2NX8
            sums = self.random.integers(-2**23, 2**23, (80, 3, words))
            a, b = (self.random.integers(-99, 99, (80, 3, words)).astype(byte_type) for _ in range(2))
            range_of = 2**48 if words == 32 else 2**24
            for pick in (np.s_[:], np.s_[::-1, ::2], np.s_[5], np.s_[:, 1], np.s_[7, 2]):
                wrapped = (sums[pick] + a[pick].astype(int) * b[pick] + range_of // 2) % range_of - range_of // 2
                before = sums.copy()
                np.testing.assert_array_equal(multiply(sums[pick], a[pick], b[pick]), wrapped, acc_type)
                np.testing.assert_array_equal(multiply(sums[5, 1], a[pick], b[pick]).shape, a[pick].shape)
                np.testing.assert_array_equal(sums, before)
        for lanes, name, lane in ((64, "2NX8", np.int8), (32, "NX16", np.int16), (16, "N_2X32", np.int32)):
            a, b = (self.random.integers(-3, 3, (90, lanes)).astype(lane) for _ in range(2))
            less = getattr(kastarri, "LT" + name)(a, b)
            np.testing.assert_array_equal(less, a < b)
            chosen = getattr(kastarri, f"ADD{name}T")(a[::-1], a, b, less[:, ::1])
            np.testing.assert_array_equal(chosen, np.where(a < b, a + b, a[::-1]))

    def test_results_go_where_they_are_wanted(self):
        acc, a = np.ones((9, 32), np.int64), self.halves(9)
        self.assertIs(kastarri.MULANX16(acc, a, 2, out=acc), acc)
        np.testing.assert_array_equal(acc, 1 + 2 * a.astype(int))
        bits = np.zeros((9, 32), bool)
        self.assertIs(kastarri.LTNX16(a, 0, out=bits), bits)
        np.testing.assert_array_equal(bits, a < 0)
        for out in (np.zeros((8, 32), bool), np.zeros((9, 32), np.uint8), np.zeros((32, 9), bool).T):
            self.assertRaisesRegex(ValueError, "out is a contiguous array", kastarri.LTNX16, a, 0, out=out)

    def test_operands_are_read_before_they_are_overwritten(self):
        """Each call with out= among its operands gives what it gives with new arrays."""
        k = kastarri
        for count in (5, 200):
            a, flat = self.halves(count), np.arange(count + 31, dtype=np.int16)
            sums, narrow = (self.random.integers(-2**20, 2**20, (count, lanes)) for lanes in (32, 64))
            divisors, p = np.arange(1, count + 1, dtype=np.int32), a > 0
            down = 64 * np.arange(count, dtype=np.int32)[::-1]
            quotients = np.arange(count, dtype=np.int32) % 3
            for array, call in ((a, lambda n: (n, k.ADDNX16, n, n[0])),
                                (a, lambda n: (n[1:], k.ADDNX16, n[:-1], n[:-1])),
                                (a, lambda n: (n, k.SUBNX16, n[::-1], n)),
                                (a, lambda n: (n, k.ADDNX16T, a[::-1], n, n, p)),
                                (a, lambda n: (n, k.ADDNX16T, n, n, n, p)),
                                (a, lambda n: (n, k.ADDNX16T, n[::-1], a, n, p)),
                                (a, lambda n: (n, k.LVNX16_I, n, down)),
                                (p, lambda n: (n[1:], k.NOTBN, n[:-1])),
                                (flat, lambda n: (n[31:], k.RMINNX16, np.lib.stride_tricks.sliding_window_view(n, 32))),
                                (sums, lambda n: (n[1:], k.MULANX16, n[:-1], a[1:], 3)),
                                (narrow, lambda n: (n[:-1], k.MULA2NX8, n[1:], 2, 3)),
                                (divisors, lambda n: (n[1:], k.RK_QUOS, quotients[1:], n[:-1]))):
                _, function, *operands = call(array.copy())
                wanted = function(*operands)
                out, function, *operands = call(array.copy())
                self.assertIs(function(*operands, out=out), out)
                np.testing.assert_array_equal(out, wanted, f"{function.__name__}, {count} registers")
        odd = np.zeros(32 * 2 + 2, np.int16)[1:33]  # not at an address that a register would have in C++
        np.testing.assert_array_equal(k.ADDNX16(RAMP, 1, out=odd), RAMP + 1)

    def test_several_results(self):
        p, r = kastarri.BABSNX16(RAMP - 3)
        np.testing.assert_array_equal(p, RAMP < 3)
        np.testing.assert_array_equal(r, abs(RAMP - 3))

    def test_single_lanes_are_numbers(self):
        self.assertEqual(kastarri.ADDS16(32000, 1000), 32767)
        np.testing.assert_array_equal(kastarri.RK_ADD([1, 2, 3], [[10], [20]]), [[11, 12, 13], [21, 22, 23]])
        np.testing.assert_array_equal(kastarri.RADDNX16(np.stack([RAMP, RAMP])), [496, 496])


class Errors(unittest.TestCase):
    def check(self, kind, words, function, *arguments):
        with self.assertRaisesRegex(kind, words):
            function(*arguments)

    def test_operands(self):
        add = kastarri.ADDNX16
        self.check(ValueError, "a has 16 lanes; a qv_vecNx16 has 32 of int16", add, RAMP[:16], RAMP)
        self.check(TypeError, r"a is of int16, not of int64; astype\(int16\)", add, RAMP.astype(int), RAMP)
        self.check(TypeError, "b: float64 where int16", add, RAMP, 1.5)
        self.check(TypeError, "<U1 where int16", add, RAMP, "5")
        self.check(ValueError, "b: a number is not within -32768 to 32767", add, RAMP, [40000] * 32)
        self.check(ValueError, "b has 3 registers along an axis where another operand has 2", add,
                   np.zeros((2, 32), np.int16), np.zeros((3, 32), np.int16))
        self.check(ValueError, "acc has a number that does not fit into 48 bits", kastarri.MULANX16, 2**47, RAMP, RAMP)
        self.check(ValueError, "into 24 bits", kastarri.MULA2NX8, -2**23 - 1, 0, 0)
        self.check(ValueError, "True and False", kastarri.NOTBN, list(range(32)))
        self.check(ValueError, "a is 4294967296; uint32 is from 0", kastarri.RK_AND, 2**32, 1)
        self.check(TypeError, "missing 1 required positional argument: 'b'", add, RAMP)
        self.check(TypeError, "is a qv_vecNx16, not a qv_vecNx16U", add, kastarri.qv_vecNx16U(1), 1)
        self.check(AttributeError, "has no 'ADDNX17'", getattr, kastarri, "ADDNX17")
        self.check(SystemError, "wrong number", _core.call, kastarri.intrinsics.index("ADDNX16"), None)
        self.check(SystemError, "wrong number", _core.call, kastarri.intrinsics.index("ADDNX16"), None, RAMP, RAMP, RAMP)

    def test_a_failed_call_changes_nothing_of_the_operands(self):
        acc = np.zeros((200, 32), np.int64)
        acc[150, 7] = 2**50
        before = acc.copy()
        self.check(ValueError, "48 bits", kastarri.MULANX16, acc, RAMP, RAMP)
        np.testing.assert_array_equal(acc, before)

    def test_immediates(self):
        for name, highest in (("SLLINX16", 15), ("SRAI2NX8", 7), ("REPNX16", 31)):
            function, a = getattr(kastarri, name), np.zeros(64 if "2NX8" in name else 32, np.int8 if "2NX8" in name else np.int16)
            function(a, highest)
            for wrong in (-1, highest + 1, 2**40):
                self.check(ValueError, f"the immediate is from 0 to {highest}", function, a, wrong)
            for wrong in (1.0, a, "1"):
                self.check(TypeError, "an immediate, which is an int", function, a, wrong)

    def test_failed_calls_leave_nothing_behind(self):
        huge = np.full((2, 32), 2**50)
        kastarri.ports.imported_wire(None)
        calls = ((kastarri.MULANX16, huge, RAMP, RAMP), (kastarri.LVNX16_I, RAMP, 1), (kastarri.RK_QUOU, 1, 0),
                 (kastarri.ADDNX16, RAMP, 1.5), (kastarri.SVNX16_X, RAMP, RAMP.copy(), [0, 2]), (kastarri.RK_READ_IMPWIRE,))

        def pages():
            for _ in range(5000):
                for function, *arguments in calls:
                    self.assertRaises(Exception, function, *arguments)
            with open("/proc/self/statm", encoding="ascii") as file:
                return int(file.read().split()[1])
        before = pages()
        self.assertLess(pages(), before + 100)  # 13 bytes a call

    def test_what_would_end_the_process(self):
        self.check(ZeroDivisionError, "RK_QUOU", kastarri.RK_QUOU, [4, 5], [1, 0])
        self.check(OverflowError, "RK_REMS", kastarri.RK_REMS, -2**31, -1)
        self.assertEqual(kastarri.RK_QUOS(-2**31, 1), -2**31)


class Memory(unittest.TestCase):
    def test_registers_one_after_the_other(self):
        memory = np.arange(256, dtype=np.int16)
        offset, loaded = 0, []
        for _ in range(4):
            v, offset = kastarri.LVNX16_IP(memory, offset, 64)
            loaded.append(v)
        np.testing.assert_array_equal(np.concatenate(loaded), memory[:128])
        v, offsets = kastarri.LVNX16_IP(memory, 64 * np.arange(4), [64, -64, 0, 1])
        np.testing.assert_array_equal(v, loaded)
        np.testing.assert_array_equal(offsets, [64, 0, 128, 193])
        target = bytearray(200)
        kastarri.SVNX16_I(v[:2], target, [6, 70])
        np.testing.assert_array_equal(np.frombuffer(target, np.int16)[3:67], memory[:64])

    def test_gathers_leave_disabled_elements_alone(self):
        memory, p = np.arange(100, dtype=np.int16), RAMP % 2 == 0
        offsets = np.where(p, 2 * RAMP[::-1], 60000).astype(np.uint16)
        self.assertRaisesRegex(ValueError, "at offset 60000", kastarri.GATHERANX16, memory, offsets)
        np.testing.assert_array_equal(kastarri.GATHERDNX16(kastarri.GATHERANX16T(memory, offsets, p)), np.where(p, RAMP[::-1], 0))
        below = np.zeros(16, np.uint32) - 4
        self.assertRaisesRegex(ValueError, "at offset -4", kastarri.GATHERAN_2X32, memory, below.astype(np.uint32))

    def test_tested_offsets_are_those_that_are_used(self):
        """Stores to where their own offsets lie, in the same array and in the same bytes at another address."""
        with tempfile.TemporaryFile() as file:
            file.truncate(4096)
            two = [np.frombuffer(mmap.mmap(file.fileno(), 4096), np.uint8) for _ in range(2)]
            for writable, readable in (two[:1] * 2, two):
                memory, same = (bytes_[1024:1152] for bytes_ in (writable, readable))
                writable[:] = 0
                kastarri.SVNX16_X(np.full((2, 32), 99, np.int16), memory, same[:8].view(np.int32))
                self.assertEqual(set(memory[:64:2]), {99})
                writable[:] = 0
                memory[:64] = (64 + 2 * RAMP).view(np.uint8)
                offsets = same.view(np.uint16).reshape(2, 32)
                kastarri.SCATTERNX16(np.full((2, 32), 2000, np.int16), memory, offsets)
                self.assertEqual(np.count_nonzero(writable), np.count_nonzero(memory))
        rows = np.arange(96, dtype=np.int16).reshape(3, 32)
        kastarri.SVNX16_I(rows[:2], rows, [64, 128])  # operands are as they were before the first store
        np.testing.assert_array_equal(rows, [RAMP, RAMP, RAMP + 32])

    def test_errors(self):
        memory = np.zeros(100, np.int16)
        for offset in (2**63 - 1, 2**63 - 64, -2**63):
            self.assertRaisesRegex(ValueError, "not within the memory of 200 bytes", kastarri.LVNX16_IP, memory, offset, 64)
        for objects in (np.full(32, None), memoryview(np.full(32, None)), np.zeros(8, "i8,O")):
            self.assertRaisesRegex(TypeError, "holds Python objects", kastarri.SVNX16_I, RAMP, objects, 0)
        kastarri.SVNX16_I(RAMP, memoryview(bytearray(64)), 0)
        for offset in (-1, 137, 2**31 - 1):
            self.assertRaisesRegex(ValueError, "not within the memory of 200 bytes", kastarri.LVNX16_I, memory, offset)
        self.assertRaisesRegex(ValueError, "offset 2 is not a multiple of 4", kastarri.RK_L32I, memory, 2)
        self.assertRaisesRegex(ValueError, "not a multiple of 2", kastarri.SSNX16_IP, 1, memory, 1, 2)
        self.assertRaisesRegex(TypeError, "may be written", kastarri.SVNX16_I, RAMP, bytes(64), 0)
        self.assertRaisesRegex(TypeError, "one behind the other", kastarri.LVNX16_I, memory[::2], 0)

    def test_accesses_stay_within_the_bytes_that_are_named(self):
        """Every access at the end of a page, behind which nothing may be touched, and one byte further, which is refused."""
        page = mmap.PAGESIZE
        pages = mmap.mmap(-1, 2 * page)
        memory = np.frombuffer(pages, np.uint8)
        libc = ctypes.CDLL(None, use_errno=True)
        address = memory.ctypes.data
        self.assertEqual(libc.mprotect(ctypes.c_void_p(address + page), ctypes.c_size_t(page), 0), 0)
        tried = 0
        for name in kastarri.intrinsics:
            function = getattr(kastarri, name)
            parameters = [p for p in inspect.signature(function).parameters if p != "out"]
            if "memory" not in parameters:
                continue
            size, multiple = map(int, re.search(r"; (\d+) bytes? an access(?:, at a multiple of (\d+))?", function.__doc__).groups("1"))
            size += size == 1 and "offsets" in parameters
            arguments = {p: 1 for p in parameters}
            if "offsets" in parameters:
                arguments |= {"memory": memory[page - size:page], "offsets": 0}
            else:
                arguments |= {"memory": memory[:page], "offset": page - size}
            function(*arguments.values())
            if "offsets" in parameters:
                arguments["offsets"] = multiple
            else:  # the addresses of some are rounded down
                arguments["offset"] += size if re.search("_(mtor|rtom)_", name) else multiple
            self.assertRaisesRegex(ValueError, "not within", function, *arguments.values())
            tried += 1
        self.assertGreater(tried, 700)
        libc.mprotect(ctypes.c_void_p(address + page), ctypes.c_size_t(page), 3)


class Core(unittest.TestCase):
    def tearDown(self):
        kastarri.state.rounding, kastarri.state.flags = "nearest", ()

    def test_states(self):
        state, third = kastarri.state, lambda: float(kastarri.MULF32(1 / 3, 3.1))
        state.flags = ()
        results = {}
        for mode in ("nearest", "zero", "up", "down"):
            state.rounding = mode
            results[mode] = third()
        self.assertLess(results["down"], results["up"])
        self.assertEqual(results["zero"], results["down"])
        self.assertEqual(state.flags, {"inexact"})
        state.ZRA_FS3 = (1, 2)
        self.assertEqual(state.ZRA_FS3, (1, 2))
        state.SAR = 5
        self.assertEqual((kastarri.RK_RSR_SAR(), state.SAR), (5, 5))
        state.PRID = 7
        self.assertEqual(kastarri.RK_RSR_PRID(), 7)
        self.assertRaises(AttributeError, setattr, state, "SARS", 1)
        self.assertRaises(ValueError, setattr, state, "SAR", 2**32)
        self.assertRaises(TypeError, setattr, state, "SAR", 1.5)
        self.assertRaises(ValueError, setattr, state, "PRID", 2**31)
        self.assertRaises(ValueError, setattr, state, "rounding", "off")
        self.assertRaises(ValueError, setattr, state, "flags", {"exact"})

    def test_ports(self):
        entries, sent, told = [3, 4], [], []
        kastarri.ports.input_queue(lambda: bool(entries), lambda: entries.pop(0))
        kastarri.ports.output_queue(lambda: len(sent) < 1, sent.append, lambda: told.append("attempt"))
        kastarri.ports.exported_state(told.append)
        kastarri.ports.imported_wire(lambda: 99)
        self.assertEqual(kastarri.RK_READ_IPQ(), 3)
        self.assertEqual(kastarri.RK_READ_IPQ_NBLK(), (4, True))
        self.assertEqual((kastarri.RK_CHECK_IPQ(), kastarri.RK_READ_IPQ_NBLK()), (1, (0, False)))
        self.assertEqual([kastarri.RK_WRITE_OPQ_NBLK(v) for v in (8, 9)], [True, False])
        kastarri.RK_WUR_EXPSTATE([1, 2])
        self.assertEqual((sent, told), ([8], ["attempt", 1, 2]))
        self.assertEqual(kastarri.RK_READ_IMPWIRE(), 99)
        # Errors of functions, and functions that are not there.
        self.assertRaises(IndexError, kastarri.RK_READ_IPQ)
        kastarri.ports.imported_wire(lambda: 2**32)
        self.assertRaisesRegex(ValueError, "32 bits", kastarri.RK_READ_IMPWIRE)
        kastarri.ports.imported_wire(None)
        self.assertRaisesRegex(RuntimeError, "no handler 'wire'", kastarri.RK_READ_IMPWIRE)

    def test_handlers_that_call_intrinsics(self):
        wire = kastarri.ports.imported_wire
        wire(lambda: np.max(kastarri.ADDNX16(RAMP, 1)))
        self.assertEqual(kastarri.RK_READ_IMPWIRE(), 32)
        wire(kastarri.RK_READ_IMPWIRE)
        self.assertRaises(RecursionError, kastarri.RK_READ_IMPWIRE)
        wire(lambda: wire(None) or 5)
        self.assertEqual(kastarri.RK_READ_IMPWIRE(), 5)


class Documentation(unittest.TestCase):
    def test_examples_of_the_documentation(self):
        found = doctest.testfile(os.path.join(ROOT, "docs", "python.md"), module_relative=False,
                                 optionflags=doctest.NORMALIZE_WHITESPACE | doctest.ELLIPSIS)
        self.assertGreater(found.attempted, 20)
        self.assertEqual(found.failed, 0)

    def test_help_and_signatures(self):
        text = pydoc.plain(pydoc.render_doc(kastarri.MULANX16))
        for words in ("MULANX16(acc, a, b, *, out=None)", "modulo 2^48", "acc: qv_vecNx48 (int64, 32 lanes)"):
            self.assertIn(words, text)
        for name in kastarri.intrinsics:
            self.assertNotRegex(getattr(kastarri, name).__doc__, "the program ends|host's")
        self.assertIs(kastarri.ZRA_ADDNX16, kastarri.ADDNX16)

    def test_registers_look_as_in_the_debugger(self):
        shown = kastarri.qv_vecNx16([16384, -8192] * 16)
        self.assertTrue(repr(shown).startswith("32 x int16 = {16384, -8192, 16384,"))
        self.assertTrue(f"{shown:q15}".startswith("32 x int16 q15 = {0.50000, -0.25000,"))
        self.assertTrue(f"{shown:hex}".startswith("32 x int16 hex = {0x4000, 0xe000,"))
        self.assertEqual(repr(kastarri.vboolN_2([True] + [False] * 15)), "bits 0..15: 10000000 00000000")
        self.assertEqual(len(repr(kastarri.qv_vecNx48(np.zeros((2, 3, 32), int))).splitlines()), 6)
        np.testing.assert_array_equal(kastarri.ADDNX16(shown, 1), np.asarray(shown) + 1)
        self.assertRaises(ValueError, format, shown, "q")

    def test_a_wheel_works_elsewhere(self):
        with tempfile.TemporaryDirectory() as directory:
            built = subprocess.run([sys.executable, "-m", "pip", "wheel", "--no-build-isolation", "--no-deps", "--no-index", "-q", "-w",
                                    directory, os.path.join(ROOT, "python")],
                                   env={**os.environ, "KASTARRI_BUILD": BUILD}, capture_output=True, text=True, check=False)
            self.assertEqual(built.returncode, 0, built.stdout + built.stderr)
            wheel, = (name for name in os.listdir(directory) if name.endswith(".whl"))
            self.assertRegex(wheel, rf"kastarri-{kastarri.__version__}-cp\d+-cp\d+-linux_x86_64.whl")
            with zipfile.ZipFile(os.path.join(directory, wheel)) as archive:
                archive.extractall(os.path.join(directory, "elsewhere"))
            program = "import kastarri; print(kastarri.__file__, kastarri.RK_ADD(2, 3))"
            ran = subprocess.run([sys.executable, "-c", program], cwd=directory, capture_output=True, text=True, check=False,
                                 env={**os.environ, "PYTHONPATH": os.path.join(directory, "elsewhere")})
            self.assertEqual(ran.stdout.split(), [os.path.join(directory, "elsewhere", "kastarri", "__init__.py"), "5"], ran.stderr)


if __name__ == "__main__":
    unittest.main()
