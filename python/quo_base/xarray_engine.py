"""Products as data sets: `xarray.open_dataset("scene.hdr", engine="quo_base")`."""

from __future__ import annotations

import os
from typing import Any, Callable, Iterable, Optional

import numpy as np
from xarray import Dataset, Variable
from xarray.backends import BackendArray, BackendEntrypoint
from xarray.core import indexing

from .errors import Error
from .product import Grid, Product
from .times import to_datetime64

__all__ = ["QuoBackend"]


class _LazyArray(BackendArray):
    """A two-dimensional array of which `read(lines, samples)` makes blocks; each key is an integer or a slice."""

    def __init__(self, shape: tuple[int, int], dtype: Any, read: Callable[[Any, Any], np.ndarray]) -> None:
        self.shape = shape
        self.dtype = np.dtype(dtype)
        self._read = read

    def __getitem__(self, key: indexing.ExplicitIndexer) -> np.ndarray:
        basic = indexing.IndexingSupport.BASIC
        return indexing.explicit_indexing_adapter(key, self.shape, basic, lambda keys: self._read(*keys))


def _lazy(*args: Any) -> indexing.LazilyIndexedArray:
    return indexing.LazilyIndexedArray(_LazyArray(*args))


def _image(product: Product, dtype: Any) -> Variable:
    raster = product.raster if dtype is None else product.raster.astype(dtype)
    lazy = _lazy(raster.shape, raster.dtype, lambda lines, samples: raster[lines, samples])
    unit = product["DataSetInfo/UnitType"] if "DataSetInfo" in product else ""
    return Variable(("line", "sample"), lazy, {"units": unit} if unit else {})


def _azimuth_times(grid: Grid, lines: Any, samples: Any) -> np.ndarray:
    return to_datetime64(grid.times(lines, samples).azimuth_time)


def _range_times(grid: Grid, lines: Any, samples: Any) -> np.ndarray:
    return np.asarray(grid.times(lines, samples).range_time)


def _placed(times: Callable[[Grid, Any, Any], np.ndarray], grid: Grid, shape: tuple[int, int], dtype: str) -> Any:
    """Times of all pixels, of which only what is asked for is computed."""
    lines, samples = np.arange(shape[0]), np.arange(shape[1])

    def read(line: Any, sample: Any) -> np.ndarray:
        return np.asarray(times(grid, lines[line][..., np.newaxis] if isinstance(sample, slice) else lines[line], samples[sample]))

    return _lazy(shape, dtype, read)


def _coordinates(product: Product, shape: tuple[int, int]) -> dict[str, Variable]:
    """Lines and samples and, where the pixels have times, azimuth time and slant range time: along one axis where
    they change along no other."""
    lines, samples = np.arange(shape[0]), np.arange(shape[1])
    made = {"line": Variable("line", lines), "sample": Variable("sample", samples)}
    try:
        grid = product.grid
    except Error:
        return made
    both = ("line", "sample")
    azimuth = ("line", _azimuth_times(grid, lines, 0)) if grid.lines_at_one_time else None
    slant = ("sample", _range_times(grid, 0, samples)) if not grid.ground_range else None
    made["azimuth_time"] = Variable(
        *(azimuth or (both, _placed(_azimuth_times, grid, shape, "datetime64[ns]"))),
        {"long_name": "zero-Doppler azimuth time"},
    )
    made["slant_range_time"] = Variable(
        *(slant or (both, _placed(_range_times, grid, shape, "float64"))),
        {"units": "s", "long_name": "two-way slant range time"},
    )
    return made


class QuoBackend(BackendEntrypoint):
    """Opens a product's header: the raster as the variable "image", read when it is asked for, with coordinates
    line, sample, azimuth_time and slant_range_time, and all header fields as attributes, "Section/field"."""

    open_dataset_parameters = ["filename_or_obj", "drop_variables", "dtype"]

    def open_dataset(
        self, filename_or_obj: Any, *, drop_variables: Optional[Iterable[str]] = None, dtype: Any = None
    ) -> Dataset:
        product = Product(filename_or_obj)
        image = _image(product, dtype)
        dropped = [drop_variables] if isinstance(drop_variables, str) else (drop_variables or ())
        coordinates = _coordinates(product, image.shape)
        data = Dataset({"image": image}, coordinates, dict(product.walk()))
        return data.drop_vars(dropped)

    def guess_can_open(self, filename_or_obj: Any) -> bool:
        """Other programs have files of that ending, too: only what is a product is one."""
        try:
            return str(filename_or_obj).endswith(".hdr") and "RasterInfo" in Product(os.fspath(filename_or_obj))
        except (Error, OSError, TypeError):
            return False
