"""The words that the names of intrinsics are made of, and what they say.

N is 32. A lane layout says how many lanes a register has and how wide they are; every register type belongs to
one. Everything here and in the modules beside it is read off names alone: it knows nothing of the tables.
"""

import collections
import re

# What a name says of its row: the prototype without names of symbol and parameters, the shape, and the semantic
# functions that would be right, each the form and the columns of a KERNEL. `kernels` is empty where rows have none.
Expected = collections.namedtuple("Expected", "prototype shape kernels")


class Layout:
    """A lane layout: number and width of the lanes, the register types (signed, unsigned), the predicate, the host
    type of one lane in memory (signed, unsigned) and the layout of one lane alone."""

    def __init__(self, lanes, bits, signed, unsigned, predicate, host=(None, None), kind="i"):
        self.lanes, self.bits, self.predicate, self.kind = lanes, bits, predicate, kind
        self.types = {"": signed, "U": unsigned}
        self.hosts = {"": host[0], "U": host[1]}

    def code(self, sign):
        """The layout as tables write it: i16x32 is 32 signed lanes of 16 bits; f is a float, w too wide to compute."""
        return f"{sign if self.kind == 'i' else self.kind}{self.bits}x{self.lanes}"


LAYOUTS = {
    "2NX8": Layout(64, 8, "qv_vec2Nx8", "qv_vec2Nx8U", "vbool2N", ("signed char", "unsigned char")),
    "NX16": Layout(32, 16, "qv_vecNx16", "qv_vecNx16U", "vboolN", ("short", "unsigned short")),
    "N_2X32": Layout(16, 32, "qv_vecN_2x32v", "qv_vecN_2x32Uv", "vboolN_2", ("int", "unsigned int")),
    "N_4X64": Layout(8, 64, "qv_vecN_4x64", None, None, ("long long", None)),
    "N_8X128": Layout(4, 128, "qv_vecN_8x128", None, None, ("qv_int128", None), "w"),
    "N_16X256": Layout(2, 256, "qv_vecN_16x256", None, None, ("qv_int256", None), "w"),
    "NXF16": Layout(32, 16, "qv_vecNxf16", None, "vboolN", ("qv_f16", None), "f"),
    "N_2XF32": Layout(16, 32, "qv_vecN_2xf32", None, "vboolN_2", ("rkfloat", None), "f"),
    "8": Layout(1, 8, "qv_int8", "qv_int8U", "vbool1"),
    "16": Layout(1, 16, "qv_int16", "qv_int16U", "vbool1"),
    "32": Layout(1, 32, "qv_int32v", "qv_int32Uv", "vbool1"),
    "64": Layout(1, 64, "qv_int64", None, "vbool1"),
    "F16": Layout(1, 16, "qv_f16", None, "vbool1", kind="f"),
    "F32": Layout(1, 32, "rkfloat", None, "vbool1", kind="f"),
}

# One lane of a vector, as a scalar of the vector unit.
ELEMENTS = {"2NX8": "8", "NX16": "16", "N_2X32": "32", "N_4X64": "64", "NXF16": "F16", "N_2XF32": "F32"}

# Lanes that are half as wide in memory as in the register: NX8 under NX16, N_2X16 under N_2X32. The letter behind
# says how a lane is widened, and so of which sign it is: S by its sign, U with zeros.
HALVES = {"NX8": "NX16", "N_2X16": "N_2X32"}

# Accumulators: products of 8-bit lanes are summed in 24 bits, of 16-bit lanes in 48, of 32-bit lanes in 64.
ACCUMULATORS = {8: 24, 16: 48, 32: 64}
WIDE_TYPES = {24: ("qv_int24", "qv_vec2Nx24"), 48: ("qv_int48", "qv_vecNx48"), 64: ("qv_int64w", "qv_vecN_2x64w")}

# Predicates by the suffix of the lanes that they govern.
PREDICATES = {"2N": ("vbool2N", 64), "N": ("vboolN", 32), "N_2": ("vboolN_2", 16), "1": ("vbool1", 1)}


def alternatives(words):
    """A regular expression for one of `words`, the longest first."""
    return "|".join(sorted(map(re.escape, words), key=len, reverse=True))


def prototype(result, *parameters):
    return f"{result}({', '.join(parameters)})"


def const(register_type):
    return f"const {register_type}&"


class Unknown(Exception):
    """A name that no rule reads."""
