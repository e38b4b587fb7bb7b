"""The words by which an intrinsic is found besides its name, its types and its rule.

A name is read in its parts: SUBSNX16T is SUBS on the lanes NX16 under a predicate, LVNX8S_IP is LV with NX8S and the
mode IP. Each part has the words that people use for it, the first ones being the most usual.
"""

import re

# Lane layouts: bits of a lane and words. A name's first layout is that of its lanes.
LAYOUTS = {
    "2NX8": "8bit byte int8 char", "NX16": "16bit short halfword int16", "N_2X32": "32bit word int32",
    "N_4X64": "64bit int64 doubleword", "N_8X128": "128bit", "N_16X256": "256bit",
    "NXF16": "half float 16bit floating point precision fp16 f16",
    "N_2XF32": "float single 32bit floating point precision fp32 f32 float32",
    "NX8": "8bit byte int8 16bit", "N_2X16": "16bit short 32bit",
    "N_2XF16": "half float 16bit single 32bit floating point precision",
    "2NX24": "24bit accumulator wide 8bit", "NX48": "48bit accumulator wide 16bit", "N_2X64W": "64bit accumulator wide 32bit",
    "N_2X96": "64bit accumulator wide", "2N8": "8bit byte", "N16": "16bit short", "N_2X16X32": "16bit 32bit mixed",
    "2NX8X16": "8bit 16bit mixed", "2NR8X16": "8bit 16bit mixed coefficient word channel",
    "2NR8UX16": "8bit 16bit mixed coefficient word channel unsigned",
    "8": "8bit byte int8 scalar", "16": "16bit short int16 scalar", "32": "32bit word int32 scalar", "64": "64bit int64 scalar",
    "F16": "half float 16bit floating point precision fp16 scalar",
    "F32": "float single 32bit floating point precision fp32 scalar",
}
LAYOUT = "|".join(layout + r"(?=[DQ]?XR)" * (layout in ("2N8", "N16")) for layout in sorted(LAYOUTS, key=len, reverse=True))
NAME = re.compile(rf"(?P<operation>CVTF(?:16|32)|[A-Z]+?(?:4T[AS]?|I(?=2N))?)(?P<layout>{LAYOUT})(?P<sign>[US]?)"
                  r"(?P<pack>PACK[LQP])?(?P<coefficients>[DQ]?XR(?:8|16)|[CJ](?![A-Z]))?(?P<predicated>T?)(?P<immediate>I?)"
                  r"(?:_(?P<mode>[IX]P?|V|[LH01]))?")

# How an address is formed, and which half, for loads and stores, gathers and packs.
MODES = {"I": "offset immediate base", "X": "offset indexed register base", "V": "variant", "L": "low lower half",
         "H": "high upper half", "0": "even lanes deinterleave stride", "1": "odd lanes deinterleave stride"}
MODES.update({mode + "P": f"post increment postincrement pointer advance update move {words}"
              for mode, words in (("I", "immediate"), ("X", "register"))})

PREDICATED = "predicated masked conditional under where tail"
SATURATING = "saturating saturation clamp clip"
NEAREST = "round rounding rounded nearest"

