"""Builds for both widths: every intrinsic gives the same bits, and the packages stand beside each other.

Run as: widths_test.py BUILD-32 BUILD-64 [BUILD...] (two build directories of the test presets, with all that these
build, and others, by clang or with sanitizers, that have the target kastarri_results).
"""

import filecmp
import glob
import os
import shutil
import sys
import tempfile
import unittest

TESTS = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
sys.path.insert(0, os.path.join(TESTS, "support"))
from commands import bits_of, output, run  # noqa: E402

CONSUMER = os.path.join(TESTS, "package", "consumer")
BUILDS = {"32": os.path.abspath(sys.argv[1]), "64": os.path.abspath(sys.argv[2])}
OTHERS = list(map(os.path.abspath, sys.argv[3:]))
ARCHITECTURES = {"32": "i386", "64": "amd64"}
TARGETS = ["avx512", "avx2", "sse2"]


class SameBits(unittest.TestCase):
    def results(self, build, library=None, header=""):
        """Name -> number, with the build's own library or another; None where the processor does not run its target."""
        environment = dict(os.environ, LD_LIBRARY_PATH=library) if library else None
        result = run(os.path.join(build, "tests", "kastarri_results"), env=environment)
        if result.returncode == 77:
            return None
        self.assertEqual(result.returncode, 0, result.stdout[-2000:])
        first, *lines = result.stdout.splitlines()
        self.assertIn(header, first)
        return dict(line.split() for line in lines)

    def test_every_intrinsic_gives_the_same_at_both_widths_on_every_target_and_in_every_build(self):
        first = None
        runs = [(build, os.path.join(build, "tests", "only", target), f"{target} {bits}")
                for target in TARGETS for bits, build in BUILDS.items()] + [(build,) for build in OTHERS]
        for build in runs:
            results = self.results(*build)
            if results is None:
                print(f"this processor does not run {build[-1]}", file=sys.stderr)
                continue
            first = first or results
            with self.subTest(build=build):
                self.assertEqual([name for name in first if first[name] != results.get(name)], [])
                self.assertEqual(set(results), set(first))
        self.assertGreater(len(first), 2500)
        self.assertGreater(len(set(first.values())), 2000, "most intrinsics are not the same as another")


class SideBySide(unittest.TestCase):
    """What both pairs of packages install, in one place."""

    @classmethod
    def setUpClass(cls):
        cls.directory = tempfile.mkdtemp()
        cls.addClassCleanup(shutil.rmtree, cls.directory)
        cls.usr = os.path.join(cls.directory, "both", "usr")
        for bits, build in BUILDS.items():
            packages, files = (os.path.join(cls.directory, kind + bits) for kind in ("packages", "files"))
            output("cpack", "--config", os.path.join(build, "CPackConfig.cmake"), "-B", packages)
            made = glob.glob(os.path.join(packages, f"*_{ARCHITECTURES[bits]}.deb"))
            assert len(made) == 2, made
            for package in made:
                output("dpkg-deb", "-x", package, files)
            shutil.copytree(files, os.path.dirname(cls.usr), symlinks=True, dirs_exist_ok=True)

    def path(self, *parts):
        return os.path.join(self.directory, self.id().rsplit(".", maxsplit=1)[1], *parts)

    def files(self, bits):
        root = os.path.join(self.directory, "files" + bits)
        return {os.path.relpath(os.path.join(path, name), root) for path, _, names in os.walk(root) for name in names}

    def test_what_packages_have_in_common_is_the_same(self):
        common = self.files("32") & self.files("64")
        for name in "usr/bin/kastarri-profile", "usr/include/kastarri.h", "usr/share/doc/kastarri/reference.html":
            self.assertIn(name, common)
        different = [name for name in sorted(common) if not filecmp.cmp(
            *(os.path.join(self.directory, "files" + bits, name) for bits in BUILDS), shallow=False)]
        self.assertEqual(different, [])

    def test_find_package_gives_the_library_of_the_programs_width(self):
        for flags, bits in ([], "64"), (["-DCMAKE_CXX_FLAGS=-m32"], "32"), (["-DKASTARRI_BITS=32"], "32"), (["-DKASTARRI_BITS=64"], "64"):
            for linkage in "shared", "static":
                with self.subTest(flags=flags, linkage=linkage):
                    build = self.path(linkage + "".join(flags))
                    output("cmake", "-S", CONSUMER, "-B", build, f"-DCMAKE_PREFIX_PATH={self.usr}", f"-DLINKAGE={linkage}", *flags)
                    output("cmake", "--build", build)
                    self.assertEqual(bits_of(os.path.join(build, "consumer")), int(bits))

    def test_pkg_config_gives_the_library_of_the_programs_width(self):
        # Where pkg-config looks on an amd64, and the one for i386 programs.
        for places, bits in (["lib/x86_64-linux-gnu", "lib"], "64"), (["lib/i386-linux-gnu"], "32"):
            with self.subTest(bits=bits):
                where = ":".join(os.path.join(self.usr, place, "pkgconfig") for place in places)
                flags = output("pkg-config", "--cflags", "--libs", "kastarri", env=dict(os.environ, PKG_CONFIG_LIBDIR=where))
                program = os.path.join(self.directory, "pkg_config" + bits)
                output("g++", os.path.join(CONSUMER, "main.cpp"), "-o", program, *flags.split())
                self.assertEqual(bits_of(program), int(bits))
                library = os.path.join(self.usr, places[0])
                self.assertIn("255", output(program, env=dict(os.environ, LD_LIBRARY_PATH=library)).split())

    def test_one_profiler_counts_the_calls_of_programs_of_either_width(self):
        for bits, build in BUILDS.items():
            with self.subTest(bits=bits):
                program = os.path.join(build, "tests", "profile", "calls_lazy")
                self.assertEqual(bits_of(program), int(bits))
                self.assertIn("7 calls of 6 intrinsics",
                              output(os.path.join(self.usr, "bin", "kastarri-profile"), program, "results"))


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
