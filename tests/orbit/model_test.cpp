#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

// The continuous orbit: which run of five vectors is in use when, and what the model makes of it.

namespace {

using test::Vec3;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr test::Times kTimes{803457.3, 9.7, 17};

/** Vectors on no curve of low degree: every run has a polynomial of its own, which tells it apart. */
test::Platform rugged(double t) {
    const double s = (t - kTimes.first_s) / kTimes.spacing_s;
    const Vec3 p{7.1e6 * std::cos(1.7 * s * s), 6.9e6 * std::sin(2.9 * s), 5e6 * std::cos(0.9 * s + s * s)};
    return {p, {}, {}};
}

/** Value at t of the degree-4 polynomial through five of the orbit's positions, by Neville's scheme. */
Vec3 run_position(const GeneralSAROrbit& orbit, int k, double t) {
    Vec3 p[5];
    double x[5];
    for (int i = 0; i < 5; ++i) {
        const double* from = orbit.pSV_m + 3 * static_cast<std::ptrdiff_t>(k + i);
        p[i] = {from[0], from[1], from[2]};
        x[i] = orbit.t0SV_s + (k + i) * orbit.dtSV_s;
    }
    for (int width = 1; width < 5; ++width)
        for (int i = 0; i + width < 5; ++i)
            p[i] = 1.0 / (x[i + width] - x[i]) * ((x[i + width] - t) * p[i] + (t - x[i]) * p[i + 1]);
    return p[0];
}

/** The run that gives the orbit's position at t, -1 for none. */
int run_in_use(GeneralSAROrbit& orbit, double t) {
    const Vec3 position = test::position_at(orbit, t);
    for (int k = 0; k + 5 <= orbit.nSV_n; ++k) {
        const Vec3 expected = run_position(orbit, k, t);
        if (test::norm(position - expected) <= 1e-8 * test::norm(expected) + 1e-4) return k;
    }
    return -1;
}

double after(double t) { return std::nextafter(t, 1e300); }
double before(double t) { return std::nextafter(t, -1e300); }
/** Time of a vector, plus a part of the spacing, computed as one computes it. */
double place(int vector, double part) {
    return kTimes.first_s + vector * kTimes.spacing_s + part * kTimes.spacing_s;
}

struct Choice {
    double from, to;  // times asked for one after the other
    int first_run, then_run;
};
// In spacings: runs are kept from 0.6 to 3.4 after their first vector. 5.05 comes as a jump and takes run
// floor(5.05 - 0.6) = 4, kept from 4.6 to 7.4.
const double kJump = place(5, 0.05);
const Choice kChoices[] = {
    {kJump, place(6, 0.7), 4, 4},
    {kJump, place(4, 0.6), 4, 4},  // the early edge itself
    {kJump, before(place(4, 0.6)), 4, 2},
    {kJump, place(4, 3.4), 4, 4},  // the late edge itself
    {kJump, after(place(4, 3.4)), 4, 6},
    {kJump, place(4, 0.2), 4, 1},    // beyond the early edge: the run that ends there
    {kJump, place(3, 0.5), 4, 1},    // which reaches a bit before the run
    {kJump, place(3, 0.3), 4, 2},    // jumps back take the run that starts there
    {kJump, place(3, 0.35), 4, 2},   // and begin right beyond the early edge's reach
    {kJump, place(11, 0.5), 4, 10},  // jumps ahead as well
    {kJump, place(16, 0.0), 4, 12},  // the last run is the end
    {kJump, place(16, 0.01), 4, 12},
    {kJump, place(20, 0.0), 4, 12},
    {kJump, place(0, 0.0), 4, 0},
    {kJump, before(kTimes.first_s), 4, 0},
    {kJump, place(-3, 0.0), 4, 0},
    {place(2, 0.05), place(0, 0.1), 1, 0},   // the first run at its own early edge
    {place(2, 0.05), place(1, 0.55), 1, 0},  // the second run gives way to it
    {place(16, 0.0), before(place(12, 0.6)), 12, 10},
};
TEST(RunChoice, FollowsTheRule) {
    for (const Choice& row : kChoices) {
        SCOPED_TRACE(testing::Message() << "row " << &row - kChoices);
        GeneralSAROrbit orbit;
        test::make_orbit(orbit, kTimes, rugged);
        // From the other end of the orbit, so that `from` is a jump.
        ASSERT_EQ(orbit.updatePolys(row.from > kTimes.at(8) ? kTimes.first_s : kTimes.last()), 0);
        EXPECT_EQ(run_in_use(orbit, row.from), row.first_run);
        EXPECT_EQ(run_in_use(orbit, row.to), row.then_run);
    }
}

/** Runs taken while a time goes evenly from one end of the orbit to the other. */
std::int64_t runs_taken(GeneralSAROrbit& orbit, double from, double to) {
    EXPECT_EQ(orbit.updatePolys(from), 0);
    const std::int64_t before_it = orbit.polyUpdates();
    constexpr int kSteps = 10000;
    Vec3 ignored{};
    for (int i = 0; i <= kSteps; ++i) EXPECT_EQ(orbit.SVGetPos(from + i * ((to - from) / kSteps), ignored.v), 0);
    return orbit.polyUpdates() - before_it;
}

// A run serves 3.4 - 1.4 = 2.6 - 0.6 = 2 spacings of a sweep: runs 0, 2, ... 12 and back, six changes each way.
TEST(Sweep, ChangesRunsAsSeldomAsPossible) {
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, kTimes, rugged);
    EXPECT_EQ(runs_taken(orbit, kTimes.first_s, kTimes.last()), 6);
    EXPECT_EQ(runs_taken(orbit, kTimes.last(), kTimes.first_s), 6);
    for (const double edge : {place(4, 3.4), place(4, 0.6)}) {  // nor does it flutter at an edge
        ASSERT_EQ(orbit.updatePolys(kJump), 0);
        const std::int64_t before_it = orbit.polyUpdates();
        for (int i = 0; i < 1000; ++i) ASSERT_EQ(orbit.updatePolys(edge + (i % 2 ? 1e-3 : -1e-3)), 0);
        EXPECT_LE(orbit.polyUpdates() - before_it, 1);
    }
}

