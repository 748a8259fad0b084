"""The dictionary of an open file as plain Python objects: one dict per
variable and one for the file, in the shape that `write` takes back."""

import ctypes
import threading

import numpy as np

from ._lib import ENCODING, NO_LABELS, check, lib, raw, text

_int, _dbl, _str = ctypes.c_int, ctypes.c_double, ctypes.c_char_p


# The library's calls must not overlap, and it takes no lock of its own.
_serial = threading.Lock()


class Handle:
    """An open file handle, closed however the block ends; threads take
    turns for the whole block."""

    def __init__(self, path, open_call, close_call):
        self._path, self._open, self._close = path, open_call, close_call

    def __enter__(self):
        _serial.acquire()
        handle = _int(-1)
        try:
            check(self._open(self._path, ctypes.byref(handle)), "cannot open %r" % self._path.decode(ENCODING, "replace"))
        except BaseException:
            _serial.release()
            raise
        self._handle = handle.value
        return self._handle

    def __exit__(self, *exc):
        try:
            self._close(self._handle)
        finally:
            _serial.release()


def units(width):
    """8-byte value units of a variable of that width (0 numeric)."""
    return 1 if width <= 8 else (width + 7) // 8


def runs(numbers):
    """Rising unit numbers as runs of [first, end), flattened for the case loops."""
    edges = []
    for n in numbers:
        if edges and edges[-1] == n:
            edges[-1] = n + 1
        else:
            edges += [n, n + 1]
    return np.array(edges, np.intc)


def names_and_widths(h):
    count, names, types = _int(), ctypes.POINTER(_str)(), ctypes.POINTER(_int)()
    check(lib.qoraGetVarNames(h, *map(ctypes.byref, (count, names, types))), "cannot list the variables")
    try:
        return [(text(names[i]), types[i]) for i in range(count.value)]
    finally:
        lib.qoraFreeVarNames(names, types, count)


def _ints(call, h, name, n):
    out = [_int() for _ in range(n)]
    check(call(h, name, *map(ctypes.byref, out)), "cannot read a property of %r" % text(name))
    return tuple(o.value for o in out)


def format_of(call, h, name):
    """(type code, width, decimals)."""
    code, decimals, width = _ints(call, h, name, 3)
    return code, width, decimals


def _label(h, name):
    buffer = ctypes.create_string_buffer(1024)
    status = check(lib.qoraGetVarLabelLong(h, name, buffer, len(buffer), None),
                   "cannot read the label of %r" % text(name))
    return text(buffer.value) if status == 0 and buffer.value else None


def missing_of(h, name, width):
    count = _int()
    if width == 0:
        slots = [_dbl() for _ in range(3)]
        status = lib.qoraGetVarNMissingValues(h, name, ctypes.byref(count), *map(ctypes.byref, slots))
        values = [s.value for s in slots]
    elif width <= 8:
        slots = [ctypes.create_string_buffer(9) for _ in range(3)]
        status = lib.qoraGetVarCMissingValues(h, name, ctypes.byref(count), *slots)
        values = [text(s.value).rstrip(" ") for s in slots]
    else:
        return [], None
    check(status, "cannot read the missing values of %r" % text(name))
    n = count.value
    if n < 0:
        return values[2:3] if n == -3 else [], (values[0], values[1])
    return values[:n], None


def value_labels_of(h, name, width):
    count, labels = _int(), ctypes.POINTER(_str)()
    if width == 0:
        values = ctypes.POINTER(_dbl)()
        get, free = lib.qoraGetVarNValueLabels, lib.qoraFreeVarNValueLabels
    else:
        values = ctypes.POINTER(_str)()
        get, free = lib.qoraGetVarCValueLabels, lib.qoraFreeVarCValueLabels
    status = check(get(h, name, *map(ctypes.byref, (values, labels, count))),
                   "cannot read the value labels of %r" % text(name))
    if status == NO_LABELS:
        return {}
    try:
        keys = [values[i] if width == 0 else text(values[i]).rstrip(" ") for i in range(count.value)]
        return dict(zip(keys, (text(labels[i]) for i in range(count.value))))
    finally:
        free(values, labels, count)


def _attributes(call, *args):
    names, texts, count = ctypes.POINTER(_str)(), ctypes.POINTER(_str)(), _int()
    check(call(*args, ctypes.byref(names), ctypes.byref(texts), ctypes.byref(count)), "cannot read the attributes")
    try:
        return {text(names[i]): text(texts[i]) for i in range(count.value)}
    finally:
        lib.qoraFreeAttributes(names, texts, count)


def variable(h, name, width):
    """Everything the dictionary says about one variable."""
    key = raw(name)
    missing, missing_range = missing_of(h, key, width)
    return {
        "name": name,
        "width": width,
        "label": _label(h, key),
        "print_format": format_of(lib.qoraGetVarPrintFormat, h, key),
        "write_format": format_of(lib.qoraGetVarWriteFormat, h, key),
        "missing_values": missing,
        "missing_range": missing_range,
        "value_labels": value_labels_of(h, key, width),
        "measure": _ints(lib.qoraGetVarMeasureLevel, h, key, 1)[0],
        "alignment": _ints(lib.qoraGetVarAlignment, h, key, 1)[0],
        "column_width": _ints(lib.qoraGetVarColumnWidth, h, key, 1)[0],
        "attributes": _attributes(lib.qoraGetVarAttributes, h, key),
    }


def file_items(h):
    """What the dictionary says about the file as a whole."""
    id_string, weight = ctypes.create_string_buffer(256), ctypes.create_string_buffer(256)
    lib.qoraGetIdString(h, id_string)
    lib.qoraGetCaseWeightVar(h, weight)
    cases, compressed = _int(), _int()
    check(lib.qoraGetNumberofCases(h, ctypes.byref(cases)), "cannot read the case count")
    check(lib.qoraGetCompression(h, ctypes.byref(compressed)), "cannot read the compression")
    return {
        "id_string": text(id_string.value).rstrip(" "),
        "weight": text(weight.value) or None,
        "compressed": bool(compressed.value),
        "case_count": cases.value if cases.value >= 0 else None,
        "attributes": _attributes(lib.qoraGetFileAttributes, h),
    }
