"""The programs of kastarri-conform: what calls each intrinsic, case by case."""

import collections
import math
import re

import register_access

# Tables and intrinsics that no program calls, each with the reason.
LEFT_OUT = {
    "scalar/ports.def": "acts on the world outside the core",
    "RK_RSR_PRID": "gives the number of the processor",
    "RK_NOP": "gives nothing",
    "RK_NOP_N": "gives nothing",
    "ZRA_SCATTERW": "gives nothing",
}

INTEGER_CORNERS, FLOAT_CORNERS = 11, 17  # as in runtime.cpp
MEMORY, PLACE = 512, 192                 # likewise

SMALL = list(range(16))
# Immediates of the scalar core, small enough to be in the range of any encoding: name -> the values that go together.
LISTED = {
    "RK_ADDI": [-100, -1, 1, 2, 100], "RK_ADDI_A": [-100, -1, 1, 2, 100], "RK_ADDI_N": [1, 2, 3, 15],
    "RK_ADDMI": [-1024, -256, 256, 2048], "RK_ADDMI_A": [-1024, -256, 256, 2048],
    "RK_MOVI": [-1000, -1, 0, 1, 1000], "RK_MOVI_N": [-10, -1, 0, 1, 30],
    "RK_SLLI": range(32), "RK_SRAI": range(32), "RK_SRLI": SMALL, "RK_SSAI": range(32), "RK_SSAI_SRC": range(32),
    "RK_CLAMPS": range(32), "RK_SEXT": range(32), "RK_CONST16": [0, 1, 0x1234, 0x7FFF, 0x8000, 0xFFFF],
    "RK_EXTUI": [(0, 1), (0, 8), (0, 16), (1, 2), (3, 5), (7, 9), (8, 8), (15, 16), (16, 16), (24, 8), (31, 1)],
    "RK_DEPBITS": [(0, 1), (0, 8), (0, 16), (1, 2), (3, 5), (7, 9), (8, 8), (15, 16), (16, 16), (24, 8), (31, 1)],
}
FIXED = {"RK_CLAMPS": {"t"}, "RK_SEXT": {"b"}, "RK_CONST16": {"imm"}, "RK_EXTUI": {"shift", "bits"},
         "RK_DEPBITS": {"shift", "bits"}}  # immediates that have the type of a register
COUNTS = {"shift", "s", "n", "t", "b"}     # registers that count bits or lanes, in these tables
COUNTING = ("scalar/funnel.def", "multiply/pack.def", "integer/predicates.def")

Parameter = collections.namedtuple("Parameter", "type name is_const stars is_reference")


def parameters(prototype):
    inside = re.search(r"\((.*)\)", prototype)[1]
    found = []
    for number, text in enumerate(filter(None, map(str.strip, inside.split(",")))):
        const, kind, marks, name = re.fullmatch(r"(const )?([\w ]+?)\s*([*&]*)\s*(\b(?!int$|char$)\w+)?", text).groups()
        found.append(Parameter(kind.strip(), name or f"unused{number}", bool(const), marks.count("*"), "&" in marks))
    return found


def result_type(prototype):
    return prototype[:prototype.index("(")].rsplit(" ", 1)[0]


