# SPDX-License-Identifier: Apache-2.0
"""How far the orbit model lies from exact and from precise state vectors, and whether the way back closes.

Usage: accuracy.py
"""

import numpy as np
from quo_base import Orbit, Product
from scene import SCENE

ROTATION, GRAVITATION, LIGHT = 7.292115189334571e-5, 3.986004418e14, 299792458.0  # rad/s, m^3/s^2, m/s
DATA = SCENE.parent.parent


def circular(times):
    """Positions and velocities over the rotating Earth of a circular orbit at 693 km, 98 degrees inclined."""
    radius, inclination = 6378137.0 + 693e3, np.radians(98.0)
    rate = np.sqrt(GRAVITATION / radius**3)
    along, turned = 0.3 + rate * times, ROTATION * times
    node = np.array([1.0, 0.0, 0.0])
    side = np.array([0.0, np.cos(inclination), np.sin(inclination)])
    at = radius * (np.cos(along)[:, None] * node + np.sin(along)[:, None] * side)
    moving = radius * rate * (np.cos(along)[:, None] * side - np.sin(along)[:, None] * node)
    moving -= ROTATION * np.cross([0.0, 0.0, 1.0], at)
    cosine, sine, zero, one = np.cos(turned), np.sin(turned), 0 * turned, 0 * turned + 1
    to_earth = np.array([[cosine, sine, zero], [-sine, cosine, zero], [zero, zero, one]])
    return tuple(np.einsum("ijn,nj->ni", to_earth, each) for each in (at, moving))


def worst(found, true):
    return np.linalg.norm(found - true, axis=-1).max()


def exact_vectors():
    print("circular orbit, eleven vectors: spacing, position, velocity, estimate, position after resample(5)")
    for spacing in (5.0, 10.0, 20.0, 30.0, 60.0):
        orbit = Orbit(0.0, spacing, *circular(spacing * np.arange(11)))
        times = np.linspace(0.0, 10 * spacing, 5001)
        at, moving = circular(times)
        errors = worst(orbit.position(times), at), worst(orbit.velocity(times), moving), orbit.fit_error
        finer = worst(orbit.resample(5.0).position(times), at)
        print(f"| {spacing:.0f} s |", " | ".join(f"{1e3 * each:.3g} {unit}" for each, unit in zip(
            (*errors, finer), ("mm", "mm/s", "mm", "mm"))), "|")


def precise_vectors():
    print("precise vectors, 24 minutes: spacing given, largest error after resample(10), estimate there")
    table = np.genfromtxt(DATA / "orbits" / "s1a_20230823_precise.csv", delimiter=",", comments="#", skip_header=4)
    for every in (2, 3, 6, 9, 12):
        given = table[::every]
        finer = Orbit(0.0, 10.0 * every, given[:, 1:4], given[:, 4:7]).resample(10.0)
        held = table[table[:, 0] <= given[-1, 0]]
        error = worst(finer.position(held[:, 0]), held[:, 1:4])
        print(f"| {10 * every} s | {1e3 * error:.2g} mm | {1e3 * finer.fit_error:.2g} mm |")


def closure():
    print("to the ground and back, 60000 samples: orbit, times, azimuth time, slant range, ground the second time")
    chance = np.random.default_rng(5)
    for name, doppler in (("s1a_iw1_slc_20220104_asc", 3000.0), ("uavsar_winnipeg_20120717_left", 300.0)):
        product = Product(DATA / "scenes" / f"{name}.xml")
        true, region = product.orbit, product.ROI
        for first in (true.first_time, 0.0):
            orbit = Orbit(first, true.spacing, true.positions, true.velocities, true.wavelength, true.look)
            azimuth = first + true.spacing * chance.uniform(1.0, len(true) - 2.0, 60000)
            time = region.FastStartTime + chance.uniform(0.0, region.FastTimeLength, 60000)
            shift = doppler * chance.integers(-1, 2, 60000)
            ground = orbit.geometry(azimuth, time, doppler=shift)
            seen = orbit.to_radar_xyz(ground.x, ground.y, ground.z, doppler=shift)
            fine = (ground.status == 0) & (seen.status == 0)
            again = orbit.geometry(seen.azimuth_time, seen.range_time, doppler=shift)
            places = [np.stack([each.x, each.y, each.z], -1)[fine] for each in (ground, again)]
            off = [
                np.abs(seen.azimuth_time - azimuth)[fine].max(),
                np.abs(seen.range_time - time)[fine].max() * LIGHT / 2,
                worst(*places),
            ]
            print(f"| {name}, {fine.sum()} | {first:.0f} |", " | ".join(f"{each:.2g}" for each in off), "|")


if __name__ == "__main__":
    exact_vectors()
    precise_vectors()
    closure()
