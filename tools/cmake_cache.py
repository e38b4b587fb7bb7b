"""The settings of a build directory."""

import json
import os
import re


def cached(build, name):
    """The value of a variable in CMake's cache; "" for one that is not there."""
    with open(os.path.join(build, "CMakeCache.txt"), encoding="utf-8") as file:
        found = re.search(rf"^{name}:\w+=(.*)$", file.read(), re.M)
    return found[1] if found else ""


def inlined(build):
    """How programs are compiled into which the static library is inlined: compiler, flags, link_flags and library. None
    where it is not built."""
    try:
        with open(os.path.join(build, "tests", "sequences", "inlined.json"), encoding="utf-8") as file:
            settings = json.load(file)
    except FileNotFoundError:
        return None
    return settings if os.path.exists(settings["library"]) else None
