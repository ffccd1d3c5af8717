#include "roilib/rounding.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

using Limits = std::numeric_limits<std::int32_t>;
constexpr double kInfinity = std::numeric_limits<double>::infinity();

constexpr struct {
    double value;
    std::int32_t rounded, truncated;
} kRows[] = {{17.3, 17, 17},
             {17.5, 18, 17},
             {-17.5, -18, -17},
             {0.5, 1, 0},
             {-0.5, -1, 0},
             {0.499999, 0, 0},
             {2147483646.4, 2147483646, 2147483646},
             {2147483647.0, Limits::max(), Limits::max()},
             {2147483648.0, Limits::max(), Limits::max()},
             {-2147483648.9, Limits::min(), Limits::min()},
             {kInfinity, Limits::max(), Limits::max()},
             {-kInfinity, Limits::min(), Limits::min()},
             {std::numeric_limits<double>::quiet_NaN(), 0, 0}};

TEST(Rounding, GoesAwayFromZeroAtHalvesAndStopsAtTheBounds) {
    for (const auto& row : kRows) {
        EXPECT_EQ(quo::round_clamped(row.value), row.rounded) << row.value;
        EXPECT_EQ(quo::truncate_clamped(row.value), row.truncated) << row.value;
    }
}

}  // namespace
