"""Builds the package with CMake, from the source tree around this directory, and puts it into a wheel.

KASTARRI_BUILD names a build directory with KASTARRI_BUILD_PYTHON to take it from instead.
"""

import os
import pathlib
import re
import subprocess
import sys

from setuptools import Distribution, setup
from setuptools.command.build_py import build_py

ROOT = pathlib.Path(__file__).resolve().parent.parent


if not (ROOT / "CMakeLists.txt").exists():
    sys.exit("kastarri is built from its whole source tree, of which a source distribution has but a part: make wheels there")


def version():
    header = (ROOT / "include" / "kastarri" / "library.h").read_text(encoding="utf-8")
    return ".".join(re.findall(r"^#define KASTARRI_VERSION_[A-Z]+ (\d+)$", header, re.M))


def built():
    """A build directory with the package built."""
    directory = os.environ.get("KASTARRI_BUILD") or str(ROOT / "build" / "python")
    if "KASTARRI_BUILD" not in os.environ:
        options = ["-DCMAKE_BUILD_TYPE=Release", "-DKASTARRI_BITS=64", "-DKASTARRI_BUILD_PYTHON=ON", "-DKASTARRI_BUILD_TESTS=OFF",
                   "-DKASTARRI_BUILD_EXAMPLES=OFF", f"-DKASTARRI_PYTHON={sys.executable}"]
        subprocess.run(["cmake", "-S", ROOT, "-B", directory, *options], check=True)
    subprocess.run(["cmake", "--build", directory, "--parallel", "--target", "kastarri_python"], check=True)
    return directory


class Build(build_py):
    def run(self):
        subprocess.run(["cmake", "--install", built(), "--component", "python", "--prefix", os.path.abspath(self.build_lib)],
                       check=True)


class Compiled(Distribution):
    """With a compiled part, for the name of the wheel."""

    def has_ext_modules(self):
        return True


# What setuptools makes on the way goes where the build goes.
SCRATCH = ROOT / "build" / "wheel"
SCRATCH.mkdir(parents=True, exist_ok=True)
setup(version=version(), cmdclass={"build_py": Build}, distclass=Compiled,
      options={"build": {"build_base": str(SCRATCH)}, "egg_info": {"egg_base": str(SCRATCH)},
               "bdist_wheel": {"bdist_dir": str(SCRATCH / "files")}})
