// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <thread>
#include <vector>

#include "generalSAR/orbit/orbit_model.h"
#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

// Geolocation of arrays, judged by the calls for single points on an orbit that was just made.

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr test::Times kTimes{803457.3, 9.7, 17};

/** The same bits, or both not a number. */
bool same(double a, double b) { return std::memcmp(&a, &b, sizeof a) == 0 || (std::isnan(a) && std::isnan(b)); }

/** Samples and room for all that is known of them. */
struct Arrays {
    explicit Arrays(std::size_t count)
        : t(count), range(count), doppler(count), height(count), status(count, -7), status_back(count, -7) {
        for (auto& value : values) value.assign(count, 2.5);
        for (auto& value : back) value.assign(count, 2.5);
    }
    [[nodiscard]] OrbitSamples samples() const {
        return {t.size(), t.data(), range.data(), doppler.data(), height.data()};
    }
    [[nodiscard]] OrbitGround ground(std::size_t first = 0) {
        const auto row = [&](std::size_t i) { return values[i].data() + first; };
        return {row(3), row(4), row(9), row(0), row(1), row(2), row(5), row(6), row(7), row(8), &status[first]};
    }
    [[nodiscard]] OrbitTargets targets() const {
        OrbitTargets all{t.size()};
        all.x_m = values[0].data();
        all.y_m = values[1].data();
        all.z_m = values[2].data();
        all.doppler_hz = doppler.data();
        return all;
    }
    [[nodiscard]] OrbitSightings sightings() { return {back[0].data(), back[1].data(), status_back.data()}; }

    std::vector<double> t, range, doppler, height;
    std::vector<double> values[10];  // in the order of GrPtGeometry, and the height
    std::vector<double> back[2];
    std::vector<std::int32_t> status, status_back;
};

/** Samples in no order, of all ranges from the nadir to beyond the horizon; a few make no sense. */
Arrays samples_of(const GeneralSAROrbit& orbit, double height_m, std::size_t count) {
    std::mt19937 random{7};
    const auto between = [&](double least, double most) {
        return least + (most - least) * static_cast<double>(random()) / 4294967296.0;
    };
    const double r = test::kSemiMajor + height_m, horizon_m = std::sqrt(r * r - 4.05e13);
    const double span = (orbit.nSV_n - 1) * orbit.dtSV_s;
    const double* v = orbit.vSV_mOs;
    const double most_hz = 2.0 / orbit.getLambda() * std::sqrt(v[0] * v[0] + v[1] * v[1] + v[2] * v[2]);
    Arrays made{count};
    for (std::size_t i = 0; i < count; ++i) {
        made.t[i] = orbit.t0SV_s + between(-0.02, 1.02) * span;
        made.range[i] = 2.0 / test::kLightSpeed * (height_m + between(-0.01, 0.9) * (horizon_m - height_m));
        made.doppler[i] = i % 3 ? between(-0.05, 0.05) * most_hz : 0.0;
        made.height[i] = i % 5 ? between(-413.0, std::min(8848.0, 0.5 * height_m)) : 0.0;
    }
    for (std::size_t i = 17; i < count; i += 97) (i % 4 ? made.t : made.range)[i] = i % 3 ? kNaN : -1e300;
    return made;
}

/** What the call for the one sample gives; not a number where it fails. */
int single(GeneralSAROrbit& orbit, const Arrays& made, std::size_t i, double (&out)[10]) {
    std::ranges::fill(out, kNaN);
    GrPtGeometry at;
    const int status = orbit.SVGetGeometry(made.t[i], made.range[i], made.doppler[i], made.height[i], &at);
    if (status) return status;
    std::memcpy(out, &at, sizeof at);
    out[9] = quo::to_geodetic(quo::load(at.point_m)).height_m;
    return status;
}

