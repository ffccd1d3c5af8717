# SPDX-License-Identifier: Apache-2.0
"""Maps and jobs: places against the array calls, terrain against its geometry, outputs whole or absent."""

import os
import pickle
import re
import subprocess
import sys
import time
import tracemalloc
from functools import partial

import numpy as np
import pytest
import quo_base
from conftest import DATA, SCENES, copy_of_safe, write_model
from quo_base import Job, Product, geocode, run, sentinel1
from quo_base import jobs as jobs_module

rasterio = pytest.importorskip("rasterio")
pyproj = pytest.importorskip("pyproj")
pytest.importorskip("xarray")
LINES, SAMPLES = 600, 2000


def stripes(latitude, longitude):
    return 1.0 + 0.5 * np.cos(2 * np.pi * 120 * latitude) + 0.5 * np.cos(2 * np.pi * 150 * longitude)


@pytest.fixture(scope="module")
def product(tmp_path_factory):
    """A part of a real scene, its amplitudes large near half minutes of latitude and near some of longitude."""
    path = str(tmp_path_factory.mktemp("map") / "image")
    scene = Product(DATA / "scenes" / (SCENES[0] + ".xml"))
    made = scene.clone()
    slow_s, fast_s = 2.0555e-3, 1.5541e-8
    region = {"SlowStartTime": 1167930362.0, "SlowTimeDelta": slow_s, "SlowTimeLength": slow_s * LINES}
    region |= {"FastStartTime": 0.0055, "FastTimeDelta": fast_s, "FastTimeLength": fast_s * SAMPLES}
    region |= {"Lines": LINES, "Samples": SAMPLES}
    made.add("ROI", **region)
    line, sample = np.meshgrid(np.arange(LINES), np.arange(SAMPLES), indexing="ij")
    seen = made.orbit.to_ground(1167930362.0 + 2.0555e-3 * line, 0.0055 + 1.5541e-8 * sample)
    with quo_base.RasterWriter(path, (LINES, SAMPLES), np.float32) as writer:
        writer[:] = stripes(seen.latitude, seen.longitude)
    made.save(path + ".hdr", exact=True)
    return Product(path + ".hdr")


@pytest.fixture
def flat(product, tmp_path):
    """Sea level around the middle of the image."""
    times = product.grid.times(LINES / 2, SAMPLES / 2)
    middle = product.orbit.to_ground(times.azimuth_time, times.range_time)
    corner = (middle.longitude - 0.02, middle.latitude + 0.003)
    return write_model(tmp_path / "flat.tif", np.zeros((60, 400)), corner, 1e-4)


@pytest.mark.parametrize("resampling, most", [("nearest", 0.15), ("bilinear", 0.02), ("sinc", 0.003)])
def test_stripes_of_latitude_and_longitude_are_where_they_belong(product, flat, resampling, most):
    made = geocode(product, flat, resampling=resampling, heights="ellipsoid")
    assert made.image.shape == (60, 400)
    assert np.nanmax(np.abs(made.image.values - stripes(made.y.values[:, np.newaxis], made.x.values))) < most


def test_tiles_are_the_whole_on_any_scheduler_and_travel_small(product, flat):
    wanted = {"quantities": ("image", "line", "mask", "local_incidence", "incidence"), "heights": "ellipsoid"}
    whole, tiles = geocode(product, flat, **wanted), geocode(product, flat, chunks=32, **wanted)
    assert len(pickle.dumps(tiles.image.data.dask)) < 20000
    for name, values in tiles.compute(scheduler="threads").items():
        np.testing.assert_array_equal(values, whole[name])
    assert not whole["mask"].any()
    with rasterio.open(flat, "r+") as file:
        file.write(200 * np.random.default_rng(4).random((60, 400), "f4"), 1)
    rough = [geocode(product, flat, chunks=chunks, **wanted).compute(scheduler="threads") for chunks in (None, 25)]
    for name in wanted["quantities"]:
        np.testing.assert_array_equal(*(each[name] for each in rough), err_msg=name)
    inner = (slice(2, -2), slice(2, -2))  # on flat ground the terrain's normal is the ellipsoid's
    np.testing.assert_allclose(whole.local_incidence[inner], whole.incidence[inner], atol=0.02)