class Intrinsic:
    """The call of one, and how often it is made."""

    def __init__(self, data, core):
        self.core, self.name, self.table = core, data["name"], data["table"]
        self.tests_alignment, self.prototype = data["tests_alignment"], data["prototype"]
        self.parameters = parameters(self.prototype)
        self.result = result_type(self.prototype)
        self.is_float = self.table.startswith("float/")
        self.is_funnel = self.table == "scalar/funnel.def"
        self.is_quiet = "float" in [self.result, *(p.type for p in self.parameters)]
        self.memory = next((p for p in self.parameters if p.stars), None)
        self.gets, self.puts, self.predicates = set(), set(), set()  # types that the call fills and reads
        self.before, self.arguments, self.after = [], [], []
        self.immediates = []
        self.write_call()

    # --- Operands ---

    def write_call(self):
        if self.memory:
            self.write_memory()
        inputs = [p for p in self.parameters if not p.stars]
        for p in sorted(inputs, key=lambda p: (p.is_reference and not p.is_const, p.name == "p")):
            self.write_operand(p)
        arguments = {p.name: p.name for p in inputs} | ({self.memory.name: self.address()} if self.memory else {})
        call = f"{self.name}({', '.join(arguments[p.name] for p in self.parameters)})"
        if self.result == "void":
            self.call = [f"{call};"]
        else:
            self.call = [f"put_{self.word(self.result)}(\"result\", {call});"]
            self.puts.add(self.result)

    def write_operand(self, p):
        if p.is_reference and not p.is_const:
            self.before.append(f"{p.type} {p.name} = get_{self.word(p.type)}(\"{p.name}\");")
            self.after.append(f"put_{self.word(p.type)}(\"{p.name}\", {p.name});")
            self.gets.add(p.type)
            self.puts.add(p.type)
        elif self.is_immediate(p):
            self.immediates.append(p.name)
            self.before.append(f"show_number(\"\", \"{p.name}\", (unsigned)({p.name}));")
        elif p.name == "p" and p.type in (*register_access.PREDICATES, "vbool1"):
            self.before.append(f"const {p.type} p = get_where_{p.type}(\"p\");")
            self.predicates.add(p.type)
        elif p.name == "offsets":
            lanes, bits = self.core.lanes(p.type)
            first = -128 if bits == 32 else 0
            self.before += [f"offsets(\"offsets\", {lanes}, {bits}, {self.core.bytes(self.memory.type)}, {first});",
                            f"const {p.type} offsets = *(const {p.type}*)staging;"]
        elif p.name in ("offset", "increment"):
            self.before.append(f"const int {p.name} = distance(\"{p.name}\", {self.core.bytes(self.memory.type)});")
        elif p.name in COUNTS and not p.is_reference and self.table in COUNTING:
            self.before.append(f"const {p.type} {p.name} = ({p.type})count(\"{p.name}\");")
        else:
            self.before.append(f"const {p.type} {p.name} = get_{self.word(p.type)}(\"{p.name}\");")
            self.gets.add(p.type)
            if re.match(r"RK_(QUO|REM)", self.name) and p.name == "b":  # by 0 and by -1 the core may trap
                self.before[-1:] = [f"const {p.type} any_b = get_{self.word(p.type)}(\"b\");",
                                    f"const {p.type} b = any_b == 0 || any_b == ({p.type})-1 ? 3 : any_b;"]

    def is_immediate(self, p):
        if p.type == "immediate" or p.name in FIXED.get(self.name, ()):
            return True
        in_name = re.search(r"(_IP?|_[lL]oadip?|_loadip?|_storeip?|_mtor_\w+|_rtom_\w+)$", self.name)
        return p.name in ("offset", "increment") and bool(in_name or self.table.startswith("scalar/"))

    @staticmethod
    def word(type_name):
        return type_name.replace(" ", "_")

    # --- Memory ---

    def is_opaque(self):
        return self.memory.type in register_access.OPAQUE

    def write_memory(self):
        kind, size = self.memory.type, self.core.bytes(self.memory.type)
        bits = self.core.lanes(kind)[1]
        if self.is_opaque():
            self.write_opaque_memory()
            return
        self.before.append(f"fill_memory({bits}, {self.core.kind(kind)});")
        if self.is_movable():
            self.before.append(f"move_place({size});")
        if self.memory.stars == 2:
            const = "const " * self.memory.is_const
            self.before.append(f"{const}{kind}* pointer = ({const}{kind}*)place;")
            self.after.append("result_pointer(pointer);")
        self.after.append(f"result_memory({bits});")

    def write_opaque_memory(self):
        kind = self.memory.type
        at = f"({kind}*)(memory + offset)"
        if self.result == "void":
            self.after.append(f"put_{kind}(\"memory\", *{at});")
            self.puts.add(kind)
        else:
            self.before.append(f"*{at} = get_{kind}(\"memory\");")
            self.gets.add(kind)

    def address(self):
        if self.is_opaque():
            return f"(const {self.memory.type}*)memory"
        return "&pointer" if self.memory.stars == 2 else f"(const {self.memory.type}*)place"

    # --- Cases ---

    def values(self):
        """What the immediates go through."""
        if not self.immediates:
            return []
        if self.name in LISTED:
            return LISTED[self.name]
        if self.memory and self.immediates[0] == "increment":
            return [self.core.bytes(self.memory.type) * k for k in (1, 2)]
        if self.memory and self.is_opaque():
            return [0, f"(int)sizeof({self.memory.type})"]
        if self.memory:
            size = self.core.bytes(self.memory.type)
            return [k * size for k in range(4) if (k + 1) * size <= MEMORY - PLACE]
        if self.immediates[0] in ("scale", "bit"):
            return range(32)
        if self.immediates[0] == "number":
            return SMALL
        if self.name.startswith("ZRA_LTR"):
            return range(self.core.types[self.result]["lanes"])
        operand = next(p for p in self.parameters if p.is_reference and p.is_const)
        lanes, bits = self.core.lanes(operand.type)
        return range(lanes if self.name.startswith(("ZRA_REP", "ZRA_SELS")) else bits)

    def plan(self):
        """Loops, rounding modes, patterns of predicates, lanes, and how many operands' corners meet."""
        types = [p.type for p in self.parameters if not p.stars and p.name not in (*self.immediates, "p", "offsets")]
        lanes = max([self.core.lanes(kind)[0] for kind in types] + [1])
        modes = 4 if self.is_float else 1
        patterns = 1 if not self.predicates else 2 if self.predicates == {"vbool1"} else 4
        meeting = min(2, max(1, len(types)))
        corners = FLOAT_CORNERS if any(self.core.is_float(kind) for kind in types) else INTEGER_CORNERS
        seeded = 18 if lanes > 1 else 32
        if len(self.values()) > 4:
            seeded = 6
        loops = math.ceil(corners ** meeting / lanes) + seeded if types else 1
        if self.memory:
            loops = 24 if not self.immediates else 14
        return loops * modes * patterns, modes, patterns, lanes, meeting

    # --- Text ---

    def is_wide(self):
        return bool({"qv_vec2Nx24", "qv_vecNx48"} & self.gets)

    def is_movable(self):
        """Whether memory may lie at any address."""
        return bool(self.memory) and not self.is_opaque() and not self.tests_alignment and self.core.bytes(self.memory.type) > 1

    def lines(self):
        body = ["next_call();"]
        if self.is_float:
            body.append("set_float_states();")
        if self.is_funnel:
            body.append("RK_WSR_SAR((unsigned)count(\"SAR\"));")
        body += self.before + self.call + self.after
        if self.is_float:
            body.append("result_number(\"flags\", scalarfp_RUR_FSR());")
        if self.name == "scalarfp_WUR_FCR":
            body.append("result_number(\"control\", scalarfp_RUR_FCR());")
        if self.is_funnel:
            body.append("result_number(\"SAR\", RK_RSR_SAR());")
        return body

    def text(self):
        begin = f"  begin(\"{self.name}\", {', '.join(map(str, self.plan()))});"
        if not self.immediates:
            loop = ["  while (more()) {", *(f"    {line}" for line in self.lines()), "  }"]
            return "\n".join([f"static void run_{self.name}() {{", begin, *loop, "  end();", "}", ""])
        names = ", ".join(self.immediates)
        calls = [f"CALL({', '.join(map(str, value)) if isinstance(value, tuple) else value})" for value in self.values()]
        rows = [calls[i:i + 8] for i in range(0, len(calls), 8)]
        loop = ["  while (more()) {", *("    " + " ".join(row) for row in rows), "  }"]
        macro = [f"#define CALL({names}) {{ \\", *(f"    {line} \\" for line in self.lines()), "  }"]
        return "\n".join([f"static void run_{self.name}() {{", *macro, begin, *loop, "  end();", "#undef CALL", "}", ""])