# Operations of the vector unit: the first pattern that fits the whole operation has its words.
OPERATIONS = [(re.compile(pattern), words) for pattern, words in [
    # Memory
    (r"LV", "load vector read fetch unaligned aligned any address"),
    (r"SV", "store vector write save unaligned aligned any address"),
    (r"LSR", "load replicate broadcast splat element every all lanes duplicate dup set1"),
    (r"LS", "load element one single lane read"),
    (r"SS", "store element one single lane 0 write first lowest"),
    (r"LB", "load predicate mask boolean read"),
    (r"SB", "store predicate mask boolean write"),
    (r"GATHERA", "gather table lookup lut indexed indirect load permute shuffle stride addresses"),
    (r"(MOV)?GATHERD", "gather result gathered data register move to vector second half"),
    (r"SCATTERINC", "scatter histogram increment count bins add 1"),
    (r"SCATTERW", "scatter wait barrier fence sync complete memory drain"),
    (r"SCATTER", "scatter indexed indirect store write permute stride transpose addresses"),
    # Integer lanes
    (r"ADD", "add sum plus addition adding modulo wrap"),
    (r"SUB", "subtract minus difference subtraction modulo wrap"),
    (r"ADDS", f"add sum plus addition {SATURATING}"),
    (r"SUBS", f"subtract minus difference subtraction {SATURATING}"),
    (r"NEG", "negate negative minus negation sign change flip"),
    (r"NEGS", f"negate negative minus negation {SATURATING}"),
    (r"ABS", "absolute value magnitude modulus abs"),
    (r"ABSS", f"absolute value magnitude abs {SATURATING}"),
    (r"ABSSUBU?", "absolute difference distance sad abs diff subtract"),
    (r"ABSSSUB", f"absolute difference distance sad abs diff subtract {SATURATING}"),
    (r"MINU?", "minimum smaller smallest lesser min lower"),
    (r"MAXU?", "maximum larger largest greater max upper"),
    (r"AVGU?", "average mean halving half add avg"),
    (r"AVGRU?", "average mean halving half add avg round up rounding"),
    (r"AND", "bitwise and logical mask bits"),
    (r"OR", "bitwise or logical bits"),
    (r"XOR", "bitwise exclusive or xor logical bits toggle eor"),
    (r"NOT", "bitwise not invert complement bits inversion ones"),
    (r"SLL", "shift left logical lsl each lane own variable amount count"),
    (r"SRL", "shift right logical lsr unsigned each lane own variable amount count"),
    (r"SRA", "shift right arithmetic asr signed each lane own variable amount count"),
    (r"SLS", f"shift left each lane own variable amount count scale {SATURATING}"),
    (r"SLLI", "shift left logical lsl immediate constant fixed amount"),
    (r"SRLI", "shift right logical lsr unsigned immediate constant fixed amount"),
    (r"SRAI", "shift right arithmetic asr signed immediate constant fixed amount"),
    (r"SLSI", f"shift left immediate constant fixed amount scale {SATURATING}"),
    (r"ROTR", "rotate right rotation ror left cyclic circular each lane own"),
    (r"ROTRI", "rotate right rotation ror left cyclic circular immediate constant"),
    (r"NSA", "normalize normalization shift amount count leading sign bits headroom redundant norm exponent"),
    (r"NSAU", "count leading zeros clz normalize normalization shift amount norm log2"),
    (r"REP", "replicate broadcast splat lane element duplicate dup every all lanes"),
    (r"ZERO", "zero clear reset set register initialize constant 0"),
    (r"EQ", "compare comparison equal equality same =="),
    (r"NEQ", "compare comparison not equal unequal different inequality !="),
    (r"LTU?", "compare comparison less than smaller below <"),
    (r"LEU?", "compare comparison less or equal at most <="),
    (r"GTU?", "compare comparison greater than larger above >"),
    (r"GEU?", "compare comparison greater or equal at least >="),
    (r"ANDB", "predicate mask boolean and combine"),
    (r"ORB", "predicate mask boolean or combine"),
    (r"XORB", "predicate mask boolean exclusive or xor differ"),
    (r"ANDNOTB", "predicate mask boolean and not clear"),
    (r"ORNOTB", "predicate mask boolean or not"),
    (r"NOTB", "predicate mask boolean not invert complement inversion"),
    (r"RANDB", "predicate mask boolean all true every reduce reduction horizontal test"),
    (r"RORB", "predicate mask boolean any true some reduce reduction horizontal test"),
    (r"LTR", "first n lanes predicate mask tail remainder rest leading count make create"),
    (r"LTRS", "first n lanes predicate mask tail remainder rest leading count make create clamp saturating"),
    (r"RADDU?", "reduce reduction horizontal sum add across all lanes total"),
    (r"RADDS", f"reduce reduction horizontal sum add across all lanes total {SATURATING}"),
    (r"RMAXU?A?", "reduce reduction horizontal maximum largest max across all lanes"),
    (r"RMINU?A?", "reduce reduction horizontal minimum smallest min across all lanes"),
    (r"RXORA?", "reduce reduction horizontal bitwise exclusive or xor parity across all lanes"),
    (r"RORA?", "reduce reduction horizontal bitwise or across all lanes"),
    (r"RANDA?", "reduce reduction horizontal bitwise and across all lanes"),
    (r"SELS", "select lane extract get element immediate constant"),
    (r"BABS", "absolute value magnitude abs sign signs predicate negative"),
    (r"ADDWU?[AS]?", "widening wide add sum plus extend accumulator accumulate"),
    (r"SUBWU?[AS]?", "widening wide subtract minus difference extend accumulator accumulate"),
    # Packs
    (r"PACKL", "pack narrow low bits part accumulator to vector convert truncate extract modulo"),
    (r"PACKM", "pack narrow middle high half upper bits accumulator to vector convert extract"),
    (r"PACKH", "pack narrow high half upper bits accumulator to vector convert extract"),
    (r"PACKQ", f"pack narrow q15 fraction fractional fixed point accumulator to vector convert {NEAREST}"),
    (r"PACKP", f"pack narrow q10 fraction fractional fixed point accumulator to vector convert {NEAREST}"),
    (r"PACKVR?NR", f"pack narrow shift right no without rounding truncate truncating accumulator to vector convert {SATURATING}"),
    (r"PACKVR?U?", f"pack narrow shift right accumulator to vector convert extract downconvert {NEAREST} {SATURATING}"),
    # Multiplies
    (r"MULSGN", "sign transfer apply sgn signum copysign multiply by the of another"),
    (r"MULSGNS", f"sign transfer apply sgn signum copysign multiply by the of another {SATURATING}"),
    # Floats
    (r"U?FLOAT", "convert conversion cast int integer to float from fixed point scale"),
    (r"U?TRUNC", "convert conversion cast float to int integer truncate toward zero fixed point scale saturating"),
    (r"CVTF16", "convert conversion cast single to half precision narrow float downconvert demote fp32 to fp16"),
    (r"CVTF32", "convert conversion cast half to single precision widen float upconvert promote fp16 to fp32"),
    (r"FIROUND", f"{NEAREST} integer integral ties away"),
    (r"FIRINT", f"{NEAREST} integer integral rint current mode"),
    (r"FICEIL", "ceiling ceil round up integer integral"),
    (r"FIFLOOR", "floor round down integer integral"),
    (r"FITRUNC", "truncate truncation round toward zero integer integral fix"),
    (r"MINNUM", "minimum smaller min ignoring nan number fmin"),
    (r"MAXNUM", "maximum larger max ignoring nan number fmax"),
    (r"CLSFY", "classify class kind fpclassify isnan nan infinity isinf zero subnormal test"),
    (r"CONST", "constant pi e ln log2 sqrt2 one half number table literal"),
    (r"OEQA?", "compare comparison ordered equal equality =="),
    (r"OLTA?", "compare comparison ordered less than smaller below <"),
    (r"OLEA?", "compare comparison ordered less or equal at most <="),
    (r"OGTA?", "compare comparison ordered greater than larger above >"),
    (r"OGEA?", "compare comparison ordered greater or equal at least >="),
    (r"UN", "compare comparison unordered nan isnan is not a number"),
    (r"UNEQA?", "compare comparison unordered not equal unequal different inequality !="),
    (r"UEQ", "compare comparison unordered equal"),
    (r"ULTQ?", "compare comparison unordered less than"),
    (r"ULEQ?", "compare comparison unordered less or equal"),
]]

