# SPDX-License-Identifier: Apache-2.0
"""Products as data sets: `xarray.open_dataset("scene.hdr", engine="quo_base")`."""

from __future__ import annotations

import os
from typing import Any, Iterable, Optional

import numpy as np
from xarray import Dataset, Variable
from xarray.backends import BackendArray, BackendEntrypoint
from xarray.core import indexing

from .errors import Error
from .product import Product
from .raster import Raster
from .times import to_datetime64

__all__ = ["QuoBackend"]


_BLOCK_LINES = 64  # whole, as they stand in the file


class _LazyArray(BackendArray):
    """A two-dimensional array of which read() makes blocks; each key is an integer or a slice."""

    def __init__(self, shape: tuple[int, int], dtype: Any) -> None:
        self.shape = shape
        self.dtype = np.dtype(dtype)

    def read(self, lines: Any, samples: Any) -> np.ndarray:
        raise NotImplementedError

    def __getitem__(self, key: indexing.ExplicitIndexer) -> np.ndarray:
        basic = indexing.IndexingSupport.BASIC
        return indexing.explicit_indexing_adapter(key, self.shape, basic, lambda keys: self.read(*keys))


class _Image(_LazyArray):
    """The raster."""

    def __init__(self, raster: Raster) -> None:
        super().__init__(raster.shape, raster.dtype)
        self._raster = raster

    def read(self, lines: Any, samples: Any) -> np.ndarray:
        return self._raster[lines, samples]


class _Times(_LazyArray):
    """Times of all pixels: "azimuth_time" or "range_time"."""

    def __init__(self, product: Product, shape: tuple[int, int], which: str) -> None:
        super().__init__(shape, "datetime64[ns]" if which == "azimuth_time" else "float64")
        self._product = product
        self._which = which

    def read(self, lines: Any, samples: Any) -> np.ndarray:
        line, sample = (np.arange(size)[key] for size, key in zip(self.shape, (lines, samples)))
        if isinstance(lines, slice) and isinstance(samples, slice):
            line = line[:, np.newaxis]
        times = getattr(self._product.grid.times(line, sample), self._which)
        return np.asarray(to_datetime64(times) if self._which == "azimuth_time" else times)


def _coordinate(product: Product, shape: tuple[int, int], which: str, axis: Optional[int]) -> Any:
    """Dimensions and times of pixels: along the one axis on which they change, else of all, when asked for."""
    times = _Times(product, shape, which)
    if axis is None:
        return ("line", "sample"), indexing.LazilyIndexedArray(times)
    key = (slice(None), 0) if axis == 0 else (0, slice(None))
    return ("line", "sample")[axis], times.read(*key)


def _coordinates(product: Product, shape: tuple[int, int]) -> dict[str, Variable]:
    """Lines and samples and, where the pixels have times, azimuth time and slant range time."""
    made = {name: Variable(name, np.arange(size)) for name, size in zip(("line", "sample"), shape)}
    try:
        grid = product.grid
    except Error:
        return made
    azimuth = _coordinate(product, shape, "azimuth_time", 0 if grid.lines_at_one_time else None)
    slant = _coordinate(product, shape, "range_time", None if grid.ground_range else 1)
    made["azimuth_time"] = Variable(azimuth[0], azimuth[1], {"long_name": "zero-Doppler azimuth time"})
    made["slant_range_time"] = Variable(
        slant[0], slant[1], {"units": "s", "long_name": "two-way slant range time"}
    )
    return made


def _image(product: Product, dtype: Any) -> Variable:
    raster = product.raster if dtype is None else product.raster.astype(dtype)
    unit = product["DataSetInfo/UnitType"] if "DataSetInfo" in product else ""
    lazy = indexing.LazilyIndexedArray(_Image(raster))
    lines, samples = raster.shape
    variable = Variable(("line", "sample"), lazy, {"units": unit} if unit else {})
    variable.encoding["preferred_chunks"] = {"line": max(1, min(lines, _BLOCK_LINES)), "sample": max(1, samples)}
    return variable


class QuoBackend(BackendEntrypoint):
    """Opens a product's header: the raster as the variable "image", read when it is asked for, with coordinates
    line, sample, azimuth_time and slant_range_time, and all header fields as attributes, "Section.field"."""

    open_dataset_parameters = ("filename_or_obj", "drop_variables", "dtype")

    def open_dataset(  # type: ignore[override]
        self, filename_or_obj: Any, *, drop_variables: Optional[Iterable[str]] = None, dtype: Any = None
    ) -> Dataset:
        product = Product(filename_or_obj)
        image = _image(product, dtype)
        dropped = [drop_variables] if isinstance(drop_variables, str) else (drop_variables or ())
        coordinates = _coordinates(product, image.shape)
        # Files of other formats have no names with slashes.
        fields = {name.replace("/", "."): value for name, value in product.walk()}
        return Dataset({"image": image}, coordinates, fields).drop_vars(dropped)

    def guess_can_open(self, filename_or_obj: Any) -> bool:
        """Other programs have files of that ending, too: only what is a product is one."""
        try:
            return str(filename_or_obj).endswith(".hdr") and "RasterInfo" in Product(os.fspath(filename_or_obj))
        except (Error, OSError, TypeError):
            return False
