"""Two reports of the programs of kastarri-conform, or two lists of values, held against each other."""

import collections
import csv
import os
import re
import textwrap
from xml.sax.saxutils import escape

import register_access

RESULT = re.compile(r"(\w+(?:/(?:spill|any))?) (\d+) ([0-9a-f]{16})")
VALUE = re.compile(r"(\w+(?:/(?:spill|any))?) (\d+) (=?\w+)((?: [0-9a-f]+)+)")

Result = collections.namedtuple("Result", "cases hash")
Value = collections.namedtuple("Value", "name case operand lanes")
Row = collections.namedtuple("Row", "name family state a b")  # of the table: what became of an intrinsic
SAME, DIFFERENT, OTHER_CASES, ONLY_A, ONLY_B = "same", "different", "other cases", "only in A", "only in B"


class Unreadable(Exception):
    pass


class Report:
    """What programs printed: a file, or all files of a directory."""

    def __init__(self, path):
        self.path, self.results, self.values, self.strange = path, {}, [], 0
        for file in self.files():
            try:
                with open(file, encoding="utf-8", errors="replace") as lines:
                    for line in lines:
                        self.read(line.strip())
            except OSError as error:
                raise Unreadable(f"{file}: {error.strerror}") from error
        if not self.results and not self.values:
            raise Unreadable(f"{path}: there is no line of a report in it")

    def files(self):
        if not os.path.isdir(self.path):
            return [self.path]
        return sorted(os.path.join(self.path, name) for name in os.listdir(self.path) if name.endswith(".txt"))

    def read(self, line):
        if match := RESULT.fullmatch(line):
            if self.results.setdefault(match[1], Result(int(match[2]), match[3])) != Result(int(match[2]), match[3]):
                raise Unreadable(f"{self.path}: it has two results for {match[1]}")
        elif match := VALUE.fullmatch(line):
            self.values.append(Value(match[1], int(match[2]), match[3], match[4].split()))
        elif line and not line.startswith("#"):
            self.strange += 1


def plain(name):
    return name.partition("/")[0]


class Comparison:
    def __init__(self, library, a, b):
        self.families = library["families"]
        self.order = {data["name"]: n for n, data in enumerate(library["intrinsics"])}
        self.family = {data["name"]: data["family"] for data in library["intrinsics"]}
        self.choices = library["choices"]
        self.rows = [self.row(name, a.results.get(name), b.results.get(name))
                     for name in sorted({*a.results, *b.results}, key=lambda n: (self.order.get(plain(n), 1 << 30), n))]
        self.different = [row.name for row in self.rows if row.state == DIFFERENT]
        self.differ = set(self.different)

    def row(self, name, a, b):
        state = (ONLY_A if not b else ONLY_B if not a else OTHER_CASES if a.cases != b.cases
                 else SAME if a.hash == b.hash else DIFFERENT)
        return Row(name, self.family.get(plain(name), "unknown"), state, a, b)

    def touched(self, choice, names):
        """The names that a choice touches. What only differs where wide registers come from spill images may speak of those; where
        memory lies at any address, of addresses alone."""
        listed = set(choice["names"])
        of_spill = "qv_wvecspill_rtor_qv_vecNx48" in listed
        of_addresses = re.search("address|alignment", choice["text"])

        def speaks(name):
            base, _, way = name.partition("/")
            only_this_way = way and base not in self.differ
            if only_this_way and way == "spill" and of_spill:
                return True
            return base in listed and (of_addresses or not (only_this_way and way == "any"))

        return [name for name in names if speaks(name)]

    def suspects(self):
        """Choices with the names that differ, the one that explains the most first: of many names that differ, and of few
        that do not. A name counts for the first choice alone."""
        compared = [row.name for row in self.rows if row.state in (SAME, DIFFERENT)]
        rest, found = list(self.different), []
        whole = {n: len(self.touched(choice, compared)) for n, choice in enumerate(self.choices)}
        while rest:
            counts = {n: len(self.touched(choice, rest)) for n, choice in enumerate(self.choices)}
            best = max(counts, key=lambda n: counts[n] ** 2 / max(1, whole[n]))
            if not counts[best]:
                break
            names = self.touched(self.choices[best], rest)
            found.append((self.choices[best], names, whole[best]))
            rest = [name for name in rest if name not in names]
        return found, rest

    def foundations(self):
        return [name for name in self.different if name in register_access.FOUNDATIONS]

    # --- Text ---

    def write_text(self, out):
        states = collections.Counter(row.state for row in self.rows)
        counts = [f"{states[s]} {s}" for s in (SAME, DIFFERENT, OTHER_CASES, ONLY_A, ONLY_B) if states[s] or s == SAME]
        print(f"{plural(len(self.rows), 'result')}: {', '.join(counts)}", file=out)
        if self.foundations():
            print(f"\nPrograms fill and read registers with these, so settle them first: {', '.join(self.foundations())}", file=out)
        suspects, rest = self.suspects()
        for number, (choice, names, whole) in enumerate(suspects):
            head = "This speaks first against the choice" if number == 0 else "then against"
            print("", textwrap.fill(f"{head}: {choice['text']}", 112, break_on_hyphens=False),
                  f"  ({self.families[choice['family']]}; {len(names)} of the {whole} that it touches)", sep="\n", file=out)
            write_names(out, names)
        if rest:
            print("\nNo choice: these should be as the core has them", file=out)
            write_names(out, rest)
        for state in (OTHER_CASES, ONLY_A, ONLY_B):
            names = [row.name for row in self.rows if row.state == state]
            if names:
                print(f"\n{state}{': the programs are not the same' * (state == OTHER_CASES)}", file=out)
                write_names(out, names)

    def write_csv(self, file):
        choice_of = {name: choice["text"] for choice, names, _ in self.suspects()[0] for name in names}
        writer = csv.writer(file, lineterminator="\n")
        writer.writerow(["name", "family", "state", "cases_a", "hash_a", "cases_b", "hash_b", "choice"])
        for row in self.rows:
            nothing = ("", "")
            writer.writerow([row.name, row.family, row.state, *(row.a or nothing), *(row.b or nothing), choice_of.get(row.name, "")])

    # --- The picture ---

    def write_svg(self, file):
        width, left, right, step, top = 900, 350, 720, 34, 106
        counts = collections.defaultdict(collections.Counter)
        for row in self.rows:
            counts[row.family][row.state if row.state in COLOURS else OTHER] += 1
        most = max(sum(c.values()) for c in counts.values())
        body = [text(40, 40, "Intrinsics here and there", 20, weight=600), text(40, 62, self.summary(), 13)]
        x = 40
        for state, colour in COLOURS.items():
            body += [f'<rect x="{x}" y="78" width="12" height="12" fill="{colour}"/>', text(x + 18, 89, state, 13)]
            x += 46 + 7 * len(state)
        for n, family in enumerate(f for f in [*self.families, "unknown"] if f in counts):
            x, y = left, top + n * step
            body.append(text(left - 10, y + 15, self.families.get(family, family), 13, anchor="end"))
            for state, colour in COLOURS.items():
                length = (right - left) * counts[family][state] / most
                length = max(length, 3) if counts[family][state] else 0  # one of hundreds is seen, too
                body.append(f'<rect x="{x:.1f}" y="{y}" width="{length:.1f}" height="20" fill="{colour}"/>')
                x += length
            not_same = sum(counts[family].values()) - counts[family][SAME]
            all_of_it = f"{sum(counts[family].values())}" + f", {not_same} not the same" * bool(not_same)
            body.append(text(x + 8, y + 15, all_of_it, 12))
        height = top + step * len(counts) + 16
        print(f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {width} {height}" width="{width}" height="{height}" '
              f'font-family="{FONT}">\n<rect width="{width}" height="{height}" fill="#ffffff"/>', *body, "</svg>", sep="\n", file=file)

    def summary(self):
        return f"{plural(len(self.rows), 'result')}, {len(self.different)} different"


