"""Floating point: what the names of vector operations and of scalars say.

Vectors and single lanes: an operation and a layout, NXF16, N_2XF32, F16 or F32, T under a predicate (MULAN_2XF32T).
Scalars of the float unit: an operation, _H in half and _S in single precision (scalarfp_MADD_H). Both names of one
operation mean the same arithmetic: MULA is MADD.
"""

import re

from vocabulary import LAYOUTS, Expected, Unknown, alternatives, const, prototype

FLOATS = ["NXF16", "N_2XF32", "F16", "F32"]

TWO_OPERANDS = ["ADD", "SUB", "MUL", "MIN", "MAX", "MINNUM", "MAXNUM"]
FUSED = {"MULA": "MULA", "MULS": "MULS"}  # acc + a * b and acc - a * b, rounded once
ON_BITS = ["ABS", "NEG"]
TO_INTEGRAL = ["FIROUND", "FICEIL", "FIFLOOR", "FITRUNC", "FIRINT"]
# O: true of ordered operands alone, U: of unordered ones too. ULTQ and ULEQ are the ones quiet about quiet NaNs.
RELATIONS = ["OEQ", "OLT", "OLE", "OGT", "OGE", "UEQ", "ULT", "ULE", "UN", "ULEQ", "ULTQ", "UNEQ"]


def split(name, operations):
    match = re.fullmatch(rf"({alternatives(operations)})({alternatives(FLOATS)})(T?)", name)
    if not match:
        raise Unknown(name)
    return match[1], LAYOUTS[match[2]], bool(match[3])


def lanes(name, twins):
    """Operations on lanes, under a predicate too."""
    del twins
    operation, layout, predicated = split(name, [*TWO_OPERANDS, *FUSED, *ON_BITS])
    register_type, code = layout.types[""], layout.code("f")
    operand = const(register_type)
    predicate = [const(layout.predicate)] if predicated else []
    suffix = "_T" if predicated else ""
    if operation in FUSED:
        return Expected(prototype("void", f"{register_type}&", operand, operand, *predicate), "acc_ab" + suffix,
                        [("float_abc", operation, code)])
    operands = [operand] * (1 if operation in ON_BITS else 2)
    shape = ("a_r" if operation in ON_BITS else "ab_r") + suffix
    kernel = ("float_bits" if operation in ON_BITS else "float_ab", operation, code)
    if predicated:
        return Expected(prototype("void", f"{register_type}&", *operands, *predicate), shape, [kernel])
    return Expected(prototype(register_type, *operands), shape, [kernel])


def integral(name, twins):
    """To the nearest integral number, ties away (FIROUND), up, down, toward zero, or by RoundMode (FIRINT)."""
    del twins
    operation, layout, predicated = split(name, TO_INTEGRAL)
    if predicated:
        raise Unknown(name)
    register_type = layout.types[""]
    return Expected(prototype(register_type, const(register_type)), "a_r", [("float_a", operation, layout.code("f"))])


CLASSES = {"NXF16": "qv_vecNx16U", "N_2XF32": "qv_vecN_2x32Uv", "F16": "qv_int16U", "F32": "qv_int32Uv"}


def classes(name, twins):
    """CLSFY: one bit of an unsigned lane says what kind of number it is."""
    del twins
    operation, layout, predicated = split(name, ["CLSFY"])
    if predicated:
        raise Unknown(name)
    return Expected(prototype(CLASSES[name.removeprefix(operation)], const(layout.types[""])), "w_r",
                    [("float_bits", operation, layout.code("f"))])


def constant(name, twins):
    """CONST: a number out of a table, in every lane."""
    del twins
    operation, layout, predicated = split(name, ["CONST"])
    if predicated:
        raise Unknown(name)
    return Expected(prototype(layout.types[""], "immediate"), "float_const", [("float_const", operation, layout.code("f"))])


def comparison(name, twins):
    del twins
    operation, layout, predicated = split(name, RELATIONS)
    if predicated:
        raise Unknown(name)
    operand = const(layout.types[""])
    return Expected(prototype(layout.predicate, operand, operand), "ab_p", [("float_ab_bits", operation, layout.code("f"))])


