"""The scalar core and its ports: what their names say of types.

A package (rk_core, rk_density, ...) and an instruction. _N is an instruction's short form, _A another way to write
it. I and MI take an immediate. U reads and gives unsigned numbers, bits are unsigned too; all else is an int.
What an instruction computes stands in its row and is tested by what it does.
"""

import re

from vocabulary import Expected, Unknown

PACKAGE = r"rk_(?:core|density|misc|mul|booleans|virtualops|ioports)_"

SIGNATURES = [
    # Arithmetic on numbers
    (r"(ADD|SUB)(X[248])?(_N|_A)?", "int(int, int)"),
    (r"ADDM?I(_N|_A)?", "int(int, immediate)"),
    (r"NEG|ABS|NSA|MOV_N|MOV_A", "int(int)"),
    (r"MULL|MULSH|MUL16S|MIN|MAX|SALT|CLAMPS|SEXT|QUOS|REMS", "int(int, int)"),
    (r"MULUH|MUL16U|MINU|MAXU|QUOU|REMU", "unsigned(unsigned, unsigned)"),
    (r"SALTU", "int(unsigned, unsigned)"),
    (r"NSAU", "int(unsigned)"),
    # Bits
    (r"AND|OR|XOR|CMP4", "unsigned(unsigned, unsigned)"),
    (r"BSWP|uint32_move", "unsigned(unsigned)"),
    (r"EXTUI", "unsigned(unsigned, int, unsigned)"),
    (r"DEPBITS", "void(unsigned&, unsigned, int, unsigned)"),
    (r"CONST16", "void(unsigned&, unsigned short)"),
    # Moves
    (r"MOVI(_N)?", "int(immediate)"),
    (r"MOV(EQ|NE|LT|GE)Z", "void(int&, int, int)"),
    (r"MOV[TF]", "void(unsigned&, unsigned, const rkbool&)"),
    (r"NOP(_N)?", "void()"),
    # Booleans: B with the second operand as it is, BC with its complement; all or any of four or eight.
    (r"(AND|OR|XOR)B|(AND|OR)BC", "rkbool(const rkbool&, const rkbool&)"),
    (r"(ALL|ANY)4", "rkbool(const rkbool4&)"),
    (r"(ALL|ANY)8", "rkbool(const rkbool8&)"),
    # The shift amount register, shifts by it, shifts that set it first, shifts by an immediate.
    (r"SSR|SSL|SSA8L|SSA8B", "void(int)"),
    (r"SSAI", "void(immediate)"),
    (r"RSR_SAR", "unsigned()"),
    (r"WSR_SAR", "void(unsigned)"),
    (r"XSR_SAR", "void(unsigned&)"),
    (r"RSR_PRID", "int()"),
    (r"SRC", "unsigned(unsigned, unsigned)"),
    (r"SLL|SRL", "unsigned(unsigned)"),
    (r"SRA", "int(int)"),
    (r"SSAI_SRC", "unsigned(unsigned, unsigned, immediate)"),
    (r"SSR_SRC", "unsigned(unsigned, unsigned, int)"),
    (r"SSR_SRA", "int(int, int)"),
    (r"SSR_SRL|SSL_SLL", "unsigned(unsigned, int)"),
    (r"SLLI|SRLI", "unsigned(unsigned, immediate)"),
    (r"SRAI", "int(int, immediate)"),
    # Loads and stores by the width in bits and the sign of what is loaded.
    (r"L32I(_N)?", "int(const int*, int)"),
    (r"L16SI", "int(const short*, int)"),
    (r"L16UI", "unsigned(const unsigned short*, int)"),
    (r"L8UI", "unsigned(const unsigned char*, int)"),
    (r"S32I(_N)?|S32NB", "void(int, const int*, int)"),
    (r"S16I", "void(int, const short*, int)"),
    (r"S8I", "void(int, const unsigned char*, int)"),
    (r"uint32_loadi", "unsigned(const unsigned*, int)"),
    (r"uint32_storei", "void(unsigned, const unsigned*, int)"),
    # Ports: the exported state, the queues, the wire. NBLK does not wait.
    (r"READ_IPQ|CHECK_[IO]PQ|RUR_EXPSTATE|READ_IMPWIRE", "unsigned()"),
    (r"READ_IPQ_NBLK", "void(unsigned&, rkbool&)"),
    (r"WRITE_OPQ|WUR_EXPSTATE", "void(unsigned)"),
    (r"WRITE_OPQ_NBLK", "rkbool(unsigned)"),
    (r"(SETB|CLRB)_EXPSTATE", "void(immediate)"),
    (r"WRMSK_EXPSTATE", "void(unsigned, unsigned)"),
]

# Helpers for / and % of kernels have no package.
HELPERS = ["QUOU", "QUOS", "REMU", "REMS"]


def instruction(name, twins):
    del twins
    match = re.fullmatch(rf"{PACKAGE}(\w+)", name)
    if not match and name not in HELPERS:
        raise Unknown(name)
    for pattern, signature in SIGNATURES:
        if re.fullmatch(pattern, match[1] if match else name):
            return Expected(signature, "scalar", [])
    raise Unknown(name)


RULES = [instruction]
