"""Multiplies, widened sums and packs: what their names say.

A multiply's name is read letter by letter:

    MUL or SQR      products, or squares
    UU US SU        both factors unsigned, the first, the second; after SQR a lone U; else both signed
    P PD Q 4T       the sum of two products, their difference, the sum of four, four taps over a sliding window
    A S             added to the accumulator, subtracted from it; else the result is fresh
    H               times 2^16: the product's high part, where it belongs
    I               interleaved: even and odd lanes have factors of their own
    lanes           2NX8 NX16 N_2X32, the width of a scalar, or one of the mixed and coefficient layouts below
    _0 _1           the even, the odd lanes; of complex numbers the terms with the real, the imaginary part

MULUSPANX16: unsigned times signed (US), two products (P), added (A), 32 lanes of 16 bits. SGN and SGNS give the
second factor the sign of the first and stand alone.
"""

import re

from vocabulary import ACCUMULATORS, LAYOUTS, WIDE_TYPES, Expected, Unknown, const, prototype

NAME = re.compile(
    r"(?P<root>MUL|SQR)(?P<transfer>SGNS?|)(?P<signs>UU|US|SU|(?<=SQR)U|)(?P<window>4T|)(?P<products>PD|P|Q|)(?P<kind>A|S|)"
    r"(?P<high>H?)(?:"
    r"(?P<lanes>2NX8|NX16|N_2X32|8|16|32)(?P<types>U?)"
    r"|(?P<packed>NX16|16)(?P<packed_types>U?)PACK(?P<pack>[LQP])(?P<predicated>T?)"
    r"|N_2X16X32_(?P<parity>[01])"
    r"|(?P<bytes_and_halves>I2NX8X16)"
    r"|I2NR8(?P<channels>U?)X16"
    r"|(?P<vector>2N8|N16)(?P<words>[DQ]?)XR(?P<coefficient>8|16)"
    r"|(?P<complex>NX16|N_2X32)(?P<conjugate>[CJ])(?P<part>_[01]|)"
    r")")

FRESH, KINDS = "Fresh", {"": "Fresh", "A": "Added", "S": "Subtracted"}
COEFFICIENTS = "const qv_int32pr&"


class Multiply:
    """A name in its letters, and what most layouts derive from them."""

    def __init__(self, name):
        match = NAME.fullmatch(name)
        if not match:
            raise Unknown(name)
        self.__dict__.update(match.groupdict())
        self.name = name
        self.kind = KINDS[self.kind]
        self.square = self.root == "SQR"
        self.first = "u" if self.signs in ("UU", "US", "U") else "i"
        self.second = "u" if self.signs in ("UU", "SU", "U") else "i"
        self.count = {"": 1, "P": 2, "PD": 2, "Q": 4}[self.products] * (4 if self.window else 1)

    def result(self, register_type, operands, shape):
        """Prototype and shape: a fresh result is returned, an accumulator goes first and is read and written."""
        if self.kind == FRESH:
            return prototype(register_type, *operands), f"{shape}_w"
        return prototype("void", f"{register_type}&", *operands), f"acc_{shape}"

    def results(self, wide, lanes, first_bits, second_bits):
        """The layouts that a result may be written in: that of the accumulator, and where the sum cannot leave the
        accumulator's range, so that its lane need not be extended, the whole container of a lane."""
        own, container = f"i{wide}x{lanes}", f"i{32 if wide == 24 else 64}x{lanes}"
        largest = self.count * max(abs(a * b) for a in limits(self.first, first_bits) for b in limits(self.second, second_bits))
        fits = self.kind == FRESH and largest < 2 ** (wide - 1)
        return [own, container] if fits else [own]

    def kernels(self, results, *columns, form="by_lane"):
        return [(form, self.kind, result, *columns) for result in results]


def limits(sign, bits):
    return (0, 2**bits - 1) if sign == "u" else (-(2 ** (bits - 1)), 2 ** (bits - 1) - 1)


def wide_type(wide, lanes):
    return WIDE_TYPES[wide][lanes > 1]


