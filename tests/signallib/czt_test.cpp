#include <gtest/gtest.h>

#include <climits>
#include <cmath>

#include "signallib/engines.h"

namespace {

using test::Exact;
using test::Samples;

class Czt : public test::WithEngine {};

/** The defining sum. */
Exact direct(const fcomplex* x, int n, int m, double w, double a) {
    Exact out;
    for (int k = 0; k < m; ++k) {
        dcomplex sum{};
        for (int j = 0; j < n; ++j) sum += dcomplex{x[j]} * std::polar(1.0, -j * (a - k * w));
        out.push_back(sum);
    }
    return out;
}

TEST_P(Czt, EqualsTheDirectSum) {
    struct Row {
        int n, m;
        double w, a;
    };
    const Row rows[] = {{16, 16, -0.3926990816987241, 0.0},
                        {17, 5, 0.0137, 1.3},
                        {5, 43, -0.0271, -2.9},
                        {1, 7, 0.3, 0.7},
                        {7, 1, 0.3, 0.7},
                        {1, 1, 0.3, 0.7},
                        {60, 31, 0.0, 0.4}};
    for (const Row& row : rows) {
        SCOPED_TRACE(testing::Message() << row.n << " to " << row.m);
        constexpr int kVectors = 3;
        const Samples in = test::noise(static_cast<std::size_t>(row.n * kVectors));
        Samples out(static_cast<std::size_t>(row.m * kVectors));
        ASSERT_EQ(czt_c(in.data(), row.n, out.data(), row.m, row.w, row.a, kVectors), 0);
        for (int v = 0; v < kVectors; ++v) {
            const Samples got{out.begin() + v * row.m, out.begin() + (v + 1) * row.m};
            EXPECT_LE(test::relative_error(got, direct(in.data() + v * row.n, row.n, row.m, row.w, row.a)), 2e-6);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Engines, Czt, testing::ValuesIn(test::kEngines),
                         [](const auto& row) { return row.param.name; });

TEST(CztPlans, LongOnesKeepTheirAccuracy) {
    const test::Engine engine{"fftw"};
    constexpr int n = 4000, m = 1000;
    const Samples in = test::noise(n);
    Samples out(m);
    ASSERT_EQ(czt_c(in.data(), n, out.data(), m, -0.00031, 0.9, 1), 0);
    EXPECT_LE(test::relative_error(out, direct(in.data(), n, m, -0.00031, 0.9)), 2e-6);
}

TEST(CztPlans, RefuseWhatCannotBe) {
    const test::Engine engine{"fftw"};
    CztPlan plan{};
    for (const auto& [n, m] : {std::pair{0, 4}, {4, 0}, {-1, 4}, {INT_MAX, INT_MAX}, {INT_MAX, 1}})
        EXPECT_EQ(czt_makep_c(&plan, n, m), 1) << n << " " << m;
    EXPECT_EQ(czt_makep_c(nullptr, 4, 4), 1);
    EXPECT_EQ(czt_destp_c(&plan), 0) << "a record of zeros holds nothing to release";
    ASSERT_EQ(czt_makep_c(&plan, 6, 4), 0);
    EXPECT_EQ(plan.forward.n, 9);
    Samples data = test::noise(24);
    const Samples before = data;
    EXPECT_EQ(pczt_c(&plan, data.data(), nullptr, 0.1, 0.2, 1), 1);
    EXPECT_EQ(pczt_c(&plan, nullptr, data.data(), 0.1, 0.2, 1), 1);
    EXPECT_EQ(pczt_c(&plan, data.data(), data.data() + 11, 0.1, 0.2, 2), 1) << "overlapping";
    EXPECT_EQ(pczt_c(&plan, data.data(), data.data() + 12, 0.1, 0.2, -1), 1);
    EXPECT_EQ(pczt_c(&plan, data.data(), data.data() + 12, 0.1, 0.2, 0), 0);
    EXPECT_EQ(data, before);
    Samples apart(8);
    EXPECT_EQ(pczt_c(&plan, data.data(), apart.data(), 0.1, 0.2, 2), 0);
    EXPECT_EQ(pczt_c(&plan, data.data(), data.data(), 0.1, 0.2, 2), 0) << "shrinks as it goes";
    EXPECT_TRUE(std::equal(apart.begin(), apart.end(), data.begin()));
    CztPlan copy = plan;
    EXPECT_EQ(czt_destp_c(&plan), 0);
    EXPECT_EQ(czt_destp_c(&copy), 1) << "released already";
    EXPECT_EQ(pczt_c(&plan, data.data(), apart.data(), 0.1, 0.2, 1), 1);
    EXPECT_EQ(pczt_c(&copy, data.data(), apart.data(), 0.1, 0.2, 1), 1);
}

}  // namespace