def test_a_ridge_hides_and_overlays_what_its_geometry_says(product, tmp_path):
    """A wall of 300 m across the line of sight: shadow on its far side, layover towards the radar."""
    times = product.grid.times(LINES / 2, SAMPLES / 2)
    middle = product.orbit.to_ground(times.azimuth_time, times.range_time)
    crs = "EPSG:32632"
    east, north = pyproj.Transformer.from_crs("EPSG:4326", crs, always_xy=True).transform(*middle[1::-1])
    x = np.abs(np.arange(200) - 100) * 10.0
    heights = np.repeat(np.maximum(0.0, 300.0 - 3.0 * x)[np.newaxis], 40, axis=0)
    path = write_model(tmp_path / "ridge.tif", heights, (east - 1000, north + 200), 10.0, crs)
    made = geocode(product, path, quantities=["mask", "incidence"], heights="ellipsoid")
    tiles = geocode(product, path, quantities=["mask"], heights="ellipsoid", chunks=16).compute()
    np.testing.assert_array_equal(tiles["mask"], made["mask"])  # what lies outside a tile is seen from it
    row = made["mask"].values[20]
    angle = np.radians(float(made.incidence[20, 100]))
    x, y, z = product.orbit.velocity(times.azimuth_time)
    phi, lam = np.radians(middle[:2])
    to_north = np.cos(phi) * z - np.sin(phi) * (np.cos(lam) * x + np.sin(lam) * y)
    across = np.hypot(to_north, np.cos(lam) * y - np.sin(lam) * x) / to_north  # the ridge runs north
    assert np.sum(row & 2 > 0) * 10 == pytest.approx(300 * np.tan(angle) * across, abs=30)
    assert np.sum(row & 1 > 0) * 10 == pytest.approx(300 / np.tan(angle) * across, abs=60)


def test_heights_of_a_geoid_are_converted_or_refused_and_never_mixed(product, flat, tmp_path):
    with pytest.raises(ValueError, match="does not name"):
        geocode(product, flat)
    sea = geocode(product, flat, quantities=["height"], heights="egm96").height.values
    assert 40 < np.nanmin(sea) and np.nanmax(sea) < 55  # the geoid lies that high in middle Italy
    named = write_model(tmp_path / "named.tif", np.zeros((60, 400)), (11.5, 41.5), 1e-4, "EPSG:4326+5773")
    with pytest.raises(ValueError, match="EGM96"):
        geocode(product, named, heights="ellipsoid")
    with pytest.raises(ValueError, match="no place in common"):
        far = write_model(tmp_path / "far.tif", np.zeros((9, 9)), (150.0, 10.0), 1e-3)
        geocode(product, far, heights="ellipsoid")
    refused = {"spacing": (1e-9, 1e9, -1.0), "crs": ("EPSG:4978",), "resampling": ("cubic",), "heights": ("sea",)}
    refused |= {"quantities": ([], ["height", "slope"]), "chunks": (0,)}
    for wrong in ({name: value} for name, values in refused.items() for value in values):
        with pytest.raises(ValueError):
            geocode(product, flat, **{"heights": "ellipsoid", **wrong})
    with pytest.MonkeyPatch.context() as absent, pytest.raises(ModuleNotFoundError, match="python3-pyproj"):
        absent.setitem(sys.modules, "pyproj", None)
        geocode(product, flat, heights="ellipsoid")
    with rasterio.open(flat, "r+") as file:
        file.transform = rasterio.Affine(1e-4, 2e-5, file.transform.c, 2e-5, -1e-4, file.transform.f)
    with pytest.raises(ValueError, match="along the axes"):
        geocode(product, flat, heights="ellipsoid")


