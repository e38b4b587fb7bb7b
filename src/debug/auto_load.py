# gdb runs this when it loads the library beside which it lies, as <library>-gdb.py. The printers are modules in
# kastarri/gdb below the library: imported once, they keep their settings when the program is run again.
import os
import sys

import gdb


def _load_kastarri():
    objfile = gdb.current_objfile()  # none if a user sources this file
    directory = os.path.dirname(os.path.realpath(objfile.filename if objfile else __file__))
    modules = os.path.join(directory, "kastarri", "gdb")
    if modules not in sys.path:
        sys.path.append(modules)
    import kastarri_printers
    kastarri_printers.register(objfile)


_load_kastarri()