// The velocities of the list are no part of the model, wherever they come from.
TEST(Model, PassesThroughItsVectorsAndDifferentiatesItself) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, kTimes, [&](double t) {
        return test::Platform{circle.earth_fixed(t - kTimes.first_s).position, Vec3{17.0, 18.0, 19.0}, {}};
    });
    for (int i = 0; i < kTimes.count; ++i) {
        const test::Platform truth = circle.earth_fixed(kTimes.at(i) - kTimes.first_s);
        EXPECT_LT(test::norm(test::position_at(orbit, kTimes.at(i)) - truth.position),
                  2e-6);  // of time's rounding
        EXPECT_LT(test::norm(test::velocity_at(orbit, kTimes.at(i)) - truth.velocity), 1e-4);
    }
    for (int i = 0; i < 130; ++i) {
        const double t = kTimes.first_s - 7.0 + i * 1.3;
        const double h = std::ldexp(1.0, -3);
        ASSERT_EQ(orbit.updatePolys(t), 0);
        const auto updates = orbit.polyUpdates();
        const auto across = [&](double step) {
            return test::position_at(orbit, t + step) - test::position_at(orbit, t - step);
        };
        const Vec3 slope = 1.0 / (12.0 * h) * (8.0 * across(h) - across(2.0 * h));
        const Vec3 velocity = test::velocity_at(orbit, t);
        if (orbit.polyUpdates() == updates) {
            EXPECT_LT(test::norm(slope - velocity), 1e-6);
        }
    }
}

TEST(Model, HasOneRunOfFiveVectors) {
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, {kTimes.first_s, kTimes.spacing_s, 5}, rugged);
    for (const double t : {place(0, -2.2), place(0, 0.1), place(4, 0.0), place(4, 2.2)})
        EXPECT_EQ(run_in_use(orbit, t), 0);
    EXPECT_EQ(runs_taken(orbit, place(0, -5.0), place(4, 5.0)), 0);
}

TEST(Model, AscendsWithTheFirstVectorsVelocity) {
    GeneralSAROrbit orbit;
    for (const double z : {1e-300, 7.3, 0.0, -0.0, -7.3, kNaN}) {
        ASSERT_EQ(orbit.SVCreate(1.5, 9.7, 5), 0);
        orbit.vSV_mOs[2] = z;
        orbit.vSV_mOs[5] = 3.0;
        EXPECT_EQ(orbit.isAscending(), z > 0.0);
    }
}

TEST(Model, NeedsFiveVectors) {
    GeneralSAROrbit orbit;
    const test::Report report;
    for (const int count : {4, 0, -1, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()}) {
        ASSERT_EQ(orbit.SVCreate(1.5, 9.7, 5), 0);
        EXPECT_EQ(orbit.SVCreate(1.5, 9.7, count), QUO_REFUSED);
        EXPECT_EQ(report.messages("ERROR").back() == "You must provide at least 5 state vectors!", count < 5);
        EXPECT_TRUE(!orbit.pSV_m && !orbit.vSV_mOs && orbit.nSV_n == 0);
        EXPECT_EQ(orbit.computeApproximateSV(), QUO_REFUSED);
        EXPECT_EQ(report.messages("ERROR").back(), "You must provide at least 5 state vectors!");
    }
}