FONT = "system-ui, 'DejaVu Sans', Helvetica, Arial, sans-serif"
OTHER = "other cases, or in one report alone"
COLOURS = {SAME: "#009e73", DIFFERENT: "#d55e00", OTHER: "#e69f00"}


def text(x, y, words, size, weight=400, anchor="start"):
    return (f'<text x="{x:.1f}" y="{y:.1f}" font-size="{size}" font-weight="{weight}" fill="#323f4b" text-anchor="{anchor}">'
            f"{escape(words)}</text>")


def plural(number, noun):
    return f"{number} {noun}" + "s" * (number != 1)


def write_names(out, names, width=110, most=24):
    line = " "
    for name in names[:most] + [f"and {len(names) - most} more"] * (len(names) > most):
        if len(line) + len(name) + 1 > width:
            print(line, file=out)
            line = " "
        line += " " + name
    print(line, file=out)


# --- Values -------------------------------------------------------------------------------------------


def cases(values):
    """(name, case) -> its values, in order."""
    found = collections.defaultdict(list)
    for value in values:
        found[value.name, value.case].append(value)
    return found


def first_difference(a, b):
    """The first of two cases' values that are not the same, and the first lane in which they differ."""
    for ours, theirs in zip(a, b):
        if ours != theirs:
            lanes = zip(ours.lanes, theirs.lanes)
            return ours, theirs, next((n for n, (x, y) in enumerate(lanes) if x != y), min(len(ours.lanes), len(theirs.lanes)))
    return None


def write_lane(out, name, text_of_lane):
    print(f"    {name.removeprefix('='):<10} {text_of_lane}", file=out)


def write_values(out, a, b):
    """Tells of the first difference of each intrinsic. Returns whether there is any."""
    ours, theirs, told = cases(a), cases(b), set()
    for key, mine in ours.items():
        if key not in theirs or key[0] in told:
            continue
        found = first_difference(mine, theirs[key])
        if not found and len(mine) == len(theirs[key]):
            continue
        told.add(key[0])
        if not found:
            print(f"{key[0]}, case {key[1]}: one list ends sooner", file=out)
            continue
        value, other, lane = found
        print(f"{key[0]}, case {key[1]}: {value.operand.removeprefix('=')} differs first in lane {lane}", file=out)
        for operand in mine[:mine.index(value)]:
            has_lane = lane < len(operand.lanes)
            note = "" if has_lane else f"  (lane 0 of {len(operand.lanes)})"
            write_lane(out, operand.operand, operand.lanes[lane if has_lane else 0] + note)
        for side, lanes in (("A", value.lanes), ("B", other.lanes)):
            write_lane(out, value.operand, f"{' '.join(lanes[lane:lane + 1]) or 'nothing'}  in {side}")
    missing = sorted({f"{name}" for name, _ in ours.keys() ^ theirs.keys()} - told)
    if missing:
        print("cases that one list alone has: " + ", ".join(missing), file=out)
    return bool(told or missing)
