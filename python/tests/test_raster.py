# SPDX-License-Identifier: Apache-2.0
import os
import pickle
from concurrent.futures import ThreadPoolExecutor

import numpy as np
import pytest
from quo_base import FileError, Product, Raster, RasterWriter, Refused

PAIR = np.dtype([("real", "i2"), ("imag", "i2")])
KINDS = ["c8", "f4", "c16", "f8", "i4", "i2", "i1", PAIR]
KEYS = np.s_[2, 3], np.s_[-1], np.s_[..., 1], np.s_[:, 1:4], np.s_[::-2, ::3], np.s_[3:3], np.s_[5:2:-1, -2::-1]


def made(folder, kind="f4", shape=(9, 6), **layout):
    values = (np.random.default_rng(7).normal(size=(*shape, 2)) * 40).astype(np.float64)
    if np.dtype(kind) == PAIR:
        samples = np.empty(shape, PAIR)
        samples["real"], samples["imag"] = values[..., 0].astype("i2"), values[..., 1].astype("i2")
    elif np.dtype(kind).kind == "c":
        samples = values.view(np.complex128)[..., 0].astype(kind)
    else:
        samples = values[..., 0].astype(kind)
    with RasterWriter(folder / "image", shape, kind, **layout) as image:
        image[5:, :] = samples[5:]
        image[:5] = samples[:5]
    return samples


@pytest.mark.parametrize("layout", [{}, dict(byte_order="big", row_prefix=5)], ids=["plain", "prefixed"])
@pytest.mark.parametrize("kind", KINDS, ids=str)
def test_slices_are_those_of_the_array(tmp_path, kind, layout):
    samples = made(tmp_path, kind, **layout)
    raster = pickle.loads(pickle.dumps(Raster(tmp_path / "image", dtype=kind)))
    for key in KEYS:
        assert np.array_equal(raster[key], samples[key]), key
    assert (raster.shape, raster.dtype, raster.stored_dtype) == (samples.shape, np.dtype(kind), np.dtype(kind))
    if kind == PAIR:
        assert np.array_equal(np.asarray(Raster(tmp_path / "image")), samples["real"] + 1j * samples["imag"])


def test_written_blocks_are_converted(tmp_path):
    samples = made(tmp_path, "i2")
    raster = Raster(tmp_path / "image")
    raster[2:4, 1] = [1.5, -1e9]
    raster[0] = 7
    samples[2:4, 1], samples[0] = [2, -32768], 7
    assert np.array_equal(raster, samples) and raster.astype("f8")[2, 1] == 2.0
    assert np.array_equal(raster.read_into(np.empty((3, 2)), 2, 1), samples[2:5, 1:3])
    with RasterWriter(tmp_path / "image", (1, 6), "i2") as image:  # as Raster[...] = does
        image[0] = [1.5, -2.5, 0.49999999999999994, 1e9, -40000, np.nan]
    assert Raster(tmp_path / "image")[0].tolist() == [2, -3, 0, 32767, -32768, 0]
    Raster(tmp_path / "image")[0] = np.array([2**40, -(2**40), 1, 2, 3, 4])
    assert Raster(tmp_path / "image")[0, :3].tolist() == [32767, -32768, 1]
    made(tmp_path, "c8", byte_order="big")
    Raster(tmp_path / "image")[8, 2:4] = np.ma.array([5.0, 6.0], mask=[True, False])
    assert np.isnan(Raster(tmp_path / "image")[8, 2]) and Raster(tmp_path / "image")[8, 3] == 6
    assert Raster(tmp_path / "image").astype(">c8")[8, 3] == 6  # slices have the machine's order
    Raster(tmp_path / "image")[8, 4:] = np.array([3, 4], "i2")
    assert Raster(tmp_path / "image")[8, 4:].tolist() == [3, 4]
    raster = Raster(tmp_path / "image")
    read_only = np.zeros((2, 2))
    read_only.flags.writeable = False
    for out in (read_only, np.zeros((2, 4))[:, ::2], np.zeros((2, 2), ">f8"), np.zeros(4), np.zeros((2, 7))):
        with pytest.raises(ValueError):
            raster.read_into(out)
        assert not out.any()


