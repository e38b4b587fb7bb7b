"""What the tables of rows say, read by the compiler's preprocessor: types, intrinsics, names.

    all_rows()      the rows of every family: header -> (title, tables, rows)
    read_types()    the register types, with what they are made from
    short_name(n)   ZRA_ADDNX16 of rk_zra32_ZRA_ADDNX16
    symbol(n)       its full name
"""

import collections
import os
import re
import shlex
import subprocess
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
PREFIX = "cstub_Km_ZNB_Orbis_R5_64k_"

# Header of a family -> title. A table src/<family>/x.def goes into <family>.h, but for those of the frame,
# which are moves and conversions.
FAMILIES = {
    "scalar": "The scalar core and its ports",
    "conversions": "Moves and conversions of registers",
    "memory": "Vector memory: loads, stores, gather and scatter",
    "integer": "Integer vectors",
    "multiply": "Multiplies, wide accumulators, packs",
    "float": "Floating point",
}
CONVERSION_TABLES = ["frame/conversions.def", "float/conversions.def"]
MOVES_OF_BITS = "frame/conversions.def"  # the other one has numbers rounded, with flags

# What a text that reads tables begins with.
READER = '#include "families.h"\n'

UNITS = {"word": ("unsigned int", 32), "half": ("unsigned short", 16), "byte": ("unsigned char", 8)}


def compiler():
    """The command that compiles C++: CXX may have words before the compiler or behind it."""
    return shlex.split(os.environ.get("CXX", "g++"))


def preprocess(text):
    """The lines of `text` after the C++ preprocessor, which sees src/."""
    result = subprocess.run([*compiler(), "-E", "-P", "-x", "c++", "-I", os.path.join(ROOT, "src"), "-"],
                            input=text, capture_output=True, text=True, check=False)
    if result.returncode != 0:
        sys.exit(result.stderr)
    return result.stdout


def records(text):
    """The records @kind{...}@ that the macros of `text` leave behind, as (kind, [fields])."""
    flat = re.sub(r"\s+", " ", preprocess(text))
    return [(m.group(1), [f.strip() for f in m.group(2).split("@,")]) for m in re.finditer(r"@(\w+)\{(.*?)\}@", flat)]


def unquote(text):
    """The text of one or several adjacent string literals."""
    return "".join(re.findall(r'"((?:[^"\\]|\\.)*)"', text)).replace('\\"', '"')


# What a register is made from: its C++ type, the name of the conversion, and whether bits are all that it moves.
Source = collections.namedtuple("Source", "type conversion from_bits")


class RegisterType:
    def __init__(self, name, unit, units, layout, meaning):
        self.name, self.units, self.layout = name, int(units), layout
        self.unit, self.unit_bits = UNITS[unit]
        self.meaning = unquote(meaning)
        self.sources = []  # Source, in the order of the rows
        self.targets = []

    @property
    def cls(self):
        return f"{self.name}_space::{self.name}_"

    @property
    def replicated(self):
        """The arguments of kastarri::replicate: bits of a lane, of its share of the register, and whether it is signed."""
        kind, bits, lanes = re.match(r"([iufb])(\d+)x(\d+)$", self.layout).groups()
        return f"{bits}, {self.units * self.unit_bits // int(lanes)}, {'true' if kind == 'i' else 'false'}"

    @property
    def shape(self):
        match = re.match(r"([iufwb])(\d+)x(\d+)$", self.layout)
        if not match:
            return f"{self.units * self.unit_bits} bits"
        kind, bits, lanes = match.groups()
        kind = {"i": ", signed", "u": ", unsigned", "f": ", floating point", "w": "", "b": ""}[kind]
        return f"{lanes} x {bits} {'bit' if bits == '1' else 'bits'}{kind}"

    @property
    def about(self):
        size = self.units * self.unit_bits // 8
        return f"{self.meaning}: {self.shape} ({size} {'byte' if size == 1 else 'bytes'})"

    @property
    def lanes(self):
        """How a value is shown: kind and bits of a lane and how many there are. Booleans are bits; a register
        without lanes of its own is its units."""
        match = re.match(r"([iufwb])(\d+)x(\d+)$", self.layout)
        if not match:
            return "w", self.unit_bits, self.units
        kind, bits, lanes = match[1], int(match[2]), int(match[3])
        return ("b", 1, bits * lanes) if "bool" in self.name else (kind, bits, lanes)


