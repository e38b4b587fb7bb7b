"""Whether a call from Python gives what a call from C++ gives: every intrinsic on the operands of its worked example.

Run as: worked_examples_test.py EXAMPLES, a program that prints the examples of all intrinsics.
"""

import inspect
import json
import re
import subprocess
import sys
import unittest

import numpy as np

import kastarri

HERE = 128  # where memory is accessed in a buffer
ROWS = json.loads(subprocess.run([sys.argv.pop(1)], capture_output=True, text=True, check=True).stdout)
EXAMPLES = {re.sub(r"^(rk_zra32_(ZRA_)?|rk_zran_)", "", name): example for name, example in ROWS["examples"].items()}


def example_of(name):
    """Scalar operations have lost their package in Python."""
    own = [EXAMPLES[key] for key in (name, name.removeprefix("RK_")) if key in EXAMPLES]
    return own[0] if own else next(e for key, e in EXAMPLES.items() if re.fullmatch(r"rk_[a-z]+_" + name.removeprefix("RK_"), key))


def described(name):
    """The types of operands, results and memory as the documentation has them."""
    text = getattr(kastarri, name).__doc__
    types = dict(re.findall(r"^ +(\w+): ([\w ]+) \(\w+", text, re.M))
    types.update(re.findall(r"^ +(memory): a buffer.*, of ([\w ]+);", text, re.M))
    returned = re.search(r"Returns (.*)\.$", text, re.M)[1]
    for part in returned.split("; "):
        match = re.match(r"(?:(\w+), )?([\w ]+) \(\w+", part)
        if match:
            types[match[1] or "result"] = match[2]
    return types


