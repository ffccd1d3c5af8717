#include <gtest/gtest.h>

#include <cmath>

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
    double latitude, longitude, heading, t, range_m, doppler_hz, side;
};
constexpr Sample kSamples[] = {
    {41.3, 12.8, -12.7, 17.3, 848730.1, 0.0, +1.0},
    {-23.9, 101.4, -167.3, 23.1, 951218.9, -3217.6, -1.0},
    {8.1, -179.9, -12.7, 20.0, 1048730.1, 8217.6, +1.0},
    {88.7, 12.8, 77.3, 12.9, 803457.3, 217.6, +1.0},
};
class GrPtLatLon : public testing::TestWithParam<Sample> {
protected:
    /** A segment through five positions. */
    template <typename Position>
    static Trajectory through(Position position) {
        return {0.0, kSpacing, sampled(5, 0.0, kSpacing, position)};
    }
    [[nodiscard]] GrPtGeometry geometry(const Trajectory& trajectory, double omega) const {
        GrPtGeometry out{};
        EXPECT_EQ(sample(trajectory, kReference + at_.t, at_.range_m, at_.doppler_hz, at_.side, omega, out), 0);
        return out;
    }
    Sample at_ = GetParam();
    CircularOrbit orbit_{at_.latitude, at_.longitude, at_.heading};
    Trajectory trajectory_ = through([this](double u) { return orbit_.earth_fixed(u).position; });
    GrPtGeometry out_ = geometry(trajectory_, 0.0);
    Vec3 P_{out_.point_m[0], out_.point_m[1], out_.point_m[2]};
};

TEST_P(GrPtLatLon, GivesThePointOfGrPtAndItsAngles) {
    const double u = kReference + at_.t - kReference;  // as rounded as the solver's
    const Vec3 S = trajectory_.position(u), V = trajectory_.velocity(u);
    Vec3 same{};
    ASSERT_EQ(gr_pt(same.v, S.v, V.v, 2.0 * at_.range_m / kLightSpeed, at_.doppler_hz, kLambda, 0.0, at_.side,
                    kSemiMajor, kSemiMinor),
              0);
    EXPECT_LT(norm(P_ - same), 1e-7);
    EXPECT_LT(norm(P_ - test::geodetic_point(out_.latitude_deg, out_.longitude_deg)), 5e-9);
    const Vec3 up = test::local_frame(out_.latitude_deg, out_.longitude_deg).up;
    EXPECT_NEAR(out_.incidence_deg, angle_deg(up, S - P_), 1e-12);
    EXPECT_NEAR(out_.look_deg, angle_deg(-S, P_ - S), 1e-12);
    EXPECT_NEAR(out_.speed_m_s, norm(V), 1e-9);
}

// Doppler from the motion of the line of sight, and its slope.
TEST_P(GrPtLatLon, GivesTheSlopeOfTheDoppler) {
    const auto doppler = [&](double u) {
        const Vec3 line = P_ - trajectory_.position(u);
        return 2.0 / kLambda * dot(trajectory_.velocity(u), line) / norm(line);
    };
    EXPECT_NEAR(doppler(at_.t), at_.doppler_hz, 1e-6);
    const double near = doppler(at_.t + 0.5) - doppler(at_.t - 0.5), far = doppler(at_.t + 1) - doppler(at_.t - 1);
    EXPECT_NEAR(out_.fm_rate_hz_s / ((8.0 * near - far) / 6.0), 1.0, 1e-6);
    EXPECT_LT(out_.fm_rate_hz_s, 0.0);
}

// The same pass in axes that do not turn, equal to the Earth-fixed ones at the time of the sample.
TEST_P(GrPtLatLon, AgreesWithItselfInInertialAxes) {
    const GrPtGeometry turning =
        geometry(through([&](double u) { return test::turned(orbit_.inertial(u).position, -kEarthRate * at_.t); }),
                 kEarthRate);
    EXPECT_NEAR(turning.latitude_deg, out_.latitude_deg, 1e-8);
    EXPECT_NEAR(turning.fm_rate_hz_s / out_.fm_rate_hz_s, 1.0, 1e-6);
    EXPECT_NEAR(turning.incidence_deg, out_.incidence_deg, 1e-8);
}
INSTANTIATE_TEST_SUITE_P(Samples, GrPtLatLon, testing::ValuesIn(kSamples));

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

}  // namespace
