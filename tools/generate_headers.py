#!/usr/bin/env python3
"""Write the public headers from the tables of rows.

Only declarations come from here: the register types with their conversions (types.h) and their lanes (layouts.h
and the debugger's table), the prototypes of the intrinsics by family, and the short names. The compiler's
preprocessor reads the tables, so a prototype here is the prototype that the library is compiled with.

    tools/generate_headers.py            write include/kastarri/*.h and src/debug/gdb/kastarri_register_types.py
    tools/generate_headers.py --check    say which of them are out of date; exit status 1 if any is
"""

import argparse
import os
import sys

import rules
import short_names
from declarations import GENERATED, declaration, family_body, header_text
from read_tables import (FAMILIES, PREFIX, READER, ROOT, about_table, all_rows, keeps_lanes, listed_tables,  # noqa: F401
                         preprocess, read_types, records, short_name, symbol, tables_by_family)

DEBUGGER_TABLE = "src/debug/gdb/kastarri_register_types.py"

def types_header(types, rows):
    """The classes; a member that converts has the rule of its conversion's row."""
    rule = {row.name: rules.own(row, types) for row in rows}

    def member(declaration, conversion):
        return f"  {declaration};  ///< {rule['rk_zra32_' + conversion]}"
    body = [
        "/// The type of every immediate operand.",
        "typedef int immediate;",
        "",
        "/* Each register type T is the class T_ in namespace T_space, named cstub_Km_ZNB_Orbis_R5_64k_T. A value is",
        "   its member array and nothing else: lanes lie in it little-endian, lane 0 in the lowest bits. A new value",
        "   is uninitialised. Conversions are those of the library (conversions.h): between registers the operator",
        "   of the source converts implicitly and the constructor is explicit, for with both implicit `To t = from`",
        "   is ambiguous or draws warnings. */",
        "",
    ]
    body += [f"namespace {t.name}_space {{ class {t.name}_; }}" for t in types.values()]
    body += ["namespace rkbool2_space {}", "namespace rkbool16_space {}", ""]
    for t in types.values():
        body += [f"/// {t.about}.", f"typedef {t.cls} {PREFIX}{t.name};"]
    for t in types.values():
        body += ["", f"namespace {t.name}_space {{", f"/// {t.about}.", f"class {t.name}_ {{", " public:",
                 f"  {t.name}_() = default;  ///< uninitialised"]
        body += [member(f"{'explicit ' * source.endswith('&')}inline {t.name}_({source} from)", conversion)
                 for source, conversion, _ in t.sources]
        body += [member(f"inline {t.name}_& operator=({source} from)", conversion) for source, conversion, _ in t.sources]
        body += [member(f"inline operator {target}() const", conversion) for target, conversion in t.targets]
        if sum(not source.type.endswith("&") for source in t.sources) > 1:
            body += [f"  {line}" for line in not_taken(t)]
        body += ["", f"  {t.unit} _[{t.units}];", "};", "}"]
    return body + [""]


def not_taken(t):
    """Members that tell in words what would be ambiguous. Compilers show their lines, with the comment."""
    what = "template <class Other, class = typename kastarri::not_taken<Other>::type>"
    return [what, f"{t.name}_(Other) = delete;  // cast a wider number, or one with a fraction, to one of the types above", what,
            f"{t.name}_& operator=(Other) = delete;  // cast it; and what returns void changes its first operand itself"]


LANES = [
    "How the lanes of a register type are to be read: kind, bits, number. The kinds are i signed, u unsigned,",
    "f floating point, b bits of a predicate, w words without a number. Lanes share the bytes of the type",
    "evenly and fill the low bits of their share; bits are packed.",
]


def layouts_header(types):
    return [f"/// {line}" for line in ["X(type, kind, bits, number) for every register type.", *LANES]] + [
        "#define KASTARRI_REGISTER_TYPES(X) \\",
        " \\\n".join(f"  X({t.name}, {', '.join(map(str, t.lanes))})" for t in types.values())]


def debugger_table(types):
    rows = [f'    "{t.name}": {t.lanes},' for t in types.values()]
    return "\n".join([f"# {line}" for line in LANES] + [GENERATED.format(source="src/frame/types.def").replace("//", "#").rstrip(),
                      "REGISTER_TYPES = {", *(row.replace("'", '"') for row in rows), "}", ""])


def conversion_bodies(types):
    """The inline members of the types. Each calls the exported conversion, but for those that give every lane the
    bits of a host scalar: a compiler can fold and hoist them."""
    body = ["/* Constructors, assignments and conversion operators of the register types. */", ""]
    for t in types.values():
        for source in t.sources:
            if source.from_bits:
                fill = f"kastarri::replicate<{t.replicated}>(_, from);"
                body += [f"KASTARRI_ALWAYS_INLINE {t.cls}::{t.name}_({source.type} from) {{ {fill} }}",
                         f"KASTARRI_ALWAYS_INLINE {t.cls}& {t.cls}::operator=({source.type} from) {{ {fill} return *this; }}"]
                continue
            call = f"*this = {symbol('rk_zra32_' + source.conversion)}(from);"
            body += [f"KASTARRI_ALWAYS_INLINE {t.cls}::{t.name}_({source.type} from) {{ {call} }}",
                     f"KASTARRI_ALWAYS_INLINE {t.cls}& {t.cls}::operator=({source.type} from) {{ return {call} }}"]
        for target, name in t.targets:
            call = f"return {symbol('rk_zra32_' + name)}(*this);"
            body.append(f"KASTARRI_ALWAYS_INLINE {t.cls}::operator {target}() const {{ {call} }}")
    return body


def outputs():
    types, families = read_types(), all_rows()
    headers = {"types": header_text("types", "The register types of the core", "src/frame/types.def and conversions.def",
                                    types_header(types, families["conversions"][2]) + ['#include "kastarri/conversions.h"'],
                                     ["library", "replicate"])}
    headers["layouts"] = header_text("layouts", "How lanes lie in each register type, for programs that handle them all",
                                     "src/frame/types.def", layouts_header(types), ["library"])
    for name, (title, tables, rows) in families.items():
        body = family_body(rows, lambda row: declaration(row, symbol(row.name)))
        includes = ["library", "types"]
        if name == "conversions":
            body += [""] + conversion_bodies(types)
            includes += ["replicate"]
        headers[name] = header_text(name, title, ", ".join("src/" + t for t in tables), body, includes)
    headers.update(short_names.headers(types, families))
    files = {os.path.join(ROOT, "include", "kastarri", f"{name}.h"): text for name, text in headers.items()}
    return {**files, os.path.join(ROOT, DEBUGGER_TABLE): debugger_table(types)}


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--check", action="store_true", help="change nothing; fail when a header is out of date")
    check = parser.parse_args().check
    stale = []
    for path, text in outputs().items():
        current = open(path, encoding="utf-8").read() if os.path.exists(path) else None
        if current != text:
            stale.append(os.path.relpath(path, ROOT))
            if not check:
                with open(path, "w", encoding="utf-8") as file:
                    file.write(text)
    for path in stale:
        print(("out of date: " if check else "wrote ") + path)
    return 1 if check and stale else 0


if __name__ == "__main__":
    sys.exit(main())
