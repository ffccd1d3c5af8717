# SPDX-License-Identifier: Apache-2.0
"""Rasters: slices of files as numpy arrays, and new rasters."""

from __future__ import annotations

import operator
import os
from threading import Lock
from types import TracebackType
from typing import Any, Optional, Union

import numpy as np

from . import _core
from ._arrays import contiguous, whole_number
from ._paths import absolute, file_name
from .errors import from_failure

__all__ = ["Raster", "RasterWriter"]


def _pair(kind: str) -> np.dtype:
    return np.dtype([("real", kind), ("imag", kind)])


# By the library's cell types: the samples as they stand in the file, and the type that slices have unless told.
_STORED: list[np.dtype[Any]] = [np.dtype("c8"), np.dtype("f4"), np.dtype("c16"), np.dtype("f8")]
_STORED += [_pair("i4"), np.dtype("i4"), _pair("i2"), np.dtype("i2"), _pair("i1"), np.dtype("i1")]
_WIDER: dict[int, np.dtype[Any]] = {4: np.dtype("c16"), 6: np.dtype("c8"), 8: np.dtype("c8")}
_SLICED = [_WIDER.get(cell_type, stored) for cell_type, stored in enumerate(_STORED)]


def _cell_type(dtype: Any) -> int:
    wanted = np.dtype(dtype).newbyteorder("=")
    if wanted not in _STORED:
        raise TypeError(f"rasters know no samples of {wanted}; they know {', '.join(map(str, _STORED))}")
    return _STORED.index(wanted)


class _Span:
    """What an index takes of one axis."""

    def __init__(self, key: Any, length: int) -> None:
        self.single = not isinstance(key, slice)
        if self.single:
            place = operator.index(key)
            if not -length <= place < length:
                raise IndexError(f"index {place} is not within {length}")
            self.places = range(place % length, place % length + 1)
        else:
            self.places = range(*key.indices(length))
        ends = sorted((self.places[0], self.places[-1])) if self.places else (0, -1)
        self.first = ends[0]
        self.count = ends[1] - ends[0] + 1

    @property
    def slice(self) -> slice:
        """Of what was read from the first place to the last: the places themselves, in their order."""
        return slice(None, None, self.places.step)


def _spans(key: Any, shape: tuple[int, int]) -> tuple[_Span, _Span]:
    keys = list(key) if isinstance(key, tuple) else [key]
    if any(each is Ellipsis for each in keys):
        place = next(i for i, each in enumerate(keys) if each is Ellipsis)
        keys[place : place + 1] = [slice(None)] * (3 - len(keys))
    keys += [slice(None)] * (2 - len(keys))
    if len(keys) != 2:
        raise IndexError("a raster has two axes: lines and samples")
    return _Span(keys[0], shape[0]), _Span(keys[1], shape[1])


def _squeezed(array: np.ndarray, lines: _Span, samples: _Span) -> Any:
    return array[0 if lines.single else slice(None), 0 if samples.single else slice(None)]


def _unmasked(value: Any) -> np.ndarray:
    """Values as an array; masked ones are not-a-number."""
    if np.ma.is_masked(value):
        if value.dtype.kind not in "fc":
            raise ValueError("masked integers have no value to be written")
        return value.filled(np.nan)
    return np.asarray(value)


def _block(value: Any, lines: _Span, samples: _Span) -> np.ndarray:
    """Values for a block without steps, in its shape."""
    if lines.places.step != 1 or samples.places.step != 1:
        raise IndexError("rasters are written without steps")
    array = _unmasked(value)
    if lines.single and not samples.single and array.ndim == 1:
        array = array[np.newaxis, :]
    elif samples.single and not lines.single and array.ndim == 1:
        array = array[:, np.newaxis]
    return np.broadcast_to(array, (lines.count, samples.count))


def _converted(block: np.ndarray, dtype: np.dtype) -> np.ndarray:
    """Values as samples of a type. Real numbers that become integers are rounded half away from zero and held at
    their bounds, no number becomes 0; complex ones become pairs of such, and are refused among real samples."""
    if block.dtype.newbyteorder("=") == dtype:
        return block.astype(dtype, copy=False)
    if block.dtype.kind not in "biufc":
        raise TypeError(f"samples of {dtype} cannot be made of {block.dtype}")
    if dtype.names is not None:
        pairs = np.empty(block.shape, dtype)
        pairs["real"], pairs["imag"] = _converted(block.real, dtype[0]), _converted(block.imag, dtype[1])
        return pairs
    if block.dtype.kind == "c" and dtype.kind != "c":
        raise from_failure(1, "writing a raster", "complex samples are no real ones", "", "", 0, 0)
    return _held(block, dtype) if dtype.kind == "i" else block.astype(dtype)


