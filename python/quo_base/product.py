# SPDX-License-Identifier: Apache-2.0
"""Products: header objects and fields under their own names, the orbit, the raster, the pixel grid."""

from __future__ import annotations

import os
from collections.abc import Iterator, Mapping, MutableMapping
from typing import Any, NamedTuple, Optional, Union

import numpy as np

from . import _core
from ._arrays import broadcast, plain
from ._paths import absolute, file_name
from .orbit import Orbit
from .raster import Raster
from .times import to_seconds

__all__ = ["Field", "Grid", "PixelTimes", "Pixels", "Product", "Section"]

Path = Union[str, os.PathLike]


class Field(NamedTuple):
    """What the library tells of a field."""

    unit: str
    """Unit of the values; empty where they have none."""
    meaning: str
    """What they are, or empty."""
    lowest: float
    """Lowest sensible value; not bounded where both bounds are 0."""
    highest: float
    """Highest sensible value."""


def _same(one: Any, other: Any) -> bool:
    if isinstance(one, float) or getattr(one, "dtype", np.dtype("O")).kind == "f":
        return np.array_equal(one, other, equal_nan=True)
    return bool(np.array_equal(one, other))


def _shown(value: Any, room: int = 70) -> str:
    text = np.array2string(value, threshold=6) if isinstance(value, np.ndarray) else repr(value)
    text = " ".join(text.split())
    return text if len(text) <= room else text[: room - 3] + "..."


class Section(MutableMapping):
    """One header object: its fields by name, as items (`section["prf_hz"]`) and attributes (`section.prf_hz`).

    Single numbers and texts are plain values. Arrays are copies and cannot be changed in place: assign them whole.
    Integers that tell an array's length make it anew, filled with zeros, when they change; update() sets lengths
    and arrays in one step. What is refused changes nothing.
    """

    __slots__ = ("_header", "_name")

    def __init__(self, header: Any, name: str) -> None:
        object.__setattr__(self, "_header", header)
        object.__setattr__(self, "_name", name)

    @property
    def _record(self) -> _core.Record:
        record = self._header.record(self._name)
        if record is None:
            raise KeyError(f"the product has no section {self._name}")
        return record

    def __getitem__(self, name: str) -> Any:
        return self._record.get(name)

    def __setitem__(self, name: str, value: Any) -> None:
        self.update({name: value})

    def __delitem__(self, name: str) -> None:
        raise TypeError("fields of a header object stay")

    def __iter__(self) -> Iterator[str]:
        return iter(self._record.names())

    def __len__(self) -> int:
        return len(self._record.names())

    def __getattr__(self, name: str) -> Any:
        if name.startswith("__"):
            raise AttributeError(name)
        below = f"{self._name}/{name}"
        if self._header.record(below) is not None:
            return Section(self._header, below)
        try:
            return self[name]
        except KeyError as missing:
            raise AttributeError(str(missing)) from None

    def __setattr__(self, name: str, value: Any) -> None:
        try:
            self[name] = value
        except KeyError as missing:
            raise AttributeError(str(missing)) from None

    def __dir__(self) -> list[str]:
        return [*super().__dir__(), *self]

    def update(self, *values: Any, **fields: Any) -> None:
        """Sets several fields in one step, all or none; lengths of arrays together with the arrays."""
        named = dict(*values, **fields)
        if not all(isinstance(name, str) for name in named):
            raise TypeError("fields are named by texts")
        self._record.update(named)

    def describe(self, name: str) -> Field:
        """Unit, meaning and bounds of a field."""
        return Field(*self._record.describe(name))

    def __eq__(self, other: object) -> bool:
        if not isinstance(other, Mapping):
            return NotImplemented
        return list(self) == list(other) and all(_same(self[name], other[name]) for name in self)

    def __reduce__(self) -> tuple:
        root = self._name.split("/")[0]
        names = [name for name in self._header.sections() if name.split("/")[0] == root]
        return _restored_section, (self._name, {name: dict(Section(self._header, name)) for name in names})

    def __repr__(self) -> str:
        if self._header.record(self._name) is None:
            return f"<Section {self._name}, which is there no more>"
        width = max((len(name) for name in self), default=0)
        rows = [
            f"  {name:{width}}  {_shown(value)} {self.describe(name).unit}".rstrip()
            for name, value in self.items()
        ]
        return "\n".join([f"<Section {self._name}>", *rows])

    def _repr_html_(self) -> str:
        return _html({self._name: self})


def _restored_section(name: str, content: dict[str, dict[str, Any]]) -> Section:
    return Section(_header_of(content), name)


