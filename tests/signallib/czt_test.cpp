// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <cmath>

#include "signallib/engines.h"

namespace {

using test::Samples;

class Czt : public test::WithEngine {};

TEST_P(Czt, EqualsTheDirectSum) {
    const struct {
        int n, m;
        double w, a;
    } rows[] = {{16, 16, -0.3926990816987241, 0.0},
                {17, 5, 0.0137, 1.3},
                {5, 43, -0.0271, -2.9},
                {1, 7, 0.3, 0.7},
                {7, 1, 0.3, 0.7},
                {1, 1, 0.3, 0.7},
                {60, 31, 0.0, 0.4},
                {4000, 1000, -0.00031, 0.9}};
    for (const auto& [n, m, w, a] : rows) {
        if (n > 100 && !fast_) continue;
        SCOPED_TRACE(testing::Message() << n << " to " << m);
        const Samples in = test::noise(static_cast<std::size_t>(3 * n));
        Samples out(static_cast<std::size_t>(3 * m));
        ASSERT_EQ(czt_c(in.data(), n, out.data(), m, w, a, 3), 0);
        for (int v = 0; v < 3; ++v)
            EXPECT_LE(test::relative_error(Samples{out.begin() + v * m, out.begin() + (v + 1) * m},
                                           test::direct(in.data() + v * n, n, m, w, a)),
                      2e-6);
    }
}
INSTANTIATE_TEST_SUITE_P(Engines, Czt, testing::ValuesIn(test::kEngines), testing::PrintToStringParamName());

}  // namespace
