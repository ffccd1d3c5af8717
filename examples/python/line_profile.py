# SPDX-License-Identifier: Apache-2.0
"""Mean power of a raster along its samples, in blocks of lines so that rasters of any size fit into memory.

Usage: line_profile.py HEADER [LINES_OF_A_BLOCK]
"""

import sys

import numpy as np
import xarray


def main(header, lines="256"):
    data = xarray.open_dataset(header, engine="quo_base", chunks={"line": int(lines)})
    power = (np.abs(data.image) ** 2).mean("sample").compute()
    loudest = int(power.values.argmax())
    print(f"{power.size} lines, mean power {float(power.mean()):.6g}")
    seen = np.ravel(data.azimuth_time.isel(line=loudest).values)[0]  # times may differ along a line
    print(f"the strongest, line {loudest}, seen from {seen} on: {float(power[loudest]):.6g}")


if __name__ == "__main__":
    main(*sys.argv[1:])
