"""Which rules read a name: those of its family, of which just one fits."""

import floats
import integer
import memory
import multiply
import registers
import scalar
from vocabulary import Unknown

RULES = [rule for family in (registers, scalar, memory, integer, multiply, floats) for rule in family.RULES]


def operation_of(symbol):
    """ADDNX16 of rk_zra32_ZRA_ADDNX16; other names as they are, without the vector unit's package."""
    return symbol.removeprefix("rk_zra32_").removeprefix("ZRA_")


def expected_of(symbol, twins):
    """What the name of a row says. `twins` are all names that there are."""
    readings = []
    for rule in RULES:
        try:
            readings.append(rule(operation_of(symbol), twins))
        except Unknown:
            pass
    if len(readings) != 1:
        raise Unknown(f"{symbol}: {len(readings)} rules read it")
    return readings[0]
