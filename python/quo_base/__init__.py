"""Radar products: headers, orbits and geolocation, rasters, polynomials, signal processing and time."""

from . import errors, sentinel1, signal, times
from .errors import Error, FileError, NumericError, OutOfMemory, Refused
from .orbit import Orbit
from .parameters import ParameterFile
from .models import Configuration, Coregistration, Polynomial, Region
from .product import Product
from .raster import Raster, RasterWriter

__all__ = [
    "Configuration",
    "Coregistration",
    "Error",
    "FileError",
    "NumericError",
    "Orbit",
    "OutOfMemory",
    "ParameterFile",
    "Polynomial",
    "Product",
    "Raster",
    "RasterWriter",
    "Refused",
    "Region",
    "errors",
    "sentinel1",
    "signal",
    "times",
]
