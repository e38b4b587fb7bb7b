"""The register types, and operands made of what is no array of the right kind."""

import re

import numpy as np

from . import _core
from .intrinsics import REGISTER_TYPES

_FORMS = {"": (0, 0), "d": (0, 0), "hex": (1, 0), "float": (2, 0), "half": (3, 0)}


class RegisterType:
    """How the lanes of a register lie in an array: `dtype`, and `lanes` in the last axis (1: there is no such axis).

    Called with values, it makes a register of them.
    """

    def __init__(self, name, kind, bits, count, dtype, lanes):
        self.name, self.kind, self.bits, self.count = name, kind, bits, count
        self.dtype, self.lanes = dtype, lanes
        self.__doc__ = f"{REGISTER_TYPES[name]}: {self._shape()}"

    def _shape(self):
        return f"{self.dtype}" + (f", {self.lanes} in the last axis" if self.lanes > 1 else ", without an axis of its own")

    def __call__(self, values=0):
        return Register(self, coerce(values, self.name, self.name, "the register"))

    def __repr__(self):
        return f"<{self.name}: {self.__doc__}>"


class Register:
    """An array and how its lanes are to be read; the last axis is the lanes, others count registers.

    It can stand wherever an array can, and is shown as the debugger's printers show it; as a format (`f"{v:q15}"`) there
    are hex, float, half and q with the bits of the fraction.
    """

    __slots__ = ("type", "value")

    def __init__(self, register_type, value):
        self.type, self.value = register_type, value

    def __array__(self, dtype=None, copy=None):
        return self.value if dtype is None else self.value.astype(dtype)

    def __repr__(self):
        return format(self)

    def __format__(self, form):
        fraction = re.fullmatch(r"q(\d{1,2})", form)
        if not fraction and form not in _FORMS:
            raise ValueError(f"'{form}' is no format of registers: there are hex, float, half and q15")
        kind, bits = (4, int(fraction[1])) if fraction else _FORMS[form]
        lanes = (self.type.lanes,) if self.type.lanes > 1 else ()
        axes = self.value.ndim - len(lanes)
        registers = self.value.reshape(-1, *lanes) if axes else self.value[np.newaxis]
        return "\n".join(_core.text(self.type.name, register, kind, bits) for register in registers)


def _numbers(value, dtype, where):
    """Numbers without a type of their own, as those of the type."""
    array = np.asarray(value)
    if array.dtype.kind not in "biuf" or (array.dtype.kind == "f" and dtype.kind != "f"):
        raise TypeError(f"{where}: {array.dtype} where {dtype} is needed")
    if dtype.kind in "iu":
        _expect_range(array, dtype, where)
    elif dtype.kind == "b" and array.dtype.kind != "b" and not np.isin(array, (0, 1)).all():
        raise ValueError(f"{where}: a predicate is of True and False")
    return array.astype(dtype)


def _expect_range(array, dtype, where):
    bounds = np.iinfo(dtype)
    if array.size and array.dtype.kind != "b" and not (bounds.min <= int(array.min()) and int(array.max()) <= bounds.max):
        raise ValueError(f"{where}: a number is not within {bounds.min} to {bounds.max}")


def coerce(value, type_name, intrinsic, parameter):
    """An array of the type's lanes. Arrays have to be of a type that loses nothing; lists and numbers, and what a host
    number is passed as, have to be within its range."""
    is_register, _, _, _, dtype, lanes = _core.types[type_name]
    where = f"{intrinsic}: {parameter}"
    if isinstance(value, Register):
        if is_register and value.type.name != type_name:
            raise TypeError(f"{where} is a {type_name}, not a {value.type.name}")
        value = value.value
    if isinstance(value, (np.ndarray, np.generic)) and is_register:
        if not np.can_cast(value.dtype, dtype, "safe"):
            raise TypeError(f"{where} is of {dtype}, not of {value.dtype}; astype({dtype}) makes it so")
        array = np.asarray(value, dtype)
    else:
        array = _numbers(value, dtype, where)
    if lanes > 1:
        if array.ndim == 0:
            array = np.full(lanes, array)
        elif array.shape[-1] != lanes:
            raise ValueError(f"{where} has {array.shape[-1]} lanes; a {type_name} has {lanes} of {dtype}")
    # With lanes one behind the other, at addresses that suit numbers.
    return np.require(array, dtype, ["C", "A"]) if array.ndim else np.array(array)


_core.set_coerce(coerce)
TYPES = {name: RegisterType(name, *row[1:]) for name, row in _core.types.items() if row[0]}
