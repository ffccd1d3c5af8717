# SPDX-License-Identifier: Apache-2.0
"""Maps under geocode(): their grids, the terrain, and what the radar sees of it."""

from __future__ import annotations

import os
from functools import lru_cache
from typing import Any, Callable, NamedTuple, Optional

import numpy as np

from . import _core
from ._arrays import broadcast
from ._paths import absolute

RESAMPLINGS = ("nearest", "bilinear", "sinc")
_HEIGHTS = {"ellipsoid": None, "egm96": "EPSG:4326+5773", "egm2008": "EPSG:4326+3855"}
_SINC = 8  # samples each way
_METRES = ("m", "metre", "metres", "meter", "meters")
_REACH_DEG = 0.25  # 27 km, over which the highest mountain of the Earth hides or overlays what lies at the sea
_GEOID_M = 50.0  # by which a geoid changes over that way, and more
_MOST_PIXELS = 2**20  # of a model or map at a time
_FINEST, _COARSEST = 1 / 50, 10  # of the image's finest pixel, and of what it may reach


def _horizontal(crs: Any) -> str:
    """A reference system without its heights, as text."""
    from pyproj import CRS

    whole = CRS.from_user_input(crs)
    flat = whole.sub_crs_list[0] if whole.is_compound else whole
    if not (flat.is_geographic or flat.is_projected):
        raise ValueError(f"{whole.name} is neither geographic nor projected: no map")
    return flat.to_wkt()


@lru_cache(16)
def _in_degrees(crs: str) -> bool:
    from pyproj import CRS

    return CRS.from_wkt(crs).is_geographic


def _around(longitude: Any, middle: Any) -> Any:
    """Longitudes, degrees, within half a turn of a middle, so that what lies beyond 180 stays beside it."""
    return longitude + 360.0 * np.round((middle - longitude) / 360.0)


@lru_cache(16)  # making one takes longer than what a small tile asks of it; pyproj keeps them apart for threads
def _transformer(source: str, target: str) -> Any:
    from pyproj import Transformer

    return Transformer.from_crs(source, target, always_xy=True)


@lru_cache(2)
def _to_ellipsoid(geoid: str) -> Any:
    """From the geoid's heights to the ellipsoid's; refused where the geoid's grid is not installed."""
    from pyproj.transformer import TransformerGroup

    group = TransformerGroup(geoid, "EPSG:4979", always_xy=True)
    if not group.transformers or not group.best_available:
        missing = ", ".join(grid.short_name for op in group.unavailable_operations for grid in op.grids)
        raise ValueError(f"heights above {geoid} need a geoid grid that is not installed: {missing}")
    return group.transformers[0]


