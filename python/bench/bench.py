#!/usr/bin/env python3
"""Compare calls from Python on blocks of 1,000 registers with loops of calls in C++.

    g++ -O2 -march=native -Iinclude python/bench/loops.cpp -Lbuild/test-64 -lkastarri -Wl,-rpath,$PWD/build/test-64 -o build/loops
    PYTHONPATH=build/test-64/python python/bench/bench.py build/loops

prints nanoseconds a register, the least of many runs that alternate. Python runs twice: into new arrays, and with out=,
which is the operand that the intrinsic changes, as in C++, or else the same array every time.
"""

import subprocess
import sys
import time

import numpy as np

import kastarri

COUNT, ROUNDS, RUNS = 1000, 12, 60
NAMES = ["ADDNX16", "ADDSNX16", "ADDSNX16T", "LTNX16", "SRAINX16", "MULNX16", "MULANX16", "MULA2NX8", "PACKVRNX48", "ADDN_2XF32",
         "MULAN_2XF32", "RADDNX16", "LVNX16_I"]


def operands(name):
    """Arrays for an intrinsic: small numbers of all kinds."""
    random = np.random.default_rng(1)
    half = random.integers(-9000, 9000, (COUNT, 32)).astype(np.int16)
    byte = random.integers(-90, 90, (COUNT, 64)).astype(np.int8)
    single = random.normal(size=(COUNT, 16)).astype(np.float32)
    wide, narrow = half.astype(np.int64) * 1000, byte.astype(np.int64) * 100
    return {"ADDSNX16T": (half, half, half, half > 0), "SRAINX16": (half, 3), "MULANX16": (wide, half, half),
            "MULA2NX8": (narrow, byte, byte), "PACKVRNX48": (wide, 4), "ADDN_2XF32": (single, single),
            "MULAN_2XF32": (single, single, single), "RADDNX16": (half,),
            "LVNX16_I": (half, np.arange(COUNT, dtype=np.int32) * 64)}.get(name, (half, half))


def nanoseconds(function, arguments, **options):
    least = 1e9
    for _ in range(RUNS):
        begin = time.perf_counter_ns()
        function(*arguments, **options)
        least = min(least, time.perf_counter_ns() - begin)
    return least / COUNT


def main():
    best = {name: [1e9, 1e9, 1e9] for name in NAMES}
    with subprocess.Popen([sys.argv[1]], stdin=subprocess.PIPE, stdout=subprocess.PIPE, text=True) as loops:
        for _ in range(ROUNDS):
            for name, least in best.items():
                function, arguments = getattr(kastarri, name), operands(name)
                changes = "Returns acc," in function.__doc__ or "Returns r," in function.__doc__
                out = arguments[0].copy() if changes else function(*arguments)
                loops.stdin.write(name + "\n")
                loops.stdin.flush()
                measured = [float(loops.stdout.readline()), nanoseconds(function, arguments),
                            nanoseconds(function, (out, *arguments[1:]) if changes else arguments, out=out)]
                best[name] = [min(pair) for pair in zip(least, measured)]
        loops.stdin.close()
    print("| intrinsic | C++ | Python | ratio | Python, out= | ratio |\n|---|---|---|---|---|---|")
    for name, (cpp, new, again) in best.items():
        print(f"| `{name}` | {cpp:.1f} | {new:.1f} | {new / cpp:.2f} | {again:.1f} | {again / cpp:.2f} |")


if __name__ == "__main__":
    main()
