#!/usr/bin/env python3
"""Write the reference of all intrinsics as one page that needs nothing else.

    tools/reference/build.py EXAMPLES OUTPUT [--version VERSION]

EXAMPLES is what kastarri_examples prints. All else comes from the tables of rows, docs/choices.md and bench/costs.csv.
"""

import argparse
import csv
import json
import os
import re
import sys

HERE = os.path.dirname(os.path.abspath(__file__))
sys.path.insert(0, os.path.dirname(HERE))
sys.path.insert(0, HERE)
import choices  # noqa: E402
import entries  # noqa: E402
import generate_headers  # noqa: E402
import not_built  # noqa: E402
import twins  # noqa: E402
import words  # noqa: E402

FLAG_NAMES = ["inexact", "underflow", "overflow", "division-by-zero", "invalid"]

# States that are shown before a call where a rule speaks of them.
STATES = {"SAR": r"\bSAR\b", "EXPSTATE": r"exported state", "RoundMode": r"\bRoundMode\b", "PRID": r"processor's number"}


class Texts:
    """Texts that many entries share, each kept once."""

    def __init__(self):
        self.numbers = {}

    def __call__(self, text):
        return None if text is None else self.numbers.setdefault(text, len(self.numbers))

    def all(self):
        return list(self.numbers)


def flags_text(values):
    """StickyFlags in words: "1 0 20" as "inexact none overflow+invalid"."""
    def words(value):
        return "+".join(name for bit, name in enumerate(FLAG_NAMES) if value >> bit & 1) or "none"
    return " ".join(words(int(value)) for value in values.split())


def coefficients(entry, operand, value):
    """A word of coefficients as what it holds: 0x0403fffe is s1 = 1027, s0 = -2."""
    bits = 16 if "XR16" in entry.id else 8
    unsigned = re.match(r"MUL(UU|SU)|.*R8UX", entry.id)
    word, parts = int(value, 16), []
    for i in reversed(range(32 // bits)):
        part = word >> bits * i & (1 << bits) - 1
        parts.append(f"{operand.name}{i} = {part if unsigned or part < 1 << bits - 1 else part - (1 << bits)}")
    return f"{', '.join(parts)} ({value})".replace(" ", "\N{NO-BREAK SPACE}")


def example_data(example, initial, entry, text):
    """What goes in and what comes out, without what only stays as it is."""
    given, got = example["in"], example["out"]
    rule = " ".join([entry.rule] + entry.context)
    words_of_coefficients = {o.name: o for o in entry.operands if o.type == "qv_int32pr" and entry.family == "multiply"}
    given = [[name, coefficients(entry, words_of_coefficients[name], values) if name in words_of_coefficients else values]
             for name, values in given]
    given = given + [[name, str(initial[name])] for name, pattern in STATES.items() if re.search(pattern, rule)]
    before = dict(map(tuple, given))
    got = [[name, flags_text(values) if name == "StickyFlags" else values] for name, values in got
           if not (name == "memory" and before.get(name) == values)]
    return [example["calls"]] + [[number for name, values in table for number in (text(name), text(values))]
                                 for table in (given, got)]


def read_costs():
    """What they are and where they were measured, the targets, and their cycles by intrinsic."""
    with open(os.path.join(os.path.dirname(os.path.dirname(HERE)), "bench", "costs.csv"), encoding="utf-8") as file:
        about = file.readline().strip("# \n")
        (_, *targets), *rows = csv.reader(file)
    return about, targets, {name: cycles for name, *cycles in rows}


def entry_data(entry, examples, cycles, text):
    """An entry as the page reads it (page.js names the columns); $ stands for the prefix of all names."""
    row = entry.row
    prototype = row.prototype.replace(generate_headers.PREFIX, "$")
    operands = [number for o in entry.operands
                for number in (text(o.name), text(o.type), text(o.access), text(o.shape))]
    stem, axes = twins.axes_of(entry)
    return [entry.short, entry.symbol.replace(generate_headers.PREFIX, "$"), list(generate_headers.FAMILIES).index(entry.family),
            text(row.table), text(entry.rule), [text(t) for t in entry.context], prototype, operands, entry.lane_bits,
            entry.register_bits, int(entry.predicated), entry.facts, text(entry.alignment),
            entry.choices, example_data(examples["examples"][row.name], examples["initial"], entry, text),
            [text(w) for w in words.words_of(entry)], round(100 * words.plainness(entry)), [text(t) for t in [stem, *axes]],
            " ".join(cycles.get(entry.short, []))]


def topic_data(topic):
    return {**topic._asdict(), "names": not_built.patterns(topic)}


def page_data(examples, version):
    text = Texts()
    all_choices = choices.read_choices()
    found = entries.read_entries(all_choices)
    about_cycles, targets, cycles = read_costs()
    rows = [entry_data(entry, examples, cycles, text) for entry in found]
    tables = {text(table): generate_headers.about_table(table) for table in dict.fromkeys(entry.row.table for entry in found)}
    return {"version": version, "prefix": generate_headers.PREFIX, "families": list(generate_headers.FAMILIES.items()),
            "choices": [choice.text for choice in all_choices], "topics": [topic_data(topic) for topic in not_built.TOPICS],
            "tables": tables, "cycles": about_cycles, "targets": targets,
            "types": {name: [type.shape, type.units * type.unit_bits // 8, type.meaning]
                      for name, type in generate_headers.read_types().items()},
            "texts": text.all(), "entries": rows}


def read(name):
    with open(os.path.join(HERE, name), encoding="utf-8") as file:
        return file.read()


def page(data):
    # A script may hold anything but its own end tag.
    json_text = json.dumps(data, ensure_ascii=False, separators=(",", ":")).replace("</", "<\\/")
    parts = {"style": read("page.css"), "script": "\n".join(map(read, ["search.js", "entry.js", "page.js"])),
             "start": read("start.html"), "data": json_text, "version": data["version"], "count": f"{len(data['entries']):,}"}
    return re.sub(r"\{\{(\w+)\}\}", lambda match: parts[match[1]], read("page.html"))


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("examples")
    parser.add_argument("output")
    parser.add_argument("--version", default="")
    arguments = parser.parse_args()
    with open(arguments.examples, encoding="utf-8") as file:
        data = page_data(json.load(file), arguments.version)
    with open(arguments.output, "w", encoding="utf-8") as file:
        file.write(page(data))


if __name__ == "__main__":
    main()