FLOAT_STATES = """// The rounding mode of the case, and flags, most often none, that have to stay.
static void set_float_states() {
  scalarfp_WUR_FCR(number % modes);
  scalarfp_WUR_FSR(number / (modes * patterns) % 5 == 4 ? any() & 0xF80 : 0);
}
"""


def function(head, lines):
    return "\n".join([f"static {head} {{", *(f"  {line}" for line in lines), "}", ""])


class Program:
    """One source, which holds all that it needs."""

    def __init__(self, title, intrinsics, core):
        self.title, self.intrinsics, self.core = title, intrinsics, core

    def accesses(self, quiet):
        """The functions that fill and read the types."""
        gets, puts, wheres = (sorted(set().union(*(getattr(i, kind) for i in self.intrinsics)))
                              for kind in ("gets", "puts", "predicates"))
        for name in gets:
            yield function(f"{name} get_{Intrinsic.word(name)}(const char* name)", self.core.ways(name, quiet).get)
        for name in puts:
            yield function(f"void put_{Intrinsic.word(name)}(const char* name, {name} value)", self.core.ways(name, quiet).put)
        for name in wheres:
            yield function(f"{name} get_where_{name}(const char* name)", self.core.predicate(name))

    def main(self):
        lines = [f"printf(\"# {self.title}\\n\");"]
        lines += [f"run_{i.name}();" for i in self.intrinsics]
        lines += ["way = SPILL;", *(f"run_{i.name}();" for i in self.intrinsics if i.is_wide())]
        lines += ["way = ANYWHERE;", "if (ANY_ADDRESS) {", *(f"  run_{i.name}();" for i in self.intrinsics if i.is_movable()), "}"]
        return "\n".join(["int main() {", *(f"  {line}" for line in lines), "  return 0;", "}", ""])

    def text(self, header, runtime, values):
        quiet = all(i.is_quiet for i in self.intrinsics)
        parts = [f"// {self.title}: written by kastarri-conform.\n#include <stdio.h>\n\n#include {header}\n"]
        parts += ["#define VALUES 1\n"] * values + [runtime]
        parts += [FLOAT_STATES] * any(i.is_float for i in self.intrinsics)
        parts += [*self.accesses(quiet), *(i.text() for i in self.intrinsics), self.main()]
        return "\n".join(parts)


def reason(data):
    """Why an intrinsic is left out; nothing if it is not."""
    return LEFT_OUT.get(data["name"]) or LEFT_OUT.get(data["table"])


def is_left_out(data):
    return reason(data) is not None


def programs(library, names, most):
    """The programs for these intrinsics: families apart, each in parts with at most so many bytes of calls. What passes the
    PC's floats by value is apart, too."""
    core = register_access.Registers(library["types"])
    groups = collections.defaultdict(list)
    for data in library["intrinsics"]:
        if data["name"] in names and not is_left_out(data):
            intrinsic = Intrinsic(data, core)
            groups[data["family"] + "_host" * intrinsic.is_quiet].append(intrinsic)
    for group, intrinsics in groups.items():
        parts, size = [[]], 0
        for intrinsic in intrinsics:
            size += len(intrinsic.text())
            if size > most and parts[-1]:
                parts.append([])
                size = len(intrinsic.text())
            parts[-1].append(intrinsic)
        for number, part in enumerate(parts, 1):
            name = f"conform_{group}" + (f"_{number}" if len(parts) > 1 else "")
            yield name, Program(name, part, core)
