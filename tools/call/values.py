"""What people write for operands, as the bytes of registers.

    5  -3  0x7fff  1.5  q15:0.25      one number: all lanes; of a Q format with the bits of its fraction
    1,2,3                             lanes from the first on, over and over
    ramp  ramp:10  ramp:10:-2         0 1 2 ...; from 10 on; in steps of -2
    corners                           the lowest, the highest, -1, 0, 1 and over again
    random  random:7                  any lanes; others for another number
    all  none  first:5  10110         predicates: their bits from the first on
"""

import random
import re
import struct

FRACTIONS = {16: 10, 32: 23}  # bits of the fraction of a float


class Wrong(Exception):
    """What was written is no value of the type."""


class Lanes:
    """How the lanes of a type lie: kind, bits and number, and the bytes of all."""

    def __init__(self, kind, bits, count, size):
        self.kind, self.bits, self.count, self.size = kind, bits, count, size

    @property
    def lowest(self):
        return -(1 << (self.bits - 1)) if self.kind == "i" else 0

    @property
    def highest(self):
        return (1 << (self.bits - (self.kind == "i"))) - 1

    def number(self, text):
        """The bits of a lane."""
        fixed = re.fullmatch(r"q(\d{1,2}):(.+)", text)
        if self.kind == "f" and not fixed:
            return self.float_bits(text)
        try:
            value = round(float(fixed[2]) * 2**int(fixed[1])) if fixed else int(text, 0)
        except (ValueError, OverflowError):
            raise Wrong(f"'{text}' is no number") from None
        is_pattern = text.startswith("0x")
        if not (self.lowest <= value <= self.highest or is_pattern and 0 <= value < 1 << self.bits):
            raise Wrong(f"{text} is not from {self.lowest} to {self.highest}")
        return value

    def float_bits(self, text):
        if text.startswith("0x"):
            value = int(text, 16)
            if value >> self.bits:
                raise Wrong(f"{text} has more than {self.bits} bits")
            return value
        try:
            packed = struct.pack("<e" if self.bits == 16 else "<f", float(text))
        except ValueError:
            raise Wrong(f"'{text}' is no number") from None
        except OverflowError:
            packed = struct.pack("<e" if self.bits == 16 else "<f", float("-inf" if text.startswith("-") else "inf"))
        return int.from_bytes(packed, "little")

    def corners(self):
        if self.kind == "f":  # zeros, one, the largest, the smallest, infinities, a quiet NaN
            fraction = FRACTIONS[self.bits]
            infinity = ((1 << (self.bits - 1 - fraction)) - 1) << fraction
            one, sign = (infinity >> (fraction + 1)) << fraction, 1 << (self.bits - 1)
            return [0, sign, one, sign | one, infinity - 1, 1, infinity, sign | infinity, infinity | 1 << (fraction - 1)]
        return [self.lowest, self.highest, -1 if self.kind == "i" else 2, 0, 1]

    def pattern(self, text):
        """The lanes of a pattern, or None."""
        name, *numbers = text.split(":")
        if name == "ramp" and len(numbers) <= 2:
            first, step = [*(self.parse_int(n) for n in numbers), *(0, 1)[len(numbers):]]
            ramp = [first + step * i for i in range(self.count)]
            return [self.number(repr(float(n)) if self.kind == "f" else str(n)) for n in ramp]
        if name == "corners" and not numbers:
            return self.corners()
        if name == "random" and len(numbers) <= 1:
            source = random.Random(self.parse_int(numbers[0]) if numbers else 0)
            return [source.getrandbits(self.bits) for _ in range(self.count)]
        return None

    @staticmethod
    def parse_int(text):
        try:
            return int(text, 0)
        except ValueError:
            raise Wrong(f"'{text}' is no whole number") from None

    def bits_of(self, text):
        """A predicate."""
        first = re.fullmatch(r"first:(\d+)", text)
        if first or text in ("all", "none"):
            enabled = int(first[1]) if first else self.count if text == "all" else 0
            return [int(i < enabled) for i in range(self.count)]
        bits = re.sub("[ ,_]", "", text)
        if not re.fullmatch("[01]+", bits) or len(bits) > self.count:
            raise Wrong(f"'{text}' is no predicate of {self.count} bits")
        return [int(bit) for bit in bits]

    def lanes(self, text):
        if self.kind == "b":
            found = self.pattern(text) if text.startswith("random") else self.bits_of(text)
        else:
            found = self.pattern(text) or [self.number(part) for part in re.split("[, ]+", text.strip())]
        if len(found) > self.count and text != "corners":
            raise Wrong(f"{len(found)} numbers for {self.count} lanes")
        return [found[i % len(found)] for i in range(self.count)]

    def image(self, text):
        lanes = self.lanes(text)
        if self.kind == "b":
            return sum(bit << i for i, bit in enumerate(lanes)).to_bytes(self.size, "little")
        return b"".join(self.lane(bits) for bits in lanes)

    def lane(self, bits):
        """Extended to its share of the register."""
        size = self.size // self.count
        bits %= 1 << self.bits
        if self.kind == "i" and bits > self.highest:
            bits -= 1 << self.bits
        return (bits % (1 << 8 * size)).to_bytes(size, "little")
