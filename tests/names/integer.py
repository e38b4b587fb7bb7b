"""Integer vectors: what their names say.

A name is an operation, a lane layout or the width of a scalar, U where the declared types are unsigned, T where
the operation works under a predicate: SUBSNX16T subtracts (SUB), saturates (S), on 32 lanes of 16 bits (NX16), in
the lanes whose predicate bit is 1 (T).

U within the operation reads the lanes as unsigned (LTUNX16); U behind the layout only names the types (ADDNX16U).
"""

import re

from vocabulary import ELEMENTS, LAYOUTS, PREDICATES, Expected, Unknown, alternatives, const, prototype

VECTORS_AND_SCALARS = ["2NX8", "NX16", "N_2X32", "N_4X64", "8", "16", "32", "64"]

# Operations on lanes: how many operands, and how their lanes are read: as signed ones, as bits (unsigned), or as
# unsigned ones where the name has U behind the operation.
SIGNED, BITS, BY_NAME = "signed", "bits", "U in the name"
LANE_BY_LANE = {
    **dict.fromkeys(["ADD", "SUB", "ADDS", "SUBS", "ABSSSUB"], (2, SIGNED)),
    **dict.fromkeys(["NEG", "NEGS", "ABS", "ABSS", "NSA"], (1, SIGNED)),
    **dict.fromkeys(["MIN", "MAX", "AVG", "AVGR", "ABSSUB"], (2, BY_NAME)),
    **dict.fromkeys(["AND", "OR", "XOR", "SLL", "SRL", "ROTR"], (2, BITS)),
    **dict.fromkeys(["NOT", "NSAU"], (1, BITS)),
    **dict.fromkeys(["SRA", "SLS"], (2, SIGNED)),
}
FORMS = {1: ("unary", "a_r"), 2: ("binary", "ab_r")}

# Whole vectors of bits are all alike: one function on words serves every layout.
ON_WORDS = ["AND", "OR", "XOR", "NOT"]

# Shifts and rotations by an immediate: the operation with I. Saturating shifts count lane by lane, all others whole
# words at a time. Left shifts and the bits of rotations have no sign; what a right shift fills with is its name.
IMMEDIATE = {**dict.fromkeys(["SLL", "SRL", "SRA", "ROTR"], "packed"), "SLS": "counted"}

RELATIONS = ["EQ", "NEQ", "LT", "LE", "GT", "GE"]

PREDICATE_LOGIC = {"AND": "ab_r", "OR": "ab_r", "XOR": "ab_r", "ANDNOT": "ab_r", "ORNOT": "ab_r", "NOT": "a_r"}
# Predicates as plain bits: 64 of them are two words.
PREDICATE_BITS = {"2N": "u32x2", "N": "u32x1", "N_2": "u16x1"}


def split(name, operations, layouts=None):
    """Operation, layout, U and T of a name."""
    match = re.fullmatch(rf"({alternatives(operations)})({alternatives(layouts or VECTORS_AND_SCALARS)})(U?)(T?)", name)
    if not match:
        raise Unknown(name)
    return match.groups()


def in_lanes(kind, result, operands, layout, predicated):
    """Prototype and shape; the predicated form has the destination in front and the predicate behind."""
    if predicated:
        return prototype("void", f"{result}&", *operands, const(layout.predicate)), kind + "_T"
    return prototype(result, *operands), kind


def lane_by_lane(name, twins):
    del twins
    unsigned_names = [o + "U" for o, (_, read) in LANE_BY_LANE.items() if read == BY_NAME]
    operation, suffix, unsigned, predicated = split(name, [*LANE_BY_LANE, *unsigned_names])
    layout = LAYOUTS[suffix]
    rule = operation[:-1] if operation in unsigned_names else operation
    arity, read = LANE_BY_LANE[rule]
    sign = "u" if read == BITS or operation in unsigned_names else "i"
    lanes = "u32x16" if rule in ON_WORDS and layout.lanes > 1 else layout.code(sign)
    form, shape = FORMS[arity]
    register_type = layout.types[unsigned]
    return Expected(*in_lanes(shape, register_type, [const(register_type)] * arity, layout, predicated),
                    [(form, rule, lanes)])


