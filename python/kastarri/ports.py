"""The ports of the core: functions that its intrinsics call. None takes a function away again.

An exception of a function is raised by the intrinsic that called it. What the intrinsic does afterwards it still does,
as with the value 0.
"""

from ._core import set_handler as _set


def exported_state(changed):
    """changed(value) is told every value that the core gives its exported state."""
    _set("exported", changed)


def input_queue(ready, read, attempt=None):
    """ready() says whether there is an entry, read() takes and returns the oldest.

    attempt() is called before a reading that does not wait; it takes nothing.
    """
    _set("input_ready", ready)
    _set("input_read", read)
    _set("input_attempt", attempt)


def output_queue(ready, write, attempt=None):
    """ready() says whether there is room, write(value) appends an entry.

    attempt() is called before a writing that does not wait; it appends nothing.
    """
    _set("output_ready", ready)
    _set("output_write", write)
    _set("output_attempt", attempt)


def imported_wire(value):
    """value() returns what the wire has."""
    _set("wire", value)
