// SPDX-License-Identifier: Apache-2.0
#include "orbit_fit.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

// The solvers that work on one segment of an orbit.

namespace {

using test::CircularOrbit, test::Trajectory, test::Vec3;
using test::kEarthRate, test::kLightSpeed, test::kSemiMajor, test::kSemiMinor;

constexpr double kLambda = 0.05546576, kSpacing = 10.0, kSpan = 4.0 * kSpacing, kReference = 803457.3;

/** The polynomials of a pass that begins at a time; in axes that do not turn, equal to the Earth-fixed ones at
 * `still_at` where that is given. */
Trajectory segment(const CircularOrbit& orbit, double from = 0.0, double still_at = 0.0) {
    return {from, kSpacing, test::sampled(5, 0.0, kSpacing, [&](double u) {
                return still_at > 0.0 ? test::turned(orbit.inertial(u).position, -kEarthRate * still_at)
                                      : orbit.earth_fixed(u).position;
            })};
}
Trajectory segment() { return segment({41.3, 12.8, -12.7}); }

int sample(const Trajectory& orbit, double t, double range, double fd, double side, double omega,
           GrPtGeometry& out) {
    return gr_pt_lat_lon(kReference, kSpacing, t, 2.0 * range / kLightSpeed, fd, kLambda, side, omega,
                         orbit.x.data(), orbit.y.data(), orbit.z.data(), kSemiMajor, kSemiMinor, &out);
}

Vec3 ground(const Trajectory& orbit, double t, double range, double fd, double side) {
    Vec3 P{};
    EXPECT_EQ(gr_pt(P.v, orbit.position(t).v, orbit.velocity(t).v, 2.0 * range / kLightSpeed, fd, kLambda, 0.0,
                    side, kSemiMajor, kSemiMinor),
              0);
    return P;
}
struct Seen {
    double t = 17.3, tau = 18.3;
    int status = 0;
};
Seen seen(const Trajectory& orbit, const Vec3& P, double fd, double span = kSpan) {
    Seen out;
    out.status = inv_grpt_opt(&out.t, &out.tau, nullptr, orbit.x.data(), orbit.y.data(), orbit.z.data(), P.v, span,
                              kLambda, fd);
    return out;
}

struct Sample {
    double latitude, heading, t, range_m, doppler_hz, side;
};
// The point is that of gr_pt(); its angles, and the slope of the Doppler from the motion of the line of sight. The
// same pass in axes that do not turn, equal to the Earth-fixed ones at the time of the sample, gives the same.
TEST(GrPtLatLon, GivesThePointOfGrPtWithItsAnglesAndTheSlopeOfItsDopplerAndLeadsBack) {
    for (const Sample& at :
         {Sample{41.3, -12.7, 17.3, 848730.1, 0.0, +1.0}, Sample{-23.9, -167.3, 23.1, 951218.9, -3217.6, -1.0}}) {
        SCOPED_TRACE(at.latitude);
        const CircularOrbit orbit{at.latitude, 12.8, at.heading};
        const Trajectory fixed = segment(orbit), turning = segment(orbit, 0.0, at.t);
        GrPtGeometry out{}, inertial{};
        ASSERT_EQ(sample(fixed, kReference + at.t, at.range_m, at.doppler_hz, at.side, 0.0, out), 0);
        ASSERT_EQ(sample(turning, kReference + at.t, at.range_m, at.doppler_hz, at.side, kEarthRate, inertial), 0);
        EXPECT_NEAR(inertial.latitude_deg, out.latitude_deg, 1e-8);
        EXPECT_NEAR(inertial.fm_rate_hz_s / out.fm_rate_hz_s, 1.0, 1e-6);
        EXPECT_NEAR(inertial.incidence_deg, out.incidence_deg, 1e-8);

        const double u = kReference + at.t - kReference;  // as rounded as the solver's
        const Vec3 S = fixed.position(u), V = fixed.velocity(u), P{out.point_m[0], out.point_m[1], out.point_m[2]};
        EXPECT_LT(norm(P - ground(fixed, u, at.range_m, at.doppler_hz, at.side)), 1e-7);
        EXPECT_LT(norm(P - test::geodetic_point(out.latitude_deg, out.longitude_deg)), 5e-9);
        const Vec3 up = test::local_frame(out.latitude_deg, out.longitude_deg).up;
        EXPECT_NEAR(out.incidence_deg, test::angle_deg(up, S - P), 1e-12);
        EXPECT_NEAR(out.look_deg, test::angle_deg(-S, P - S), 1e-12);
        EXPECT_NEAR(out.speed_m_s, norm(V), 1e-9);
        const auto doppler = [&](double later) {
            const Vec3 line = P - fixed.position(at.t + later);
            return 2.0 / kLambda * dot(fixed.velocity(at.t + later), line) / norm(line);
        };
        const double near = doppler(0.5) - doppler(-0.5), far = doppler(1.0) - doppler(-1.0);
        EXPECT_NEAR(out.fm_rate_hz_s / ((8.0 * near - far) / 6.0), 1.0, 1e-6);
        EXPECT_LT(out.fm_rate_hz_s, 0.0);

        const Seen back = seen(fixed, P, at.doppler_hz);
        ASSERT_EQ(back.status, 0);
        EXPECT_NEAR(back.t, u, 1e-9);
        EXPECT_NEAR(back.tau * kLightSpeed / 2.0, at.range_m, 1e-5);
    }
    const test::Report report;
    GrPtGeometry out{};
    out.look_deg = 17.3;
    EXPECT_EQ(sample(segment(), kReference + 17.3, 80345.7, 0.0, 1.0, 0.0, out), 10);
    EXPECT_EQ(sample(segment(), std::nan(""), 848730.1, 0.0, 1.0, 0.0, out), 1);
    EXPECT_EQ(out.look_deg, 17.3);
    ASSERT_EQ(report.entries().size(), 4U);
    EXPECT_EQ(report.entries()[0].function + report.entries()[1].function, "gr_pt0gr_pt_lat_lon");
}

// The point is seen at 17.3 s: segments that begin after it or end before it do not see it.
TEST(InvGrptOpt, RefusesWhatTheSpanDoesNotSee) {
    const test::Report report;
    const Vec3 P = ground(segment(), 17.3, 848730.1, 0.0, 1.0);
    const Trajectory late = segment({41.3, 12.8, -12.7}, -19.3);
    std::vector<Seen> none{seen(segment(), P, 0.0, 15.1), seen(segment(), P, 0.0, 17.299), seen(late, P, 0.0),
                           seen(segment(), P, 60000.0), seen(segment(), {1e6, 6.3e6, 2e6}, 1e300)};
    for (const double bad : {std::nan(""), std::numeric_limits<double>::infinity()}) {
        none.insert(none.end(), {seen(segment(), P, bad), seen(segment(), P, 0.0, bad)});
        for (std::size_t i = 0; i < 5; ++i) {
            Vec3 off = P;
            Trajectory broken = segment();
            off[i % 3] = broken.y[i] = bad;
            none.insert(none.end(), {seen(segment(), off, 0.0), seen(broken, P, 0.0)});
        }
    }
    Trajectory still = segment();  // no motion, no slope
    for (auto* axis : {&still.x, &still.y, &still.z}) std::fill_n(axis->begin(), 4, 0.0);
    none.push_back(seen(still, P, 0.0));
    for (const Seen& row : none) EXPECT_TRUE(row.status == 12 && row.t == 17.3 && row.tau == 18.3);
    EXPECT_EQ(report.entries("ERROR").size(), none.size());
    EXPECT_EQ(seen(segment(), P, 0.0, 17.301).status, 0);
}

// A platform whose motion along a line is x = (t - 5)^3 makes the residual of a point beside the place of t = 5 a
// fifth power, of which Newton's method takes a fifth off the distance in every step: eight of them are made from
// span / 2, and the range time is that before the last.
TEST(InvGrptOpt, MakesEightStepsAndGivesTheRangeTimeBeforeTheLast) {
    const double along[5] = {0.0, 1.0, -15.0, 75.0, -125.0}, still[5] = {}, P[3] = {0.0, 0.0, 7.3};
    double t = 0.0, tau = 0.0;
    ASSERT_EQ(inv_grpt_opt(&t, &tau, nullptr, along, still, still, P, 23.0, kLambda, 0.0), 0);
    const double from_start = 23.0 / 2.0 - 5.0;
    EXPECT_NEAR(t, 5.0 + std::pow(0.8, 8) * from_start, 1e-10);
    const double x = std::pow(std::pow(0.8, 7) * from_start, 3);
    EXPECT_NEAR(tau * kLightSpeed / 2.0, std::hypot(x, 7.3), 1e-9);
}

}  // namespace
