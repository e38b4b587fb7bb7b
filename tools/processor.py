"""The processor of this machine."""

import re

# The features that targets need, best first, by the names that Linux has for them.
NEEDS = {"avx512": {"avx512f", "avx512bw", "avx512dq", "avx512vl"}, "avx2": {"avx2", "fma", "f16c"}, "sse2": {"sse2"}}


def told():
    with open("/proc/cpuinfo", encoding="utf-8") as file:
        return dict(re.findall(r"^(.+?)\s*: (.*)$", file.read(), re.M))


def name():
    """With family and model, as many have the same name."""
    about = told()
    return f"{about['model name']} (family {about['cpu family']}, model {about['model']})"


def features():
    return set(told()["flags"].split())


def runs(target):
    return NEEDS[target] <= features()


def best_target():
    return next(filter(runs, NEEDS))
