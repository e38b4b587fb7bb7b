"""The sources: as an archive, and within another project.

Run as: sources_test.py BUILD [RELEASE] [TEST...] (as package_test.py; with RELEASE the library is built to the end, which
takes minutes).
"""

import glob
import os
import re
import shutil
import sys
import tarfile
import unittest

from support import BITS, HERE, RELEASE, ROOT, VERSION, Directory, output


class Subproject(Directory):
    """Within another project there is the library and nothing else."""

    def configure(self, how, *arguments):
        with open(self.path("CMakeLists.txt"), "w", encoding="utf-8") as file:
            file.write(f"""cmake_minimum_required(VERSION 3.22)
                project(whole LANGUAGES CXX)
                {how}
                add_executable(whole {HERE}/consumer/main.cpp)
                target_link_libraries(whole PRIVATE kastarri::kastarri)""")
        shutil.rmtree(self.path("build"), ignore_errors=True)
        output("cmake", "-G", "Ninja", "-S", self.directory, "-B", self.path("build"), *arguments)
        return set(re.findall(r"^(?:.*/)?([\w.-]+): \w+$", output("ninja", "-C", self.path("build"), "-t", "targets", "all"), re.M))

    def rules(self):
        """All rules of installing."""
        text = ""
        for path in glob.glob(self.path("build", "**", "cmake_install.cmake"), recursive=True):
            with open(path, encoding="utf-8") as file:
                text += file.read()
        return "".join(re.findall(r"file\(INSTALL DESTINATION.*", text))

    def test_the_library_alone_is_built(self):
        added = f'add_subdirectory("{ROOT}" kastarri)'
        fetched = f'include(FetchContent)\nFetchContent_Declare(kastarri SOURCE_DIR "{ROOT}")\nFetchContent_MakeAvailable(kastarri)'
        for how, *arguments in ([added], [fetched, "-DCMAKE_CXX_FLAGS=-m32"], [added, f"-DKASTARRI_BITS={BITS}", "-DKASTARRI_INSTALL=ON"]):
            with self.subTest(how=how, arguments=arguments):
                targets = self.configure(how, *arguments)
                self.assertIn("libkastarri.so", targets)
                self.assertEqual({"kastarri_tests", "fir", "kastarri-port", "kastarri-profile", "kastarri_examples", "test"} & targets, set())
                self.assertEqual("libkastarri.so" in self.rules(), "-DKASTARRI_INSTALL=ON" in arguments)
                self.assertNotIn("kastarri-profile", self.rules())
                # What uses it is of one width with it, which is that of the project if nothing is said.
                main = glob.glob(os.path.join(HERE, "consumer", "main.cpp"))[0]
                output("ninja", "-C", self.path("build"), f"{main}^")
                width = BITS if len(arguments) > 1 else "32" if arguments else "64"
                objects = glob.glob(self.path("build", "CMakeFiles", "whole.dir", "**", "*.o"), recursive=True)
                self.assertRegex(output("readelf", "-h", *objects), f"ELF{width}")

    @unittest.skipIf(not RELEASE, "it takes minutes to build")
    def test_it_is_built(self):
        self.configure(f'add_subdirectory("{ROOT}" kastarri)', f"-DKASTARRI_BITS={BITS}", "-DKASTARRI_TARGETS=sse2")
        output("ninja", "-C", self.path("build"))
        self.assertEqual(output(self.path("build", "whole")).split(), [VERSION, VERSION, "sse2", "255"])


class Sources(Directory):
    def archive(self, tree):
        path = output(sys.executable, os.path.join(tree, "tools", "release.py"), "--sources", "--output", self.path("made")).split("\n")[-2]
        self.assertEqual(os.path.basename(path), f"kastarri-{VERSION}.tar.gz")
        return path

    def names(self, path):
        with tarfile.open(path) as archive:
            return {member.name for member in archive if not member.isdir()}

    def test_the_archive_is_a_tree_that_builds_without_git(self):
        first = self.archive(ROOT)
        names = self.names(first)
        shutil.unpack_archive(first, self.directory)
        tree = self.path(f"kastarri-{VERSION}")
        self.assertEqual(self.names(self.archive(tree)), names)
        output("cmake", "--preset", f"install{'' if BITS == '32' else '-64'}", cwd=tree)
        # What is made of all tables, and a source of each kind; the whole is built for a release.
        build = glob.glob(os.path.join(tree, "build", "*"))[0]
        output("ninja", "-C", build, "kastarri-port", "kastarri-port-man" if shutil.which("help2man") else "kastarri-port",
               *(os.path.join(tree, "src", source) + "^" for source in ("frame/library.cpp", "integer/logic.cpp")))


if __name__ == "__main__":
    unittest.main()