class Kind:
    """How a text of numbers becomes the values of a type."""

    def __init__(self, type_name):
        self.register = getattr(kastarri, type_name, None) if re.match("qv_|vbool|rk|valign", type_name) else None
        hosts = {"int": "int32", "unsigned": "uint32", "unsigned int": "uint32", "short": "int16", "unsigned short": "uint16",
                 "signed char": "int8", "char": "int8", "unsigned char": "uint8", "long long": "int64", "float": "float32"}
        self.dtype = self.register.dtype if self.register else np.dtype(hosts.get(type_name, type_name))
        self.lanes = self.register.lanes if self.register else 1

    def values(self, words):
        if words[0].startswith("0x"):
            data = b"".join(int(word, 16).to_bytes(len(word) // 2 - 1, "little") for word in words)
            shown = np.frombuffer(data, self.dtype)
        elif self.dtype == bool and self.lanes in (4, 8):  # booleans of the scalar core are shown as one number
            shown = np.array([int(words[0]) >> bit & 1 for bit in range(self.lanes)], bool)
        elif self.dtype.kind == "f":
            shown = np.array([float(word) for word in words], self.dtype)
        else:
            shown = np.array([int(word) for word in words]).astype(self.dtype)
        return shown

    def operand(self, words):
        shown = self.values(words)
        return shown[0] if self.lanes == 1 else np.resize(shown, self.lanes)  # lanes repeat behind those that are shown

    def to_memory(self, words):
        """The bytes of a register, or of as many elements as are shown."""
        alone = not self.register or self.register.count == 1
        shown = self.values(words) if alone else self.operand(words)
        if self.dtype == bool:
            return np.packbits(shown, bitorder="little")
        bits = self.register.bits if self.register else 0
        return shown.astype({24: np.int32, 48: np.int64}.get(bits, self.dtype)).view(np.uint8)

    def from_memory(self, data):
        if self.dtype == bool:
            return np.unpackbits(data, bitorder="little").astype(bool)
        bits = self.register.bits if self.register else 0
        return data.view({24: np.int32, 48: np.int64}.get(bits, self.dtype))


def same(expected, got):
    return np.array_equal(expected, got, equal_nan=expected.dtype.kind == "f")


class Events:
    """Handlers of all ports that tell what they do."""

    def __init__(self):
        self.told = {}
        ports = kastarri.ports
        ports.exported_state(lambda value: self.tell("the handler of the exported state is told", value))
        ports.input_queue(lambda: True, lambda: self.tell("the input queue gives", 41))
        ports.output_queue(lambda: True, lambda value: self.tell("the output queue takes", value))
        ports.imported_wire(lambda: self.tell("the wire has", 1234))

    def tell(self, event, value):
        self.told.setdefault(event, []).append(str(value))
        return value


class Example:
    """A worked example, called again."""

    def __init__(self, name):
        self.name, self.function, self.data = name, getattr(kastarri, name), example_of(name)
        self.given = {key: text.split() for key, text in self.data["in"]}
        self.types = described(name)
        self.memory = np.zeros(512, np.uint8)
        if "memory" in self.given:
            self.place = HERE + 64 * ("offset" in self.given)  # where lies what the example shows
            image = Kind(self.types["memory"]).to_memory(self.given["memory"])
            self.memory[self.place:self.place + len(image)] = image
        self.out, self.states, self.refused = {}, {}, []

    def call(self, events):
        for column in range(self.data["calls"]):
            initial = dict(ROWS["initial"])
            for state, value in initial.items():
                setattr(kastarri.state, state, value)
            events.told.clear()
            operands = [self.operand(name, column) for name in inspect.signature(self.function).parameters if name != "out"]
            try:
                results = self.function(*operands)
            except ValueError as error:  # the C++ function takes any immediate
                self.refused.append((column, str(error)))
                continue
            self.add(results, column)
            for state in initial:
                self.states.setdefault(state, {})[column] = getattr(kastarri.state, state)
            for event, told in events.told.items():
                self.states.setdefault(event, {})[column] = told[-1]

    def operand(self, name, column):
        if name == "memory":
            return self.memory[self.place:] if "offsets" in self.given else self.memory
        if name == "offset":
            return self.place
        words = self.given.get(name.rstrip("_"))
        if self.data["calls"] > 1:
            words = words[column:column + 1]
        if name not in self.types:
            return int(words[0])  # an immediate
        return Kind(self.types[name]).operand(words)

    def add(self, results, column):
        names = ["pointer" if part.startswith("offset behind") else part.split(",")[0] if re.match(r"\w+, ", part) else "result"
                 for part in re.search(r"Returns (.*)\.$", self.function.__doc__, re.M)[1].split("; ")]
        for name, value in zip(names, results if isinstance(results, tuple) else (results,)):
            if name == "pointer":
                self.states["pointer"] = {column: f"+{value - self.place}"}
            elif value is not None:
                self.out.setdefault(name, {})[column] = value


class WorkedExamples(unittest.TestCase):
    def test_every_intrinsic(self):
        events, compared, refused = Events(), 0, 0
        for name in kastarri.intrinsics:
            example = Example(name)
            example.call(events)
            refused += len(example.refused)
            self.assertTrue(all("immediate is from" in error for _, error in example.refused), example.refused)
            for key, text in example.data["out"]:
                compared += self.compare(example, key, text.split())
        self.assertGreater(compared, len(kastarri.intrinsics))
        self.assertLess(refused, 400)

    def compare(self, example, key, words):
        """1 if something was there to compare."""
        name, _, first = key.partition("@")
        first = int(first or 0)
        if name == "memory":
            kind = Kind(example.types["memory"])
            expected = kind.values(words)
            self.expect(example, name, expected, kind.from_memory(example.memory[example.place:])[first:][:len(expected)])
            return 1
        columns = range(example.data["calls"])
        if len(columns) > 1:
            refused = [column for column, _ in example.refused]
            columns = [column for column in columns if column not in refused]
            words = [words[column] for column in columns]
        if name in example.states:
            self.assertEqual([str(example.states[name][column]) for column in columns], words, example.name)
            return 1
        self.assertIn(name, example.out, example.name)
        if not words:
            return 0
        kind, got = Kind(example.types[name]), example.out[name]
        if example.data["calls"] == 1:
            expected = kind.values(words)
            self.expect(example, name, expected, np.atleast_1d(got[0])[first:][:len(expected)])
        else:
            self.expect(example, name, np.stack([kind.values([word]).reshape(np.shape(got[c])) for c, word in zip(columns, words)]),
                        np.stack([got[column] for column in columns]))
        return 1

    def expect(self, example, name, expected, found):
        self.assertTrue(same(expected, found), f"{example.name}: {name} = {found}, not {expected}")


if __name__ == "__main__":
    unittest.main()
