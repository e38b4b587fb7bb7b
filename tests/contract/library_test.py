"""The contract of the built library and its headers: what is exported, what is needed, what compiles.

    library_test.py LIBRARY [--objects FILE...] [test...]    the library's object files; Headers, Documents.test_x, ...
"""

import argparse
import glob
import itertools
import os
import re
import subprocess
import sys
import tempfile
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tests", "support")]
import generate_headers  # noqa: E402
import processor  # noqa: E402
import rules  # noqa: E402
from commands import bits_of  # noqa: E402

COMPILERS = ["g++", "clang++"]
USER_FLAGS = ["-std=c++11", "-Wall", "-Wextra", "-Wpedantic", "-Wconversion", "-Wshadow", "-Werror",
              "-I", os.path.join(ROOT, "include")]

SYSTEM_HEADERS = """
    assert.h complex.h ctype.h errno.h fenv.h float.h inttypes.h iso646.h limits.h locale.h math.h setjmp.h signal.h stdalign.h
    stdarg.h stdatomic.h stdbool.h stddef.h stdint.h stdio.h stdlib.h string.h tgmath.h time.h uchar.h wchar.h wctype.h

    algorithm any array atomic barrier bit bitset cassert ccomplex cctype cerrno cfenv cfloat charconv chrono cinttypes ciso646
    climits clocale cmath codecvt compare complex concepts condition_variable coroutine csetjmp csignal cstdalign cstdarg
    cstdbool cstddef cstdint cstdio cstdlib cstring ctgmath ctime cuchar cwchar cwctype deque exception execution expected
    filesystem format forward_list fstream functional future initializer_list iomanip ios iosfwd iostream istream iterator latch
    limits list locale map memory memory_resource mutex new numbers numeric optional ostream print queue random ranges ratio
    regex scoped_allocator semaphore set shared_mutex source_location span spanstream sstream stack stacktrace stdexcept
    stop_token streambuf string string_view strstream syncstream system_error thread tuple type_traits typeindex typeinfo
    unordered_map unordered_set utility valarray variant vector version

    aio.h arpa/inet.h dirent.h dlfcn.h fcntl.h fnmatch.h ftw.h glob.h grp.h iconv.h langinfo.h libgen.h mqueue.h net/if.h
    netdb.h netinet/in.h netinet/tcp.h nl_types.h poll.h pthread.h pwd.h regex.h sched.h search.h semaphore.h spawn.h strings.h
    sys/ioctl.h sys/ipc.h sys/mman.h sys/msg.h sys/param.h sys/resource.h sys/select.h sys/sem.h sys/shm.h sys/socket.h
    sys/stat.h sys/statvfs.h sys/time.h sys/times.h sys/types.h sys/uio.h sys/un.h sys/utsname.h sys/wait.h syslog.h tar.h
    termios.h ucontext.h unistd.h utime.h utmpx.h wordexp.h
""".split()


def read(*path):
    with open(os.path.join(ROOT, *path), encoding="utf-8") as file:
        return file.read()


def output(*command):
    return subprocess.run(command, capture_output=True, text=True, check=True).stdout


def exported():
    """The names of the exported symbols, without the arguments that C++ encodes in them."""
    lines = output("nm", "-D", "-C", "--defined-only", LIBRARY).splitlines()
    return [re.sub(r"^\S+ \S ", "", line).split("(")[0] for line in lines]


def declared():
    """The names that the public headers declare as exported."""
    names = set()
    for path in glob.glob(os.path.join(ROOT, "include", "kastarri", "*.h")):
        for declaration in re.findall(r"^(?:extern )?KASTARRI_(?:API|RESULT) ([^;]*);", read(path), re.M):
            names.add(re.findall(r"\bcstub_\w+(?=\(|\[|$)", declaration)[0])
    return names


def all_rows():
    return [row for _, _, rows in generate_headers.all_rows().values() for row in rows]


