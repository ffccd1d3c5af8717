# SPDX-License-Identifier: Apache-2.0
"""What the tests share: the bundled scenes and their tie points."""

import os
import shutil
import struct
from pathlib import Path

import numpy as np
import pytest

DATA = Path(os.environ["QUO_TEST_DATA"])
SCENES = ["s1a_iw1_slc_20220104_asc", "s1a_iw_grd_20201127_desc_sea", "uavsar_winnipeg_20120717_left"]


@pytest.fixture
def scene_file():
    return DATA / "scenes" / (SCENES[0] + ".xml")


def tie_points(scene):
    """Azimuth time, range time, latitude, longitude, height of the producer's points."""
    lines = (DATA / "scenes" / (scene + "_tie_points.csv")).read_text().splitlines()
    rows = [line.split(",")[:5] for line in lines if line[0].isdigit()]
    return np.array(rows, np.float64).T


def write_model(path, heights, corner, step, crs="EPSG:4326"):
    """An elevation model whose north-west corner is told."""
    import rasterio

    rows, columns = heights.shape
    shape = {"height": rows, "width": columns, "count": 1, "dtype": "float32"}
    transform = rasterio.transform.from_origin(*corner, step, step)
    with rasterio.open(path, "w", driver="GTiff", crs=crs, transform=transform, **shape) as file:
        file.write(heights.astype(np.float32), 1)
    return path


def write_sparse_tiff(path, lines, samples, complex_samples):
    """Integers of 16 bits, in pairs or alone, in one strip, all zero and none of them on the disk."""
    size, kind = lines * samples * (4 if complex_samples else 2), 5 if complex_samples else 1
    bits = 32 if complex_samples else 16
    tags = [(256, samples), (257, lines), (258, bits), (259, 1), (262, 1), (273, 8), (277, 1)]
    tags += [(278, lines), (279, size), (339, kind)]
    with open(path, "wb") as file:
        file.write(struct.pack("<2sHI", b"II", 42, 8 + size))
        file.seek(8 + size)
        file.write(struct.pack("<H", len(tags)))
        file.write(b"".join(struct.pack("<HHII", tag, 4, 1, value) for tag, value in tags) + bytes(4))


def copy_of_safe(name, folder, lines, samples, stated_samples):
    """A bundled product in a folder, with a measurement of fewer samples than it states, and the annotation."""
    shutil.copytree(DATA / "sentinel1" / name, folder / name)
    annotation = next((folder / name / "annotation").iterdir())
    text = annotation.read_text()
    annotation.write_text(text.replace(f"<numberOfSamples>{stated_samples}<", f"<numberOfSamples>{samples}<"))
    (folder / name / "measurement").mkdir(exist_ok=True)
    write_sparse_tiff(folder / name / "measurement" / (annotation.stem + ".tiff"), lines, samples, "SLC" in name)
    return folder / name, text
