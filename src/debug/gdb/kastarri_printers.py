"""gdb shows the register types of kastarri by their lanes.

    set kastarri format FORM          the form in which registers are shown from now on
    show kastarri format
    kastarri print[/FORM] EXPRESSION  one value

The text is that of kastarri/print.h, which is tested to be the same.
"""

import re

import gdb
import gdb.printing

from kastarri_register_types import REGISTER_TYPES

FORMS = "decimal, hex, float, half, halves, bytes, or q0 to q63 (fixed point with so many fraction bits)"
HELP = """FORM is how a lane is shown:
  decimal        its number; half and single floats as the number that they stand for
  hex            its bits
  q0 to q63      a fixed-point number with so many bits of fraction
  float, half    the float whose bits an integer lane of 32 or 16 bits holds
  halves, bytes  a word of coefficients (qv_int32pr, qv_int64pr) as the numbers of 16 or 8 bits in it
In q1 to q7 such a word is shown by its bytes, in q8 to q15 by its halves.
Lanes that a form does not fit are shown in decimal."""
PARTS = {"halves": 16, "bytes": 8}  # bits
FLOATS = {16: ("half", 10), 32: ("float", 23)}  # bits: name, bits of the fraction


class Form:
    """How the bits of a lane are read."""

    def __init__(self, name):
        fixed = re.match(r"q(\d{1,2})$", name)
        if not (name in ("decimal", "hex", "float", "half", *PARTS) or fixed and int(fixed[1]) <= 63):
            raise gdb.GdbError(f'Unknown form "{name}": a register is shown as {FORMS}.')
        self.name = name
        self.fraction_bits = int(fixed[1]) if fixed else None

    def part_bits(self):
        """Into how many bits each this form takes a word of coefficients apart; 0 if it does not."""
        if self.fraction_bits is None:
            return PARTS.get(self.name, 0)
        return 0 if self.fraction_bits in (0, *range(16, 64)) else 8 if self.fraction_bits < 8 else 16

    def fits(self, kind, bits):
        """Whether lanes can be shown so; those that cannot are shown in decimal."""
        if self.name in ("decimal", "hex"):
            return True
        if self.fraction_bits is not None:
            return kind in "iu"
        return kind in "iuf" and FLOATS.get(bits, ("",))[0] == self.name


def signed(bits_of_lane, bits):
    return bits_of_lane - (bits_of_lane >> bits - 1 << bits)


def fixed_point(number, fraction_bits):
    """`number` / 2^fraction_bits, rounded to as many digits as keep all lanes apart."""
    digits = (fraction_bits * 30103 + 99999) // 100000  # fraction_bits * log10(2), rounded up
    scaled = (2 * abs(number) * 10**digits + (1 << fraction_bits)) >> (fraction_bits + 1)
    whole, fraction = divmod(scaled, 10**digits)
    return "-" * (number < 0) + str(whole) + (f".{fraction:0{digits}}" if digits else "")