TEST(SpoiltVectors, GiveNoModel) {
    const struct {
        void (*spoil)(GeneralSAROrbit& orbit);
        int status;
    } rows[] = {
        {[](auto& o) { o.pSV_m[3 * 9 + 1] = kNaN; }, QUO_NUMERIC},
        {[](auto& o) { o.pSV_m[3 * 16 + 2] = -std::numeric_limits<double>::infinity(); }, QUO_NUMERIC},
        {[](auto& o) { o.dtSV_s = 0.0; }, QUO_REFUSED},
        {[](auto& o) { o.dtSV_s = -9.7; }, QUO_REFUSED},
        {[](auto& o) { o.dtSV_s = kNaN; }, QUO_REFUSED},
        {[](auto& o) { o.dtSV_s = 1e-13; }, QUO_REFUSED},  // lost in the rounding of the times
        {[](auto& o) { o.t0SV_s = kNaN; }, QUO_REFUSED},
        {[](auto& o) { o.nSV_n = 2000000; }, QUO_REFUSED},  // changed by hand
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(testing::Message() << "row " << &row - rows);
        GeneralSAROrbit orbit;
        test::make_orbit(orbit, kTimes, rugged);
        row.spoil(orbit);
        EXPECT_EQ(orbit.computeApproximateSV(), row.status);
        double xyz[3] = {1.0, 2.0, 3.0};
        EXPECT_EQ(orbit.SVGetPos(kTimes.at(3), xyz), QUO_REFUSED);
        EXPECT_EQ(xyz[0] + xyz[1] + xyz[2], 6.0);
        orbit.nSV_n = kTimes.count;
    }
}

// --- the plain record -------------------------------------------------------------------------------------------

TEST(StateVectorRecord, FitsOnePolynomialThroughAll) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    SAROrbitStateVectors_Obj record, unfitted, copy;
    EXPECT_EQ(record.nSV_n, -999);
    EXPECT_EQ(record.t0SV_s + record.dtSV_s, -1998.0);
    double xyz[3] = {1.0, 2.0, 3.0}, same[3] = {};
    EXPECT_EQ(record.SVPolyCompute(), QUO_REFUSED);
    ASSERT_EQ(record.SVCreate(803457.3, 9.7, 9), 0);
    for (int i = 0; i < 9; ++i) {
        const test::Platform state = circle.earth_fixed(i * 9.7);
        std::copy_n(state.position.v, 3, record.pSV_m + 3 * static_cast<std::ptrdiff_t>(i));
        std::copy_n(state.velocity.v, 3, record.vSV_mOs + 3 * static_cast<std::ptrdiff_t>(i));
    }
    EXPECT_EQ(record.positionPoly(0), nullptr);
    ASSERT_EQ(record.clone(&unfitted), 0);
    EXPECT_EQ(unfitted.SVGetPos(803457.3, xyz), QUO_REFUSED);
    ASSERT_EQ(unfitted.SVPolyCompute() + record.SVPolyCompute(), 0);
    for (int step = 0; step < 24; ++step) {
        const double u = step * 3.3;
        const test::Platform truth = circle.earth_fixed(u);
        Vec3 p{}, v{};
        ASSERT_EQ(record.SVGetPos(803457.3 + u, p.v) + record.SVGetVel(803457.3 + u, v.v), 0);
        EXPECT_LT(test::norm(p - truth.position), 1e-5);
        EXPECT_LT(test::norm(v - truth.velocity), 1e-5);
        for (int axis = 0; axis < 3; ++axis) {  // the velocities have polynomials of their own
            double value = 0.0;
            for (int i = 0; i < 9; ++i) value = value * u + record.velocityPoly(axis)[i];
            EXPECT_NEAR(value, truth.velocity[static_cast<std::size_t>(axis)], 1e-6);
        }
    }
    EXPECT_EQ(record.SVGetPos(kNaN, xyz), QUO_REFUSED);
    EXPECT_EQ(xyz[0] + xyz[1] + xyz[2], 6.0);
    ASSERT_EQ(record.clone(&copy) + record.SVGetPos(803467.9, xyz), 0);
    record.SVDestroy();
    ASSERT_EQ(copy.SVGetPos(803467.9, same), 0);
    EXPECT_EQ(same[0] + same[1] + same[2], xyz[0] + xyz[1] + xyz[2]);
    EXPECT_EQ(record.SVGetPos(803467.9, xyz), QUO_REFUSED);
}

TEST(StateVectorRecord, HasNoLowerBound) {
    using Limits = std::numeric_limits<int>;
    SAROrbitStateVectors_Obj record;
    for (const int count : {0, 4, 1, -1, Limits::min(), Limits::max()}) {
        const bool possible = count >= 0 && count < 5;
        EXPECT_EQ(record.SVCreate(1.5, 9.7, count), possible ? 0 : QUO_REFUSED);
        EXPECT_EQ(record.nSV_n, possible ? count : 0);
        EXPECT_EQ(record.pSV_m != nullptr, possible && count > 0);
        EXPECT_EQ(record.SVPolyCompute(), record.pSV_m ? 0 : QUO_REFUSED);
    }
}

}  // namespace
