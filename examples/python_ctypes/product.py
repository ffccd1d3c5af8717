# SPDX-License-Identifier: Apache-2.0
"""A product from Python with the standard library alone: ctypes loads the library and calls its C functions.

Usage: product.py LIBRARY HEADER AZIMUTH_S RANGE_S
"""

import ctypes
import sys
from array import array

FLOAT_COMPLEX = 0  # of RasterCellType


class Product:
    """An open product; every failure of a call is a RuntimeError with its status."""

    def __init__(self, library, header, raster=None):
        self._library = ctypes.CDLL(library)
        self._handle = ctypes.c_void_p()
        self._library.quo_product_close.argtypes = [ctypes.c_void_p]
        names = [name.encode() if name else None for name in (header, raster)]
        self._check("open", self._library.quo_product_open(*names, ctypes.byref(self._handle)))

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self._library.quo_product_close(self._handle)

    @staticmethod
    def _check(name, status):
        if status:
            raise RuntimeError(f"quo_product_{name}: status {status}")

    def _call(self, name, *arguments):
        self._check(name, getattr(self._library, "quo_product_" + name)(self._handle, *arguments))

    def numbers(self, field):
        length = ctypes.c_size_t()
        self._call("length", field.encode(), ctypes.byref(length))
        values = (ctypes.c_double * length.value)()
        self._call("numbers", field.encode(), values, length)
        return list(values)

    def text(self, field):
        room = ctypes.create_string_buffer(512)
        self._call("text", field.encode(), room, ctypes.c_size_t(len(room)))
        return room.value.decode()

    def to_ground(self, azimuth_s, range_s):
        """Latitude, longitude and incidence angle of samples, in degrees."""
        count = len(azimuth_s)
        times = [(ctypes.c_double * count)(*values) for values in (azimuth_s, range_s)]
        found = {name: (ctypes.c_double * count)() for name in ("latitude", "longitude", "incidence")}
        outputs = ["latitude", "longitude", None, None, None, None, "incidence", None, None, None]
        self._call("to_ground", ctypes.c_size_t(count), *times, None, None, *map(found.get, outputs), None)
        return tuple(list(values) for values in found.values())

    def to_radar(self, latitude, longitude):
        """Azimuth and range times at which points on the ellipsoid are seen."""
        count = len(latitude)
        place = [(ctypes.c_double * count)(*values) for values in (latitude, longitude)]
        times = [(ctypes.c_double * count)() for _ in range(2)]
        self._call("to_radar", ctypes.c_size_t(count), *place, *[None] * 5, *times, None)
        return tuple(list(values) for values in times)

    def shape(self):
        """Lines and samples of the raster."""
        lines, samples = ctypes.c_int32(), ctypes.c_int32()
        self._call("raster", ctypes.byref(lines), ctypes.byref(samples), None)
        return lines.value, samples.value

    def read(self, first_line, lines, first_sample, samples):
        """Real and imaginary parts in turn, as floats, whatever the samples are in the file."""
        block = array("f", bytes(8 * lines * samples))
        address, length = block.buffer_info()
        place = [ctypes.c_int32(value) for value in (first_line, lines, first_sample, samples, FLOAT_COMPLEX)]
        self._call("read", *place, ctypes.c_void_p(address), ctypes.c_size_t(length * block.itemsize))
        return block


def main(library, header, azimuth_s, range_s):
    with Product(library, header) as product:
        (prf_hz,) = product.numbers("SamplingConstants/prf_hz")
        positions = product.numbers("StateVectorData/pSV_m")
        vectors = len(positions) // 3
        print(f"{product.text('DataSetInfo/SensorName')}, PRF {prf_hz:.3f} Hz, {vectors} state vectors")
        ranges = [float(range_s) + 1e-4 * i for i in range(3)]
        latitude, longitude, incidence = product.to_ground([float(azimuth_s)] * 3, ranges)
        for place in zip(latitude, longitude, incidence, *product.to_radar(latitude, longitude)):
            print("%.7f N, %.7f E, seen at %.4f degrees; back at %.6f s, %.10f s" % place)
        lines, samples = product.shape()
        if lines * samples == 0:
            return  # a header alone
        lines = min(lines, 10)
        block = product.read(0, lines, 0, samples)
        intensity = sum(value * value for value in block) / (lines * samples)
        print(f"{lines} lines of {samples} samples, mean intensity {intensity:.3f}")


if __name__ == "__main__":
    if len(sys.argv) != 5:
        sys.exit(__doc__)
    main(*sys.argv[1:])