void expect_as_alone(GeneralSAROrbit& orbit, double height_m, std::size_t count, double least_solved) {
    Arrays made = samples_of(orbit, height_m, count);
    ASSERT_EQ(orbit.updatePolys(orbit.t0SV_s), 0);  // which arrays do not look at
    ASSERT_EQ(orbit.sat2earth(made.samples(), made.ground()), 0);
    ASSERT_EQ(orbit.earth2sat(made.targets(), made.sightings()), 0);
    EXPECT_EQ(errno, 0);
    const double end = orbit.t0SV_s + (orbit.nSV_n - 1) * orbit.dtSV_s;
    std::size_t ground = 0, seen = 0;
    for (std::size_t i = 0; i < count; ++i) {
        SCOPED_TRACE(testing::Message() << "point " << i);
        // The run in use at the end is that of a model just made; making it anew for each point takes long.
        const auto renew = [&] { return i % 997 ? orbit.updatePolys(end) : orbit.computeApproximateSV(); };
        double alone[10], t = kNaN, range = kNaN;
        ASSERT_EQ(renew(), 0);
        ASSERT_EQ(made.status[i], single(orbit, made, i, alone));
        const double tolerance_deg[] = {0, 0, 0, 1e-13, 1e-13, 1e-13, 1e-13, 0, 0, 0};
        for (int row = 0; row < 10; ++row) {
            const double found = made.values[row][i];
            ASSERT_TRUE(same(found, alone[row]) || std::abs(found - alone[row]) <= tolerance_deg[row])
                << row << ": " << found << " - " << alone[row] << " = " << found - alone[row];
        }
        ASSERT_EQ(renew(), 0);
        ASSERT_EQ(made.status_back[i], orbit.earth2sat(alone, &t, &range, made.doppler[i]));
        ASSERT_TRUE(same(made.back[0][i], t) && same(made.back[1][i], range)) << made.back[0][i] - t;
        ground += made.status[i] == 0;
        seen += made.status_back[i] == 0;
    }
    EXPECT_GT(ground, least_solved * static_cast<double>(count));
    EXPECT_GT(seen, 0.9 * least_solved * static_cast<double>(count));
}

/** Orbits from aircraft to geostationary: height, spacing and number of vectors; how many samples. */
struct Course {
    const char* name;
    double height_m, heading_deg, spacing_s;
    int count;
    std::size_t samples;
};
constexpr Course kCourses[] = {
    {"Aircraft", 12.5e3, 40.0, 0.7, 60, 100000},
    {"LowOrbit", 693e3, -12.7, 9.7, 17, 200000},
    {"LowOrbitFiveVectors", 514e3, 192.4, 9.7, 5, 200000},
    {"LowOrbitMinutes", 693e3, 90.0, 60.0, 17, 100000},
    {"LowOrbitVeryManyVectors", 693e3, -12.7, 0.01, 16001, 10000},
    {"NavigationSatellite", 20200e3, 40.0, 60.0, 40, 50000},
    {"Geostationary", 35786e3, 30.0, 300.0, 40, 50000},
    {"Revolution", 693e3, -12.7, 10.0, 700, 3000},  // no first guess: every point is searched for
};
class Courses : public testing::TestWithParam<Course> {};
INSTANTIATE_TEST_SUITE_P(Made, Courses, testing::ValuesIn(kCourses),
                         [](const auto& row) { return row.param.name; });

TEST_P(Courses, GiveAnArrayWhatItsPointsGetAlone) {
    const Course& row = GetParam();
    const test::CircularOrbit circle{41.3, 12.8, row.heading_deg, row.height_m};
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, {803457.3, row.spacing_s, row.count},
                     [&](double t) { return circle.earth_fixed(t - 803457.3); });
    orbit.setLookSign(row.count % 2 ? 1 : -1);
    expect_as_alone(orbit, row.height_m, row.samples, 0.8);
}

