"""Dates between the file, which counts seconds since 14 October 1582, and
NumPy's datetime64, which counts nanoseconds since 1970."""

import numpy as np

# Format type codes whose values are calendar dates, with or without a time.
DATE_FORMATS = frozenset({20, 22, 23, 24, 28, 29, 30, 38, 39})
DATE_FORMAT = (20, 11, 0)
DATETIME_FORMAT = (22, 20, 0)

_EPOCH = 12219379200  # seconds from 14 October 1582 to 1 January 1970
_NS = 10**9
_NAT = np.iinfo(np.int64).min
# Whole seconds since 1970 that datetime64[ns] holds.
_LIMIT = np.iinfo(np.int64).max // _NS - 1


def to_datetime64(seconds):
    """datetime64[ns] of the dates, NaN becoming NaT, and the number of dates
    outside what datetime64[ns] holds, which become NaT as well."""
    whole = np.floor(seconds) - _EPOCH
    known = np.abs(whole) <= _LIMIT  # false for NaN too
    ns = np.full(seconds.shape, _NAT, np.int64)
    fraction = np.round((seconds[known] - np.floor(seconds[known])) * _NS)
    ns[known] = whole[known].astype(np.int64) * _NS + fraction.astype(np.int64)
    return ns.view("M8[ns]"), int((~known & ~np.isnan(seconds)).sum())


def to_seconds(values):
    """Seconds since 1582 of datetime64 values, NaT becoming NaN."""
    ns = np.asarray(values, "M8[ns]").view(np.int64)
    seconds = (ns // _NS + _EPOCH).astype(np.float64) + (ns % _NS) / _NS
    seconds[ns == _NAT] = np.nan
    return seconds


def format_for(values):
    """The date format when every value falls on midnight, else date and time."""
    ns = np.asarray(values, "M8[ns]").view(np.int64)
    ns = ns[ns != _NAT]
    return DATE_FORMAT if not (ns % (86400 * _NS)).any() else DATETIME_FORMAT