def run_program(program, compiler="g++", level="-O0"):
    """What a program prints, to either stream, and its exit status."""
    with tempfile.TemporaryDirectory() as directory:
        binary = os.path.join(directory, "kernel")
        subprocess.run([compiler, *USER_FLAGS, level, "-x", "c++", "-", "-x", "none", LIBRARY, "-o", binary,
                        "-Wl,-rpath," + os.path.dirname(LIBRARY)], input=program, text=True, check=True)
        run = subprocess.run([binary], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)
        return run.stdout, run.returncode


class Library(unittest.TestCase):
    def test_exports_are_the_rows_and_the_declared_rest(self):
        names = exported()
        self.assertEqual(len(names), len(set(names)), "an intrinsic is exported once")
        self.assertEqual([n for n in names if not n.startswith("cstub_")], [])
        rows = {generate_headers.symbol(row.name) for row in all_rows()}
        self.assertEqual(rows - set(names), set(), "rows that are not exported")
        self.assertEqual(set(names) - declared(), set(), "exported but in no public header")
        self.assertEqual(declared() - set(names), set(), "in a public header but not exported")

    def test_file_is_a_plain_library(self):
        dynamic = output("readelf", "-d", LIBRARY)
        major = re.search(r"KASTARRI_VERSION_MAJOR (\d+)", read("include", "kastarri", "library.h"))[1]
        self.assertEqual(re.findall(r"SONAME.*\[(.*)\]", dynamic), [f"libkastarri.so.{major}"])
        self.assertLessEqual(set(re.findall(r"NEEDED.*\[(.*)\]", dynamic)), {"libc.so.6"})
        self.assertNotIn("TEXTREL", dynamic)
        sections = output("readelf", "-lW", LIBRARY)
        self.assertRegex(sections, r"GNU_STACK.* RW ", "no executable stack")

    def test_nothing_runs_when_the_library_is_loaded(self):
        self.assertTrue(OBJECTS, "--objects")
        symbols = output("nm", *OBJECTS)
        self.assertNotIn("_GLOBAL__sub_I", symbols, "a constructor of static data")

    def test_objects_hold_nothing_weak(self):
        self.assertTrue(OBJECTS, "--objects")
        # A weak function compiled for one target could be picked by the linker for all of them.
        weak = [line for line in output("nm", "-C", *OBJECTS).splitlines() if re.search(r" [WVu] ", line)]
        self.assertEqual(weak, [])


