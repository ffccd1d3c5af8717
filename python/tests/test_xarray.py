# SPDX-License-Identifier: Apache-2.0
import pickle

import numpy as np
import pytest
from quo_base import Product, RasterWriter, times

xarray = pytest.importorskip("xarray")
EPOCH = 1167930358.0


def made(folder, **grid):
    """A product of 12 lines of 10 samples, whose pixels count up."""
    samples = np.arange(120, dtype=np.float32).reshape(12, 10)
    with RasterWriter(folder / "image", samples.shape, "f4") as image:
        image[:] = samples
    product = Product(folder / "image.hdr")
    steps = dict(Epoch_s=EPOCH, FirstLine_s=0.25, LineStep_s=0.002, FirstSample_s=0.005, SampleStep_s=1e-8)
    product.add("ImageGrid", **{**steps, **grid})
    product.add("SamplingConstants", prf_hz=1717.25)
    product.save(exact=True)
    return samples, folder / "image.hdr"


@pytest.mark.parametrize("chunks", [None, {"line": 5, "sample": 4}])
def test_a_product_is_a_data_set(tmp_path, chunks):
    samples, file = made(tmp_path)
    data = pickle.loads(pickle.dumps(xarray.open_dataset(file, engine="quo_base", chunks=chunks)))
    assert data.image.dims == ("line", "sample") and data.attrs["SamplingConstants.prf_hz"] == 1717.25
    keys = [dict(line=3), dict(line=slice(8, 2, -2), sample=slice(1, None, 3)), dict(line=[7, 2], sample=[0, 9])]
    for key in keys:
        plain = xarray.DataArray(samples, dims=("line", "sample")).isel(key)
        assert np.array_equal(data.image.isel(key), plain), key
    assert data.image.sum().compute() == samples.sum()
    assert data.azimuth_time.dims == ("line",) and data.slant_range_time.dims == ("sample",)
    assert data.azimuth_time.values[3] == times.to_datetime64(EPOCH + 0.25 + 3 * 0.002)
    assert data.slant_range_time.values[7] == pytest.approx(0.005 + 7e-8, abs=1e-18)


def test_times_that_change_along_both_axes_are_made_when_asked_for(tmp_path):
    slant_of_ground = np.zeros((2, 12))
    slant_of_ground[:, :2] = [[800000.0, 0.5], [800100.0, 0.5]]
    lists = dict(GroundLists=2, GroundTime_s=[0.25, 0.27], GroundToSlant=slant_of_ground)
    _, file = made(tmp_path, SampleStep_s=0.0, GroundStep_m=10.0, DelayShare=0.5, DelayReference_s=0.005, **lists)
    data = xarray.open_dataset(file, engine="quo_base")
    assert data.slant_range_time.dims == data.azimuth_time.dims == ("line", "sample")
    line = data.isel(line=11)
    expected = (800100.0 + 0.5 * 10.0 * np.arange(10)) * 2 / 299792458.0
    np.testing.assert_allclose(line.slant_range_time, expected, rtol=1e-14)
    assert np.array_equal(data.slant_range_time[:, 4].values, data.slant_range_time.values[:, 4])
    pixels = Product(file).grid.pixels(data.azimuth_time.values, data.slant_range_time.values)
    np.testing.assert_allclose(pixels.line, np.repeat(np.arange(12.0)[:, None], 10, 1), atol=2e-4)


def test_arguments_of_the_engine(tmp_path, monkeypatch):
    samples, file = made(tmp_path)
    data = xarray.open_dataset(file, drop_variables="azimuth_time", dtype="f8", engine="quo_base")
    assert data.image.dtype == np.float64 and "azimuth_time" not in data.coords
    assert np.array_equal(xarray.open_dataset(file).image, samples)
    monkeypatch.setattr("quo_base.xarray_engine._BLOCK_LINES", 3)
    data = xarray.open_dataset(file, chunks={})
    assert data.image.chunks == ((3, 3, 3, 3), (10,))  # whole lines
    pytest.importorskip("scipy")
    data.to_netcdf(tmp_path / "image.nc", engine="scipy")
    with xarray.open_dataset(tmp_path / "image.nc", engine="scipy") as copy:
        assert copy.image.equals(data.image) and copy.attrs["SamplingConstants.prf_hz"] == 1717.25
    (tmp_path / "other.hdr").write_text("ENVI\n")
    with pytest.raises(ValueError):
        xarray.open_dataset(tmp_path / "other.hdr")
