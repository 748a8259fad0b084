"""A DataFrame into a system file, with the dictionary it implies or the one
given, in the shape `read_meta` returns."""

import ctypes
import os
import warnings

import numpy as np
import pandas as pd

from . import _dates
from ._dictionary import Handle, runs, units
from ._lib import check, file_name, has, lib, loops, raw

_MAX_STRING = 32767
_CHUNK_BYTES = 1 << 20  # cases are assembled a cache-sized block at a time


def write(df, path, meta=None, compress=True):
    """Writes the DataFrame as a system file.

    Columns become variables in order: numbers and booleans numeric,
    datetime64 numeric with a date format, categoricals numeric codes 1, 2,
    ... labelled with their categories, anything else strings as wide as the
    longest value. meta (as read_meta returns it, or any part of it) adds
    labels, formats, missing values, value labels, display properties,
    attributes and the file's id string and weight; a string keeps a width
    given there when its values fit.
    """
    given = {v["name"]: v for v in (meta or {}).get("variables", [])}
    columns = [_Column(str(name), df[name], given.get(str(name), {})) for name in df.columns]
    name, opened = file_name(path), False
    try:
        with Handle(name, lib.qoraOpenWrite, lib.qoraCloseWrite) as h:
            opened = True
            check(lib.qoraSetCompression(h, int(bool(compress))), "cannot set the compression")
            for column in columns:
                column.define(h)
            _define_file(h, meta or {})
            check(lib.qoraCommitHeader(h), "cannot write the dictionary")
            _write_cases(h, columns, len(df))
    except BaseException:
        if opened and os.path.exists(name):  # no half-written file is left
            os.remove(name)
        raise


class _Column:
    """One column: its variable's definition and its values as file units."""

    def __init__(self, name, series, given):
        self.name, self.given, self.labels = name, dict(given), {}
        if isinstance(series.dtype, pd.CategoricalDtype):
            series = self._categories(series)
        if pd.api.types.is_datetime64_any_dtype(series.dtype):
            moments = series.dt.tz_convert(None) if series.dt.tz is not None else series
            self.values, self.width = _dates.to_seconds(moments.to_numpy()), 0
            self.format = _dates.format_for(moments.to_numpy())
        elif pd.api.types.is_bool_dtype(series.dtype) or pd.api.types.is_numeric_dtype(series.dtype):
            # NumPy columns come as they are; nullable ones give NaN for NA.
            plain = isinstance(series.dtype, np.dtype)
            self.values = series.to_numpy(np.float64) if plain else series.to_numpy(np.float64, na_value=np.nan)
            self.width, self.format = 0, _number_format(series, self.values)
        else:
            self.values, self.width = _strings(series, given.get("width", 0))
            self.format = (1, self.width, 0)
        if "width" in given and (given["width"] == 0) != (self.width == 0):
            self.given = {}  # the column is not of the type the dictionary gives

    def _categories(self, series):
        """The values behind a categorical, when the given value labels name
        them (a category that is no label being its value's own text, as
        `read` makes it); else codes 1, 2, ... labelled with the categories."""
        given = self.given.get("value_labels") or {}
        values = {label: value for value, label in given.items()}
        strings = bool(self.given.get("width"))
        try:
            if given:
                originals = [values[c] if c in values else (c if strings else float(c)) for c in series.cat.categories]
                return series.cat.rename_categories(originals).astype(object if strings else np.float64)
        except (TypeError, ValueError):
            pass
        self.given.pop("value_labels", None)
        self.labels = {float(i + 1): str(c) for i, c in enumerate(series.cat.categories)}
        codes = series.cat.codes.to_numpy().astype(np.float64)
        return pd.Series(np.where(codes < 0, np.nan, codes + 1), index=series.index)

    def define(self, h):
        key, given = raw(self.name), self.given
        check(lib.qoraSetVarName(h, key, self.width), "cannot define variable %r" % self.name)
        for call, item in ((lib.qoraSetVarPrintFormat, "print_format"), (lib.qoraSetVarWriteFormat, "write_format")):
            code, width, decimals = self._format(given.get(item))
            check(call(h, key, code, decimals, width), "cannot set the %s of %r" % (item.replace("_", " "), self.name))
        if given.get("label"):
            check(lib.qoraSetVarLabel(h, key, raw(given["label"])), "cannot set the label of %r" % self.name)
        _define_missing(h, key, self.width, given)
        for value, label in {**self.labels, **(given.get("value_labels") or {})}.items():
            if self.width:
                status = lib.qoraSetVarCValueLabel(h, key, raw(value), raw(label))
            else:
                status = lib.qoraSetVarNValueLabel(h, key, float(value), raw(label))
            check(status, "cannot set a value label of %r" % self.name)
        for call, item in ((lib.qoraSetVarMeasureLevel, "measure"), (lib.qoraSetVarAlignment, "alignment"),
                           (lib.qoraSetVarColumnWidth, "column_width")):
            if given.get(item) is not None:
                check(call(h, key, given[item]), "cannot set the %s of %r" % (item.replace("_", " "), self.name))
        _define_attributes(h, "qoraSetVarAttributes", given.get("attributes"), key)

    def _format(self, given):
        """A given format, unless it no longer fits a string grown wider."""
        if given and self.width and given[1] != self.width * (2 if given[0] == 2 else 1):
            return self.format
        return given or self.format


