"""Radar products: headers, orbits and geolocation, rasters, polynomials, signal processing and time."""

from . import errors, times
from .errors import Error, FileError, NumericError, OutOfMemory, Refused
from .orbit import Orbit
from .product import Product
from .raster import Raster, RasterWriter

__all__ = [
    "Error",
    "FileError",
    "NumericError",
    "Orbit",
    "OutOfMemory",
    "Product",
    "Raster",
    "RasterWriter",
    "Refused",
    "errors",
    "times",
]
