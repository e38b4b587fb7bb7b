"""The rule of one intrinsic in words of its own, from its row.

A sentence of the tables serves all rows below it, signed and unsigned, loads in all modes. Here the parts that tell them
apart are replaced by what holds for the one, and what its shape says is added: that lanes are loaded, where the address
is, that the pointer moves, what becomes of disabled lanes.

    rules.own(row, types)    the rule of a row of read_tables
"""

import re

import read_tables

SIGNS = [(r"^MULUU", "both factors are unsigned"), (r"^MULUS", "the first factor is unsigned, the second signed"),
         ("", "the factors are signed")]
MIXED_SIGNS = [(r"^MULUU", "both factors are unsigned"), (r"^MULUS", "the 16-bit factor is unsigned, the 32-bit one signed"),
               (r"^MULSU", "the 16-bit factor is signed, the 32-bit one unsigned"), ("", "both factors are signed")]
COEFFICIENT_SIGNS = [(r"^MULUU", "vectors and coefficients are unsigned"),
                     (r"^MULUS", "vectors are unsigned, coefficients signed"),
                     (r"^MULSU", "vectors are signed, coefficients unsigned"), ("", "vectors and coefficients are signed")]
EXTENDED = [(r"^\w+(NX8|N_2X16)S", "sign-extended"), ("", "zero-extended")]

