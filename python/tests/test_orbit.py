# SPDX-License-Identifier: Apache-2.0
import pickle

import numpy as np
import pytest
from conftest import DATA, SCENES, tie_points
from quo_base import Orbit, Product, Refused, times


@pytest.mark.parametrize("scene", SCENES)
def test_tie_points_are_met_both_ways(scene):
    azimuth, slant, *place = tie_points(scene)
    orbit = Product(DATA / "scenes" / (scene + ".xml")).orbit
    seen = orbit.to_radar(*place)
    assert not seen.status.any()
    np.testing.assert_allclose(seen.azimuth_time, azimuth, rtol=0, atol=2.5e-6)
    np.testing.assert_allclose(seen.range_time, slant, rtol=0, atol=1e-13)
    ground = orbit.to_ground(times.to_datetime64(seen.azimuth_time), seen.range_time, height=place[2])
    np.testing.assert_allclose(ground[:3], place, rtol=0, atol=1e-3)
    whole = orbit.geometry(seen.azimuth_time, seen.range_time, height=place[2])
    assert np.array_equal(orbit.to_radar_xyz(whole.x, whole.y, whole.z).status, np.zeros(len(azimuth)))
    assert (pickle.loads(pickle.dumps(orbit)).to_radar(*place).range_time == seen.range_time).all()


def orbit_of(scene_file):
    return Product(scene_file).orbit


def test_arguments_are_broadcast_whatever_their_layout(scene_file):
    orbit = orbit_of(scene_file)
    azimuth = orbit.times()[5:8] + 0.37
    slant = np.linspace(0.0053, 0.0058, 4)
    plain = orbit.to_ground(np.repeat(azimuth, 4), np.tile(slant, 3)).latitude.reshape(3, 4)
    layouts = {
        "outer": (azimuth[:, None], slant),
        "fortran": (np.asfortranarray(np.repeat(azimuth, 4).reshape(3, 4)), slant),
        "swapped": (azimuth.astype(">f8")[:, None], slant.astype(">f8")),
        "strided": (np.repeat(azimuth, 2)[::2, None], np.repeat(slant, 3)[::3]),
        "backwards": (azimuth[::-1][::-1, None], slant[::-1][::-1]),
    }
    for name, arguments in layouts.items():
        assert np.array_equal(orbit.to_ground(*arguments).latitude, plain), name
    assert orbit.to_ground(azimuth[1], slant[2]).latitude == plain[1, 2]
    assert orbit.to_ground(np.empty((0, 1)), slant).latitude.shape == (0, 4)
    assert np.isnan(orbit.to_ground(azimuth[0], [np.nan, 1.0]).latitude).all()
    masked = np.ma.array(azimuth, mask=[False, True, False])
    assert np.isnan(orbit.to_ground(masked, slant[0]).latitude).tolist() == [False, True, False]


@pytest.mark.parametrize(
    "refused, doing",
    [
        (TypeError, lambda orbit: orbit.to_ground([1j], [1.0])),
        (TypeError, lambda orbit: orbit.to_ground([0.0], ["x"])),
        (ValueError, lambda orbit: orbit.to_ground([1.0, 2.0], [1.0, 2.0, 3.0])),
        (ValueError, lambda orbit: orbit.quantities(["latitude", "colour"], 0.0, 0.0)),
        (ValueError, lambda orbit: Orbit(0.0, 10.0, np.zeros((4, 3)), np.zeros((4, 3)))),
        (ValueError, lambda orbit: Orbit(0.0, 10.0, np.zeros((5, 3)), np.zeros((5, 2)))),
        (Refused, lambda orbit: Orbit(0.0, 10.0, orbit.positions, orbit.velocities).to_ground(0.0, 0.005)),
        (
            Refused,
            lambda orbit: Orbit(0.0, 10.0, orbit.positions, orbit.velocities).to_radar(0.0, 0.0, doppler=1.0),
        ),
    ],
)
def test_bad_input_is_refused(scene_file, refused, doing):
    with pytest.raises(refused):
        doing(orbit_of(scene_file))


def test_positions_follow_the_vectors_and_velocities_their_slope(scene_file):
    orbit = orbit_of(scene_file)
    assert np.array_equal(orbit.position(orbit.times()), orbit.positions) and orbit.check() == []
    middle = orbit.first_time + 70.3
    slope = (orbit.position(middle + 0.5) - orbit.position(middle - 0.5)) / 1.0
    np.testing.assert_allclose(orbit.velocity(middle), slope, rtol=0, atol=1e-3)
    times_of_a_line = middle - np.arange(40) * 1.7  # what stands beside a time does not choose its curve
    assert np.array_equal(orbit.position(times_of_a_line), [orbit.position(each) for each in times_of_a_line])
    finer = orbit.resample(3.0)
    assert finer.spacing <= 3.0 and len(orbit) == 16
    np.testing.assert_allclose(finer.position(middle), orbit.position(middle), rtol=0, atol=1e-3)
    assert np.isnan(orbit.position([np.nan, middle])).tolist() == [[True] * 3, [False] * 3]
    broken = orbit.positions
    broken[7] = broken[6]
    assert 7 in [found.vector for found in Orbit(0.0, 10.0, broken, orbit.velocities).check()]


def test_times_are_those_of_the_calendar():
    stamps = np.array(["1985-01-01T00:00:00", "2022-01-04T17:05:58.268589", "NaT"], "datetime64[ns]")
    seconds = times.to_seconds(stamps)
    assert seconds[:2].tolist() == [0.0, 1167930358.268589] and np.isnan(seconds[2])
    assert (np.abs(times.to_datetime64(seconds) - stamps)[:2] < np.timedelta64(250, "ns")).all()
    assert times.to_seconds("04-JAN-2022 17:05:58.268589") == times.to_seconds("2022-01-04T17:05:58.268589Z")
    assert times.to_text(seconds[1]) == "2022-01-04T17:05:58.268589"
    assert np.isnat(times.to_datetime64([1e10, -1e10, np.inf])).all()  # no wrap into other centuries
    far = np.array(["2500-01-01", "1984-12-31", "NaT"], "datetime64[D]")  # which nanoseconds do not reach
    np.testing.assert_array_equal(times.to_seconds(far), [188100 * 86400.0, -86400.0, np.nan])
    assert times.to_seconds("2022-01-04") == 1167868800.0
    masked = times.to_seconds(np.ma.array(stamps, mask=[True, False, False]))
    assert np.isnan(masked).tolist() == [True, False, True] and masked[1] == seconds[1]
    with pytest.raises(ValueError, match="100,000"):
        times.to_seconds(np.datetime64(9 * 10**18, "s"))
    for text in ("yesterday", "32-JAN-2022"):
        with pytest.raises(ValueError):
            times.to_seconds(text)