def immediate_shift(name, twins):
    del twins
    operation, suffix, unsigned, _ = split(name, [o + "I" for o in IMMEDIATE])
    layout = LAYOUTS[suffix]
    register_type = layout.types[unsigned]
    return Expected(prototype(register_type, const(register_type), "immediate"), "a_i_r",
                    [(IMMEDIATE[operation[:-1]], operation, layout.code("i"))])


def comparison(name, twins):
    """Bit i of the predicate is the relation between lanes i; U compares unsigned numbers."""
    del twins
    operation, suffix, unsigned, _ = split(name, [r + u for r in RELATIONS for u in ("", "U")])
    layout = LAYOUTS[suffix]
    relation = operation.removesuffix("U")
    operand = const(layout.types[unsigned])
    return Expected(prototype(layout.predicate, operand, operand), "ab_p",
                    [("ab_bits", relation, layout.code("u" if operation != relation else "i"))])


def replication(name, twins):
    """REP: lane `immediate` in every lane."""
    del twins
    _, suffix, unsigned, predicated = split(name, ["REP"])
    layout = LAYOUTS[suffix]
    register_type = layout.types[unsigned]
    return Expected(*in_lanes("a_i_r", register_type, [const(register_type), "immediate"], layout, predicated),
                    [("replicate", layout.code("i"))])


OTHER_ZEROS = {"NX8S": "qv_vecNx8", "NX8U": "qv_vecNx8U", "N_2X16S": "qv_vecN_2x16", "N_2X16U": "qv_vecN_2x16U",
               "2NX24": "qv_vec2Nx24", "NX48": "qv_vecNx48", "N_2X64W": "qv_vecN_2x64w"}


def zero(name, twins):
    """ZERO: the register with every bit 0; of halves (NX8S) the half-width one, of accumulators (NX48) the wide one."""
    del twins
    suffix = name.removeprefix("ZERO")
    if suffix in OTHER_ZEROS:
        register_type = OTHER_ZEROS[suffix]
    else:
        _, layout, unsigned, _ = split(name, ["ZERO"], LAYOUTS)
        register_type = LAYOUTS[layout].types[unsigned]
    return Expected(prototype(register_type), "value_r", [("filled", "0")])


def predicate_logic(name, twins):
    """ANDB2N, NOTBN_2: bit by bit. Without lanes (ANDB) on booleans of the scalar core, with 1 on a vbool1."""
    del twins
    match = re.fullmatch(rf"({alternatives(PREDICATE_LOGIC)})B({alternatives(PREDICATES)}|)", name)
    if not match:
        raise Unknown(name)
    operation, lanes = match.groups()
    shape = PREDICATE_LOGIC[operation]
    register_type = PREDICATES[lanes][0] if lanes else "rkbool"
    operands = [const(register_type)] * (2 if shape == "ab_r" else 1)
    return Expected(prototype(register_type, *operands), shape,
                    [("binary" if shape == "ab_r" else "unary", operation, PREDICATE_BITS.get(lanes, "u1x1"))])


def predicate_reduction(name, twins):
    """RANDB: are all bits 1? RORB: is any?"""
    del twins
    match = re.fullmatch(r"R(AND|OR)B(2N|N_2|N)", name)
    if not match:
        raise Unknown(name)
    rule = {"AND": "ALL", "OR": "ANY"}[match[1]]
    return Expected(prototype("vbool1", const(PREDICATES[match[2]][0])), "reduce",
                    [("whole", rule, PREDICATE_BITS[match[2]])])


def first_lanes(name, twins):
    """LTR: the first n lanes; n modulo the number of lanes, with S clamped to it. I has n as an immediate."""
    del twins
    match = re.fullmatch(r"LTR(S?)(2N|N_2|N)(I?)", name)
    if not match:
        raise Unknown(name)
    saturating, lanes, by_immediate = match.groups()
    register_type, count = PREDICATES[lanes]
    return Expected(prototype(register_type, "immediate" if by_immediate else "int"), "n_p",
                    [("first", "CLAMPED" if saturating else "MODULO", f"b1x{count}")])


