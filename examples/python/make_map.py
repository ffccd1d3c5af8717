# SPDX-License-Identifier: Apache-2.0
"""A picture of an image on the map, and of the surroundings of known places, which should be bright in the middle.

The map is in the UTM zone of the first place. The elevation model's heights are above the ellipsoid. Places are a
list with the columns name, latitude_deg, longitude_deg and height_m.

Usage: make_map.py HEADER DEM PLACES.csv PICTURE.png
"""

import sys

import matplotlib
import numpy as np
from elevation_model import read_places
from pyproj import Transformer
from quo_base import geocode

matplotlib.use("agg")
from matplotlib import pyplot  # noqa: E402

COARSE_M, GATHERED = 8.0, 5  # bright points of the whole image stay visible
FINE_M, HALF_M = 4.0, 120.0


def utm_zone(latitude, longitude):
    """Number of a UTM zone's system on WGS84 in the EPSG registry, special zones apart."""
    return (32600 if latitude >= 0 else 32700) + int((longitude + 180) // 6) % 60 + 1


def decibels(amplitude):
    return 20.0 * np.log10(np.maximum(amplitude, 1e-6))


def draw_map(axes, whole, places):
    """The brightest of GATHERED x GATHERED pixels in each, and rings around the places."""
    picture = decibels(whole.fillna(0.0).coarsen(x=GATHERED, y=GATHERED, boundary="trim").max())
    low, high = np.percentile(picture.values[picture > -100], [5, 99.9])
    picture.where(picture > -100).plot.imshow(ax=axes, cmap="gray", vmin=low, vmax=high, add_colorbar=False)
    for name, (east, north) in places.items():
        axes.plot(east, north, "o", markersize=14, markerfacecolor="none", markeredgecolor="tab:orange")
        axes.annotate(name, (east, north), (8, 8), textcoords="offset points", color="tab:orange")
    title = f"The image, the brightest pixel in each {COARSE_M * GATHERED:.0f} m square"
    axes.set(aspect="equal", xlabel="UTM east, m", ylabel="UTM north, m", title=title)
    axes.ticklabel_format(useOffset=False, style="plain")
    axes.locator_params(nbins=5)


def draw_surroundings(axes, fine, name, east, north):
    """HALF_M each way around a place; returns the picture and how far from the place the brightest pixel is, m."""
    part = fine.sel(x=slice(east - HALF_M, east + HALF_M), y=slice(north + HALF_M, north - HALF_M)).compute()
    extent = np.array([part.x[0] - east, part.x[-1] - east, part.y[-1] - north, part.y[0] - north])
    edges = extent + np.array([-1, 1, -1, 1]) * FINE_M / 2
    peak = part.where(part == part.max(), drop=True)
    level = decibels(part / part.max())
    shown = axes.imshow(level, cmap="inferno", vmin=-40, vmax=0, extent=edges, interpolation="nearest")
    axes.axhline(0, color="white", linewidth=0.3)
    axes.axvline(0, color="white", linewidth=0.3)
    axes.set_title(name, fontsize=9)
    axes.tick_params(labelsize=7)
    return shown, float(np.hypot(peak.x[0] - east, peak.y[0] - north))


def main(header, dem, places_file, picture):
    names = read_places(places_file)
    utm = f"EPSG:{utm_zone(*next(iter(names.values()))[:2])}"
    to_map = Transformer.from_crs("EPSG:4326", utm, always_xy=True)
    places = {name: to_map.transform(longitude, latitude) for name, (latitude, longitude, _) in names.items()}
    whole = geocode(header, dem, utm, COARSE_M, heights="ellipsoid").image
    # Tiles are made where they are asked for.
    fine = geocode(header, dem, utm, FINE_M, "sinc", heights="ellipsoid", chunks=128).image
    figure = pyplot.figure(figsize=(13, 6.5), layout="constrained")
    left, right = figure.subfigures(1, 2)
    draw_map(left.subplots(), whole, places)
    small = np.ravel(right.subplots(3, 3))
    drawn = [draw_surroundings(axes, fine, name, *place) for axes, (name, place) in zip(small, places.items())]
    off = [distance for _, distance in drawn]
    right.suptitle("Around each place, where the lines cross")
    right.supxlabel("east of the place, m", fontsize=9)
    right.supylabel("north of the place, m", fontsize=9)
    right.colorbar(drawn[0][0], ax=list(small), label="dB from the brightest pixel", shrink=0.6)
    figure.savefig(picture, dpi=100)
    print(f"{len(off)} places; the brightest pixel of {FINE_M:g} m is {max(off):.1f} m off at most")


if __name__ == "__main__":
    main(*sys.argv[1:])
