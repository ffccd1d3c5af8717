# SPDX-License-Identifier: Apache-2.0
"""Maps of several products at a time, as raster files with their reference system: on two processes of this
machine, or on a cluster whose scheduler's address is told. Running it again does what is left.

The elevation model's heights are above the ellipsoid.

Usage: maps_on_workers.py DEM FOLDER HEADER... [--scheduler ADDRESS]
"""

import argparse
import os
import sys

import rasterio
from distributed import Client, LocalCluster
from quo_base import Job, geocode, run


def make_map(path, header, dem):
    """A GeoTIFF; the job has a name of its own for it until it is whole."""
    image = geocode(header, dem, heights="ellipsoid")
    shape = {"height": image.image.shape[0], "width": image.image.shape[1], "count": 1, "dtype": "float32"}
    place = {"crs": image.attrs["crs"], "transform": rasterio.Affine(*image.attrs["transform"])}
    with rasterio.open(path, "w", driver="GTiff", nodata=float("nan"), **shape, **place) as file:
        file.write(image.image.values, 1)


def main():
    arguments = argparse.ArgumentParser(description=__doc__.split("\n")[0])
    arguments.add_argument("dem")
    arguments.add_argument("folder")
    arguments.add_argument("headers", nargs="+")
    arguments.add_argument("--scheduler")
    told = arguments.parse_args()
    names = [os.path.join(told.folder, os.path.basename(header)[:-4] + ".tif") for header in told.headers]
    jobs = [Job(name, make_map, (header, told.dem)) for name, header in zip(names, told.headers)]
    cluster = told.scheduler or LocalCluster(n_workers=2, threads_per_worker=1, dashboard_address=None)
    with Client(cluster) as client:
        outcomes = run(jobs, client)
    for outcome in outcomes:
        print(f"{outcome.output}: {outcome.state} {outcome.reason}".rstrip())
    return int(any(outcome.state == "failed" for outcome in outcomes))


if __name__ == "__main__":
    sys.exit(main())
