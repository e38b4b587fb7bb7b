#!/usr/bin/env python3
"""Write what the Python package has of each intrinsic, from its row.

    python/generate.py DIRECTORY

writes into DIRECTORY rows.inc, which the extension compiles into its table, and kastarri/intrinsics.py and .pyi, a
function for each intrinsic with its rule as the documentation.
"""

import keyword
import os
import re
import sys

HERE = os.path.dirname(os.path.abspath(__file__))
TOOLS = os.path.join(os.path.dirname(HERE), "tools")
sys.path[:0] = [TOOLS, os.path.join(TOOLS, "reference")]
import entries  # noqa: E402
import generate_headers  # noqa: E402
import rules  # noqa: E402

GENERATED = "# Generated from the tables of rows."
INT_MIN, INT_MAX = -2**31, 2**31 - 1

# The types of arrays: kind and bits of a lane -> name of NumPy. Lanes of 24 and 48 bits are numbers of 64.
DTYPES = {**{(k, b): f"{'u' if k == 'u' else ''}int{b}" for k in "iu" for b in (8, 16, 32, 64)},
          **{("i", 24): "int64", ("i", 48): "int64", ("f", 16): "float16", ("f", 32): "float32"}}


class Shown:
    """How values of a type look in Python."""

    def __init__(self, operand):
        if operand.register:
            kind, bits, self.lanes = operand.register.lanes
            if kind == "w":
                bits, self.lanes = 32, operand.bytes // 4
        else:
            kind = "f" if operand.type == "float" else "b" if operand.type == "bool" else "u" if "unsigned" in operand.type else "i"
            bits, self.lanes = 8 * operand.bytes, 1
        self.dtype = "bool" if kind == "b" else "uint32" if kind == "w" else DTYPES[kind, bits]
        self.text = self.dtype + (f", {self.lanes} lanes" if self.lanes > 1 else "")
        self.annotation = f'_Array[np.{self.dtype.replace("bool", "bool_")}]'


class Parameter:
    """A parameter of the prototype, or its result, with its part in a call from Python."""

    def __init__(self, row, operand, number):
        self.operand, self.name, self.numbers = operand, operand.name or f"ignored{number}", (0, 0)
        if keyword.iskeyword(self.name):
            self.name += "_"
        gathers = re.match("gather|scatter|increment", row.shape) is not None
        if operand.role == "result":
            self.role = "result"
        elif operand.in_memory:
            self.role = "moving" if operand.pointer else "memory"
        elif operand.role == "written":
            self.role = "kept" if operand.keeps else "written"
        elif not operand.name:
            self.role = "ignored"
        elif gathers and operand.name == "offsets":
            self.role = "offsets"
        elif gathers and operand.name == "p":
            # The upper half of the predicate governs what _H forms scatter.
            self.role, self.numbers = "enabled", (32 if row.name.endswith("_H") else 0, 0)
        elif operand.name == "offset":
            self.role = "offset"
        else:
            self.role = "immediate" if operand.type == "immediate" else "input"

    @property
    def arguments(self):
        """The arguments that it takes in Python, as (name, how it is described)."""
        if self.role in ("result", "written", "ignored"):
            return []
        if self.role == "memory":
            return [("memory", "memory")]
        if self.role == "moving":
            return [("memory", "memory"), ("offset", "offset")]
        return [(self.name, "immediate" if self.role == "immediate" else "offset" if self.role == "offset" else "array")]

    def initializer(self):
        return f'{{"{self.name}", Role::{self.role}, {self.numbers[0]}, {self.numbers[1]}}}'


def range_of(immediate, rule, lanes):
    """The immediates that a rule tells apart."""
    match = re.search(rf"\b(?:immediate|{immediate}) mod(?:ulo)? (\d+|the number of lanes)", rule)
    if not match:
        return INT_MIN, INT_MAX
    return 0, (lanes if match[1].startswith("the") else int(match[1])) - 1


