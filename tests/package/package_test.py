"""What is installed and packaged: that other projects find it, build against it, and that all versions agree.

Run as: package_test.py BUILD (a build directory whose libraries are built).
"""

import glob
import itertools
import os
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
BUILD = os.path.abspath(sys.argv[1])


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
ARCHITECTURE = {"32": "i386", "64": "amd64"}[BITS]
MULTIARCH = {"32": "lib/i386-linux-gnu", "64": "lib/x86_64-linux-gnu"}[BITS]  # where the test presets install libraries
# Where the files of CMake and pkg-config are found: those of 32 bits whatever a project says.
CMAKE_DIRECTORY = {"32": "lib", "64": MULTIARCH}[BITS] + "/cmake/kastarri"
PKGCONFIG_DIRECTORIES = {"32": ["lib/pkgconfig", MULTIARCH + "/pkgconfig"], "64": [MULTIARCH + "/pkgconfig"]}[BITS]


def processor_runs_static():
    with open("/proc/cpuinfo", encoding="utf-8") as file:
        flags = set(re.search(r"^flags\s*:(.*)$", file.read(), re.M)[1].split())
    return {"sse2": {"sse2"}, "avx2": {"avx2", "fma", "f16c"},
            "avx512": {"avx512f", "avx512bw", "avx512dq", "avx512vl"}}[STATIC_TARGET] <= flags


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


