"""Programs of intrinsics as C++ in the short names, from what `kastarri_sequences show` says of them."""

import os
import sys

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path.insert(0, os.path.join(ROOT, "tools"))
import generate_headers  # noqa: E402

STATES = "cstub_Km_ZNB_Orbis_R5_64k_proc.states"

HELPERS = r"""
static void set(void* to, const char* hex) {
  unsigned char* bytes = static_cast<unsigned char*>(to);
  for (unsigned byte; std::sscanf(hex, "%2x", &byte) == 1; hex += 2) *bytes++ = static_cast<unsigned char>(byte);
}
static void print(const char* name, const void* from, unsigned size) {
  const unsigned char* bytes = static_cast<const unsigned char*>(from);
  std::printf("%s ", name);
  for (unsigned i = 0; i < size; ++i) std::printf("%02x", bytes[i]);
  std::printf("\n");
}
"""

# A signalling NaN that a function returns becomes quiet on a 32-bit host.
QUIETEN = r"""
static void quieten(float* single) {
  unsigned bits;
  std::memcpy(&bits, single, sizeof bits);
  if ((bits & 0x7FFFFFFF) > 0x7F800000) bits |= 0x400000;
  std::memcpy(single, &bits, sizeof bits);
}
"""


def fill_function():
    with open(os.path.join(ROOT, "tests", "sequences", "memory.h"), encoding="utf-8") as file:
        text = file.read()
    return "\nstatic " + text[text.index("inline"):text.rindex("#endif")].strip() + "\n"


def pointers(program):
    return [f"{kind}* {name} = reinterpret_cast<{kind}*>(memory);" for name, kind in program["pointers"].items()]


def calls(program):
    lines = []
    for step in program["steps"]:
        for name, place in step["set"].items():
            lines.append(f"{name} = reinterpret_cast<{program['pointers'][name]}*>(memory + {place});")
        result = step["result"] and step["result"] + " = "
        lines.append(f"{result}{generate_headers.short_name(step['intrinsic'])}({', '.join(step['arguments'])});")
        if step["is_float"]:
            lines.append(f"quieten(&{step['result']});")
    return lines


def states(program):
    return [f"{STATES}.{name} = {value};" for name, value in program["states"].items()]


def block(lines):
    return "".join(f"  {line}\n" for line in lines)


def snippet(program):
    """A program that stands alone and prints what registers, memory and states hold at its end."""
    registers = program["registers"]
    text = '#include <cstdio>\n#include <cstring>\n\n#include "kastarri/names.h"\n' + HELPERS
    if any(step["is_float"] for step in program["steps"]):
        text += QUIETEN
    if program["pointers"]:
        text += fill_function()
    text += "\nint main() {\n" + block(states(program))
    if program["pointers"]:
        size = program["memory"]
        text += block([f"alignas(64) static unsigned char memory[{size}];", f"fill(memory, {size}, {program['key']}u);"])
    for register in registers:
        text += block([f"{register['type']} {register['name']};", f"set(&{register['name']}, \"{register['bytes']}\");"])
    text += block(pointers(program)) + "\n" + block(calls(program)) + "\n"
    text += block([f"print(\"{register['name']}\", &{register['name']}, sizeof {register['name']});" for register in registers])
    if program["pointers"]:
        text += block(["print(\"memory\", memory, sizeof memory);"])
        text += block([f"std::printf(\"{name} %d\\n\", static_cast<int>(reinterpret_cast<const unsigned char*>({name}) - memory));"
                       for name in program["pointers"]])
    text += block([f"std::printf(\"{name} %u\\n\", {STATES}.{name});" for name in program["states"]])
    return text + "}\n"


def function(program, number):
    """A program as a function, which returns its number: that of kastarri_sequences."""
    registers = program["registers"]
    initial = bytes.fromhex("".join(register["bytes"] for register in registers))
    text = f"static const unsigned char initial_{number}[] = {{{', '.join(map(str, initial))}, 0}};\n"
    text += f"__attribute__((noinline)) std::uint64_t program_{number}(unsigned char* memory, const unsigned char* from) {{\n"
    place = 0
    for register in registers:
        name = register["name"]
        text += block([f"{register['type']} {name};", f"std::memcpy(&{name}, from + {place}, sizeof {name});"])
        place += len(register["bytes"]) // 2
    text += block(pointers(program) + states(program) + calls(program) + ["testing_support::Sum sum;"])
    text += block([f"sum.add(&{register['name']}, sizeof {register['name']});" for register in registers])
    text += block([f"sum.add(static_cast<std::uint64_t>(reinterpret_cast<const unsigned char*>({name}) - memory));"
                   for name in program["pointers"]])
    text += block([f"sum.add(memory, {program['memory']});"] + [f"sum.add({STATES}.{name});" for name in program["states"]])
    return text + "  return sum.value();\n}\n"


def batch(programs):
    """Many programs, number -> program, as one that prints the number of each. Compilers see nothing of the operands."""
    text = '#include <cinttypes>\n#include <cstdio>\n\n#include "support/sum.h"\n\n#include "kastarri/names.h"\n'
    text += '#include "sequences/memory.h"\n\nusing testing_support::quieten;\nalignas(64) unsigned char memory[2048];\n'
    text += "".join(function(program, number) for number, program in programs.items())
    text += "int main() {\n"
    for number, program in programs.items():
        text += block([f"const unsigned char* volatile from_{number} = initial_{number};",
                       f"fill(memory, sizeof memory, {program['key']}u);",
                       f"std::printf(\"{number} %016\" PRIx64 \"\\n\", program_{number}(memory, from_{number}));"])
    return text + "}\n"