def floating(pattern, bits):
    """The number that an IEEE pattern stands for; for a NaN, which has more bits to it, a text."""
    fraction_bits = FLOATS[bits][1]
    sign, exponent, fraction = pattern >> bits - 1, (pattern & ~(1 << bits - 1)) >> fraction_bits, pattern & (1 << fraction_bits) - 1
    top = (1 << bits - 1 - fraction_bits) - 1
    if exponent == top and fraction:
        return f"nan({hexadecimal(pattern, bits)})"
    if exponent == top:
        magnitude = float("inf")
    else:
        mantissa = fraction + (exponent > 0) * (1 << fraction_bits)
        magnitude = mantissa * 2.0 ** (max(exponent, 1) - top // 2 - fraction_bits)
    return -magnitude if sign else magnitude


def hexadecimal(pattern, bits):
    return f"0x{pattern:0{(bits + 3) // 4}x}"


class Scalar:
    """A register of one lane, or of bits."""

    def __init__(self, value, kind, bits, count, form):
        self.kind, self.bits, self.count = kind, bits, count
        self.form = form if form.fits(kind, bits) else Form("decimal")
        self.type = value.type.strip_typedefs().unqualified()
        self.units = value["_"]
        self.unit_bits = 8 * self.units[0].type.sizeof
        self.share = 8 * value.type.sizeof // count

    def units_with(self, position, bits):
        """The units in which so many bits from bit `position` lie."""
        return [self.units[k] for k in range(position // self.unit_bits, (position + bits - 1) // self.unit_bits + 1)]

    def pattern(self, position, bits):
        """So many bits of the register from bit `position`. Raises gdb.error where they cannot be read."""
        units = sum(int(unit) << self.unit_bits * k for k, unit in enumerate(self.units_with(position, bits)))
        return units >> position % self.unit_bits & (1 << bits) - 1

    def lane(self, index):
        """What a lane shows: an int or float, to which gdb's own output formats apply, or a text."""
        pattern = self.pattern(index * self.share, self.bits)
        if self.kind == "w" or self.form.name == "hex":
            return hexadecimal(pattern, self.bits)
        if self.kind == "f" or self.form.name in ("float", "half"):
            return floating(pattern, self.bits)
        number = signed(pattern, self.bits) if self.kind == "i" else pattern
        return number if self.form.name == "decimal" else fixed_point(number, self.form.fraction_bits)

    def bit_string(self):
        pattern = self.pattern(0, self.count)
        if self.form.name == "hex":
            return hexadecimal(pattern, self.count)
        digits = f"{pattern:0{self.count}b}"[::-1]
        grouped = " ".join(digits[i:i + 8] for i in range(0, self.count, 8))
        return grouped if self.count == 1 else f"bits 0..{self.count - 1}: {grouped}"

    def form_to_tell(self):
        """The form, unless it is the one that goes without saying."""
        natural = self.form.name == "decimal" or self.kind == "w" or self.kind == "f" and self.form.name != "hex"
        return "" if natural else self.form.name

    def to_string(self):
        try:
            return self.bit_string() if self.kind == "b" else self.lane_text()
        except gdb.error as error:
            return unreadable(error)

    def lane_text(self):
        lane, form = self.lane(0), self.form_to_tell()
        text = f"{lane:.9g}" if isinstance(lane, float) else str(lane)
        return text if form in ("", "hex") else f"{text} ({form})"


class Vector(Scalar):
    """A register of several lanes, which are its children."""

    def to_string(self):
        kind = {"i": f"int{self.bits}", "u": f"uint{self.bits}", "w": f"bits{self.bits}"}.get(self.kind) or FLOATS[self.bits][0]
        return f"{self.count} x {kind} {self.form_to_tell()}".rstrip()

    def children(self):
        for index in range(self.count):
            yield f"[{index}]", self.child(index)

    def child(self, index):
        """A lane as a value: gdb would show a text as an array of characters in an IDE."""
        try:
            lane = self.lane(index)
        except gdb.error:
            return next(filter(cannot_be_read, self.units_with(index * self.share, self.bits)))  # gdb says why
        if isinstance(lane, float):
            return gdb.Value(lane).cast(gdb.lookup_type("float"))
        if isinstance(lane, int):
            return lane
        pattern = self.pattern(index * self.share, self.bits)
        return gdb.Value(pattern.to_bytes(self.type.sizeof, "little"), LaneText.type_for(self.type))

    def display_hint(self):
        return "array"


class LaneText(Scalar):
    """A lane that shows a text: a register whose lane 0 it is. For it to be known among registers its type is
    one that no program has, a vector of them."""

    @staticmethod
    def type_for(register_type):
        return register_type.vector(0)

    @staticmethod
    def register_type(type_):
        return type_.target() if type_.code == gdb.TYPE_CODE_ARRAY and "vector_size" in str(type_) else None

    def to_string(self):
        return self.lane(0)


def cannot_be_read(unit):
    try:
        int(unit)
    except gdb.error:
        return True
    return False


def unreadable(error):
    return "<optimized out>" if "optimized out" in str(error) else f"<{error}>"


def lanes_of(type_, form):
    """Kind, bits and number of the lanes of a register type, as that form has them; None of another type."""
    name = re.match(r"(\w+)_space::\1_$", type_.strip_typedefs().unqualified().name or "")
    lanes = REGISTER_TYPES.get(name[1]) if name else None
    if lanes and name[1].endswith("pr") and form.part_bits():  # a word of the scalar core
        return "i", form.part_bits(), lanes[1] // form.part_bits()
    return lanes


def referenced(value):
    references = (gdb.TYPE_CODE_REF, gdb.TYPE_CODE_RVALUE_REF)
    return value.referenced_value() if value.type.strip_typedefs().code in references else value


class Printers(gdb.printing.PrettyPrinter):
    def __init__(self):
        super().__init__("kastarri")
        self.form = Form("decimal")

    def __call__(self, value):
        value = referenced(value)
        register_type = LaneText.register_type(value.type)
        lanes = lanes_of(register_type or value.type, self.form)
        if lanes is None:
            return None
        if register_type:
            return LaneText(value[0], *lanes, self.form)
        kind, _, count = lanes
        return (Scalar if kind == "b" or count == 1 else Vector)(value, *lanes, self.form)


PRINTERS = Printers()


class Format(gdb.Parameter):
    set_doc = "Set the form in which registers are shown."
    show_doc = "Show the form in which registers are shown."
    __doc__ = HELP

    def __init__(self):
        super().__init__("kastarri format", gdb.COMMAND_DATA, gdb.PARAM_STRING_NOESCAPE)
        self.value = PRINTERS.form.name

    def get_set_string(self):
        try:
            PRINTERS.form = Form(self.value.strip())
        finally:
            self.value = PRINTERS.form.name
        return ""

    def get_show_string(self, value):
        return f"Registers are shown in the form {value}."


class Kastarri(gdb.Command):
    __doc__ = f"""See registers of kastarri.
set kastarri format FORM is for all, kastarri print/FORM for one.

{HELP}"""

    def __init__(self):
        super().__init__("kastarri", gdb.COMMAND_DATA, gdb.COMPLETE_NONE, True)


class SetKastarri(gdb.Command):
    """Settings of the printers of kastarri."""

    def __init__(self):
        super().__init__("set kastarri", gdb.COMMAND_DATA, gdb.COMPLETE_NONE, True)


class ShowKastarri(gdb.Command):
    """Settings of the printers of kastarri."""

    def __init__(self):
        super().__init__("show kastarri", gdb.COMMAND_DATA, gdb.COMPLETE_NONE, True)

    def invoke(self, argument, from_tty):
        gdb.execute("show kastarri format", from_tty)


class Print(gdb.Command):
    __doc__ = f"""Print a register in a form of its own: kastarri print[/FORM] EXPRESSION

{HELP}"""

    def __init__(self):
        super().__init__("kastarri print", gdb.COMMAND_DATA, gdb.COMPLETE_EXPRESSION)

    def invoke(self, argument, from_tty):
        form, expression = re.match(r"\s*(?:/(\S*))?\s*(.*)$", argument).groups()
        if not expression:
            raise gdb.GdbError("Usage: kastarri print[/FORM] EXPRESSION")
        try:
            self.print(expression, PRINTERS.form if form is None else Form(form), form is not None)
        except gdb.error as error:
            raise gdb.GdbError(str(error))

    @staticmethod
    def print(expression, form, must_fit):
        value = referenced(gdb.parse_and_eval(expression))
        lanes = lanes_of(value.type, form)
        if lanes is None:
            raise gdb.GdbError(f"{expression} is of type {value.type}, which is not a register type.")
        kind, bits, _ = lanes
        if must_fit and not form.fits(kind, bits) and bits != PARTS.get(form.name):
            kinds = {"b": "bits", "w": "words without a number", "f": FLOATS.get(bits, ("",))[0] + " lanes"}
            raise gdb.GdbError(f"The form {form.name} does not fit {kinds.get(kind, f'lanes of {bits} bits')}.")
        usual = PRINTERS.form
        PRINTERS.form = form
        try:
            gdb.write(value.format_string() + "\n")
        finally:
            PRINTERS.form = usual


for command in (Kastarri, SetKastarri, ShowKastarri, Format, Print):
    command()


def register(objfile):
    """Has gdb use the printers for the types of `objfile`, or of every program if that is None."""
    gdb.printing.register_pretty_printer(objfile, PRINTERS, replace=True)
