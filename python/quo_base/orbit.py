# SPDX-License-Identifier: Apache-2.0
"""Orbits: where the platform flies, and geolocation of arrays of points."""

from __future__ import annotations

from typing import Any, NamedTuple, Optional, Sequence

import numpy as np

from . import _core
from ._arrays import broadcast, contiguous, doubles, plain, whole_number
from .times import to_seconds

__all__ = ["Finding", "Geometry", "Ground", "Orbit", "Sighting"]


class Ground(NamedTuple):
    """Places of samples; not-a-number where a sample sees no ground."""

    latitude: Any
    """Geodetic latitude, degrees."""
    longitude: Any
    """Longitude, degrees, -180 to 180."""
    height: Any
    """Height above the ellipsoid, m."""
    status: Any
    """0 where there is a place; 1 for inputs that are no numbers; 10 where no ground is seen."""


class Geometry(NamedTuple):
    """Places of samples, and how they are seen."""

    latitude: Any
    """Geodetic latitude, degrees."""
    longitude: Any
    """Longitude, degrees."""
    height: Any
    """Height above the ellipsoid, m."""
    x: Any
    """Earth-fixed, m."""
    y: Any
    """With x."""
    z: Any
    """With x."""
    incidence: Any
    """Angle between the line of sight and the ellipsoid's normal, degrees."""
    look: Any
    """Angle at the platform from the direction to the Earth's centre, degrees."""
    fm_rate: Any
    """Azimuth FM rate, Hz/s, negative at broadside."""
    speed: Any
    """Platform speed over the rotating Earth, m/s."""
    status: Any
    """As in Ground."""


class Sighting(NamedTuple):
    """When places are seen, and how far away; not-a-number where they are not."""

    azimuth_time: Any
    """Seconds since 1985."""
    range_time: Any
    """Two-way range time, s."""
    status: Any
    """0 where the place is seen; 1 for inputs that are no numbers; 12 where it is not seen."""


class Finding(NamedTuple):
    """What is wrong with the state vectors."""

    vector: int
    """Number of the vector, from 0; -1 for the list as a whole."""
    size: float
    """How far it is off, in the unit that the text tells."""
    text: str
    """The finding in words."""