# A multiply's operation, letter by letter; the letters are those of tests/names/multiply.py.
MULTIPLY = re.compile(r"(MUL|SQR)(UU|US|SU|(?<=SQR)U|)(4T|)(PD|P|Q|)(A|S|)(H?)(I?)")
MULTIPLY_WORDS = [
    {"MUL": "multiply product times multiplication", "SQR": "square squares multiply power energy norm magnitude squared"},
    {"UU": "unsigned", "U": "unsigned", "US": "unsigned times signed mixed sign", "SU": "signed times unsigned mixed sign"},
    {"4T": "four tap taps sliding window fir filter convolution convolve correlation coefficient dot"},
    {"P": "pair two sum dot products dual", "PD": "pair two difference dual", "Q": "four quad sum dot products"},
    {"A": "accumulate accumulating multiply-accumulate mac mla add",
     "S": "subtract multiply-subtract mls msub negative accumulate minus"},
    {"H": "high half upper"},
    {"I": "interleave interleaved two channel stereo"},
]

# What stands behind the layout of a multiply.
COEFFICIENTS = "coefficient taps fir filter convolution scalar word constant"
TAIL = {"C": "complex number cmul i q rotate mixer fft", "J": "complex conjugate conjugated number correlation"}
PACKED = {"PACKL": "low bits product narrow modulo", "PACKQ": f"q15 fraction fractional fixed point narrow {NEAREST}",
          "PACKP": f"q10 fraction fractional fixed point narrow {NEAREST}"}