def test_nothing_is_read_before_it_is_asked_for(tmp_path, monkeypatch):
    samples = made(tmp_path)
    os.truncate(tmp_path / "image", samples.nbytes - 1)
    monkeypatch.chdir(tmp_path)
    product = pickle.loads(pickle.dumps(Product("image.hdr")))  # to other folders, too
    raster = pickle.loads(pickle.dumps(Raster("image")))
    assert (product.path, raster.path) == (str(tmp_path / "image.hdr"), str(tmp_path / "image"))
    raster = product.raster
    assert np.array_equal(raster[:8], samples[:8])
    with pytest.raises(FileError) as caught:
        raster[8]
    assert caught.value.status == 4
    os.remove(tmp_path / "image")
    with pytest.raises(FileError, match=str(tmp_path / "image")):
        raster[0]
    with Product(tmp_path / "image.hdr") as product, product.raster as raster:
        assert raster.shape == samples.shape
    for doing in (lambda: raster[0], lambda: raster.shape, lambda: product.raster, lambda: list(product)):
        with pytest.raises(ValueError, match="closed"):
            doing()
    assert "absent" in repr(Raster("absent"))


def test_threads_share_a_raster(tmp_path):
    samples = made(tmp_path, "c8", (400, 300))
    raster = Raster(tmp_path / "image")
    with ThreadPoolExecutor(8) as threads:
        lines = list(threads.map(lambda line: raster[line], range(400)))
    assert np.array_equal(lines, samples)


@pytest.mark.parametrize(
    "refused, doing",
    [
        (IndexError, lambda raster: raster[9]),
        (IndexError, lambda raster: raster[0, 0, 0]),
        (TypeError, lambda raster: raster[[0, 1]]),
        (TypeError, lambda raster: raster.astype("u8")),
        (TypeError, lambda raster: raster.read_into([[0.0]])),
        (TypeError, lambda raster: raster.__setitem__(0, "text")),
        (Refused, lambda raster: raster.__setitem__(0, 1j)),
        (ValueError, lambda raster: raster.astype("i4").__setitem__(0, np.ma.array([1] * 6, mask=True))),
        (ValueError, lambda raster: raster.__setitem__(0, [1, 2])),
        (IndexError, lambda raster: raster.__setitem__(np.s_[::2], 1)),
        (FileError, lambda raster: Raster(raster.path + "s")[0]),
        (Refused, lambda raster: RasterWriter(raster.path, (2, -1), "f4")),
        (ValueError, lambda raster: RasterWriter(raster.path, (2,), "f4")),
        (ValueError, lambda raster: RasterWriter(raster.path, (2**40, 2), "f4")),
    ],
)
def test_bad_requests_change_nothing(tmp_path, refused, doing):
    samples = made(tmp_path)
    with pytest.raises(refused):
        doing(Raster(tmp_path / "image"))
    assert np.array_equal(Raster(tmp_path / "image"), samples)


def test_unfinished_rasters_leave_the_old_one(tmp_path):
    samples = made(tmp_path)
    with pytest.raises(ZeroDivisionError):
        with RasterWriter(tmp_path / "image", (2, 2), "f4") as image:
            image[0] = 1 / 0
    for key in (np.s_[0], np.s_[:, 1], np.s_[1:]):
        with pytest.raises(FileError, match="2 samples were never"):
            with RasterWriter(tmp_path / "image", (2, 2), "f4") as image:
                image[key] = 1.0
    for doing in (lambda: image.__setitem__(0, 1.0), image.commit):
        with pytest.raises(Refused, match="complete or given up"):
            doing()
    assert np.array_equal(Raster(tmp_path / "image"), samples) and len(os.listdir(tmp_path)) == 2
