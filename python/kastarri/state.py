"""The state of the core outside its registers."""

import operator

import numpy as np

from . import _core
from .intrinsics import STATES

FLAGS = ("inexact", "underflow", "overflow", "division by zero", "invalid")
ROUNDINGS = ("nearest", "zero", "up", "down")
_words = np.frombuffer(_core.states, np.uint32)
_prid = np.frombuffer(_core.prid, np.int32)


class State:
    """The state registers by their names, as numbers: state.SAR, state.RoundMode, ... and in words

    rounding   "nearest", "zero", "up" or "down"
    flags      what float operations raised since it was cleared: a set of FLAGS
    PRID       the processor's number
    """

    __slots__ = ()

    def __getattr__(self, name):
        at, count = _place(name)
        return int(_words[at]) if count == 1 else tuple(int(word) for word in _words[at:at + count])

    def __setattr__(self, name, value):
        if name in ("rounding", "flags", "PRID"):
            object.__setattr__(self, name, value)
            return
        at, count = _place(name)
        words = tuple(map(operator.index, (value,) if count == 1 else value))
        if len(words) != count or not all(0 <= word < 2**32 for word in words):
            raise ValueError(f"state.{name} is {'a word' if count == 1 else f'{count} words'} of 32 bits")
        _words[at:at + count] = words

    def __dir__(self):
        return [*super().__dir__(), *STATES]

    def __repr__(self):
        return f"<state: rounding {self.rounding}, flags {', '.join(sorted(self.flags)) or 'none'}, SAR {self.SAR}>"

    @property
    def rounding(self):
        return ROUNDINGS[self.RoundMode & 3]

    @rounding.setter
    def rounding(self, name):
        if name not in ROUNDINGS:
            raise ValueError(f"'{name}' is no rounding: there are {', '.join(ROUNDINGS)}")
        self.RoundMode = ROUNDINGS.index(name)

    @property
    def flags(self):
        return {name for bit, name in enumerate(FLAGS) if self.StickyFlags >> bit & 1}

    @flags.setter
    def flags(self, names):
        unknown = set(names) - set(FLAGS)
        if unknown:
            raise ValueError(f"there are no flags {sorted(unknown)}, but {', '.join(FLAGS)}")
        self.StickyFlags = sum(1 << FLAGS.index(name) for name in set(names))

    @property
    def PRID(self):
        return int(_prid[0])

    @PRID.setter
    def PRID(self, number):
        if not -2**31 <= operator.index(number) < 2**31:
            raise ValueError("state.PRID is a number of 32 bits")
        _prid[0] = number


def _place(name):
    try:
        return STATES[name]
    except KeyError:
        raise AttributeError(f"the core has no state '{name}'") from None


state = State()