# A part of a sentence that speaks of several forms -> what it says of each: the first pattern that the name has.
OWN_PARTS = [(re.compile(part), forms) for part, forms in [
    # Multiplies
    (r"UU forms read both factors(?: of a product)? as unsigned, US forms the first$", SIGNS),
    (r"UU forms read both factors as unsigned, US forms the 16-bit one, SU forms the 32-bit one", MIXED_SIGNS),
    (r"vectors and coefficients are signed, (?:UU forms read both as unsigned, )?US forms the vectors(?: as unsigned|, SU forms the "
     r"coefficients)", COEFFICIENT_SIGNS),
    (r"U forms read (?:both|a and b) as unsigned", [(r"^(ADD|SUB)WU", "a and b are unsigned"), ("", "a and b are signed")]),
    (r"SQRU forms read the lanes as unsigned", [(r"^SQRU", "the lanes are unsigned"), ("", "the lanes are signed")]),
    (r"US forms read a as unsigned", [(r"^MULUS", "a is unsigned"), ("", "a is signed")]),
    (r"23 (?:for 24-bit lanes, 32 for others|\(24-bit lanes\) or 32 \(others\))", [(r"2NX24", "23"), ("", "32")]),
    (r"clamped to the range of the lane(?= *$)|clamped to the signed range of the result's lane, in U forms to the unsigned one",
     [(r"^PACK\w*U2NX", "clamped to the unsigned range of the result's lane"),
     ("", "clamped to the signed range of the result's lane")]),
    # Memory
    (r"sign-extended \(\.\.S\) or zero-extended \(\.\.U\)", EXTENDED),
    (r"(?<=at the address, )extended,", [(r"^LV\w+S", "sign-extended,"), ("", "zero-extended,")]),
    (r"lane i saturated to half its width \(\.\.S\) or its low half \(\.\.U\)",
     [(r"^SV(NX8|N_2X16)S", "lane i saturated to half its width"), ("", "the low half of lane i")]),
    (r"\. SSNX8S saturates it to 8 bits, SSNX8U writes its low byte",
     [(r"^SSNX8S", ". It is saturated to 8 bits"), (r"^SSNX8U", ". Its low byte is written"), ("", "")]),
    (r"\. SSN_2X16S saturates it to 16 bits, SSN_2X16U writes its low half",
     [(r"^SSN_2X16S", ". It is saturated to 16 bits"), (r"^SSN_2X16U", ". Its low half is written"), ("", "")]),
    (r"\. NX8S and N_2X16S sign-extend it, NX8U and N_2X16U zero-extend it",
     [(r"^LSR(NX8|N_2X16)S", ". It is sign-extended"), (r"^LSR(NX8|N_2X16)U", ". It is zero-extended"), ("", "")]),
    (r"The post-increment modes demand of the destination object, not of the element, that it be aligned(, or the program ends)?: to 2 "
     r"bytes where it is made of 16-bit units, else to 4",
     [(r"^LSNX(16|F16)U?_.P", r"The destination object, not the element, must be aligned to 2 bytes, or the program ends"),
      (r"_.P$", r"The destination object, not the element, must be aligned to 4 bytes, or the program ends"), ("", "")]),
    (r"The post-increment modes demand that the destination object be aligned(, or the program ends)?, as above",
     [(r"^LSNX8._.P", r"The destination object, not the element, must be aligned to 2 bytes, or the program ends"),
      (r"_.P$", r"The destination object, not the element, must be aligned to 4 bytes, or the program ends"), ("", "")]),
    (r"must be aligned(, or the program ends)?: to 2 bytes for 16-bit elements, else to 4",
     [(r"^SSNX(16|F16)|^SSN_2X16", "must be aligned to 2 bytes, or the program ends"),
      ("", "must be aligned to 4 bytes, or the program ends")]),
    (r": any address with an offset; with post-increment one aligned to 4 bytes, of LBN_2 to 2(, or the program ends)?",
     [(r"^LBN_2_IP", ", which must be aligned to 2 bytes, or the program ends"),
      (r"_IP$", ", which must be aligned to 4 bytes, or the program ends"), ("", ", which may be any")]),
    (r"must be aligned to 4 bytes, of SBN_2 to 2(, or the program ends)?",
     [(r"^SBN_2_", "must be aligned to 2 bytes, or the program ends"), ("", "must be aligned to 4 bytes, or the program ends")]),
    (r"; 0 and nothing read where predicate bit i is 0",
     [(r"T(_V)?$", "; 0 and nothing read where predicate bit i is 0"), ("", "")]),
    (r"\. The int of the _V forms is ignored", [(r"_V$", ". The last int is ignored"), ("", "")]),
    (r", of SCATTERNX8U its low byte,", [(r"^SCATTERNX8U", "'s low byte"), ("", "")]),
    (r"\. The byte after an 8-bit element is read too",
     [(r"^SCATTERNX8U", ". The byte after each element is read too"), ("", "")]),
    (r"lane i \(_L\) or lane 32 \+ i \(_H\)", [(r"_H$", "lane 32 + i"), ("", "lane i")]),
    (r", of the T forms where the lane's predicate bit is 1", [(r"T_[LH]$", ", where the lane's predicate bit is 1"), ("", "")]),
    # Moves: the mode is told from the shape.
    (r"a copy of the whole register: _loadi.*", [(r"_load", "the whole register"), (r"_store", "writes the whole register"),
                                                 ("", "a copy of the whole register")]),
    (r"; the address of a host scalar is rounded down to its size",
     [(r"^(u?int(16|32)|float)_mtor|_rtom_(u?int(16|32)|float)$", "; the address is rounded down to its size"), ("", "")]),
    (r"lane 0 where memory holds one element, else all lanes",
     [(r"_rtom_(u?int\d+|float|rkfloat|qv_u?int\w+|qv_f16)$", "lane 0"), ("", "all lanes")]),
    (r"; a narrower signed type in memory saturates, a narrower unsigned one keeps the low bits, and so do the images of the accumulators",
     [(r"_rtom_(uint\d+|qv_\w+U)$", "; where it is narrower, the low bits"),
      (r"_rtom_(int\d+|qv_int\w+|qv_vecNx8|qv_vecN_2x16)$", "; where it is narrower, saturated"),
      (r"_rtom_\w*(w|Nx32U?)$", "; the low bits"), ("", "")]),
    # Floats
    (r"half lane 2i \(_0\) or 2i \+ 1 \(_1\)", [(r"_0$", "half lane 2i"), ("", "half lane 2i + 1")]),
    (r"^a \+ b, a - b, a \* b,", [(r"ADD", "a + b,"), (r"SUB", "a - b,"), ("", "a * b,")]),
    (r"acc \+ a \* b \(MADD\), acc - a \* b \(MSUB\), rounded once; MADDN and MSUBN to nearest whatever RoundMode says",
     [(r"MADD_", "acc = acc + a * b, rounded once, by RoundMode"), (r"MSUB_", "acc = acc - a * b, rounded once, by RoundMode"),
      (r"MADDN_", "acc = acc + a * b, rounded once, to nearest whatever RoundMode says"),
      (r"MSUBN_", "acc = acc - a * b, rounded once, to nearest whatever RoundMode says")]),
    (r"the sign cleared, the sign turned: bits only",
     [(r"ABS", "a with its sign cleared: bits only"), ("", "a with its sign turned: bits only")]),
    (r"the smaller, the larger of a and b", [(r"MIN", "the smaller of a and b"), ("", "the larger of a and b")]),
    (r"as MIN and MAX, but a number wins over a NaN",
     [(r"MIN", "the smaller of a and b; -0 is below +0, a number wins over a NaN"),
      ("", "the larger of a and b; -0 is below +0, a number wins over a NaN")]),
    (r"a rounded to an integer: FIROUND .*? alone in raising inexact",
     [(r"FIROUND", "a rounded to the nearest integer, ties away from zero"), (r"FICEIL", "a rounded up to an integer"),
      (r"FIFLOOR", "a rounded down to an integer"), (r"FITRUNC", "a rounded toward zero to an integer"),
      (r"FIRINT", "a rounded to an integer by RoundMode; raises inexact, which the like do not")]),
    (r"\+-m \(NEXP0\), \+-m or, for an odd e, \+-2m \(NEXP01\)", [(r"NEXP0_", "+-m"), ("", "+-m or, for an odd e, +-2m")]),
    (r"e of a less e of b, clamped to the exponents of normal numbers \(MKDADJ\); half the e of a, rounded down \(MKSADJ\)",
     [(r"MKDADJ", "e of a less e of b, clamped to the exponents of normal numbers"), ("", "half the e of a, rounded down")]),
    (r"toward zero and without flags \(ADDEXP\), rounded by RoundMode with flags \(ADDEXPM\)",
     [(r"ADDEXP_", "toward zero and without flags"), ("", "rounded by RoundMode with flags")]),
    (r"^a; r = a where the boolean is true .*",
     [(r"MOVT", "r = a where the boolean is true, else as it was"), (r"MOVF", "r = a where the boolean is false, else as it was"),
      (r"MOVEQZ", "r = a where the integer is 0, else as it was"),
      (r"MOVNEZ", "r = a where the integer is not 0, else as it was"),
      (r"MOVGEZ", "r = a where the integer is at least 0, else as it was"),
      (r"MOVLTZ", "r = a where the integer is below 0, else as it was"),
      ("", "a")]),
    (r"the bits of a number, a number of the bits; a half is the low 16",
     [(r"RFR_H", "the bits of a, in the low 16"), (r"RFR", "the bits of a"), (r"WFR_H", "the number whose bits are the low 16"),
      ("", "the number of the bits")]),
    (r"otherwise as TRUNC and UTRUNC", [(r"UTRUNC", "otherwise as UTRUNC"), ("", "otherwise as TRUNC")]),
    # The scalar core
    (r"set, cleared$", [(r"SETB", "set"), ("", "cleared")]),
    (r"n a ([+-]) b, modulo 2\^32, for n = 2, 4, 8", [(rf"X{n}", rf"{n} a \1 b, modulo 2^32") for n in "248"]),
    (r"-a, and the magnitude of a; both wrap: ", [(r"NEG", "-a, which wraps: "), ("", "the magnitude of a, which wraps: ")]),
    (r"of unsigned factors \(U\) and of signed ones \(S\)", [(r"MULUH", "of unsigned factors"), ("", "of signed factors")]),
    (r"read as signed \(S\) and as unsigned \(U\)", [(r"16S", "read as signed"), ("", "read as unsigned")]),
    (r"bitwise and, or, exclusive or(?! of)",
     [(r"_AND", "a and b, bit by bit"), (r"_OR", "a or b, bit by bit"), ("", "a exclusive or b, bit by bit")]),
    (r"the bitwise and, or, exclusive or of",
     [(r"_AND", "the bitwise and of"), (r"_OR", "the bitwise or of"), ("", "the bitwise exclusive or of")]),
    (r"the bitwise and, or of", [(r"_AND", "the bitwise and of"), ("", "the bitwise or of")]),
    (r"; SALTU compares as unsigned", [(r"U$", ", compared as unsigned"), ("", ", compared as signed")]),
    (r"the smaller and the larger of a and b; MINU and MAXU compare as unsigned",
     [(r"MINU", "the smaller of a and b, compared as unsigned"), (r"MAXU", "the larger of a and b, compared as unsigned"),
      (r"MIN", "the smaller of a and b, compared as signed"), ("", "the larger of a and b, compared as signed")]),
    (r"t == 0, t != 0, t < 0, t >= 0", [(r"EQZ", "t == 0"), (r"NEZ", "t != 0"), (r"LTZ", "t < 0"), ("", "t >= 0")]),
    (r"is not 0 \(MOVT\), when it is 0 \(MOVF\)", [(r"MOVT", "is not 0"), ("", "is 0")]),
    (r"all 4 or 8 bits", [(r"4", "all 4 bits"), ("", "all 8 bits")]),
    (r"quotient toward zero and remainder, which has the dividend's sign; a divisor of 0, and -2\^31 by -1 in the signed forms, raise",
     [(r"QUOU", "the quotient; a divisor of 0 raises"), (r"REMU", "the remainder; a divisor of 0 raises"),
      (r"QUOS", "the quotient, toward zero; a divisor of 0, and -2^31 by -1, raise"),
      (r"REMS", "the remainder, which has the dividend's sign; a divisor of 0, and -2^31 by -1, raise")]),
    (r"SAR = 8 s mod 32, and 32 less that: byte positions of unaligned data, little-endian and big-endian",
     [(r"8L", "SAR = 8 s mod 32: the byte position of unaligned data, little-endian"),
      ("", "SAR = 32 - 8 s mod 32: the byte position of unaligned data, big-endian")]),
    (r"arithmetically \(SRAI?\), logically \(SRLI?\)", [(r"SRA", "arithmetically"), ("", "logically")]),
    (r"zero-extended \(L16UI\), sign-extended \(L16SI\)", [(r"UI", "zero-extended"), ("", "sign-extended")]),
]]


