# gdb runs this when it loads the library, as <library>-gdb.py beside it or in a directory of gdb's own. The printers are
# modules in kastarri/gdb below the library, or below this file where a user sources it: imported once, they keep their
# settings when the program is run again.
import os
import sys

import gdb


def _load_kastarri():
    library = gdb.current_objfile()  # none if a user sources this file
    near = os.path.dirname(os.path.realpath(library.filename if library else __file__))
    modules = os.path.join(near, "kastarri", "gdb")
    if modules not in sys.path:
        sys.path.append(modules)
    writes, sys.dont_write_bytecode = sys.dont_write_bytecode, True  # who removes the library would not know of it
    try:
        import kastarri_printers
    finally:
        sys.dont_write_bytecode = writes
    kastarri_printers.register(library)


_load_kastarri()
