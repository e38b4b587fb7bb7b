"""Vector memory: what the names of loads, stores, gathers and scatters say.

LVNX16T_IP: load (L) a whole vector (V) of 32 lanes of 16 bits (NX16), the lanes whose predicate bit is 1 (T), from
a pointer that then moves by the increment (IP).

_I and _X take a base and an offset in bytes, as an immediate or from a register: here both are an int. _IP and _XP
take a pointer to the pointer.
"""

import re

from vocabulary import ELEMENTS, HALVES, LAYOUTS, PREDICATES, Expected, Unknown, alternatives, const, prototype

WHOLE = ["2NX8", "NX16", "N_2X32", "N_4X64", "NXF16", "N_2XF32"]
ELEMENT = [*WHOLE, "N_8X128", "N_16X256"]

HALF_TYPES = {"NX8S": "qv_vecNx8", "NX8U": "qv_vecNx8U", "N_2X16S": "qv_vecN_2x16", "N_2X16U": "qv_vecN_2x16U",
              "N_2XF16": "qv_vecN_2xf16"}
HALF_HOSTS = {"NX8S": "signed char", "NX8U": "unsigned char", "N_2X16S": "short", "N_2X16U": "unsigned short"}


class Lanes:
    """The lanes of a name in the register and in memory."""

    def __init__(self, suffix):
        self.float_halves = suffix == "N_2XF16"  # converted, not copied
        self.halves = suffix in HALF_TYPES
        if self.float_halves:
            self.layout, self.unsigned = LAYOUTS["N_2XF32"], ""
        elif self.halves:
            self.layout = LAYOUTS[HALVES[suffix[:-1]]]
            self.unsigned = "U" if suffix[-1] == "U" else ""
        else:
            match = re.fullmatch(rf"({alternatives(ELEMENT)})(U?)", suffix)
            if not match or not LAYOUTS[match[1]].types[match[2]]:
                raise Unknown(suffix)
            self.layout, self.unsigned = LAYOUTS[match[1]], match[2]
        self.suffix = suffix
        self.register = self.layout.types[self.unsigned]
        self.memory = HALF_TYPES.get(suffix, self.register)
        self.element = HALF_HOSTS.get(suffix) or self.layout.hosts[self.unsigned]
        self.element_bytes = self.layout.bits // 8 // (2 if self.halves else 1)

    def bits(self, lanes, width=1):
        """The layout of lanes that are copied. Numbers of memory that is as wide as the register are plain bits."""
        sign = "i" if self.halves and not self.unsigned else "u"
        return plain(sign, self.layout.bits // width, lanes)


def plain(sign, bits, lanes):
    """Lanes that are moved only: a float is its bits, 64 bits are one host integer, wider lanes are only ever moved."""
    return f"w{bits}x{lanes}" if bits > 64 else f"i64x{lanes}" if bits == 64 else f"{sign}{bits}x{lanes}"


def addressed(load, register, memory, mode, predicate=None):
    """The prototype of a load or store in one of the four modes."""
    tail = [const(predicate)] if predicate else []
    if load:
        if mode in ("I", "X"):
            return prototype(register, f"const {memory}*", "int", *tail)
        return prototype("void", f"{register}&", f"const {memory}**", "int", *tail)
    if mode in ("I", "X"):
        return prototype("void", const(register), f"const {memory}*", "int", *tail)
    return prototype("void", const(register), f"{memory}**", "int", *tail)


def access_shape(load, mode, suffix=""):
    return f"{'load' if load else 'store'}_{'I' if mode in ('I', 'X') else 'IP'}{suffix}"


def whole_vector(name, twins):
    """LV and SV: 64 bytes, or 32 for lanes that are half as wide in memory, at any address. Into wider lanes by sign
    (S) or with zeros (U); into narrower ones saturated (S) or cut (U)."""
    del twins
    match = re.fullmatch(r"([LS])V(\w+?)(T?)_(IP|XP|I|X)", name)
    if not match:
        raise Unknown(name)
    load, mode, predicated = match[1] == "L", match[4], bool(match[3])
    lanes = Lanes(match[2])
    if predicated and not lanes.layout.predicate:
        raise Unknown(name)
    return Expected(addressed(load, lanes.register, lanes.memory, mode, lanes.layout.predicate if predicated else None),
                    access_shape(load, mode, "_T" if predicated else ""), list(whole_kernels(load, predicated, lanes)))


def whole_kernels(load, predicated, lanes):
    layout = lanes.layout
    if lanes.float_halves:
        yield (("load_halves", "f16x16") if load else
               ("store_halves_where", "f32x16", "f16x16") if predicated else ("store_halves", "f32x16", "f16x16"))
    elif lanes.halves:
        memory, register = lanes.bits(layout.lanes, 2), lanes.bits(layout.lanes)
        if load:
            yield "extend", register, memory
        elif not lanes.unsigned:
            yield ("saturated_where" if predicated else "saturated"), memory, register
        else:
            yield ("store_where", memory, "SAME", register) if predicated else ("cut", memory, register)
    elif load:
        # 64-bit lanes have no predicated form and go as words.
        register = lanes.bits(layout.lanes) if layout.bits < 64 else "u32x16"
        yield "copy", register
    elif predicated:
        register = lanes.bits(layout.lanes)
        yield "store_where", register, "SAME", register
    else:
        # Whole registers are stored alike, whatever their lanes.
        yield "copy", "u16x32"


def element(name, twins):
    """LS, SS and LSR: one element from memory into a scalar, lane 0 into memory, one element into every lane.
    Elements of 16 to 128 bits are aligned: stores test the address, loads that move the pointer test the scalar that
    they write. Replicating loads test nothing."""
    del twins
    match = re.fullmatch(r"(LSR|LS|SS)(\w+?)_(IP|XP|I|X)", name)
    if not match:
        raise Unknown(name)
    operation, suffix, mode = match.groups()
    lanes = Lanes(suffix)
    if lanes.float_halves or operation == "LSR" and lanes.layout.kind == "w":
        raise Unknown(name)
    load = operation != "SS"
    layout = lanes.layout
    register = lanes.register if operation != "LS" else scalar_of(lanes)
    aligned = ""
    if operation == "SS" and 1 < lanes.element_bytes <= 16:
        aligned = "_aligned"
    if operation == "LS" and 1 < layout.bits // 8 <= 16 and mode in ("IP", "XP"):
        aligned = "_aligned_destination"
    return Expected(addressed(load, register, lanes.element, mode), access_shape(load, mode, aligned),
                    [element_kernel(operation, lanes)])


def scalar_of(lanes):
    layout = next(suffix for suffix, each in LAYOUTS.items() if each is lanes.layout)
    if layout in ELEMENTS:
        return LAYOUTS[ELEMENTS[layout]].types[lanes.unsigned]
    return {"N_8X128": "qv_int128", "N_16X256": "qv_int256"}[layout]


def element_kernel(operation, lanes):
    bits = lanes.layout.bits
    memory, scalar = lanes.bits(1, 2 if lanes.halves else 1), lanes.bits(1)
    if operation == "LSR":
        return "replicate", lanes.bits(lanes.layout.lanes), memory
    if operation == "LS":
        return "a", scalar, "SAME", memory
    saturated = lanes.halves and not lanes.unsigned
    return "a", memory, f"SATURATE{bits // 2}" if saturated else "SAME", scalar


def predicate_access(name, twins):
    """LB and SB: a predicate from and into memory. All but the plain load test the alignment of the address."""
    del twins
    match = re.fullmatch(r"([LS])B(2N|N_2|N)_(I|IP)", name)
    if not match:
        raise Unknown(name)
    load, mode = match[1] == "L", match[3]
    register, bits = PREDICATES[match[2]]
    whole = plain("u", bits, 1)
    return Expected(addressed(load, register, register, mode),
                    access_shape(load, mode, "" if load and mode == "I" else "_aligned"), [("a", whole, "SAME", whole)])


GATHERED = ["NX8U", "NX8S", "NX16", "NX16U", "NXF16", "N_2X32", "N_2X32U", "N_2XF32"]
OFFSETS = {16: ("qv_vecNx16U", "u16x32", "vboolN"), 32: ("qv_vecN_2x32Uv", "u32x16", "vboolN_2")}


def gather(name, twins):
    """GATHERA: elements at base + offset into the gather register; _V takes one int more, which says nothing. 8-bit
    elements take a 16-bit unit each, with zeros above, whatever their sign: GATHERD looks at it."""
    del twins
    match = re.fullmatch(rf"GATHERA({alternatives(GATHERED)})(T?)(_V|)", name)
    if not match:
        raise Unknown(name)
    suffix, predicated, variant = match.groups()
    lanes = Lanes(suffix)
    offsets, units, predicate = OFFSETS[lanes.layout.bits]
    operands = [f"const {lanes.element}*", const(offsets)] + ["int"] * bool(variant) + [const(predicate)] * bool(predicated)
    return Expected(prototype("qv_gsr", *operands), "gather" + variant + ("_T" if predicated else ""),
                    [("gather", units, str(8 * lanes.element_bytes))])


def gathered(name, twins):
    """GATHERD: the gather register as a vector: its 64 bytes, or the low byte of every unit (8-bit lanes by S, and
    2NX8, whose 64 lanes are filled from two gathers: _L the lower 32, _H the upper ones)."""
    del twins
    if name == "MOVGATHERD":
        return Expected(prototype("qv_vec2Nx8", "const qv_gsr&"), "gathered", [("gathered", "u16x32")])
    match = re.fullmatch(rf"GATHERD(?:({alternatives(GATHERED)})|2NX8(U?)_([LH]))", name)
    if not match:
        raise Unknown(name)
    suffix, unsigned, part = match.groups()
    if part:
        register = LAYOUTS["2NX8"].types[unsigned]
        if part == "H":
            return Expected(prototype("void", f"{register}&", "const qv_gsr&"), "gathered_part", [("gathered_high", "u8x32")])
        return Expected(prototype(register, "const qv_gsr&"), "gathered", [("gathered_low", "u8x32")])
    register = "qv_vecNx8" if suffix == "NX8S" else Lanes(suffix).register
    return Expected(prototype(register, "const qv_gsr&"), "gathered",
                    [("gathered", "u8x32" if suffix == "NX8S" else "u16x32")])


def scatter(name, twins):
    """SCATTER: lanes to base + offset, of 8-bit lanes the low byte of a 16-bit lane, or half of 64 lanes (_L, _H)."""
    del twins
    if name == "SCATTERW":
        return Expected(prototype("void"), "wait", [])
    match = re.fullmatch(rf"SCATTER(?:({alternatives(GATHERED)})(T?)|2NX8(U?)(T?)_([LH]))", name)
    if not match or match[1] == "NX8S":
        raise Unknown(name)
    suffix, part = match[1], match[5]
    predicated = match[2] or match[4]
    lanes = Lanes(suffix or "2NX8" + match[3])
    offsets, units, predicate = OFFSETS[lanes.layout.bits if suffix else 16]
    predicate = predicate if suffix else "vbool2N"
    operands = [const(lanes.register), f"const {lanes.element}*", const(offsets)] + [const(predicate)] * bool(predicated)
    data = units if suffix else "u8x32"
    return Expected(prototype("void", *operands), "scatter" + ("_T" if predicated else ""),
                    [("scatter_high" if part == "H" else "scatter", units, f"std::uint{8 * lanes.element_bytes}_t", data)])


def increment(name, twins):
    """SCATTERINC: adds 1 to the elements at base + offset."""
    del twins
    match = re.fullmatch(r"SCATTERINC(NX16U?|N_2X32U?)", name)
    if not match:
        raise Unknown(name)
    lanes = Lanes(match[1])
    offsets, units, _ = OFFSETS[lanes.layout.bits]
    return Expected(prototype("void", f"const {lanes.element}*", const(offsets)), "increment", [("increment", units)])


RULES = [whole_vector, element, predicate_access, gather, gathered, scatter, increment]
