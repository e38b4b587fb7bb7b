"""Holds every row of the tables to its name.

    names_test.py [--root DIRECTORY] [test...]    DIRECTORY holds src/; the one of this file if none is given

A name says what its intrinsic does (vocabulary.py and the modules beside it, one a family). The rows are what the
library is made of. Neither knows of the other: a row that compares as signed under a name with U fails here.
"""

import argparse
import os
import sys
import unittest

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import rows as tables  # noqa: E402
from grammar import expected_of, operation_of  # noqa: E402
from rows import read_tables  # noqa: E402
from vocabulary import Unknown  # noqa: E402


def faults(table, twins):
    """What each row of a table has that its name does not say."""
    for row in table.rows:
        try:
            expected = expected_of(row.name, twins)
        except Unknown:
            yield row.name, "no rule of the grammar reads this name"
            continue
        for what in ("prototype", "shape"):
            if getattr(row, what) != getattr(expected, what):
                yield row.name, f"{what} {getattr(row, what)}, but the name says {getattr(expected, what)}"
        kernel = table.kernels.get(row.kernel, (row.kernel,))
        if expected.kernels and kernel not in expected.kernels:
            yield row.name, f"handed to {row.kernel} {kernel}, but the name says {' or '.join(map(str, expected.kernels))}"


def unused_kernels(table):
    """Semantic functions that no row is handed to."""
    return set(table.kernels) - {row.kernel for row in table.rows}


def check(paths, root=tables.ROOT, twins=None):
    """The faults of the tables at `paths`, as (table, name, what). `twins` are the names that there are, by default
    those of the tables."""
    read = tables.read(paths, root)
    names = twins if twins is not None else {operation_of(row.name) for table in read for row in table.rows}
    return [(table.path, name, what) for table in read for name, what in faults(table, names)] + [
        (table.path, name, "a semantic function without a row") for table in read for name in sorted(unused_kernels(table))]


def all_tables():
    return [table for family in read_tables.tables_by_family().values() for table in family]


class Names(unittest.TestCase):
    maxDiff = None

    def test_every_row_is_what_its_name_says(self):
        self.assertEqual([f"{path}: {name}: {what}" for path, name, what in check(all_tables(), ARGUMENTS.root)], [])

    def test_names_that_differ_in_a_letter_say_different_things(self):
        for pair in (("LTUNX16", "LTNX16"), ("SUBSNX16T", "SUBNX16T"), ("SRAN_2X32", "SRLN_2X32"), ("LTRSN_2", "LTRN_2"),
                     ("LVNX8U_I", "LVNX8S_I"), ("GATHERANX8U", "GATHERANX16U"), ("MAXU2NX8", "MAX2NX8"),
                     ("LSN_2X32_IP", "LSN_2X32_I"), ("RADDUNX16", "RADDNX16"), ("MULUSANX16", "MULUSSNX16"),
                     ("PACKVRNX48", "PACKVRNRNX48"), ("RMAXUNX16", "RMAXNX16"),
                     ("RORANX16", "RORNX16"), ("RANDNX16", "RXORNX16"), ("SUBWUANX16", "SUBWUSNX16"), ("ADDWUNX16", "ADDWNX16"),
                     ("ADDWNX16", "SUBWNX16"), ("OLTNXF16", "ULTNXF16")):
            expected = [expected_of(f"rk_zra32_ZRA_{name}", set()) for name in pair]
            self.assertNotEqual((expected[0].shape, expected[0].kernels), (expected[1].shape, expected[1].kernels), pair)


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--root", default=tables.ROOT)
    ARGUMENTS, rest = parser.parse_known_args()
    unittest.main(argv=[sys.argv[0], *rest])
