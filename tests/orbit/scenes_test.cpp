#include "support/scenes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/geometry.h"

// The bundled scenes: the ground point of a sample and the geometry there; from the ground to azimuth time and
// range time, and there and back again.

namespace {

using test::Vec3;

struct Sample {
    double t, range_s;
    Vec3 platform, velocity, point;
};

class RealScene : public testing::TestWithParam<test::Scene> {
protected:
    RealScene() { test::load_orbit(GetParam(), orbit_); }

    /** Calls `check` for samples all over the scene; times are multiples of 2^-10 s, so that steps of half a
     * second on them are exact. */
    template <typename Check>
    void for_samples(double doppler_hz, const Check& check) {
        for (int i = 0; i < 60; ++i) {
            const double along = extent_.first_s + i / 59.0 * (extent_.last_s - extent_.first_s);
            const double t = std::ldexp(std::round(std::ldexp(along, 10)), -10);
            const double range = extent_.near_s + (i * 11 % 60) / 59.0 * (extent_.far_s - extent_.near_s);
            Sample sample{t, range, test::position_at(orbit_, t), test::velocity_at(orbit_, t), {}};
            ASSERT_EQ(orbit_.sat2earth(t, range, doppler_hz, sample.point.v), 0);
            check(sample);
        }
    }

    GeneralSAROrbit orbit_;
    std::vector<test::TiePoint> points_ = test::load_tie_points(GetParam());
    test::Extent extent_ = test::extent_of(points_);
};
INSTANTIATE_TEST_SUITE_P(Bundled, RealScene, testing::ValuesIn(test::kScenes),
                         [](const auto& scene) { return scene.param.name; });

/** Relative agreement with a value that is not near zero. */
void expect_close(double value, double truth, double relative) {
    EXPECT_NEAR(value, truth, relative * std::abs(truth));
}

TEST_P(RealScene, AnglesAndSpeedAreThoseOfTheVectors) {
    for (const double doppler : {0.0, GetParam().doppler_hz}) {
        for_samples(doppler, [&](const Sample& s) {
            double incidence = 0.0, look = 0.0;
            ASSERT_EQ(orbit_.SVGetAngles(s.t, s.range_s, doppler, &incidence, &look), 0);
            expect_close(incidence, test::angle_deg(test::ellipsoid_gradient(s.point), s.platform - s.point),
                         1e-6);
            expect_close(look, test::angle_deg(-s.platform, s.point - s.platform), 1e-6);
            expect_close(orbit_.SVGetSatSpeed(s.t, s.range_s, doppler), test::norm(s.velocity), 1e-14);
        });
    }
}

// The mission's angles at its own tie points, after the conversion from its vertical to ours. Stated to a double's
// digits for the satellite, to a float's for the aircraft; where tie points have heights, they are seen from the
// model's platform, as the library's own angles belong to the point on the ellipsoid.
TEST_P(RealScene, AnglesAgreeWithTheProduct) {
    for (const test::TiePoint& tie : points_) {
        const Vec3 platform = test::position_at(orbit_, tie.azimuth_time_s);
        const Vec3 target = test::geodetic_point(tie.latitude_deg, tie.longitude_deg, tie.height_m);
        const Vec3 normal = test::local_frame(tie.latitude_deg, tie.longitude_deg).up;
        const double against_normal = test::angle_deg(normal, platform - target);
        const double stated = GetParam().geocentric
                                  ? tie.incidence_deg + against_normal - test::angle_deg(target, platform - target)
                                  : tie.incidence_deg;
        EXPECT_NEAR(against_normal, stated, 1e-5);
        if (!std::isnan(tie.look_deg)) {
            EXPECT_NEAR(test::angle_deg(-platform, target - platform), tie.look_deg, 1e-5);
        }
        if (GetParam().at_sea_level) {
            EXPECT_NEAR(orbit_.SVGetAnglesIncidence(tie.azimuth_time_s, tie.range_time_s), stated, 1e-5);
            EXPECT_NEAR(orbit_.SVGetAnglesLook(tie.azimuth_time_s, tie.range_time_s), tie.look_deg, 1e-5);
        }
    }
}

/** Doppler of a fixed point from the change of its distance: -(2 / lambda) dR/dt, and once more for the FM rate.
 */
TEST_P(RealScene, FmRateIsTheDerivativeOfTheDoppler) {
    for (const double doppler : {0.0, GetParam().doppler_hz}) {
        for_samples(doppler, [&](const Sample& s) {
            constexpr double h = 0.5;
            double rate = 0.0, distance[5];
            ASSERT_EQ(orbit_.SVGetFR(s.t, s.range_s, doppler, &rate), 0);
            const auto before = orbit_.polyUpdates();
            for (int i = 0; i < 5; ++i)
                distance[i] = test::norm(test::position_at(orbit_, s.t + (i - 2) * h) - s.point);
            if (orbit_.polyUpdates() != before) return;  // two curves a hair apart have no second difference
            const double bend =
                (-distance[0] + 16.0 * distance[1] - 30.0 * distance[2] + 16.0 * distance[3] - distance[4]) /
                (12.0 * h * h);
            expect_close(rate, -2.0 / orbit_.getLambda() * bend, 1e-6);
            EXPECT_LT(rate, 0.0);
        });
    }
}

TEST_P(RealScene, SquintedLinesLeaveAtTheirAngleAndEndOnTheGround) {
    for (const double squint : {0.0, 3.7, -11.3}) {
        for_samples(0.0, [&](const Sample& s) {
            Vec3 p{};
            double time = 0.0;
            ASSERT_EQ(orbit_.sat2earthSquinted(s.t, s.range_s, squint, p.v, &time), 0);
            const Vec3 line = p - s.platform, abeam = s.point - s.platform;
            EXPECT_NEAR(test::height_above_ellipsoid(p), 0.0, 1e-5);
            EXPECT_NEAR(test::norm(line), 0.5 * test::kLightSpeed * time, 1e-5);
            EXPECT_NEAR(90.0 - test::angle_deg(line, s.velocity), squint, 1e-7);
            // Nothing but the part along the velocity was added to the line abeam.
            EXPECT_NEAR(test::dot(test::unit(line), test::unit(test::cross(abeam, s.velocity))), 0.0, 1e-9);
            if (squint == 0.0) {
                EXPECT_LT(test::norm(p - s.point), 1e-5);
            }
        });
    }
    Vec3 p{1.5, 2.5, 3.5};  // a line that passes the Earth by
    double time = 4.5;
    EXPECT_EQ(orbit_.sat2earthSquinted(extent_.first_s, extent_.near_s, 89.9, p.v, &time), QUO_NUMERIC);
    EXPECT_EQ(p[0] + p[1] + p[2] + time, 12.0);
}

// The quantities of the product's own FM rate: its three coefficients fit the rate along the swath to about a part
// in a thousand.
TEST(SatelliteScene, FmRateAgreesWithTheProduct) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[0], orbit);
    const double t = 1167930359.807086, t0 = 0.005336535882737799;
    const double coefficients[] = {-2325.728040087356, 450547.0373834581, -78809649.94526018};
    for (const double late : {0.0, 1.3e-4, 3.5e-4}) {
        const double stated = coefficients[0] + late * (coefficients[1] + late * coefficients[2]);
        expect_close(orbit.SVGetFR(t, t0 + late), stated, 1e-3);
    }
}

