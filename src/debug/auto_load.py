# gdb runs this when it loads the library beside which it lies, as <library>-gdb.py. The printers are modules in
# kastarri/gdb below it: imported once, they keep their settings when the program is run again.
import os
import sys

import gdb


def _load_kastarri():
    modules = os.path.join(os.path.dirname(os.path.realpath(__file__)), "kastarri", "gdb")
    if modules not in sys.path:
        sys.path.append(modules)
    import kastarri_printers
    kastarri_printers.register(gdb.current_objfile())  # none if a user sources this file


_load_kastarri()
