"""What the tests of installations and packages share: the build, from sys.argv, and its settings."""

import os
import shutil
import sys
import tempfile
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tests", "support")]
import processor  # noqa: E402
from cmake_cache import cached  # noqa: E402
from commands import output, run  # noqa: E402

BUILD = os.path.abspath(sys.argv.pop(1))
RELEASE = os.path.abspath(sys.argv.pop(1)) if os.path.isdir("".join(sys.argv[1:2])) else None

VERSION = cached(BUILD, "CMAKE_PROJECT_VERSION")
COMPILER = cached(BUILD, "CMAKE_CXX_COMPILER")  # what it built others link, but for the static library of clang
CLANG = "clang" in os.path.basename(COMPILER)
STATIC_TARGET = cached(BUILD, "KASTARRI_STATIC_TARGET")
BITS = cached(BUILD, "KASTARRI_BITS")
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
