"""A build directory with tests in it, of which single objects are compiled anew from sources with faults.

A source with a fault lies in a directory of its own that is searched for headers first, so nothing of the tree or of
the build is written to.
"""

import concurrent.futures
import glob
import json
import os
import re
import shlex
import subprocess

TIMEOUT = 300


class Failed(Exception):
    """A compilation that failed, with what the compiler said."""


class Build:
    def __init__(self, root, directory, target):
        self.root, self.directory = root, os.path.abspath(directory)
        only = os.path.join("tests", "only", target)
        shared = os.path.isdir(os.path.join(self.directory, only))
        self.library = self.newest(os.path.join(only if shared else "", "libkastarri.so.*.*.*"))
        self.program = os.path.join("tests", "kastarri_tests")
        with open(os.path.join(self.directory, "compile_commands.json"), encoding="utf-8") as file:
            self.commands = {re.search(r" -o (\S+)", entry["command"])[1]: entry["command"] for entry in json.load(file)}
        self.links = {product: self.link_command(product) for product in (self.library, self.program)}
        self.objects = {product: {word for word in shlex.split(link) if word in self.commands}
                        for product, link in self.links.items()}
        self.dependencies = self.read_dependencies()

    def newest(self, pattern):
        found = glob.glob(os.path.join(self.directory, pattern))
        if not found:
            raise SystemExit(f"{self.directory} has no {pattern}: build it first")
        return os.path.relpath(max(found, key=os.path.getmtime), self.directory)

    def ninja(self, *arguments):
        return subprocess.run(["ninja", "-C", self.directory, *arguments], capture_output=True, text=True, check=True).stdout

    def link_command(self, product):
        return self.ninja("-t", "commands", "-s", product).strip().split("\n")[-1]

    def read_dependencies(self):
        """Object -> the files of the tree's src and tests that it is compiled from."""
        found, files = {}, set()
        for line in self.ninja("-t", "deps").split("\n"):
            if match := re.match(r"(\S+): #deps", line):
                files = found[match[1]] = set()
            elif line.strip():
                path = os.path.relpath(os.path.join(self.directory, line.strip()), self.root)
                if path.startswith(("src/", "tests/")):
                    files.add(path)
        return found

    def dependents(self, product, paths):
        """The objects of the library or program that are compiled from any of the paths (of src)."""
        return sorted(o for o in self.objects[product] if any("src/" + path in self.dependencies.get(o, ()) for path in paths))

    def compile(self, scratch, name):
        """Compiles an object with the sources in scratch/src before those of the tree."""
        output = os.path.join(scratch, name.replace("/", "_"))
        words = []
        for word in shlex.split(self.commands[name]):
            changed = os.path.join(scratch, os.path.relpath(word, self.root)) if word.startswith(self.root) else word
            words.append(output if word == name else changed if os.path.isfile(changed) else word)
        compiler = 1 + (os.path.basename(words[0]) == "ccache")
        words[compiler:compiler] = ["-I", os.path.join(scratch, "src"), "-w"]
        result = subprocess.run(words, cwd=self.directory, capture_output=True, text=True, check=False)
        if result.returncode != 0:
            raise Failed(result.stderr)
        return output

    def same(self, name, compiled):
        """Whether the object is byte for byte what it is without the fault."""
        with open(os.path.join(self.directory, name), "rb") as before, open(compiled, "rb") as after:
            return before.read() == after.read()

    def link(self, product, output, objects):
        """The product with some of its objects replaced: {name: path}."""
        words = [objects.get(word, word) for word in shlex.split(self.links[product])]
        words = words[words.index("&&") + 1:] if words[0] == ":" else words
        words = words[:words.index("&&")] if "&&" in words else words
        words[words.index("-o") + 1] = output
        result = subprocess.run(words, cwd=self.directory, capture_output=True, text=True, check=False)
        if result.returncode != 0:
            raise Failed(result.stderr)

    def rebuild_library(self, scratch, paths):
        """The library of the sources in scratch that stand at the paths. False if it is what it was."""
        library = self.compile_all(scratch, self.dependents(self.library, paths))
        if all(self.same(name, path) for name, path in library.items()):
            return False
        self.link(self.library, os.path.join(scratch, self.name_of(self.library)), library)
        return True

    def rebuild(self, scratch, paths):
        """Library and test program of the sources in scratch that stand at the paths. False if the library is what it
        was."""
        if not self.rebuild_library(scratch, paths):
            return False
        tests = self.compile_all(scratch, self.dependents(self.program, paths))
        if tests:
            self.link(self.program, os.path.join(scratch, self.name_of(self.program)), tests)
        return True

    def compile_all(self, scratch, names):
        """Object -> the new one. What the compiler says of all that fail is in one exception."""
        with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
            futures = {name: pool.submit(self.compile, scratch, name) for name in names}
        failures = [future.exception() for future in futures.values() if future.exception()]
        if failures:
            raise Failed("\n".join(map(str, failures)))
        return {name: future.result() for name, future in futures.items()}

    def name_of(self, product):
        """What the product is called where the loader looks for it."""
        return re.sub(r"(\.so\.\d+).*", r"\1", os.path.basename(product))

    def run(self, scratch, pattern, *arguments):
        """The exit status (None: it hangs) and output of the tests that match, with what is in scratch."""
        program = os.path.join(scratch, "kastarri_tests")
        if not os.path.exists(program):
            program = os.path.join(self.directory, self.program)
        library = scratch if glob.glob(os.path.join(scratch, "libkastarri.so.*")) else os.path.dirname(
            os.path.join(self.directory, self.library))
        try:
            done = subprocess.run([program, "--gtest_brief=1", "--gtest_filter=" + pattern, *arguments], text=True, errors="replace",
                                  env={**os.environ, "LD_LIBRARY_PATH": library}, timeout=TIMEOUT, check=False,
                                  stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.STDOUT)
        except subprocess.TimeoutExpired:
            return None, ""
        return done.returncode, done.stdout