def of_its_form(text, name):
    """The sentence with the parts that speak of several forms replaced by what holds for this name."""
    for part, forms in OWN_PARTS:
        match = part.search(text)
        said = match and next((said for pattern, said in forms if re.search(pattern, name)), None)
        if said is not None:
            text = text[:match.start()] + match.expand(said) + text[match.end():]
    return text


def register_types(row, types):
    """The register types of a prototype, the result first."""
    return [types[name] for name in re.findall(rf"{read_tables.PREFIX}(\w+)", row.prototype) if name in types]


def in_numbers(text, row, types):
    """w, the bits of a lane, the number of lanes and the accumulator's width as numbers."""
    registers = register_types(row, types)
    text = text.replace("the number of lanes", str(max((t.lanes[2] for t in registers), default=0)))
    lanes = next((t.lanes[1] for t in registers if t.lanes[0] in "iuf"), None)
    if lanes:
        text = re.sub(r"\bw\b(?! \+)", str(lanes), text)
    return re.sub(r"2\^24, 2\^48 or 2\^64|2\^24 or 2\^48|2\^48 or 2\^64", f"2^{lanes}", text)


def float_conversion(text, name):
    """A conversion that rounds: to a float by the mode, to an integer toward zero."""
    if "to an integer truncated" not in text:
        return text
    target = name.rpartition("_rtor_")[2]
    if re.search(r"f16|f32|float", target):
        return "the source's value as a number of the target's format, rounded by RoundMode, with flags"
    return "the source's value truncated toward zero and saturated to the target, with flags"


