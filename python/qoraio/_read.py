"""A system file into a DataFrame, and its dictionary into Python objects."""

import ctypes
import os
import warnings

import numpy as np
import pandas as pd

from . import _dates
from ._dictionary import (Handle, file_items, format_of, missing_of, names_and_widths, runs, units,
                          value_labels_of, variable)
from ._lib import QoraError, check, file_name, lib, loops, raw, text


def read_meta(path):
    """The dictionary of the file: a dict with the file's items and, under
    "variables", one dict per variable in file order."""
    with Handle(file_name(path), lib.qoraOpenRead, lib.qoraCloseRead) as h:
        meta = file_items(h)
        meta["variables"] = [variable(h, name, width) for name, width in names_and_widths(h)]
        return meta


def read(path, columns=None, cases=None, labels=False, user_missing=False):
    """The cases of the file as a DataFrame.

    columns: names of the variables to read, in the order wanted (all when None).
    cases: (start, stop) numbered as a slice, from 0 and stop excluded; the
        reader seeks to start, so parts of a file can be read separately.
    labels: labelled variables become categoricals of their labels.
    user_missing: keep user-missing values instead of making them NaN.
    """
    name = file_name(path)
    with Handle(name, lib.qoraOpenRead, lib.qoraCloseRead) as h:
        all_vars = names_and_widths(h)
        offsets = np.cumsum([0] + [units(w) for _, w in all_vars])
        size = _case_size(h, int(offsets[-1]))
        picked = _choose(all_vars, columns)
        block = _read_cases(h, name, size, cases, [int(offsets[i]) for i, (_, w) in enumerate(all_vars) if w == 0])
        chosen = [(_essentials(h, *all_vars[i], labels), int(offsets[i])) for i in picked]
    return _frame(block, chosen, labels, user_missing)


def _essentials(h, name, width, labels):
    """What shaping a variable's column needs of its dictionary entry."""
    key = raw(name)
    missing, missing_range = missing_of(h, key, width)
    return {"name": name, "width": width, "print_format": format_of(lib.qoraGetVarPrintFormat, h, key),
            "missing_values": missing, "missing_range": missing_range,
            "value_labels": value_labels_of(h, key, width) if labels else {}}


def _case_size(h, expected_units):
    size = ctypes.c_int()
    check(lib.qoraGetCaseSize(h, ctypes.byref(size)), "cannot read the case size")
    if size.value != expected_units * 8:
        raise QoraError(6, "the case size %d does not match the variables' %d bytes" % (size.value, expected_units * 8))
    return size.value


def _choose(all_vars, columns):
    if columns is None:
        return list(range(len(all_vars)))
    index = {name: i for i, (name, _) in enumerate(all_vars)}
    missing = [c for c in columns if c not in index]
    if missing:
        raise KeyError("no such variables: %s" % ", ".join(map(str, missing)))
    return [index[c] for c in columns]


def _case_range(h, path, units_per_case, cases):
    """First case and the most cases to read. A count from the header is
    trusted only as far as the file has bytes for it."""
    count, compressed = ctypes.c_int(), ctypes.c_int()
    check(lib.qoraGetNumberofCases(h, ctypes.byref(count)), "cannot read the case count")
    check(lib.qoraGetCompression(h, ctypes.byref(compressed)), "cannot read the compression")
    # A compressed value takes at least one code byte, a raw one 8 bytes.
    room = os.path.getsize(path) // (units_per_case * (1 if compressed.value else 8)) + 1
    total = count.value if count.value >= 0 else None
    start, stop = cases if cases is not None else (0, None)
    if total is not None:
        start, stop, _ = slice(start, stop).indices(total)
    elif start < 0 or (stop is not None and stop < 0):
        raise ValueError("the file does not record its case count: cases must count from the start")
    stop = start + room if stop is None else stop
    return start, max(0, min(stop - start, room))


def _read_cases(h, path, size, cases, numeric_offsets):
    """The chosen cases as a (cases, units) float64 block, system-missing
    already NaN in the numeric units."""
    units_per_case = size // 8
    start, rows = _case_range(h, path, units_per_case, cases)
    block = np.empty((rows, units_per_case), np.float64)
    if rows == 0:
        return block
    if start > 0:
        check(lib.qoraSeekNextCase(h, start), "cannot seek to case %d" % start)
    numeric = runs(numeric_offsets)
    done = ctypes.c_int64()
    status = loops.qoraio_read_cases(ctypes.cast(lib.qoraWholeCaseIn, ctypes.c_void_p), h, block.ctypes.data, rows,
                                     units_per_case, numeric.ctypes.data, len(numeric) // 2, ctypes.byref(done))
    check(status, "cannot read case %d" % (start + done.value))
    return block[: done.value]


def _frame(block, chosen, labels, user_missing):
    names = [var["name"] for var, _ in chosen]
    if all(var["width"] == 0 for var, _ in chosen):
        offsets = [offset for _, offset in chosen]
        values = block if offsets == list(range(block.shape[1])) else block[:, offsets]
        for j, (var, _) in enumerate(chosen):
            _user_missing(values[:, j], var, user_missing)
        frame = pd.DataFrame(values, columns=names, copy=False)
    else:
        columns = {}
        for var, offset in chosen:
            if var["width"]:
                columns[var["name"]] = _strings(block, offset, var["width"])
            else:
                columns[var["name"]] = _user_missing(np.array(block[:, offset]), var, user_missing)
        frame = pd.DataFrame(columns)
    for var, _ in chosen:
        if var["width"] == 0 and var["print_format"][0] in _dates.DATE_FORMATS:
            frame[var["name"]], lost = _dates.to_datetime64(frame[var["name"]].to_numpy())
            if lost:
                warnings.warn("%s: %d dates outside the years 1678 to 2261 read as NaT" % (var["name"], lost))
        if labels and var["value_labels"]:
            frame[var["name"]] = _categorical(frame[var["name"]], var["value_labels"])
    return frame


def _strings(block, offset, width):
    """Whole string values of one variable, trailing blanks trimmed."""
    cells = np.ascontiguousarray(block.view(np.uint8)[:, offset * 8: offset * 8 + width])
    return pd.Series([text(b.rstrip(b" ")) for b in cells.view("S%d" % width).ravel()], dtype=object)


def _user_missing(values, var, keep):
    """Turns the variable's user-missing values into NaN, in place."""
    if keep or not (var["missing_values"] or var["missing_range"]):
        return values
    missing = np.isin(values.view(np.int64), np.array(var["missing_values"], np.float64).view(np.int64))
    if var["missing_range"] is not None:
        low, high = var["missing_range"]
        missing |= (values >= low) & (values <= high)
    values[missing] = np.nan
    return values


def _categorical(column, value_labels):
    """Labels in place of labelled values; a value without a label keeps its
    own text, so that nothing is lost."""
    mapped = [value_labels.get(v, v if isinstance(v, str) else "%g" % v) if pd.notna(v) else None for v in column]
    categories = list(dict.fromkeys(value_labels.values()))
    categories += sorted({m for m in mapped if m is not None} - set(categories))
    return pd.Categorical(mapped, categories=categories)