# An integer layout and the float layout as wide.
FLOAT_OF = {"N_2X32": "N_2XF32", "NX16": "NXF16"}


def scaled(name, twins):
    """FLOAT: lanes / 2^immediate as floats; TRUNC: floats * 2^immediate as integers, toward zero. U: unsigned lanes.
    The layout in the name is that of the operand."""
    del twins
    match = re.fullmatch(rf"(U?)(FLOAT)({alternatives(FLOAT_OF)})|(U?)(TRUNC)({alternatives(FLOAT_OF.values())})", name)
    if not match:
        raise Unknown(name)
    unsigned, to_float = match[1] or match[4] or "", match[2] is not None
    integers = match[3] or next(i for i, f in FLOAT_OF.items() if f == match[6])
    whole, fraction = LAYOUTS[integers], LAYOUTS[FLOAT_OF[integers]]
    source, target = (whole, fraction) if to_float else (fraction, whole)
    sign = "u" if unsigned else "i"
    types = [layout.types[unsigned if layout is whole else ""] for layout in (target, source)]
    return Expected(prototype(types[0], const(types[1]), "immediate"), "float_scaled",
                    [("convert_scaled", source.code(sign), target.code(sign), whole.code(sign))])


def precision(name, twins):
    """CVT: to the format named first, from the one named second; of vectors the even (_0) or odd (_1) halves."""
    del twins
    kinds = {
        "CVTF16F32": ("qv_f16", "rkfloat", ("convert", "f32x1", "f16x1")),
        "CVTF32F16": ("rkfloat", "qv_f16", ("convert", "f16x1", "f32x1")),
        "CVTF32NXF16_0": ("qv_vecN_2xf32", "qv_vecNxf16", ("convert_from_every_other", "0")),
        "CVTF32NXF16_1": ("qv_vecN_2xf32", "qv_vecNxf16", ("convert_from_every_other", "1")),
        "CVTF16N_2XF32_0": ("qv_vecNxf16", "qv_vecN_2xf32", ("convert_to_every_other", "0")),
        "CVTF16N_2XF32_1": ("qv_vecNxf16", "qv_vecN_2xf32", ("convert_to_every_other", "1")),
    }
    if name not in kinds:
        raise Unknown(name)
    result, source, kernel = kinds[name]
    return Expected(prototype(result, const(source)), "w_r", [kernel])


SCALARS = {"H": "qv_f16", "S": "rkfloat"}