FLOAT_MULTIPLIES = {"MUL": "multiply product times multiplication", "MULA": "fused multiply add accumulate fma mac mla madd",
                    "MULS": "fused multiply subtract fms msub negative nmsub"}

# The scalar core.
SCALAR = [(re.compile(pattern), words) for pattern, words in [
    (r"READ_IPQ", "input queue fifo port read pop receive get blocking take"),
    (r"CHECK_IPQ", "input queue fifo port check empty status poll"),
    (r"READ_IPQ_NBLK", "input queue fifo port read pop receive non nonblocking try poll"),
    (r"WRITE_OPQ", "output queue fifo port write push send put blocking"),
    (r"CHECK_OPQ", "output queue fifo port check full room status poll"),
    (r"WRITE_OPQ_NBLK", "output queue fifo port write push send non nonblocking try"),
    (r"RUR_EXPSTATE", "exported state port gpio output pins read"),
    (r"WUR_EXPSTATE", "exported state port gpio output pins write set"),
    (r"SETB_EXPSTATE", "exported state port gpio output pin set bit"),
    (r"CLRB_EXPSTATE", "exported state port gpio output pin clear bit"),
    (r"WRMSK_EXPSTATE", "exported state port gpio output pins write under mask bits"),
    (r"READ_IMPWIRE", "import wire port gpio input pins read"),
    (r"ADD(M?I)?(_[NA])?", "add sum plus"), (r"ADDX\d(_A)?", "add scaled shift lea address index times"),
    (r"SUB(_A)?", "subtract minus"), (r"SUBX\d", "subtract scaled shift times"),
    (r"NEG", "negate minus"), (r"ABS", "absolute value magnitude"),
    (r"MULL", "multiply low product"), (r"MUL[US]H", "multiply high upper product mulh"),
    (r"MUL16[US]", "multiply 16bit halves product"),
    (r"AND", "bitwise and"), (r"OR", "bitwise or"), (r"XOR", "bitwise exclusive or xor"),
    (r"SALTU?", "compare less than set slt"), (r"MINU?", "minimum smaller min"), (r"MAXU?", "maximum larger max"),
    (r"CLAMPS", f"clamp to n bits range limit signed {SATURATING}"), (r"SEXT", "sign extend extension bit"),
    (r"NSA", "normalize shift amount count leading sign bits norm"), (r"NSAU", "count leading zeros clz normalize norm"),
    (r"EXTUI", "extract bits bit field bitfield unsigned"), (r"DEPBITS", "deposit insert bits bit field bitfield"),
    (r"CONST16", "constant load immediate 16bit"), (r"BSWP", "byte swap reverse bytes endian endianness bswap"),
    (r"CMP4", "compare four bytes equal string"), (r"MOVI(_N)?", "move constant immediate set"),
    (r"MOV_[NA]|uint32_move", "move copy register"),
    (r"MOV(EQ|NE|LT|GE)Z", "conditional move select cmov if zero negative"),
    (r"MOV[TF]", "conditional move select cmov if boolean true false"),
    (r"(AND|OR|XOR)BC?", "boolean logic"), (r"ALL[48]", "boolean all every true"), (r"ANY[48]", "boolean any some true"),
    (r"NOP(_N)?", "nop no operation nothing idle"), (r"RSR_PRID", "processor id number core identification"),
    (r"QUO[US]", "divide division quotient integer div"), (r"REM[US]", "remainder modulo mod divide division integer"),
    (r"RSR_SAR", "shift amount register sar read"), (r"WSR_SAR", "shift amount register sar write set"),
    (r"XSR_SAR", "shift amount register sar exchange swap"),
    (r"SS(R|L|AI)", "shift amount register sar set"),
    (r"SSA8[LB]", "shift amount register sar set byte unaligned endian endianness alignment"),
    (r"SRC|SS(R|AI)_SRC", "funnel shift double concatenate extract unaligned rotate"),
    (r"SLL|SSL_SLL", "shift left logical"), (r"SRA|SSR_SRA", "shift right arithmetic"), (r"SRL|SSR_SRL", "shift right logical"),
    (r"SLLI", "shift left logical immediate constant"), (r"SRAI", "shift right arithmetic immediate constant"),
    (r"SRLI", "shift right logical immediate constant"),
    (r"L32I(_N)?|uint32_loadi", "load word 32bit read"), (r"S32(I|NB)(_N)?|uint32_storei", "store word 32bit write"),
    (r"L16[US]I", "load halfword 16bit read extend"), (r"S16I", "store halfword 16bit write"),
    (r"L8UI", "load byte 8bit read extend"), (r"S8I", "store byte 8bit write"),
]]

