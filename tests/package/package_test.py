"""What is installed and packaged: that other projects find it, build against it, and that all versions agree.

Run as: package_test.py BUILD [RELEASE] [TEST...] (a build directory whose libraries are built; archives and packages are
made from it, or are those of the directory RELEASE).
"""

import glob
import itertools
import os
import re
import shutil
import unittest

from support import (BITS, BUILD, CLANG, COMPILER, HERE, OTHER, RELEASE, ROOT, STATIC_TARGET, VERSION, Directory, cached, output,
                     processor, run)

ARCHITECTURE = {"32": "i386", "64": "amd64"}[BITS]
MULTIARCH = {"32": "lib/i386-linux-gnu", "64": "lib/x86_64-linux-gnu"}[BITS]  # where the test presets install libraries
# Where the files of CMake and pkg-config are found: those of 32 bits whatever a project says.
CMAKE_DIRECTORY = {"32": "lib", "64": MULTIARCH}[BITS] + "/cmake/kastarri"
PKGCONFIG_DIRECTORIES = {"32": ["lib/pkgconfig", MULTIARCH + "/pkgconfig"], "64": [MULTIARCH + "/pkgconfig"]}[BITS]


def cpack(generator, directory):
    """The files of a release or, without one, those that the build makes."""
    if not RELEASE:
        output("cpack", "--config", os.path.join(BUILD, "CPackConfig.cmake"), "-G", generator, "-B", directory)
    return RELEASE or directory


class Installed(Directory):
    """What projects do with a library below `prefix`, whose libraries are in `libraries`."""

    def environment(self, directory=PKGCONFIG_DIRECTORIES[0]):
        return dict(os.environ, PKG_CONFIG_PATH=os.path.join(self.prefix, directory))

    def configure(self, *arguments):
        shutil.rmtree(self.path("build"), ignore_errors=True)
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

    def check_use(self):
        """A program is built, run, profiled and looked at in gdb, and so is an example."""
        program = self.consumer("-DLINKAGE=shared", "-DCMAKE_BUILD_TYPE=Debug")
        self.check_answer(program)
        profile = run(os.path.join(self.prefix, "bin", "kastarri-profile"), "--callers", program)
        self.assertRegex(profile.stdout, r" ZRA_ADDNX16 +main \(main\.cpp\)\n")
        shown = run(*self.gdb(), "-ex", "break main.cpp:12", "-ex", "run", "-ex", "print a", program).stdout
        self.assertIn("$1 = 32 x int16 = {300, 300, ", shown)
        output("cmake", "-S", os.path.join(self.prefix, "share/doc/kastarri/examples"), "-B", self.path("examples"),
               f"-DCMAKE_PREFIX_PATH={self.prefix}", f"-DKASTARRI_BITS={BITS}", "-DCMAKE_BUILD_TYPE=Release")
        output("cmake", "--build", self.path("examples"), "--target", "threshold")
        output(self.path("examples", "threshold"), cwd=self.directory)

    def gdb(self):
        return ["gdb", "-nx", "-q", "-batch", "-ex", "set debuginfod enabled off", "-iex", f"add-auto-load-safe-path {self.libraries}"]


