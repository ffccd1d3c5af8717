#include "sarutillib/geometry_kernels.h"

#include <gtest/gtest.h>

#include <cmath>

#include "support/geometry.h"

namespace {

using quo::Ellipsoid;
using quo::Vec3;

test::Vec3 plain(const Vec3& p) { return {p.x, p.y, p.z}; }

TEST(Geodetic, ReturnsFromEveryPlaceAndHeight) {
    constexpr Ellipsoid kBodies[] = {quo::kWgs84, {6371000.3, 6371000.3}, {3396190.0, 3376200.0}, {6.3e6, 6.4e6}};
    for (const Ellipsoid& body : kBodies)
        for (const double latitude : {-90.0, -89.9999999, -45.3, -1e-7, 0.0, 17.3, 44.9, 89.93, 90.0})
            for (const double longitude : {-179.9999999, -90.0, 0.0, 12.8, 101.4, 180.0})
                for (const double height : {-9517.3, 0.0, 8848.1, 693e3, 36e6}) {
                    SCOPED_TRACE(testing::Message() << latitude << " " << longitude << " " << height);
                    const test::Vec3 p =
                        test::geodetic_point(latitude, longitude, height, body.equatorial_m, body.polar_m);
                    const GeodeticPoint g = quo::to_geodetic(quo::load(p.v), body);
                    const double rounding = 4e-16 * test::norm(p);
                    EXPECT_NEAR(g.height_m, height, 2.0 * rounding);
                    EXPECT_LT(test::norm(test::geodetic_point(g.latitude_deg, g.longitude_deg, g.height_m,
                                                              body.equatorial_m, body.polar_m) -
                                         p),
                              3.0 * rounding);
                    EXPECT_LT(test::norm(plain(quo::from_geodetic(g, body)) - p), 3.0 * rounding);
                }
}

TEST(Geodetic, HasAnAnswerOnTheAxisAndAtTheCentre) {
    EXPECT_EQ(quo::to_geodetic({0.0, 0.0, -test::kSemiMinor}, quo::kWgs84).longitude_deg, 0.0);
    const auto centre = quo::to_geodetic({0.0, 0.0, 0.0}, quo::kWgs84);
    EXPECT_TRUE(std::isfinite(centre.latitude_deg) && std::isfinite(centre.height_m));
}

/** A look at the WGS84 ellipsoid from a circular orbit. */
struct View {
    test::Platform sat;
    quo::RadarLook look;
    Vec3 S, V, P{};
    explicit View(double range, double fd = 0.0, double side = 1.0)
        : sat{test::circular_orbit(41.3, 12.8, -12.7)},
          look{2.0 * range / test::kLightSpeed, fd, 0.0555, side},
          S{quo::load(sat.position.v)},
          V{quo::load(sat.velocity.v)} {
        EXPECT_EQ(quo::ground_point(S, V, look, quo::kWgs84, &P), 0);
    }
};

// The last rate is that of a body turning ten times as fast as the Earth.
TEST(RefineGroundPoint, FindsTheSolutionFromAfar) {
    for (const double omega : {0.0, test::kEarthRate, 10.0 * test::kEarthRate}) {
        View view{848730.1, 3217.6};
        // The inertial velocity of the same platform.
        const Vec3 inertial = view.V + quo::cross({0.0, 0.0, omega}, view.S);
        const auto steps_from = [&](const Vec3& away) {
            Vec3 p = view.P + away;
            const int steps = quo::refine_ground_point(view.S, inertial, view.look, omega, quo::kWgs84, &p);
            EXPECT_LT(quo::norm(p - view.P), 1e-7);
            return steps;
        };
        // Quadratic convergence: each step squares what is missing, in units of some 100 km.
        EXPECT_EQ(steps_from({31e3, -17e3, 23e3}), 5);
        EXPECT_EQ(steps_from({-41.7, 3.9, 17.3}), 3);
        EXPECT_EQ(steps_from({}), 1);
    }
}

TEST(RefineGroundPoint, EndsWhereTheStepsNoLongerShrinkAndWithoutASolution) {
    // At this size a unit in the last place is longer than the step at which the iteration is done.
    constexpr double kScale = 1e9;
    const View view{848730.1};
    quo::RadarLook look = view.look;
    look.tau_s *= kScale;
    Vec3 p = kScale * (view.P + Vec3{31e3, -17e3, 23e3});
    const Ellipsoid body{kScale * quo::kWgs84.equatorial_m, kScale * quo::kWgs84.polar_m};
    EXPECT_LT(quo::refine_ground_point(kScale * view.S, kScale * view.V, look, 0.0, body, &p), 10);
    EXPECT_LT(quo::norm(1.0 / kScale * p - view.P), 1e-7);

    look.tau_s = 0.5 * view.look.tau_s;  // shorter than the height
    p = view.P;
    EXPECT_LE(quo::refine_ground_point(view.S, view.V, look, 0.0, quo::kWgs84, &p), quo::kForwardSteps);
    p = view.S;  // no line of sight, no derivative: nowhere to step
    EXPECT_EQ(quo::refine_ground_point(view.S, view.V, view.look, 0.0, quo::kWgs84, &p), 0);
    EXPECT_EQ(quo::norm(p - view.S), 0.0);
}

}  // namespace
