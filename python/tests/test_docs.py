# SPDX-License-Identifier: Apache-2.0
import re
import sys
from pathlib import Path

import numpy as np
import pytest
from conftest import DATA, write_model
from quo_base import Product, RasterWriter

ROOT = DATA.parent.parent
LINES, SAMPLES = 400, 1000


def make_scene(scene_file):
    """A product scene.hdr of speckle through which parallels and meridians run at every hundredth of a degree, and
    a model of flat ground in it, dem.tif; its samples."""
    product = Product(scene_file)
    product.ROI.update(Lines=LINES, Samples=SAMPLES)
    times = product.grid.times(np.arange(LINES)[:, np.newaxis], np.arange(SAMPLES))
    seen = product.orbit.to_ground(times.azimuth_time, times.range_time)
    off = [np.abs(each / 0.01 - np.rint(each / 0.01)) for each in seen[:2]]
    speckle = np.random.default_rng(3).normal(size=(LINES, SAMPLES, 2)).astype("f4").view("c8")[..., 0]
    samples = speckle * (1 + 9 * (np.minimum(*off) < 0.03)).astype("f4")
    with RasterWriter("scene", samples.shape, "c8") as image:
        image[:] = samples
    product.add("RasterInfo", **Product("scene.hdr").RasterInfo)
    product.save("scene.hdr")
    middle = [float(each[LINES // 2, SAMPLES // 2]) for each in seen[:2]]
    write_model("dem.tif", np.zeros((300, 300)), (middle[1] - 0.015, middle[0] + 0.015), 1e-4)
    return samples


def blocks_of(page):
    return re.findall(r"```python\n(.*?)```", (ROOT / page).read_text(), re.DOTALL)


def test_the_page_of_names_is_that_of_the_package(monkeypatch):
    monkeypatch.syspath_prepend(ROOT / "scripts")
    import python_names

    assert (ROOT / "docs" / "python_names.md").read_text() == python_names.page()


def draw_a_map_of_islands(scene_map, folder):
    import elevation_model
    import make_map

    rows = ["name,latitude_deg,longitude_deg,height_m"]
    at = (60, 150, 240)
    rows += [f"{i}{j},{scene_map.y.values[i]},{scene_map.x.values[j]},30" for i in at for j in at]
    (folder / "places.csv").write_text("\n".join(rows))
    elevation_model.main("places.csv", "islands.tif")
    make_map.main("scene.hdr", "islands.tif", "places.csv", "islands.png")
    assert (folder / "islands.png").stat().st_size > 1e4


def test_the_examples_of_the_page_run(scene_file, tmp_path, monkeypatch, capsys):
    rasterio = pytest.importorskip("rasterio")
    distributed = pytest.importorskip("distributed")
    for module in ("pyproj", "matplotlib"):
        pytest.importorskip(module)
    monkeypatch.chdir(tmp_path)
    samples = make_scene(scene_file)
    names: dict = {}
    for block in blocks_of("docs/python.md"):
        exec(block, names)
    for name in ("scene", "scene.hdr"):
        Path(name.replace("scene", "cut")).symlink_to(name)  # what the tutorial cuts out
    shown: dict = {}
    for block in blocks_of("README.md") + blocks_of("docs/tutorial.md"):
        exec(block, shown)
    assert shown["ground"].status.sum() == 0 and shown["scene_map"].image.shape == (300, 300)
    assert np.array_equal(names["block"], samples[100:150, ::2]) and names["seen"].status.sum() == 0
    assert names["scene_map"]["image"].shape == (300, 300) and names["power"].shape == (LINES,)
    assert [each.state for each in names["outcomes"]] == ["made"] and names["fit"].rank == 3
    assert (tmp_path / "maps.png").stat().st_size > 1e4
    monkeypatch.syspath_prepend(ROOT / "examples" / "python")
    import geolocate
    import line_profile
    import maps_on_workers

    capsys.readouterr()
    geolocate.main("scene.hdr")
    line_profile.main("scene.hdr", "64")
    told = capsys.readouterr().out
    power = np.mean(np.abs(samples) ** 2)
    assert told.count("incidence") == 5 and f"{LINES} lines, mean power {power:.4g}"[:-1] in told
    maps_on_workers.make_map("map.tif", "scene.hdr", "dem.tif")
    monkeypatch.setattr("sys.argv", ["", "dem.tif", ".", "scene.hdr", "--scheduler"])
    with distributed.LocalCluster(n_workers=1, processes=False, dashboard_address=None) as cluster:
        sys.argv.append(cluster.scheduler_address)
        assert maps_on_workers.main() == 0
    assert (tmp_path / "scene.tif").read_bytes() == (tmp_path / "map.tif").read_bytes()
    draw_a_map_of_islands(names["scene_map"], tmp_path)
    assert "9 places; the brightest" in capsys.readouterr().out
    with rasterio.open("map.tif") as file:
        assert np.array_equal(file.read(1), names["scene_map"].image, equal_nan=True)
