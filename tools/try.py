#!/usr/bin/env python3
"""Build the library for the best target that this processor runs; test and time one intrinsic.

    tools/try.py NAME [--target TARGET]

NAME is ADDSNX16, say. What differs from it by a type or by a predicate alone (ADDSNX16U, ADDSNX16T) goes with it.
The build is in build/try and is kept: after a change of a table or a rule what depends on it is built again.
"""

import argparse
import os
import re
import subprocess
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import generate_headers  # noqa: E402
import processor  # noqa: E402

BUILD = os.path.join(ROOT, "build", "try")


def operation(name):
    """The name of a row's test: what stands behind the package, or all of it."""
    return name.partition("_ZRA_")[2] or name


def twins(name):
    """The rows of that name and those with a U or T more."""
    rows = [row.name for _, _, family in generate_headers.all_rows().values() for row in family]
    found = [row for row in rows if re.fullmatch(rf"(?:.*_)?{re.escape(name)}(?:_[HS])?U?T?", row)]
    if not found:
        sys.exit(f"no row has the name {name}: tables are listed in src/rows.def and src/scalar_rows.def")
    return found


def run(*command):
    subprocess.run(command, cwd=ROOT, check=True)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("name")
    parser.add_argument("--target", default=processor.best_target(), choices=processor.NEEDS)
    arguments = parser.parse_args()
    rows = twins(re.sub(r"^(ZRA|RK)_", "", arguments.name))
    run("cmake", "--preset", "try", "-DKASTARRI_TARGETS=" + arguments.target)
    run("cmake", "--build", "--parallel", "--preset", "try", "--target", "kastarri_tests", "kastarri_bench")
    tests = subprocess.run([os.path.join(BUILD, "tests", "kastarri_tests"),
                            "--gtest_filter=" + ":".join(f"*.{operation(row)}" for row in rows)], check=False)
    if tests.returncode == 0:
        run("tools/performance.py", BUILD, "--filter", "^(" + "|".join(rows) + ")(/.*)?$")
    return tests.returncode


if __name__ == "__main__":
    try:
        sys.exit(main())
    except subprocess.CalledProcessError as error:
        sys.exit(error.returncode)