class Intrinsic:
    def __init__(self, row, types, number):
        self.row, self.number, self.name = row, number, entries.operation(row.name)
        self.symbol = generate_headers.symbol(row.name)
        self.rule = rules.own(row, types)
        operands = entries.operands_of(row, types)
        self.parameters = [Parameter(row, operand, i) for i, operand in enumerate(operands)]
        lanes = max((Shown(o).lanes for o in operands), default=1)
        for p in self.parameters:
            if p.role == "immediate":
                p.numbers = range_of(p.name, self.rule, lanes)
            elif p.role in ("memory", "moving"):
                p.numbers = self.alignment(p.operand, operands), self.access(operands)

    def alignment(self, place, operands):
        """What an address has to be a multiple of, or the program would end."""
        text = entries.alignment(self.row, operands)
        return min(place.bytes, 4) if text.startswith("The address accessed is tested") else 1

    def access(self, operands):
        """Bits: 1 the access writes, 2 the address is rounded down."""
        writes = not any(o.role in ("written", "result") for o in operands)
        rounds = "rounded down" in entries.alignment(self.row, operands)
        return int(writes) + 2 * int(rounds)

    @property
    def divides(self):
        return "division fault" in self.row.doc

    @property
    def returned(self):
        """Names and types of what a call returns, the result first."""
        order = [p for p in self.parameters if p.role == "result"] + [p for p in self.parameters if p.role in ("written", "kept", "moving")]
        return [("offset" if p.role == "moving" else p.name, p) for p in order]

    def table_row(self):
        parameters = ", ".join(p.initializer() for p in self.parameters)
        return f'ROW({self.symbol}, "{self.name}", {str(self.divides).lower()}, {parameters})\n'

    def rule_in_python(self):
        """The rule, with errors where the core would end the program; operands that are tested lie where they have to."""
        rule = re.sub(r"\. The destination object[^.;]*?or the program ends", "", self.rule)
        rule = re.sub(r",? or the program ends", "", rule).replace("the host's division fault", "ArithmeticError")
        return rule.replace("\\", "\\\\")

    def documentation(self):
        rule = self.rule_in_python()
        lines = [rule[0].upper() + rule[1:] + ".", ""]
        for p in self.parameters:
            if p.role in ("memory", "moving"):
                size = p.operand.bytes
                lines.append(f"memory: a buffer{' that is written' if p.numbers[1] & 1 else ''}, of {p.operand.type}; "
                             + f"{size} byte{'s' * (size > 1)} an access"
                             + (f", at a multiple of {p.numbers[0]}" if p.numbers[0] > 1 else ""))
                if p.role == "moving":
                    lines.append("offset: bytes from the beginning of the buffer")
            elif p.role == "offset":
                lines.append("offset: bytes from the beginning of the buffer")
            elif p.role == "immediate":
                bounds = "" if p.numbers == (INT_MIN, INT_MAX) else f", {p.numbers[0]} to {p.numbers[1]}"
                lines.append(f"{p.name}: immediate{bounds}")
            elif p.arguments:
                lines.append(f"{p.name}: {p.operand.type} ({Shown(p.operand).text})")
        returned = [f"offset behind the access" if name == "offset" else
                    f"{'' if name == 'result' else name + ', '}{p.operand.type} ({Shown(p.operand).text})"
                    for name, p in self.returned]
        lines.append("Returns " + ("; ".join(returned) if returned else "nothing") + ".")
        return "\n".join("    " + line if line else "" for line in lines).strip()

    def definition(self):
        arguments = [name for p in self.parameters for name, _ in p.arguments]
        has_out = any(p.role != "moving" for _, p in self.returned)
        signature = ", ".join(arguments + (["*", "out=None"] if has_out else []))
        call = ", ".join([str(self.number), "out" if has_out else "None", *arguments])
        return f'def {self.name}({signature}):\n    """{self.documentation()}\n    """\n    return _call({call})\n'

    def stub(self):
        kinds = {"array": "_Operand", "memory": "_Buffer", "offset": "_Offset", "immediate": "int"}
        arguments = [f"{name}: {kinds[kind]}" for p in self.parameters for name, kind in p.arguments]
        returned = ["_Moved" if p.role == "moving" else Shown(p.operand).annotation for _, p in self.returned]
        result = "None" if not returned else returned[0] if len(returned) == 1 else f"tuple[{', '.join(returned)}]"
        outs = [annotation for annotation in returned if annotation != "_Moved"]
        if outs:
            arguments += ["*", f"out: {outs[0]} | None = ..."]
        return f"def {self.name}({', '.join(arguments)}) -> {result}: ...\n"


def write(path, *parts):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, "w", encoding="utf-8") as file:
        file.writelines(parts)


def states():
    """The state registers by their names: the number of their first word, and how many they are."""
    with open(os.path.join(generate_headers.ROOT, "include", "kastarri", "state.h"), encoding="utf-8") as file:
        block = re.search(r"_states \{(.*?)\n\}", file.read(), re.S)[1]
    found, at = {}, 0
    for name, count in re.findall(r"^  unsigned (\w+)(?:\[(\d)\])?;", block, re.M):
        found[name] = at, int(count or 1)
        at += int(count or 1)
    return found


def main():
    directory = sys.argv[1]
    types = generate_headers.read_types()
    rows = [row for _, _, rows in generate_headers.all_rows().values() for row in rows]
    intrinsics = [Intrinsic(row, types, number) for number, row in enumerate(rows)]
    write(os.path.join(directory, "rows.inc"), *(i.table_row() for i in intrinsics))
    meanings = [f'    "{t.name}": "{t.meaning}",\n' for t in types.values()]
    names = [f"    \"{i.name}\",\n" for i in intrinsics]
    write(os.path.join(directory, "kastarri", "intrinsics.py"),
          f'"""Every intrinsic of the core."""\n\n{GENERATED}\n\nfrom ._core import call as _call\n\n',
          "REGISTER_TYPES = {\n", *meanings, "}\n\n", f"STATES = {states()!r}\n\n",
          "__all__ = [\n", *names, "]\n\n\n", "\n\n".join(i.definition() for i in intrinsics))
    write(os.path.join(directory, "kastarri", "intrinsics.pyi"),
          f"{GENERATED}\nfrom typing import Any, Union\n\nimport numpy as np\nimport numpy.typing as npt\n\n",
          "from .registers import Register\n\n",
          "_Array = npt.NDArray\n_Operand = Union[npt.ArrayLike, Register]\n_Buffer = Any\n",
          "_Offset = Union[int, npt.NDArray[np.integer[Any]]]\n_Moved = Any\n\n",
          "REGISTER_TYPES: dict[str, str]\nSTATES: dict[str, tuple[int, int]]\n\n",
          *(i.stub() for i in intrinsics))
    write(os.path.join(directory, "kastarri", "__init__.pyi"),
          f"{GENERATED}\nfrom . import ports as ports\nfrom .intrinsics import *\n",
          "from .registers import Register as Register, RegisterType as RegisterType\nfrom .state import state as state\n\n",
          "__version__: str\nintrinsics: list[str]\n", *(f"{name}: RegisterType\n" for name in types))


if __name__ == "__main__":
    main()
