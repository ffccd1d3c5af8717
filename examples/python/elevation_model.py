# SPDX-License-Identifier: Apache-2.0
"""An elevation model of the sea with an island under each place of a list: heights above the ellipsoid.

Usage: elevation_model.py PLACES.csv DEM.tif
"""

import csv
import sys

import numpy as np
import rasterio

STEP_DEG, MARGIN_DEG, ISLAND_M = 0.0005, 0.03, 400.0
METRES_PER_DEGREE = 111195.0


def read_places(path):
    """Latitudes, longitudes (degrees) and heights (m) by name."""
    with open(path, newline="") as file:
        rows = csv.DictReader(line for line in file if not line.startswith("#"))
        columns = ("latitude_deg", "longitude_deg", "height_m")
        return {row["name"]: tuple(float(row[column]) for column in columns) for row in rows}


def heights_around(places, latitude, longitude):
    """Heights on a grid; the top of an island is flat."""
    made = np.zeros(np.broadcast(latitude, longitude).shape)
    for place_latitude, place_longitude, height in places:
        north = (latitude - place_latitude) * METRES_PER_DEGREE
        east = (longitude - place_longitude) * METRES_PER_DEGREE * np.cos(np.radians(place_latitude))
        made += height * np.exp(-((np.hypot(north, east) / ISLAND_M) ** 4))
    return made


def main(places_file, path):
    places = np.array(list(read_places(places_file).values()))
    south, west = places[:, :2].min(axis=0) - MARGIN_DEG
    north, east = places[:, :2].max(axis=0) + MARGIN_DEG
    rows, columns = (int((to - start) / STEP_DEG) for start, to in ((south, north), (west, east)))
    latitude = north - STEP_DEG * (np.arange(rows)[:, np.newaxis] + 0.5)
    longitude = west + STEP_DEG * (np.arange(columns) + 0.5)
    shape = {"height": rows, "width": columns, "count": 1, "dtype": "float32"}
    place = {"crs": "EPSG:4326", "transform": rasterio.transform.from_origin(west, north, STEP_DEG, STEP_DEG)}
    with rasterio.open(path, "w", driver="GTiff", **shape, **place) as file:
        file.write(heights_around(places, latitude, longitude).astype(np.float32), 1)


if __name__ == "__main__":
    main(*sys.argv[1:])
