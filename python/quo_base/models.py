# SPDX-License-Identifier: Apache-2.0
"""Header objects that stand by themselves: regions, polynomials, coregistration, records of processors."""

from __future__ import annotations

import os
from typing import Any, ClassVar, NamedTuple, Union

import numpy as np

from . import _core
from ._arrays import broadcast, plain
from ._paths import file_name
from .product import Section
from .times import to_seconds

__all__ = ["Configuration", "Coregistration", "Finding", "Polynomial", "Region", "Review", "review"]

Path = Union[str, os.PathLike]


class _Model(Section):
    """A section without a product; fields are set by name."""

    __slots__ = ()
    _SECTION: ClassVar[str] = ""
    _KIND: ClassVar[Any] = None

    def __init__(self, **fields: Any) -> None:
        super().__init__(self._KIND(), self._SECTION)
        self.update(fields)

    @classmethod
    def _of(cls, held: Any) -> Any:
        made = cls.__new__(cls)
        Section.__init__(made, held, cls._SECTION)
        return made

    def __reduce__(self) -> tuple:
        return _restored, (type(self), dict(self))


def _restored(kind: type, fields: dict[str, Any]) -> _Model:
    return kind(**fields)


def _known(times: Any) -> np.ndarray:
    """Times that have an index, which no index could tell apart from 0."""
    (made,) = broadcast(times)
    if np.isnan(made).any():
        raise ValueError("a time that is no number has no index")
    return made


class Region(_Model):
    """A rectangle of an image in time: FastStartTime (two-way range time, s), SlowStartTime (s since 1985), their
    Delta (s), TimeLength (s), and Samples and Lines. `Region(**product.ROI)` takes a product's."""

    __slots__ = ()
    _SECTION = "ROI"
    _KIND = _core.Region

    @classmethod
    def of_axes(cls, range_axis: tuple[float, float, int], azimuth_axis: tuple[Any, float, int]) -> Region:
        """The region of two axes: start, step and count of the range times, s, and of the azimuth times."""
        made = cls()
        made._header.set_axes(*range_axis, to_seconds(azimuth_axis[0]), *azimuth_axis[1:])
        return made

    @classmethod
    def read(cls, path: Path, section: str = "ROI") -> Region:
        """The region of a section of a header or parameter file."""
        return cls._of(_core.Region.read(file_name(path), section))

    def save(self, path: Path, section: str = "ROI") -> None:
        """Writes the region as a section of a header, replacing an older one."""
        self._header.write(file_name(path), section)

    def __and__(self, other: Region) -> Region:
        """What two regions share, on this one's grid; refused where that is nothing."""
        if not isinstance(other, Region):
            return NotImplemented
        shared = Region._of(self._header.intersect(other._header))
        if shared.Lines < 1 or shared.Samples < 1:
            raise ValueError("the regions have nothing in common")
        return shared

    def samples(self, range_time: Any) -> Any:
        """Indices of the samples nearest to range times."""
        return self._header.samples(_known(range_time))[()]

    def lines(self, azimuth_time: Any) -> Any:
        """Indices of the lines nearest to azimuth times."""
        return self._header.lines(_known(to_seconds(azimuth_time)))[()]


def _headers(*regions: Region) -> list[Any]:
    if not all(isinstance(each, Region) for each in regions):
        raise TypeError("a Region is needed")
    return [each._header for each in regions]


class Polynomial(_Model):
    """pol[0] + pol[1] x + pol[2] y + pol[3] x y + pol[4] x^2 + pol[5] x^3 + pol[6] x^4, where x is the range time
    after trg0_s and y the azimuth time after taz0_s."""

    __slots__ = ()
    _SECTION = "PolySAR"
    _KIND = _core.Polynomial

    @classmethod
    def read(cls, path: Path, name: str) -> Polynomial:
        """The polynomial of a name such as "DopplerCentroid-0" of a header."""
        return cls._of(_core.Polynomial.read(file_name(path), name))

    def save(self, path: Path, name: str) -> None:
        """Writes the polynomial under a name into a header."""
        self._header.write(file_name(path), name)

    def __call__(self, range_time: Any, azimuth_time: Any) -> Any:
        """Values at range times (two-way, s) and azimuth times."""
        return self._header.value(*broadcast(range_time, to_seconds(azimuth_time)))[()]


class Coregistration(_Model):
    """The mapping of a master image onto a slave image, in times and in samples."""

    __slots__ = ()
    _SECTION = "REGIST"
    _KIND = _core.Coregistration

    @classmethod
    def read(cls, path: Path) -> Coregistration:
        """The mapping of a header or parameter file."""
        return cls._of(_core.Coregistration.read(file_name(path)))

    def save(self, path: Path) -> None:
        """Writes the mapping into a header."""
        self._header.write(file_name(path))

    def to_slave(self, range_time: Any, azimuth_time: Any) -> tuple[Any, Any]:
        """Range and azimuth times of the slave, s."""
        made = plain(self._header.to_slave(*broadcast(range_time, to_seconds(azimuth_time))))
        return made[0], made[1]

    def to_master(self, range_time: Any, azimuth_time: Any) -> tuple[Any, Any]:
        """Range and azimuth times of the master, s; not-a-number where the mapping has no inverse."""
        made = plain(self._header.to_master(*broadcast(range_time, to_seconds(azimuth_time))))
        return made[0], made[1]

    def with_samples(self, master: Region, slave: Region) -> Coregistration:
        """The mapping whose sample form is made of its time form."""
        return Coregistration._of(self._header.with_samples(*_headers(master, slave)))

    def with_times(self, master: Region, slave: Region) -> Coregistration:
        """The mapping whose time form is made of its sample form."""
        return Coregistration._of(self._header.with_times(*_headers(master, slave)))


class Configuration(Section):
    """The parameters of one processor: a record by its class name, such as "AzimuthConf"."""

    __slots__ = ()

    def __init__(self, name: str, **fields: Any) -> None:
        super().__init__(_core.Configuration(name), name)
        self.update(fields)

    @staticmethod
    def names() -> list[str]:
        """Names of all records."""
        return _core.Configuration.names()

    @classmethod
    def read(cls, path: Path, name: str, channel: int = 1) -> Configuration:
        """The record of a configuration file."""
        made = cls.__new__(cls)
        Section.__init__(made, _core.Configuration.read(name, file_name(path), channel), name)
        return made

    def save(self, path: Path, channel: int = 1) -> None:
        """Writes the record's own parameters into a configuration file."""
        self._header.write(file_name(path), channel)

    @property
    def shared(self) -> dict[str, Any]:
        """The parameters that all processors share, as the file told them."""
        return self._header.shared()

    def __reduce__(self) -> tuple:
        return _configured, (self._name, dict(self))


def _configured(name: str, fields: dict[str, Any]) -> Configuration:
    return Configuration(name, **fields)


class Finding(NamedTuple):
    """Something in a configuration file that does not fit its record."""

    section: str
    """Section of the record, or one that no record has."""
    name: str
    """Name of the element; empty where the whole section is meant."""
    reason: str
    """Continues the name: "is missing"."""


class Review(NamedTuple):
    """What a configuration file holds."""

    records: list[str]
    """The records that are there."""
    findings: list[Finding]
    """What does not fit."""


def review(path: Path, channel: int = 1) -> Review:
    """Compares a configuration file with the records that it holds."""
    records, findings = _core.review(file_name(path), channel)
    return Review(records, [Finding(*finding) for finding in findings])
