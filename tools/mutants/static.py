"""What is wrong with a row without building it: its prototype is not the committed one, or its name says otherwise.

Many faults are tried at once, at most one a line: a fault is judged by the rows that come of its line alone.
"""

import collections
import os
import re
import shutil
import subprocess
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tests", "names")]
import read_tables  # noqa: E402
import names_test  # noqa: E402


def preprocess(text):
    """What the preprocessor makes of a text, errors and all: a fault may leave macros with the wrong arguments."""
    return subprocess.run(["g++", "-E", "-P", "-x", "c++", "-I", os.path.join(read_tables.ROOT, "src"), "-"],
                          input=text, capture_output=True, text=True, check=False).stdout


read_tables.preprocess = preprocess


class Tree:
    """A scratch copy of what the static checks read. In a marked one every line says which it is, to the preprocessor."""

    def __init__(self, directory, lines=()):
        self.directory = directory
        shutil.copytree(os.path.join(ROOT, "src"), os.path.join(directory, "src"))
        self.texts, self.marked = {}, collections.defaultdict(list)
        for line in lines:
            if line.kind != "TYPE":
                self.marked[line.path].append(line.number)
        for path in self.marked:
            self.write(path, self.lines(path))

    def lines(self, path):
        if path not in self.texts:
            with open(os.path.join(ROOT, "src", path), encoding="utf-8") as file:
                self.texts[path] = file.read().split("\n")
        return list(self.texts[path])

    def write(self, path, lines):
        for number in self.marked[path]:
            head, code, continued = re.match(r"(#define \w+\([^)]*\) )?(.*?)(\s*\\)?$", lines[number - 1]).groups()
            lines[number - 1] = f'{head or ""}@begin{{"{path}:{number}"}}@ {code} @end{{}}@{continued or ""}'
        with open(os.path.join(self.directory, "src", path), "w", encoding="utf-8") as file:
            file.write("\n".join(lines))

    def plant(self, mutants):
        """Writes the files that the mutants are in."""
        for path, group in by_path(mutants).items():
            lines = self.lines(path)
            for mutant in group:
                lines[mutant.line.number - 1] = mutant.apply(lines[mutant.line.number - 1])
            self.write(path, lines)

    def restore(self, mutants):
        for path in by_path(mutants):
            self.write(path, self.lines(path))

    def records(self):
        """All that the tables say, in order: rows with their prototypes, semantic functions and marks."""
        read_tables.ROOT = self.directory
        tables = read_tables.tables_by_family().values()
        return read_tables.records(
            read_tables.READER + '#define DOC(...)\n'
            '#define ENTRY(SYMBOL, SHAPE, ...) @row{SYMBOL@,SIG_##SHAPE(SYMBOL, __VA_ARGS__)@,__VA_ARGS__}@\n#define HELPER ENTRY\n'
            '#define KERNEL(OP, ...) @kernel{OP}@\n#include "frame/rows.h"\n'
            + "".join(f'#include "{table}"\n' for family in tables for table in family))

    def marked_records(self):
        """The records, each with the lines that it comes of: the table's first, then those of kinds of row."""
        stack = []
        for kind, fields in self.records():
            if kind == "begin":
                path, number = fields[0].strip('"').split(":")
                stack.append((path, int(number)))
            elif kind == "end":
                stack.pop()
            else:
                yield kind, fields, tuple(stack)

    def prototypes(self):
        """Line -> its rows and their prototypes."""
        found = collections.defaultdict(list)
        for kind, fields, places in self.marked_records():
            for at in places if kind == "row" else ():
                found[at].append(fields[1])
        return found

    def types(self):
        """Register type -> what the headers say of it, but for its conversions, which stand in other lines."""
        read_tables.ROOT = self.directory
        return {name: (t.cls, t.unit, t.units, t.lanes, t.shape) for name, t in read_tables.read_types().items()}

    def conversions(self):
        """What the headers say of the conversions of all register types."""
        read_tables.ROOT = self.directory
        return {"all": [(t.sources, t.targets) for t in read_tables.read_types().values()]}


def by_path(mutants):
    paths = collections.defaultdict(list)
    for mutant in mutants:
        paths[mutant.path].append(mutant)
    return paths


def rows_of_lines(marked):
    """Line -> the rows that come of it: its own, of a semantic function those that call it."""
    rows, kernels, callers = collections.defaultdict(set), [], collections.defaultdict(set)
    for kind, fields, places in marked.marked_records():
        if kind == "row":
            for at in places:
                rows[at].add(fields[0])
            callers[places[0][0], fields[-1].split(",")[-1].strip()].add(fields[0])
        else:
            kernels.append((places, fields[0]))
    for places, kernel in kernels:
        for at in places:
            rows[at] |= callers[places[0][0], kernel]
    return rows


HOST_KINDS = ("HOST", "HOST_BOTH")


def place(mutant):
    return mutant.line.path, mutant.line.number


def passes(mutants):
    """Groups that can be judged together: a mutant a line, semantic functions apart from rows, and what is written once
    for many lines, and kinds of conversion, alone."""
    groups = collections.defaultdict(lambda: collections.defaultdict(list))
    for number, mutant in enumerate(mutants):
        shared = mutant.path.endswith(".h") or (mutant.line.kind in HOST_KINDS and mutant.column == -1)
        groups[number if shared else mutant.line.kind == "KERNEL", shared][place(mutant)].append(mutant)
    for lines in groups.values():
        for turn in range(max(map(len, lines.values()))):
            yield [found[turn] for found in lines.values() if turn < len(found)]


def judge(directory, lines, mutants, progress, by_names=True):
    """Mutant -> what finds it, of the mutants that the static checks find; and the rows of each line."""
    tree, marked = Tree(os.path.join(directory, "plain")), Tree(os.path.join(directory, "marked"), lines)
    rows, found = rows_of_lines(marked), {}
    judge_by_headers(marked, [m for m in mutants if m.line.kind not in ("KERNEL", "TYPE")], Tree.prototypes, place, found, progress)
    judge_by_headers(tree, [m for m in mutants if m.line.kind == "TYPE"], Tree.types, lambda m: m.line.cells[0], found, progress)
    kinds = [m for m in mutants if m not in found and m.line.kind in HOST_KINDS and m.column == -1]
    judge_by_headers(tree, kinds, Tree.conversions, lambda m: "all", found, progress)
    if by_names:
        judge_by_names(tree, [m for m in mutants if m not in found], rows, found, progress)
    return found, rows


def judge_by_headers(tree, mutants, declarations, key, found, progress):
    committed = declarations(tree)
    for group in passes(mutants):
        tree.plant(group)
        declared = declarations(tree)
        for mutant in group:
            if declared.get(key(mutant)) != committed[key(mutant)]:
                found[mutant] = "prototype"
        tree.restore(group)
        progress(len(group))


def judge_by_names(tree, mutants, rows, found, progress):
    tables = names_test.all_tables()
    twins = {names_test.operation_of(name) for names in rows.values() for name in names}
    for group in passes(mutants):
        tree.plant(group)
        touched = {mutant.path for mutant in group}
        read = [t for t in tables if t in touched] if touched <= set(tables) else tables
        named = {name for _, name, _ in names_test.check(read, tree.directory, twins)}
        for mutant in group:
            if rows[place(mutant)] & named:
                found[mutant] = "name"
        tree.restore(group)
        progress(len(group))
