# SPDX-License-Identifier: Apache-2.0
import pickle

import numpy as np
import pytest
from conftest import DATA
from quo_base import Configuration, Coregistration, ParameterFile, Polynomial, Refused, Region, signal
from quo_base.models import review

NOISE = np.random.default_rng(11).normal(size=(3, 8, 15, 2)).astype("f4").view("c8")[..., 0]


@pytest.mark.parametrize("axis", [0, 1, 2, -2])
def test_transforms_are_those_of_another_engine(axis):
    close = dict(rtol=0, atol=2e-5)
    np.testing.assert_allclose(signal.fft(NOISE, axis), np.fft.fft(NOISE, axis=axis), **close)
    np.testing.assert_allclose(signal.fft(NOISE, axis, inverse=True), np.fft.ifft(NOISE, axis=axis), **close)
    np.testing.assert_allclose(signal.rfft(NOISE.real, axis), np.fft.rfft(NOISE.real, axis=axis), **close)
    back = signal.irfft(np.fft.rfft(NOISE.imag, axis=axis).astype("c8"), NOISE.shape[axis], axis)
    np.testing.assert_allclose(back, NOISE.imag, **close)
    n = NOISE.shape[axis]
    zoomed = signal.czt(NOISE, n, -2 * np.pi / n, axis=axis)
    np.testing.assert_allclose(zoomed, np.fft.fft(NOISE, axis=axis), **close)


def test_images_are_transformed_along_either_axis_and_both():
    image = NOISE[:, :, 4]
    np.testing.assert_allclose(signal.fft(image, 0), np.fft.fft(image, axis=0), rtol=0, atol=1e-5)
    np.testing.assert_allclose(signal.fft2(image), np.fft.fft2(image), rtol=0, atol=1e-5)
    tone = np.exp(2j * np.pi * 0.0625 * np.arange(64))[None, :] * np.ones((64, 1))
    finer = signal.resize(tone, (64, 128))
    np.testing.assert_allclose(finer[5], np.exp(2j * np.pi * 0.03125 * np.arange(128)), atol=1e-5)
    assert np.isnan(signal.sample_at(tone, [31.0, np.nan], 30.25)).tolist() == [False, True]
    np.testing.assert_allclose(signal.sample_at(tone, 31.0, 30.25), np.exp(2j * np.pi * 0.0625 * 30.25), atol=1e-4)


def test_certified_fits_are_met():
    rows = [
        line.split(",") for line in (DATA / "nist" / "wampler1.csv").read_text().splitlines() if line[0].isdigit()
    ]
    x, y = np.array(rows, np.float64).T
    fit = signal.least_squares(np.vander(x, 6, increasing=True), y)
    np.testing.assert_allclose(fit.x, np.ones(6), rtol=1e-9)
    assert fit.rank == 6 and fit.residual_norm < 1e-6


@pytest.mark.parametrize(
    "doing",
    [
        lambda: Region()[3],
        lambda: Configuration(3),
        lambda: Region().update({1: 2}),
        lambda: Region.read("x", 3),
        lambda: ParameterFile("x")["a", 1],
        lambda: Coregistration().with_samples(1, 2),
    ],
)
def test_wrong_types_are_told_in_the_words_of_the_package(doing):
    with pytest.raises(TypeError) as caught:
        doing()
    assert "_core" not in str(caught.value) and "self:" not in str(caught.value)


def region_at(range_s):
    return Region.of_axes((range_s, 1e-8, 9), (1e9, 0.002, 9))


@pytest.mark.parametrize(
    "refused, doing",
    [
        (Refused, lambda: signal.fft(np.zeros((0, 4)))),
        (TypeError, lambda: signal.fft(["one"])),
        (ValueError, lambda: signal.irfft(np.zeros(4), 9)),
        (ValueError, lambda: signal.irfft(np.zeros(1), 0)),
        (ValueError, lambda: signal.fast_length(2**31 - 1)),
        (ValueError, lambda: region_at(0.005).samples([np.nan])),
        (ValueError, lambda: region_at(0.005) & region_at(0.006)),
        (ValueError, lambda: ParameterFile("x").__setitem__(("A", "B"), "one\n[C]")),
        (ValueError, lambda: ParameterFile("x").__setitem__(("A", "B\0"), 1)),
        (ValueError, lambda: signal.resize(np.zeros((4, 4)), (2, 8))),
        (ValueError, lambda: signal.czt(np.zeros(4), 0, 1.0)),
        (ValueError, lambda: signal.least_squares(np.eye(3), np.ones(2))),
        (ArithmeticError, lambda: signal.least_squares(np.full((3, 1), np.nan), np.ones(3))),
        (KeyError, lambda: Configuration("Conf")),
        (KeyError, lambda: Region(Width=1)),
    ],
)
def test_bad_input_is_refused(refused, doing):
    with pytest.raises(refused):
        doing()


def test_regions_and_mappings_invert_each_other(tmp_path):
    region = Region.of_axes((0.0051, 1e-8, 300), (np.datetime64("2016-09-09T01:46:40"), 2e-3, 40))
    assert (
        region.samples(0.0051 + np.array([0.0, 17.4e-8])).tolist() == [0, 17] and region.lines(1e9 + 0.0301) == 15
    )
    assert (region & Region.of_axes((0.0051 + 1e-6, 1e-8, 300), (1e9, 2e-3, 50))).Samples == 200
    region.save(tmp_path / "region.xml")
    assert Region.read(tmp_path / "region.xml") == region == pickle.loads(pickle.dumps(region))
    mapping = Coregistration(
        RgFit=[3.0, 1.0, 1e-9, 0.0062], AzFit=[0.1, 2e-3, 1.0, 1e9], trg0_s=0.0051, taz0_s=1e9
    )
    slave = mapping.to_slave(0.00513, 1e9 + np.arange(3))
    np.testing.assert_allclose(mapping.to_master(*slave), [[0.00513] * 3, 1e9 + np.arange(3)], rtol=1e-13)
    again = mapping.with_samples(region, region).with_times(region, region)
    np.testing.assert_allclose(again.to_slave(0.00513, 1e9)[0], slave[0][0], rtol=1e-9)
    line = Polynomial(pol=[1, 2, 3, 4, 5, 6, 7], trg0_s=0.5, taz0_s=10.0)
    x, y = np.array([0.1, -0.3]), 2.0
    np.testing.assert_allclose(
        line(0.5 + x, 12.0), 1 + 2 * x + 3 * y + 4 * x * y + 5 * x**2 + 6 * x**3 + 7 * x**4
    )


def test_records_and_parameters_are_kept_in_files(tmp_path):
    for name in Configuration.names():
        record = Configuration(name)
        record.save(tmp_path / "records.xml")
        assert Configuration.read(tmp_path / "records.xml", name) == record == pickle.loads(pickle.dumps(record))
    assert sorted(review(tmp_path / "records.xml").records) == sorted(Configuration.names())
    assert Configuration("AzimuthConf").describe("AntennaLength").unit == "m"
    parameters = ParameterFile(tmp_path / "chain.par")
    parameters["Chain", "Name"], parameters["Chain", "Steps"], parameters["Chain", "Lines"] = (
        "a b",
        [1.5, -2.0],
        2**40,
    )
    parameters.save()
    parameters.forget()
    assert parameters["Chain", "Name"] == "a b" and parameters["Chain", "Lines"] == str(2**40)
    assert parameters.numbers("Chain", "Steps", 2).tolist() == [1.5, -2.0]
    for missing in (lambda: parameters["Chain", "Rest"], lambda: parameters.numbers("Chain", "Steps", 3)):
        with pytest.raises(KeyError):
            missing()
