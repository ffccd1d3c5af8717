// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/geometry/geometry_kernels.h"

#include "support/geometry.h"
#include "support/prelude.h"

namespace {

using quo::Ellipsoid;
using quo::Vec3;

test::Vec3 plain(const Vec3& p) { return {p.x, p.y, p.z}; }

TEST(Geodetic, ReturnsFromEveryPlaceAndHeight) {
    constexpr Ellipsoid kBodies[] = {quo::kWgs84, {6371000.3, 6371000.3}, {3396190.0, 3376200.0}, {6.3e6, 6.4e6}};
    for (const Ellipsoid& body : kBodies)
        for (const double latitude : {-90.0, -89.9999999, -45.3, -1e-7, 0.0, 44.9})
            for (const double longitude : {-179.9999999, -90.0, 0.0, 101.4, 180.0})
                for (const double height : {-9517.3, 0.0, 8848.1, 36e6}) {
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
    // On the axis and at the centre there is an answer, too.
    EXPECT_EQ(quo::to_geodetic({0.0, 0.0, -test::kSemiMinor}, quo::kWgs84).longitude_deg, 0.0);
    const auto centre = quo::to_geodetic({0.0, 0.0, 0.0}, quo::kWgs84);
    EXPECT_TRUE(std::isfinite(centre.latitude_deg) && std::isfinite(centre.height_m));
}

// The last rate is that of a body turning ten times as fast as the Earth. At the last scale a unit in the last
// place is longer than the step at which the iteration is done: it ends where the steps no longer shrink.
TEST(RefineGroundPoint, FindsTheSolutionFromAfar) {
    const test::Platform sat = test::circular_orbit(41.3, 12.8, -12.7);
    quo::RadarLook look{2.0 * 848730.1 / test::kLightSpeed, 3217.6, 0.0555, 1.0};
    const Vec3 S = quo::load(sat.position.v), V = quo::load(sat.velocity.v);
    Vec3 P{};
    ASSERT_EQ(quo::ground_point(S, V, look, quo::kWgs84, &P), 0);
    const auto refine = [&](const Vec3& away, double omega, double scale = 1.0) {
        const Vec3 inertial = V + quo::cross({0.0, 0.0, omega}, S);  // the velocity of the same platform
        const Ellipsoid body{scale * quo::kWgs84.equatorial_m, scale * quo::kWgs84.polar_m};
        quo::RadarLook scaled = look;
        scaled.tau_s *= scale;
        Vec3 p = scale * (P + away);
        const int steps = quo::refine_ground_point(scale * S, scale * inertial, scaled, omega, body, &p);
        EXPECT_LT(quo::norm(1.0 / scale * p - P), 1e-7);
        return steps;
    };
    for (const double omega : {0.0, test::kEarthRate, 10.0 * test::kEarthRate}) {
        // Quadratic convergence: each step squares what is missing, in units of some 100 km.
        EXPECT_EQ(refine({31e3, -17e3, 23e3}, omega), 5);
        EXPECT_EQ(refine({-41.7, 3.9, 17.3}, omega), 3);
        EXPECT_EQ(refine({}, omega), 1);
    }
    look.fd_hz = 0.0;
    ASSERT_EQ(quo::ground_point(S, V, look, quo::kWgs84, &P), 0);
    EXPECT_LT(refine({31e3, -17e3, 23e3}, 0.0, 1e9), 10);

    look.tau_s *= 0.5;  // shorter than the height
    Vec3 p = P;
    EXPECT_LE(quo::refine_ground_point(S, V, look, 0.0, quo::kWgs84, &p), quo::kForwardSteps);
    p = S;  // no line of sight, no derivative: nowhere to step
    EXPECT_EQ(quo::refine_ground_point(S, V, look, 0.0, quo::kWgs84, &p), 0);
    EXPECT_EQ(quo::norm(p - S), 0.0);
}

}  // namespace
