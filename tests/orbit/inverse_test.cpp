#include <gtest/gtest.h>

#include <cmath>

#include "orbit/made_orbits.h"
#include "support/geometry.h"
#include "support/scenes.h"

// From the ground to azimuth time and range time, and there and back again.

namespace {

using test::Vec3;

class RealScene : public testing::TestWithParam<test::Scene> {
protected:
    RealScene() { test::load_orbit(GetParam(), orbit_); }

    GeneralSAROrbit orbit_;
    std::vector<test::TiePoint> points_ = test::load_tie_points(GetParam());
    test::Extent extent_ = test::extent_of(points_);
};
INSTANTIATE_TEST_SUITE_P(Bundled, RealScene, testing::ValuesIn(test::kScenes),
                         [](const auto& scene) { return scene.param.name; });

TEST_P(RealScene, SeesTiePointsWhereTheirProductDoes) {
    for (const test::TiePoint& point : points_) {
        const Vec3 p = test::geodetic_point(point.latitude_deg, point.longitude_deg, point.height_m);
        double t[2], range[2];
        ASSERT_EQ(orbit_.earth2sat(p.v, &t[0], &range[0]), 0);
        ASSERT_EQ(orbit_.earth2satPrecise(p.v, &t[1], &range[1]), 0);
        for (int i = 0; i < 2; ++i) {
            EXPECT_NEAR(t[i], point.azimuth_time_s, GetParam().time_reach_s);
            EXPECT_NEAR(range[i], point.range_time_s, 2.0 / test::kLightSpeed * GetParam().range_reach_m);
        }
        EXPECT_NEAR(orbit_.earth2satAzimuth(p.v), t[0], 2.4e-7);  // a double's last bit
        EXPECT_NEAR(orbit_.earth2satRange(p[0], p[1], p[2]), range[0], 1e-14);
    }
}

/** How far a sample's coordinates may be off after a journey to the ground and back, and the point after one more.
 */
struct Closure {
    double time_s, range_s, point_m;
};

/** Samples all over the extent of the scene, times on whole microseconds, either look side, three Dopplers. */
void expect_closed(GeneralSAROrbit& orbit, const test::Extent& extent, double doppler_hz, const Closure& within) {
    constexpr int kSteps = 23;
    for (const int side : {+5, 0, -1}) {  // not negative: right
        orbit.setLookSign(side);
        for (const double doppler : {0.0, doppler_hz, -doppler_hz}) {
            for (int i = 0; i <= kSteps * kSteps; ++i) {
                const double along = static_cast<double>(i) / (kSteps * kSteps);
                const double across = static_cast<double>(i * 7 % (kSteps + 1)) / kSteps;
                const double t = extent.first_s + along * (extent.last_s - extent.first_s);
                const double range = extent.near_s + across * (extent.far_s - extent.near_s);
                Vec3 p{}, again{};
                double t_back = 0.0, range_back = 0.0;
                ASSERT_EQ(orbit.sat2earth(t, range, doppler, p.v), 0);
                ASSERT_EQ(orbit.earth2sat(p.v, &t_back, &range_back, doppler), 0);
                EXPECT_NEAR(t_back, t, within.time_s);
                EXPECT_NEAR(range_back, range, within.range_s);
                ASSERT_EQ(orbit.sat2earth(t_back, range_back, doppler, again.v), 0);
                EXPECT_LT(test::norm(again - p), within.point_m);
                EXPECT_NEAR(test::height_above_ellipsoid(p), 0.0, 1e-5);
                const Vec3 from = test::position_at(orbit, t);
                const Vec3 right = test::cross(test::velocity_at(orbit, t), from);
                EXPECT_EQ(test::dot(right, p - from) > 0.0, side >= 0);
            }
        }
    }
}

// Seconds since 1985 are known to 1.2e-7 s in a double, almost a millimetre of flight.
TEST_P(RealScene, ClosesOnAbsoluteTimes) {
    expect_closed(orbit_, extent_, GetParam().doppler_hz, {3e-7, 1e-12, 2e-3});
}

// The same orbit with its times moved near zero shows what the geometry itself does.
TEST_P(RealScene, ClosesBeyondTheRoundingOfAbsoluteTimes) {
    const double move = std::floor(extent_.first_s);
    orbit_.t0SV_s -= move;
    ASSERT_EQ(orbit_.computeApproximateSV(), 0);
    const test::Extent moved{extent_.first_s - move, extent_.last_s - move, extent_.near_s, extent_.far_s};
    expect_closed(orbit_, moved, GetParam().doppler_hz, {1e-9, 1e-12, 1e-5});
}

// One product's tie points all lie on the ellipsoid: there the forward direction has the same truth, within the
// tie points' own microsecond.
TEST(SeaScene, FindsTiePointsFromTheirTimes) {
    const test::Scene& scene = test::kScenes[1];
    ASSERT_TRUE(scene.at_sea_level);
    GeneralSAROrbit orbit;
    test::load_orbit(scene, orbit);
    for (const test::TiePoint& point : test::load_tie_points(scene)) {
        Vec3 p{};
        double latitude = 0.0, longitude = 0.0;
        ASSERT_EQ(orbit.sat2earth(point.azimuth_time_s, point.range_time_s, p.v), 0);
        EXPECT_LT(test::norm(p - test::geodetic_point(point.latitude_deg, point.longitude_deg)), 0.02);
        ASSERT_EQ(orbit.SVGetLatLon(point.azimuth_time_s, point.range_time_s, &latitude, &longitude), 0);
        EXPECT_NEAR(latitude, point.latitude_deg, 2e-7);
        EXPECT_NEAR(longitude, point.longitude_deg, 2e-7);
    }
}

}  // namespace