// Every width of pack, pieces of any length, threads side by side, outputs in place of inputs: always the same
// bits.
TEST(Arrays, HaveTheSameBitsHoweverTheyAreCut) {
    test::Flight flight{kTimes};
    const GeneralSAROrbit& orbit = flight.orbit;
    constexpr std::size_t kCount = 5003;
    Arrays whole = samples_of(orbit, 693e3, kCount), pieces = samples_of(orbit, 693e3, kCount);
    ASSERT_EQ(orbit.sat2earth(whole.samples(), whole.ground()), 0);
    ASSERT_EQ(orbit.earth2sat(whole.targets(), whole.sightings()), 0);
    const auto part = [&](std::size_t first, std::size_t last) {
        for (std::size_t at = first, count = 1; at < last; at += count, count = count * 3 % 331) {
            count = std::min(count, last - at);
            const OrbitSamples samples{count, &pieces.t[at], &pieces.range[at], &pieces.doppler[at],
                                       &pieces.height[at]};
            EXPECT_EQ(orbit.sat2earth(samples, pieces.ground(at)), 0);
        }
    };
    std::thread other{part, 0, kCount / 2};
    part(kCount / 2, kCount);
    other.join();
    EXPECT_EQ(pieces.status, whole.status);
    for (int row = 0; row < 10; ++row)
        EXPECT_TRUE(std::ranges::equal(pieces.values[row], whole.values[row], same)) << row;

    OrbitSightings in_place{pieces.values[0].data(), pieces.values[1].data(), nullptr};
    ASSERT_EQ(orbit.earth2sat(pieces.targets(), in_place), 0);
    for (int row = 0; row < 2; ++row)
        EXPECT_TRUE(std::ranges::equal(pieces.values[row], whole.back[row], same)) << row;
}

TEST(Arrays, HaveTheSameBitsInPacksOfEveryWidth) {
    test::Flight flight{kTimes};
    const auto model = quo::OrbitModel::create(kTimes.count);
    ASSERT_EQ(model->build({flight.orbit.pSV_m, nullptr, kTimes.count, kTimes.spacing_s}, kTimes.first_s), 0);
    const quo::OrbitView view = model->view(flight.orbit.getLambda(), 1.0);
    const Arrays made = samples_of(flight.orbit, 693e3, quo::kBlockPoints);
    quo::ForwardBlock forward[3]{};
    quo::InverseBlock inverse[3]{};
    for (int i = 0; i < 3; ++i) {
        const quo::ArrayKernels& kernels = quo::array_kernels(2 << i);
        quo::ForwardBlock& block = forward[i];
        std::ranges::copy(made.t, block.t_s);
        std::ranges::copy(made.range, block.range_s);
        std::ranges::copy(made.doppler, block.doppler_hz);
        std::ranges::copy(made.height, block.height_m);
        block.want_place = block.want_angles = block.want_rate = block.want_speed = true;
        block.with_heights = i > 0;
        kernels.forward(view, quo::kBlockPoints, block);
        block.with_heights = true;
        kernels.forward(view, quo::kBlockPoints, block);
        std::ranges::copy(block.result[quo::kX], inverse[i].x_m);
        std::ranges::copy(block.result[quo::kY], inverse[i].y_m);
        std::ranges::copy(block.result[quo::kZ], inverse[i].z_m);
        std::ranges::copy(made.doppler, inverse[i].doppler_hz);
        kernels.inverse(view, quo::kBlockPoints, inverse[i]);
    }
    EXPECT_GT(std::ranges::count_if(inverse[0].solved, [](auto solved) { return solved != 0; }), 40);
    for (int i = 1; i < 3; ++i)
        for (int j = 0; j < quo::kBlockPoints; ++j) {
            ASSERT_EQ(forward[i].solved[j], forward[0].solved[j]) << j;
            ASSERT_EQ(inverse[i].solved[j], inverse[0].solved[j]) << j;
            if (!forward[0].solved[j]) continue;
            for (int row = 0; row < quo::kGroundValues; ++row)
                ASSERT_TRUE(same(forward[i].result[row][j], forward[0].result[row][j])) << row;
            EXPECT_TRUE(same(inverse[i].t_s[j], inverse[0].t_s[j]));
            EXPECT_TRUE(same(inverse[i].range_s[j], inverse[0].range_s[j]));
        }
}

