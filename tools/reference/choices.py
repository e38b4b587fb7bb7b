"""The choices of docs/choices.md, each with the intrinsics that it names."""

import os
import re

import generate_headers

PATH = os.path.join(generate_headers.ROOT, "docs", "choices.md")


def patterns(text):
    """The names in backquotes as regular expressions: `..` stands for any characters of a name."""
    return [re.compile(re.escape(name).replace(r"\.\.", r"\w*")) for name in re.findall(r"`([^`]+)`", text)]


class Choice:
    def __init__(self, family, text, names):
        self.family, self.text = family, text
        included, _, excluded = names.partition("but not")
        self.included, self.excluded = patterns(included), patterns(excluded)

    def names(self, name):
        """Whether the choice names an intrinsic of its family, given without package."""
        return any(p.fullmatch(name) for p in self.included) and not any(p.fullmatch(name) for p in self.excluded)


def read_choices():
    """The choices in the order of the document: sections are families by their titles, table rows choices."""
    families = {title: name for name, title in generate_headers.FAMILIES.items()}
    found, family = [], None
    with open(PATH, encoding="utf-8") as file:
        for line in file:
            if line.startswith("## "):
                family = families[line[3:].strip()]
            cells = re.fullmatch(r"\| (.*) \| (.*) \|\n?", line)
            if cells and cells[1] != "choice":
                found.append(Choice(family, cells[1], cells[2]))
    return found
