# SPDX-License-Identifier: Apache-2.0
import os

import numpy as np
import pytest
from conftest import DATA, SCENES, copy_of_safe, tie_points
from quo_base import FileError, sentinel1

NAME = "S1A_IW_SLC__1SDV_20220104T170557_20220104T170624_041314_04E951_F1F1.SAFE"
LINES, SAMPLES = 4503, 22694


@pytest.fixture
def safe(tmp_path):
    return copy_of_safe(NAME, tmp_path, LINES, SAMPLES, SAMPLES)[0]


def test_an_imported_product_meets_its_tie_points(safe, tmp_path, monkeypatch, capsys):
    product, linked, ties = sentinel1.import_product(safe, tmp_path / "image.slc", link=True)
    assert linked and product.raster.shape == (LINES, SAMPLES) and product.grid.bursts == 3
    assert ties.most_line < 0.05 and ties.most_sample < 0.05 and ties.most_ground_m < 1.0
    azimuth, slant, *place = tie_points(SCENES[0])
    seen = product.orbit.to_radar(*place)
    inside = azimuth < product.orbit.first_time + 65
    np.testing.assert_allclose(seen.azimuth_time[inside], azimuth[inside], rtol=0, atol=2.5e-6)
    pixels = product.grid.pixels(seen.azimuth_time, seen.range_time)
    known = pixels.status == 0
    back = product.grid.times(pixels.line[known], pixels.sample[known])
    np.testing.assert_allclose(back.range_time, slant[known], rtol=0, atol=1e-12)
    assert not product.raster[4000, ::1000].any()
    monkeypatch.syspath_prepend(DATA.parent.parent / "examples" / "python")
    import geolocate

    geolocate.main(tmp_path / "image.slc.hdr")  # lines of the raster, of which bursts that overlap have more
    assert f"line {LINES - 1:8.1f}, sample {SAMPLES - 1:8.1f}:" in capsys.readouterr().out


def test_what_the_progress_raises_ends_the_import(safe, tmp_path):
    def stop(done, everything):
        raise KeyboardInterrupt

    with pytest.raises(KeyboardInterrupt):
        sentinel1.import_product(safe, tmp_path / "image.slc", progress=stop)
    with pytest.raises(FileError) as caught:
        sentinel1.import_product(tmp_path / "absent", tmp_path / "image.slc")
    assert "absent" in str(caught.value) and os.listdir(tmp_path) == [NAME]
