"""What people look for, and what answers it: the queries of queries.txt."""

import os
import re

STANDS_FOR = {"{V}": "(2NX8|NX16|N_2X32)", "{F}": "(NXF16|N_2XF32)", "{M}": "(I|X|IP|XP)"}


def alternatives(expression):
    """The alternatives of a regular expression that stand in no group."""
    return re.findall(r"(?:\([^()]*\)|\[[^\]]*\]|[^|])+", expression)


class Query:
    def __init__(self, line):
        self.text, answers = line.split("\t")
        for short, meant in STANDS_FOR.items():
            answers = answers.replace(short, meant)
        self.topics = [a[1:] for a in alternatives(answers) if a.startswith("?")]
        self.names = re.compile("|".join(a for a in alternatives(answers) if not a.startswith("?")) or "(?!)")

    def answered_by(self, answer):
        """An answer is the name of an entry, or the title of what is not built behind a ?."""
        return any(answer[1:].startswith(t) for t in self.topics) if answer[0] == "?" else bool(self.names.fullmatch(answer))


def read_queries():
    with open(os.path.join(os.path.dirname(os.path.abspath(__file__)), "queries.txt"), encoding="utf-8") as file:
        return [Query(line.rstrip("\n")) for line in file if line.strip() and not line.startswith("#")]
