"""The short names: each is a declaration of its own, bound to the symbol of the full name.

ZRA_ADDNX16 is the function cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_ZRA_ADDNX16 under the name of the core's own sources.
"""

import re
import subprocess

import rules
from declarations import declaration, documentation, family_body, header_text, parts
from read_tables import PREFIX, compiler, short_name, symbol


def exported(rows, types):
    """The symbols of rows: those that the compiler refers to when their prototypes are all that it has."""
    text = "typedef int immediate;\n"
    text += "".join(f"namespace {t.name}_space {{ class {t.name}_; }} typedef {t.cls} {PREFIX}{t.name};\n" for t in types.values())
    text += "".join(f"{row.prototype};\n" for row in rows)
    text += "void* table[] = {" + ", ".join(f"(void*)&{symbol(row.name)}" for row in rows) + "};\n"
    assembly = subprocess.run([*compiler(), "-S", "-o", "-", "-x", "c++", "-"],
                              input=text, capture_output=True, text=True, check=True).stdout
    return dict(zip(rows, re.findall(r"^\s*\.(?:quad|long)\s+(_Z\w+)$", assembly, re.M)))


def limit(row, types):
    """What an immediate has to be below, and its name: the rule takes it modulo that."""
    immediate = re.search(r"\bimmediate (\w+)", row.prototype)
    modulus = immediate and re.search(rf"\b(?:immediate|{immediate[1]}) mod(?:ulo)? (\d+)", rules.own(row, types))
    return (modulus[1], immediate[1]) if modulus else None


def declared(row, types, target):
    below, name = limit(row, types), short_name(row.name)
    row = row._replace(prototype=row.prototype.replace(PREFIX, ""))
    binding = f'__asm__("{target}")'
    if not below:
        return declaration(row, name, [binding])
    result, parameters = parts(row)
    call = ", ".join(re.findall(r"(\w+)(?:,|$)", parameters))
    return declaration(row, name, [f"KASTARRI_BELOW({', '.join(below)})", binding]) + [
        f"KASTARRI_BELOW_BODY({', '.join(below)}, {result} {name}({parameters}),",
        f"                    {symbol(row.name)}({call}))"]


def types_header(types):
    body = []
    for t in types.values():
        body += [*documentation(t.about), f"using {t.name} = {t.cls};"]
    return header_text("names/types", "The register types under the names of the core's own sources", "src/frame/types.def",
                       body, ["types"])


def headers(types, families):
    """Path below kastarri/ -> text."""
    targets = exported([row for _, _, rows in families.values() for row in rows], types)
    found = {"names/types": types_header(types)}
    for name, (title, tables, rows) in families.items():
        found[f"names/{name}"] = header_text(
            f"names/{name}", f"{title}, under the names of the core's own sources", ", ".join("src/" + t for t in tables),
            family_body(rows, lambda row: declared(row, types, targets[row])), [name, "names/checks", "names/types"])
    found["names"] = header_text(
        "names", "The names of the core's own sources: ZRA_ADDNX16, qv_vecNx16, ...; RK_ before operations of the scalar core.\n"
        "/// Each is declared below names/ and is the library's function of the full name", "all tables",
        ['#include "kastarri.h"', ""] + [f'#include "kastarri/names/{name}.h"' for name in families])
    return found
