#!/usr/bin/env python3
"""Write what kastarri-port knows: the names of intrinsics and types, and what is not built.

    tools/port_data.py OUTPUT
"""

import json
import os
import sys

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import generate_headers  # noqa: E402
import not_built  # noqa: E402


def main():
    rows = [row for _, _, rows in generate_headers.all_rows().values() for row in rows]
    data = {
        "prefix": generate_headers.PREFIX,
        "intrinsics": [[generate_headers.short_name(row.name), generate_headers.symbol(row.name)] for row in rows],
        "types": list(generate_headers.read_types()),
        "topics": [{"title": topic.title, "why": topic.why, "instead": topic.instead, "names": not_built.patterns(topic)}
                   for topic in not_built.TOPICS],
    }
    with open(sys.argv[1], "w", encoding="utf-8") as file:
        json.dump(data, file, indent=0)


if __name__ == "__main__":
    main()