def test_heights_are_what_their_file_means(product, flat, tmp_path):
    with rasterio.open(flat, "r+") as file:
        file.write(np.full((60, 400), 50, "f4"), 1)
        file.scales, file.offsets = (2.0,), (5.0,)
        mask = np.full((60, 400), 255, "u1")
        mask[30, 200] = 0
        file.write_mask(mask)
    made = geocode(product, flat, heights="ellipsoid", quantities=["height", "mask"])
    assert np.isnan(made.height[30, 200]) and made["mask"][30, 200] == 4 and not made["mask"][:, :100].any()
    np.testing.assert_allclose(made.height[:, :100], 105.0, rtol=1e-12)
    corner = rasterio.open(flat).transform[2:6:3]
    solid = write_model(tmp_path / "solid.tif", np.zeros((60, 400)), corner, 1e-4, "EPSG:4979")
    assert not geocode(product, solid, quantities=["height"]).height.any()
    with pytest.raises(ValueError, match="ellipsoid"):
        geocode(product, solid, heights="egm96")
    with rasterio.open(flat, "r+") as file:
        file.units = ("foot",)
    with pytest.raises(ValueError, match="metres"):
        geocode(product, flat, heights="ellipsoid")


@pytest.mark.parametrize("width, turn", [(400, 0.0), (400, 360.0), (3600, 0.0)])
def test_a_map_goes_on_beyond_the_antimeridian(product, flat, tmp_path, width, turn):
    """Turned about the Earth's axis, image and model are the same elsewhere."""
    whole = geocode(product, flat, heights="ellipsoid")
    a, _, west, _, _, north = rasterio.open(flat).transform[:6]
    delta = 180.0 - west - 200.5 * a
    turned, c, s = product.clone(), np.cos(np.radians(delta)), np.sin(np.radians(delta))
    vectors, matrix = product.orbit, np.array([[c, -s, 0], [s, c, 0], [0, 0, 1]])
    moved = vectors.positions @ matrix.T, vectors.velocities @ matrix.T
    turned.orbit = quo_base.Orbit(vectors.first_time, vectors.spacing, *moved)
    turned.save(tmp_path / "turned.hdr", exact=True)
    turned = Product(tmp_path / "turned.hdr", raster=product.path[:-4])
    if width == 400:
        path = write_model(tmp_path / "there.tif", np.zeros((60, 400)), (west + delta - turn, north), a)
        made = geocode(turned, path, heights="ellipsoid")
        np.testing.assert_allclose(made.image, whole.image, atol=1e-4)
    else:
        path = write_model(tmp_path / "round.tif", np.zeros((1800, 3600)), (-180.0, 90.0), 0.1)
        made = geocode(turned, path, spacing=a, heights="ellipsoid", chunks=400)
        x, y = whole.x.values + delta, whole.y.values
        near = made.image.sel(x=x[5:-5], y=y[5:-5], method="nearest")
        assert made.x.size < 4000 and np.isfinite(near).all()


def check_real_terrain(product):
    """A map over measured heights: against the array calls at heights taken pixel by pixel, and against
    the one tie point that lies there, from which its terrain differs by metres."""
    path = DATA / "sentinel1" / "dem" / "rome_30m.tif"
    made = geocode(product, path, quantities=["line", "sample", "height"])
    with rasterio.open(path) as file:
        row, column = np.random.default_rng(2).integers(0, 120, (2, 50))
        longitude, latitude = (np.array(each) for each in file.xy(row, column))
        above_sea = file.read(1)[row, column].astype(float)
    geoid = pyproj.Transformer.from_crs("EPSG:4326+5773", "EPSG:4979", always_xy=True)
    height = geoid.transform(longitude, latitude, above_sea)[2]
    seen = product.orbit.to_radar(latitude, longitude, height)
    there = product.grid.pixels(*seen[:2])
    assert made.height.shape == (120, 120) and np.ptp(height) > 20
    expectations = (("height", height, 1e-4), ("line", there.line, 1e-3), ("sample", there.sample, 1e-3))
    for name, expected, most in expectations:
        np.testing.assert_allclose(made[name].values[row, column], expected, rtol=0, atol=most)
    line, sample, latitude, longitude, height, incidence = 8020, 22202, 42.00620382, 12.49345628, 93.9934, 44.0716
    here = made.interp(x=longitude, y=latitude)
    nearer = (float(here.height) - height) / np.tan(np.radians(incidence)) / 10.0  # samples of 10 m
    assert abs(float(here.height) - height) < 15
    assert (float(here["line"]), float(here["sample"]) + nearer) == pytest.approx((line, sample), abs=0.1)