TEST(Arrays, RefuseWhatDoesNotFitAndWriteNothing) {
    test::Flight flight{kTimes};
    const GeneralSAROrbit &orbit = flight.orbit, empty;
    Arrays made = samples_of(orbit, 693e3, 40);
    const test::Report report;
    const OrbitSamples samples = made.samples();
    const OrbitGround ground = made.ground();
    const auto forward = [&](auto change, const GeneralSAROrbit& on) {
        OrbitSamples in = samples;
        OrbitGround out = ground;
        change(in, out);
        return on.sat2earth(in, out);
    };
    const auto inverse = [&](auto change, const GeneralSAROrbit& on) {
        OrbitTargets in = made.targets();
        OrbitSightings out = made.sightings();
        change(in, out);
        return on.earth2sat(in, out);
    };
    const auto expect = [&](int status, auto call, auto change) {
        SCOPED_TRACE(testing::Message() << "call " << report.entries().size());
        const std::size_t entries = report.entries().size();
        EXPECT_EQ(call(change, orbit), status);
        EXPECT_EQ(call(change, empty), QUO_REFUSED);
        EXPECT_EQ(report.entries().size() - entries, status ? 2U : 1U);
        for (const auto& row : made.values) EXPECT_EQ(std::ranges::count(row, 2.5), 40);
        for (const auto& row : made.back) EXPECT_EQ(std::ranges::count(row, 2.5), 40);
        EXPECT_EQ(std::ranges::count(made.status, -7) + std::ranges::count(made.status_back, -7), 80);
    };
    const double* const nowhere = nullptr;
    double* const x = made.values[0].data();
    std::int32_t* const in_times = reinterpret_cast<std::int32_t*>(made.t.data());
    expect(QUO_OK, forward, [&](auto& in, auto&) { in = {0, nowhere, nowhere}; });
    expect(QUO_OK, forward, [&](auto& in, auto&) { in.count = 0; });
    expect(QUO_OK, inverse, [&](auto& in, auto&) { in = {0}; });
    expect(QUO_REFUSED, forward, [&](auto& in, auto&) { in.azimuth_s = nullptr; });
    expect(QUO_REFUSED, forward, [&](auto& in, auto&) { in.range_s = nullptr; });
    for (const std::size_t count : {SIZE_MAX, SIZE_MAX / 8, SIZE_MAX / 16, SIZE_MAX / 8 + 1}) {
        expect(QUO_REFUSED, forward, [&](auto& in, auto&) { in.count = count; });
        expect(QUO_REFUSED, inverse, [&](auto& in, auto&) { in.count = count; });
    }
    expect(QUO_REFUSED, forward, [&](auto& in, auto& out) { in.range_s = out.x_m + 1; });
    expect(QUO_REFUSED, forward,
           [&](auto& in, auto& out) { out.look_deg = const_cast<double*>(in.range_s) - 39; });
    expect(QUO_REFUSED, forward, [&](auto&, auto& out) { out.y_m = x; });
    expect(QUO_REFUSED, forward, [&](auto&, auto& out) { out.z_m = x + 39; });
    expect(QUO_REFUSED, forward, [&](auto&, auto& out) { out.status = in_times; });
    expect(QUO_REFUSED, forward, [&](auto&, auto& out) { out.status = reinterpret_cast<std::int32_t*>(x); });
    expect(QUO_REFUSED, inverse, [&](auto& in, auto&) { in.y_m = nullptr; });
    expect(QUO_REFUSED, inverse, [&](auto& in, auto&) { in.latitude_deg = in.longitude_deg = x; });
    expect(QUO_REFUSED, inverse, [&](auto& in, auto&) { in.height_m = x; });
    expect(QUO_REFUSED, inverse, [&](auto& in, auto&) { in = {40, x}; });
    expect(QUO_REFUSED, inverse, [&](auto&, auto& out) { out.range_s = out.azimuth_s; });
    expect(QUO_REFUSED, inverse, [&](auto&, auto& out) { out.azimuth_s = x + 1; });
}