class Terrain(NamedTuple):
    """An elevation model by its file, and what its heights stand on."""

    path: str
    crs: str
    transform: tuple[float, ...]
    shape: tuple[int, int]
    scale: tuple[float, float]
    geoid: Optional[str]

    @classmethod
    def of(cls, path: Any, heights: Optional[str]) -> Terrain:
        import rasterio

        if heights is not None and heights not in _HEIGHTS:
            raise ValueError(f"heights stand on one of {', '.join(_HEIGHTS)}, not {heights!r}")
        with rasterio.open(os.fspath(path)) as file:
            if file.crs is None:
                raise ValueError(f"{path}: has no coordinate reference system")
            geoid = _geoid_of(path, file.crs, heights)
            if file.transform.b or file.transform.d:
                raise ValueError(f"{path}: its rows do not run along the axes; warp it first")
            if (file.units[0] or "m").lower() not in _METRES:
                raise ValueError(f"{path}: its heights are in {file.units[0]}, not in metres")
            crs, transform = _horizontal(file.crs.to_wkt()), tuple(file.transform)[:6]
            scale = (file.scales[0], file.offsets[0])
            made = cls(absolute(os.fspath(path)), crs, transform, file.shape, scale, geoid)
        if geoid is not None:
            _to_ellipsoid(geoid)
        return made

    def heights(self, longitude: np.ndarray, latitude: np.ndarray) -> np.ndarray:
        """Heights above the ellipsoid at places, bilinear; not-a-number beyond the model and beside its gaps."""
        import rasterio

        row, column = self._pixels(longitude, latitude)
        window = _window(row, column, self.shape, 1)
        if window is None:
            return np.full(np.shape(longitude), np.nan)
        with rasterio.open(self.path) as file:
            block = self._read(file, *window)
        made = _bilinear(block, row - window[0], column - window[2])
        if self.geoid is None:
            return made
        return _to_ellipsoid(self.geoid).transform(longitude, latitude, made)[2]

    def relief(self, longitude: np.ndarray, latitude: np.ndarray) -> float:
        """Difference between the highest and the lowest ground within _REACH_DEG of places, m."""
        import rasterio

        east = _REACH_DEG / np.cos(np.radians(np.minimum(np.abs(latitude), 89.0)))
        around = [self._pixels(longitude + i * east, latitude + j * _REACH_DEG) for i in (-1, 1) for j in (-1, 1)]
        ends = [[np.floor(np.nanmin(each)), np.ceil(np.nanmax(each)) + 1] for each in map(np.array, zip(*around))]
        (first, last), (left, right) = (np.clip(end, 0, size).astype(int) for end, size in zip(ends, self.shape))
        strip = max(1, _MOST_PIXELS // max(1, right - left))
        low, high = np.inf, -np.inf
        with rasterio.open(self.path) as file:
            for row in range(first, last, strip):
                block = self._read(file, row, min(strip, last - row), left, right - left)
                known = block[np.isfinite(block)]
                low, high = min(low, known.min(initial=np.inf)), max(high, known.max(initial=-np.inf))
        return max(high - low, 0.0) + (0.0 if self.geoid is None else _GEOID_M)

    def _pixels(self, longitude: np.ndarray, latitude: np.ndarray) -> tuple[np.ndarray, np.ndarray]:
        """Rows and columns of places; centres of pixels have whole numbers."""
        x, y = _transformer("EPSG:4326", self.crs).transform(longitude, latitude)
        a, _, c, _, e, f = self.transform
        if _in_degrees(self.crs):
            x = _around(x, self.middle()[0])
        return (y - f) / e - 0.5, (x - c) / a - 0.5

    def _read(self, file: Any, row: int, rows: int, column: int, columns: int) -> np.ndarray:
        """Heights as the file means them; not-a-number where it has none."""
        from rasterio.windows import Window

        block = file.read(1, window=Window(column, row, columns, rows), masked=True)
        return block.astype(np.float64).filled(np.nan) * self.scale[0] + self.scale[1]

    def goes_round(self) -> bool:
        """Whether the model has all longitudes."""
        return _in_degrees(self.crs) and abs(self.shape[1] * self.transform[0]) > 359.9

    def middle(self) -> tuple[float, float]:
        """The middle of the model in its own coordinates."""
        a, _, c, _, e, f = self.transform
        return c + a * self.shape[1] / 2, f + e * self.shape[0] / 2


def _geoid_of(path: Any, crs: Any, heights: Optional[str]) -> Optional[str]:
    """What the heights stand on: what the file names, or what is told; the two must agree."""
    from pyproj import CRS

    whole = CRS.from_wkt(crs.to_wkt())
    if not whole.is_compound and len(whole.axis_info) == 3:
        if heights not in (None, "ellipsoid") or whole.axis_info[2].unit_name != "metre":
            unit = whole.axis_info[2].unit_name
            raise ValueError(f"{path}: its heights are above the ellipsoid of {whole.name}, in {unit}")
        return None
    vertical = [part.to_authority() for part in whole.sub_crs_list if part.is_vertical]
    named = "+".join(["EPSG:4326", vertical[0][1]]) if vertical and vertical[0] else None
    if heights is None and not vertical:
        known = " or ".join(map(repr, _HEIGHTS))
        raise ValueError(f"{path} does not name what its heights stand on: heights={known}")
    if heights is None and named is None:
        raise ValueError(f"{path}: its heights stand on {whole.sub_crs_list[-1].name}, which is not known here")
    if heights is not None and vertical and named != _HEIGHTS[heights]:
        raise ValueError(f"{path}: its heights stand on {whole.sub_crs_list[-1].name}, not on {heights!r}")
    return named if heights is None else _HEIGHTS[heights]


class MapGrid(NamedTuple):
    """A map: its reference system, where its pixels stand, and how many there are."""

    crs: str
    transform: tuple[float, ...]
    shape: tuple[int, int]
    pixel_m: float

    @classmethod
    def over(cls, product: Any, terrain: Terrain, crs: Any, spacing: Optional[float]) -> MapGrid:
        """The part of the model's grid, or of a wanted one, that the image may reach."""
        if spacing is not None and not (spacing > 0 and np.isfinite(spacing)):
            raise ValueError(f"a spacing of {spacing} makes no map")
        wanted = terrain.crs if crs is None else _horizontal(crs)
        outline = _outline(product, terrain)
        x, y = _transformer("EPSG:4326", wanted).transform(*outline)
        if _in_degrees(wanted):
            x = _around(x, float(np.mean(outline[0])))
        if crs is None and spacing is None:
            transform = terrain.transform
            if _in_degrees(wanted):
                x = x + 360.0 * np.round((terrain.middle()[0] - np.mean(x)) / 360.0)
        else:
            step = _spacing_of(terrain, wanted) if spacing is None else float(spacing)
            if step > _COARSEST * max(np.ptp(x), np.ptp(y)):
                raise ValueError(f"a spacing of {step:g} is far coarser than the image is wide")
            left, top = step * np.floor(np.min(x) / step), step * np.ceil(np.max(y) / step)
            transform = (step, 0.0, left, 0.0, -step, top)
            finest, pixel_m = _FINEST * _finest_m(product), _pixel_m(wanted, transform, (0, 0))
            if not pixel_m > finest:
                raise ValueError(f"a spacing of {step:g}, {pixel_m:.2g} m, is far finer than the image's pixels")
        return cls._covering(wanted, transform, x, y, terrain if crs is None and spacing is None else None)

    @classmethod
    def _covering(
        cls, crs: str, transform: Any, x: np.ndarray, y: np.ndarray, limit: Optional[Terrain]
    ) -> MapGrid:
        a, _, c, _, e, f = transform
        columns, rows = (np.sort([np.min(v), np.max(v)]) for v in ((x - c) / a, (y - f) / e))
        first = np.floor([rows[0], columns[0]]).astype(int)
        last = np.ceil([rows[1], columns[1]]).astype(int)
        if limit is not None:
            axes = slice(0, 1 if limit.goes_round() else 2)  # round the Earth columns go on beyond the seam
            first[axes], last[axes] = np.maximum(first, 0)[axes], np.minimum(last, limit.shape)[axes]
        if (last <= first).any():
            raise ValueError("the elevation model and the image have no place in common")
        moved = (a, 0.0, c + a * first[1], 0.0, e, f + e * first[0])
        size = last - first
        return cls(crs, moved, (int(size[0]), int(size[1])), _pixel_m(crs, moved, size))

    def axes(self) -> tuple[np.ndarray, np.ndarray]:
        """Coordinates of the pixels' centres: x of the columns, y of the rows."""
        a, _, c, _, e, f = self.transform
        return c + a * (np.arange(self.shape[1]) + 0.5), f + e * (np.arange(self.shape[0]) + 0.5)

    def outline(self) -> tuple[np.ndarray, np.ndarray]:
        """Longitudes and latitudes of places all over the map, degrees."""
        a, _, c, _, e, f = self.transform
        x, y = np.meshgrid(c + a * np.linspace(0, self.shape[1], 33), f + e * np.linspace(0, self.shape[0], 33))
        return _transformer(self.crs, "EPSG:4326").transform(x, y)

    def places(self, row: int, column: int, rows: int, columns: int) -> tuple[np.ndarray, np.ndarray]:
        """Longitudes and latitudes of pixels, degrees; the place may lie beside the map."""
        a, _, c, _, e, f = self.transform
        x, y = np.meshgrid(c + a * (column + np.arange(columns) + 0.5), f + e * (row + np.arange(rows) + 0.5))
        return _transformer(self.crs, "EPSG:4326").transform(x, y)


def _outline(product: Any, terrain: Terrain) -> tuple[np.ndarray, np.ndarray]:
    """Places all around the part of the model that the image may show, and within: longitudes and latitudes.

    The image's edges are looked for at the lowest and the highest ground of the Earth, so that no terrain is cut.
    """
    lines, samples = product.raster.shape
    line, sample = np.meshgrid(np.linspace(-1, lines, 33), np.linspace(-1, samples, 33), indexing="ij")
    times = product.grid.times(line, sample)
    places = [product.orbit.to_ground(times.azimuth_time, times.range_time, None, h) for h in (-500.0, 9000.0)]
    longitude = np.concatenate([np.ravel(each.longitude) for each in places])
    latitude = np.concatenate([np.ravel(each.latitude) for each in places])
    known = np.isfinite(longitude)
    if not known.any():
        raise ValueError("the image has no place on the ground")
    first = longitude[known][0]  # an image is narrower than half a turn
    longitude = _around(longitude, first)
    a, _, c, _, e, f = terrain.transform
    u, v = np.meshgrid(np.linspace(0, terrain.shape[1], 33), np.linspace(0, terrain.shape[0], 33))
    east, north = _transformer(terrain.crs, "EPSG:4326").transform(c + a * u, f + e * v)
    if terrain.goes_round():
        east = longitude[known]
    elif _in_degrees(terrain.crs):  # whose columns go on in one direction
        east = _around(east, c + a * u)
        east = east + 360.0 * np.round((first - np.mean(east)) / 360.0)
    else:
        east = _around(east, first)
    west, south = max(longitude[known].min(), east.min()), max(latitude[known].min(), north.min())
    to_east, to_north = min(longitude[known].max(), east.max()), min(latitude[known].max(), north.max())
    if to_east <= west or to_north <= south:
        raise ValueError("the elevation model and the image have no place in common")
    outline = np.meshgrid(np.linspace(west, to_east, 17), np.linspace(south, to_north, 17))
    return outline[0], outline[1]


def _spacing_of(terrain: Terrain, crs: str) -> float:
    """The model's spacing in units of another reference system, at its middle."""
    (x, y), there = terrain.middle(), _transformer(terrain.crs, crs)
    one, other = there.transform(x, y), there.transform(x, y + terrain.transform[4])
    return float(np.hypot(other[0] - one[0], other[1] - one[1]))


def _pixel_m(crs: str, transform: Any, shape: Any) -> float:
    """Length of the shorter side of a pixel in the middle of a map, m."""
    a, _, c, _, e, f = transform
    x, y = c + a * shape[1] / 2, f + e * shape[0] / 2
    places = np.array([x, x + a, x]), np.array([y, y, y + e])
    longitude, latitude = _transformer(crs, "EPSG:4326").transform(*places)
    corner, east, north = earth_fixed(latitude, longitude, np.zeros(3))
    return float(min(np.linalg.norm(east - corner), np.linalg.norm(north - corner)))


def _finest_m(product: Any) -> float:
    """Length of the shorter side of an image's pixel on the ellipsoid, in its middle, m."""
    line, sample = (size / 2 for size in product.raster.shape)
    times = product.grid.times([line, line + 1, line], [sample, sample, sample + 1])
    seen = product.orbit.geometry(times.azimuth_time, times.range_time)
    corner, below, beside = np.stack([seen.x, seen.y, seen.z], axis=-1)
    return float(min(np.linalg.norm(below - corner), np.linalg.norm(beside - corner)))


# --- Samples at places between them ------------------------------------------------------------------------------


def _window(row: Any, column: Any, shape: tuple[int, int], margin: int) -> Optional[tuple[int, int, int, int]]:
    """First row, rows, first column, columns of what places within a raster need; None where none is within."""
    within = (row > -1.0) & (row < shape[0]) & (column > -1.0) & (column < shape[1])
    if not np.any(within):
        return None
    first = [max(int(np.floor(v[within].min())) - margin, 0) for v in (row, column)]
    last = [min(int(np.floor(v[within].max())) + margin + 2, n) for v, n in zip((row, column), shape)]
    return first[0], last[0] - first[0], first[1], last[1] - first[1]


def _taken(block: np.ndarray, row: np.ndarray, column: np.ndarray) -> tuple[np.ndarray, np.ndarray]:
    """Values at whole places, with those at the border going on beyond it, and which of them are within."""
    within = (row >= 0) & (row < block.shape[0]) & (column >= 0) & (column < block.shape[1])
    values = block[np.clip(row, 0, block.shape[0] - 1), np.clip(column, 0, block.shape[1] - 1)]
    return values, within


def _nearest(block: np.ndarray, row: np.ndarray, column: np.ndarray) -> np.ndarray:
    known = np.isfinite(row) & np.isfinite(column)
    places = [np.floor(np.where(known, v, -1.0) + 0.5).astype(np.int64) for v in (row, column)]
    values, within = _taken(block, *places)
    return np.where(known & within, values, np.nan)


def _weighted(block: np.ndarray, row: np.ndarray, column: np.ndarray, taps: int, weight: Any) -> np.ndarray:
    """Sum over taps x taps neighbours by the product of their weights, which are made to have the sum 1. Places
    within half a pixel of the border take its values as going on; beyond there are none."""
    edge = [np.isfinite(v) & (v >= -0.5) & (v <= n - 0.5) for v, n in zip((row, column), block.shape)]
    known = edge[0] & edge[1]
    row, column = np.where(known, row, 0.0), np.where(known, column, 0.0)
    whole = [np.floor(v).astype(np.int64) for v in (row, column)]
    offsets = range(1 - taps // 2, taps // 2 + 1)
    weights = [[weight((v - w) - k) for k in offsets] for v, w in zip((row, column), whole)]
    total, norm = np.zeros(row.shape), sum(weights[0]) * sum(weights[1])
    for k, along in zip(offsets, weights[0]):
        part = np.zeros(row.shape)
        for l, across in zip(offsets, weights[1]):
            part += across * _taken(block, whole[0] + k, whole[1] + l)[0]
        total += along * part
    return np.where(known, total / norm, np.nan)


def _bilinear(block: np.ndarray, row: np.ndarray, column: np.ndarray) -> np.ndarray:
    return _weighted(block, row, column, 2, lambda x: 1.0 - np.abs(x))


def _sinc(block: np.ndarray, row: np.ndarray, column: np.ndarray) -> np.ndarray:
    """Under a raised cosine that ends after _SINC samples."""
    return _weighted(block, row, column, 2 * _SINC, lambda x: np.sinc(x) * (0.5 + 0.5 * np.cos(np.pi * x / _SINC)))


def resample(raster: Any, line: np.ndarray, sample: np.ndarray, how: str) -> np.ndarray:
    """The raster at places between its samples, float32; amplitudes of complex samples."""
    window = _window(line, sample, raster.shape, _SINC)
    if window is None:
        return np.full(line.shape, np.nan, np.float32)
    first_line, lines, first_sample, samples = window
    block = raster[first_line : first_line + lines, first_sample : first_sample + samples]
    block = np.abs(block) if np.iscomplexobj(block) else block.astype(np.float64)
    made = {"nearest": _nearest, "bilinear": _bilinear, "sinc": _sinc}[how](
        block, line - first_line, sample - first_sample
    )
    return made.astype(np.float32)


# --- Terrain -----------------------------------------------------------------------------------------------------


def earth_fixed(latitude: np.ndarray, longitude: np.ndarray, height: np.ndarray) -> np.ndarray:
    """Earth-fixed places, shape of the latitudes and 3, m."""
    return _core.earth_fixed(*broadcast(latitude, longitude, height))


def terrain_normals(ground: np.ndarray) -> np.ndarray:
    """Outward unit normals of a surface through a grid of places, by differences of neighbours."""
    down, right = np.gradient(ground, axis=0), np.gradient(ground, axis=1)
    normal = np.cross(right, down)
    normal *= np.sign(np.sum(normal * ground, axis=-1, keepdims=True))
    return normal / np.linalg.norm(normal, axis=-1, keepdims=True)


def horizontal(sight: np.ndarray, latitude: np.ndarray, longitude: np.ndarray) -> tuple[np.ndarray, np.ndarray]:
    """East and north part of directions, as a unit vector in the horizontal plane."""
    phi, lam = np.radians(latitude), np.radians(longitude)
    east = -np.sin(lam) * sight[..., 0] + np.cos(lam) * sight[..., 1]
    inward = np.cos(lam) * sight[..., 0] + np.sin(lam) * sight[..., 1]
    north = -np.sin(phi) * inward + np.cos(phi) * sight[..., 2]
    length = np.hypot(east, north)
    return east / length, north / length


def map_steps(east: Any, north: Any, latitude: np.ndarray, longitude: np.ndarray, grid: MapGrid) -> Any:
    """Rows and columns of the map that one pixel's length on the ground towards the platform leads over."""
    per_degree_m = 111195.0  # to the half percent that the Earth is no sphere
    ahead_latitude = latitude + grid.pixel_m * north / per_degree_m
    ahead_longitude = longitude + grid.pixel_m * east / (per_degree_m * np.cos(np.radians(latitude)))
    there = _transformer("EPSG:4326", grid.crs)
    x0, y0 = there.transform(longitude, latitude)
    x1, y1 = there.transform(ahead_longitude, ahead_latitude)
    ahead = _around(x1 - x0, 0.0) if _in_degrees(grid.crs) else x1 - x0
    return (y1 - y0) / grid.transform[4], ahead / grid.transform[0]


LAYOVER, SHADOW, UNKNOWN = 1, 2, 4


def layover_and_shadow(
    heights: Callable[[int, int], np.ndarray],
    here: np.ndarray,
    tangent: np.ndarray,
    steps: Any,
    pixel_m: float,
    relief: float,
) -> np.ndarray:
    """LAYOVER where another place along the line of sight's plane has the same range, SHADOW where one hides this
    one, UNKNOWN where height or sight are.

    heights(rows, columns): terrain with so many more rows and columns on each side; here: its middle; tangent: of
    the angle of incidence; steps: as of map_steps(); relief: of all terrain. The rays are taken as parallel over
    the few kilometres in question, and the ground as flat between places. What is asked of a place hangs on its
    own surroundings alone, whatever part of the map is made.
    """
    known = np.isfinite(here) & np.isfinite(tangent) & np.isfinite(steps[0]) & np.isfinite(steps[1])
    mask = np.where(known, 0, UNKNOWN).astype(np.uint8)
    if not known.any():
        return mask
    farthest = relief * max(tangent[known].max(), 1.0 / tangent[known].min())
    reach = max(1, int(np.ceil(farthest / pixel_m)))
    margin = [int(np.ceil(reach * np.abs(step[known]).max())) + 1 for step in steps]
    around = heights(*margin)
    low, high = np.nanmin(around), np.nanmax(around)
    row, column = np.nonzero(known)
    flat, height, slope = np.flatnonzero(known), here[known], tangent[known]
    row_step, column_step = (step[known] for step in steps)
    made = mask.ravel()
    for k in range(1, reach + 1):
        distance = k * pixel_m
        # Those that the lowest and the highest ground could still touch from here on.
        rise, fall = np.maximum(high - height, 0.0), np.maximum(height - low, 0.0)
        left = np.maximum(rise * np.maximum(slope, 1.0 / slope), fall / slope) > distance
        if not left.all():
            row, column, flat, height, slope, row_step, column_step = (
                each[left] for each in (row, column, flat, height, slope, row_step, column_step)
            )
        if not flat.size:
            break
        nearer = _stepped(around, row + margin[0], column + margin[1], k * row_step, k * column_step) - height
        farther = _stepped(around, row + margin[0], column + margin[1], -k * row_step, -k * column_step) - height
        with np.errstate(invalid="ignore"):
            made[flat[nearer * slope > distance]] |= SHADOW
            made[flat[(-nearer > distance * slope) | (farther > distance * slope)]] |= LAYOVER
    return mask


def _stepped(block: np.ndarray, row: Any, column: Any, down: np.ndarray, right: np.ndarray) -> np.ndarray:
    """The block, bilinear, away from whole places within it; the same bits wherever the block begins."""
    below, beside = np.floor(down), np.floor(right)
    v, u = down - below, right - beside
    first = (row + below.astype(np.int64)) * block.shape[1] + column + beside.astype(np.int64)
    values = block.ravel()
    upper = values[first] * (1.0 - u) + values[first + 1] * u
    first += block.shape[1]
    return upper * (1.0 - v) + (values[first] * (1.0 - u) + values[first + 1] * u) * v
