#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Kills processes that save a header, a parameter file, a raster with its description, a picture and, where the Python
# package is built, a map, over and over, at any moment: each file is then old or new, and the next save sweeps what was
# left.
# Usage: scripts/check_kill.sh BUILD_FOLDER [TIMES]
set -eu
times=${2:-300}
QUO_KILLS=$times "$1/tests/faults/faults_test" --gtest_brief=1 --gtest_filter='Kill.*'
[ -d "$1/python/quo_base" ] || exit 0
PYTHONPATH=$1/python /usr/bin/python3 - "$times" <<'PROGRAM'
import os, random, signal, sys, tempfile, time

import numpy, rasterio
from quo_base import Job, run

LINES, SAMPLES = 600, 500
heights = numpy.arange(LINES * SAMPLES, dtype="float32").reshape(LINES, SAMPLES)


def make_map(path):
    place = rasterio.transform.from_origin(11.5, 41.5, 1e-4, 1e-4)
    shape = {"height": LINES, "width": SAMPLES, "count": 1, "dtype": "float32", "compress": "deflate"}
    with rasterio.open(path, "w", driver="GTiff", crs="EPSG:4326", transform=place, **shape) as file:
        for line in range(0, LINES, 50):
            file.write(heights[line:line + 50], 1, window=((line, line + 50), (0, SAMPLES)))


def start(jobs):
    child = os.fork()
    if child == 0:
        run(jobs, progress=None)
        os._exit(0)
    return child


with tempfile.TemporaryDirectory() as folder:
    output = os.path.join(folder, "map.tif")
    jobs = [Job(output, make_map)]
    begun = time.monotonic()
    os.waitpid(start(jobs), 0)
    took_s = time.monotonic() - begun
    os.remove(output)
    whole = 0
    for moment in range(int(sys.argv[1])):
        child = start(jobs)
        time.sleep(random.Random(moment).uniform(0.0, 1.3 * took_s))
        os.kill(child, signal.SIGKILL)
        os.waitpid(child, 0)
        found = os.path.exists(output)
        whole += found
        state = run(jobs, progress=None)[0].state
        with rasterio.open(output) as file:
            same = numpy.array_equal(file.read(1), heights)
        if not same or state != ("skipped" if found else "made") or os.listdir(folder) != ["map.tif"]:
            sys.exit(f"check_kill.sh: moment {moment}: {state}, {os.listdir(folder)}")
        os.remove(output)
    print(f"maps: {whole} whole, the others absent")
PROGRAM
