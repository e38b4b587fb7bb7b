#!/usr/bin/env python3
"""Write what kastarri-call knows of each intrinsic, from its row.

    tools/call/data.py OUTPUT
"""

import json
import os
import sys

HERE = os.path.dirname(os.path.abspath(__file__))
TOOLS = os.path.dirname(HERE)
sys.path[:0] = [TOOLS, os.path.join(TOOLS, "reference")]
import choices  # noqa: E402
import entries  # noqa: E402
import generate_headers  # noqa: E402
import not_built  # noqa: E402
import words  # noqa: E402


def lanes(operand):
    """Kind, bits and number of the lanes, and bytes, of a register or of a number of the host."""
    if operand.register:
        return [*operand.register.lanes, operand.bytes]
    kind = "f" if operand.type == "float" else "b" if operand.type == "bool" else "u" if "unsigned" in operand.type else "i"
    return [kind, 1 if kind == "b" else 8 * operand.bytes, 1, operand.bytes]


def part(operand):
    """What an operand is in a call: given, changed, written, memory, or ignored."""
    if operand.in_memory:
        return "memory"
    if operand.role in ("written", "result"):
        return "changed" if operand.keeps else "written"
    return "given" if operand.name else "ignored"


def entry_data(entry):
    operation, attributes = words.words_of(entry)
    types = " ".join(o.type for o in entry.operands)
    rules = " ".join([entry.rule, *entry.context, generate_headers.FAMILIES[entry.family]])
    prototype = entry.row.prototype.replace(entry.symbol, entry.short).replace(generate_headers.PREFIX, "")
    return {"name": entry.short, "row": entry.row.name, "prototype": prototype, "rule": entry.rule,
            "id": entry.id, "operands": [[o.name, o.type, part(o), *lanes(o)] for o in entry.operands],
            "words": [operation, f"{attributes} {types}", rules], "plainness": round(words.plainness(entry), 2)}


def main():
    found = [entry_data(entry) for entry in entries.read_entries(choices.read_choices())]
    topics = [{"title": t.title, "why": t.why, "instead": t.instead, "words": t.words} for t in not_built.TOPICS]
    with open(sys.argv[1], "w", encoding="utf-8") as file:
        json.dump({"prefix": generate_headers.PREFIX, "entries": found, "topics": topics}, file, separators=(",", ":"))


if __name__ == "__main__":
    main()