def multiply(name, twins):
    """Reads the letters and hands on to the layout's rule."""
    m = Multiply(name)
    if m.lanes and not m.transfer:
        return products(m, twins)
    if m.lanes:
        return sign_transfer(m)
    if m.packed:
        return narrow(m)
    if m.parity:
        return halves_times_words(m)
    if m.bytes_and_halves:
        return bytes_times_halves(m)
    if m.channels is not None:
        return channels(m)
    return complex_product(m) if m.complex else coefficients(m)


def products(m, twins):
    """Lanes times lanes, into an accumulator of as many lanes. The declared types are signed where a twin with U
    behind the layout has the unsigned ones, else those that the letters read. US has U for its first factor only."""
    layout = LAYOUTS[m.lanes]
    has_twin = m.name + "U" in twins and not m.types
    read = ["U" if sign == "u" and not has_twin else "" for sign in (m.first, m.second)]
    types = [const(layout.types[unsigned]) for unsigned in read]
    if m.types and "u" not in (m.first, m.second):
        raise Unknown(m.name)
    wide = ACCUMULATORS[layout.bits]
    codes = [layout.code(m.first), layout.code(m.second)]
    if m.square:
        m.second, operands, columns, shape = m.first, types, codes, "ab"
        columns = [codes[0]] * 2
        rule = {"P": "SQUARES", "PD": "SQUARES_DIFFERENCE"}[m.products]
    else:
        rule = {"": "SINGLE", "P": "PAIR", "PD": "PAIR_DIFFERENCE"}[m.products]
        operands, columns = types * m.count, codes * m.count
        shape = "ab" if m.count == 1 else "abcd"
    results = m.results(wide, layout.lanes, layout.bits, layout.bits)
    # Single products of 8-bit and 16-bit lanes have instructions of their own.
    vectors = rule == "SINGLE" and m.lanes in ("2NX8", "NX16")
    kernels = m.kernels(results, *([] if vectors else [rule]), *columns, form="by_register" if vectors else "by_lane")
    return Expected(*m.result(wide_type(wide, layout.lanes), operands, shape), kernels)


def sign_transfer(m):
    """SGN: b where a is positive, -b where a is negative, 0 where it is 0, as narrow as they are. SGNS saturates -b."""
    layout = LAYOUTS[m.lanes]
    code, operand = layout.code("i"), const(layout.types[""])
    return Expected(prototype(layout.types[""], operand, operand), "ab_r", [("ab", code, m.transfer, code, code)])


def narrow(m):
    """PACK: the accumulator is as narrow as the factors: L keeps the low bits of the product, Q takes it as a Q15
    fraction, P as a Q10 one. U names unsigned types; the bits are the same."""
    layout = LAYOUTS[m.packed]
    register_type, code = layout.types[m.packed_types], layout.code("i")
    operands = [const(register_type)] * 2
    kernels = [("by_lane", m.kind, code, f"PACK{m.pack}", code, code)]
    if m.kind == FRESH:
        return Expected(prototype(register_type, *operands), "ab_r", kernels)
    if m.predicated:
        return Expected(prototype("void", f"{register_type}&", *operands, const(layout.predicate)), "acc_ab_T", kernels)
    return Expected(prototype("void", f"{register_type}&", *operands), "acc_ab", kernels)


def halves_times_words(m):
    """16-bit lane 2k (_0) or 2k + 1 (_1) times 32-bit lane k. The halves are cut out of words by the rule."""
    halves, words = LAYOUTS["NX16"], LAYOUTS["N_2X32"]
    place = {"0": "EVEN", "1": "ODD_HIGH" if m.high else "ODD"}[m.parity]
    half = "std::uint16_t" if m.first == "u" else "std::int16_t"
    types = [const(halves.types["U" if m.first == "u" else ""]), const(words.types["U" if m.second == "u" else ""])]
    return Expected(*m.result("qv_vecN_2x64w", types, "ab"),
                    [("by_lane", m.kind, "i64x16", f"{place}<{half}>", "u32x16", words.code(m.second))])


