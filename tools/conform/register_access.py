"""How a program of kastarri-conform fills and reads values of each type, with nothing but memory and what the core's rules
settle: pointers to register types, conversions, loads, stores and packs."""

import collections

# Of a type: the lines of get_T(name), which returns an operand, and of put_T(name, value), which takes a result.
Ways = collections.namedtuple("Ways", "get put")

HOST = {"int": 32, "unsigned": 32, "unsigned int": 32, "immediate": 32, "short": 16, "unsigned short": 16, "char": 8,
        "signed char": 8, "unsigned char": 8, "bool": 1, "long long": 64, "float": 32}

# What has no memory image that the core's rules settle: programs move it through memory and never look at its bytes there.
OPAQUE = {"qv_vec2Nx24", "qv_vecNx48", "qv_vecN_2x64w", "vbool1", "qv_int24", "qv_int48"}

PREDICATES = {"vboolN": ("N", 32), "vbool2N": ("2N", 64), "vboolN_2": ("N_2", 16)}

SPECIAL = {
    # The low bits by an image, extended by their sign; all of them by the spill image, of which nobody but this library
    # says how its lanes lie. Back by the image of the low bits, and the rest as a pack.
    "qv_vec2Nx24": Ways(
        ["if (way == SPILL) {",
         "  operand(name, 64, 24, INTEGER);",
         "  return qv_wvecspill_mtor_qv_vec2Nx24((const qv_wvecspill*)staging, 0);",
         "}",
         "operand(name, 64, 16, INTEGER);",
         "return qv_vec2Nx16w_mtor_qv_vec2Nx24((const qv_vec2Nx16w*)staging, 0);"],
        ["qv_vec2Nx24_rtom_qv_vec2Nx16Uw(value, (const qv_vec2Nx16Uw*)staging, 0);",
         "result(name, 64, 16);",
         "*(qv_vec2Nx8*)staging = ZRA_PACKVRNR2NX24(value, 16);",
         "result(name, 64, 8);"]),
    "qv_vecNx48": Ways(
        ["if (way == SPILL) {",
         "  operand(name, 32, 48, INTEGER);",
         "  return qv_wvecspill_mtor_qv_vecNx48((const qv_wvecspill*)staging, 0);",
         "}",
         "operand(name, 32, 32, INTEGER);",
         "return qv_vecNx32_mtor_qv_vecNx48((const qv_vecNx32*)staging, 0);"],
        ["qv_vecNx48_rtom_qv_vecNx32(value, (const qv_vecNx32*)staging, 0);",
         "result(name, 32, 32);",
         "*(qv_vecNx16*)staging = ZRA_PACKVRNRNX48(value, 32);",
         "result(name, 32, 16);"]),
    # high * 2^31 twice, and low: no conversion leads into these lanes.
    "qv_vecN_2x64w": Ways(
        ["const qv_vecN_2x32v one = 1;",
         "const qv_vecN_2x32Uv half = 0x80000000u;",
         "qv_vecN_2x64w value;",
         "unsigned i;",
         "operand(name, 16, 64, INTEGER);",
         "for (i = 0; i < 32; ++i)",
         "  write_bytes(staging + 128 + i % 2 * 64 + i / 2 * 4, read_bytes(staging + 4 * i, 4), 4);",
         "value = ZRA_MULUSN_2X32U(*(const qv_vecN_2x32Uv*)(staging + 128), one);",
         "ZRA_MULUSAN_2X32U(value, half, *(const qv_vecN_2x32v*)(staging + 192));",
         "ZRA_MULUSAN_2X32U(value, half, *(const qv_vecN_2x32v*)(staging + 192));",
         "return value;"],
        ["*(qv_vecN_2x32v*)staging = ZRA_PACKLN_2X64W(value);",
         "*(qv_vecN_2x32v*)(staging + 64) = ZRA_PACKHN_2X64W(value);",
         "result(name, 32, 32);"]),
    "vbool1": Ways(
        ["const vbool1 value = (int)(scalar(name, 8) & 1);", "return value;"],
        ["const vboolN all = value;", "ZRA_SBN_I(all, (const vboolN*)staging, 0);", "result(name, 1, 32);"]),
    "qv_int24": Ways(
        ["const qv_int24 value = (int)scalar(name, 32);", "return value;"],
        ["qv_int24_rtom_int32(value, (const int*)staging, 0);", "result(name, 1, 32);"]),
    "qv_int48": Ways(
        ["operand(name, 1, 64, INTEGER);", "return int64_mtor_qv_int48((const long long*)staging, 0);"],
        ["qv_int48_rtom_int64(value, (const long long*)staging, 0);", "result(name, 1, 64);"]),
    "qv_int32pr": Ways(
        ["const qv_int32pr value = (int)scalar(name, 32);", "return value;"],
        ["*(qv_int32pr*)staging = value;", "result(name, 1, 32);"]),
    "long long": Ways(
        ["operand(name, 1, 64, INTEGER);", "return *(const long long*)staging;"],
        ["*(long long*)staging = value;", "result(name, 1, 64);"]),
    "float": Ways(
        ["operand(name, 1, 32, QUIET);", "return *(const float*)staging;"],
        ["*(float*)staging = value;", "result(name, 1, 32);"]),
}