// Two runs serve most times; which one it is must not hang on the times beside, nor on what was asked before.
TEST(Arrays, FollowThePlatformAsATimeAloneDoes) {
    test::Flight flight{kTimes};
    GeneralSAROrbit &orbit = flight.orbit, empty;
    std::vector<double> times{kTimes.last(), kNaN, kTimes.first_s - 17.3}, positions(90, 2.5), velocities(90, 2.5);
    for (int i = 0; i < 27; ++i) times.push_back(kTimes.first_s + 0.37 * kTimes.spacing_s * i);
    ASSERT_EQ(orbit.SVGetStates(30, times.data(), positions.data(), nullptr), QUO_OK);
    ASSERT_EQ(orbit.SVGetStates(30, times.data(), nullptr, velocities.data()), QUO_OK);
    for (std::size_t i = 0; i < times.size(); ++i) {
        double alone[6] = {kNaN, kNaN, kNaN, kNaN, kNaN, kNaN};
        ASSERT_EQ(orbit.updatePolys(kTimes.last()), 0);
        const int expected = std::isfinite(times[i]) ? QUO_OK : QUO_REFUSED;
        ASSERT_EQ(orbit.SVGetPos(times[i], alone), expected);
        ASSERT_EQ(orbit.SVGetVel(times[i], alone + 3), expected);
        EXPECT_TRUE(std::equal(alone, alone + 3, &positions[3 * i], same)) << i;
        EXPECT_TRUE(std::equal(alone + 3, alone + 6, &velocities[3 * i], same)) << i;
    }
    double* const at = positions.data();
    const double first = *at;
    EXPECT_EQ(empty.SVGetStates(1, times.data(), at, nullptr), QUO_REFUSED);
    EXPECT_EQ(orbit.SVGetStates(1, nullptr, at, nullptr), QUO_REFUSED);
    EXPECT_EQ(orbit.SVGetStates(SIZE_MAX / 24, times.data(), at, nullptr), QUO_REFUSED);
    EXPECT_EQ(orbit.SVGetStates(2, times.data(), at, at + 5), QUO_REFUSED);
    EXPECT_EQ(orbit.SVGetStates(2, at + 5, at, nullptr), QUO_REFUSED);
    EXPECT_EQ(*at, first);
}

// Places are the points that from_geodetic() makes of them; a Doppler or height that is not given is 0.
TEST(Arrays, TakePlacesAndDoWithoutWhatIsNotGiven) {
    test::Flight flight{kTimes};
    GeneralSAROrbit& orbit = flight.orbit;
    constexpr std::size_t kCount = 300;
    Arrays made = samples_of(orbit, 693e3, kCount);
    ASSERT_EQ(orbit.sat2earth(OrbitSamples{kCount, made.t.data(), made.range.data()}, made.ground()), 0);
    OrbitTargets places{kCount, made.values[3].data(), made.values[4].data()};
    ASSERT_EQ(orbit.earth2sat(places, made.sightings()), 0);
    std::size_t seen = 0;
    for (std::size_t i = 0; i < kCount; ++i) {
        double xyz[3] = {}, t = kNaN, range = kNaN;
        ASSERT_EQ(orbit.updatePolys(kTimes.last()), 0);
        if (orbit.sat2earth(made.t[i], made.range[i], xyz)) continue;
        for (int axis = 0; axis < 3; ++axis) ASSERT_EQ(xyz[axis], made.values[axis][i]);
        const GeodeticPoint place{made.values[3][i], made.values[4][i], 0.0};
        quo::store(quo::from_geodetic(place), xyz);
        ASSERT_EQ(orbit.updatePolys(kTimes.last()), 0);
        ASSERT_EQ(made.status_back[i], orbit.earth2sat(xyz, &t, &range));
        ASSERT_TRUE(same(made.back[0][i], t) && same(made.back[1][i], range)) << i;
        seen += made.status_back[i] == 0;
    }
    EXPECT_GT(seen, 200U);
}

class Scenes : public testing::TestWithParam<test::Scene> {};
INSTANTIATE_TEST_SUITE_P(Bundled, Scenes, testing::ValuesIn(test::kScenes),
                         [](const auto& scene) { return scene.param.name; });
TEST_P(Scenes, GiveAnArrayWhatItsPointsGetAlone) {
    GeneralSAROrbit orbit;
    test::load_orbit(GetParam(), orbit);
    const double height_m = quo::to_geodetic(quo::load(orbit.pSV_m)).height_m;
    expect_as_alone(orbit, height_m, 100000, 0.6);
}

}  // namespace
