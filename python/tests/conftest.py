"""What the tests share: the bundled scenes and their tie points."""

import os
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