def _number_format(series, values):
    """Whole numbers without decimals, as wide as the widest; others F8.2."""
    if not (pd.api.types.is_integer_dtype(series.dtype) or pd.api.types.is_bool_dtype(series.dtype)):
        return (5, 8, 2)
    known = values[~np.isnan(values)]
    digits = len("%d" % np.abs(known).max()) + 1 if known.size else 1
    return (5, min(40, max(8, digits)), 0)


def _strings(series, given_width):
    """Blank-padded bytes of each value, and the variable's width: the widest
    value, or the given width when every value fits in it."""
    encoded = [b"" if v is None or (not isinstance(v, str) and pd.isna(v)) else raw(str(v)) for v in series]
    width = max([len(b) for b in encoded] + [1])
    if width > _MAX_STRING:
        raise ValueError("column %r holds a value of %d bytes; at most %d fit" % (series.name, width, _MAX_STRING))
    width = max(width, min(given_width, _MAX_STRING))
    size = units(width) * 8
    return np.array([b.ljust(size, b" ") for b in encoded], "S%d" % size), width


def _define_missing(h, key, width, given):
    values, value_range = list(given.get("missing_values") or []), given.get("missing_range")
    if not values and value_range is None:
        return
    if width == 0:
        slots = list(value_range or []) + values
        count = -len(slots) if value_range is not None else len(slots)
        status = lib.qoraSetVarNMissingValues(h, key, count, *(slots + [0.0] * (3 - len(slots))))
    else:
        slots = [raw(v) for v in values] + [None] * (3 - len(values))
        status = lib.qoraSetVarCMissingValues(h, key, len(values), *slots)
    check(status, "cannot set the missing values of %r" % key.decode(errors="replace"))


def _define_attributes(h, call, attributes, *where):
    """Custom attributes, where the library offers the call to set them."""
    if not attributes:
        return
    if not has(call):
        warnings.warn("this library cannot write attributes; they are left out")
        return
    names = (ctypes.c_char_p * len(attributes))(*map(raw, attributes))
    texts = (ctypes.c_char_p * len(attributes))(*map(raw, attributes.values()))
    check(getattr(lib, call)(h, *where, names, texts, len(attributes)), "cannot set the attributes")


def _define_file(h, meta):
    if meta.get("id_string"):
        check(lib.qoraSetIdString(h, raw(meta["id_string"])), "cannot set the id string")
    if meta.get("weight"):
        check(lib.qoraSetCaseWeightVar(h, raw(meta["weight"])), "cannot set the weight variable")
    _define_attributes(h, "qoraSetFileAttributes", meta.get("attributes"))


def _write_cases(h, columns, rows):
    offsets = np.cumsum([0] + [units(c.width) for c in columns])
    case_units = int(offsets[-1])
    numeric = runs([offsets[i] for i, c in enumerate(columns) if c.width == 0])
    step = max(1, _CHUNK_BYTES // (case_units * 8))
    block = np.empty((min(step, rows), case_units), np.float64)
    write_case = ctypes.cast(lib.qoraWholeCaseOut, ctypes.c_void_p)
    for first in range(0, rows, step):
        part = block[: min(step, rows - first)]
        for column, offset in zip(columns, offsets):
            values = column.values[first: first + len(part)]
            if column.width:
                cells = values.view(np.uint8).reshape(len(part), -1)
                part.view(np.uint8)[:, offset * 8: offset * 8 + cells.shape[1]] = cells
            else:
                part[:, offset] = values
        status = loops.qoraio_write_cases(write_case, h, part.ctypes.data, len(part), case_units,
                                          numeric.ctypes.data, len(numeric) // 2)
        check(status, "cannot write case %d" % first)
