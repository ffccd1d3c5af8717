// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "quo_base/SARpolynomials.h"

namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

/** The first at or after a time, looked for one by one. */
std::size_t first_at_or_after(const polySAR& set, double time) {
    std::size_t i = 0;
    while (i < static_cast<std::size_t>(set.ndc) && !(time <= set.DC[i].taz0)) ++i;
    return i;
}

void expect_choices(const polySAR& set, std::vector<double> times) {
    const auto count = static_cast<std::size_t>(set.ndc);
    times.insert(times.end(), {-kInfinity, kInfinity, kNaN, -1.0, 0.0, 1e9});
    for (const double time : times) {
        const std::size_t next = first_at_or_after(set, time);
        const std::size_t earlier = time >= set.DC[count - 1].taz0 && next > 0 ? count - 1
                                    : next > 0                                 ? std::min(next, count) - 1
                                                                               : 0;
        int number = -1;
        ASSERT_EQ(set.getDCnum(time, &number), 0);
        ASSERT_EQ(number, static_cast<int>(earlier)) << "at " << time << " of " << count;
        const std::size_t chosen = std::min(next, count - 1);
        if (!std::isfinite(time - set.DC[chosen].taz0)) continue;
        ASSERT_EQ(set.EvaluateDC(0.0, time), static_cast<double>(chosen)) << "at " << time;
    }
}

// Lists in order, with times that are equal, far apart or not a number, and in no order at all: their times may
// change as long as what was in order stays so, and they may become shorter.
TEST(PolynomialChoice, IsTheFirstAtOrAfterInAnyList) {
    std::mt19937 random{7};
    const auto below = [&](std::size_t most) { return static_cast<std::size_t>(random()) % most; };
    for (std::size_t count = 1; count < 700; count += 1 + below(20))
        for (const int kind : {0, 1, 2, 3, 4}) {
            polySAR set;
            std::vector<double> times(count);
            for (double& time : times)
                time = kind == 1 ? static_cast<double>(below(9)) : 1e-3 * static_cast<double>(below(1 << 20));
            if (kind == 2) times[below(count)] = 1e300;
            if (kind < 4) std::ranges::sort(times);
            if (kind == 3) std::swap(times[below(count)], times[below(count)]);
            for (int i = 0; kind == 4 && i < 3; ++i) times[below(count)] = i ? kNaN : kInfinity;
            ASSERT_EQ(set.CreatePolys(static_cast<int>(count), 0), 0);
            for (std::size_t i = 0; i < count; ++i) {
                set.DC[i].pol[0] = static_cast<double>(i);
                set.DC[i].taz0 = times[i];
            }
            expect_choices(set, times);
            for (std::size_t i = 0; i < count; ++i)
                set.DC[i].taz0 += 0.5 + (kind < 3 ? 1e-2 * static_cast<double>(i) : 0.0);
            expect_choices(set, times);
            set.ndc = static_cast<int>(1 + below(count));
            expect_choices(set, times);
        }
}

}  // namespace
