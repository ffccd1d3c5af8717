#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "orbit_fit.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

namespace {

using test::CircularOrbit;
using test::kLightSpeed;
using test::kSemiMajor;
using test::kSemiMinor;
using test::norm;
using test::sampled;
using test::Trajectory;
using test::Vec3;

constexpr double kLambda = 0.05546576, kSpacing = 10.0, kSpan = 4.0 * kSpacing;

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
Vec3 ground(const Trajectory& orbit, double t, double range, double fd, double side) {
    Vec3 P{};
    EXPECT_EQ(gr_pt(P.v, orbit.position(t).v, orbit.velocity(t).v, 2.0 * range / kLightSpeed, fd, kLambda, 0.0,
                    side, kSemiMajor, kSemiMinor),
              0);
    return P;
}
Trajectory segment(double latitude = 41.3, double heading = -12.7, double height = 693e3) {
    const CircularOrbit orbit{latitude, 12.8, heading, height};
    return {0.0, kSpacing, sampled(5, 0.0, kSpacing, [&](double u) { return orbit.earth_fixed(u).position; })};
}

TEST(InvGrptOpt, ClosesTheRoundTrip) {
    constexpr double kPasses[][4] = {
        {41.3, -12.7, 693e3, 803457.3}, {-77.9, -167.3, 514e3, 751218.9}, {3.1, 97.3, 1336e3, 1748730.1}};
    for (const auto& [latitude, heading, height, range] : kPasses) {
        const Trajectory orbit = segment(latitude, heading, height);
        for (const double t : {0.917, 7.9, 20.0, 31.3, 39.083})
            for (const double fd : {0.0, 1217.6, -9876.5, 90123.4, -90123.4})
                for (const double side : {+1.0, -1.0}) {
                    SCOPED_TRACE(testing::Message() << "height " << height << " t " << t << " fd " << fd);
                    const Vec3 P = ground(orbit, t, range, fd, side);
                    const Seen image = seen(orbit, P, fd);
                    ASSERT_EQ(image.status, 0);
                    EXPECT_NEAR(image.t, t, 1e-9);
                    EXPECT_NEAR(image.tau * kLightSpeed / 2.0, range, 1e-5);
                }
    }
}

// The point is seen at 17.3 s: segments that begin after it or end before it do not see it.
TEST(InvGrptOpt, RefusesWhatTheSpanDoesNotSee) {
    const test::Report report;
    const CircularOrbit orbit{41.3, 12.8, -12.7};
    const Vec3 P = ground(segment(), 17.3, 848730.1, 0.0, 1.0);
    const Trajectory late{-19.3, kSpacing,
                          sampled(5, 0.0, kSpacing, [&](double u) { return orbit.earth_fixed(u).position; })};
    for (const Seen& none : {seen(segment(), P, 0.0, 15.1), seen(segment(), P, 0.0, 17.299), seen(late, P, 0.0),
                             seen(segment(), P, 60000.0)}) {
        EXPECT_EQ(none.status, 12);
        EXPECT_EQ(none.t, 17.3);
        EXPECT_EQ(none.tau, 18.3);
    }
    EXPECT_EQ(report.entries("ERROR").size(), 4U);
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

TEST(InvGrptOpt, RefusesWhatIsNotANumber) {
    const Vec3 P = ground(segment(), 17.3, 848730.1, 0.0, 1.0);
    for (const double bad : {std::numeric_limits<double>::quiet_NaN(), std::numeric_limits<double>::infinity()}) {
        std::vector<Seen> none{seen(segment(), P, bad), seen(segment(), P, 0.0, bad)};
        for (std::size_t i = 0; i < 5; ++i) {
            Vec3 off = P;
            Trajectory broken = segment();
            off[i % 3] = broken.y[i] = bad;
            none.push_back(seen(segment(), off, 0.0));
            none.push_back(seen(broken, P, 0.0));
        }
        for (const Seen& row : none) EXPECT_TRUE(row.status == 12 && row.t == 17.3 && row.tau == 18.3);
    }
}

}  // namespace
