# SPDX-License-Identifier: Apache-2.0
"""Where the corners and the middle of an image lie on the ground, and how they are seen.

Usage: geolocate.py HEADER [HEIGHT_M]
"""

import sys

import numpy as np
from quo_base import Product


def main(header, height="0"):
    product = Product(header)
    # Of bursts, which overlap in time, the raster has more lines than the region.
    shape = product.raster.shape if "RasterInfo" in product else (product.ROI.Lines, product.ROI.Samples)
    lines, samples = shape[0] - 1, shape[1] - 1
    line = np.array([0, 0, lines, lines, lines / 2])
    sample = np.array([0, samples, samples, 0, samples / 2])
    times = product.grid.times(line, sample)
    seen = product.orbit.geometry(times.azimuth_time, times.range_time, height=float(height))
    for row in zip(line, sample, seen.latitude, seen.longitude, seen.incidence):
        print("line {:8.1f}, sample {:8.1f}: {:.7f} N, {:.7f} E, incidence {:.4f} degrees".format(*row))


if __name__ == "__main__":
    main(*sys.argv[1:])
