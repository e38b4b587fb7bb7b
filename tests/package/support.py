"""What the tests of installations and packages share: the build, from sys.argv, and its settings."""

import os
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
BUILD = os.path.abspath(sys.argv.pop(1))
RELEASE = os.path.abspath(sys.argv.pop(1)) if os.path.isdir("".join(sys.argv[1:2])) else None


def run(*command, **options):
    return subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False, **options)


def output(*command, **options):
    result = run(*command, **options)
    if result.returncode != 0:
        raise AssertionError(" ".join(command) + "\n" + result.stdout)
    return result.stdout


def cached(name):
    with open(os.path.join(BUILD, "CMakeCache.txt"), encoding="utf-8") as cache:
        return re.search(rf"^{name}:\w+=(.*)$", cache.read(), re.M)[1]


VERSION = cached("CMAKE_PROJECT_VERSION")
COMPILER = cached("CMAKE_CXX_COMPILER")  # what it built others link, but for the static library of clang
CLANG = "clang" in os.path.basename(COMPILER)
STATIC_TARGET = cached("KASTARRI_STATIC_TARGET")
BITS = cached("KASTARRI_BITS")
OTHER = {"32": "64", "64": "32"}[BITS]


class Directory(unittest.TestCase):
    """Tests with a temporary directory for the class, and one in it for each test."""

    @classmethod
    def setUpClass(cls):
        cls.shared = tempfile.mkdtemp()
        cls.addClassCleanup(shutil.rmtree, cls.shared)

    def setUp(self):
        self.directory = tempfile.mkdtemp(dir=self.shared)

    def path(self, *parts):
        return os.path.join(self.directory, *parts)
