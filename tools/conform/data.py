#!/usr/bin/env python3
"""Write what kastarri-conform knows: the intrinsics with their prototypes in the core's words, the register types, and
the choices with the intrinsics that they touch.

    tools/conform/data.py OUTPUT
"""

import json
import os
import re
import sys

TOOLS = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
sys.path[:0] = [TOOLS, os.path.join(TOOLS, "reference")]
import choices  # noqa: E402
import entries  # noqa: E402
import generate_headers  # noqa: E402


def prototype(row):
    """As the core's own sources would have it: int ZRA_X(const qv_int8& a)."""
    name = generate_headers.short_name(row.name)
    text = re.sub(rf"\b{generate_headers.symbol(row.name)}\b", name, row.prototype)
    return text.replace(generate_headers.PREFIX, "")


def intrinsic(family, row):
    return {
        "name": generate_headers.short_name(row.name),
        "family": family,
        "table": row.table,
        "prototype": prototype(row),
        "tests_alignment": "aligned" in row.shape or row.table == "scalar/access.def",
    }


def type_data(register):
    kind, bits, lanes = register.lanes
    return {"kind": kind, "bits": bits, "lanes": lanes, "bytes": register.units * register.unit_bits // 8}


def main():
    families = generate_headers.all_rows()
    rows = [(family, row) for family, (_, _, rows) in families.items() for row in rows]
    data = {
        "families": {family: title for family, (title, _, _) in families.items()},
        "intrinsics": [intrinsic(family, row) for family, row in rows],
        "types": {name: type_data(register) for name, register in generate_headers.read_types().items()},
        "choices": [{"family": choice.family, "text": choice.text,
                     "names": [generate_headers.short_name(row.name) for family, row in rows
                               if family == choice.family and choice.names(entries.operation(row.name))]}
                    for choice in choices.read_choices()],
    }
    with open(sys.argv[1], "w", encoding="utf-8") as file:
        json.dump(data, file, indent=0)


if __name__ == "__main__":
    main()
