"""Faults in rules: one operator or constant of src/**/*.cpp, src/**/*.h and of the expressions of SCALAR rows."""

import collections
import glob
import os
import re

import cells

OPERATORS = {"+": "-", "-": "+", "*": "+", "/": "*", "%": "/", "<<": ">>", ">>": "<<", "&": "|", "|": "&", "^": "|",
             "&&": "||", "||": "&&", "<": "<=", "<=": "<", ">": ">=", ">=": ">", "==": "!=", "!=": "==",
             "+=": "-=", "-=": "+=", "*=": "+=", "&=": "|=", "|=": "&=", "^=": "|=", "<<=": ">>=", ">>=": "<<="}
WORDS = {"true": "false", "false": "true", "min": "max", "max": "min"}
# The tokens of a line that are looked at. What a formatter puts spaces around is a binary operator: no bracket of a
# template, no reference, no sign.
TOKEN = re.compile(r"(?<= )(?:<<=|>>=|&&|\|\||<<|>>|[-+*&|^]=|[<>=!]=|[-+*/%&|^<>])(?= )|\b(?:true|false|min|max)\b"
                   r"|(?<![\w.])(?:0x[0-9A-Fa-f]+|\d+)(?=[uUlL]*\b)(?![\w.]*\.)")
LEFT_OUT = ("profile", "debug", "check")  # they have tests of their own, which take minutes


class Mutant(collections.namedtuple("Mutant", "path number text begin end value")):
    """A line (number, text) of src/path whose characters from begin to end are replaced."""

    @property
    def key(self):
        """What it is known by: no line number, which changes with lines above."""
        return f"{self.path} {self.apply(self.text, '{', '}').strip()}"

    def apply(self, text, before="", after=""):
        """The line with the fault; between braces with what was there when they are given."""
        old = self.text[self.begin:self.end] + " -> " if before else ""
        return text[:self.begin] + before + old + self.value + after + text[self.end:]


def exchanged(token):
    if token[0].isdigit():
        number = int(token, 16 if token.startswith("0x") else 10)
        changed = number - 1 if number % 2 else number + 1
        return hex(changed) if token.startswith("0x") else str(changed)
    return OPERATORS.get(token) or WORDS[token]


def code_lines(text):
    """(number, line with comments and literals blanked) of what is code: no directives but bodies of macros."""
    blank = lambda match: re.sub(r"[^\n]", " ", match[0])  # noqa: E731
    text = re.sub(r'//[^\n]*|/\*.*?\*/|"(?:[^"\\\n]|\\.)*"', blank, text, flags=re.S)
    for number, line in enumerate(text.split("\n"), 1):
        if re.match(r"\s*#\s*define\b", line):
            yield number, re.sub(r"^\s*#\s*define\s+\w+(\([^)]*\))?", blank, line)
        elif not re.match(r"\s*(#|asm\b|static_assert\b)", line):
            yield number, line


def all_mutants(src):
    paths = glob.glob(os.path.join(src, "*", "**", "*.cpp"), recursive=True) + glob.glob(
        os.path.join(src, "*", "**", "*.h"), recursive=True)
    for path in sorted(paths):
        name = os.path.relpath(path, src)
        if name.startswith(LEFT_OUT) or name.endswith("row_kinds.h"):
            continue
        with open(path, encoding="utf-8") as file:
            text = file.read()
        lines = text.split("\n")
        for number, code in code_lines(text):
            yield from mutants_of(name, number, lines[number - 1], code)
    for line in cells.read_lines(src):
        if line.kind in ("SCALAR", "HELPER"):
            with open(os.path.join(src, line.path), encoding="utf-8") as file:
                text = file.read().split("\n")[line.number - 1]
            begin, end = line.spans[-1]
            yield from mutants_of(line.path, line.number, text, " " * begin + text[begin:end])


def mutants_of(path, number, text, code):
    for match in TOKEN.finditer(code):
        yield Mutant(path, number, text, *match.span(), exchanged(match[0]))
