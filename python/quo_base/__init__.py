# SPDX-License-Identifier: Apache-2.0
"""Radar products: headers, orbits and geolocation, rasters, polynomials, signal processing and time."""

from ._calls import hide_signatures
from . import errors, mapping, models, sentinel1, signal, times
from .errors import Error, FileError, NumericError, OutOfMemory, Refused
from .jobs import Job, Outcome, run
from .mapping import geocode
from .orbit import Orbit
from .parameters import ParameterFile
from .models import Configuration, Coregistration, Polynomial, Region
from .product import Product
from .raster import Raster, RasterWriter

hide_signatures()

__all__ = [
    "Configuration",
    "Coregistration",
    "Error",
    "FileError",
    "Job",
    "NumericError",
    "Orbit",
    "OutOfMemory",
    "Outcome",
    "ParameterFile",
    "Polynomial",
    "Product",
    "Raster",
    "RasterWriter",
    "Refused",
    "Region",
    "errors",
    "geocode",
    "mapping",
    "models",
    "run",
    "sentinel1",
    "signal",
    "times",
]
