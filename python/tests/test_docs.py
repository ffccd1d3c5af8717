import re
from pathlib import Path

import numpy as np
from conftest import DATA, write_model
from quo_base import Product, RasterWriter

PAGE = DATA.parent.parent / "docs" / "python.md"


def test_the_examples_of_the_page_run(scene_file, tmp_path, monkeypatch):
    monkeypatch.chdir(tmp_path)
    samples = np.arange(200 * 300).reshape(200, 300).astype("c8")
    with RasterWriter(Path("scene"), samples.shape, "c8") as image:
        image[:] = samples
    product = Product(scene_file)
    product.add("RasterInfo", **Product("scene.hdr").RasterInfo)
    product.ROI.update(Lines=200, Samples=300)
    product.save("scene.hdr")
    times = product.grid.times(100, 150)
    middle = product.orbit.to_ground(times.azimuth_time, times.range_time)
    write_model("dem.tif", np.zeros((40, 80)), (middle.longitude - 0.004, middle.latitude + 0.002), 1e-4)
    names: dict = {}
    for block in re.findall(r"```python\n(.*?)```", PAGE.read_text(), re.DOTALL):
        exec(block, names)
    assert np.array_equal(names["block"], samples[100:150, ::2]) and names["seen"].status.sum() == 0
    assert names["scene_map"]["image"].shape == (40, 80) and [each.state for each in names["outcomes"]] == ["made"]
    assert names["power"].shape == (200,) and names["fit"].rank == 3