def _header_of(content: dict[str, dict[str, Any]]) -> _core.Header:
    product = Product()
    for section, fields in content.items():
        product.add(section, **fields)
    return product._header


class _Closed:
    """Stands for the header of a closed product."""

    def __getattr__(self, name: str) -> Any:
        raise ValueError("the product is closed")


def _html(sections: Mapping[str, Section]) -> str:
    from html import escape

    rows = []
    for name, section in sections.items():
        rows.append(f'<tr><th colspan="4" style="text-align:left">{escape(name)}</th></tr>')
        for field, value in section.items():
            told = section.describe(field)
            cells = (field, _shown(value), told.unit, told.meaning)
            rows.append("<tr>" + "".join(f"<td>{escape(cell)}</td>" for cell in cells) + "</tr>")
    return "<table>" + "".join(rows) + "</table>"


class PixelTimes(NamedTuple):
    """Where pixels stand in time; not-a-number for a pixel without."""

    azimuth_time: Any
    """Zero-Doppler azimuth times, seconds since 1985."""
    range_time: Any
    """Two-way range times, s."""
    status: Any
    """0; 1 for a pixel without times."""


class Pixels(NamedTuple):
    """Pixels of times; not-a-number where there is none."""

    line: Any
    """Lines, from 0; of a point that two bursts see, the earlier burst's."""
    second_line: Any
    """The line in the later burst, where two bursts see the point."""
    sample: Any
    """Samples, from 0."""
    status: Any
    """0; 1 for times without a pixel."""


class Grid:
    """Where the pixels of an image stand in azimuth and range time. Arguments are broadcast as in Orbit."""

    __slots__ = ("_grid",)

    def __init__(self, grid: _core.Grid) -> None:
        self._grid = grid

    @property
    def bursts(self) -> int:
        """Number of bursts; 0 for an image without."""
        return self._grid.bursts

    @property
    def ground_range(self) -> bool:
        """Whether samples are equally spaced on the ground."""
        return self._grid.ground_range

    @property
    def lines_at_one_time(self) -> bool:
        """Whether all samples of a line have one azimuth time."""
        return self._grid.lines_at_one_time

    def times(self, line: Any, sample: Any) -> PixelTimes:
        """Times of pixels; whole numbers are the centres of pixels."""
        return PixelTimes(*plain(self._grid.times(*broadcast(line, sample))))

    def pixels(self, azimuth_time: Any, range_time: Any) -> Pixels:
        """Pixels of times; they may lie outside the raster."""
        return Pixels(*plain(self._grid.pixels(*broadcast(to_seconds(azimuth_time), range_time))))