def conversion(text, row, types):
    """A conversion between registers of bits: by the number and width of the lanes."""
    if not text.startswith("the register's lanes from the source"):
        return text
    source, target = re.search(r"(\w+?)_rtor_(\w+)", read_tables.short_name(row.name)).groups()
    (from_kind, from_bits, from_lanes), (to_kind, to_bits, to_lanes) = (lanes_of(name, types) for name in (source, target))
    if not from_bits:  # packed lanes have no width of their own
        return f"lane i = bits {to_bits} i to {to_bits} i + {to_bits - 1} of the source, sign-extended"
    if not to_bits:
        return f"lane i of the source in bits {from_bits} i to {from_bits} i + {from_bits - 1}, without gaps"
    which = ("lane i = lane i of the source" if from_lanes == to_lanes > 1 else "the source" if to_lanes == 1 == from_lanes
             else f"every {'bit' if to_kind == 'b' else 'lane'} = the source" if from_lanes == 1 else "lane 0 of the source")
    if to_bits < from_bits:
        return f"{which}, its low {to_bits} bits" if to_bits > 1 else f"{which}, its lowest bit"
    return which + ("" if to_bits == from_bits else ", sign-extended" if from_kind == "i" else ", zero-extended")


def lanes_of(name, types):
    """Kind, bits and number of the lanes of a register type or of a host scalar."""
    if name in types:
        kind, bits, lanes = re.fullmatch(r"([iufwb])(\d+)x(\d+)|.*", types[name].layout).groups(default="0")
        return kind, int(bits), int(lanes)
    match = re.fullmatch(r"(u?)int(\d+)", name)
    return ("u" if match[1] else "i", int(match[2]), 1) if match else ("f", 32, 1) if name == "float" else ("u", 1, 1)


def loading(text, shape):
    """A load says so."""
    if not re.match(r"load|mtor", shape) or re.match(r"loads?\b", text):
        return text
    return "loads " + text if text.startswith("the ") else "loads: " + text


def address(row):
    if re.match(r"(load|store)_IP", row.shape):
        return "The address is the pointer, which then moves by increment bytes"
    if re.match(r"(load|store)_I", row.shape):
        return "The address is base + offset bytes"
    return None


def disabled(row, text):
    """What becomes of the lanes whose predicate bit is 0, where the sentence does not say it."""
    if not read_tables.keeps_lanes(row) or "predicate bit" in text:
        return None
    written = re.search(r"& ?(\w+)", row.prototype)[1]
    flags = " and raises no flag" if row.table.startswith("float/") else ""
    return f"Where predicate bit i is 0, {written} keeps lane i{flags}"


def own(row, types, sentence=None):
    """The rule of a row; or another sentence of its table as it holds for this row."""
    name = re.sub(r"^ZRA_", "", read_tables.short_name(row.name))
    text = in_numbers(of_its_form(sentence or row.doc, name), row, types)
    text = conversion(float_conversion(text, name), row, types)
    if sentence:
        return text
    parts = [loading(text, row.shape), address(row), disabled(row, text)]
    return re.sub(r"\.(\s*\.)+", ".", ". ".join(part.strip().rstrip(".") for part in parts if part))
