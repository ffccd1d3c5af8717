"""Rasters: slices of files as numpy arrays, and new rasters."""

from __future__ import annotations

import operator
import os
from types import TracebackType
from typing import Any, Optional, Union

import numpy as np

from . import _core
from ._arrays import contiguous
from ._paths import file_name

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


def _block(value: Any, lines: _Span, samples: _Span) -> np.ndarray:
    """Values for a block without steps, in its shape."""
    if lines.places.step != 1 or samples.places.step != 1:
        raise IndexError("rasters are written without steps")
    array = np.asarray(value)
    if lines.single and not samples.single and array.ndim == 1:
        array = array[np.newaxis, :]
    elif samples.single and not lines.single and array.ndim == 1:
        array = array[:, np.newaxis]
    return np.broadcast_to(array, (lines.count, samples.count))


def _storable(block: np.ndarray, kind: str) -> np.ndarray:
    """Values in a type that the library converts into samples of this kind."""
    dtype = block.dtype.newbyteorder("=")
    if dtype.kind == "c" or (kind == "c" and dtype.names is None):
        dtype = np.dtype(np.complex64 if dtype == np.complex64 else np.complex128)
    elif dtype not in _STORED or dtype == np.int8:
        dtype = np.dtype(np.float64)
    return contiguous(block.astype(dtype, casting="same_kind", copy=False))


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
        self._wanted = None if dtype is None else np.dtype(dtype)
        if dtype is not None:
            _cell_type(dtype)
        self._opened: Optional[_core.RasterReader] = None

    @property
    def _reader(self) -> _core.RasterReader:
        if self._opened is None:
            self._opened = _core.RasterReader(self._header, self._path)
        return self._opened

    def __reduce__(self) -> tuple:
        return _reopened, (self._path, self._header, self._wanted)

    def __repr__(self) -> str:
        if self._opened is None:
            return f"<Raster: {self.path}>"
        return f"<Raster: {self.path}, {self.shape[0]} lines of {self.shape[1]} samples, {self.dtype}>"

    path = property(lambda self: self._path or self._header[:-4], doc="Name of the raster file.")
    shape = property(lambda self: (self._reader.lines, self._reader.samples), doc="Lines and samples of a line.")
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
        block = _storable(_block(value, lines, samples), self.dtype.kind)
        place = (lines.first, lines.count, samples.first, samples.count)
        if block.size:
            _core.overwrite(self.path, *place, _cell_type(block.dtype), block)


def _reopened(path: Optional[str], header: str, dtype: Any) -> Raster:
    return Raster(path, header=header, dtype=dtype)


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
        self.path = file_name(path)
        self.shape = (operator.index(shape[0]), operator.index(shape[1]))
        self.dtype = _STORED[_cell_type(dtype)].newbyteorder(">" if byte_order == "big" else "<")
        self._writer = _core.RasterWriter(
            self.path, *self.shape, _cell_type(dtype), byte_order == "big", row_prefix
        )

    def __setitem__(self, key: Any, value: Any) -> None:
        lines, samples = _spans(key, self.shape)
        block = _block(value, lines, samples).astype(self.dtype, casting="same_kind", copy=False)
        if block.size:
            self._writer.write(lines.first, samples.first, np.ascontiguousarray(block))

    def commit(self) -> None:
        """All samples are written: raster and description take their names."""
        self._writer.commit()

    def discard(self) -> None:
        """Gives the new raster up."""
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
