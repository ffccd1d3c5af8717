# SPDX-License-Identifier: Apache-2.0
"""Times: seconds since 1 January 1985 without leap seconds, as the library counts them, and numpy's datetime64."""

from __future__ import annotations

import re
from typing import Any

import numpy as np

from . import _core

__all__ = ["to_datetime64", "to_seconds", "to_text"]

_EPOCH = np.datetime64("1985-01-01T00:00:00", "ns")
_REACH_S = 8.7e9  # into 1709 and 2260; 64 bits of nanoseconds end in 2262
_SECOND = np.timedelta64(1, "s")
_FINER = ("ms", "us", "ns", "ps", "fs", "as")
_MOST_S = 10**5 * 366 * 86400
_DAY = re.compile(r"\d{4}-\d{2}-\d{2}")
_NANOSECOND = np.timedelta64(1, "ns")


def to_seconds(times: Any) -> Any:
    """Seconds since 1985 of numbers (as they are), datetime64, datetime or texts, in the shape of the input.

    Texts are ISO 8601 ("2022-01-04T17:05:58.25", "2022-01-04") or the headers' form ("04-JAN-2022
    17:05:58.250000"). Not-a-time and what is masked become not-a-number. Of a time in this century a float64 keeps
    quarters of a microsecond.
    """
    array = np.asarray(times)
    if array.dtype.kind not in "UOM":
        return times
    if np.ma.is_masked(times):
        if array.dtype.kind != "M":
            raise TypeError("texts and objects cannot be masked times")
        array = np.where(np.ma.getmaskarray(times), np.datetime64("NaT"), array)
    if array.dtype.kind == "U":
        return np.vectorize(_seconds_of_text, otypes=[np.float64])(array)[()]
    if array.dtype.kind == "O":
        array = array.astype("datetime64[us]")
    return _seconds_of_stamps(array)[()]


def _seconds_of_text(text: str) -> float:
    return _core.seconds_of_text(text + "T00:00:00" if _DAY.fullmatch(text) else text)


def _seconds_of_stamps(array: np.ndarray) -> np.ndarray:
    """By way of whole seconds, which reach further than nanoseconds do."""
    known = ~np.isnat(array)
    whole = np.where(known, array, _EPOCH.astype(array.dtype)).astype("datetime64[s]")
    if (np.abs(whole.astype(np.int64)) > _MOST_S).any() or (whole.astype(array.dtype) > array)[known].any():
        raise ValueError("a time beyond 100,000 years")
    seconds = (whole - _EPOCH.astype("datetime64[s]")).astype(np.int64).astype(np.float64)
    if np.datetime_data(array.dtype)[0] in _FINER:
        seconds += np.where(known, array - whole.astype(array.dtype), np.timedelta64(0, "s")) / _SECOND
    return np.where(known, seconds, np.nan)


def to_datetime64(seconds: Any) -> Any:
    """datetime64[ns] of seconds since 1985; not-a-number and what lies beyond its years become not-a-time."""
    values = np.asarray(seconds, dtype=np.float64)
    known = np.abs(values) < _REACH_S
    whole = np.floor(np.where(known, values, 0.0))
    rest = np.rint((np.where(known, values, 0.0) - whole) * 1e9)
    times = _EPOCH + whole.astype(np.int64) * _SECOND + rest.astype(np.int64) * _NANOSECOND
    return np.where(known, times, np.datetime64("NaT", "ns"))[()]


def to_text(seconds: float, iso: bool = True) -> str:
    """A time as text: ISO 8601 to microseconds, rounded, or the headers' form, cut to microseconds."""
    return _core.text_of_seconds(seconds, iso)