TEST(Samples, AllFormsOfACallAgree) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[0], orbit);
    const double t = 1167930370.73, range = 0.00551;
    for (const double fd : {0.0, 1234.5}) {
        double full[9] = {}, brief[9] = {};  // x, y, z, latitude, longitude, incidence, look, rate, speed
        ASSERT_EQ(orbit.sat2earth(t, range, fd, full), 0);
        ASSERT_EQ(orbit.SVGetLatLon(t, range, fd, &full[3], &full[4]), 0);
        ASSERT_EQ(orbit.SVGetAngles(t, range, fd, &full[5], &full[6]), 0);
        ASSERT_EQ(orbit.SVGetFR(t, range, fd, &full[7]), 0);
        ASSERT_EQ(orbit.SVGetSatSpeed(t, range, fd, &full[8]), 0);
        EXPECT_THAT((std::vector{orbit.sat2earthX(t, range, fd), orbit.sat2earthY(t, range, fd),
                                 orbit.sat2earthZ(t, range, fd), orbit.SVGetLat(t, range, fd),
                                 orbit.SVGetLon(t, range, fd), orbit.SVGetAnglesIncidence(t, range, fd),
                                 orbit.SVGetAnglesLook(t, range, fd), orbit.SVGetFR(t, range, fd),
                                 orbit.SVGetSatSpeed(t, range, fd)}),
                    testing::ElementsAreArray(full));
        EXPECT_TRUE(std::equal(full, full + 3, orbit.sat2earth(t, range, fd)));
        if (fd != 0.0) continue;

        ASSERT_EQ(orbit.sat2earth(t, range, brief), 0);
        ASSERT_EQ(orbit.SVGetLatLon(t, range, &brief[3], &brief[4]), 0);
        ASSERT_EQ(orbit.SVGetAngles(t, range, &brief[5], &brief[6]), 0);
        ASSERT_EQ(orbit.SVGetFR(t, range, &brief[7]), 0);
        ASSERT_EQ(orbit.SVGetSatSpeed(t, range, &brief[8]), 0);
        EXPECT_THAT(brief, testing::ElementsAreArray(full));
        EXPECT_THAT(
            (std::vector{orbit.sat2earthX(t, range), orbit.sat2earthY(t, range), orbit.sat2earthZ(t, range),
                         orbit.SVGetLat(t, range), orbit.SVGetLon(t, range), orbit.SVGetAnglesIncidence(t, range),
                         orbit.SVGetAnglesLook(t, range), orbit.SVGetFR(t, range), orbit.SVGetSatSpeed(t, range)}),
            testing::ElementsAreArray(full));
        EXPECT_TRUE(std::equal(full, full + 3, orbit.sat2earth(t, range)));
        // From a position and a velocity of one's own; each pointer has a place of its own behind it.
        EXPECT_TRUE(std::equal(full, full + 3, orbit.sat2earth(orbit.SVGetPos(t), orbit.SVGetVel(t), range)));
        Vec3 aliased = test::position_at(orbit, t);
        ASSERT_EQ(orbit.sat2earth(aliased.v, test::velocity_at(orbit, t).v, range, aliased.v), 0);
        EXPECT_EQ(aliased[2], full[2]);
    }
}

// --- from the ground to the image -------------------------------------------------------------------------------

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
