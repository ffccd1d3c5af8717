// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/place_tree.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <ranges>
#include <vector>

namespace {

using quo::OrbitPlace;
using quo::Vec3;

// Judged by a look at every place: on lines, in planes, with places that coincide, on a shell as orbits are, from
// within and from far off.
TEST(PlaceTree, FindsTheNearestOfAll) {
    std::mt19937 random{7};
    const auto number = [&](double size) { return size * (static_cast<double>(random()) / 2147483648.0 - 1.0); };
    EXPECT_EQ(quo::nearest_in_tree({}, {}), 0);
    for (std::int32_t count = 1; count < 400; count = count * 3 / 2 + 1)
        for (const Vec3 size :
             {Vec3{7e6, 7e6, 7e6}, {7e6, 0.0, 7e6}, {0.0, 0.0, 7e6}, {2.0, 2.0, 2.0}, {1.0, 1.0, 1.0}}) {
            std::vector<OrbitPlace> places;
            for (std::int32_t run = 0; run < count; ++run)
                places.push_back({{number(size.x), number(size.y), number(size.z)}, run});
            if (size.x == 2.0)
                for (auto& [at, run, least] : places) at = {std::round(at.x), std::round(at.y), std::round(at.z)};
            if (size.x == 1.0)
                for (auto& [at, run, least] : places) at = (7e6 + number(7e5)) / norm(at) * at;
            const std::vector<OrbitPlace> in_order = places;
            quo::plant_tree(places);
            // All that a search from within leaves out it leaves out for this radius: no larger, and hardly
            // smaller.
            const double least_m =
                norm(std::ranges::min(in_order, {}, [](const OrbitPlace& p) { return norm(p.at); }).at);
            const double told_m = places[places.size() / 2].least_radius_m;
            ASSERT_TRUE(told_m <= least_m && told_m >= (1.0 - 1e-6) * least_m) << told_m << ' ' << least_m;
            for (int i = 0; i < 100; ++i) {
                Vec3 point{number(2e7), number(9e6), number(9e6)};
                if (size.x == 1.0) point = 5.9e6 / norm(point) * point;
                const auto distance = [&](const OrbitPlace& place) { return norm(point - place.at); };
                const auto found = static_cast<std::size_t>(quo::nearest_in_tree(places, point));
                ASSERT_EQ(distance(in_order[found]), distance(std::ranges::min(in_order, {}, distance)));
            }
        }
}

}  // namespace
