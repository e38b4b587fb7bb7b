#!/usr/bin/env python3
"""The demo: its verdict is that of the programs, and its page shows what they made.

    demo_test.py BUILD
"""

import base64
import os
import re
import struct
import subprocess
import sys
import unittest
import xml.etree.ElementTree
import zlib

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
BUILD = sys.argv.pop(1)


def demo(*wrapper):
    """The last line and the exit status."""
    run = subprocess.run([os.path.join(ROOT, "tools", "demo", "run.py"), BUILD, *wrapper], stdout=subprocess.PIPE,
                         text=True, check=False)
    return run.stdout.splitlines()[-1], run.returncode


class Demo(unittest.TestCase):
    def test_one_kernel_that_differs_is_told(self):
        for script, told in [('case $0 in */fir) exit 1;; esac; exec "$0" "$@"', "fir ended with 1"),
                             ('case $0 in */fir) exec true;; esac; exec "$0" "$@"', "fir checked nothing")]:
            self.assertEqual(demo("sh", "-c", script), ("7 of 8 kernels equal to plain C: " + told, 1))

    def test_page_shows_what_the_kernels_made(self):
        verdict, status = demo()
        self.assertRegex(verdict, r"^8 kernels, every value equal to plain C \([\d,]+ values\)$")
        self.assertEqual(status, 0)
        with open(os.path.join(BUILD, "index.html"), encoding="utf-8") as file:
            page = file.read()
        self.assertIn(verdict, page)
        shown = re.findall(r'src="(.*?)"', page)
        self.assertEqual(len(shown), 8 * 2 + 5)
        for path in (os.path.join(BUILD, name) for name in shown):
            with open(path, "rb") as file:
                start = {".wav": b"RIFF", ".png": b"\x89PNG", ".svg": b"<svg"}[os.path.splitext(path)[1]]
                self.assertTrue(file.read().startswith(start), path)
            if path.endswith(".svg"):
                tags = [element.tag.rpartition("}")[2] for element in xml.etree.ElementTree.parse(path).getroot()]
                self.assertEqual(tags[:2], ["title", "desc"], path)
        self.check_picture_in_plot()

    def check_picture_in_plot(self):
        """The plot of the spectrogram holds the picture that was written."""
        with open(os.path.join(BUILD, "demo-output", "fft-plot.svg"), encoding="utf-8") as file:
            png = base64.b64decode(re.search("data:image/png;base64,(.*?)'", file.read())[1], validate=True)
        with open(os.path.join(BUILD, "demo-output", "fft.pgm"), "rb") as file:
            _, size, _, pixels = file.read().split(b"\n", 3)
        width, height = map(int, size.split())
        chunks, at = {}, 8
        while at < len(png):
            length, name = struct.unpack(">I4s", png[at:at + 8])
            end = at + 8 + length
            self.assertEqual(png[end:end + 4], struct.pack(">I", zlib.crc32(png[at + 4:end])), name)
            chunks[name], at = png[at + 8:end], end + 4
        self.assertEqual(list(chunks), [b"IHDR", b"PLTE", b"IDAT", b"IEND"])
        self.assertEqual(chunks[b"IHDR"], struct.pack(">IIBBBBB", width, height, 8, 3, 0, 0, 0))
        rows = zlib.decompress(chunks[b"IDAT"])
        self.assertEqual(rows, b"".join(b"\0" + pixels[y * width:(y + 1) * width] for y in range(height)))


if __name__ == "__main__":
    unittest.main()