# Floats of the scalar unit that vectors do not have; all else has the words of its vector form.
SCALAR_FLOAT = [(re.compile(pattern), words) for pattern, words in [
    (r"RUR_FCR", "read rounding mode control register round fenv get enable"),
    (r"WUR_FCR", "write set change rounding mode control register round fenv enable"),
    (r"RUR_FSR", "read status flags exceptions sticky register fenv get test inexact overflow invalid"),
    (r"WUR_FSR", "write set clear reset status flags exceptions sticky register fenv"),
    (r"MADDN?", "fused multiply add fma madd mac accumulate"), (r"MSUBN?", "fused multiply subtract fms msub"),
    (r"NEXP01?", "mantissa exponent split normalize frexp significand reciprocal root newton step"),
    (r"MKDADJ", "exponent adjust division divide quotient scale newton step"),
    (r"MKSADJ", "exponent adjust square root sqrt scale newton step"),
    (r"ADDEXPM?", "add exponent scale by power of two ldexp scalbn"),
    (r"MOV", "move copy"), (r"MOV(EQ|NE|LT|GE)Z", "conditional move select cmov if integer zero negative"),
    (r"MOV[TF]", "conditional move select cmov if boolean true false"),
    (r"RFR", "read bits of float reinterpret bitcast as unsigned word"), (r"WFR", "float from bits reinterpret bitcast word"),
    (r"U?FLOAT(16)?", "convert conversion cast int integer to float from fixed point scale"),
    (r"U?TRUNC(16)?", "convert conversion cast float to int integer truncate toward zero fixed point scale"),
]]

TYPES = [(re.compile(pattern), words) for pattern, words in [
    (r"(u?int\d+|float|bool)", "host c scalar int integer"), (r"qv_u?int\d+\w*|qv_f16|rkfloat", "scalar lane element"),
    (r"qv_vec(2Nx24|Nx48|N_2x64w)", "accumulator wide"), (r"qv_wvecspill", "spill accumulator wide save restore"),
    (r"qv_vec\w+", "vector"), (r"vbool\w+|rkbool\w*", "predicate mask boolean"), (r"valign", "alignment register"),
    (r"qv_gsr", "gather register"),
]]


def first(table, text):
    return next((words for pattern, words in table if pattern.fullmatch(text)), "")


def of_registers(name):
    """Moves and conversions: qv_vecNx16_loadip, int16_rtor_qv_vecNx16."""
    move = re.fullmatch(r"(\w+?)_(load|store|move)(ip?|xp?|)", name)
    if move:
        words = {"load": "load read register", "store": "store write save register", "move": "move copy assign register"}[move[2]]
        return [first(TYPES, move[1]) + " " + words, MODES.get(move[3].upper(), "")]
    source, way, target = re.fullmatch(r"(\w+?)_(rtor|mtor|rtom)_(\w+)", name).groups()
    words = {"rtor": "convert conversion cast", "mtor": "load convert conversion", "rtom": "store convert conversion"}[way]
    ends = first(TYPES, source), first(TYPES, target)
    meaning = ""
    if way == "rtor" and "vector" in ends[1] and "scalar" in ends[0]:
        meaning = "broadcast splat replicate set1 fill every all lanes duplicate scalar to vector int"
    elif way == "rtor" and "vector" in ends[0] and "scalar" in ends[1]:
        meaning = "get extract lane 0 first lowest element vector to scalar int"
    return [f"{words} {meaning}", f"{ends[0]} {ends[1]}"]