class Installation(Directory):
    """The installation is made in a staging directory, as packagers do, and moved: nothing in it may know where
    it was made."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        staging = os.path.join(cls.shared, "staging")
        output("cmake", "--install", BUILD, "--prefix", "/opt/elsewhere", env=dict(os.environ, DESTDIR=staging))
        cls.prefix = os.path.join(cls.shared, "moved here")
        shutil.move(os.path.join(staging, "opt", "elsewhere"), cls.prefix)
        cls.libraries = os.path.join(cls.prefix, MULTIARCH)

    def environment(self, directory=PKGCONFIG_DIRECTORIES[0]):
        return dict(os.environ, PKG_CONFIG_PATH=os.path.join(self.prefix, directory))

    def configure(self, *arguments):
        return run("cmake", "-S", os.path.join(HERE, "consumer"), "-B", self.path("build"),
                   "-DCMAKE_BUILD_TYPE=Release", f"-DCMAKE_PREFIX_PATH={self.prefix}", *arguments)

    def check_answer(self, program, **environment):
        answer = output(program, env=dict(os.environ, **environment)).split()
        self.assertEqual(answer[:2] + answer[3:], [VERSION, VERSION, "255"])
        return answer[2]

    def consumer(self, *arguments):
        configured = self.configure(*arguments)
        self.assertEqual(configured.returncode, 0, configured.stdout)
        output("cmake", "--build", self.path("build"))
        return self.path("build", "consumer")

    def test_a_project_links_the_shared_library(self):
        program = self.consumer("-DLINKAGE=shared", f"-DWANTED_VERSION={VERSION}")
        self.check_answer(program)
        self.assertIn("libkastarri.so.", output("readelf", "-d", program))

    def test_a_project_links_the_static_library(self):
        program = self.consumer("-DLINKAGE=static", f"-DCMAKE_CXX_COMPILER={COMPILER}")
        self.assertNotIn("libkastarri", output("readelf", "-d", program))
        calls = [line for line in output("objdump", "-d", "--no-show-raw-insn", program).splitlines()
                 if re.search(r"call .*ZRA_ADDNX16[^+]*$", line)]
        self.assertEqual(calls, [], "what is optimised when it is linked has the intrinsic inlined")
        if processor_runs_static():
            self.assertEqual(self.check_answer(program), STATIC_TARGET)

    def test_a_component_or_version_that_is_not_there_is_named(self):
        for arguments, message in [(["-DWANTED_COMPONENT=python"], "component 'python' is not there; installed: shared, static"),
                                   (["-DWANTED_VERSION=99.0"], f"version: {VERSION}")]:
            with self.subTest(arguments=arguments):
                configured = self.configure(*arguments)
                self.assertNotEqual(configured.returncode, 0)
                self.assertIn(message, " ".join(configured.stdout.split()))

    def test_a_compiler_that_makes_no_such_programs_is_refused(self):
        compiler = self.path("only_other")
        with open(compiler, "w", encoding="utf-8") as script:
            script.write(f'#!/bin/sh\nfor a; do test "$a" != -m{BITS} || exit 1; done\nexec g++ -m{OTHER} "$@"\n')
        os.chmod(compiler, 0o755)
        configured = self.configure(f"-DCMAKE_CXX_COMPILER={compiler}", f"-DKASTARRI_BITS={BITS}",
                                    f"-Dkastarri_DIR={os.path.join(self.prefix, CMAKE_DIRECTORY)}")
        self.assertNotEqual(configured.returncode, 0)
        self.assertIn(f"kastarri is a {BITS}-bit x86 library", configured.stdout)

    def test_a_project_of_the_other_width_is_told(self):
        configured = self.configure(f"-DKASTARRI_BITS={OTHER}")
        self.assertNotEqual(configured.returncode, 0)
        self.assertIn(f"version: {VERSION} for {BITS}-bit programs, not for those of this project",
                      " ".join(configured.stdout.split()))
        if OTHER == "32":  # CMake looks among libraries for 64 bits only where programs are
            self.assertIn("Could not find a package configuration file provided by \"kastarri\"",
                          " ".join(self.configure("-DCMAKE_CXX_FLAGS=-m32", "--fresh").stdout.split()))
        # Who says nothing may have the 32-bit library, and hears of it.
        told = "there is no library for 64-bit programs" in self.configure("--fresh").stdout
        self.assertEqual(told, BITS == "32")

    def test_pkg_config_has_all_that_a_compiler_needs(self):
        modules = {"kastarri": True, "kastarri-static": processor_runs_static()}
        for module, directory, compiler in itertools.product(modules, PKGCONFIG_DIRECTORIES, ("g++", "clang++")):
            with self.subTest(module=module, directory=directory, compiler=compiler):
                if CLANG and module == "kastarri-static" and compiler == "g++":
                    continue  # it reads no bitcode
                environment = self.environment(directory)
                self.assertEqual(output("pkg-config", "--modversion", module, env=environment).strip(), VERSION)
                # The shell takes apart what pkg-config prints, spaces in the prefix being quoted.
                output("sh", "-c", f'eval "{compiler} -O2 {HERE}/consumer/main.cpp -o {self.path(module)} '
                       f'$(pkg-config --cflags --libs {module})"', env=environment)
                if modules[module]:
                    self.check_answer(self.path(module), LD_LIBRARY_PATH=self.libraries)

    def test_both_ways_compile_for_sse2_and_nothing_that_one_compiler_lacks(self):
        self.configure("-DLINKAGE=shared", "-DCMAKE_EXPORT_COMPILE_COMMANDS=ON")
        with open(self.path("build", "compile_commands.json"), encoding="utf-8") as commands:
            flags = {"cmake": commands.read().split()}
        for module in "kastarri", "kastarri-static":
            flags[module] = output("pkg-config", "--cflags", module, env=self.environment()).split()
        for name, given in flags.items():
            with self.subTest(name=name):
                self.assertIn("-mfpmath=sse", given)
                self.assertTrue({"-msse2", "-mavx2", "-mavx512f"} & set(given))
                self.assertEqual([flag for flag in given if "-max=" in flag], [])

    def test_headers_say_which_programs_they_are_for(self):
        compiled = run("g++", "-mx32", "-fsyntax-only", "-I", os.path.join(self.prefix, "include"), "-x", "c++", "-",
                       input='#include "kastarri.h"\n')
        self.assertIn("compile with -m32 or -m64", compiled.stdout)

    def test_links_of_the_library(self):
        major = VERSION.split(".", maxsplit=1)[0]
        self.assertEqual(os.readlink(os.path.join(self.libraries, "libkastarri.so")), f"libkastarri.so.{major}")
        self.assertEqual(os.readlink(os.path.join(self.libraries, f"libkastarri.so.{major}")), f"libkastarri.so.{VERSION}")


class DebianPackages(Directory):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        output("cpack", "--config", os.path.join(BUILD, "CPackConfig.cmake"), "-B", cls.shared)
        major = VERSION.split(".", maxsplit=1)[0]
        cls.runtime_name = f"libkastarri{major}"
        cls.runtime = os.path.join(cls.shared, f"{cls.runtime_name}_{VERSION}_{ARCHITECTURE}.deb")
        cls.devel = os.path.join(cls.shared, f"libkastarri-dev_{VERSION}_{ARCHITECTURE}.deb")

    def fields(self, package, *names):
        return [output("dpkg-deb", "-f", package, name).strip() for name in names]

    def files(self, package):
        """Every file with its mode and owner."""
        listed = [line.split(maxsplit=5) for line in output("dpkg-deb", "-c", package).splitlines()]
        return {line[5].split(" -> ")[0].removeprefix("./"): (line[0], line[1]) for line in listed if line[0][0] != "d"}

    def test_what_packages_say_of_themselves(self):
        fields = ("Version", "Architecture", "Multi-Arch", "Section")
        self.assertEqual(self.fields(self.runtime, *fields), [VERSION, ARCHITECTURE, "same", "libs"])
        self.assertEqual(self.fields(self.devel, *fields), [VERSION, ARCHITECTURE, "same", "libdevel"])
        self.assertEqual(self.fields(self.devel, "Depends"), [f"{self.runtime_name} (= {VERSION}), libc6 (>= 2.34), python3:any"])
        for package in self.runtime, self.devel:
            synopsis, *rest = self.fields(package, "Description")[0].splitlines()
            self.assertTrue(synopsis and rest and len(synopsis) < 80)

    def test_the_libc_that_is_asked_for_has_what_the_libraries_use(self):
        number = lambda version: tuple(map(int, version))
        profiler, = glob.glob(os.path.join(BUILD, "lib", "**", "libkastarri-profile.so"), recursive=True)
        for package, library in (self.runtime, os.path.join(BUILD, "libkastarri.so")), (self.devel, profiler):
            depends = re.search(r"libc6 \(>= (\d+)\.(\d+)\)", self.fields(package, "Depends")[0])
            used = re.findall(r"GLIBC_(\d+)\.(\d+)", output("objdump", "-p", library))
            self.assertTrue(used)
            self.assertGreaterEqual(number(depends.groups()), max(map(number, used)))

    def test_files(self):
        runtime, devel = self.files(self.runtime), self.files(self.devel)
        documents = {package: {f"usr/share/doc/{package}/{file}" for file in ("copyright", "changelog.gz")}
                     for package in (self.runtime_name, "libkastarri-dev")}
        library = f"usr/{MULTIARCH}/libkastarri.so."
        major = VERSION.split(".", maxsplit=1)[0]
        self.assertEqual(set(runtime), {library + VERSION, library + major} | documents[self.runtime_name])
        headers = {"usr/include/" + os.path.relpath(path, os.path.join(ROOT, "include"))
                   for path in glob.glob(os.path.join(ROOT, "include", "**", "*.h"), recursive=True)}
        links = {f"usr/{MULTIARCH}/libkastarri.so", f"usr/{MULTIARCH}/libkastarri_static.a",
                 "usr/bin/kastarri-call", f"usr/lib/kastarri/call/{BITS}/run", "usr/bin/kastarri-port",
                 "usr/share/kastarri/port.json", f"usr/{CMAKE_DIRECTORY}/kastarri-config.cmake",
                 *(f"usr/{directory}/kastarri.pc" for directory in PKGCONFIG_DIRECTORIES)}
        self.assertEqual((headers | links | documents["libkastarri-dev"]) - set(devel), set(), "missing")
        self.assertEqual(set(runtime) & set(devel), set(), "in both packages")
        for name, (mode, owner) in {**runtime, **devel}.items():
            self.assertEqual(owner, "root/root", name)
            executable = name.startswith(("usr/bin/", "usr/lib/kastarri/call/"))
            self.assertIn(mode, {"lrwxrwxrwx", "-rwxr-xr-x" if executable else "-rw-r--r--"}, name)

    def test_library_is_stripped_and_announced_to_the_loader(self):
        output("dpkg-deb", "-R", self.runtime, self.path("runtime"))
        library = self.path("runtime", "usr", MULTIARCH, f"libkastarri.so.{VERSION}")
        self.assertNotIn(".symtab", output("readelf", "-SW", library))
        control = {}
        for name in os.listdir(self.path("runtime", "DEBIAN")):
            with open(self.path("runtime", "DEBIAN", name), encoding="utf-8") as file:
                control[name] = file.read()
        self.assertEqual(set(control), {"control", "md5sums", "shlibs", "triggers"}, "and no maintainer's scripts")
        self.assertIn("ldconfig", control["triggers"])
        soname = re.search(r"SONAME.*\[(\w+)\.so\.(\d+)\]", output("readelf", "-d", library))
        self.assertEqual(control["shlibs"].split()[:3], [*soname.groups(), self.runtime_name])

    @unittest.skipIf(os.getuid() != 0, "dpkg installs for root alone")
    def test_packages_install_and_leave_nothing(self):
        # A root of its own: no package is installed there, so dependencies are forced.
        root = self.path("root")
        database = os.path.join(root, "var/lib/dpkg")
        os.makedirs(os.path.join(database, "info"))
        os.makedirs(os.path.join(database, "updates"))
        open(os.path.join(database, "status"), "w", encoding="utf-8").close()
        dpkg = ["dpkg", f"--root={root}", f"--log={self.path('log')}", "--force-depends"]
        output(*dpkg, "--add-architecture", ARCHITECTURE)
        output(*dpkg, "-i", self.runtime, self.devel)
        self.assertTrue(os.path.exists(os.path.join(root, "usr", MULTIARCH, "libkastarri.so")))
        output(*dpkg, "-P", f"libkastarri-dev:{ARCHITECTURE}", f"{self.runtime_name}:{ARCHITECTURE}")
        left = [os.path.join(path, name) for path, _, files in os.walk(root) for name in files
                if not path.startswith(os.path.join(root, "var"))]
        self.assertEqual(left, [])


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
