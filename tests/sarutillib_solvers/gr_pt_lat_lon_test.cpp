#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "orbit_fit.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

namespace {

using test::angle_deg;
using test::CircularOrbit;
using test::dot;
using test::kEarthRate;
using test::kLightSpeed;
using test::kSemiMajor;
using test::kSemiMinor;
using test::norm;
using test::sampled;
using test::Trajectory;
using test::Vec3;

constexpr double kLambda = 0.05546576, kSpacing = 10.0, kReference = 803457.3;

int sample(const Trajectory& orbit, double t, double range, double fd, double side, double omega,
           GrPtGeometry& out) {
    return gr_pt_lat_lon(kReference, kSpacing, t, 2.0 * range / kLightSpeed, fd, kLambda, side, omega,
                         orbit.x.data(), orbit.y.data(), orbit.z.data(), kSemiMajor, kSemiMinor, &out);
}

struct Sample {
    const char* name;
    double latitude, longitude, heading, t, range_m, doppler_hz, side;
};
constexpr Sample kSamples[] = {
    {"Right", 41.3, 12.8, -12.7, 17.3, 848730.1, 0.0, +1.0},
    {"LeftSquinted", -23.9, 101.4, -167.3, 23.1, 951218.9, -3217.6, -1.0},
    {"RightSquinted", 8.1, -179.9, -12.7, 20.0, 1048730.1, 8217.6, +1.0},
    {"Polar", 88.7, 12.8, 77.3, 12.9, 803457.3, 217.6, +1.0},
};
class GrPtLatLon : public testing::TestWithParam<Sample> {
protected:
    [[nodiscard]] CircularOrbit orbit() const {
        return {GetParam().latitude, GetParam().longitude, GetParam().heading};
    }
    [[nodiscard]] Trajectory earth_fixed() const {
        return {0.0, kSpacing,
                sampled(5, 0.0, kSpacing, [&](double u) { return orbit().earth_fixed(u).position; })};
    }
    [[nodiscard]] GrPtGeometry geometry(const Trajectory& trajectory, double omega) const {
        const Sample& at = GetParam();
        GrPtGeometry out{};
        EXPECT_EQ(sample(trajectory, kReference + at.t, at.range_m, at.doppler_hz, at.side, omega, out), 0);
        return out;
    }
};

TEST_P(GrPtLatLon, GivesThePointOfGrPtAndItsAngles) {
    const Sample& at = GetParam();
    const Trajectory trajectory = earth_fixed();
    const GrPtGeometry out = geometry(trajectory, 0.0);
    const double u = kReference + at.t - kReference;  // as rounded as the solver's
    const Vec3 S = trajectory.position(u), V = trajectory.velocity(u);
    const Vec3 P{out.point_m[0], out.point_m[1], out.point_m[2]};

    Vec3 same{};
    ASSERT_EQ(gr_pt(same.v, S.v, V.v, 2.0 * at.range_m / kLightSpeed, at.doppler_hz, kLambda, 0.0, at.side,
                    kSemiMajor, kSemiMinor),
              0);
    EXPECT_LT(norm(P - same), 1e-7);
    EXPECT_LT(norm(P - test::geodetic_point(out.latitude_deg, out.longitude_deg)), 5e-9);
    const Vec3 up = test::local_frame(out.latitude_deg, out.longitude_deg).up;
    EXPECT_NEAR(out.incidence_deg, angle_deg(up, S - P), 1e-12);
    EXPECT_NEAR(out.look_deg, angle_deg(-S, P - S), 1e-12);
    EXPECT_NEAR(out.speed_m_s, norm(V), 1e-9);
}

/** Doppler of a point, from the motion of the line of sight. */
double doppler(const Vec3& S, const Vec3& V, const Vec3& P) { return 2.0 / kLambda * dot(V, P - S) / norm(P - S); }

TEST_P(GrPtLatLon, GivesTheSlopeOfTheDoppler) {
    constexpr double kStep = 0.5;
    const Trajectory trajectory = earth_fixed();
    const GrPtGeometry out = geometry(trajectory, 0.0);
    const Vec3 P{out.point_m[0], out.point_m[1], out.point_m[2]};
    const auto at = [&](double steps) {
        const double u = GetParam().t + steps * kStep;
        return doppler(trajectory.position(u), trajectory.velocity(u), P);
    };
    EXPECT_NEAR(at(0.0), GetParam().doppler_hz, 1e-6);
    const double slope = (8.0 * (at(1.0) - at(-1.0)) - (at(2.0) - at(-2.0))) / (12.0 * kStep);
    EXPECT_NEAR(out.fm_rate_hz_s / slope, 1.0, 1e-6);
    EXPECT_LT(out.fm_rate_hz_s, 0.0);
}

// The same pass in axes that do not turn, equal to the Earth-fixed ones at the time of the sample.
TEST_P(GrPtLatLon, AgreesWithItselfInInertialAxes) {
    const double t = GetParam().t;
    const Trajectory inertial{0.0, kSpacing, sampled(5, 0.0, kSpacing, [&](double u) {
                                  return test::turned(orbit().inertial(u).position, -kEarthRate * t);
                              })};
    const GrPtGeometry fixed = geometry(earth_fixed(), 0.0), turning = geometry(inertial, kEarthRate);
    EXPECT_NEAR(turning.latitude_deg, fixed.latitude_deg, 1e-8);
    EXPECT_NEAR(turning.fm_rate_hz_s / fixed.fm_rate_hz_s, 1.0, 1e-6);
    EXPECT_NEAR(turning.incidence_deg, fixed.incidence_deg, 1e-8);
}
INSTANTIATE_TEST_SUITE_P(Samples, GrPtLatLon, testing::ValuesIn(kSamples),
                         [](const auto& row) { return row.param.name; });

TEST(GrPtLatLonFaults, PassOnTheStatusOfTheStartingPoint) {
    const test::Report report;
    const CircularOrbit orbit{41.3, 12.8, -12.7};
    const Trajectory trajectory{
        0.0, kSpacing, sampled(5, 0.0, kSpacing, [&](double u) { return orbit.earth_fixed(u).position; })};
    GrPtGeometry out{};
    out.look_deg = 17.3;
    EXPECT_EQ(sample(trajectory, kReference + 17.3, 80345.7, 0.0, 1.0, 0.0, out), 10);
    EXPECT_EQ(sample(trajectory, std::nan(""), 848730.1, 0.0, 1.0, 0.0, out), 1);
    EXPECT_EQ(out.look_deg, 17.3);
    const auto errors = report.entries("ERROR"), tree = report.entries("ERROR_CALL_TREE");
    ASSERT_EQ(errors.size(), 2U);
    EXPECT_EQ(errors[0].function, "gr_pt0");
    ASSERT_EQ(tree.size(), 2U);
    EXPECT_EQ(tree[0].function, "gr_pt_lat_lon");
}

/** A descending pass over the sea, from a product: state vectors 10 s apart and points of its geolocation grid.
 * Contains modified Copernicus Sentinel data 2020. */
namespace real {
const std::vector<double> kPositions{1642875.426227, -6691736.570208, 1604552.28083,   1631282.196926,
                                     -6711619.89965, 1532142.496123,  1619477.59444,   -6730733.539611,
                                     1459559.616155, 1607464.069351,  -6749075.049413, 1386811.84246,
                                     1595244.099358, -6766642.079446, 1313907.395183};
constexpr double kFirst = 1133090022.6516778;
struct TiePoint {
    double t, tau, latitude, longitude, look;
};
constexpr TiePoint kTiePoints[] = {
    {1133090037.492938, 0.005330886594997056, 12.9689603977848, -79.73490826714345, 27.53030698505915},
    {1133090037.493462, 0.006380337593618161, 13.40822936056225, -82.0108833492346, 40.41369077817829},
    {1133090046.496782, 0.00533088659499012, 12.42441574976831, -79.84683492443872, 27.5298826253001},
    {1133090049.498588, 0.006380304309893076, 12.68396405286191, -82.15324274382826, 40.41332408416942},
};
}  // namespace real

TEST(GrPtLatLonTruth, MeetsTheGeolocationGridOfARealProduct) {
    const Trajectory orbit{0.0, kSpacing, real::kPositions};
    for (const real::TiePoint& tie : real::kTiePoints) {
        GrPtGeometry out{};
        ASSERT_EQ(
            sample(orbit, kReference + (tie.t - real::kFirst), tie.tau * kLightSpeed / 2.0, 0.0, 1.0, 0.0, out),
            0);
        EXPECT_NEAR(out.latitude_deg, tie.latitude, 3e-7);  // 3 cm: the grid's times are rounded to 1e-6 s
        EXPECT_NEAR(out.longitude_deg, tie.longitude, 3e-7);
        EXPECT_NEAR(out.look_deg, tie.look, 2e-5);
    }
    // The product's own FM rate polynomial, for one time.
    constexpr double kTime = 1133090040.155807, kTau = 0.0058;
    const double u = kTau - 0.00533062135915133;
    const double rate = -2340.278813288759 + u * (447589.9234491635 + u * -77704099.64702502);
    GrPtGeometry out{};
    ASSERT_EQ(sample(orbit, kReference + (kTime - real::kFirst), kTau * kLightSpeed / 2.0, 0.0, 1.0, 0.0, out), 0);
    EXPECT_NEAR(out.fm_rate_hz_s, rate, 1.0);
}

}  // namespace
