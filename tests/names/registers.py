"""Moves and conversions of registers: what their names say.

<type>_loadi, _storeip, _move: a register as it is. <from>_rtor_<to>: from register to register, or from and to a host
scalar; <from>_mtor_<to>: from memory; <from>_rtom_<to>: into memory. Host scalars are named by their width, int16.
"""

import re

from vocabulary import Expected, Unknown, const, prototype

HOSTS = {"int8": "signed char", "uint8": "unsigned char", "int16": "short", "uint16": "unsigned short", "int32": "int",
         "uint32": "unsigned int", "int64": "long long", "float": "float", "bool": "bool"}
# C's boolean and character are what conversions of the scalar core's booleans say int8 for.
BOOLEANS = ["rkbool", "rkbool4", "rkbool8"]
REGISTER = r"(?:qv_\w+?|vbool\w*?|rkbool\w*?|rkfloat|valign)"


def host(name, register):
    return "char" if name == "int8" and register in BOOLEANS else HOSTS[name]


def move(name, twins):
    """Whole registers; i and ip by an immediate offset, x and xp by a register's: both are an int here."""
    del twins
    match = re.fullmatch(rf"({REGISTER})_(move|load|store)(i|ip|x|xp|)", name)
    if not match or (match[2] == "move") != (match[3] == ""):
        raise Unknown(name)
    register, operation, mode = match.groups()
    if operation == "move":
        return Expected(prototype(register, const(register)), "move", [])
    shape = f"{operation}_{'IP' if mode.endswith('p') else 'I'}"
    signatures = {
        "load_I": prototype(register, f"const {register}*", "int"),
        "load_IP": prototype("void", f"{register}&", f"const {register}**", "int"),
        "store_I": prototype("void", const(register), f"const {register}*", "int"),
        "store_IP": prototype("void", const(register), f"{register}**", "int"),
    }
    return Expected(signatures[shape], shape, [(f"register_{operation}",)])


def conversion(name, twins):
    del twins
    match = re.fullmatch(r"(\w+?)_(rtor|mtor|rtom)_(\w+)", name)
    if not match:
        raise Unknown(name)
    source, way, target = match.groups()
    if way == "rtor":
        if source in HOSTS:
            return Expected(prototype(target, host(source, target)), "from_host", [])
        if target in HOSTS:
            return Expected(prototype(host(target, source), const(source)), "to_host", [])
        return Expected(prototype(target, const(source)), "rtor", [])
    if way == "mtor":
        return Expected(prototype(target, f"const {HOSTS.get(source, source)}*", "int"), "mtor", [])
    return Expected(prototype("void", const(source), f"const {HOSTS.get(target, target)}*", "int"), "rtom", [])


RULES = [move, conversion]