def sum_of_lanes(name, twins):
    """RADD: the sum of all lanes. Lanes of 8 and 16 bits have exact sums, twice as wide; 32-bit lanes wrap. S clamps
    to the lane, U before the layout reads the lanes as unsigned; its types are then unsigned too."""
    del twins
    operation, suffix, unsigned, predicated = split(name, ["RADD", "RADDU", "RADDS"])
    layout = LAYOUTS[suffix]
    unsigned_types = "U" if operation == "RADDU" else unsigned
    clamped = operation == "RADDS"
    width = layout.bits if clamped or layout.bits == 32 else 2 * layout.bits
    result, sign = LAYOUTS[str(width)], "u" if operation == "RADDU" else "i"
    operands = [const(layout.types[unsigned_types])] + ([const(layout.predicate)] if predicated else [])
    return Expected(prototype(result.types[unsigned_types], *operands), "reduce_T" if predicated else "reduce",
                    [("sum", result.code(sign), "CLAMPED" if clamped else "EXACT", layout.code(sign))])


def combined_lanes(name, twins):
    """RMAX, RMIN, RXOR, ROR, RAND: all lanes combined into one as wide. A combines with the accumulator too; U behind the
    operation reads the lanes as unsigned, and its types are then unsigned; U behind the layout only names the types."""
    del twins
    bitwise = ["RXOR", "ROR", "RAND"]
    operation, suffix, unsigned, predicated = split(
        name, ["RMAX", "RMIN", "RMAXU", "RMINU", "RMAXA", "RMINA", *bitwise, *(o + "A" for o in bitwise)],
        ["2NX8", "NX16", "N_2X32"])
    layout = LAYOUTS[suffix]
    rule, letter = re.fullmatch(r"R(MAX|MIN|XOR|OR|AND)([UA]?)", operation).groups()
    accumulated, is_bitwise = letter == "A", "R" + rule in bitwise
    if unsigned and not is_bitwise or predicated and accumulated:
        raise Unknown(name)
    unsigned_types = "U" if letter == "U" else unsigned
    result, operand = LAYOUTS[ELEMENTS[suffix]].types[unsigned_types], const(layout.types[unsigned_types])
    lanes = layout.code("u" if letter == "U" or is_bitwise else "i")
    if accumulated:
        return Expected(prototype("void", f"{result}&", operand), "acc_a", [("combined_with", rule, lanes)])
    operands = [operand] + ([const(layout.predicate)] if predicated else [])
    return Expected(prototype(result, *operands), "reduce_T" if predicated else "reduce", [("combined", rule, lanes)])


def selection(name, twins):
    """SELS: lane `immediate` as a scalar."""
    del twins
    operation, suffix, unsigned, predicated = split(name, ["SELS"])
    if unsigned or predicated or suffix not in ELEMENTS:
        raise Unknown(name)
    layout = LAYOUTS[suffix]
    return Expected(prototype(LAYOUTS[ELEMENTS[suffix]].types[""], const(layout.types[""]), "immediate"), "a_i_lane",
                    [("selected", layout.code("i"))])


def with_predicate(name, twins):
    """B in front: the operation, and a predicate of what it loses: of ABS, which lanes were negative."""
    del twins
    operation, suffix, unsigned, predicated = split(name, ["BABS"])
    if unsigned or predicated:
        raise Unknown(name)
    layout = LAYOUTS[suffix]
    register_type = layout.types[""]
    return Expected(prototype("void", f"{layout.predicate}&", f"{register_type}&", const(register_type)), "a_pr",
                    [("unary_and_signs", operation[1:], layout.code("i"))])


RULES = [lane_by_lane, immediate_shift, comparison, replication, zero, predicate_logic, predicate_reduction, first_lanes,
         sum_of_lanes, combined_lanes, selection, with_predicate]
