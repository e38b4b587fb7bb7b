"""Faults in rows: one cell of a line of a table exchanged for another that stands in the same column elsewhere.

A line is KIND(cell, cell, ...) in a table (src/**/*.def), or in the definition of a kind of row that stands for several
(src/**/row_kinds.h, src/frame/host_ints.h). Its name is no cell: it is what the row is held to. Nor is the expression of a SCALAR row, which
is a rule (rules.py).
"""

import collections
import glob
import os
import re

NAMELESS = {"REGISTER", "HOST", "HOST_BOTH", "LOADED", "LOADED_HOST", "STORED", "STORED_HOST", "TYPE"}
NAME_COLUMNS = {"SCALAR": {1, 4}, "HELPER": {0, 4}, "TYPE": {0, 4}}  # and what is words or a rule
SHAPED = {"KERNEL", "ROW", "PROTO", "SCALARFP", "SCALARFP_BOTH"}     # column 1 says what the others are
# Kinds of which one can stand for another: they take the same columns.
EXCHANGEABLE = [
    {"LOAD_ROWS", "ELEMENT_LOAD_ROWS"}, {"STORE_ROWS", "ELEMENT_STORE_ROWS"}, {"COPIED", "COPIED_IP", "COPIED_EVERYWHERE"},
    {"SCALARFP", "SCALARFP_BOTH"}, {"PREDICATE_LOAD_ROWS", "PREDICATE_STORE_ROWS"}, {"HOST", "HOST_BOTH", "LOADED_HOST"},
    {"FLOAT_a", "FLOAT_bits", "FLOAT_ab", "FLOAT_acc_ab", "FLOAT_ab_p"}, {"REGISTER", "LOADED", "STORED"},
]

Line = collections.namedtuple("Line", "path number kind cells spans")  # spans: of the kind, then of each cell


def split(text, start):
    """The spans of the cells of text[start:], which begins after the opening parenthesis; None if it does not close."""
    spans, depth, begin, quoted = [], 0, start, False
    for at in range(start, len(text)):
        character = text[at]
        quoted ^= character == '"'
        if quoted:
            continue
        if character in "([":
            depth += 1
        elif character in ")]" and depth:
            depth -= 1
        elif character == ")" or (character == "," and depth == 0):
            cell = text[begin:at]
            left = begin + len(cell) - len(cell.lstrip())
            spans.append((left, left + len(cell.strip())))
            begin = at + 1
            if character == ")":
                return spans
    return None


def read_lines(src):
    """The lines of all tables and kinds of row."""
    lines = []
    paths = glob.glob(os.path.join(src, "*", "*.def")) + glob.glob(os.path.join(src, "*", "row_kinds.h"))
    paths.append(os.path.join(src, "frame", "host_ints.h"))
    for path in sorted(paths):
        with open(path, encoding="utf-8") as file:
            for number, text in enumerate(file, 1):
                match = re.match(r"\s*(?:#define \w+\([^)]*\) )?(?!DOC\b|ENTRY\b)([A-Za-z]\w*)\(", text)
                spans = match and split(text, match.end())
                if not spans:
                    continue
                cells = tuple(text[a:b] for a, b in spans)
                lines.append(Line(os.path.relpath(path, src), number, match[1], cells, (match.span(1), *spans)))
    return lines


def column_key(line, column):
    """What two lines must have in common for cells of the column to be exchanged."""
    if column == -1:
        kinds = next((kinds for kinds in EXCHANGEABLE if line.kind in kinds), {line.kind})
        return ("kind", min(kinds))
    shape = line.cells[1] if line.kind in SHAPED and column > 1 else ""
    return line.kind, len(line.cells), column, shape


def columns(line):
    names = NAME_COLUMNS.get(line.kind, set() if line.kind in NAMELESS else {0})
    return [-1] + [column for column in range(len(line.cells)) if column not in names]


def cell(line, column):
    return line.kind if column == -1 else line.cells[column]


class Mutant(collections.namedtuple("Mutant", "line column value")):
    """A line with one other cell; column -1 is its kind."""

    @property
    def path(self):
        return self.line.path

    @property
    def key(self):
        """What it is known by: no line number, which changes with lines above."""
        line = f"{self.line.kind}({', '.join(self.line.cells)})"
        return f"{self.path} {line}: {cell(self.line, self.column)} -> {self.value}"

    @property
    def number(self):
        return self.line.number

    def apply(self, text):
        """The line's text with the fault in it."""
        begin, end = self.line.spans[self.column + 1]
        return text[:begin] + self.value + text[end:]


def all_mutants(lines):
    """Every exchange within a table; where its table has no other value for a cell, within the family."""
    by_table, by_family = collections.defaultdict(dict), collections.defaultdict(dict)
    for line in lines:
        for column in columns(line):
            key = column_key(line, column)
            by_table[line.path, key][cell(line, column)] = None
            by_family[os.path.dirname(line.path), key][cell(line, column)] = None
    for line in lines:
        for column in columns(line):
            key = column_key(line, column)
            for values in (by_table[line.path, key], by_family[os.path.dirname(line.path), key]):
                others = [value for value in values if value != cell(line, column)]
                if others:
                    break
            for value in others:
                yield Mutant(line, column, value)
