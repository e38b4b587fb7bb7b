"""What the reference says: worked examples against arithmetic done here, and what is told from the rows.

Run as: data_test.py EXAMPLES (what kastarri_examples printed).
"""

import json
import os
import re
import struct
import sys
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tools", "reference")]
import build  # noqa: E402
import choices  # noqa: E402
import entries  # noqa: E402
import generate_headers  # noqa: E402
import not_built  # noqa: E402
import rules  # noqa: E402
import words  # noqa: E402

with open(sys.argv.pop(1), encoding="utf-8") as file:
    EXAMPLES = json.load(file)["examples"]
CHOICES = choices.read_choices()
ENTRIES = entries.read_entries(CHOICES)

WITHOUT_EFFECT = {"RK_NOP", "RK_NOP_N", "SCATTERW"}


def low(value, bits):
    return value & ((1 << bits) - 1)


def signed(value, bits):
    return low(value + (1 << (bits - 1)), bits) - (1 << (bits - 1))


def clamped(value, bits):
    return max(-1 << (bits - 1), min((1 << (bits - 1)) - 1, value))


def clamped_unsigned(value, bits):
    return max(0, min((1 << bits) - 1, value))


def rounded_shift(value, count):
    return (value + (1 << count >> 1)) >> count


def single(value):
    """The single nearest to a number; one that is too large is infinite."""
    return struct.unpack("f", struct.pack("f", value))[0] if abs(value) < 2**128 - 2**103 else value * float("inf")


# Operations on one lane: the result from the operands in the order of the prototype.
BY_LANE = {
    "ADDNX16": lambda a, b: signed(a + b, 16),
    "ADDNX16U": lambda a, b: low(a + b, 16),
    "ADD2NX8": lambda a, b: signed(a + b, 8),
    "ADDN_2X32": lambda a, b: signed(a + b, 32),
    "ADDSNX16": lambda a, b: clamped(a + b, 16),
    "SUBSNX16": lambda a, b: clamped(a - b, 16),
    "SUB8U": lambda a, b: low(a - b, 8),
    "NEGSNX16": lambda a: clamped(-a, 16),
    "ABSSUBUNX16U": lambda a, b: abs(a - b),
    "AVGNX16": lambda a, b: (a + b) >> 1,
    "AVGR2NX8": lambda a, b: (a + b + 1) >> 1,
    "MINNX16": min,
    "MAXU2NX8U": max,
    "XORN_2X32": lambda a, b: a ^ b,
    "LTNX16": lambda a, b: int(a < b),
    "GEUNX16U": lambda a, b: int(a >= b),
    "ANDNOTBN": lambda a, b: a & (1 - b),
    "MULNX16": lambda a, b: a * b,
    "MUL2NX8": lambda a, b: a * b,
    "MULANX16": lambda acc, a, b: signed(acc + a * b, 48),
    "MULS2NX8": lambda acc, a, b: signed(acc - a * b, 24),
    "MULP2NX8": lambda a, b, c, d: signed(a * b + c * d, 24),
    "ADDWNX16": lambda a, b: a + b,
    "SUBWUANX16": lambda acc, a, b: signed(acc + a - b, 48),
    "SQRPDNX16": lambda a, b: a * a - b * b,
    "ADDSNX16T": lambda r, a, b, p: clamped(a + b, 16) if p else r,
    "SUBNX16UT": lambda r, a, b, p: low(a - b, 16) if p else r,
    "qv_vecNx16_rtor_qv_vecNx16U": lambda value: low(value, 16),
    "RK_ADD": lambda a, b: signed(a + b, 32),
    "RK_MULUH": lambda a, b: a * b >> 32,
    "RK_SALTU": lambda a, b: int(a < b),
    "RK_ADDX8": lambda a, b: signed(8 * a + b, 32),
}