def test_tie_points_of_a_real_ground_range_image_lie_on_their_pixels(tmp_path):
    """On slopes that go through each tie point's height: what its producer states, from the whole chain."""
    name = "S1B_IW_GRDH_1SDV_20211223T051122_20211223T051147_030148_039993_5371.SAFE"
    folder, annotation = copy_of_safe(name, tmp_path, 16705, 30, 26102)
    product = sentinel1.import_product(folder, tmp_path / "image").product
    product.RasterInfo.NrOfPixelsPerLine = 26102  # no samples are read
    product.save(exact=True)
    check_real_terrain(product)
    tags = ("line", "pixel", "latitude", "longitude", "height")
    stated = np.array([re.findall(f"<{tag}>([0-9.e+-]+)</{tag}>", annotation)[-20:] for tag in tags], float).T
    slope = np.add.outer(np.arange(-4, 5), 2 * np.arange(-4, 5))
    for line, sample, latitude, longitude, height in stated:
        corner = (longitude - 4.5e-4, latitude + 4.5e-4)
        model = write_model(tmp_path / "slope.tif", height + slope, corner, 1e-4)
        made = geocode(product, model, quantities=["line", "sample"], heights="ellipsoid")
        here = made.sel(x=longitude, y=latitude, method="nearest")
        assert (float(here["line"]), float(here["sample"])) == pytest.approx((line, sample), abs=0.02)


def test_memory_is_that_of_a_tile_not_of_the_map(product, flat):
    def peak(chunks):
        tracemalloc.start()
        geocode(product, flat, heights="ellipsoid", chunks=chunks).image.mean().compute(scheduler="synchronous")
        held = tracemalloc.get_traced_memory()[1]
        tracemalloc.stop()
        return held

    peak(400)  # loads modules
    assert peak(50) < 0.4 * peak(400)


def test_files_and_clusters_that_go_are_told(product, flat, tmp_path, monkeypatch):
    copy = str(tmp_path / "copy.hdr")
    Product(product.path).save(copy)
    tiles = geocode(Product(copy, raster=product.path[:-4]), flat, heights="ellipsoid", chunks=64)
    assert tiles.image.mean().compute(scheduler="synchronous") == pytest.approx(1, abs=0.5)
    monkeypatch.chdir(tmp_path)
    changed = Product("copy.hdr", raster=product.path[:-4])
    there = geocode(changed, "flat.tif", heights="ellipsoid", chunks="auto").image  # names without a folder
    assert there.data.npartitions == 1 and there.data.name != tiles.image.data.name
    monkeypatch.chdir("/")
    one, other = (each.compute(scheduler="synchronous") for each in (there, tiles.image))
    np.testing.assert_array_equal(one, other)
    monkeypatch.chdir(tmp_path)
    os.utime(flat, (1, 1))  # a model that has changed makes other tiles
    assert geocode(changed, flat, heights="ellipsoid", chunks=64).image.data.name != tiles.image.data.name
    changed.SamplingConstants.prf_hz *= 1.001
    with pytest.raises(ValueError, match="save"):
        geocode(changed, flat, heights="ellipsoid")
    os.remove(flat)
    with pytest.raises(rasterio.errors.RasterioIOError, match="flat.tif"):
        tiles.compute(scheduler="synchronous")
    os.remove(copy)
    with pytest.raises(quo_base.Error, match="copy.hdr"):
        tiles.compute(scheduler="synchronous")
    distributed = pytest.importorskip("distributed")
    with distributed.Client(processes=False, n_workers=1, dashboard_address=None) as client:
        pass
    with pytest.raises(Exception, match="client|Client|losed"):
        run([Job(str(tmp_path / "none"), _write, ("text",))], client, progress=None)
    assert os.listdir(tmp_path) == []


def _write(path, text, fail_once=None):
    with open(path, "w") as file:
        file.write(text)
    if fail_once and not os.path.exists(fail_once):
        open(fail_once, "w").close()
        raise OSError("once")


def _slowly(path, text):
    time.sleep(0.01)
    _write(path, text)


