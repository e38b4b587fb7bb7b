"""tools/where: what stands at the places that it names."""

import os
import re
import subprocess
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))


def where(*names):
    return subprocess.run([os.path.join(ROOT, "tools", "where"), *names], capture_output=True, text=True, check=False)


def text_at(place):
    """The line of the sources at a place, file:line."""
    path, line = re.match(r"(\S+):(\d+)", place).groups()
    with open(os.path.join(ROOT, path), encoding="utf-8") as file:
        return file.read().splitlines()[int(line) - 1]


# A name as it may be asked for, and a part of what stands at each place.
CASES = {
    "ADDSNX16T": {"row": "ROW(ADDSNX16T,", "function": "KERNEL(ADDSNX16,", "form": "KERNEL_binary", "rule": "auto ADDS =",
                  "shape": "SIG_ab_r_T", "test": "integer/arithmetic.def"},
    "ZRA_MULANX16": {"row": "ROW(MULANX16,", "function": "Added", "form": "KERNEL_by_register", "shape": "SIG_acc_ab(",
                     "test": "multiply/products.def"},
    "LVNX16T_IP": {"row": "LOAD_ROWS_T(LVNX16T,", "kind of row": "#define LOAD_ROWS_T", "function": "KERNEL(LVNX16,",
                   "form": "KERNEL_copy", "shape": "SIG_load_IP_T", "test": "memory/vectors.def"},
    "cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_ZRA_ADDN_2XF32": {
        "row": "(ADD)", "kind of row": "#define FLOAT_", "rule": " ADD", "shape": "SIG_ab_r(", "test": "float/arithmetic.def"},
    "ADD_S": {"row": "(ADD,", "kind of row": "#define SCALARFP_BOTH", "test": "float/scalars.def"},
    "int16_mtor_qv_vecNx16": {"row": "LOADED_HOST(int16,", "rule": "BODY_mtor", "shape": "SIG_mtor",
                              "test": "frame/memory_conversions.def"},
    "RK_SRC": {"row": "SCALAR(core, SRC,", "shape": "SIG_scalar", "test": "scalar/funnel.def"},
    "QUOU": {"row": "HELPER(QUOU,", "test": "scalar/scalar.def"},
}


class Where(unittest.TestCase):
    def test_every_place_holds_what_it_is_said_to(self):
        found = where(*CASES)
        self.assertEqual((found.returncode, found.stderr), (0, ""))
        answers = re.split(r"^(?=cstub)", found.stdout, flags=re.M)[1:]
        self.assertEqual(len(answers), len(CASES))
        for (name, parts), answer in zip(CASES.items(), answers):
            with self.subTest(name=name):
                symbol, *rest = answer.splitlines()
                places = {line[2:14].strip(): line[14:] for line in rest}
                self.assertIn(symbol + "(", text_at(places["header"]))
                for what, part in parts.items():
                    self.assertIn(part, text_at(places[what]), what)

    def test_an_unknown_name_is_an_error_that_names_the_nearest(self):
        answer = where("ADDNX61", "ADDNX16")
        self.assertEqual(answer.returncode, 1)
        self.assertRegex(answer.stdout, r"ADDNX61: no intrinsic .*\bADDNX16\b")
        self.assertRegex(answer.stdout, r"(?m)^cstub\w+_ZRA_ADDNX16$")


if __name__ == "__main__":
    unittest.main()