class Product(Mapping):
    """A product: its header objects by section, its orbit, its raster.

    `product["SamplingConstants/prf_hz"]`, `product["SamplingConstants"]["prf_hz"]` and
    `product.SamplingConstants.prf_hz` are one value. Iterating gives the sections, those below others too
    ("PolySAR/DopplerCentroid-0"); walk() gives every field. The header is read when the product is opened; the
    raster only when it is sliced. Products are copied by clone() and pickled by content.
    """

    __slots__ = ("_header", "_path", "_raster")

    def __init__(self, path: Optional[Path] = None, raster: Optional[Path] = None) -> None:
        """Opens the product of a header file, XML or one of the older parameter files; else an empty product.

        raster: the raster's file, where it is another than the header's less its last four characters.
        """
        self._set("_path", None if path is None else file_name(path))
        self._set("_raster", None if raster is None else file_name(raster))
        self._set("_header", _core.Header() if path is None else _core.Header.read(self._path))

    def _set(self, name: str, value: Any) -> None:
        object.__setattr__(self, name, value)

    # --- Fields --------------------------------------------------------------------------------------------------

    def __getitem__(self, path: str) -> Any:
        if self._header.record(path) is not None:
            return Section(self._header, path)
        section, slash, field = path.rpartition("/")
        if slash and self._header.record(section) is not None:
            return Section(self._header, section)[field]
        raise KeyError(f"the product has no {path}")

    def __setitem__(self, path: str, value: Any) -> None:
        if isinstance(value, Mapping):
            self.add(path, **value)
            return
        section, _, field = path.rpartition("/")
        self[section][field] = value

    def __delitem__(self, section: str) -> None:
        if self._header.record(section) is None:
            raise KeyError(section)
        self._header.enable(section, False)

    def __iter__(self) -> Iterator[str]:
        return iter(self._header.sections())

    def __len__(self) -> int:
        return len(self._header.sections())

    def __getattr__(self, name: str) -> Any:
        if not name.startswith("_") and self._header.record(name) is not None:
            return Section(self._header, name)
        raise AttributeError(f"the product has no {name}")

    def __setattr__(self, name: str, value: Any) -> None:
        if name != "orbit":
            raise AttributeError(f"{name} cannot be set; sections are added by add()")
        object.__setattr__(self, name, value)

    def __dir__(self) -> list[str]:
        return [*super().__dir__(), *(name for name in self if "/" not in name)]

    def add(self, section: str, **fields: Any) -> Section:
        """Adds a section with its default values, where the product has none, and sets some of its fields."""
        added = self._header.record(section) is None
        if added:
            self._header.enable(section, True)
        held = Section(self._header, section)
        try:
            held.update(fields)
        except BaseException:
            if added:
                self._header.enable(section, False)
            raise
        return held

    @staticmethod
    def sections() -> list[str]:
        """The sections that a product can have."""
        return _core.Header.known_sections()

    def walk(self) -> Iterator[tuple[str, Any]]:
        """Every field: "Section/field" and its value."""
        for name, section in self.items():
            for field, value in section.items():
                yield f"{name}/{field}", value

    def __repr__(self) -> str:
        if isinstance(self._header, _Closed):
            return f"<Product {self._path or 'in memory'}, closed>"
        rows = [f"  {name}: {len(section)} fields" for name, section in self.items()]
        return "\n".join([f"<Product {self._path or 'in memory'}>", *rows])

    def _repr_html_(self) -> str:
        return _html(self)

    # --- Files and copies ----------------------------------------------------------------------------------------

    @property
    def path(self) -> Optional[str]:
        """Name of the header file; None for a product in memory."""
        return self._path

    def save(self, path: Optional[Path] = None, exact: bool = False) -> None:
        """Writes the header: into its own file, or another, whose other sections stay.

        exact: numbers with all their digits; else with the 15 that headers usually have. The old file stays whole
        where this fails.
        """
        target = self._path if path is None else file_name(path)
        if target is None:
            raise TypeError("a product in memory needs a file name")
        self._header.write(target, exact)
        if self._path is None:
            self._set("_path", target)

    def close(self) -> None:
        """Gives the header up: all further use of the product is refused. Sections, orbits, grids and rasters that
        it gave stay."""
        self._set("_header", _Closed())

    def __enter__(self) -> Product:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()

    def clone(self) -> Product:
        """A copy that can be changed apart from this one."""
        copy = Product.__new__(Product)
        for name, value in (("_header", self._header.clone()), ("_path", self._path), ("_raster", self._raster)):
            copy._set(name, value)
        return copy

    def __reduce__(self) -> tuple:
        content = {name: dict(section) for name, section in self.items()}
        path, raster = (name and absolute(name) for name in (self._path, self._raster))
        return _restored, (path, raster, content, self._header.grid_broken)

    # --- Geometry and samples ------------------------------------------------------------------------------------

    @property
    def orbit(self) -> Orbit:
        """The orbit through the product's state vectors, with its wavelength and look side, as they are now."""
        return Orbit._of(self._header.orbit())

    @orbit.setter
    def orbit(self, value: Orbit) -> None:
        if not isinstance(value, Orbit):
            raise TypeError("an Orbit is needed")
        self._header.set_orbit(value._orbit)

    @property
    def grid(self) -> Grid:
        """Where pixels stand in time: the section "ImageGrid", else the region "ROI" where that has the raster's
        size, as they are now."""
        return Grid(self._header.grid())

    @property
    def raster(self) -> Raster:
        """The product's raster, which is read slice by slice."""
        if self._path is None:
            raise ValueError("a product in memory has no raster")
        self._header.sections()  # refused once the product is closed
        return Raster(self._raster, header=self._path)

    def evaluate(self, quantity: str, range_time: Any, azimuth_time: Any, interpolate: bool = False) -> Any:
        """A quantity of the product's polynomials at range times (two-way, s) and azimuth times.

        quantity: "DC" Doppler centroid, Hz; "FR" FM rate, Hz/s; "SL2GR" and "GR2SL" slant range to ground range
        and back; "SL2THETA" incidence and "SL2PHI" look angle, degrees. interpolate: between the polynomials
        around the azimuth time; else the one at or after it.
        """
        arrays = broadcast(range_time, to_seconds(azimuth_time))
        return self._header.evaluate(str(quantity), bool(interpolate), *arrays)[()]


def _restored(
    path: Optional[str], raster: Optional[str], content: dict[str, dict[str, Any]], grid_broken: bool
) -> Product:
    product = Product()
    for name, value in (("_header", _header_of(content)), ("_path", path), ("_raster", raster)):
        product._set(name, value)
    product._header.grid_broken = grid_broken
    return product