class Orbit:
    """An orbit through equally spaced state vectors. It never changes, so threads may share it.

    Times are azimuth times: seconds since 1985 or datetime64. Range times are two-way, in seconds. Doppler is in
    Hz, positive while the target approaches. All arguments are broadcast against each other, and results have
    their common shape; scalars give scalars. Points without a solution get not-a-number and a status. Array calls
    run without the interpreter's lock.
    """

    __slots__ = ("_orbit",)

    def __init__(
        self,
        first_time: Any,
        spacing: float,
        positions: Any,
        velocities: Any,
        wavelength: Optional[float] = None,
        look: Optional[int] = None,
    ) -> None:
        """An orbit of state vectors.

        first_time: of the first vector; spacing: s; positions: (n, 3), m, Earth-fixed, n at least 5; velocities:
        (n, 3), m/s; wavelength: m, needed where a Doppler takes part; look: negative looks left, needed on the way
        to the ground.
        """
        self._orbit = _core.Orbit(
            float(to_seconds(first_time)),
            float(spacing),
            contiguous(doubles(positions)),
            contiguous(doubles(velocities)),
            None if wavelength is None else float(wavelength),
            None if look is None else whole_number(look),
        )

    @classmethod
    def _of(cls, orbit: _core.Orbit) -> Orbit:
        made = cls.__new__(cls)
        made._orbit = orbit
        return made

    def __reduce__(self) -> tuple:
        held = self._orbit
        vectors = (held.first_time, held.spacing, held.positions, held.velocities)
        return Orbit, (*vectors, held.wavelength, held.look)

    def __repr__(self) -> str:
        return (
            f"<Orbit: {len(self)} vectors from {_core.text_of_seconds(self.first_time, True)} on, "
            f"{self.spacing:g} s apart>"
        )

    def __len__(self) -> int:
        return len(self.positions)

    @property
    def first_time(self) -> float:
        """Time of the first vector, seconds since 1985."""
        return self._orbit.first_time

    @property
    def spacing(self) -> float:
        """Time from vector to vector, s."""
        return self._orbit.spacing

    @property
    def positions(self) -> np.ndarray:
        """Positions of the vectors, (n, 3), m: a copy."""
        return self._orbit.positions

    @property
    def velocities(self) -> np.ndarray:
        """Their velocities, (n, 3), m/s: a copy."""
        return self._orbit.velocities

    @property
    def wavelength(self) -> Optional[float]:
        """Radar wavelength, m; None where not known."""
        return self._orbit.wavelength

    @property
    def look(self) -> Optional[int]:
        """Look sign, negative left; None where not known."""
        return self._orbit.look

    @property
    def ascending(self) -> bool:
        """Whether the first vector flies north."""
        return self._orbit.ascending

    @property
    def fit_error(self) -> float:
        """Estimate of how far the model is off a smooth orbit, m."""
        return self._orbit.fit_error

    def times(self) -> np.ndarray:
        """Times of the vectors, (n,), seconds since 1985."""
        return self.first_time + self.spacing * np.arange(len(self))

    def position(self, time: Any) -> np.ndarray:
        """Positions at times, shape of the times and 3, m, Earth-fixed."""
        (times,) = broadcast(to_seconds(time))
        return self._orbit.positions_at(times)

    def velocity(self, time: Any) -> np.ndarray:
        """Velocities at times, shape of the times and 3, m/s: the derivative of the positions."""
        (times,) = broadcast(to_seconds(time))
        return self._orbit.velocities_at(times)

    def quantities(
        self, names: Sequence[str], azimuth_time: Any, range_time: Any, doppler: Any = None, height: Any = None
    ) -> dict[str, Any]:
        """Those quantities of Geometry that are named, and "status", of samples as for geometry()."""
        arrays = broadcast(to_seconds(azimuth_time), range_time, doppler, height)
        made = self._orbit.to_ground(list(names), *arrays)
        return {name: values[()] for name, values in made.items()}

    def to_ground(self, azimuth_time: Any, range_time: Any, doppler: Any = None, height: Any = None) -> Ground:
        """Where samples lie on the ground, at a height (m) and seen with a Doppler (Hz), 0 unless given."""
        return Ground(**self.quantities(Ground._fields[:-1], azimuth_time, range_time, doppler, height))

    def geometry(self, azimuth_time: Any, range_time: Any, doppler: Any = None, height: Any = None) -> Geometry:
        """Where samples lie and how they are seen, as for to_ground()."""
        return Geometry(**self.quantities(Geometry._fields[:-1], azimuth_time, range_time, doppler, height))

    def to_radar(self, latitude: Any, longitude: Any, height: Any = None, doppler: Any = None) -> Sighting:
        """When places are seen: geodetic degrees, height in m (0 unless given), Doppler in Hz (0 unless given)."""
        return self._sighting(False, latitude, longitude, height, doppler)

    def to_radar_xyz(self, x: Any, y: Any, z: Any, doppler: Any = None) -> Sighting:
        """The same of Earth-fixed places, m."""
        return self._sighting(True, x, y, z, doppler)

    def _sighting(self, fixed: bool, *values: Any) -> Sighting:
        return Sighting(*plain(self._orbit.to_radar(fixed, *broadcast(*values))))

    def resample(self, spacing: float) -> Orbit:
        """The orbit with vectors at most `spacing` seconds apart, as precise as its own vectors allow."""
        return Orbit._of(self._orbit.resampled(float(spacing)))

    def check(self) -> list[Finding]:
        """What is wrong with the vectors: gaps, duplicates, steps, velocities that are not the derivative."""
        return [Finding(*found) for found in self._orbit.check()]