def _held(block: np.ndarray, dtype: np.dtype) -> np.ndarray:
    if block.dtype.kind == "f":
        block = block.astype(np.float64)
        whole = np.trunc(block)
        block = np.where(np.abs(block - whole) == 0.5, whole + np.sign(block), np.rint(block))
        block = np.where(np.isnan(block), 0.0, block)
    elif block.dtype.kind == "b":
        return block.astype(dtype)
    return np.clip(block, np.iinfo(dtype).min, np.iinfo(dtype).max).astype(dtype)


class Raster:
    """A raster file as a two-dimensional array that is read when it is sliced: lines, then samples.

    `raster[100:200, ::2]` is a numpy array of `dtype`, in the machine's byte order. Nothing is read before, and
    each slice reads only what lies between its first and last line and sample. Any number of threads may slice one
    raster at a time. `raster[10, 5:9] = values` writes into the file, unless its samples have 8 bits.
    """

    def __init__(
        self,
        path: Union[str, os.PathLike, None] = None,
        *,
        header: Union[str, os.PathLike, None] = None,
        dtype: Any = None,
    ) -> None:
        """The raster of a file, described by PATH.hdr, or the one that a product's header describes.

        dtype: of slices; unless given that of the samples, where integers in pairs become complex numbers. Real
        numbers that become integers are rounded half away from zero and held at their bounds.
        """
        if path is None and header is None:
            raise TypeError("a raster's file or a header is needed")
        self._path = None if path is None else file_name(path)
        self._header = f"{self._path}.hdr" if header is None else file_name(header)
        self._wanted = None if dtype is None else np.dtype(dtype).newbyteorder("=")
        if dtype is not None:
            _cell_type(dtype)
        self._opened: Optional[_core.RasterReader] = None
        self._closed = False

    @property
    def _reader(self) -> _core.RasterReader:
        if self._closed:
            raise ValueError(f"{self.path} is closed")
        if self._opened is None:
            self._opened = _core.RasterReader(self._header, self._path)
        return self._opened

    def close(self) -> None:
        """Closes the file, once slices that other threads are reading are there; all further use is refused."""
        self._opened, self._closed = None, True

    def __enter__(self) -> Raster:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()

    def __reduce__(self) -> tuple:
        return _reopened, (self._path and absolute(self._path), absolute(self._header), self._wanted)

    def __repr__(self) -> str:
        if self._opened is None:
            return f"<Raster: {self.path}>"
        return f"<Raster: {self.path}, {self.shape[0]} lines of {self.shape[1]} samples, {self.dtype}>"

    @property
    def path(self) -> str:
        """Name of the raster file."""
        return self._path or self._header[:-4]

    @property
    def shape(self) -> tuple[int, int]:
        """Lines and samples of a line."""
        return (self._reader.lines, self._reader.samples)

    ndim = 2

    @property
    def dtype(self) -> np.dtype:
        """Type of slices."""
        return self._wanted or _SLICED[self._reader.cell_type]

    @property
    def stored_dtype(self) -> np.dtype:
        """Type of the samples in the file; its byte order plays no part."""
        return _STORED[self._reader.cell_type]

    def __len__(self) -> int:
        return self.shape[0]

    def astype(self, dtype: Any) -> Raster:
        """The same raster, whose slices have another type."""
        return Raster(self._path, header=self._header, dtype=dtype)

    def __array__(self, dtype: Any = None) -> np.ndarray:
        return self[:, :] if dtype is None else self[:, :].astype(dtype, copy=False)

    def __getitem__(self, key: Any) -> Any:
        lines, samples = _spans(key, self.shape)
        if abs(lines.places.step) == 1:
            return _squeezed(self._read(lines.first, lines.count, samples)[lines.slice], lines, samples)
        block = np.empty((len(lines.places), len(samples.places)), self.dtype)
        for row, line in zip(block, lines.places):
            row[:] = self._read(line, 1, samples)[0]
        return _squeezed(block, lines, samples)

    def _read(self, first_line: int, lines: int, samples: _Span) -> np.ndarray:
        block = np.empty((lines, samples.count), self.dtype)
        self._reader.read(first_line, lines, samples.first, samples.count, _cell_type(self.dtype), block)
        return block[:, samples.slice]

    def read_into(self, out: np.ndarray, first_line: int = 0, first_sample: int = 0) -> np.ndarray:
        """Fills an array (lines, samples) of any type of samples, C-contiguous and writable, with the block that
        begins there, and returns it: nothing is allocated or copied."""
        if not isinstance(out, np.ndarray):
            raise TypeError("an array is needed")
        if out.ndim != 2 or not out.dtype.isnative:
            raise ValueError("an array of two dimensions in the machine's byte order is needed")
        self._reader.read(first_line, out.shape[0], first_sample, out.shape[1], _cell_type(out.dtype), out)
        return out

    def __setitem__(self, key: Any, value: Any) -> None:
        lines, samples = _spans(key, self.shape)
        block = contiguous(_converted(_block(value, lines, samples), self.stored_dtype))
        place = (lines.first, lines.count, samples.first, samples.count)
        if block.size:
            _core.overwrite(self.path, *place, _cell_type(block.dtype), block)