def _kill_once(path, mark):
    _write(path, "half")
    if not os.path.exists(mark):
        open(mark, "w").close()
        os._exit(1)
    _write(path, "whole")


def _kill_once_within(tile, mark):
    if not os.path.exists(mark):
        open(mark, "w").close()
        os._exit(1)
    return tile


def test_outputs_appear_whole_or_not_at_all(tmp_path):
    jobs = [Job(str(tmp_path / str(i)), _write, (str(i),)) for i in range(5)]
    jobs.append(Job(str(tmp_path / "again"), _write, ("again", str(tmp_path / "mark"))))
    jobs.append(Job(str(tmp_path / "never"), _write, ()))
    jobs.append(Job(str(tmp_path / "ends"), sys.exit))
    jobs.append(Job(str(tmp_path / "nothing"), partial(max, "a")))
    outcomes = run(jobs, progress=None)
    assert [outcome.state for outcome in outcomes] == ["made"] * 6 + ["failed"] * 3
    for outcome, reason in zip(outcomes[6:], ("TypeError", "SystemExit", "has made nothing")):
        assert reason in outcome.reason
    assert sorted(os.listdir(tmp_path)) == ["0", "1", "2", "3", "4", "again", "mark"]
    assert [outcome.state for outcome in run(jobs[:6], progress=None)] == ["skipped"] * 6
    with pytest.raises(ValueError):
        run([jobs[0], jobs[0]._replace(output=str(tmp_path / "x" / ".." / "0"))])


def test_only_what_this_run_or_a_dead_one_has_begun_is_swept(tmp_path):
    host, mine = jobs_module._host(), f"{os.getpid():08x}"
    dead = subprocess.Popen(["true"])
    dead.wait()
    out = str(tmp_path / "out")
    stay = [".part-1", ".part-" + "g" * 32]
    stay += [f".part-{host}{mine}{0:016x}", f".part-{'0' * 8}{dead.pid:08x}{0:016x}"]
    output_too = f".part-{host}{dead.pid:08x}{1:016x}"
    for tail in (*stay, output_too, f".part-{host}{dead.pid:08x}{0:016x}"):
        _write(out + tail, "")
    jobs = [Job(out, _write, ("text",)), Job(out + output_too, _write, ("text",))]
    assert [outcome.state for outcome in run(jobs, progress=None)] == ["made", "skipped"]
    assert sorted(os.listdir(tmp_path)) == sorted("out" + tail for tail in ("", output_too, *stay))


def test_what_progress_raises_ends_the_run(tmp_path):
    def stop(*_):
        raise KeyboardInterrupt

    jobs = [Job(str(tmp_path / str(i)), _slowly, ("",)) for i in range(200)]
    with pytest.raises(KeyboardInterrupt) as raised:
        run(jobs, progress=stop)
    made = os.listdir(tmp_path)
    assert 0 < len(made) < 200
    time.sleep(0.1)
    assert os.listdir(tmp_path) == made and raised.tb  # which holds all that ran


def test_a_killed_worker_leaves_nothing_half(tmp_path, product, flat):
    distributed = pytest.importorskip("distributed")
    jobs = [Job(str(tmp_path / str(i)), _write, (str(i),)) for i in range(6)]
    jobs.append(Job(str(tmp_path / "killed"), _kill_once, (str(tmp_path / "mark"),)))
    whole = geocode(product, flat, heights="ellipsoid").image.values
    with distributed.LocalCluster(n_workers=2, threads_per_worker=1, dashboard_address=None) as cluster:
        with distributed.Client(cluster) as client:
            assert all(outcome.state != "failed" for outcome in run(jobs, client, progress=None))
            tiles = geocode(product, flat, heights="ellipsoid", chunks=100).image
            mark = str(tmp_path / "again")
            meta = np.empty((0, 0), "f4")
            tiles = tiles.data.map_blocks(_kill_once_within, mark, dtype=tiles.dtype, meta=meta).compute()
    assert os.path.exists(mark) and (tmp_path / "killed").read_text() == "whole"
    assert not [name for name in os.listdir(tmp_path) if ".part-" in name]
    np.testing.assert_array_equal(tiles, whole)
