"""Every command of README.md and of the documents, run as it stands there, in a directory that looks like the tree after
the commands before it: with a kernel, the demo's build, an installation in the home directory.

Run as: commands_test.py BUILD (a build directory with libraries, tools and examples).
"""

import glob
import os
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

from support import BITS, BUILD, CLANG, ROOT

IS_64 = BITS == "64"

# What is not run, and why. `make` is asked what it would do, and presets are looked up: CI builds what they build.
NOT_RUN = [
    (r"apt |dpkg ", "changes the system; package_test.py installs the packages in a root of their own"),
    (r"docker ", "needs docker and its images"),
    (r"add-auto-load-safe-path ", "a line for gdb, which print_test.py gives it"),
    (r"pip ", "needs a wheel, of which tests/python make and install one"),
    (r"for source in here|kastarri-conform .*(here.txt|errors.txt)", "takes minutes; conform_test.py does it with a part"),
]
# What suits builds of some kind alone.
SUITS = [
    (r"-m32|build/demo/|\./kernel", lambda: not IS_64, "builds for 32 bits"),
    (r"build/demo-64", lambda: IS_64, "builds for 64 bits"),
    (r"build/sanitize-64", lambda: False, "the build with sanitizers, which CI makes"),
    (r"^clang.*-static", lambda: CLANG, "builds by clang"),
    (r"^g.*-static", lambda: not CLANG, "builds by g++"),
]


def read(path):
    with open(path, encoding="utf-8") as file:
        return file.read()


def commands():
    """(Page, command) for every line of an indented block, comments and continuations taken away. A loop is one command, and of
    a session, whose commands have a prompt, what is printed is none."""
    for page in [os.path.join(ROOT, "README.md"), *sorted(glob.glob(os.path.join(ROOT, "docs", "*.md")))]:
        text = re.sub(r"^( *)```.*?^ *```", "", read(page), flags=re.M | re.S)
        text = re.sub(r" \\\n +", " ", text)
        text = re.sub(r"; do\n +(.*)\n +done", r"; do \1; done", text)
        for block in re.findall(r"(?<=\n\n)((?: {4}.*\n)+)", text):
            if "    >>> " in block:  # Python's, which tests/python run
                continue
            line = r"^ {4}\$ (.*)$" if re.search(r"^ {4}\$ ", block, re.M) else r"^ {4}(?! )(.*?)(?: +#.*)?$"
            for command in re.findall(line, block, re.M):
                yield os.path.relpath(page, ROOT), command


class Commands(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.directory = tempfile.mkdtemp()
        cls.addClassCleanup(shutil.rmtree, cls.directory)
        path = lambda *parts: os.path.join(cls.directory, *parts)
        subprocess.run(["cmake", "--install", BUILD, "--prefix", path("kastarri")], check=True, capture_output=True)
        os.makedirs(path("build"))
        os.makedirs(path("docs", "pictures"))
        os.makedirs(path("filters"))
        os.symlink(os.path.join(ROOT, "include"), path("include"))
        os.symlink(BUILD, path("build", "demo-64" if IS_64 else "demo"))
        with open(path("kernel.cpp"), "w", encoding="utf-8") as file:
            file.write(re.search(r"```cpp\n(.*?)```", read(os.path.join(ROOT, "README.md")), re.S)[1])
        places = glob.glob(path("kastarri", "lib", "**", "pkgconfig"), recursive=True)
        cls.environment = dict(os.environ, HOME=cls.directory, PKG_CONFIG_PATH=":".join(places),
                               LD_LIBRARY_PATH=":".join(map(os.path.dirname, places)),
                               PATH=path("kastarri", "bin") + ":" + os.environ["PATH"])

    def run_here(self, command, **options):
        done = subprocess.run(["bash", "-c", command], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False,
                              env=self.environment, **{"cwd": self.directory, **options})
        self.assertEqual(done.returncode, 0, done.stdout[-3000:])
        return done.stdout

    def look_up_presets(self, command):
        for kind, preset in re.findall(r"cmake( --build)? --preset ([\w-]+)", command):
            listed = self.run_here(f"cmake --list-presets={'build' if kind else 'configure'}", cwd=ROOT)
            self.assertIn(f'"{preset}"', listed)

    def test_every_command_works(self):
        ran, reasons = [], {}
        for page, command in commands():
            not_run = [reason for pattern, reason in NOT_RUN if re.match(pattern, command)]
            not_run += [f"for {what}" for pattern, suits, what in SUITS if re.search(pattern, command) and not suits()]
            if not_run:
                reasons[command] = not_run[0]
                continue
            with self.subTest(page=page, command=command):
                if command.startswith("make "):
                    self.run_here(command.replace("make ", "make --dry-run ", 1), cwd=ROOT)
                elif command.startswith("cmake --preset"):
                    self.look_up_presets(command)
                else:
                    self.run_here(command)
                ran.append(command)
        print(*(f"not run: {command}\n         {reason}" for command, reason in reasons.items()), sep="\n", file=sys.stderr)
        self.assertGreater(len(ran), 15)
        for pattern, _ in NOT_RUN:
            self.assertTrue(any(re.match(pattern, command) for command in reasons), f"no command is {pattern}")

    def test_every_target_of_make_is_in_its_help(self):
        makefile = read(os.path.join(ROOT, "Makefile"))
        targets = set(re.search(r"^\.PHONY: (.*)$", makefile, re.M)[1].split()) - {"help"}
        self.assertEqual(set(re.findall(r"^#   make ([\w-]+) ", makefile, re.M)), targets)


if __name__ == "__main__":
    unittest.main()
