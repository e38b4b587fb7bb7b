"""The programs of kastarri-conform, compiled and run on this machine."""

import concurrent.futures
import glob
import os
import subprocess
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, os.path.join(ROOT, "tools"))
from cmake_cache import cached, inlined  # noqa: E402

USER_FLAGS = ["-msse2", "-mfpmath=sse"]  # as cmake/Library.cmake has them


class Failed(Exception):
    """A command that failed, with what it said."""


def run(command, **options):
    done = subprocess.run(command, capture_output=True, text=True, errors="replace", check=False, **options)
    if done.returncode != 0:
        raise Failed(f"{' '.join(command)}: status {done.returncode}\n{(done.stderr or done.stdout)[-3000:]}")
    return done.stdout


def in_parallel(function, items):
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        return list(pool.map(function, items))


class Build:
    """A directory in which the library was built."""

    def __init__(self, directory):
        self.directory = os.path.abspath(directory)
        self.bits = self.cached("KASTARRI_BITS") or "32"
        self.width = f"-m{self.bits}"
        self.compiler = self.cached("CMAKE_CXX_COMPILER")
        self.tool = os.path.join(self.directory, "bin", "kastarri-conform")

    def cached(self, name):
        return cached(self.directory, name)

    def libraries(self):
        """Target -> the directory of the shared library for it alone; if there is none, that of the only one."""
        found = {os.path.basename(path): path for path in sorted(glob.glob(os.path.join(self.directory, "tests", "only", "*")))}
        return found or {"shipped": self.directory}

    def inlined(self):
        return inlined(self.directory)


def write_programs(build, directory, *options):
    """The sources that kastarri-conform writes."""
    run([build.tool, "-o", directory, *options])
    return sorted(glob.glob(os.path.join(directory, "*.cpp")))


def compile_programs(sources, directory, compiler, flags, link):
    os.makedirs(directory, exist_ok=True)

    def compile_one(source):
        program = os.path.join(directory, os.path.basename(source).removesuffix(".cpp"))
        run([compiler, "-std=c++11", *flags, "-I", os.path.join(ROOT, "include"), source, "-o", program, *link])
        return program

    return in_parallel(compile_one, sources)


def run_program(program, library=None, preload=None, timeout=None):
    """Intrinsic -> what the program prints of it: less where it ends badly, or not in time."""
    environment = dict(os.environ)
    if library:
        environment["LD_LIBRARY_PATH"] = library
    if preload:
        environment["LD_PRELOAD"] = preload
    try:
        printed = subprocess.run([program], env=environment, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=False,
                                 timeout=timeout).stdout
    except subprocess.TimeoutExpired as expired:
        printed = expired.stdout or b""
    lines = printed.decode(errors="replace").split("\n")[:-1]
    return {line.split()[0]: line for line in lines if not line.startswith("#")}


def report(programs, library=None, preload=None):
    """Intrinsic -> what the programs print of it."""
    parts = in_parallel(lambda program: run_program(program, library, preload), programs)
    return {name: line for part in parts for name, line in part.items()}
