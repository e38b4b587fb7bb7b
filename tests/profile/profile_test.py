"""kastarri-profile: counts that are exact, programs that notice nothing, tables that outlive a crash.

Run as: profile_test.py BUILD CMAKE
"""

import csv
import glob
import os
import re
import signal
import struct
import subprocess
import sys
import tempfile
import unittest
import xml.etree.ElementTree

sys.path.insert(0, os.path.join(os.path.dirname(os.path.dirname(os.path.abspath(__file__))), "support"))
from commands import bits_of  # noqa: E402

BUILD, CMAKE = sys.argv[1:3]
PROFILER = os.path.join(BUILD, "bin", "kastarri-profile")
PROGRAMS = os.path.join(BUILD, "tests", "profile")
CALLS = os.path.join(PROGRAMS, "calls_lazy")
BITS = bits_of(CALLS)
BUILDS = [os.path.join(PROGRAMS, name) for name in ("calls_lazy", "calls_now", "calls_no_plt", "calls_fixed")]
HOST, PLUGIN = os.path.join(PROGRAMS, "host"), os.path.join(PROGRAMS, "libplugin.so")


BEFORE_MAIN = {"RK_CLAMPS": 1, "int32_rtor_qv_vecNx16": 1}
RESULTS = {"RK_CLAMPS": 2, "int32_rtor_qv_vecNx16": 1, "ZRA_LVNX16_IP": 1, "ZRA_MULNX16": 1, "ZRA_MULANX16": 1,
           "float_rtor_qv_vecN_2xf32": 1}
ADD = ("ZRA_ADDNX16", "add")
SVG = "{http://www.w3.org/2000/svg}"


def with_loader(header, name):
    """An ELF header and behind it a table of one segment, which names the dynamic loader."""
    if header[4] == 1:
        segment = struct.pack("<8I", 3, len(header) + 32, 0, 0, len(name), len(name), 4, 1)
        table = {28: struct.pack("<I", len(header)), 42: struct.pack("<HH", len(segment), 1)}
    else:
        segment = struct.pack("<IIQQQQQQ", 3, 4, len(header) + 56, 0, 0, len(name), len(name), 1)
        table = {32: struct.pack("<Q", len(header)), 54: struct.pack("<HH", len(segment), 1)}
    for place, number in table.items():
        header = header[:place] + number + header[place + len(number):]
    return header + segment + name


class ProfileTest(unittest.TestCase):
    def setUp(self):
        directory = tempfile.TemporaryDirectory()
        self.addCleanup(directory.cleanup)
        self.directory = directory.name

    def path(self, name):
        return os.path.join(self.directory, name)

    def run_profiler(self, *arguments, profiler=PROFILER, **options):
        return subprocess.run([profiler, *arguments], capture_output=True, text=True, check=False, timeout=600, **options)

    def counts(self, *command, status=0):
        """Name -> calls of a program's run, which has to end with `status`."""
        result = self.run_profiler("--csv", self.path("counts.csv"), *command)
        self.assertEqual(result.returncode, status, result.stderr)
        with open(self.path("counts.csv"), encoding="utf-8", newline="") as file:
            return {row["name"]: int(row["calls"]) for row in csv.DictReader(file)}

    def assert_added(self, counts, calls):
        self.assertEqual(counts, dict(BEFORE_MAIN, ZRA_ADDNX16=calls))


class Counts(ProfileTest):
    def test_calls_are_counted_however_the_program_is_linked(self):
        for program in BUILDS:
            with self.subTest(program=program):
                self.assertEqual(self.counts(program, "results"), RESULTS)
                self.assertEqual(self.counts(program, "pointers"), dict(BEFORE_MAIN, ZRA_ADDNX16=3, ZRA_SUBNX16=3))

    def test_no_thread_loses_a_call(self):
        self.assert_added(self.counts(CALLS, "threads"), 400000)

    def test_counters_of_ended_threads_are_used_again(self):
        self.assert_added(self.counts(CALLS, "many-threads"), 3000)

    def test_forked_and_executed_processes_are_counted(self):
        self.assert_added(self.counts(CALLS, "fork"), 1 + 10 + 2 * 5000000)
        for mode in ("exec", "fork-exec"):
            with self.subTest(mode=mode):
                both = {name: RESULTS.get(name, 0) + BEFORE_MAIN.get(name, 0) for name in RESULTS}
                self.assertEqual(self.counts(CALLS, mode), dict(both, ZRA_ADDNX16=3))

    def test_plugins_are_counted(self):
        self.assertEqual(self.counts("--anyway", HOST, PLUGIN, PLUGIN), {"RK_MAX": 2, "RK_MIN": 2})

    def test_what_the_library_calls_itself_is_not_counted(self):
        self.assertEqual(self.counts(CALLS, "unaligned", status=1), dict(BEFORE_MAIN, ZRA_SBN_I=1))


