"""The settings of a build directory."""

import os
import re


def cached(build, name):
    """The value of a variable in CMake's cache; "" for one that is not there."""
    with open(os.path.join(build, "CMakeCache.txt"), encoding="utf-8") as file:
        found = re.search(rf"^{name}:\w+=(.*)$", file.read(), re.M)
    return found[1] if found else ""
