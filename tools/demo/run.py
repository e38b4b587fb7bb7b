#!/usr/bin/env python3
"""Run the examples of a build on the data that is shipped and say whether every kernel equals plain C.

    tools/demo/run.py BUILD [WRAPPER...]     WRAPPER: a command to run each of them under, such as valgrind

Sounds and pictures go to BUILD/demo-output, and a page that shows them before and after to BUILD/index.html. The
exit status is 0 if every example ran and found every value equal.
"""

import html
import os
import re
import shutil
import string
import struct
import subprocess
import sys
import zlib

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(os.path.dirname(HERE))
DATA = os.path.join("examples", "data")
SOUND, PHOTO = "guitar.wav", "camera.pgm"

# Name, its input, the kind of its output, whether it draws a picture of what happened, and what the page says of it.
EXAMPLES = [
    ("fir", SOUND, ".wav", True, "A low-pass filter", "Takes the treble out of the recording, with 64 taps."),
    ("mixer", SOUND, ".wav", True, "A frequency shift", "Moves every frequency up by the same amount; chords turn into bells."),
    ("biquad", SOUND, ".wav", True, "An equaliser", "Less bass and middle, more treble, in single precision. In half precision "
     "its coefficients are too coarse for the bass."),
    ("fft", SOUND, ".pgm", True, "A spectrogram", "Which frequencies sound when: Fourier transforms of 1,024 points, one after "
     "the other. All numbers of a block share an exponent, which each of ten stages chooses anew."),
    ("convolve", PHOTO, ".pgm", False, "Edges", "The steepest of four slopes about each pixel, by four masks."),
    ("threshold", PHOTO, ".pgm", False, "Dark and light", "Parted at a level that the kernel finds by its reductions."),
    ("histogram", PHOTO, ".pgm", True, "A gamma curve", "Each grey looked up in a table by a gather, and counted by a scatter. "
     "Both reach one element at a time, as plain C does, and put it into a register besides: plain C is faster."),
    ("ports", SOUND, ".wav", False, "A volume control", "The recording goes through the core's queues, sample by sample, to half "
     "its volume."),
]


def run(example, build, out, wrapper):
    """What an example printed, complaints included, and its exit status."""
    name, _, kind, draws, *_ = example
    command = [*wrapper, os.path.join(build, "examples", name), "--output", os.path.join(out, name + kind)]
    if draws:
        command += ["--picture", os.path.join(out, name + "-plot.svg")]
    result = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)
    print(result.stdout)
    return result.stdout, result.returncode


def values_checked(report):
    """How many values an example says it has found equal: the numbers of its line `check`."""
    line = re.search(r"^  check +(.*), all equal to plain C$", report, re.M)
    return sum(map(int, re.findall(r"\b(\d+) [a-z]", line[1]))) if line else 0


def png(pgm):
    """A grey picture, from the bytes of a binary PGM as the examples write it to those of a PNG."""
    _, size, _, pixels = pgm.split(b"\n", 3)
    width, height = map(int, size.split())

    def chunk(name, data):
        return struct.pack(">I", len(data)) + name + data + struct.pack(">I", zlib.crc32(name + data))

    rows = b"".join(b"\0" + pixels[y * width:(y + 1) * width] for y in range(height))
    head = struct.pack(">IIBBBBB", width, height, 8, 0, 0, 0, 0)
    return b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", head) + chunk(b"IDAT", zlib.compress(rows)) + chunk(b"IEND", b"")


def convert(out):
    """A PNG beside every picture: the photographs, and the drawings where there is a program that does it."""
    rsvg = shutil.which("rsvg-convert")
    if not rsvg:
        print("Drawings are not written as PNG: rsvg-convert is missing")
    for name in sorted(os.listdir(out)):
        path, kind = os.path.splitext(os.path.join(out, name))
        if kind == ".pgm":
            with open(path + kind, "rb") as pgm, open(path + ".png", "wb") as file:
                file.write(png(pgm.read()))
        elif kind == ".svg" and rsvg:
            subprocess.run([rsvg, path + kind, "-o", path + ".png"], check=True)


def media(kind, source, what):
    source, what = html.escape(source), html.escape(what)
    shown = (f'<audio controls preload="metadata" src="{source}" aria-label="{what}"></audio>' if kind == ".wav" else
             f'<img src="{source}" alt="{what}">')
    return f"<figure>{shown}<figcaption>{what}</figcaption></figure>"


def section(example, report):
    name, source, kind, draws, title, text = example

    def figure(file, what):
        stem, its_kind = os.path.splitext(file)
        return media(its_kind, "demo-output/" + (stem + ".png" if its_kind == ".pgm" else file), what)

    plot = (f'<figure class="plot"><img src="demo-output/{name}-plot.svg" alt="What {name} did, as a plot"></figure>'
            if draws else "")
    return (f'<section><h2>{html.escape(title)} <code>{name}</code></h2><p>{html.escape(text)}</p>'
            f'<div class="pair">{figure(source, "before")}{figure(name + kind, "after")}</div>{plot}'
            f"<pre>{html.escape(report)}</pre></section>")


def page(verdict, good, reports):
    with open(os.path.join(HERE, "page.html"), encoding="utf-8") as file:
        template = string.Template(file.read())
    return template.substitute(verdict=html.escape(verdict), state="good" if good else "bad",
                               sections="\n".join(section(example, reports[example[0]]) for example in EXAMPLES))


def main():
    if len(sys.argv) < 2:
        sys.exit(__doc__)
    build = os.path.relpath(os.path.abspath(sys.argv[1]), ROOT)
    os.chdir(ROOT)  # so that paths are short
    out = os.path.join(build, "demo-output")
    shutil.rmtree(out, ignore_errors=True)
    os.makedirs(out)
    for name in (SOUND, PHOTO):
        shutil.copy(os.path.join(DATA, name), out)

    print(f"{len(EXAMPLES)} kernels on a recording and a photograph, each checked against plain C\n")
    reports, equal, values = {}, 0, 0
    failed = []
    for example in EXAMPLES:
        report, status = run(example, build, out, sys.argv[2:])
        reports[example[0]] = report
        checked = values_checked(report)
        if status == 0 and checked > 0:
            equal += 1
            values += checked
        else:
            failed.append(f"{example[0]} ended with {status}" if status else f"{example[0]} checked nothing")
    convert(out)
    verdict = (f"{equal} of {len(EXAMPLES)} kernels equal to plain C: {', '.join(failed)}" if failed else
               f"{equal} kernels, every value equal to plain C ({values:,} values)")
    with open(os.path.join(build, "index.html"), "w", encoding="utf-8") as file:
        file.write(page(verdict, not failed, reports))
    print(f"To look at and to listen to: {os.path.join(build, 'index.html')}")
    print(verdict)
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
