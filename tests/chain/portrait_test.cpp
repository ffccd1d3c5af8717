// SPDX-License-Identifier: Apache-2.0

// The picture of a target: what is measured must be drawn where the axes say.
#include "point_targets/portrait.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

namespace {

double sinc_decibel(double x) {
    const double a = std::numbers::pi * x;
    return std::max(-120.0, a == 0.0 ? 0.0 : 20.0 * std::log10(std::abs(std::sin(a) / a)));
}

// A response 0.886 x 2 samples wide: a zero at every second sample, and half the power 22 pixels to either side of
// the cuts' middles, whose 400 pixels are 16 samples.
TEST(Portrait, ShowsTheResponseAndItsWidth) {
    example::Closeup closeup;
    const auto reach = static_cast<int>(closeup.side() / 2);
    for (int i = -reach; i <= reach; ++i)
        for (int j = -reach; j <= reach; ++j)
            closeup.decibel.push_back(sinc_decibel(0.5 * i / closeup.finer) +
                                      sinc_decibel(0.5 * j / closeup.finer));
    example::Measurement found{};
    found.name = "a\xff";
    found.azimuth = found.range = {0.0, 1.772, 1.772, -13.26, -10.2};
    const drawing::Picture picture = example::portrait(found, closeup);
    ASSERT_EQ(picture.channels, 3U);
    const auto colour = [&](int x, int y) {
        const std::size_t at = 3 * (static_cast<std::size_t>(y) * picture.width + static_cast<std::size_t>(x));
        return std::array{int{picture.values[at]}, int{picture.values[at + 1]}, int{picture.values[at + 2]}};
    };
    // 420 pixels from (74, 84) on are 16 samples.
    EXPECT_GT(colour(74 + 210 + 4, 84 + 210 + 4)[1], 240);
    for (const int zero : {-6, -4, -2, 2, 4, 6})
        EXPECT_LT(colour(74 + 210 + zero * 420 / 16, 84 + 214)[0], 60) << zero;
    for (const int top : {84, 84 + 420 - 150}) {
        const int row = top + static_cast<int>(150 * 6.01 / 43), middle = 684 + 200;
        for (const int x : {middle - 20, middle, middle + 20})
            EXPECT_GT(colour(x, row)[0] - colour(x, row)[2], 140);
        for (const int x : {middle - 26, middle + 26}) EXPECT_GT(colour(x, row)[2], 140) << x;
    }
}

}  // namespace