# The intrinsics that all this rests on: where one of them differs, others only seem to.
FOUNDATIONS = {
    "qv_wvecspill_mtor_qv_vec2Nx24", "qv_vec2Nx16w_mtor_qv_vec2Nx24", "qv_vec2Nx24_rtom_qv_vec2Nx16Uw", "ZRA_PACKVRNR2NX24",
    "qv_wvecspill_mtor_qv_vecNx48", "qv_vecNx32_mtor_qv_vecNx48", "qv_vecNx48_rtom_qv_vecNx32", "ZRA_PACKVRNRNX48",
    "ZRA_MULUSN_2X32U", "ZRA_MULUSAN_2X32U", "ZRA_PACKLN_2X64W", "ZRA_PACKHN_2X64W", "ZRA_LBN_I", "ZRA_SBN_I", "ZRA_LB2N_I",
    "ZRA_SB2N_I", "ZRA_LBN_2_I", "ZRA_SBN_2_I", "qv_int24_rtom_int32", "int64_mtor_qv_int48", "qv_int48_rtom_int64",
    "vbool1_rtor_vboolN", "int32_rtor_vbool1", "scalarfp_WUR_FCR", "scalarfp_WUR_FSR", "scalarfp_RUR_FSR", "RK_WSR_SAR",
    "RK_RSR_SAR",
}


class Registers:
    """The types of the core, by what the tables say of them."""

    def __init__(self, types):
        self.types = types

    def bytes(self, name):
        return self.types[name]["bytes"] if name in self.types else HOST[name] // 8

    def lanes(self, name):
        """Lanes and their bits, as they lie in memory; those of 128 bits and more by words, a predicate's bits as one."""
        if name in HOST:
            return 1, max(8, HOST[name])
        data = self.types[name]
        if data["kind"] == "b":
            return 1, 8 * data["bytes"]
        parts = max(1, data["bits"] // 64)
        return data["lanes"] * parts, data["bits"] // parts

    def is_float(self, name):
        return name == "float" or self.types.get(name, {}).get("kind") == "f"

    def kind(self, name, quiet=False):
        return ("QUIET" if quiet else "FLOAT") if self.is_float(name) else "INTEGER"

    def ways(self, name, quiet):
        if name in SPECIAL:
            return SPECIAL[name]
        if name in PREDICATES:
            form, bits = PREDICATES[name]
            return Ways([f"operand(name, 1, {bits}, INTEGER);", f"return ZRA_LB{form}_I((const {name}*)staging, 0);"],
                        [f"ZRA_SB{form}_I(value, (const {name}*)staging, 0);", f"result(name, 1, {bits});"])
        if name.startswith("rkbool"):
            mask = (1 << self.types[name]["lanes"]) - 1
            return Ways([f"const {name} value = (int)(scalar(name, 8) & {mask});", "return value;"],
                        ["const int bits = value;", "result_number(name, (unsigned)bits);"])
        if name in HOST:
            bits = HOST[name]
            masked = f"scalar(name, {max(8, bits)})" + " & 1" * (bits == 1)
            read = f"({masked}) != 0" if bits == 1 else f"({name}){masked}"
            return Ways([f"return {read};"],
                        [f"result_number(name, (unsigned)value{f' & {(1 << bits) - 1}' if bits < 32 else ''});"])
        lanes, bits = self.lanes(name)
        return Ways([f"operand(name, {lanes}, {bits}, {self.kind(name, quiet)});", f"return *(const {name}*)staging;"],
                    [f"*({name}*)staging = value;", f"result(name, {lanes}, {bits});"])

    def predicate(self, name):
        """The lines of what governs lanes."""
        if name == "vbool1":
            return ["predicate(name, 32);", "const vbool1 value = (int)(staging[0] & 1);", "return value;"]
        form, bits = PREDICATES[name]
        return [f"predicate(name, {bits});", f"return ZRA_LB{form}_I((const {name}*)staging, 0);"]
