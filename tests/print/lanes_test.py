"""What kastarri/lanes.h reads from every register type, against Python's own integers and floats.

Run as: lanes_test.py LIBRARY
"""

import subprocess
import sys
import unittest

import print_test
from print_test import COMPILERS, DIRECTORY, TYPES, image, lanes, number_text, path, write_image


def expected(register, data):
    kind, bits, count, share = lanes(register)
    whole = int.from_bytes(data, "little")
    own = [whole >> i * share & (1 << bits) - 1 for i in range(count)]
    if kind == "b" or (kind, bits) == ("w", 32):
        return [str(lane) for lane in own]
    return [number_text(kind, bits, lane, "decimal").replace("-nan", "nan").split("(")[0] for lane in own]


class Lanes(unittest.TestCase):
    def test_numbers_are_those_of_the_bits(self):
        for compiler in COMPILERS:
            for standard in ("c++11", "c++17"):
                # Without SSE compilers move singles through the x87, which makes signalling NaNs quiet.
                print_test.build(compiler, "lanes", "-O2", "-msse2", "-mfpmath=sse", "-std=" + standard)
                for seed in range(3):
                    bytes_of = image(seed)
                    run = subprocess.run([path("lanes_" + compiler), write_image("image", bytes_of)], capture_output=True,
                                         text=True, check=False)
                    told = {name: numbers for name, *numbers in map(str.split, run.stdout.splitlines())}
                    self.assertEqual(run.returncode, 0, run.stdout)
                    self.assertEqual(list(told), list(TYPES))
                    for name, numbers in told.items():
                        with self.subTest(compiler=compiler, standard=standard, seed=seed, type=name):
                            self.assertEqual([number.replace("-nan", "nan") for number in numbers],
                                             expected(TYPES[name], bytes_of[name]))


if __name__ == "__main__":
    try:
        unittest.main(argv=[sys.argv[0]])
    finally:
        DIRECTORY.cleanup()
