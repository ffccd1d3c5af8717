# SPDX-License-Identifier: Apache-2.0
"""What the benchmarks measure on: a part of a real scene with made samples, and flat terrain under it."""

import time
from pathlib import Path

import numpy as np
from quo_base import Product, RasterWriter, Region

SCENE = Path(__file__).parents[2] / "tests" / "data" / "scenes" / "s1a_iw1_slc_20220104_asc.xml"
LINE_S, SAMPLE_S = 2.0555e-3, 1.5541e-8


def make_product(folder, lines, samples):
    """The header file of a product of complex samples."""
    path = Path(folder) / "image"
    with RasterWriter(path, (lines, samples), np.complex64) as image:
        for line in range(lines):
            image[line] = np.exp(0.1j * np.arange(samples) * line)
    product = Product(SCENE)
    product.add("RasterInfo", **Product(f"{path}.hdr").RasterInfo)
    product.add("ROI", **Region.of_axes((0.0055, SAMPLE_S, samples), (1167930362.0, LINE_S, lines)))
    product.save(f"{path}.hdr", exact=True)
    return f"{path}.hdr"


def make_terrain(folder, header, pixels):
    """An elevation model of pixels x pixels of 10 m, gently rolling, around the image's middle."""
    import rasterio

    product = Product(header)
    times = product.grid.times(product.ROI.Lines / 2, product.ROI.Samples / 2)
    middle = product.orbit.to_ground(times.azimuth_time, times.range_time)
    step = 1e-4
    corner = (float(middle.longitude) - step * pixels / 2, float(middle.latitude) + step * pixels / 2)
    heights = 50 * np.sin(np.arange(pixels) / 40)[:, np.newaxis] * np.cos(np.arange(pixels) / 50)
    path = str(Path(folder) / "dem.tif")
    shape = {"height": pixels, "width": pixels, "count": 1, "dtype": "float32"}
    place = {"crs": "EPSG:4326", "transform": rasterio.transform.from_origin(*corner, step, step)}
    with rasterio.open(path, "w", driver="GTiff", **shape, **place) as file:
        file.write(heights.astype(np.float32), 1)
    return path


def seconds(doing, times=1):
    """The shortest of several runs."""
    best = float("inf")
    for _ in range(times):
        start = time.perf_counter()
        doing()
        best = min(best, time.perf_counter() - start)
    return best
