# SPDX-License-Identifier: Apache-2.0
"""Array calls, raster slices and the import beside the same without the package, as ratios.

The calls of the library are made by ctypes, on the same arrays, in this process.

Usage: ratios.py LIBRARY
"""

import ctypes
import subprocess
import sys
import tempfile

import numpy as np
from quo_base import Product
from scene import make_product, seconds

POINTS, LINES, SAMPLES = 1_000_000, 4000, 4000


def pointer(array):
    return None if array is None else ctypes.c_void_p(array.ctypes.data)


class Handle:
    """The product by the library's plain calls."""

    def __init__(self, library, header):
        self._library = ctypes.CDLL(library)
        self._product = ctypes.c_void_p()
        self._check("open", self._library.quo_product_open(header.encode(), None, ctypes.byref(self._product)))

    @staticmethod
    def _check(name, status):
        if status:
            raise RuntimeError(f"quo_product_{name}: status {status}")

    def to_ground(self, azimuth, slant):
        made = [np.empty(POINTS) for _ in range(3)] + [None] * 7 + [np.empty(POINTS, np.int32)]
        arrays = [azimuth, slant, None, None, *made]
        count = ctypes.c_size_t(POINTS)
        self._check("to_ground", self._library.quo_product_to_ground(self._product, count, *map(pointer, arrays)))

    def to_radar(self, latitude, longitude, height):
        made = [np.empty(POINTS), np.empty(POINTS), np.empty(POINTS, np.int32)]
        arrays = [latitude, longitude, height, None, None, None, None, *made]
        count = ctypes.c_size_t(POINTS)
        self._check("to_radar", self._library.quo_product_to_radar(self._product, count, *map(pointer, arrays)))

    def read(self, lines, samples):
        block = np.empty((lines, samples), np.complex64)
        place = (0, lines, 0, samples, 0, pointer(block), ctypes.c_size_t(block.nbytes))
        self._check("read", self._library.quo_product_read(self._product, *place))


def beside(name, limit, package, library, times=7):
    """Takes turns, so that both see the same load."""
    ours, theirs = float("inf"), float("inf")
    for _ in range(times):
        theirs = min(theirs, seconds(library))
        ours = min(ours, seconds(package))
    print(f"| {name} | {ours:.4f} s | {theirs:.4f} s | {ours / theirs:.3f} | {limit} |", flush=True)


def started(statement):
    subprocess.run([sys.executable, "-c", statement], check=True)


def main(library):
    print("| measured | package | library | ratio | at most |\n|---|---|---|---|---|")
    with tempfile.TemporaryDirectory() as folder:
        header = make_product(folder, LINES, SAMPLES)
        product, handle = Product(header), Handle(library, header)
        orbit, raster = product.orbit, product.raster
        rng = np.random.default_rng(5)
        azimuth, slant = 1167930362.0 + 8 * rng.random(POINTS), 0.0055 + 6e-5 * rng.random(POINTS)
        ground = orbit.to_ground(azimuth, slant)[:3]
        seen = (azimuth, slant)
        beside("to_ground, 10^6 points", 1.1, lambda: orbit.to_ground(*seen), lambda: handle.to_ground(*seen))
        beside("to_radar, 10^6 points", 1.1, lambda: orbit.to_radar(*ground), lambda: handle.to_radar(*ground))
        beside("all of a raster", 1.2, lambda: raster[:, :], lambda: handle.read(LINES, SAMPLES))
        beside("256 lines of a raster", 1.2, lambda: raster[:256], lambda: handle.read(256, SAMPLES))
    package, alone = (seconds(lambda: started(text), 7) for text in ("import quo_base", "import numpy"))
    print(f"\nImporting the package takes {package - alone:.3f} s beside numpy's {alone:.3f} s; at most 0.15 s")


if __name__ == "__main__":
    main(*sys.argv[1:])