def read_types():
    found = records('#define TYPE(T, UNIT, UNITS, LAYOUT, ...) @type{T@,UNIT@,UNITS@,LAYOUT@,__VA_ARGS__}@\n'
                    '#include "frame/types.def"\n')
    types = {fields[0]: RegisterType(*fields) for _, fields in found}
    kinds = records('#define DOC(TEXT)\n#define BITS(...) @bits{__VA_ARGS__}@\n'
                    '#define REGISTER(FROM, TO) @register{FROM@,TO}@\n'
                    '#define HOST(NAME, TYPE, TO) @host{NAME@,TYPE@,TO}@\n'
                    '#define HOST_BOTH(NAME, TYPE, TO) @both{NAME@,TYPE@,TO}@\n'
                    '#include "frame/host_ints.h"\n'
                    + "".join(f'BITS({int(table == MOVES_OF_BITS)})\n#include "{table}"\n' for table in CONVERSION_TABLES))
    from_bits = False
    for kind, fields in kinds:
        if kind == "bits":
            from_bits = fields[0] == "1"
        elif kind == "register":
            source, target = types[fields[0]], types[fields[1]]
            target.sources.append(Source(f"const {source.cls}&", f"{source.name}_rtor_{target.name}", False))
            source.targets.append((target.cls, f"{source.name}_rtor_{target.name}"))
        else:
            name, host, target = fields[0], fields[1], types[fields[2]]
            target.sources.append(Source(host, f"{name}_rtor_{target.name}", from_bits))
            if kind == "both":
                target.targets.append((host, f"{target.name}_rtor_{name}"))
    return types


def symbol(name):
    """The exported symbol of a row: an intrinsic's name has its package, a helper's has none."""
    return f"{PREFIX}_KOR_{name}" if name.startswith("rk_") else PREFIX + name


Row = collections.namedtuple("Row", "name prototype doc table shape")


def read_rows(tables, types):
    """The rows, in order."""
    names = re.compile(r"\b(" + "|".join(types) + r")\b")
    rows = []
    for table in tables:
        doc = ""
        for kind, fields in records(READER + '#define DOC(...) @doc{__VA_ARGS__}@\n'
                                    '#define ENTRY(SYMBOL, SHAPE, ...) @row{SYMBOL@,SHAPE@,SIG_##SHAPE(SYMBOL, __VA_ARGS__)}@\n'
                                    '#define HELPER ENTRY\n'
                                    f'#include "frame/rows.h"\n#include "{table}"\n'):
            if kind == "doc":
                doc = unquote(fields[0])
                continue
            name, shape, prototype = fields
            prototype = re.sub(rf"\b{name}\b", symbol(name), names.sub(lambda m: PREFIX + m.group(1), prototype))
            prototype = re.sub(r"\s+([,()])", r"\1", re.sub(r"\(\s+", "(", prototype))
            rows.append(Row(name, prototype, doc, table, shape))
    return rows


def about_table(table):
    """The comment at the head of a table, without the kinds of row that it lists."""
    with open(os.path.join(ROOT, "src", table), encoding="utf-8") as file:
        head = re.match(r"(//.*\n)*", file.read())[0]
    return " ".join(line[3:] for line in head.splitlines() if not line.startswith("//  "))


def keeps_lanes(row):
    """Whether a form leaves the lanes of its destination whose predicate bit is 0: what is predicated and does not load."""
    first = re.search(r"\(([^,)]*)", row.prototype)[1]
    return "_T" in row.shape and "&" in first and not first.startswith("const") and "*" not in row.prototype


def short_name(name):
    """ZRA_ADDNX16 of rk_zra32_ZRA_ADDNX16; moves, conversions and scalarfp_ names lose their package too."""
    package, rest = re.match(r"(rk_[a-z0-9]+_)?(.*)", name).groups()
    return rest if package in ("rk_zra32_", "rk_zran_") or rest.startswith("uint32_") else f"RK_{rest}"


def listed_tables():
    """The tables that the library is made of, in their order."""
    listed = []
    for name in ("scalar_rows.def", "rows.def"):
        with open(os.path.join(ROOT, "src", name), encoding="utf-8") as file:
            listed += re.findall(r'^#include "(.*)"', file.read(), re.M)
    return listed


def tables_by_family():
    """The listed tables by the header that declares their rows."""
    listed = listed_tables()
    families = {name: [] for name in FAMILIES}
    for table in listed + [t for t in CONVERSION_TABLES if t not in listed]:
        directory = os.path.dirname(table)
        header = "conversions" if table in CONVERSION_TABLES or directory == "frame" else directory
        families[header].append(table)
    return {name: tables for name, tables in families.items() if tables}


def all_rows():
    """The rows of every family: header -> (title, tables, rows)."""
    types = read_types()
    return {name: (FAMILIES[name], tables, read_rows(tables, types)) for name, tables in tables_by_family().items()}