def _reopened(path: Optional[str], header: str, dtype: Any) -> Raster:
    return Raster(path, header=header, dtype=dtype)


class _Covered:
    """What has been written of a raster: few rectangles, as those that come in order grow together."""

    def __init__(self, shape: tuple[int, int]) -> None:
        self._shape = shape
        self._parts: list[tuple[int, int, int, int]] = []  # first line, last + 1, first sample, last + 1
        self._lock = Lock()

    def add(self, line: int, lines: int, sample: int, samples: int) -> None:
        part = (line, line + lines, sample, sample + samples)
        with self._lock:
            while self._parts and (joined := _joined(self._parts[-1], part)):
                self._parts.pop()
                part = joined
            self._parts.append(part)

    def missing(self) -> int:
        """How many samples no rectangle holds."""
        parts = np.array([*self._parts, (0, self._shape[0], 0, self._shape[1])], np.int64)
        edges = [np.unique(parts[:, place]) for place in (slice(0, 2), slice(2, 4))]
        held = np.zeros((len(edges[0]) - 1, len(edges[1]) - 1), bool)
        for first, last, left, right in parts[:-1]:
            lines, samples = np.searchsorted(edges[0], (first, last)), np.searchsorted(edges[1], (left, right))
            held[slice(*lines), slice(*samples)] = True
        sizes = np.multiply.outer(*(np.diff(edge) for edge in edges))
        return int(sizes[~held].sum())


def _joined(
    one: tuple[int, int, int, int], other: tuple[int, int, int, int]
) -> Optional[tuple[int, int, int, int]]:
    """Two rectangles as one, where the other goes on where the one ends."""
    if one[:2] == other[:2] and one[2] <= other[2] <= one[3]:
        return (*one[:2], one[2], max(one[3], other[3]))
    if one[2:] == other[2:] and one[0] <= other[0] <= one[1]:
        return (one[0], max(one[1], other[1]), *one[2:])
    return None


class RasterWriter:
    """A new raster: written beside its place, it appears there with its description when all of it is there.

    with RasterWriter("image.slc", (lines, samples), "complex64") as image:
        image[0:100, :] = block

    Leaving the block by an exception leaves an older raster of that name as it was.
    """

    def __init__(
        self,
        path: Union[str, os.PathLike],
        shape: tuple[int, int],
        dtype: Any,
        *,
        byte_order: str = "little",
        row_prefix: int = 0,
    ) -> None:
        """shape: lines, samples of a line; byte_order: "little" or "big"; row_prefix: bytes before each line."""
        if byte_order not in ("little", "big"):
            raise ValueError('the byte order is "little" or "big"')
        if len(shape) != 2:
            raise ValueError("a raster has lines and samples, no other axes")
        self.path = file_name(path)
        self.shape = (whole_number(shape[0]), whole_number(shape[1]))
        self.dtype = _STORED[_cell_type(dtype)].newbyteorder(">" if byte_order == "big" else "<")
        self._writer = _core.RasterWriter(
            self.path, *self.shape, _cell_type(dtype), byte_order == "big", whole_number(row_prefix)
        )
        self._covered = _Covered(self.shape)

    def __setitem__(self, key: Any, value: Any) -> None:
        lines, samples = _spans(key, self.shape)
        native = self.dtype.newbyteorder("=")
        block = _converted(_block(value, lines, samples), native).astype(self.dtype, copy=False)
        if block.size:
            self._writer.write(lines.first, samples.first, np.ascontiguousarray(block))
            self._covered.add(lines.first, lines.count, samples.first, samples.count)

    def commit(self) -> None:
        """All samples are written: raster and description take their names. Refused, and the new raster given up,
        where samples never were."""
        if missing := self._covered.missing():
            self.discard()
            raise from_failure(5, "completing a raster", f"{missing} samples were never written", "", "", 0, 0)
        self._writer.commit()

    def discard(self) -> None:
        """Gives the new raster up."""
        self._covered = _Covered((0, 0))
        self._writer.discard()

    def __enter__(self) -> RasterWriter:
        return self

    def __exit__(
        self, kind: Optional[type[BaseException]], error: Optional[BaseException], trace: Optional[TracebackType]
    ) -> None:
        if kind is None:
            self.commit()
        else:
            self.discard()
