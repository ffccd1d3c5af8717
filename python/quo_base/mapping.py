# SPDX-License-Identifier: Apache-2.0
"""Terrain-corrected maps: images on the grid of an elevation model, or on one that is asked for."""

from __future__ import annotations

import os
from importlib.util import find_spec
from typing import Any, NamedTuple, Optional, Sequence, Union

import numpy as np

from . import _maps
from ._maps import MapGrid, Terrain
from ._paths import absolute
from .product import Product

__all__ = ["QUANTITIES", "geocode"]

Path = Union[str, os.PathLike]

QUANTITIES: dict[str, tuple[str, str]] = {
    "image": ("", "image, amplitude of complex samples"),
    "height": ("m", "height above the ellipsoid"),
    "line": ("", "line of the image, from 0"),
    "sample": ("", "sample of the image, from 0"),
    "incidence": ("degrees", "angle between the line of sight and the ellipsoid's normal"),
    "local_incidence": ("degrees", "angle between the line of sight and the terrain's normal"),
    "mask": ("", "sum of 1 where layover and 2 where shadow lies, and 4 where the terrain is not known"),
}
"""What can be had on the map: name, unit and meaning."""


class _Job(NamedTuple):
    """All that a tile of the map is made of: paths and numbers, so that it travels to other machines."""

    header: str
    raster: str
    terrain: Terrain
    grid: MapGrid
    resampling: str
    quantities: tuple[str, ...]
    relief: float
    """Of all the ground that can hide or overlay a place of the map, so that tiles see what the map sees, m."""
    files: tuple[tuple[int, int], ...]
    """Sizes and times of header, raster and model: maps of changed files have other names in a cluster."""

    def tile(self, row: int, column: int, rows: int, columns: int) -> dict[str, np.ndarray]:
        """Those quantities on rows x columns of the map from a place on."""
        product = Product(self.header, self.raster)
        return _Tile(self, product, row, column, rows, columns).quantities()


