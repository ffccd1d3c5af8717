# SPDX-License-Identifier: Apache-2.0
"""Arrays as the bindings take them: float64, C-contiguous, aligned, of one shape."""

from __future__ import annotations

import operator
from collections.abc import Iterable
from typing import Any

import numpy as np


def doubles(values: Any) -> np.ndarray:
    """The values as float64. Masked ones become not-a-number; texts, objects and complex numbers are refused."""
    if isinstance(values, np.ma.MaskedArray):
        values = np.ma.filled(values.astype(np.float64), np.nan)
    array = np.asarray(values)
    if array.dtype.kind not in "biuf":
        raise TypeError(f"real numbers are needed, not {array.dtype}")
    return array.astype(np.float64, copy=False)


def contiguous(array: np.ndarray) -> np.ndarray:
    """The array as the bindings take it; a copy where its layout needs one."""
    return np.require(array, requirements=["C", "A"])


def broadcast(*values: Any) -> list[Any]:
    """The values in one common shape; None stays None. What fits already is not copied."""
    arrays = [None if value is None else doubles(value) for value in values]
    shape = np.broadcast_shapes(*(array.shape for array in arrays if array is not None))
    return [None if array is None else contiguous(np.broadcast_to(array, shape)) for array in arrays]


def whole_number(value: Any) -> int:
    """An integer as the library counts."""
    number = operator.index(value)
    if not -(2**31) <= number < 2**31:
        raise ValueError(f"{number} does not fit into 32 bits")
    return number


def plain(arrays: Iterable[Any]) -> list[Any]:
    """The arrays; those without dimensions as single numbers."""
    return [array[()] for array in arrays]


def samples(values: Any, dtype: type, dimensions: int) -> np.ndarray:
    """The values as samples of a type, C-contiguous and aligned, where numbers keep their kind."""
    array = np.asarray(values)
    if array.ndim != dimensions:
        raise ValueError(f"an array of {dimensions} dimensions is needed, not {array.ndim}")
    return contiguous(array.astype(dtype, casting="same_kind", copy=False))
