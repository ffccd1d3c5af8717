// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/orbit_model.h"
#include "orbit/made_orbits.h"
#include "quo_base/interp_orb.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

// The continuous orbit: which run of five vectors is in use when, and what the model makes of it.

namespace {

using test::Vec3;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr test::Times kTimes{803457.3, 9.7, 17};

/** Time of a vector, plus a part of the spacing, computed as one computes it; a step of rounding beyond it. */
double place(int vector, double part, int beyond = 0) {
    const double t = kTimes.first_s + vector * kTimes.spacing_s + part * kTimes.spacing_s;
    return beyond == 0 ? t : std::nextafter(t, beyond * 1e300);
}

struct Choice {
    double from, to;  // times asked for one after the other
    int first_run, then_run;
};
// In spacings: runs are kept from 0.6 to 3.4 after their first vector. 5.05 comes as a jump and takes run
// floor(5.05 - 0.6) = 4, kept from 4.6 to 7.4.
const double kJump = place(5, 0.05);
const Choice kChoices[] = {
    {kJump, place(4, 0.6), 4, 4},  // the early edge itself
    {kJump, place(4, 0.6, -1), 4, 2},
    {kJump, place(4, 3.4), 4, 4},  // the late edge itself
    {kJump, place(4, 3.4, +1), 4, 6},
    {kJump, place(3, 0.5), 4, 1},   // beyond the early edge: the run that ends there
    {kJump, place(3, 0.35), 4, 2},  // jumps back take the run that starts there
    {kJump, place(11, 0.5), 4, 10},
    {kJump, place(20, 0.0), 4, 12},  // the last run is the end
    {kJump, place(0, 0.0, -1), 4, 0},
    {place(2, 0.05), place(1, 0.55), 1, 0},  // the second run gives way to the first
    {place(16, 0.0), place(12, 0.6, -1), 12, 10},
};
TEST(Runs, FollowTheRule) {
    const test::Flight flight{kTimes};
    const auto model = quo::OrbitModel::create(17);
    ASSERT_EQ(model->build({flight.orbit.pSV_m, flight.orbit.vSV_mOs, 17, kTimes.spacing_s}, kTimes.first_s), 0);
    const auto run_at = [&](double t) {
        model->select(t);
        return std::lround((model->reference() - kTimes.first_s) / kTimes.spacing_s);
    };
    for (const Choice& row : kChoices) {
        SCOPED_TRACE(testing::Message() << "row " << &row - kChoices);
        run_at(row.from > kTimes.at(8) ? kTimes.first_s : kTimes.last());  // so that `from` is a jump
        EXPECT_EQ(run_at(row.from), row.first_run);
        const std::int64_t before_it = model->switches();
        EXPECT_EQ(run_at(row.to), row.then_run);
        EXPECT_EQ(model->switches() - before_it, row.then_run != row.first_run);
    }
}

// Points straight aside of the platform: at the time from which they are made.
TEST(CloseGuess, StopsWithinAHundredthOfASpacing) {
    const test::Flight flight{{803457.3, 0.1, 1601}};
    const auto model = quo::OrbitModel::create(1601);
    ASSERT_EQ(model->build({flight.orbit.pSV_m, flight.orbit.vSV_mOs, 1601, 0.1}, 803457.3), 0);
    for (const double since_first_s : {0.3, 17.3, 91.7, 158.9})
        for (const double aside_m : {-6e5, 2e5, 9e5}) {
            const test::Platform at = flight.state(803457.3 + since_first_s);
            const Vec3 side = cross(at.velocity, at.position), down = cross(at.velocity, side);
            const Vec3 p = at.position + aside_m * unit(side) + 7e5 * unit(down);
            double guess_s = 0.0;
            ASSERT_TRUE(model->close_guess({{p[0], p[1], p[2]}, 0.0566, 0.0}, &guess_s));
            EXPECT_NEAR(guess_s, since_first_s, 0.01 * 0.1);
        }
}

// The velocities of the list are no part of the model, wherever they come from. Five vectors are one run.
TEST(Model, PassesThroughItsVectors) {
    test::Flight flight{{803457.3, 9.7, 5}};
    GeneralSAROrbit& orbit = flight.orbit;
    std::fill_n(orbit.vSV_mOs, 15, 17.0);
    ASSERT_EQ(orbit.computeApproximateSV(), 0);
    for (int i = 0; i < 5; ++i) {
        const double t = flight.times.at(i);
        EXPECT_LT(test::norm(test::position_at(orbit, t) - flight.state(t).position), 2e-6);  // of time's rounding
        EXPECT_LT(test::norm(test::velocity_at(orbit, t) - flight.state(t).velocity), 1e-4);
    }
    EXPECT_EQ(orbit.polyUpdates(), 0);
}

TEST(Model, NeedsFiveGoodVectorsAndAscendsWithTheFirst) {
    constexpr const char* kTooFew = "You must provide at least 5 state vectors!";
    GeneralSAROrbit orbit;
    const test::Report report;
    EXPECT_FALSE(orbit.isAscending());
    for (const double z : {1e-300, 0.0, -7.3, kNaN}) {
        ASSERT_EQ(orbit.SVCreate(1.5, 9.7, 5), 0);
        orbit.vSV_mOs[2] = z;
        orbit.vSV_mOs[5] = 3.0;
        EXPECT_EQ(orbit.isAscending(), z > 0.0);
    }
    for (const int count : {4, -1, std::numeric_limits<int>::max()}) {
        ASSERT_EQ(orbit.SVCreate(1.5, 9.7, 5), 0);
        EXPECT_EQ(orbit.SVCreate(1.5, 9.7, count), QUO_REFUSED);
        EXPECT_EQ(report.messages("ERROR").back() == kTooFew, count < 5);
        EXPECT_TRUE(!orbit.pSV_m && !orbit.vSV_mOs && orbit.nSV_n == 0);
        EXPECT_EQ(orbit.computeApproximateSV(), QUO_REFUSED);
    }
    const std::pair<void (*)(GeneralSAROrbit&), int> spoilt[] = {
        {[](auto& o) { o.pSV_m[3 * 16 + 2] = -std::numeric_limits<double>::infinity(); }, QUO_NUMERIC},
        {[](auto& o) { o.dtSV_s = -9.7; }, QUO_REFUSED},
        {[](auto& o) { o.dtSV_s = 1e-13; }, QUO_REFUSED},  // lost in the rounding of the times
        {[](auto& o) { o.t0SV_s = kNaN; }, QUO_REFUSED},
        {[](auto& o) { o.nSV_n = 2000000; }, QUO_REFUSED},  // changed by hand
    };
    for (const auto& [spoil, status] : spoilt) {
        test::Flight flight{kTimes};
        spoil(flight.orbit);
        EXPECT_EQ(flight.orbit.computeApproximateSV(), status);
        double xyz[3] = {1.0, 2.0, 3.0};
        EXPECT_EQ(flight.orbit.SVGetPos(kTimes.at(3), xyz), QUO_REFUSED);
        EXPECT_EQ(xyz[0] + xyz[1] + xyz[2], 6.0);
    }
}

TEST(StateVectorRecord, FitsOnePolynomialThroughAll) {
    const test::Flight flight{{803457.3, 9.7, 9}};
    SAROrbitStateVectors_Obj record, copy;
    EXPECT_EQ(record.nSV_n + record.t0SV_s + record.dtSV_s, -3 * 999.0);
    double xyz[3] = {1.0, 2.0, 3.0};
    ASSERT_EQ(record.SVCreate(803457.3, 9.7, 9), 0);
    std::copy_n(flight.orbit.pSV_m, 27, record.pSV_m);
    std::copy_n(flight.orbit.vSV_mOs, 27, record.vSV_mOs);
    ASSERT_EQ(record.clone(&copy), 0);
    EXPECT_EQ(copy.SVGetPos(803457.3, xyz), QUO_REFUSED);  // not yet fitted
    EXPECT_EQ(copy.positionPoly(0), nullptr);
    ASSERT_EQ(record.SVPolyCompute() + record.clone(&copy), 0);
    EXPECT_EQ(copy.SVGetPos(kNaN, xyz), QUO_REFUSED);
    record.SVDestroy();
    EXPECT_EQ(record.SVGetPos(803467.9, xyz), QUO_REFUSED);
    EXPECT_EQ(xyz[0] + xyz[1] + xyz[2], 6.0);
    for (double u = 0.0; u < 77.0; u += 3.3) {
        const test::Platform truth = flight.circle.earth_fixed(u);
        Vec3 p{}, v{};
        ASSERT_EQ(copy.SVGetPos(803457.3 + u, p.v) + copy.SVGetVel(803457.3 + u, v.v), 0);
        EXPECT_LT(test::norm(p - truth.position), 1e-5);
        EXPECT_LT(test::norm(v - truth.velocity), 1e-5);
        for (int axis = 0; axis < 3; ++axis)  // the velocities have polynomials of their own
            EXPECT_NEAR(POSMACRO(u, copy.velocityPoly(axis), 9), truth.velocity.v[axis], 1e-6);
    }
    for (const int count : {0, 4, -1, std::numeric_limits<int>::max()}) {  // no lower bound
        const bool possible = count >= 0 && count < 5;
        EXPECT_EQ(record.SVCreate(1.5, 9.7, count), possible ? 0 : QUO_REFUSED);
        EXPECT_EQ(record.nSV_n, possible ? count : 0);
        EXPECT_EQ(record.SVPolyCompute(), record.pSV_m ? 0 : QUO_REFUSED);
        EXPECT_EQ(record.pSV_m != nullptr, count == 4);
    }
}

}  // namespace
