"""What an intrinsic has in common with its twins: the same operation on other lanes, of another sign, under a predicate, in
another addressing mode, added to an accumulator, saturated."""

import re

import words

AXES = ["predicated", "mode", "sign", "lanes", "kind", "saturated"]

# Operations of which a U at the end makes one on unsigned numbers.
SIGNED = r"LT|LE|GT|GE|MIN|MAX|AVGR?|ABSSUB|RADD|PACKVR?"
SATURATED = {"ADDS": "ADD", "SUBS": "SUB", "NEGS": "NEG", "ABSS": "ABS", "ABSSSUB": "ABSSUB",
             "RADDS": "RADD", "MULSGNS": "MULSGN"}


def of_operation(operation):
    """The operation without what makes a twin of it, and that: sign, kind of accumulation, saturation."""
    letters = words.MULTIPLY.fullmatch(operation)
    if letters:
        root, signs, window, products, kind, high, interleaved = letters.groups()
        return f"{root}{window}{products}{high}{interleaved}", signs, kind, ""
    several = re.fullmatch(r"(ADDW|SUBW|RMAX|RMIN|RXOR|ROR|RAND)(U?)([AS]?)", operation)
    if several:
        return *several.groups(), ""
    unsigned = re.fullmatch(rf"({SIGNED})U", operation) or re.fullmatch(r"U(FLOAT|TRUNC)", operation)
    if unsigned:
        return unsigned[1], "U", "", ""
    return SATURATED.get(operation, operation), "", "", "S" * (operation in SATURATED)


def axes_of(entry):
    """The stem that twins share, and the entry's place on each of the AXES."""
    name = entry.id
    move = re.fullmatch(r"(\w+_(?:load|store))(ip?|xp?)", name)
    scalar_float = re.fullmatch(r"(scalarfp_\w+)_([HS])", name)
    predicate = re.fullmatch(r"(\w*?B|LTRS?|R?(?:AND|OR)B)(2N|N_2|N|1)(I?)(?:_(IP?))?", name)
    if move:
        return move[1], ["", move[2], "", "", "", ""]
    if scalar_float:
        return scalar_float[1], ["", "", "", scalar_float[2], "", ""]
    if predicate:
        return predicate[1] + predicate[3], ["", predicate[4] or "", "", predicate[2], "", ""]
    match = words.NAME.fullmatch(name)
    if not match or entry.family in ("scalar", "conversions"):
        return name, [""] * len(AXES)
    stem, sign, kind, saturated = of_operation(match["operation"])
    mode = match["mode"] or ""
    if mode in ("0", "1", "L", "H", "V"):  # not how an address is formed but a part of the operation
        stem, mode = stem + "_" + mode, ""
    stem += match["pack"] or ""
    stem += match["immediate"]
    if match["coefficients"]:
        stem += match["coefficients"].strip("DQ68XR1") or "R"
    lanes = match["layout"] + ((match["coefficients"] or "") if "XR" in (match["coefficients"] or "") else "")
    return stem, [match["predicated"], mode, sign + match["sign"], lanes, kind, saturated]
