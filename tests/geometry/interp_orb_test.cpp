// SPDX-License-Identifier: Apache-2.0
#include "quo_base/interp_orb.h"

#include "orbit_fit.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

namespace {

using test::sampled, test::Trajectory, test::Vec3;

/** A pass over the pole whose positions hold as many decimals as product headers do, where `decimals` is set. */
struct Pass {
    int n;
    double t0, dt;
    bool decimals;
    double at_vectors_m, between_m;
};

// Of the last two, the one polynomial through all vectors would miss them by metres once it is evaluated.
TEST(OrbInterp, PassesThroughTheVectorsAndFollowsTheOrbitBetween) {
    const test::CircularOrbit orbit{77.3, 12.8, -12.7};
    for (const Pass& pass : {Pass{5, -13.7, 10.0, true, 4e-9, 3e-5}, Pass{9, 7.3, 60.0, false, 4e-9, 1e-5},
                             Pass{17, 0.0, 10.0, true, 4e-9, 3e-4}, Pass{31, 0.0, 10.0, false, 2e-8, 1e-6},
                             Pass{31, 0.0, 60.0, true, 2e-6, 1e-4}, Pass{97, 0.0, 10.0, true, 2e-6, 1e-4}}) {
        SCOPED_TRACE(testing::Message() << pass.n << " vectors " << pass.dt << " s apart");
        auto positions = sampled(pass.n, 0.0, pass.dt, [&](double t) { return orbit.earth_fixed(t).position; });
        if (pass.decimals)
            for (double& value : positions) value = std::round(value * 1e6) / 1e6;
        const Trajectory fit{pass.t0, pass.dt, positions};
        ASSERT_EQ(fit.status, 0);
        for (int i = 0; i < pass.n; ++i) {
            const double t = i * pass.dt, half = t + 0.5 * pass.dt;
            const auto* at = &positions[3 * static_cast<std::size_t>(i)];
            EXPECT_LT(norm(fit.position(pass.t0 + t) - Vec3{at[0], at[1], at[2]}), pass.at_vectors_m) << i;
            if (i + 1 == pass.n) break;
            EXPECT_LT(norm(fit.position(pass.t0 + half) - orbit.earth_fixed(half).position), pass.between_m) << i;
        }
    }
}

TEST(OrbInterp, FitsOneVectorAndFailsWithoutMemory) {
    const test::Report report;
    const std::vector<double> positions(15, 17.3);
    test::fail_every_allocation([&] { return Trajectory{0.0, 10.0, positions}.status; });
    const Trajectory one{17.3, 0.0, {41.3, 12.8, -12.7}};
    EXPECT_TRUE(one.status == 0 && one.y[0] == 12.8);
}

// Whatever a header may hold: the coefficients are finite, and the values are met as far as their size allows.
TEST(Orbffit, GivesFiniteCoefficientsForAnyFiniteValues) {
    constexpr int kCount = 3001;
    for (const double size : {0.0, 5e-324, 1.7e-3, std::numeric_limits<double>::max()})
        for (const double sign : {+1.0, -1.0})
            for (const double dt : {1e-300, -10.0, 1e300}) {
                std::vector<double> values(kCount, size), c(kCount, std::nan(""));
                for (std::size_t i = 1; i < values.size(); i += 2) values[i] = sign * size;
                for (const int n : {2, 5, 40, kCount}) {
                    const int status = orbffit(0.0, dt, values.data(), n, c.data());
                    const bool finite =
                        std::all_of(c.begin(), c.begin() + n, [](double v) { return std::isfinite(v); });
                    ASSERT_TRUE(status == 10 || (status == 0 && finite)) << size << ' ' << sign << ' ' << dt;
                }
            }
}

}  // namespace