class Headers(unittest.TestCase):
    def compile(self, compiler, *arguments, text=None):
        command = [compiler, *USER_FLAGS, "-fsyntax-only", *arguments]
        result = subprocess.run(command, input=text, capture_output=True, text=True, check=False)
        self.assertEqual(result.returncode, 0, " ".join(command) + "\n" + result.stderr[:2000])

    def test_headers_are_those_of_the_rows(self):
        stale = [path for path, text in generate_headers.outputs().items() if read(path) != text]
        self.assertEqual(stale, [], "run `make headers`")

    def test_rules_tell_what_becomes_of_lanes_under_a_predicate(self):
        predicated = [row for row in all_rows() if "_T" in row.shape]
        self.assertGreater(len(predicated), 250)
        types = generate_headers.read_types()
        self.assertEqual([row.name for row in predicated if "predicate bit" not in rules.own(row, types)], [])

    def test_every_declaration_has_its_documentation(self):
        for path in self.headers():
            lines = read(path).splitlines()
            for above, line in zip(lines, lines[1:]):
                with self.subTest(path=path, line=line):
                    if re.match(r"(extern )?KASTARRI_(API|RESULT)\b|typedef.*\bcstub_|using.*_space::", line):
                        self.assertRegex(above, "^//")
                    if re.match(r"  (explicit )?inline.*;", line):
                        self.assertRegex(line, "; +///< ")

    def headers(self):
        return sorted(glob.glob(os.path.join(ROOT, "include", "**", "*.h"), recursive=True))

    def test_each_header_compiles_alone(self):
        for compiler in COMPILERS:
            for header in self.headers():
                with self.subTest(compiler=compiler, header=os.path.basename(header)):
                    for level in ("-O0", "-O2"):
                        self.compile(compiler, level, "-x", "c++", "-", text=f'#include "{header}"\n')

    def test_every_conversion_compiles_in_every_form(self):
        for compiler in COMPILERS:
            with self.subTest(compiler=compiler):
                self.compile(compiler, "-I", os.path.join(ROOT, "src"),
                             os.path.join(ROOT, "tests", "contract", "conversions_compile.cpp"))

    def test_short_names_collide_with_nothing_of_the_system(self):
        headers = "".join(f"#if __has_include(<{h}>)\n#include <{h}>\n#endif\n" for h in SYSTEM_HEADERS)
        names = '#include "kastarri/names.h"\n'
        use = "qv_vecNx16 twice(const qv_vecNx16& v) { return ZRA_ADDNX16(v, v); }\n"
        self.compile("g++", "-std=gnu++20", "-Wno-deprecated", "-x", "c++", "-", text=headers + names + use)
        # Names that the headers never say make no difference to headers that come after them.
        words = re.findall(r"\w+", self.preprocessed("-std=gnu++20", "-dD", text=headers))
        self.assertGreater(len(words), 100000)
        self.assertEqual(set(words) & self.short_names(), set())

    def preprocessed(self, *arguments, text):
        return subprocess.run(["g++", *USER_FLAGS, "-w", *arguments, "-E", "-x", "c++", "-"], input=text, capture_output=True,
                              text=True, check=True).stdout

    def short_names(self):
        return {generate_headers.short_name(row.name) for row in all_rows()} | set(generate_headers.read_types())


class ShortNames(unittest.TestCase):
    def test_each_is_the_function_of_its_full_name(self):
        pairs = [(generate_headers.short_name(row.name), generate_headers.symbol(row.name)) for row in all_rows()]
        program = '#include <cstring>\n#include "kastarri/names.h"\ntemplate <class T> struct same { static void as(T, T) {} };\n'
        program += "void types() {\n" + "".join(f"same<decltype(&{a})>::as(&{a}, &{b});\n" for a, b in pairs) + "}\n"
        for table, names in zip(("short_names", "full_names"), zip(*pairs)):
            program += f"void* {table}[] = {{" + ", ".join(f"reinterpret_cast<void*>(&{name})" for name in names) + "};\n"
        program += "int main() { return std::memcmp(short_names, full_names, sizeof short_names) != 0; }\n"
        self.assertGreater(len(pairs), 2500)
        for compiler, level in (("g++", "-O0"), ("g++", "-O2"), ("clang++", "-O2")):
            with self.subTest(compiler=compiler, level=level):
                self.assertEqual(run_program(program, compiler, level), ("", 0))

    def test_a_name_of_the_program_stands_beside_one_of_the_core(self):
        program = """
            #define valign valign_of_the_core
            #include "kastarri/names.h"
            #undef valign
            struct valign { int left; };
            namespace mine { struct qv_vecNx16 { int ZRA_ADDNX16; }; int take(qv_vecNx16 v) { return v.ZRA_ADDNX16; } }
            valign_of_the_core of_the_core;
            int main() { return valign{mine::take(mine::qv_vecNx16{0})}.left; }
        """
        for compiler in COMPILERS:
            with self.subTest(compiler=compiler):
                self.assertEqual(run_program(program, compiler), ("", 0))


