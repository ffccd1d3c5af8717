# SPDX-License-Identifier: Apache-2.0
import re
import subprocess
import sys
from pathlib import Path

import numpy as np
import pytest
import quo_base
from conftest import DATA

ROOT = DATA.parent.parent
LINES, SAMPLES = 800, 3000


def follow_the_tutorial():
    """The product cut.hdr and the elevation model dem.tif, by the tutorial's own commands."""
    build = Path(quo_base.__file__).parents[2]
    if not (build / "tools" / "quo" / "quo").exists():
        pytest.skip("needs the tool and the examples")
    named = re.search("^export PATH=.*$", (ROOT / "docs" / "README.md").read_text(), re.MULTILINE)[0]
    typed = r"^\$ ((?:cp|make_measurement|quo import|quo convert|gdal_create) .*)$"
    commands = re.findall(typed, (ROOT / "docs" / "tutorial.md").read_text(), re.MULTILINE)
    script = [f"sources='{ROOT}' build='{build}'", named, *commands]
    subprocess.run(["sh", "-ec", "\n".join(script)], check=True)


def blocks_of(page):
    return re.findall(r"```python\n(.*?)```", (ROOT / page).read_text(), re.DOTALL)


def test_the_page_of_names_is_that_of_the_package(monkeypatch):
    monkeypatch.syspath_prepend(ROOT / "scripts")
    import python_names

    assert (ROOT / "docs" / "python_names.md").read_text() == python_names.page()


def draw_a_map_of_islands(cut_map, folder):
    import elevation_model
    import make_map

    rows = ["name,latitude_deg,longitude_deg,height_m"]
    rows += [
        f"{i}{j},{cut_map.y.values[i]},{cut_map.x.values[j]},30" for i in (300, 320, 340) for j in (430, 450, 470)
    ]
    (folder / "places.csv").write_text("\n".join(rows))
    elevation_model.main("places.csv", "islands.tif")
    make_map.main("cut.hdr", "islands.tif", "places.csv", "islands.png")
    assert (folder / "islands.png").stat().st_size > 1e4


def test_the_examples_of_the_page_run(scene_file, tmp_path, monkeypatch, capsys):
    rasterio = pytest.importorskip("rasterio")
    distributed = pytest.importorskip("distributed")
    for module in ("pyproj", "matplotlib"):
        pytest.importorskip(module)
    monkeypatch.chdir(tmp_path)
    follow_the_tutorial()
    samples = np.fromfile("cut", "<i2").reshape(LINES, SAMPLES, 2).astype("f4").view("c8")[..., 0]
    names: dict = {}
    for block in blocks_of("docs/python.md"):
        exec(block, names)
    Path("scene.xml").symlink_to(scene_file)
    for block in blocks_of("docs/polynomials.md") + blocks_of("docs/recipes.md"):
        exec(block, {})
    assert np.array_equal(names["block"], samples[100:150, ::2]) and names["seen"].status.sum() == 0
    assert names["cut_map"]["image"].shape == (644, 900) and [each.state for each in names["outcomes"]] == ["made"]
    assert names["power"].shape == (LINES,) and names["fit"].rank == 3
    assert (tmp_path / "maps.png").stat().st_size > 1e4
    monkeypatch.syspath_prepend(ROOT / "examples" / "python")
    import geolocate
    import line_profile
    import maps_on_workers

    capsys.readouterr()
    geolocate.main("cut.hdr")
    line_profile.main("cut.hdr", "64")
    told = capsys.readouterr().out
    assert told.count("incidence") == 5
    assert f"{LINES} lines, mean power {np.mean(np.abs(samples) ** 2):.0f}"[:-1] in told
    maps_on_workers.make_map("map.tif", "cut.hdr", "dem.tif")
    monkeypatch.setattr("sys.argv", ["", "dem.tif", ".", "cut.hdr", "--scheduler"])
    with distributed.LocalCluster(n_workers=1, processes=False, dashboard_address=None) as cluster:
        sys.argv.append(cluster.scheduler_address)
        assert maps_on_workers.main() == 0
    assert (tmp_path / "cut.tif").read_bytes() == (tmp_path / "map.tif").read_bytes()
    draw_a_map_of_islands(names["cut_map"], tmp_path)
    assert "9 places; the brightest" in capsys.readouterr().out
    with rasterio.open("map.tif") as file:
        assert np.array_equal(file.read(1), names["cut_map"].image, equal_nan=True)