def bytes_times_halves(m):
    """8-bit lane 2k times lane k of the second vector, 2k + 1 times lane k of the third. US reads the bytes unsigned."""
    byte = "std::uint8_t" if m.first == "u" else "std::int8_t"
    types = [const(LAYOUTS["2NX8"].types["U" if m.first == "u" else ""]), *["const qv_vecNx16&"] * 2]
    return Expected(*m.result("qv_vec2Nx24", types, "abc"),
                    m.kernels(m.results(24, 64, 8, 16), f"INTERLEAVED<{byte}>", "u16x32", "i16x32", "i16x32"))


def channels(m):
    """Two channels of 16-bit lanes times 8-bit coefficients of one word, into interleaved lanes of 24 bits. US reads
    the vectors as unsigned, 8U the coefficients."""
    if m.channels:
        m.second = "u"
    elif m.signs == "US":
        m.second = "i"
    vectors = 2 * m.count
    types = [const(LAYOUTS["NX16"].types["U" if m.first == "u" else ""])] * vectors
    rule = "CHANNEL" if m.count == 1 else "CHANNEL_PAIR"
    kernels = m.kernels(m.results(24, 64, 16, 8), rule, str(vectors), LAYOUTS["NX16"].code(m.first),
                        f"{'u' if m.second == 'u' else 's'}8", form="channels")
    return Expected(*m.result("qv_vec2Nx24", [*types, COEFFICIENTS], {2: "abs", 4: "abcds"}[vectors]), kernels)


def coefficients(m):
    """Vectors times the coefficients of words, XR8 four of 8 bits or XR16 two of 16. D has a word each for even and
    odd lanes, Q before X one for every fourth lane. UU and US read the vectors as unsigned, UU and SU the words; all three declare the
    vectors unsigned."""
    layout = LAYOUTS[{"2N8": "2NX8", "N16": "NX16"}[m.vector]]
    words = {"": 1, "D": 2, "Q": 4}[m.words]
    vectors = 2 if m.window else m.count
    coefficient = f"{'u' if m.second == 'u' else 's'}{m.coefficient}" + (f"_in_{words}" if words > 1 else "")
    wide = ACCUMULATORS[layout.bits]
    results = m.results(wide, layout.lanes, layout.bits, int(m.coefficient))
    if m.window:
        kernels = m.kernels(results, layout.code(m.first), coefficient, form="window")
    else:
        kernels = m.kernels(results, str(m.count), layout.code(m.first), coefficient, form="taps")
    types = [const(layout.types["U" if m.signs else ""])] * vectors + [COEFFICIENTS] * words
    return Expected(*m.result(wide_type(wide, layout.lanes), types, "abcd"[:vectors] + "stuv"[:words]), kernels)


def complex_product(m):
    """Pairs of lanes are complex numbers, the real part first; J conjugates the second factor. _0 and _1 are the two
    halves of the product. A number is read whole: 32 or 64 bits."""
    layout = LAYOUTS[m.complex]
    rule = {"_0": "REAL", "_1": "IMAGINARY", "": {"C": "COMPLEX", "J": "CONJUGATE"}[m.conjugate]}[m.part]
    wide = ACCUMULATORS[layout.bits]
    m.count = 2
    number = f"u{2 * layout.bits}x{layout.lanes // 2}"
    kernels = m.kernels(m.results(wide, layout.lanes, layout.bits, layout.bits), rule, number, number)
    return Expected(*m.result(wide_type(wide, layout.lanes), [const(layout.types[""])] * 2, "ab"), kernels)


