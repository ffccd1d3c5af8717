#include <gtest/gtest.h>

#include <climits>
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

TEST(CztPlans, RefuseWhatCannotBe) {
    const test::Engine engine{"fftw"};
    CztPlan plan{};
    for (const auto& [n, m] : {std::pair{0, 4}, {4, 0}, {INT_MAX, INT_MAX}, {INT_MAX, 1}})
        EXPECT_EQ(czt_makep_c(&plan, n, m), 1) << n << " " << m;
    EXPECT_EQ(czt_destp_c(&plan), 0) << "a record of zeros holds nothing to release";
    ASSERT_EQ(czt_makep_c(&plan, 6, 4), 0);
    Samples data = test::noise(24), apart(8);
    const Samples before = data;
    fcomplex *const d = data.data(), *const none = nullptr;
    for (const auto& [in, out, count, status] : {std::tuple{d, none, 1, 1},
                                                 {none, d, 1, 1},
                                                 {d, d + 11, 2, 1},
                                                 {d, d + 12, -1, 1},
                                                 {d, d + 12, 0, 0},
                                                 {d, apart.data(), 2, 0}}) {
        EXPECT_EQ(pczt_c(&plan, in, out, 0.1, 0.2, count), status);
        EXPECT_EQ(data, before);
    }
    EXPECT_EQ(pczt_c(&plan, d, d, 0.1, 0.2, 2), 0) << "shrinks as it goes";
    EXPECT_TRUE(std::equal(apart.begin(), apart.end(), data.begin()));
    CztPlan copy = plan;
    EXPECT_EQ(czt_destp_c(&plan), 0);
    EXPECT_EQ(czt_destp_c(&copy), 1) << "released already";
    EXPECT_EQ(pczt_c(&plan, d, apart.data(), 0.1, 0.2, 1), 1);
}

}  // namespace