class Callers(ProfileTest):
    def callers(self, *command, status=0):
        """(Intrinsic, function that calls it) -> calls. What is not told by the file of the source has that of the code."""
        result = self.run_profiler("--callers", "--output", self.path("table"), *command)
        self.assertEqual(result.returncode, status, result.stderr)
        with open(self.path("table"), encoding="utf-8") as file:
            table = re.search(r"^ +calls .* intrinsic +called by\n((?:.+\n)+)", file.read(), re.M)[1]
        rows = re.findall(r"^ +([\d,]+) +\S+ .*? (\w+) +((?:\S+::)?\S+) \(\w.*\)$", table.replace("(anonymous namespace)::", ""), re.M)
        self.assertEqual(len(rows), table.count("\n"), table)
        return {(name, function): int(calls.replace(",", "")) for calls, name, function in rows}

    def test_functions_that_call_are_named_however_the_program_is_linked(self):
        for program in BUILDS:
            with self.subTest(program=program):
                callers = self.callers(program, "pointers")
                self.assertEqual({name: calls for (name, _), calls in callers.items()}, dict(BEFORE_MAIN, ZRA_ADDNX16=3, ZRA_SUBNX16=3))
                results = self.callers(program, "results")
                self.assertEqual(sum(results.values()), sum(RESULTS.values()))
                self.assertEqual(sum(calls for (name, _), calls in results.items() if name == "RK_CLAMPS"), 2)

    def test_every_thread_and_process_is_there(self):
        self.assertEqual(self.callers(CALLS, "threads")[ADD], 400000)
        self.assertEqual(self.callers(CALLS, "fork")[ADD], 1 + 10 + 2 * 5000000)
        self.assertEqual(self.callers(CALLS, "fork-exec")[ADD], 3)
        self.assertEqual(self.callers(CALLS, "signal", str(int(signal.SIGKILL)), status=-signal.SIGKILL)[ADD], 5)

    def test_callers_in_plugins_are_named(self):
        callers = self.callers("--anyway", HOST, PLUGIN)
        self.assertEqual(callers.pop(("RK_MAX", "plugin")), 1)
        self.assertEqual(list(callers.values()), [1], "its last call, which may be a jump, so that main has called")

    def test_results_are_those_of_the_program(self):
        for program in BUILDS:
            plain = subprocess.run([program, "results"], capture_output=True, text=True, check=True)
            self.assertEqual(self.run_profiler("--callers", program, "results").stdout, plain.stdout)


class Transparency(ProfileTest):
    def test_results_input_output_and_arguments_are_those_of_the_program(self):
        for program in BUILDS:
            for arguments, text in ((["results"], ""), (["copy"], "a line\nanother"), (["arguments", "--top", "-h", "a b"], "")):
                with self.subTest(program=program, arguments=arguments):
                    plain = subprocess.run([program, *arguments], capture_output=True, text=True, input=text, check=True)
                    profiled = self.run_profiler("--output", self.path("table"), program, *arguments, input=text)
                    self.assertEqual((profiled.stdout, profiled.stderr, profiled.returncode), (plain.stdout, "", 0))
                    self.assertNotEqual(plain.stdout, "")

    def test_status_is_passed_on_and_the_table_written_however_the_program_ends(self):
        for mode, argument, status in (("exit", 3, 3), ("_exit", 4, 4), ("fault", 16, -signal.SIGSEGV),
                                       ("signal", int(signal.SIGABRT), -signal.SIGABRT),
                                       ("signal", int(signal.SIGKILL), -signal.SIGKILL)):
            with self.subTest(mode=mode, argument=argument):
                self.assert_added(self.counts(CALLS, mode, str(argument), status=status), 5)

    def test_the_message_of_an_alignment_failure_comes_before_the_table(self):
        result = self.run_profiler(CALLS, "unaligned")
        self.assertEqual(result.returncode, 1)
        self.assertRegex(result.stderr, r"\AError: .* is not properly aligned\.\n\ncalls_lazy: 3 calls of 3 intrinsics\n")

    def test_signals_reach_the_program(self):
        for number in (signal.SIGTERM, signal.SIGINT):
            with self.subTest(signal=number):
                with subprocess.Popen([PROFILER, CALLS, "wait"], stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                                      text=True) as running:
                    self.assertEqual(running.stdout.readline(), "ready\n")
                    running.send_signal(number)
                    table = running.communicate(timeout=600)[1]
                self.assertEqual(running.returncode, -number)
                self.assertRegex(table, r" 4 .* ZRA_ADDNX16\n")


