"""What the reference says of each intrinsic, from its row: nothing here knows an intrinsic by name."""

import re

import generate_headers
import rules
from generate_headers import PREFIX

# Host types: bits, and how they are shown.
HOST_TYPES = {
    "signed char": (8, "8 bits, signed"), "unsigned char": (8, "8 bits, unsigned"), "char": (8, "8 bits, signed"),
    "short": (16, "16 bits, signed"), "unsigned short": (16, "16 bits, unsigned"),
    "int": (32, "32 bits, signed"), "unsigned": (32, "32 bits, unsigned"), "unsigned int": (32, "32 bits, unsigned"),
    "immediate": (32, "an int"), "long long": (64, "64 bits, signed"), "float": (32, "32 bits, floating point"),
    "bool": (8, "true or false"),
}

# What a rule does to numbers, told by its words.
FACTS = {
    "saturates": r"clamp|(?<!not )saturat|the bound of",
    "wraps": r"modulo 2\^|\bwrap|low (\d+ )?bits",
    "exact": r"\bexact\b",
    "rounds": r"\brounded\b(?! down to its size)",
    "truncates": r"truncat",
    "flags": r"(?<!without )\bflags\b|\binvalid\b|\binexact\b",
}


# What an r or acc held before a call matters, but in shapes of loads and in these, whose r is a second result.
SECOND_RESULT = {"a_pr"}


class Operand:
    """A parameter, or the result, of a prototype."""

    def __init__(self, text, types, name=None):
        text = text.replace(PREFIX, "").strip()
        match = re.fullmatch(r"(const )?([\w ]+?)\s*(\*\*|\*|&)?\s*(?<=[ *&])(\w+)", text) if name is None else None
        if match:
            const, self.type, mark, self.name = match.groups()
        else:
            const, self.type, mark, self.name = None, text, None, name or ""
        self.register = types.get(self.type)
        self.in_memory = bool(mark) and "*" in mark
        self.pointer = mark == "**"
        self.role = ("result" if name == "result" else "in memory" if self.in_memory
                     else "written" if mark == "&" and not const else "read")
        self.keeps = False  # whether what it held before the call matters
        self.bytes = self.register.units * self.register.unit_bits // 8 if self.register else HOST_TYPES[self.type][0] // 8

    @property
    def access(self):
        return "read and written" if self.keeps else "read, moved" if self.pointer else self.role

    @property
    def shape(self):
        return self.register.shape if self.register else HOST_TYPES[self.type][1]

    @property
    def lane_bits(self):
        match = re.fullmatch(r"[iufw](\d+)x\d+", self.register.layout) if self.register else None
        return int(match[1]) if match else None


def operands_of(row, types):
    result, parameters = re.fullmatch(r"(.*?)\s*\bcstub\w+\((.*)\)", row.prototype).groups()
    operands = [Operand(text, types) for text in parameters.split(",") if text.strip()]
    for operand in operands:
        operand.keeps = (operand.role == "written" and operand.name in ("r", "acc") and row.shape not in SECOND_RESULT
                         and not row.shape.startswith("load"))
    return operands if result == "void" else operands + [Operand(result, types, "result")]


def alignment(row, operands):
    """Who tests the address of a memory operand, or None where there is none."""
    places = [o for o in operands if o.in_memory]
    if not places:
        return None
    tested = next((o for o in operands if o.role == "written"), None) if "aligned_destination" in row.shape else places[0]
    step = min(tested.bytes, 4)
    if row.shape in ("mtor", "rtom"):
        return f"The address is rounded down to a multiple of {tested.bytes}." if not tested.register and step > 1 \
            else "Any address: none is tested or rounded."
    if step == 1 or not ("aligned" in row.shape or row.shape == "scalar"):
        return "Any address: none is tested."
    if tested.in_memory:
        return f"The address accessed is tested: unless it is a multiple of {step}, the program ends with an error."
    return (f"The address of the destination {tested.name} is tested: unless it is a multiple of {step}, the program ends with "
            "an error. What the pointer says is not tested.")


def operation(name):
    """The short name without the package of the vector unit: what a choice names, and the link to the entry."""
    return re.sub(r"^ZRA_", "", generate_headers.short_name(name))


class Sentences:
    """The sentences of a table, and which others their words refer to."""

    def __init__(self, rows):
        self.texts = list(dict.fromkeys(row.doc for row in rows))
        self.rows = rows

    def context(self, text):
        """The rules without which this one cannot be read: that before it, or those of the operations it names."""
        if "as above" in text:
            return [self.texts[self.texts.index(text) - 1]]
        named = re.search(r"\bas ([A-Z]\w+)(?: and ([A-Z]\w+))?", text)
        found = [row.doc for name in (named.groups() if named else ()) if name for row in self.rows
                 if re.match(rf"(\w+fp_|RK_)?{name}(?![A-Z])|{name}N", operation(row.name))]
        return list(dict.fromkeys(doc for doc in found if doc != text))


def facts(texts):
    joined = ". ".join(texts)
    return [name for name, pattern in FACTS.items() if re.search(pattern, joined)]


class Entry:
    def __init__(self, family, row, types, sentences, choices):
        self.row, self.family = row, family
        self.id = operation(row.name)
        self.short = generate_headers.short_name(row.name)
        self.symbol = generate_headers.symbol(row.name)
        self.operands = operands_of(row, types)
        self.rule = rules.own(row, types)
        self.context = [rules.own(row, types, sentence) for sentence in sentences.context(row.doc)]
        self.facts = facts([self.rule] + self.context)
        self.alignment = alignment(row, self.operands)
        self.choices = [i for i, choice in enumerate(choices) if choice.family == family and choice.names(self.id)]
        self.predicated = "_T" in row.shape

    @property
    def lane_bits(self):
        """The widths of the lanes; without registers, of the numbers."""
        widths = {o.lane_bits for o in self.operands if o.register} - {None}
        return sorted(widths or {8 * o.bytes for o in self.operands if not o.register})

    @property
    def register_bits(self):
        return max((8 * o.bytes for o in self.operands if o.register), default=0)


def read_entries(choices):
    types = generate_headers.read_types()
    entries = []
    for family, (_, tables, rows) in generate_headers.all_rows().items():
        sentences = {table: Sentences([row for row in rows if row.table == table]) for table in tables}
        entries += [Entry(family, row, types, sentences[row.table], choices) for row in rows]
    return entries