# Scalars by what they are handed. {T} is the scalar's type; the rule is the operation but where it is named.
SAME = None
SCALAR_KINDS = [
    # operations, prototype, shape, form of the semantic function, its rule
    (["ADD", "SUB", "MUL", "MIN", "MAX", "MINNUM", "MAXNUM", "MKDADJ"],
     "{T}(const {T}&, const {T}&)", "scalarfp_ab_r", "scalar_ab", SAME),
    (["MADD"], "void({T}&, const {T}&, const {T}&)", "scalarfp_acc_ab", "scalar_abc", "MULA"),
    (["MSUB"], "void({T}&, const {T}&, const {T}&)", "scalarfp_acc_ab", "scalar_abc", "MULS"),
    # N: to nearest, whatever RoundMode says.
    (["MADDN"], "void({T}&, const {T}&, const {T}&)", "scalarfp_acc_ab", "scalar_abc_to_nearest", "MULA"),
    (["MSUBN"], "void({T}&, const {T}&, const {T}&)", "scalarfp_acc_ab", "scalar_abc_to_nearest", "MULS"),
    (["ABS", "NEG", "MOV"], "{T}(const {T}&)", "scalarfp_a_r", "scalar_on_bits", SAME),
    ([*TO_INTEGRAL, "NEXP0", "NEXP01", "MKSADJ"], "{T}(const {T}&)", "scalarfp_a_r", "scalar_a", SAME),
    # M: rounded by RoundMode, with flags; without it toward zero and silent.
    (["ADDEXPM"], "void({T}&, const {T}&)", "scalarfp_ra", "scalar_ab", SAME),
    (["ADDEXP"], "void({T}&, const {T}&)", "scalarfp_ra", "scalar_ab", "WithoutFlags<ADDEXPM>"),
    (["CLSFY"], "unsigned(const {T}&)", "scalarfp_to_word", "scalar_on_bits", SAME),
    (["RFR"], "unsigned(const {T}&)", "scalarfp_to_word", "scalar_on_bits", "MOV"),
    (["WFR"], "{T}(unsigned)", "scalarfp_from_word", "scalar_from_bits", "MOV"),
    (["CONST"], "{T}(immediate)", "scalarfp_const", "scalar_const", "constant"),
    (RELATIONS, "rkbool(const {T}&, const {T}&)", "scalarfp_relation", "scalar_relation", SAME),
    (["FLOAT"], "{T}(int, immediate)", "scalarfp_from_int", "scalar_float", "i32x1"),
    (["UFLOAT"], "{T}(unsigned int, immediate)", "scalarfp_from_int", "scalar_float", "u32x1"),
    (["FLOAT16"], "{T}(const qv_int16&, immediate)", "scalarfp_scaled", "scalar_float", "i16x1"),
    (["UFLOAT16"], "{T}(const qv_int16U&, immediate)", "scalarfp_scaled", "scalar_float", "u16x1"),
    (["TRUNC"], "int(const {T}&, immediate)", "scalarfp_to_int", "scalar_trunc", "i32x1"),
    (["UTRUNC"], "unsigned int(const {T}&, immediate)", "scalarfp_to_int", "scalar_trunc", "u32x1"),
    (["TRUNC16"], "qv_int16(const {T}&, immediate)", "scalarfp_scaled", "scalar_trunc", "i16x1"),
    (["UTRUNC16"], "qv_int16U(const {T}&, immediate)", "scalarfp_scaled", "scalar_trunc", "u16x1"),
    (["MOVT"], "void({T}&, const {T}&, const rkbool&)", "scalarfp_move_where", "scalar_move", "IS_TRUE"),
    (["MOVF"], "void({T}&, const {T}&, const rkbool&)", "scalarfp_move_where", "scalar_move", "IS_FALSE"),
    (["MOVEQZ"], "void({T}&, const {T}&, int)", "scalarfp_move_when", "scalar_move", "IS_ZERO"),
    (["MOVNEZ"], "void({T}&, const {T}&, int)", "scalarfp_move_when", "scalar_move", "IS_NOT_ZERO"),
    (["MOVLTZ"], "void({T}&, const {T}&, int)", "scalarfp_move_when", "scalar_move", "IS_NEGATIVE"),
    (["MOVGEZ"], "void({T}&, const {T}&, int)", "scalarfp_move_when", "scalar_move", "IS_NOT_NEGATIVE"),
]
# Relations of halves with A: into a predicate of the vector unit.
INTO_PREDICATE = ["OEQ", "OLT", "OLE", "OGT", "OGE", "UNEQ"]

REGISTERS = {"RUR_FCR": ("unsigned()", "scalarfp_read", "scalar_read", "READ_CONTROL"),
             "WUR_FCR": ("void(unsigned)", "scalarfp_write", "scalar_write", "WRITE_CONTROL"),
             "RUR_FSR": ("unsigned()", "scalarfp_read", "scalar_read", "READ_STATUS"),
             "WUR_FSR": ("void(unsigned)", "scalarfp_write", "scalar_write", "WRITE_STATUS")}


def scalar(name, twins):
    del twins
    match = re.fullmatch(r"rk_zran_scalarfp_(\w+?)(?:_([HS]))?", name)
    if not match:
        raise Unknown(name)
    operation, width = match.groups()
    if not width:
        if operation not in REGISTERS:
            raise Unknown(name)
        signature, shape, form, rule = REGISTERS[operation]
        return Expected(signature, shape, [(form, rule)])
    if width == "H" and operation[-1] == "A" and operation[:-1] in INTO_PREDICATE:
        return Expected("vbool1(const qv_f16&, const qv_f16&)", "scalarfp_relation", [("scalar_relation", operation[:-1])])
    for operations, signature, shape, form, rule in SCALAR_KINDS:
        if operation in operations:
            return Expected(signature.format(T=SCALARS[width]), shape, [(form, rule or operation)])
    raise Unknown(name)


RULES = [lanes, integral, classes, constant, comparison, scaled, precision, scalar]