class _Tile:
    """Terrain and its sight by the radar on a part of the map."""

    def __init__(self, job: _Job, product: Product, row: int, column: int, rows: int, columns: int) -> None:
        self._job = job
        self._product = product
        self._place = (row, column, rows, columns)
        margin = int("local_incidence" in job.quantities)
        self._inner = (slice(margin, margin + rows), slice(margin, margin + columns))
        self.longitude, self.latitude, self.height = self._heights(margin, margin)
        self.seen = product.orbit.to_radar(self.latitude, self.longitude, self.height)
        found = product.grid.pixels(self.seen.azimuth_time, self.seen.range_time)
        self.line, self.sample = np.asarray(found.line), np.asarray(found.sample)

    def _heights(self, more_rows: int, more_columns: int) -> tuple[np.ndarray, np.ndarray, np.ndarray]:
        """Longitudes, latitudes and heights with so much more on each side."""
        row, column, rows, columns = self._place
        around = (row - more_rows, column - more_columns, rows + 2 * more_rows, columns + 2 * more_columns)
        longitude, latitude = self._job.grid.places(*around)
        return longitude, latitude, self._job.terrain.heights(longitude, latitude)

    def _heights_alone(self, more_rows: int, more_columns: int) -> np.ndarray:
        """The heights of _heights(), in strips, as only they are kept."""
        row, column, rows, columns = self._place
        made = np.empty((rows + 2 * more_rows, columns + 2 * more_columns))
        strip = max(1, _STRIP // made.shape[1])
        for first in range(0, made.shape[0], strip):
            count = min(strip, made.shape[0] - first)
            places = self._job.grid.places(row - more_rows + first, column - more_columns, count, made.shape[1])
            made[first : first + count] = self._job.terrain.heights(*places)
        return made

    def quantities(self) -> dict[str, np.ndarray]:
        """The quantities that are asked for, by name."""
        return {name: getattr(self, "_" + name)() for name in self._job.quantities}

    def _image(self) -> np.ndarray:
        line, sample = self.line[self._inner], self.sample[self._inner]
        return _maps.resample(self._product.raster, line, sample, self._job.resampling)

    def _line(self) -> np.ndarray:
        return self.line[self._inner]

    def _sample(self) -> np.ndarray:
        return self.sample[self._inner]

    def _height(self) -> np.ndarray:
        return self.height[self._inner]

    def _incidence(self) -> np.ndarray:
        azimuth, slant, height = (each[self._inner] for each in (*self.seen[:2], self.height))
        made = self._product.orbit.quantities(["incidence"], azimuth, slant, None, height)
        return np.asarray(made["incidence"])

    def _sight(self) -> tuple[np.ndarray, np.ndarray]:
        """Unit vectors from the ground to the platform, and the ground, both (rows, columns, 3), Earth-fixed."""
        ground = _maps.earth_fixed(self.latitude, self.longitude, self.height)
        orbit, time = self._product.orbit, self.seen.azimuth_time
        platform = orbit.position(np.where(np.isfinite(time), time, orbit.first_time))
        line = platform - ground
        return line / np.linalg.norm(line, axis=-1, keepdims=True), ground

    def _local_incidence(self) -> np.ndarray:
        sight, ground = self._sight()
        cosine = np.sum(sight * _maps.terrain_normals(ground), axis=-1)
        angle = np.degrees(np.arccos(np.clip(cosine, -1.0, 1.0)))
        angle[~np.isfinite(self.seen.azimuth_time)] = np.nan
        return angle[self._inner]

    def _mask(self) -> np.ndarray:
        sight, _ = self._sight()
        east, north = _maps.horizontal(sight, self.latitude, self.longitude)
        steps = _maps.map_steps(east, north, self.latitude, self.longitude, self._job.grid)
        inner = self._inner
        return _maps.layover_and_shadow(
            self._heights_alone,
            self.height[inner],
            np.tan(np.radians(self._incidence())),
            tuple(step[inner] for step in steps),
            self._job.grid.pixel_m,
            self._job.relief,
        )


def geocode(
    product: Union[Product, Path],
    dem: Path,
    crs: Any = None,
    spacing: Optional[float] = None,
    resampling: str = "bilinear",
    quantities: Sequence[str] = ("image",),
    *,
    heights: Optional[str] = None,
    chunks: Union[int, str, None] = None,
) -> Any:
    """The product's image as a map: an xarray.Dataset with one variable for each quantity.

    product: as its file has it; one with changes that are not saved is refused. dem: elevation model, any file
    that rasterio reads, in metres once its scale is applied. heights: what its heights stand on, "ellipsoid"
    (WGS84), "egm96" or "egm2008"; unless told, what the file names, and one that names nothing is refused. Geoid
    heights are converted by pyproj, or refused where its grids are missing. crs and spacing (in units of crs): the
    map's reference system and pixels; unless given those of the elevation model. What is far finer than the
    image's pixels or coarser than all of it is refused. The map covers the model as far as the image may reach.
    resampling: "nearest", "bilinear" or "sinc" (eight samples each way). quantities: see QUANTITIES. chunks:
    pixels of a tile's side, or "auto"; then the variables are dask arrays of tiles that are made when they are
    asked for, on any scheduler. Not-a-number where there is no image.

    Amplitudes of complex images are interpolated, not the samples: their phase turns too fast for a neighbour's.
    """
    _need("xarray", "rasterio", "pyproj", *(["dask"] if chunks is not None else []))
    _check(resampling, quantities, chunks)
    held = product if isinstance(product, Product) else Product(product)
    if held.path is None:
        raise ValueError("a product in memory has no raster to map")
    if isinstance(product, Product) and _unsaved(held):
        raise ValueError(f"the product has changes that {held.path} does not have: save() it before")
    terrain = Terrain.of(dem, heights)
    grid = MapGrid.over(held, terrain, crs, spacing)
    relief = terrain.relief(*grid.outline()) if "mask" in quantities else 0.0
    names = (absolute(held.path), absolute(held.raster.path))
    files = tuple(map(_stamp, (*names, terrain.path)))
    job = _Job(*names, terrain, grid, resampling, tuple(quantities), relief, files)
    if chunks is None:
        return _dataset(job, _eager(job))
    return _dataset(job, _lazy(job, chunks if isinstance(chunks, int) else _TILE))


def _stamp(name: str) -> tuple[int, int]:
    """Size and time of a file; of one that is none, nothing."""
    try:
        told = os.stat(name)
    except OSError:
        return -1, -1
    return told.st_size, told.st_mtime_ns


def _unsaved(product: Product) -> bool:
    """Whether a product differs from its file by more than the digits that headers usually have."""
    saved = Product(product.path)
    return list(saved) != list(product) or any(
        not _alike(value, other) for (_, value), (_, other) in zip(product.walk(), saved.walk())
    )


def _alike(one: Any, other: Any) -> bool:
    if isinstance(one, (float, np.ndarray)):
        return np.shape(one) == np.shape(other) and np.allclose(one, other, rtol=1e-14, atol=0.0, equal_nan=True)
    return bool(one == other)


def _need(*modules: str) -> None:
    for module in modules:
        if find_spec(module) is None:
            raise ModuleNotFoundError(f"geocode() needs {module}, Debian's python3-{module}", name=module)


def _check(resampling: str, quantities: Sequence[str], chunks: Union[int, str, None]) -> None:
    if chunks not in (None, "auto") and not (isinstance(chunks, int) and chunks >= 1):
        raise ValueError(f"tiles of {chunks} pixels make no map")
    if resampling not in _maps.RESAMPLINGS:
        raise ValueError(f"resampling is one of {', '.join(_maps.RESAMPLINGS)}, not {resampling!r}")
    unknown = [name for name in quantities if name not in QUANTITIES]
    if unknown or not quantities:
        raise ValueError(f"quantities are {', '.join(QUANTITIES)}, not {', '.join(unknown) or 'none'}")


_TILE = 512
_STRIP = 2**18  # pixels whose places are in memory at a time beside a tile's own


def _spans(length: int, size: int) -> list[tuple[int, int]]:
    return [(first, min(size, length - first)) for first in range(0, length, size)]


def _eager(job: _Job) -> dict[str, np.ndarray]:
    shape = job.grid.shape
    made = {name: np.empty(shape, _dtype(name)) for name in job.quantities}
    for row, rows in _spans(shape[0], _TILE):
        for column, columns in _spans(shape[1], _TILE):
            for name, values in job.tile(row, column, rows, columns).items():
                made[name][row : row + rows, column : column + columns] = values
    return made


def _dtype(name: str) -> np.dtype:
    return np.dtype({"mask": "u1", "image": "f4"}.get(name, "f8"))


def _lazy(job: _Job, size: int) -> dict[str, Any]:
    """A graph in which each tile is made once, whatever is asked of it."""
    import operator

    import dask.array as da
    from dask.base import tokenize
    from dask.highlevelgraph import HighLevelGraph

    rows, columns = (_spans(length, size) for length in job.grid.shape)
    token = tokenize(job, size)
    places = [(i, j) for i in range(len(rows)) for j in range(len(columns))]
    tiles = {
        (f"tile-{token}", i, j): (job.tile, rows[i][0], columns[j][0], rows[i][1], columns[j][1])
        for i, j in places
    }
    chunks = tuple(tuple(count for _, count in spans) for spans in (rows, columns))
    made = {}
    for name in job.quantities:
        key = f"{name}-{token}"
        layer = {(key, i, j): (operator.getitem, (f"tile-{token}", i, j), name) for i, j in places}
        layers: dict[str, Any] = {f"tile-{token}": tiles, key: layer}
        graph = HighLevelGraph(layers, {f"tile-{token}": set(), key: {f"tile-{token}"}})
        made[name] = da.Array(graph, key, chunks, dtype=_dtype(name))
    return made


def _dataset(job: _Job, made: dict[str, Any]) -> Any:
    from xarray import Dataset, Variable

    variables = {
        name: Variable(("y", "x"), values, {"units": QUANTITIES[name][0], "long_name": QUANTITIES[name][1]})
        for name, values in made.items()
    }
    x, y = job.grid.axes()
    return Dataset(variables, {"x": x, "y": y}, {"crs": job.grid.crs, "transform": job.grid.transform})
