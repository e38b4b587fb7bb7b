#!/usr/bin/env python3
"""Make what a release consists of, in build/release or another directory, which is emptied before.

    tools/release.py [--sources] [--output DIRECTORY]

The source archive is the last commit, or, in a tree without git, the tree but for build/. All the rest is built from that
archive, unpacked, for programs of both widths: archives that can be unpacked anywhere, Debian packages, the reference
page. Beside them come the tables of `make bench`, if they are there, and SHA256SUMS. Then each is installed in a place of
its own, and a program is built with it and run. With --sources it ends with the source archive.
"""

import argparse
import glob
import gzip
import hashlib
import os
import re
import shutil
import subprocess
import sys
import tarfile

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
WORK = os.path.join(ROOT, "build", "release-tree")
WIDTHS = {"install": "i386-linux-gnu", "install-64": "x86_64-linux-gnu"}  # preset: where Debian has its libraries
TABLES = {"performance.md": "make bench", "performance-64.md": "make bench BITS=64"}


def run(*command, **options):
    print("+", *command, flush=True)
    subprocess.run(command, check=True, **options)


def version():
    with open(os.path.join(ROOT, "include", "kastarri", "library.h"), encoding="utf-8") as header:
        return ".".join(re.findall(r"^#define KASTARRI_VERSION_(?:MAJOR|MINOR|PATCH) (\d+)$", header.read(), re.M))


def has_git():
    """Whether the tree is a checkout of its own, and not part of another."""
    told = subprocess.run(["git", "-C", ROOT, "rev-parse", "--show-toplevel"], capture_output=True, text=True, check=False) \
        if shutil.which("git") else None
    return bool(told) and told.returncode == 0 and os.path.realpath(told.stdout.strip()) == os.path.realpath(ROOT)


def source_archive(release, name):
    path = os.path.join(release, name + ".tar.gz")
    if has_git():
        if subprocess.run(["git", "-C", ROOT, "status", "--porcelain"], capture_output=True, check=True).stdout:
            print("release.py: changes that are not committed are not in the release", file=sys.stderr)
        archive = subprocess.run(["git", "-C", ROOT, "archive", f"--prefix={name}/", "HEAD"], stdout=subprocess.PIPE, check=True)
        with open(path, "wb") as file, gzip.GzipFile("", "wb", 9, file, mtime=0) as packed:  # the same each time
            packed.write(archive.stdout)
    else:
        with tarfile.open(path, "w:gz") as archive:
            for entry in sorted(set(os.listdir(ROOT)) - {"build", ".git"}):
                archive.add(os.path.join(ROOT, entry), f"{name}/{entry}")
    return path


def build(tree, release, preset, libraries):
    """Debian packages have their libraries in a directory for the architecture, archives in lib."""
    directory = os.path.join(tree, "build", preset)
    for generator, place in ("DEB", f"lib/{libraries}"), ("TGZ", "lib"):
        run("cmake", "--preset", preset, f"-DCMAKE_INSTALL_LIBDIR={place}", cwd=tree)
        run("cmake", "--build", "--parallel", str(os.cpu_count()), "--preset", preset, cwd=tree)
        run("cpack", "--config", os.path.join(directory, "CPackConfig.cmake"), "-G", generator, "-B", os.path.join(WORK, preset))
    for pattern in "*.deb", "*.tar.gz":
        for path in glob.glob(os.path.join(WORK, preset, pattern)):
            shutil.copy(path, release)
    return directory


def copy_tables(release, name):
    for table, command in TABLES.items():
        path = os.path.join(ROOT, "build", table)
        if os.path.exists(path):
            shutil.copy(path, os.path.join(release, f"{name}-{table}"))
        else:
            print(f"release.py: there is no build/{table}, so it is not in the release; `{command}` measures it", file=sys.stderr)


def write_checksums(release):
    lines = []
    for name in sorted(os.listdir(release)):
        with open(os.path.join(release, name), "rb") as file:
            lines.append(f"{hashlib.sha256(file.read()).hexdigest()}  {name}\n")
    with open(os.path.join(release, "SHA256SUMS"), "w", encoding="utf-8") as file:
        file.writelines(lines)


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--sources", action="store_true", help="make the source archive alone")
    parser.add_argument("--output", metavar="DIRECTORY", default=os.path.join(ROOT, "build", "release"))
    arguments = parser.parse_args()
    name, release = f"kastarri-{version()}", os.path.abspath(arguments.output)
    shutil.rmtree(release, ignore_errors=True)
    os.makedirs(release)
    sources = source_archive(release, name)
    if arguments.sources:
        print(sources)
        return
    shutil.rmtree(WORK, ignore_errors=True)
    shutil.unpack_archive(sources, WORK)
    tree = os.path.join(WORK, name)
    built = [build(tree, release, preset, libraries) for preset, libraries in WIDTHS.items()]
    shutil.copy(os.path.join(built[0], "reference.html"), os.path.join(release, f"{name}-reference.html"))
    copy_tables(release, name)
    write_checksums(release)
    for directory in built:
        for test, *classes in ("package_test.py", "Archive", "DebianPackages"), ("sources_test.py", "Subproject"):
            run(sys.executable, os.path.join(tree, "tests", "package", test), directory, release, *classes)
    run("sha256sum", "--check", "--quiet", "SHA256SUMS", cwd=release)
    print(f"\n{release}:", *sorted(os.listdir(release)), sep="\n  ")


if __name__ == "__main__":
    main()
