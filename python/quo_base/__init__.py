"""Radar products: headers, orbits and geolocation, rasters, polynomials, signal processing and time."""

from . import errors, sentinel1, signal, times
from .errors import Error, FileError, NumericError, OutOfMemory, Refused
from .jobs import Job, Outcome, run
from .mapping import geocode
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
    "run",
    "sentinel1",
    "signal",
    "times",
]