# The same where there is more to an operation than one lane: from whole operands.
BY_OPERANDS = {
    "PACKVRNX48": lambda acc, shift: [clamped(rounded_shift(x, shift[0]), 16) for x in acc],
    "PACKVRU2NX24": lambda acc, shift: [clamped_unsigned(rounded_shift(x, shift[0]), 8) for x in acc],
    "PACKLNX48": lambda acc: [signed(x, 16) for x in acc],
    "RADDNX16": lambda a: [4 * sum(a)],
    "RADDSNX16": lambda a: [clamped(4 * sum(a), 16)],
    "RMAXNX16": lambda a: [max(a)],
    "RMINUNX16T": lambda a, p: [min([x for x, bit in zip(a, p) if bit], default=65535)],
    "RXORANX16": lambda acc, a: acc,  # every lane is there four times
    "LTRN": lambda n: [int(i < n[0]) for i in range(8)],
    "MULQ2N8XR8": lambda a, b, c, d, s: [
        signed(sum(signed(s[0] >> 8 * (3 - k), 8) * x for k, x in enumerate(lanes)), 24) for lanes in zip(a, b, c, d)],
    "MULNX16C": lambda a, b: [part for k in range(0, 8, 2) for part in
                              (a[k] * b[k] - a[k + 1] * b[k + 1], a[k + 1] * b[k] + a[k] * b[k + 1])],
    "GATHERANX16T": lambda memory, offsets, p: [memory[o // 2] if bit else 0 for o, bit in zip(offsets, p)],
    "LVNX8S_I": lambda memory, offset: memory,
    "LVNX16T_I": lambda memory, offset, p: [x if bit else 0 for x, bit in zip(memory, p)],
    "SVNX8S_I": lambda v, memory, offset: [clamped(x, 8) for x in v],
    "SVNX8U_I": lambda v, memory, offset: [low(x, 8) for x in v],
    "SSNX16_I": lambda v, memory, offset: v[:1] + memory[1:],
    "RK_L16SI": lambda memory, offset: memory[:1],
}


def number(text):
    return int(text, 0) if re.fullmatch(r"-?(0x)?[0-9a-f]+", text) and not text.startswith("inf") else float(text)


def numbers(table):
    return [[number(text) for text in texts.split()] for _, texts in table]


def example(name):
    entry = next(e for e in ENTRIES if e.id == name)
    return EXAMPLES[entry.row.name]


class WorkedExamples(unittest.TestCase):
    def outcome(self, name):
        """The result, or the operand that the intrinsic writes."""
        out = dict(example(name)["out"])
        written = [key for key in out if key in ("result", "r", "acc")] or ["memory"]
        return [number(text) for text in out[written[0]].split()]

    def test_every_row_was_computed(self):
        self.assertEqual(set(EXAMPLES), {e.row.name for e in ENTRIES})
        silent = {e.id for e in ENTRIES if not EXAMPLES[e.row.name]["out"]}
        self.assertEqual(silent, WITHOUT_EFFECT)

    def test_operands_are_those_of_the_prototype(self):
        for entry in ENTRIES:
            shown = [name for name, _ in EXAMPLES[entry.row.name]["in"]]
            expected = ["memory" if o.in_memory else o.name for o in entry.operands if o.role != "result"]
            self.assertEqual(shown, expected, entry.id)

    def test_lanes(self):
        for name, rule in BY_LANE.items():
            with self.subTest(name):
                lanes = zip(*numbers(example(name)["in"]))
                expected = [rule(*operands) for operands in lanes]
                self.assertEqual(self.outcome(name), expected)

    def test_whole_operands(self):
        for name, rule in BY_OPERANDS.items():
            with self.subTest(name):
                self.assertEqual(self.outcome(name), rule(*numbers(example(name)["in"])))

    def test_examples_show_something(self):
        # Where an operation saturates, some lane of its example has to.
        for name in ("ADDSNX16", "PACKVRNX48", "SVNX8S_I"):
            self.assertIn(max(self.outcome(name)), (127, 32767), name)

    def test_sums_of_singles_are_rounded_and_raise_flags(self):
        a, b = ([single(v) for v in values] for values in numbers(example("ADDF32")["in"]))
        flags = [int(value) for value in dict(example("ADDF32")["out"])["StickyFlags"].split()]
        self.assertEqual([single(v) for v in self.outcome("ADDF32")[:4]], [single(x + y) for x, y in zip(a, b)][:4])
        # Sums of two singles of like size are exact as doubles.
        self.assertEqual([flag & 1 for flag in flags[:4]], [int(single(x + y) != x + y) for x, y in zip(a, b)][:4])
        self.assertEqual(flags[a.index(float("inf"))], 16, "infinity less infinity is invalid")

    def test_post_increment_moves_the_pointer(self):
        self.assertEqual(dict(example("SVNX16_XP")["out"])["pointer"], "+64")


class Facts(unittest.TestCase):
    def test_every_name_of_a_choice_is_that_of_an_intrinsic(self):
        for choice in CHOICES:
            names = [e.id for e in ENTRIES if e.family == choice.family]
            for pattern in choice.included + choice.excluded:
                self.assertTrue(any(map(pattern.fullmatch, names)), f"{pattern.pattern} in '{choice.text}'")
            self.assertTrue(any(map(choice.names, names)), choice.text)

    def test_what_tests_alignment_is_listed_as_a_choice(self):
        index = next(i for i, choice in enumerate(CHOICES) if choice.text.startswith("What tests alignment"))
        tested = {e.id for e in ENTRIES if e.family == "memory" and "is tested:" in (e.alignment or "")}
        self.assertEqual(tested, {e.id for e in ENTRIES if index in e.choices})

    def test_rules_that_lean_on_others_have_them(self):
        leaning = [e for e in ENTRIES if re.search(r"otherwise as|^as [A-Z]", e.row.doc)]
        self.assertGreater(len(leaning), 40)
        self.assertEqual([e.id for e in leaning if not e.context], [])

    def test_rules_of_conversions_are_what_the_library_computes(self):
        types, computed = generate_headers.read_types(), 0
        for e in ENTRIES:
            if e.row.table != "frame/conversions.def" or not re.match("every lane|lane|the source", e.rule):
                continue
            (_, width, _), (kind, bits, _) = (rules.lanes_of(name, types) for name in e.id.split("_rtor_"))
            if kind == "f" or not width or not bits:
                continue
            values, out = (numbers(EXAMPLES[e.row.name][key])[0] for key in ("in", "out"))
            read = [signed(v, width) if "sign-extended" in e.rule else low(v, width) for v in values]
            written = [signed(v, bits) if kind == "i" else low(v, bits) for v in read]
            expected = written[:1] * len(out) if re.match("every lane|lane 0", e.rule) else written
            self.assertEqual(out, expected, e.id)
            computed += 1
        self.assertGreater(computed, 200)

    def test_cycles_are_of_intrinsics(self):
        about, targets, cycles = build.read_costs()
        self.assertRegex(about, "^cycles a call costs, .*measured on: .*model")
        self.assertLessEqual(set(cycles), {e.short for e in ENTRIES})
        self.assertEqual({len(row) for row in cycles.values()}, {len(targets)})
        # An accumulator takes longer than a move, a scatter than a store, whatever the processor.
        for slow, quick in (("ZRA_MULANX16", "qv_vecNx16_move"), ("ZRA_SCATTERNX16", "ZRA_SVNX16_I")):
            for target, more, less in zip(targets, cycles[slow], cycles[quick]):
                self.assertGreater(float(more), float(less), (slow, target))

    def test_every_entry_has_words_to_be_found_by(self):
        self.assertEqual([e.id for e in ENTRIES if not words.words_of(e)[0].strip()], [])

    def test_every_rule_speaks_of_its_own_row(self):
        of_others = re.compile(r"\bforms?\b|\(\.\.|\((_\w+|[A-Z]{1,2}|[A-Z]\w{2,})\)|\bw\b|modes|\b_V\b|as above|\bfor n\b")
        self.assertEqual([(e.id, text) for e in ENTRIES for text in [e.rule, *e.context] if of_others.search(text)], [])
        for e in ENTRIES:
            self.assertEqual("moves by increment" in e.rule, any(o.pointer for o in e.operands), e.id)
            self.assertEqual(bool(re.match("loads", e.rule)), bool(re.match("load|mtor", e.row.shape)), e.id)
            if e.predicated:
                self.assertRegex(" ".join([e.rule, *e.context]), "predicate bit", e.id)
            told, tested = (re.search(pattern, text) for pattern, text in
                            ((r"aligned to (\d)", e.rule), (r"is tested: unless it is a multiple of (\d)", e.alignment or "")))
            if e.family == "memory":
                self.assertEqual(told and told[1], tested and tested[1], e.id)

    def test_parts_that_rules_replace_stand_in_the_tables(self):
        sentences = {e.row.doc for e in ENTRIES}
        self.assertEqual([part.pattern for part, _ in rules.OWN_PARTS if not any(map(part.search, sentences))], [])

    def test_rules_of_their_own(self):
        found = {e.id: e.rule for e in ENTRIES}
        for name, rule in {
                "MULUSANX16": "lane i of acc = acc[i] + a[i] * b[i], modulo 2^48; the first factor is unsigned, the second signed",
                "LVNX8S_IP": "loads: lane i = lane i of the 32 bytes at the address, sign-extended. The address is the pointer, which then "
                             "moves by increment bytes",
                "NEGNX16UT": "lane i = -a[i], modulo 2^16: the most negative value is its own negative. Where predicate bit i is 0, r keeps "
                             "lane i",
                "SCATTERNX16": "writes lane i at base + offset i bytes",
                "GATHERANX16": "element i, at base + offset i bytes, into lane i",
                "qv_vecNx16_rtor_int8": "lane 0 of the source, its low 8 bits",
                "int8_rtor_qv_vecNx16": "every lane = the source, sign-extended",
                "RK_ADDX4": "4 a + b, modulo 2^32"}.items():
            self.assertEqual(found[name], rule)

    def test_facts_are_those_of_the_words(self):
        facts = {e.id: e.facts for e in ENTRIES}
        for name, expected in {"ADDSNX16": ["saturates"], "ADDNX16": ["wraps"], "MULNX16": ["exact"],
                               "PACKVRNX48": ["saturates", "rounds"], "PACKVNRNX48": ["saturates", "truncates"],
                               "ANDNX16": [], "ADDNXF16": ["rounds", "flags"], "SUBF16T": ["rounds", "flags"],
                               "int16_mtor_qv_vecNx16": [], "MULNX16PACKQ": ["wraps", "rounds"]}.items():
            self.assertEqual(facts[name], expected, name)

    def test_what_is_written_instead_is_there(self):
        there = {e.id for e in ENTRIES} | {e.short for e in ENTRIES}
        for topic in not_built.TOPICS:
            names = [name for code in re.findall("`([^`]+)`", topic.instead) for name in re.findall(r"\b[A-Za-z]+\w*(?=\(|$)", code)]
            self.assertTrue(names, topic.key)
            self.assertLessEqual(set(names), there)

    def test_what_is_not_built_is_not_there(self):
        # But for those that a topic's title leaves out.
        left_out = {name for topic in not_built.TOPICS for name in re.findall(r"`(\w+)`", topic.title.partition("but for")[2])}
        self.assertEqual({e.id for e in ENTRIES if not_built.topic_of(e.id)}, left_out)
        for name, key in {"SELNX16I": "select", "SHFL2NX8": "select", "UNPKS2NX8": "select", "LANX16_IP": "aligning", "DIVNX16": "division",
                          "RSQRTN_2XF32": "division", "ADDMOD16U": "ring", "UNSQZ2N": "compress", "RBMAXNX16": "places",
                          "RADDANX16": "sums", "LSCF_I": "unknown-elements"}.items():
            self.assertEqual(not_built.topic_of(name).key, key, name)
        for name in ("ADDNX17", "SLLNX8", "FOONX16", "MULX", "LATER", "SATNX16", "LSNX17_I"):
            self.assertIsNone(not_built.topic_of(name), name)

    def test_short_names_lead_to_one_entry(self):
        self.assertEqual(len({e.id for e in ENTRIES}), len(ENTRIES))
        rows = [row for _, _, rows in generate_headers.all_rows().values() for row in rows]
        self.assertEqual([e.row for e in ENTRIES], rows)


if __name__ == "__main__":
    unittest.main()
