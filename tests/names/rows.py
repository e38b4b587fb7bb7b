"""Reads the tables: rows and semantic functions as the C++ preprocessor leaves them."""

import collections
import os
import re
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import read_tables  # noqa: E402

Row = collections.namedtuple("Row", "name prototype shape kernel")
Table = collections.namedtuple("Table", "path rows kernels")

HOST_WORDS = {"void", "bool", "char", "short", "int", "long", "float", "double", "signed", "unsigned", "const", "immediate"}
REGISTER_TYPE = re.compile(r"(qv_|vbool|rkbool|rkfloat$|valign$)")


def nameless(parameter):
    """`const qv_int8& a` as `const qv_int8&`: the type alone, spelt in one way."""
    words = re.findall(r"\w+|[&*]", parameter)
    if words and re.match(r"\w", words[-1]) and words[-1] not in HOST_WORDS and not REGISTER_TYPE.match(words[-1]):
        words.pop()
    return re.sub(r" (?=[&*])", "", " ".join(words))


def type_of(declaration, symbol):
    """The prototype without the names of the function and of its parameters."""
    result, parameters = re.match(rf"(.*?)\s*\b{symbol}\s*\(\s*(.*?)\s*\)$", declaration).groups()
    return f"{nameless(result)}({', '.join(nameless(p) for p in parameters.split(',') if p.strip())})"


def columns(text):
    """The columns of a row, cut at commas outside of <...> and (...)."""
    cells, depth = [""], 0
    for character in text:
        depth += (character in "<(") - (character in ">)")
        if character == "," and depth == 0:
            cells.append("")
        else:
            cells[-1] += character
    return tuple(re.sub(r"\s+", " ", cell).strip() for cell in cells)


def read(paths, root=ROOT):
    """The tables at `paths`, which are relative to src/ below `root`."""
    read_tables.ROOT = root
    text = read_tables.READER + (
        "#define KERNEL(OP, ...) @kernel{OP@,__VA_ARGS__}@\n"
        "#define ENTRY(SYMBOL, SHAPE, ...) @row{SYMBOL@,SHAPE@,SIG_##SHAPE(SYMBOL, __VA_ARGS__)@,__VA_ARGS__}@\n"
        "#define HELPER ENTRY\n"
        '#include "frame/rows.h"\n')
    text += "".join(f'@table{{{path}}}@\n#include "{path}"\n' for path in paths)
    tables = []
    for kind, fields in read_tables.records(text):
        if kind == "table":
            tables.append(Table(fields[0], [], {}))
        elif kind == "kernel":
            tables[-1].kernels[fields[0]] = columns(fields[1])
        elif kind == "row":
            symbol, shape, declaration, cells = fields
            tables[-1].rows.append(Row(symbol, type_of(declaration, symbol), shape, columns(cells)[-1]))
    return tables