class Constants(unittest.TestCase):
    def test_registers_made_of_host_scalars_are_those_of_the_exported_conversions(self):
        sets = [(), ("sse2",), ("avx2",), ("avx512f", "avx512bw")]
        with tempfile.TemporaryDirectory() as directory:
            binary = os.path.join(directory, "constants")
            for compiler, flags, level in itertools.product(COMPILERS, sets, ("-O0", "-O3")):
                if not set(flags) <= processor.features():
                    continue
                with self.subTest(compiler=compiler, flags=flags, level=level):
                    fpmath = ["-mfpmath=sse"] if flags else []
                    subprocess.run([compiler, *USER_FLAGS, level, *(f"-m{flag}" for flag in flags), *fpmath, "-Wno-conversion",
                                    "-I", os.path.join(ROOT, "src"), os.path.join(ROOT, "tests", "contract", "constants.cpp"),
                                    LIBRARY, "-o", binary, "-Wl,-rpath," + os.path.dirname(LIBRARY)], check=True)
                    self.assertEqual(subprocess.run([binary], capture_output=True, text=True, check=False).stdout, "")


class Documents(unittest.TestCase):
    def test_coverage_and_counts_are_those_of_the_rows(self):
        check = subprocess.run([sys.executable, os.path.join(ROOT, "tools", "coverage.py"), "--check"], check=False)
        self.assertEqual(check.returncode, 0, "run `make headers`")

    def test_times_of_the_readme_are_those_that_were_measured(self):
        section = re.search(r"^## How fast$(.*?)^## ", read("README.md"), re.M | re.S)[1]
        measured = re.findall(r"^\|.*", section, re.M)
        self.assertGreater(len(measured), 8)
        self.assertEqual([row for row in measured if row not in read("docs", "performance.md").splitlines()], [])

    def test_the_kernel_of_the_readme_prints_what_the_readme_says(self):
        readme = read("README.md")
        program = re.search(r"```cpp\n(.*?)```", readme, re.S)[1]
        printed = re.search(r"It prints `(.*?)`", readme)[1]
        self.assertEqual(run_program(program), (printed + "\n", 0))

    def test_every_line_that_compiles_a_kernel_has_the_flags_of_a_fast_one(self):
        pages = [os.path.join(ROOT, "README.md"), *glob.glob(os.path.join(ROOT, "docs", "*.md"))]
        lines = [line for page in pages for line in read(page).splitlines()
                 if re.match(r"    (g|clang)\+\+ .*\.cpp", line) and "$(pkg-config" not in line]
        self.assertGreaterEqual(len(lines), 2)
        self.assertEqual([line for line in lines if not re.search(r" -msse2 -mfpmath=sse | -march=native ", line)], [])

    def test_the_programs_of_the_porting_page_print_what_it_says(self):
        page = read("docs", "porting.md")
        programs = re.findall(r"```cpp\n(.*?)```\n\n(?:```text\n(.*?)```)?", page, re.S)
        self.assertEqual(len(programs), page.count("```cpp"))
        self.assertGreaterEqual(sum(bool(printed) for _, printed in programs), 5)
        for program, printed in programs:
            with self.subTest(program=program):
                if "int main()" in program:
                    status = 1 if printed.startswith("Error: ") else 0
                    self.assertEqual(run_program(program), (printed, status))
                else:
                    subprocess.run(["g++", *USER_FLAGS, "-fsyntax-only", "-x", "c++", "-"], input=program, text=True, check=True)

    def test_what_the_guide_quotes_stands_in_the_sources(self):
        guide = read("docs", "adding-an-intrinsic.md")
        quotations = 0
        for path, blocks in re.findall(r"^`(\S+)`:\n\n((?:```\w*\n.*?```\n)+)", guide, re.S | re.M):
            source = read(path)
            for block in re.findall(r"```\w*\n(.*?)```", blocks, re.S):
                quotations += 1
                with self.subTest(path=path):
                    self.assertRegex(source, re.escape(block).replace(re.escape("..."), ".*"))
        self.assertGreaterEqual(quotations, 4)


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("library")
    parser.add_argument("tests", nargs="*")
    parser.add_argument("--objects", nargs="+", default=[])
    arguments = parser.parse_args()
    LIBRARY, OBJECTS = os.path.abspath(arguments.library), arguments.objects
    BITS = bits_of(LIBRARY)
    USER_FLAGS.append(f"-m{BITS}")
    unittest.main(argv=[sys.argv[0], *arguments.tests])
