#!/usr/bin/env python3
"""Stop the kernel of examples/fir in gdb, look at its registers, and write down the session.

    tools/debug_session.py BUILD    BUILD is a build directory with the library, say build/test

Writes docs/pictures/gdb.svg, and into docs/debugging.md the text between the marks `session`.
"""

import glob
import html
import os
import re
import subprocess
import sys
import tempfile
import textwrap

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
KERNEL = "examples/fir/fir_kernel.cpp"
COLUMNS = 100
COMMANDS = ["break fir_kernel.cpp:{packed}", "run", "print sum", "print filtered", "kastarri print/hex pair[0]",
            "set kastarri format q15", "print filtered", "kastarri print/q30 sum", "delete", "break fir_kernel.cpp:{last}",
            "continue", "print rest"]
QUIET = ["set confirm off", "set print frame-arguments none", "set startup-with-shell off",
         f"set args --output {os.devnull} --picture {os.devnull}"]


def line_after(text):
    """The line of the kernel behind the one that holds `text`."""
    with open(os.path.join(ROOT, KERNEL), encoding="utf-8") as file:
        return next(number for number, line in enumerate(file, 1) if text in line) + 1


def session(build):
    """The lines of the session. Names of files are those of the sources; the program's own output is left out."""
    with tempfile.TemporaryDirectory() as directory:
        program = os.path.join(directory, "fir")
        sources = [os.path.relpath(path, ROOT) for path in sorted(glob.glob(os.path.join(ROOT, "examples/fir/*.cpp")))]
        subprocess.run(["g++", "-m32", "-g", "-std=c++17", "-Iinclude", "-Iexamples", '-DEXAMPLE_DATA="examples/data"', *sources,
                        "-L" + build, "-lkastarri", "-Wl,-rpath," + build, "-o", program], cwd=ROOT, check=True)
        commands = [c.format(packed=line_after("PACKVRNX48"), last=line_after("rest._[0] =")) for c in COMMANDS]
        words = [word for command in QUIET for word in ("-ex", command)]
        words += [word for command in commands for word in ("-ex", f"echo (gdb) {command}\\n", "-ex", command)]
        result = subprocess.run(["gdb", "-nx", "-q", "-batch", "-iex", "add-auto-load-safe-path " + build, *words, program],
                                cwd=ROOT, capture_output=True, text=True, check=True)
    if result.stderr:
        sys.exit(result.stderr)
    start = result.stdout.index("(gdb)")
    lines = re.sub(r"\[Thread debugging.*\nUsing host.*\n|\[Inferior .*\n", "", result.stdout[start:]).splitlines()
    return [part for line in lines if line for part in wrapped(line)]


def wrapped(line):
    return textwrap.wrap(line, COLUMNS, subsequent_indent="    ", break_on_hyphens=False) if len(line) > COLUMNS else [line]


def picture(lines):
    advance, height, margin = 7.8, 18, 16
    width, total = round(COLUMNS * advance + 2 * margin), len(lines) * height + 2 * margin
    out = [f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {width} {total}" width="{width}" height="{total}"',
           '     font-family="DejaVu Sans Mono, Menlo, Consolas, monospace" font-size="13" fill="#c9d1d9">',
           f'<rect width="{width}" height="{total}" rx="8" fill="#161b22"/>']
    for row, line in enumerate(lines):
        text = html.escape(line, quote=False)
        text = re.sub(r"^\(gdb\)(.*)", r'<tspan fill="#7ee787">(gdb)</tspan><tspan fill="#ffffff" font-weight="bold">\1</tspan>', text)
        text = re.sub(r"^(\$\d+ = )?(\d+ x [\w ]+|bits 0\.\.\d+)", r'\1<tspan fill="#79c0ff">\2</tspan>', text)
        out.append(f'<text x="{margin}" y="{margin + 13 + row * height}" xml:space="preserve">{text}</text>')
    return "\n".join(out + ["</svg>", ""])


def main():
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    lines = session(os.path.abspath(sys.argv[1]))
    os.makedirs(os.path.join(ROOT, "docs", "pictures"), exist_ok=True)
    with open(os.path.join(ROOT, "docs", "pictures", "gdb.svg"), "w", encoding="utf-8") as file:
        file.write(picture(lines))
    page = os.path.join(ROOT, "docs", "debugging.md")
    with open(page, encoding="utf-8") as file:
        text = file.read()
    before, after = re.match(r"(.*<!-- session -->\n).*(<!-- /session -->.*)", text, re.S).groups()
    with open(page, "w", encoding="utf-8") as file:
        file.write(before + "```\n" + "\n".join(lines) + "\n```\n" + after)


if __name__ == "__main__":
    main()
