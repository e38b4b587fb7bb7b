#!/usr/bin/env python3
"""List the intrinsics of a built library for kastarri-profile.

    tools/list_intrinsics.py LIBRARY DIRECTORY

writes DIRECTORY/intrinsics.inc, INTRINSIC(index, symbol as the linker knows it) for each, and
DIRECTORY/intrinsics.csv, name and family of each in the same order. Names and families are those of the rows.
"""

import csv
import os
import re
import subprocess
import sys

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import generate_headers  # noqa: E402


def linker_names(library):
    """Symbol as the sources know it -> as the linker does, with the arguments that C++ encodes in it."""
    found = subprocess.run(["nm", "-D", "--defined-only", "--format=just-symbols", library],
                           capture_output=True, text=True, check=True).stdout
    functions = re.finditer(r"^_Z(\d+)(cstub_\w+)$", found, re.M)
    return {match[2][:int(match[1])]: match[0] for match in functions}


def main():
    library, directory = sys.argv[1:]
    names = linker_names(library)
    intrinsics = [(names[generate_headers.symbol(row[0])], generate_headers.short_name(row[0]), family)
                  for family, (_, _, rows) in generate_headers.all_rows().items() for row in rows]
    with open(os.path.join(directory, "intrinsics.inc"), "w", encoding="utf-8") as file:
        file.writelines(f"INTRINSIC({index}, {symbol})\n" for index, (symbol, *_) in enumerate(intrinsics))
    with open(os.path.join(directory, "intrinsics.csv"), "w", encoding="utf-8", newline="") as file:
        csv.writer(file, lineterminator="\n").writerows(intrinsic[1:] for intrinsic in intrinsics)


if __name__ == "__main__":
    main()