def widened(name, twins):
    """ADDW, SUBW: lanes added or subtracted, both unsigned with U, in the accumulator's lanes. A and S as of products."""
    del twins
    match = re.fullmatch(r"(ADD|SUB)W(U?)([AS]?)(2NX8|NX16)", name)
    if not match:
        raise Unknown(name)
    operation, unsigned, kind, lanes = match.groups()
    layout, kind = LAYOUTS[lanes], KINDS[kind]
    wide, code = ACCUMULATORS[layout.bits], layout.code("u" if unsigned else "i")
    # A fresh sum is in range and fills the whole container of a lane.
    result = f"i{(32 if wide == 24 else 64) if kind == FRESH else wide}x{layout.lanes}"
    register_type, operands = wide_type(wide, layout.lanes), [const(layout.types[unsigned])] * 2
    kernels = [("by_lane", kind, result, {"ADD": "SUM", "SUB": "DIFFERENCE"}[operation], code, code)]
    if kind == FRESH:
        return Expected(prototype(register_type, *operands), "ab_w", kernels)
    return Expected(prototype("void", f"{register_type}&", *operands), "acc_ab", kernels)


PACK = re.compile(r"PACK(?P<how>L|M|H|Q|P|VRNR|VR|VNR|V)(?P<unsigned>U?)(?P<wide>2NX24|NX48|N_2X64W|N_2X96)(?P<parity>_[01]|)")
FIXED = {"L": "LOW", "M": "MIDDLE", "H": "HIGH", "Q": "Q15", "P": "Q10"}
# Accumulator type, result of all lanes and of every other one, the containers that a rule reads.
PACKED = {"2NX24": ("qv_vec2Nx24", "2NX8", "NX16", "u32x64"), "NX48": ("qv_vecNx48", "NX16", "N_2X32", "u64x32"),
          "N_2X64W": ("qv_vecN_2x64w", "N_2X32", None, "i64x16"), "N_2X96": ("qv_vecN_2x64w", "N_2X32", None, "i64x16")}


def pack(name, twins):
    """Accumulator lanes to narrow ones: the low bits (L), bits 16 up (M), the high bits (H), Q15 and Q10 fractions
    (Q, P); shifted by one count for all lanes (VR) or a count each (V), with rounding, with NR without, and saturated,
    with U to unsigned lanes. _0 and _1 take the even, the odd lanes into lanes twice as wide."""
    del twins
    match = PACK.fullmatch(name)
    if not match:
        raise Unknown(name)
    how, unsigned, wide, parity = match.groups()
    source, whole, alternate, containers = PACKED[wide]
    layout = LAYOUTS[alternate if parity else whole]
    result = layout.types[unsigned]
    if how in FIXED:
        if parity:
            kernel = ("fixed", layout.code("i"), f"{FIXED[how]}8", f"EveryOther<{parity[1]}>")
        else:
            kernel = ("fixed", layout.code("i"), FIXED[how], f"All<{containers}>")
        return Expected(prototype(result, const(source)), "w_r", [kernel])
    rounding = "Truncated" if how.endswith("NR") else "Rounded"
    code = layout.code("u" if unsigned else "i")
    if how.startswith("VR"):
        # Plain rounding packs of 24 and 48 bits declare their count signed; it is read as unsigned all the same.
        count = "int" if how == "VR" and wide in ("2NX24", "NX48") and not parity else "unsigned int"
        return Expected(prototype(result, const(source), count), "w_r_shift",
                        [shifted("shift", code, wide, rounding, parity)])
    return Expected(prototype(result, const(source), const(layout.types[""])), "w_r_counts",
                    [shifted("counts", code, wide, rounding, parity, layout.code("u"))])


def shifted(form, code, wide, rounding, parity, *counts):
    """The semantic function of a shifting pack: which lanes of which accumulator, and the largest count."""
    if wide == "NX48" and not parity:
        return f"{form}48", rounding
    if wide == "2NX24" and parity and form == "shift":
        return "shift_every_other24", code, rounding, parity[1]
    if wide == "2NX24":
        return form, code, "Words24", rounding, f"EveryOther24<{parity[1]}>" if parity else "All24", "23", *counts
    lanes = f"EveryOther48<{parity[1]}>" if parity else "AllLanes<64>"
    return form, code, "WordsOfPairs", rounding, lanes, "32", *counts


RULES = [multiply, widened, pack]
