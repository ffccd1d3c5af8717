# SPDX-License-Identifier: Apache-2.0
"""Fourier transforms in single precision, chirp-z transform, resampling, and least squares."""

from __future__ import annotations

from typing import Any, Callable, NamedTuple

import numpy as np

from . import _core
from ._arrays import broadcast, contiguous, doubles, samples, whole_number

__all__ = [
    "Fit",
    "czt",
    "engine",
    "fast_length",
    "fft",
    "fft2",
    "least_squares",
    "irfft",
    "resize",
    "rfft",
    "sample_at",
]


def engine() -> str:
    """Name of the engine that transforms lengths without a prime factor above 7."""
    return _core.engine()


def fast_length(n: int) -> int:
    """First length from n on whose prime factors are 2, 3 and 5 only."""
    made = _core.fast_length(whole_number(n))
    if n < 1 or made < n:
        raise ValueError(f"there is no length from {n} on")
    return made


def _direction(inverse: bool, scaled: bool) -> int:
    return (-1 if scaled else -2) if inverse else 1


def _along(array: np.ndarray, axis: int, transform: Callable[[np.ndarray], np.ndarray]) -> np.ndarray:
    """What `transform` makes of the vectors along an axis, which it takes as the rows of an image."""
    moved = np.ascontiguousarray(np.moveaxis(array, axis, -1))
    made = transform(moved.reshape(-1, moved.shape[-1]))
    return np.moveaxis(made.reshape(*moved.shape[:-1], made.shape[-1]), -1, axis)


def fft(values: Any, axis: int = -1, inverse: bool = False, scaled: bool = True) -> np.ndarray:
    """Fourier transform along an axis, complex64 in the shape of the values.

    inverse: with exponent sign +1; scaled: the inverse is divided by the length. The forward transform never is.
    """
    direction = _direction(inverse, scaled)
    array = samples(values, np.complex64, np.ndim(values))
    if array.ndim == 2 and axis in (0, -2):
        return _core.fft(array, 0, direction)
    return _along(array, axis, lambda image: _core.fft(image, direction, 0))


def fft2(image: Any, inverse: bool = False, scaled: bool = True) -> np.ndarray:
    """Fourier transform of an image (lines, samples) along both axes, complex64."""
    direction = _direction(inverse, scaled)
    return _core.fft(samples(image, np.complex64, 2), direction, direction)


def rfft(values: Any, axis: int = -1) -> np.ndarray:
    """Fourier transform of N real values along an axis: the N // 2 + 1 frequencies from 0 on, complex64."""
    array = samples(values, np.float32, np.ndim(values))
    return _along(array, axis, lambda image: _unpacked(_core.fft_real(image, 1, 0)))


def irfft(spectrum: Any, n: int, axis: int = -1) -> np.ndarray:
    """The n real values, float32, of their n // 2 + 1 frequencies along an axis; scaled."""
    array = samples(spectrum, np.complex64, np.ndim(spectrum))
    if n < 1:
        raise ValueError(f"{n} values have no frequencies")
    if array.shape[axis] != n // 2 + 1:
        raise ValueError(f"{n} values have {n // 2 + 1} frequencies, not {array.shape[axis]}")
    return _along(array, axis, lambda image: _core.fft_real(_packed(image, n), -1, 0))


def _unpacked(packed: np.ndarray) -> np.ndarray:
    """The engine packs R0 R1 I1 R2 I2 ..., with the last real part alone where there is one."""
    rows, n = packed.shape
    pairs = np.zeros((rows, 2 * (n // 2 + 1)), np.float32)
    pairs[:, 0] = packed[:, 0]
    pairs[:, 2 : n + 1] = packed[:, 1:]
    return pairs.view(np.complex64)


def _packed(spectrum: np.ndarray, n: int) -> np.ndarray:
    pairs = np.ascontiguousarray(spectrum).view(np.float32)
    return np.ascontiguousarray(np.concatenate([pairs[:, :1], pairs[:, 2 : n + 1]], axis=1))


def czt(values: Any, count: int, step: float, first: float = 0.0, axis: int = -1) -> np.ndarray:
    """Chirp-z transform along an axis: the spectrum at `count` angular frequencies, complex64.

    first: the first of them, step: from each to the next, downwards; radians per sample.
    """
    array = samples(values, np.complex64, np.ndim(values))
    return _along(array, axis, lambda image: _core.czt(image, whole_number(count), float(step), float(first)))


def resize(image: Any, shape: tuple[int, int]) -> np.ndarray:
    """An image of more lines and samples, by zero-padding of its spectrum, complex64."""
    array = samples(image, np.complex64, 2).copy()
    lines, places = map(whole_number, shape)
    return _core.grow(_core.grow(array, lines, array.shape[1]), lines, places)


def sample_at(image: Any, line: Any, sample: Any, lowpass: int = 1) -> np.ndarray:
    """An image between its samples, complex64: at places counted from 0, which are broadcast.

    lowpass: from 1 to 64, narrows the band for places that are as far apart. Outside the image it is 0; at
    places that are no numbers it is none.
    """
    lines, places = broadcast(line, sample)
    made = _core.sample_at(samples(image, np.complex64, 2), lines, places, whole_number(lowpass))
    made[np.isnan(lines) | np.isnan(places)] = np.nan
    return made[()]


class Fit(NamedTuple):
    """Least-squares solution."""

    x: np.ndarray
    """Parameters, (columns,)."""
    rank: int
    """Independent columns found."""
    condition: float
    """Condition of the columns, scaled to length 1."""
    residual_norm: float
    """Euclidean norm of b - a x."""


def least_squares(a: Any, b: Any) -> Fit:
    """The x (columns,) that brings a x nearest to b: a (rows, columns), b (rows,). Dependent columns get 0."""
    return Fit(*_core.least_squares(*(contiguous(doubles(each)) for each in (a, b))))
