// SPDX-License-Identifier: Apache-2.0
#include "support/scenes.h"

#include "orbit/made_orbits.h"
#include "support/geometry.h"

// The bundled scenes: what their products say of their tie points, and there and back again.

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

// The mission's angles at its own tie points, after the conversion from its vertical to ours. Stated to a double's
// digits for the satellite, to a float's for the aircraft. Both directions of geolocation have the same truth at
// the heights of the tie points, within their own microsecond.
TEST_P(RealScene, FindsAnglesPlacesAndTimesAsItsProductDoes) {
    for (const test::TiePoint& tie : points_) {
        const Vec3 platform = test::position_at(orbit_, tie.azimuth_time_s);
        const Vec3 target = test::geodetic_point(tie.latitude_deg, tie.longitude_deg, tie.height_m);
        const Vec3 normal = test::local_frame(tie.latitude_deg, tie.longitude_deg).up;
        const double against_normal = test::angle_deg(normal, platform - target);
        const double stated = GetParam().geocentric
                                  ? tie.incidence_deg + against_normal - test::angle_deg(target, platform - target)
                                  : tie.incidence_deg;
        EXPECT_NEAR(against_normal, stated, 1e-5);
        double t[2], range[2];
        ASSERT_EQ(orbit_.earth2sat(target.v, &t[0], &range[0]), 0);
        ASSERT_EQ(orbit_.earth2satPrecise(target.v, &t[1], &range[1]), 0);
        for (int i = 0; i < 2; ++i) {
            EXPECT_NEAR(t[i], tie.azimuth_time_s, GetParam().time_reach_s);
            EXPECT_NEAR(range[i], tie.range_time_s, 2.0 / test::kLightSpeed * GetParam().range_reach_m);
        }
        EXPECT_NEAR(orbit_.earth2satAzimuth(target.v), t[0], 2.4e-7);  // a double's last bit
        EXPECT_NEAR(orbit_.earth2satRange(target[0], target[1], target[2]), range[0], 1e-14);

        GrPtGeometry at;
        ASSERT_EQ(orbit_.SVGetGeometry(tie.azimuth_time_s, tie.range_time_s, 0.0, tie.height_m, &at), 0);
        Vec3 point{};
        ASSERT_EQ(orbit_.sat2earth(tie.azimuth_time_s, tie.range_time_s, 0.0, tie.height_m, point.v), 0);
        EXPECT_TRUE(std::equal(point.v, point.v + 3, at.point_m));
        EXPECT_LT(test::norm(point - target), GetParam().geocentric ? 0.02 : 0.002);
        EXPECT_NEAR(at.incidence_deg, stated, 1e-5);
        EXPECT_NEAR(at.look_deg, std::isnan(tie.look_deg) ? at.look_deg : tie.look_deg, 1e-5);
        EXPECT_NEAR(at.latitude_deg, tie.latitude_deg, 2e-7);
        EXPECT_NEAR(at.longitude_deg, tie.longitude_deg, 2e-7);
        EXPECT_NEAR(at.speed_m_s, test::norm(test::velocity_at(orbit_, tie.azimuth_time_s)), 1e-9);
    }
}

// The quantities of the product's own FM rate: its three coefficients fit the rate along the swath to about a part
// in a thousand.
TEST(SatelliteScene, FmRateAgreesWithTheProduct) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[0], orbit);
    for (const double late : {0.0, 1.3e-4, 3.5e-4}) {
        const double stated = -2325.728040087356 + late * (450547.0373834581 + late * -78809649.94526018);
        EXPECT_NEAR(orbit.SVGetFR(1167930359.807086, 0.005336535882737799 + late) / stated, 1.0, 1e-3);
    }
}

TEST_P(RealScene, SquintedLinesLeaveAtTheirAngleAndEndOnTheGround) {
    const double t = extent_.first_s, range = extent_.near_s;
    const Vec3 platform = test::position_at(orbit_, t), velocity = test::velocity_at(orbit_, t);
    Vec3 p{}, abeam{};
    double time = 4.5;
    ASSERT_EQ(orbit_.sat2earth(t, range, abeam.v), 0);
    for (const double squint : {0.0, 3.7, -11.3}) {
        ASSERT_EQ(orbit_.sat2earthSquinted(t, range, squint, p.v, &time), 0);
        const Vec3 line = p - platform;
        EXPECT_NEAR(test::height_above_ellipsoid(p), 0.0, 1e-5);
        EXPECT_NEAR(test::norm(line), 0.5 * test::kLightSpeed * time, 1e-5);
        EXPECT_NEAR(90.0 - test::angle_deg(line, velocity), squint, 1e-7);
        // Nothing but the part along the velocity was added to the line abeam.
        EXPECT_NEAR(test::dot(test::unit(line), test::unit(test::cross(abeam - platform, velocity))), 0.0, 1e-9);
    }
    const double before = p[0] + p[1] + p[2] + time;
    EXPECT_EQ(orbit_.sat2earthSquinted(t, range, 89.9, p.v, &time), QUO_NUMERIC);  // passes the Earth by
    EXPECT_EQ(p[0] + p[1] + p[2] + time, before);
}

// Samples all over the scene, either look side, three Dopplers. Seconds since 1985 are known to 1.2e-7 s in a
// double, almost a millimetre of flight; the same orbit with its times moved near zero shows what the geometry
// itself does.
TEST_P(RealScene, ClosesToTheRoundingOfItsTimes) {
    constexpr int kSteps = 23, kSamples = 9 * kSteps * kSteps;
    const double move = std::floor(extent_.first_s), fd = GetParam().doppler_hz;
    for (const bool moved : {false, true}) {
        if (moved) orbit_.t0SV_s -= move;
        ASSERT_EQ(orbit_.computeApproximateSV(), 0);
        for (int i = 0; i <= kSamples; ++i) {
            const double along = static_cast<double>(i) / kSamples, across = i * 7 % (kSteps + 1);
            const double t = extent_.first_s - (moved ? move : 0.0) + along * (extent_.last_s - extent_.first_s);
            const double range = extent_.near_s + across / kSteps * (extent_.far_s - extent_.near_s);
            const double doppler = (i % 3 - 1) * fd;
            const int side = (i / 3) % 3 - 1;  // not negative: right
            Vec3 p{}, again{};
            double t_back = 0.0, range_back = 0.0;
            orbit_.setLookSign(side);
            ASSERT_EQ(orbit_.sat2earth(t, range, doppler, p.v), 0);
            ASSERT_EQ(orbit_.earth2sat(p.v, &t_back, &range_back, doppler), 0);
            EXPECT_NEAR(t_back, t, moved ? 1e-9 : 3e-7);
            EXPECT_NEAR(range_back, range, 1e-12);
            ASSERT_EQ(orbit_.sat2earth(t_back, range_back, doppler, again.v), 0);
            EXPECT_LT(test::norm(again - p), moved ? 1e-5 : 2e-3);
            const Vec3 from = test::position_at(orbit_, t);
            const Vec3 right = test::cross(test::velocity_at(orbit_, t), from);
            EXPECT_EQ(test::dot(right, p - from) > 0.0, side >= 0);
        }
    }
}

}  // namespace