class Installation(Installed):
    """The installation is made in a staging directory, as packagers do, and moved: nothing in it may know where
    it was made."""

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        cls.prefix = os.path.join(cls.shared, "moved here")
        cls.manifest = cls.install(os.path.join(cls.shared, "staging"))
        shutil.move(os.path.join(cls.shared, "staging/opt/elsewhere"), cls.prefix)
        cls.libraries = os.path.join(cls.prefix, MULTIARCH)

    @staticmethod
    def install(staging):
        """What CMake says of it. Another test may install from the same build meanwhile."""
        while True:
            output("cmake", "--install", BUILD, "--prefix", "/opt/elsewhere", env=dict(os.environ, DESTDIR=staging))
            with open(os.path.join(BUILD, "install_manifest.txt"), encoding="utf-8") as file:
                manifest = file.read()
            if manifest.startswith("/opt/elsewhere/"):
                return manifest

    def test_what_is_installed_can_be_removed(self):
        # Beside it the library for the other width, with which it has the headers in common, and a user's file.
        builds = [self.path("build"), self.path("other")]
        headers = [line for line in self.manifest.split() if "/include/" in line]
        for build, manifest in zip(builds, (self.manifest, "\n".join(headers))):
            os.mkdir(build)
            with open(os.path.join(build, "install_manifest.txt"), "w", encoding="utf-8") as file:
                file.write(manifest)
        root = self.path("root", "opt", "elsewhere")
        shutil.copytree(self.prefix, root, symlinks=True)
        kept = os.path.join(root, "share", "doc", "kastarri", "notes")
        open(kept, "w", encoding="utf-8").close()
        script = ("-P", os.path.join(ROOT, "cmake", "uninstall.cmake"))
        environment = dict(os.environ, DESTDIR=self.path("root"))
        output("cmake", f"-DBUILD={builds[0]}", f"-DOTHERS={builds[1]};{self.path('none')}", *script, env=environment)
        left = {os.path.join(path, name) for path, _, files in os.walk(root) for name in files}
        self.assertEqual(left, {self.path("root") + header for header in headers} | {kept})
        self.assertFalse(os.path.exists(os.path.join(root, "lib", "kastarri")))
        output("cmake", f"-DBUILD={builds[1]}", f"-DOTHERS={builds[0]}", *script, env=environment)
        self.assertFalse(os.path.exists(os.path.join(root, "include", "kastarri")))
        self.assertIn("Nothing was installed", run("cmake", f"-DBUILD={builds[0]}", *script).stdout)

    def test_each_tool_tells_its_version_and_has_a_man_page(self):
        tools = os.listdir(os.path.join(self.prefix, "bin"))
        self.assertGreaterEqual(len(tools), 2)
        for tool in tools:
            with self.subTest(tool=tool):
                program = os.path.join(self.prefix, "bin", tool)
                self.assertEqual(output(program, "--version"), f"{tool} {VERSION}\n")
                if cached(BUILD, "KASTARRI_HELP2MAN").endswith("NOTFOUND") and "CI" not in os.environ:
                    continue
                with open(os.path.join(self.prefix, "share/man/man1", tool + ".1"), encoding="utf-8") as file:
                    page = re.sub(r"\\f[BIR]", "", file.read().replace("\\-", "-"))
                self.assertRegex(page, rf"(?m)^\.SH NAME\n{tool} - \w.*\w$")
                options = re.findall(r"^  (--\w+)", output(program, "--help"), re.M)
                self.assertIn("--version", options)
                self.assertEqual([option for option in options if option not in page], [])

    def test_documents_know_the_version(self):
        with open(os.path.join(ROOT, "CHANGELOG.md"), encoding="utf-8") as file:
            self.assertEqual(re.findall(r"^## \[(\d.*?)\] - \d{4}-\d\d-\d\d$", file.read(), re.M)[0], VERSION)
        with open(os.path.join(ROOT, "docs", "installing.md"), encoding="utf-8") as file:
            self.assertIn(f"find_package(kastarri {VERSION.rpartition('.')[0]} CONFIG", file.read())

    def test_the_links_between_documents_hold(self):
        """Where the document that is named is not one of the sources, which are not installed."""
        documents = os.path.join(self.prefix, "share", "doc", "kastarri")
        pages = glob.glob(os.path.join(documents, "**", "*.md"), recursive=True)
        self.assertGreater(len(pages), 10)
        for page in pages:
            with open(page, encoding="utf-8") as file:
                links = re.findall(r"\]\(((?:\.\./)*(?:docs/|examples/|pictures/)?[\w-]+\.(?:md|svg|png))", file.read())
            for link in links:
                self.assertTrue(os.path.exists(os.path.join(os.path.dirname(page), link)), f"{page}: {link}")

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
        if processor.runs(STATIC_TARGET):
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
                          " ".join(self.configure("-DCMAKE_CXX_FLAGS=-m32").stdout.split()))
        # Who says nothing may have the 32-bit library, and hears of it.
        told = "there is no library for 64-bit programs" in self.configure().stdout
        self.assertEqual(told, BITS == "32")

    def test_pkg_config_has_all_that_a_compiler_needs(self):
        modules = {"kastarri": True, "kastarri-static": processor.runs(STATIC_TARGET)}
        for module, directory, compiler in itertools.product(modules, PKGCONFIG_DIRECTORIES, ("g++", "clang++")):
            with self.subTest(module=module, directory=directory, compiler=compiler):
                if CLANG and module == "kastarri-static" and compiler == "g++":
                    continue  # it reads no bitcode
                environment = self.environment(directory)
                self.assertEqual(output("pkg-config", "--modversion", module, env=environment).strip(), VERSION)
                # The shell takes apart what pkg-config prints, spaces in the prefix being quoted.
                output("sh", "-c", f'eval "{compiler} -O2 \\"{HERE}/consumer/main.cpp\\" -o {self.path(module)} '
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


class Archive(Installed):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        name = f"kastarri-{VERSION}-linux-{ARCHITECTURE}"
        shutil.unpack_archive(os.path.join(cpack("TGZ", cls.shared), name + ".tar.gz"), cls.shared)
        cls.prefix = os.path.join(cls.shared, name)
        cls.libraries = os.path.dirname(glob.glob(os.path.join(cls.prefix, "lib", "**", "libkastarri.so"), recursive=True)[0])

    def test_it_serves_where_it_is_unpacked(self):
        self.check_use()


class DebianPackages(Installed):
    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        packages = cpack("DEB", cls.shared)
        major = VERSION.split(".", maxsplit=1)[0]
        cls.runtime_name = f"libkastarri{major}"
        cls.runtime = os.path.join(packages, f"{cls.runtime_name}_{VERSION}_{ARCHITECTURE}.deb")
        cls.devel = os.path.join(packages, f"libkastarri-dev_{VERSION}_{ARCHITECTURE}.deb")

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
        tools = glob.glob(os.path.join(BUILD, "lib", "**", "libkastarri-*.so"), recursive=True)
        self.assertEqual(len(tools), 2, "the profiler's and the checker's")
        for package, library in [(self.runtime, os.path.join(BUILD, "libkastarri.so")), *((self.devel, tool) for tool in tools)]:
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
                 "usr/bin/kastarri-port", "usr/bin/kastarri-call", f"usr/lib/kastarri/call/{BITS}/run",
                 "usr/bin/kastarri-check", "usr/share/kastarri/port.json",
                 "usr/bin/kastarri-conform", *(f"usr/share/kastarri/conform/{name}" for name in (
                     "conform.json", "comparison.py", "programs.py", "register_access.py", "runtime.cpp")), f"usr/{CMAKE_DIRECTORY}/kastarri-config.cmake",
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
    def test_packages_install_serve_and_leave_nothing(self):
        # A root of its own: no package is installed there, so dependencies are forced.
        root = os.path.realpath(self.path("root"))
        database = os.path.join(root, "var/lib/dpkg")
        os.makedirs(os.path.join(database, "info"))
        os.makedirs(os.path.join(database, "updates"))
        open(os.path.join(database, "status"), "w", encoding="utf-8").close()
        dpkg = ["dpkg", f"--root={root}", f"--log={self.path('log')}", "--force-depends"]
        output(*dpkg, "--add-architecture", ARCHITECTURE)
        output(*dpkg, "-i", self.runtime, self.devel)
        self.prefix = os.path.join(root, "usr")
        self.libraries = os.path.join(self.prefix, MULTIARCH)
        self.scripts = os.path.join(self.path("scripts"), root[1:])
        os.makedirs(os.path.dirname(self.scripts))
        os.symlink(os.path.join(self.prefix, "share/gdb/auto-load"), self.scripts)
        self.check_use()
        output(*dpkg, "-P", f"libkastarri-dev:{ARCHITECTURE}", f"{self.runtime_name}:{ARCHITECTURE}")
        left = [os.path.join(path, name) for path, _, files in os.walk(root) for name in files
                if not path.startswith(os.path.join(root, "var"))]
        self.assertEqual(left, [])

    def gdb(self):
        """It trusts the directory of scripts that is its own, where the library's lies under the full path of the library,
        here that of the root first."""
        scripts = self.path("scripts")
        return ["gdb", "-nx", "-q", "-batch", "-ex", "set debuginfod enabled off",
                "-iex", f"set auto-load scripts-directory {scripts}", "-iex", f"set auto-load safe-path {scripts}"]


if __name__ == "__main__":
    unittest.main()
