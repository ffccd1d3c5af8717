# SPDX-License-Identifier: Apache-2.0
"""Geolocation beside the same equations in numpy's own arithmetic: zero Doppler on the curve through five vectors.

Usage: beside_numpy.py
"""

import numpy as np
from quo_base import Product
from scene import SCENE, seconds

POINTS, STEPS = 1_000_000, 4
LIGHT_M_S, A_M, B_M = 299792458.0, 6378137.0, 6356752.314245


class Curve:
    """The polynomial of degree 4 through five vectors of an orbit, in the time after the third."""

    def __init__(self, orbit, third):
        self.start = orbit.first_time + third * orbit.spacing
        times = orbit.spacing * np.arange(-2, 3)
        self._places = np.polyfit(times, orbit.positions[third - 2 : third + 3], 4)[:, :, np.newaxis]
        self._speeds = self._places[:-1] * np.arange(4, 0, -1)[:, np.newaxis, np.newaxis]
        self._turns = self._speeds[:-1] * np.arange(3, 0, -1)[:, np.newaxis, np.newaxis]

    def at(self, time):
        """Place, velocity and acceleration, each (3, points)."""
        made = []
        for terms in (self._places, self._speeds, self._turns):
            value = terms[0]
            for term in terms[1:]:
                value = value * time + term
            made.append(value)
        return made


def earth_fixed(latitude, longitude):
    phi, lam = np.radians(latitude), np.radians(longitude)
    across = A_M**2 / np.sqrt((A_M * np.cos(phi)) ** 2 + (B_M * np.sin(phi)) ** 2)
    level = across * np.cos(phi)
    return np.stack([level * np.cos(lam), level * np.sin(lam), (B_M / A_M) ** 2 * across * np.sin(phi)])


def to_radar(curve, latitude, longitude):
    """Azimuth times and two-way range times, by Newton's method on (point - place) . velocity = 0."""
    point = earth_fixed(latitude, longitude)
    time = np.zeros(len(latitude))
    for _ in range(STEPS):
        place, velocity, acceleration = curve.at(time)
        sight = point - place
        ahead = np.einsum("ij,ij->j", sight, velocity)
        slope = np.einsum("ij,ij->j", sight, acceleration) - np.einsum("ij,ij->j", velocity, velocity)
        time = time - ahead / slope
    return curve.start + time, 2.0 / LIGHT_M_S * np.linalg.norm(point - curve.at(time)[0], axis=0)


def main():
    orbit = Product(SCENE).orbit
    third = len(orbit) // 2
    curve, rng = Curve(orbit, third), np.random.default_rng(5)
    azimuth = curve.start + orbit.spacing * rng.uniform(-0.4, 0.4, POINTS)
    ground = orbit.to_ground(azimuth, 0.0055 + 6e-5 * rng.random(POINTS))
    ours, theirs = orbit.to_radar(*ground[:2]), to_radar(curve, *ground[:2])
    off = [float(np.max(np.abs(one - other))) for one, other in zip(ours, theirs)]
    package, numpy_alone = (
        seconds(doing, 5) for doing in (lambda: orbit.to_radar(*ground[:2]), lambda: to_radar(curve, *ground[:2]))
    )
    print(f"to_radar, {POINTS} points: {package:.3f} s; numpy: {numpy_alone:.3f} s,"
          f" {numpy_alone / package:.1f} times as long;"
          f" at most {off[0]:.1g} s of azimuth and {off[1]:.1g} s of range apart")


if __name__ == "__main__":
    main()
