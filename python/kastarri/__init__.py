"""Every intrinsic of the core on arrays of NumPy.

    kastarri.ADDSNX16(a, b)       the intrinsic ADDSNX16; help(kastarri.ADDSNX16) tells its rule
    kastarri.qv_vecNx16(values)   a register as the debugger shows it
    kastarri.state                rounding mode, flags and the other states of the core
    kastarri.ports                what the intrinsics of the ports call

Lanes are the last axis of an array; leading axes count registers and are broadcast. What an intrinsic changes in place
it returns here: acc = kastarri.MULANX16(acc, a, b).
"""

from . import ports
from ._core import version as __version__
from .intrinsics import *  # noqa: F403
from .intrinsics import __all__ as intrinsics
from .registers import TYPES as _TYPES
from .registers import Register, RegisterType
from .state import state

globals().update(_TYPES)
__all__ = [*intrinsics, *_TYPES, "Register", "RegisterType", "intrinsics", "ports", "state"]


def __getattr__(name):
    # By the names that the core's own sources have for the vector unit.
    if name.startswith("ZRA_") and name[4:] in globals():
        return globals()[name[4:]]
    raise AttributeError(f"kastarri has no '{name}'")