class Output(ProfileTest):
    def profiler_with_costs(self, costs):
        """The profiler as it is installed, with other costs."""
        subprocess.run([CMAKE, "--install", BUILD, "--prefix", self.path("installed")], check=True, capture_output=True)
        with open(self.path("installed/share/kastarri/costs.csv"), "w", encoding="utf-8") as file:
            file.write(costs)
        return self.path("installed/bin/kastarri-profile")

    def lines(self, *arguments, profiler=PROFILER):
        table = self.run_profiler(*arguments, profiler=profiler).stderr
        return [line.split() for line in table.splitlines() if line]

    def test_table_names_the_most_called_and_the_families(self):
        costs = "# measured on: a machine\nname,avx512,avx2,sse2\n" + "".join(
            f"{name},{cycles},{cycles},{cycles}\n" for name, cycles in (("ZRA_ADDNX16", 4.0), ("ZRA_SUBNX16", 8.0), ("RK_CLAMPS", 14.0)))
        *table, estimate = self.lines("--top", "2", CALLS, "pointers", profiler=self.profiler_with_costs(costs))
        self.assertEqual(table, [
            ["calls_lazy:", "8", "calls", "of", "4", "intrinsics"],
            ["calls", "share", "cycles", "share", "family", "intrinsic"],
            ["3", "37.5%", "12", "24.0%", "integer", "ZRA_ADDNX16"],
            ["3", "37.5%", "24", "48.0%", "integer", "ZRA_SUBNX16"],
            ["2", "25.0%", "14", "28.0%", "2", "more"],
            ["calls", "share", "cycles", "share", "family"],
            ["6", "75.0%", "36", "72.0%", "integer"],
            ["1", "12.5%", "conversions"],
            ["1", "12.5%", "14", "28.0%", "scalar"]])
        self.assertRegex(" ".join(estimate), r"cost on a machine with (avx512|avx2|sse2); not known of 1 call$")

    def test_without_costs_there_are_counts_alone(self):
        profiler = self.profiler_with_costs("# measured on: another machine\nname\nZRA_ADDNX16\n")
        table = self.lines("--csv", self.path("counts.csv"), CALLS, "pointers", profiler=profiler)
        self.assertEqual(table[1:3], [["calls", "share", "family", "intrinsic"], ["3", "37.5%", "integer", "ZRA_ADDNX16"]])
        with open(self.path("counts.csv"), encoding="utf-8") as file:
            self.assertIn("ZRA_ADDNX16,integer,3,\n", file.read())

    def test_every_intrinsic_has_a_cost_on_every_target(self):
        share = os.path.join(os.path.dirname(os.path.dirname(PROFILER)), "share", "kastarri", "costs.csv")
        with open(share, encoding="utf-8") as file:
            self.assertRegex(file.readline(), r"measured on: .*\(family \d+, model \d+\)\n")
            costs = {row["name"]: [float(row[target]) for target in ("avx512", "avx2", "sse2")] for row in csv.DictReader(file)}
        listed, = glob.glob(os.path.join(BUILD, "lib", "kastarri", "profile", "*", "intrinsics.csv"))
        with open(listed, encoding="utf-8") as file:
            names = {name for name, _ in csv.reader(file)}
        self.assertGreater(len(names & set(costs)) / len(names), 0.95, "`make bench` measures those that are new")
        self.assertEqual(set(costs) - names, set())
        self.assertTrue(all(0.5 < cycles < 1000 for cells in costs.values() for cycles in cells))

    def test_picture_is_well_formed_and_inside_its_frame(self):
        program = self.path("a<b&c")
        os.symlink(CALLS, program)
        for top, bars in ((1, 1), (25, 6)):
            with self.subTest(top=top):
                self.run_profiler("--svg", self.path("p.svg"), "--top", str(top), program, "results")
                picture = xml.etree.ElementTree.parse(self.path("p.svg")).getroot()
                width, height = float(picture.get("width")), float(picture.get("height"))
                self.assertEqual(picture.get("viewBox"), f"0 0 {picture.get('width')} {picture.get('height')}")
                rectangles = picture.findall(SVG + "rect")
                families = 4
                self.assertEqual(len(rectangles), 1 + 2 * families + bars)
                for r in rectangles[1:]:
                    self.assertLessEqual(float(r.get("x")) + float(r.get("width")), width)
                    self.assertLessEqual(float(r.get("y")) + float(r.get("height")), height)
                texts = [t.text for t in picture.findall(SVG + "text")]
                self.assertIn("Intrinsics called by a<b&c", texts)
                self.assertIn("2 (28.6%)", texts)
                self.assertEqual("and 5 more: 5 (71.4%)" in texts, top == 1)

    def test_a_program_that_calls_nothing_has_empty_tables(self):
        result = self.run_profiler("--anyway", "--csv", self.path("counts.csv"), "--svg", self.path("p.svg"), HOST)
        self.assertEqual(result.stderr, "\nhost: 0 calls of 0 intrinsics\n")
        with open(self.path("counts.csv"), encoding="utf-8") as file:
            self.assertEqual(file.read(), "name,family,calls,cycles\n")
        xml.etree.ElementTree.parse(self.path("p.svg"))

    def test_the_installed_profiler_works(self):
        subprocess.run([CMAKE, "--install", BUILD, "--prefix", self.path("installed")], check=True, capture_output=True)
        os.symlink(self.path("installed/bin/kastarri-profile"), self.path("link"))
        result = self.run_profiler(CALLS, "results", profiler=self.path("link"))
        self.assertIn("7 calls of 6 intrinsics", result.stderr)


