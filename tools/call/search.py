"""The search of the reference page (tools/reference/search.js), for the shell: what people write, and what answers it."""

import math
import re

STOP_WORDS = set("a an the of to in into with for from by on is are be do does how i can my me what which that "
                 "this two using use vs intrinsic intrinsics function instruction".split())
WIDTHS = set("8 16 24 32 48 64 128 256".split())
WHOLE = {"masked", "predicated", "signed"}
ENDINGS = re.compile(r"(?:ations?|ating|ated|ates?|ings?|ions?|ed|es|ers?|s|e)$")
WEIGHTS = (6, 3, 1)  # of what the operation is called, what tells it from others, its rule
EXACT_NAME, NAME_BEGINS, NAME_CONTAINS, NAME_MISSPELT = 10, 5, 2, 8
BEGINS, MISSPELT, CUT = 0.5, 0.4, 0.35


def stem(word):
    if word in WHOLE:
        return word
    cut = ENDINGS.sub("", word)
    return word if len(cut) < 3 or re.search(r"\d", word) else re.sub(r"([^lse])\1$", r"\1", cut)


def words_of(text):
    found = re.sub(r"\b(\d+)[ -]?bits?\b", r"\1bit", text.lower())
    parts = [p for word in re.split(r'[\s,;:()/.?"]+', found)
             for p in (word.split("-") if re.fullmatch(r"[a-z]+(-[a-z]+)+", word) else [word])]
    return [word for word in (re.sub(r"^[-'`]+|[-'`]+$", "", part) for part in parts) if word]


def one_letter_apart(a, b):
    if abs(len(a) - len(b)) > 1:
        return False
    i = next((k for k in range(min(len(a), len(b))) if a[k] != b[k]), min(len(a), len(b)))
    return (a[i + 1:] == b[i + 1:] or a[i + 1:] == b[i:] or a[i:] == b[i + 1:]
            or (a[i:i + 1] == b[i + 1:i + 2] and a[i + 1:i + 2] == b[i:i + 1] and a[i + 2:] == b[i + 2:]))


class Index:
    """Of entries (names in lower case, three texts of words, plainness)."""

    def __init__(self, entries):
        self.entries, self.by_word, stems_of = entries, {}, {}
        for number, (_, texts, _) in enumerate(entries):
            for text, weight in zip(texts, WEIGHTS):
                if text not in stems_of:
                    stems_of[text] = {stem(word) for word in words_of(text)}
                for word in stems_of[text]:
                    found = self.by_word.setdefault(word, {})
                    found[number] = max(found.get(number, 0), weight)

    def matches(self, word):
        """Number of an entry -> what the word is worth there."""
        wanted, matches = stem(word), {}

        def match_words(fits, factor):
            for each, numbers in self.by_word.items():
                if fits(each):
                    for number, weight in numbers.items():
                        matches[number] = max(matches.get(number, 0), weight * factor)

        match_words(lambda each: each == wanted, 1)
        if len(wanted) > 2:
            match_words(lambda each: each != wanted and each.startswith(wanted), BEGINS)
        for number, (names, _, _) in enumerate(self.entries):
            worth, other = max(map(lambda name: name_worth(name, word), names), default=0), matches.get(number, 0)
            if worth:
                matches[number] = worth + other if worth > NAME_CONTAINS else max(worth, other)
        if matches or len(word) < 4:
            return matches
        match_words(lambda each: len(each) > 2 and (one_letter_apart(each, wanted) or one_letter_apart(each, word)), MISSPELT)
        for number, (names, _, _) in enumerate(self.entries):
            if any(one_letter_apart(name, word) for name in names):
                matches[number] = NAME_MISSPELT
        return matches

    def answers(self, query):
        """The numbers of the entries that answer, best first. A rare word tells more than a frequent one, and who has all the
        words goes before who has some."""
        written = [word + "bit" if word in WIDTHS else word for word in words_of(query)]
        telling = [word for word in written if word not in STOP_WORDS] or written
        found = [self.matches(word) for word in telling]
        rarities = [math.log(1 + len(self.entries) / (1 + len(matches))) for matches in found]
        scores = {}
        for matches, rarity in zip(found, rarities):
            for number, worth in matches.items():
                score, has = scores.get(number, (0, 0))
                scores[number] = score + worth * rarity, has + rarity
        ranked = [(score * has / sum(rarities) * self.entries[number][2], number) for number, (score, has) in scores.items()]
        ranked.sort(key=lambda pair: (-pair[0], pair[1]))
        return [number for score, number in ranked if score >= CUT * ranked[0][0]]


def name_worth(name, word):
    if name == word:
        return EXACT_NAME
    return NAME_BEGINS if len(word) > 2 and name.startswith(word) else NAME_CONTAINS if len(word) > 3 and word in name else 0
