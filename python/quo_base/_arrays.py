"""Arrays as the bindings take them: float64, C-contiguous, aligned, of one shape."""

from __future__ import annotations

from typing import Any, Optional

import numpy as np


def doubles(values: Any) -> np.ndarray:
    """The values as float64. Masked ones become not-a-number; texts, objects and complex numbers are refused."""
    if isinstance(values, np.ma.MaskedArray):
        values = values.astype(np.float64).filled(np.nan)
    array = np.asarray(values)
    if array.dtype.kind not in "biuf":
        raise TypeError(f"real numbers are needed, not {array.dtype}")
    return array.astype(np.float64, copy=False)


def broadcast(*values: Any) -> list[Optional[np.ndarray]]:
    """The values in one common shape; None stays None. What fits already is not copied."""
    arrays = [None if value is None else doubles(value) for value in values]
    shape = np.broadcast_shapes(*(array.shape for array in arrays if array is not None))
    return [None if array is None else np.require(np.broadcast_to(array, shape), requirements="CA") for array in arrays]


def samples(values: Any, dtype: type, dimensions: int) -> np.ndarray:
    """The values as samples of a type, C-contiguous and aligned, where numbers keep their kind."""
    array = np.asarray(values)
    if array.ndim != dimensions:
        raise ValueError(f"an array of {dimensions} dimensions is needed, not {array.ndim}")
    return np.require(array.astype(dtype, casting="same_kind", copy=False), requirements="CA")
