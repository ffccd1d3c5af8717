#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/geometry.h"
#include "support/scenes.h"

// The ground point of a sample and the geometry there.

namespace {

using test::Vec3;

struct Sample {
    double t, range_s;
    Vec3 platform, velocity, point;
};

class SceneSamples : public testing::TestWithParam<test::Scene> {
protected:
    SceneSamples() { test::load_orbit(GetParam(), orbit_); }

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
INSTANTIATE_TEST_SUITE_P(Bundled, SceneSamples, testing::ValuesIn(test::kScenes),
                         [](const auto& scene) { return scene.param.name; });

/** Relative agreement with a value that is not near zero. */
void expect_close(double value, double truth, double relative) {
    EXPECT_NEAR(value, truth, relative * std::abs(truth));
}

TEST_P(SceneSamples, AnglesAndSpeedAreThoseOfTheVectors) {
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
TEST_P(SceneSamples, AnglesAgreeWithTheProduct) {
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
TEST_P(SceneSamples, FmRateIsTheDerivativeOfTheDoppler) {
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

TEST_P(SceneSamples, SquintedLinesLeaveAtTheirAngleAndEndOnTheGround) {
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

}  // namespace