class Errors(ProfileTest):
    def program(self, name, content, mode=0o755):
        with open(self.path(name), "wb") as file:
            file.write(content)
        os.chmod(self.path(name), mode)
        return self.path(name)

    def test_what_cannot_be_profiled_is_named(self):
        x86 = b"\x7fELF\x01\x01\x01" + bytes(9) + b"\x02\x00\x03\x00" + bytes(32)
        x86_64 = b"\x7fELF\x02\x01\x01" + bytes(9) + b"\x02\x00\x3e\x00" + bytes(44)
        arm = b"\x7fELF\x01\x01\x01" + bytes(9) + b"\x02\x00\x28\x00" + bytes(32)
        # A program of the other width that names its loader, where this build has the files of one width.
        self.assertEqual(len(os.listdir(os.path.join(BUILD, "lib", "kastarri", "profile"))), 1)
        other = with_loader(x86 if BITS == 64 else x86_64, b"/lib/ld.so\0")
        for command, status, message in (
                (["no-such-program"], 127, "there is no program no-such-program"),
                ([self.path("absent")], 127, "there is no program"),
                ([self.directory], 126, "not an executable file"),
                ([self.program("plain", x86, mode=0o644)], 126, "not an executable file"),
                ([self.program("script", b"#!/bin/sh\n")], 126, "not a program but a script"),
                ([self.program("empty", b"")], 126, "not a program"),
                ([self.program("arm", arm)], 126, "not an x86 program"),
                ([self.program("other", other)], 126, f"is a {96 - BITS}-bit program, and kastarri for those"),
                ([self.program("static", x86)], 126, "linked statically"),
                ([self.program("static64", x86_64)], 126, "linked statically"),
                ([HOST], 126, "not linked with libkastarri.so"),
                (["--csv", self.path("no/such.csv"), CALLS], 125, "cannot write .*no/such.csv: No such file"),
                (["--top", "0", CALLS], 2, "--top: '0' is not a number above 0"),
                ([], 2, "which program")):
            with self.subTest(command=command):
                result = self.run_profiler(*command)
                self.assertEqual(result.returncode, status, result.stderr)
                self.assertRegex(result.stderr, "kastarri-profile: .*" + message)
                self.assertNotIn("Traceback", result.stderr)


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0]])
