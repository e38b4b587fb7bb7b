"""What of the core is not built: why, and what a kernel does instead.

docs/coverage.md, the reference page and kastarri-port have it from here. Names of intrinsics stand in backquotes.
"""

import collections
import re

# title: what of the topic is built stands behind "but for". names: patterns of names that belong here. abbreviated: where
# no name is known to us, words that one may be short for; it has at least their capitals. words: what else people look for.
Topic = collections.namedtuple("Topic", "key title why instead names abbreviated words")

TOPICS = [
    Topic("aligning", "Aligning loads and stores through alignment registers, also of double width",
          "how the registers buffer and rotate is not known well enough to give the core's bits",
          "Whole vectors are loaded and stored at any address: `LVNX16_IP` and `SVNX16_IP` take the place of an aligning access, "
          "and what primes or flushes an alignment register is left out.",
          [], ["LoadAligning", "StoreAligning"], "unaligned stream streaming priming flush alignment aligning align register valign"),
    Topic("select", "Select, shuffle, dual-select and unpack by pattern, but for `SELS2NX8`",
          "the patterns are tables of the core that we do not have",
          "Select by a predicate: `r = b; ZRA_MINNX16T(r, a, a, p);` takes a where the bit is 1, for the smaller of a and a is a. "
          "Any other order: store the lanes, load them with `GATHERANX16` and `GATHERDNX16`, whose offsets are bytes. One lane in "
          "every lane: `REPNX16`. Every other lane of an accumulator: `PACKVRNX48_0` and `PACKVRNX48_1`. Bytes to 16 bits: "
          "`LVNX8S_I`, `LVNX8U_I`.",
          [], ["SELect", "DualSELect", "SHuFfLe", "UNPacK"],
          "shuffle select dual permute permutation rearrange interleave deinterleave zip unzip transpose blend merge vsel swizzle reverse "
          "unpack lanes pattern"),
    Topic("engine", "The general wide partial-product engine", "its operand encoding is not known",
          "Sums of products have intrinsics of their own: `MULPANX16` of two, `MULQAN16XR16` of four with coefficients, `MUL4TAN16XR8` "
          "over a sliding window.",
          [], [], "partial product engine general wide matrix systolic"),
    Topic("division", "Division, reciprocal and square-root steps and their tables", "the seeds are not known",
          "Divide lane by lane in C on an array, or multiply by a reciprocal that the host computes: results to nearest, not the "
          "core's approximations. Integers of the scalar core have "
          "`RK_QUOS`, `RK_QUOU`, `RK_REMS` and `RK_REMU`; the exponent steps of floats are there: `scalarfp_MKDADJ_S`, "
          "`scalarfp_MKSADJ_S`, `scalarfp_ADDEXPM_S`.",
          [], ["DIVide", "DIVision", "RECiprocal", "RECIProcal", "SQuareRooT", "ReciprocalSQuareRooT", "QUOtient"],
          "divide division reciprocal inverse square root sqrt rsqrt quotient newton step seed iteration div"),
    Topic("ring", "`ADDMOD16U`, `MINORMAX2NX8`", "where the modulus comes from and which of the two is chosen is not known",
          "An address in a ring is C on the PC; in lanes, `ADDNX16U`, a comparison (`GEUNX16U`) and `SUBNX16UT`. For the other, "
          "`MIN2NX8` and `MAX2NX8`, the one stored over the other by `SV2NX8T_I`.",
          [r"ADDMOD16U", r"MINORMAX2NX8"], [], "circular modulo address ring buffer"),
    Topic("compress", "Compress and expand under a predicate (`SQZ..`, `UNSQZ..`)",
          "their operands and the lanes that are left over are not known",
          "Store the vector and the predicate and copy the enabled lanes in a loop; `GATHERANX16` brings them back in the new order.",
          [r"(UN)?SQZ\w*"], [], "compress compaction compact squeeze expand left pack filter predicate"),
    Topic("sums", "Accumulating sums of lanes (`RADDA`, `RADDAU`), reductions that start anew (`.._rinit`)",
          "how wide the accumulator is and what it starts from is not known",
          "`RADDNX16` and an addition: `ADD32`. Extremes and bits that accumulate are there: `RMAXANX16`, `RXORANX16`.",
          [r"RADDAU?(2N|N)\w*", r"R[A-Z]+A?\w*_rinit"], [], "accumulate accumulating reduction sum initialize"),
    Topic("places", "Extremes with their place (`RBMAX`, `RBMIN`)", "which of several equal lanes is told is not known",
          "`RMAXNX16` or `RMINNX16`, and `EQNX16` with the result in every lane: the predicate of all such lanes.",
          [r"RB(MAX|MIN)\w*"], [], "argmax argmin index place position maximum minimum horizontal across lanes"),
    Topic("unknown-elements", "`LSFAST9_I`, `SSFAST9_I`, `LSCF_I`, `SSCF_I`", "nothing tells their operands",
          "One element is loaded by `LSNX16_I` and its like and stored by `SSNX16_I`.",
          [r"[LS]SFAST9_I", r"[LS]SCF_I"], [], ""),
]

LAYOUT = r"(?=[SUI]{0,2}(2N|N|\d|$))"


def abbreviation(words):
    """A pattern for short forms of words: SQuareRooT is SQRT, SQUARERT, SQROOT or SQUAREROOT."""
    return re.sub("[a-z]+", lambda left_out: f"({left_out[0].upper()})?", words)


def patterns(topic):
    """Patterns of the names, without package, that a topic answers."""
    return topic.names + [abbreviation(words) + LAYOUT + r"\w*" for words in topic.abbreviated]


def table():
    """The rows of the table in docs/coverage.md."""
    return [f"| {topic.title} | {topic.why} | {topic.instead} |" for topic in TOPICS]


def topic_of(name):
    """The topic that answers a name without package, or None."""
    return next((topic for topic in TOPICS for pattern in patterns(topic) if re.fullmatch(pattern, name)), None)