def of_multiply(operation):
    match = MULTIPLY.fullmatch(operation)
    return " ".join(words[part] for words, part in zip(MULTIPLY_WORDS, match.groups()) if part in words) if match else ""


def of_vectors(name):
    match = NAME.fullmatch(name)
    if not match:
        return [first(OPERATIONS, re.sub(r"(2N|N_2|N|1)?I?(_\w+)?$", "", name)), MODES.get(name.rpartition("_")[2], "")]
    operation, layout = match["operation"], match["layout"]
    is_float = "F" in layout and layout != "N_2XF16"
    words = (FLOAT_MULTIPLIES.get(operation) if is_float else None) or of_multiply(operation) or first(OPERATIONS, operation)
    attributes = [LAYOUTS[layout], MODES.get(match["mode"], "")]
    memory = operation in ("LV", "SV", "LS", "SS", "LSR")
    if memory and layout in ("NX8", "N_2X16", "N_2XF16"):
        signed = {"S": "sign", "U": "zero", "": "float"}[match["sign"]]
        words += f" widen extend {signed} extending promote upconvert" if operation[0] == "L" else \
            " narrow downconvert demote " + {"S": SATURATING, "U": "truncate low bits", "": ""}[match["sign"]]
    if match["sign"] == "U" or re.match(r"U|\w+U[AS]?$|MULUU|SQRU", operation) and not is_float:
        attributes.append("unsigned")
    if match["pack"]:
        words += " " + PACKED[match["pack"]]
    if match["coefficients"]:
        words += " " + TAIL.get(match["coefficients"], COEFFICIENTS)
        attributes.append({"8": "8bit", "6": "16bit"}.get(match["coefficients"][-1], ""))
    return [words, " ".join([*attributes, "scalar" if operation in ("LS", "SS") else "vector" if "N" in layout else ""])]


def of_scalar_float(name):
    operation, kind = re.fullmatch(r"scalarfp_(\w+?)(?:_([HS]))?", name).groups()
    words = first(SCALAR_FLOAT, operation) or FLOAT_MULTIPLIES.get(operation) or first(OPERATIONS, operation)
    return [words, {"H": LAYOUTS["F16"], "S": LAYOUTS["F32"], None: "float floating point"}[kind]]


def words_of(entry):
    """What the operation is called, and what else tells the entry from others: two texts of words."""
    name = entry.id
    if entry.family == "scalar":
        text = f"{first(SCALAR, name.removeprefix('RK_'))} scalar core"
        words = [re.sub(r"\d+bit", "", text), " ".join(re.findall(r"\d+bit", text))]
    elif name.startswith("scalarfp_"):
        words = of_scalar_float(name)
    elif re.search(r"_(load|store)[ix]p?$|_move$|_(rtor|mtor|rtom)_", name):
        words = of_registers(name)
    else:
        words = of_vectors(name)
    if entry.predicated:
        words = [f"{words[0]} {PREDICATED}", words[1] + " predicate mask"]
    return words


def plainness(entry):
    """From 0 to 1: what is used most goes before its variants, of entries that answer equally well."""
    worth = 1.0
    match = NAME.fullmatch(entry.id)
    layout, mode = (match["layout"], match["mode"]) if match else ("", entry.id.rpartition("_")[2].upper())
    if entry.predicated:
        worth *= 0.86
    if match and match["sign"] == "U" and match["operation"] not in ("LV", "LS", "LSR", "SV", "SS"):
        worth *= 0.97
    if match and re.fullmatch(r"(SLL|SRL|SRA|SLS|ROTR)I", match["operation"]):
        worth *= 0.96
    worth *= {"X": 0.97, "IP": 0.98, "XP": 0.95, "V": 0.9}.get(mode, 1.0)
    worth *= {"NX16": 1.0, "2NX8": 0.99, "N_2X32": 0.99, "NXF16": 0.96, "N_2XF32": 0.97}.get(layout, 0.95)
    if re.fullmatch(r"F?\d+", layout) or entry.family == "scalar" or entry.id.startswith("scalarfp_"):
        worth *= 0.9
    if entry.family == "conversions":
        worth *= 0.8
    if match and match["operation"].startswith("MULSGN"):
        worth *= 0.85
    letters = match and MULTIPLY.fullmatch(match["operation"])
    return worth * 0.97 ** (sum(map(bool, letters.groups())) if letters else 0)
