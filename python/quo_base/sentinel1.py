# SPDX-License-Identifier: Apache-2.0
"""Sentinel-1 products, taken over as products of the library."""

from __future__ import annotations

import os
from typing import Callable, NamedTuple, Optional, Union

from . import _core
from ._paths import file_name
from .product import Product

__all__ = ["Imported", "TiePoints", "import_product"]

Path = Union[str, os.PathLike]


class TiePoints(NamedTuple):
    """How far pixel grid and orbit are off the producer's tie points; 0 where the annotation has none."""

    points: int
    """Number of tie points."""
    rms_line: float
    """Root mean square of the lines' differences."""
    most_line: float
    """The largest of them."""
    rms_sample: float
    """The same of the samples."""
    most_sample: float
    """The largest of them."""
    rms_ground_m: float
    """The same on the ground, m."""
    most_ground_m: float
    """The largest of them, m."""


class Imported(NamedTuple):
    """What became of an import."""

    product: Product
    """The new product."""
    linked: bool
    """Whether its raster is a link into the measurement."""
    ties: TiePoints
    """What the tie points show."""


def import_product(
    source: Path,
    raster: Path,
    *,
    swath: Optional[str] = None,
    polarization: Optional[str] = None,
    orbit_file: Optional[Path] = None,
    link: bool = False,
    progress: Optional[Callable[[int, int], object]] = None,
) -> Imported:
    """Takes over a product (SLC or GRD) as a raster and its header, RASTER.hdr; both appear together, or nothing.

    source: the product's folder, manifest or annotation; swath ("IW1") and polarization ("VV") where it has
    several; orbit_file: state vectors in place of the annotation's; link: do not copy samples that can be used as
    they stand; progress: told of bytes written and of all; what it raises ends the import.
    """
    orbit = None if orbit_file is None else file_name(orbit_file)
    name = file_name(raster)
    _, _, linked, *ties = _core.import_sentinel1(
        file_name(source), name, swath, polarization, orbit, link, progress
    )
    return Imported(Product(name + ".hdr"), linked, TiePoints(*ties))
