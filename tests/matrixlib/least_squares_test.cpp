// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <limits>
#include <sstream>
#include <string>
#include <vector>

#include "one_based.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "support/diagnostics.h"

namespace {

using test::OneBased;
using Values = test::Flat;

void powers(double x, double values[], int count) {
    values[1] = 1.0;
    for (int i = 2; i <= count; ++i) values[i] = values[i - 1] * x;
}

/** A certified regression data set. */
struct Reference {
    Values x, y, certified;
    double residual_sum_of_squares = 0.0;
    [[nodiscard]] int degree() const { return static_cast<int>(certified.size()) - 1; }
    [[nodiscard]] int points() const { return static_cast<int>(x.size()); }
};

Reference load(const std::string& name) {
    Reference reference;
    std::ifstream stream{std::string{QUO_TEST_DATA} + "/nist/" + name + ".csv"};
    for (std::string line; std::getline(stream, line);) {
        std::istringstream words{line};
        std::string hash, key;
        if (line.starts_with("# certified")) {
            words >> hash >> key;
            for (double value = 0.0; words >> value;) reference.certified.push_back(value);
        } else if (line.starts_with("# residual_sum_of_squares")) {
            words >> hash >> key >> reference.residual_sum_of_squares;
        } else if (double x = 0.0, y = 0.0; std::sscanf(line.c_str(), "%lf,%lf", &x, &y) == 2) {
            reference.x.push_back(x);
            reference.y.push_back(y);
        }
    }
    return reference;
}

/** Wampler's third set with departures of ten thousand times their size is his fifth. */
Reference load_wampler5() {
    constexpr double kTimes = 1e4;
    Reference reference = load("wampler3");
    for (std::size_t k = 0; k < reference.x.size(); ++k) {
        const double exact = polval(reference.certified.data(), reference.degree(), reference.x[k]);
        reference.y[k] = exact + kTimes * (reference.y[k] - exact);
    }
    reference.residual_sum_of_squares *= kTimes * kTimes;
    return reference;
}

/** One of the library's fits of a polynomial, with its status; ascending coefficients. */
using Fit = int (*)(const Reference&, Values& c);

int fit_polfit(const Reference& r, Values& c) {
    return polfit(r.x.data(), r.y.data(), r.points(), c.data(), r.degree());
}
int fit_gen_polfit(const Reference& r, Values& c) {
    double sse = 0.0;
    const int status = gen_polfit(r.degree() + 1, r.x.data(), r.y.data(), r.points(), c.data(), &sse);
    EXPECT_NEAR(sse, status ? 0.0 : r.residual_sum_of_squares, 1e-5 * (1.0 + r.residual_sum_of_squares));
    return status;
}
int fit_lfitd(const Reference& r, Values& c) {
    const int ma = r.degree() + 1;
    const Values sig(r.x.size(), 1.0);
    const std::vector<int> all(c.size(), 1);
    OneBased covar{ma, ma};
    double chisq = 0.0;
    const int status = lfitd(r.x.data() - 1, r.y.data() - 1, sig.data() - 1, r.points(), c.data() - 1,
                             all.data() - 1, ma, covar.get(), &chisq, powers);
    EXPECT_NEAR(chisq, status ? 0.0 : r.residual_sum_of_squares, 1e-5 * (1.0 + r.residual_sum_of_squares));
    return status;
}
/** What svdfit() makes of points of standard deviation 1. */
struct SvdFit {
    int status;
    double chisq = 6.0;
    Values a;
    SvdFit(const Values& x, const Values& y, int ma, QuoBasisFunction basis)
        : a(static_cast<std::size_t>(ma), 5.0) {
        const Values sig(x.size(), 1.0);
        Values w(a.size());
        OneBased u{std::max(static_cast<int>(x.size()), ma), ma}, v{ma, ma};
        status = svdfit(x.data() - 1, y.data() - 1, sig.data() - 1, static_cast<int>(x.size()), a.data() - 1, ma,
                        u.get(), v.get(), w.data() - 1, &chisq, basis);
    }
};
// Over -1..1 and expanded at the end: of raw powers the singular values fall below the threshold.
int fit_svdfit(const Reference& r, Values& c) {
    const auto [low, high] = std::ranges::minmax(r.x);
    const double middle = 0.5 * (low + high), half = 0.5 * (high - low);
    Values scaled;
    for (const double x : r.x) scaled.push_back((x - middle) / half);
    const SvdFit fit{scaled, r.y, r.degree() + 1, powers};
    for (std::size_t k = c.size(); k-- > 0;) {  // c = c * (x - middle) / half + a[k]
        for (std::size_t i = c.size(); i-- > 0;) c[i] = ((i > 0 ? c[i - 1] : 0.0) - middle * c[i]) / half;
        c[0] += fit.a[k];
    }
    return fit.status;
}
int fit_qr(const Reference& r, Values& c) {
    Values design;
    for (const double x : r.x) {
        Values row(c.size() + 1);
        powers(x, row.data(), r.degree() + 1);
        design.insert(design.end(), row.begin() + 1, row.end());
    }
    LsqSummary summary{};
    const int status = lsq_fit(design.data(), r.points(), r.degree() + 1, r.y.data(), c.data(), &summary);
    EXPECT_EQ(summary.rank, status ? 0 : r.degree() + 1);
    EXPECT_NEAR(summary.residual_norm * summary.residual_norm, status ? 0.0 : r.residual_sum_of_squares,
                1e-9 * (1.0 + r.residual_sum_of_squares));
    return status;
}

double digits(const Values& fitted, const Values& certified) {
    double fewest = 15.0;
    for (std::size_t i = 0; i < fitted.size(); ++i) {
        const double error = std::abs(fitted[i] - certified[i]) / std::abs(certified[i]);
        fewest = std::min(fewest, error > 0.0 ? -std::log10(error) : 15.0);
    }
    return fewest;
}

struct Row {
    const char* name;
    Fit fit;
    double least_digits;
};
// Least digits: what the normal equations in double reach, and what an orthogonal decomposition must reach.
constexpr Row kFits[] = {{"polfit", fit_polfit, 6.0},
                         {"gen_polfit", fit_gen_polfit, 6.0},
                         {"lfitd", fit_lfitd, 6.0},
                         {"svdfit", fit_svdfit, 7.0},
                         {"lsq_fit", fit_qr, 12.0}};  // had 6.6 of wampler5 before solutions were refined

TEST(CertifiedData, IsReproducedToTheDigitsOfEachMethodWithWhateverMemory) {
    const test::Report report;
    for (const std::string set : {"pontius", "wampler1", "wampler3", "wampler5"}) {
        const Reference reference = set == "wampler5" ? load_wampler5() : load(set);
        ASSERT_GT(reference.points(), 20) << set;
        for (const Row& row : kFits) {
            Values c(reference.certified.size());
            test::fail_every_allocation([&] {
                std::ranges::fill(c, 0.0);
                return row.fit(reference, c);
            });
            const double reached = digits(c, reference.certified);
            std::printf("%-10s %-10s %5.1f digits\n", row.name, set.c_str(), reached);
            EXPECT_GE(reached, row.least_digits) << row.name << ' ' << set;
        }
    }
}

TEST(Polfit, RunsThroughAnExactPolynomialOfAnyDegree) {
    const Values exact{1.3, 0.6, -0.1, -0.8, -1.5, -2.2, -2.9, -3.6};
    for (int degree = 0; degree <= 7; ++degree) {
        Values x, y, c(8);
        for (int k = 0; k < 17; ++k) x.push_back(-0.9 + 0.11 * k);
        for (const double value : x) y.push_back(polval(exact.data(), degree, value));
        ASSERT_EQ(polfit(x.data(), y.data(), 17, c.data(), degree), 0);
        for (std::size_t i = 0; i < 8; ++i) EXPECT_NEAR(c[i], int(i) > degree ? 0.0 : exact[i], 1e-9) << degree;
    }
}

TEST(Polfit, IgnoresASingularSystemAndRefusesNoPoints) {
    const test::Report report;
    const test::CapturedStderr silent;
    const Values x(10, 2.5), y(10, 1.0);
    Values c{7, 7, 7};
    constexpr int kMax = std::numeric_limits<int>::max(), kMin = std::numeric_limits<int>::min();
    for (const auto& [points, degree] :
         {std::pair{0, 2}, {-5, 2}, {10, -1}, {10, kMin}, {10, kMax}, {kMin, kMin}}) {
        EXPECT_EQ(polfit(x.data(), y.data(), points, c.data(), degree), 10) << points;
        const int terms = degree == kMax || degree == kMin ? degree : degree + 1;
        EXPECT_EQ(gen_polfit(terms, x.data(), y.data(), points, c.data(), nullptr), 10);
    }
    EXPECT_THAT(c, testing::Each(7.0));
    EXPECT_EQ(polfit(x.data(), y.data(), 10, c.data(), 2), 0);
    EXPECT_EQ(report.entries("ERROR")[0].function, "dpolfit");
    EXPECT_EQ(report.entries("ERROR")[0].file, R"(..\..\..\libsrc\sources\sarutillib\interp_orb)");
    EXPECT_EQ(report.entries("ERROR_CALL_TREE")[0].function, "polfit()");
    EXPECT_EQ(report.entries("ERROR_CALL_TREE")[1].function, "gen_polfit()");
}

TEST(Polval, IsZeroBelowDegreeZeroAndInfiniteAtInfinity) {
    const double c[] = {2.0, -3.0, 0.5};
    EXPECT_EQ(polval(c, 2, -HUGE_VAL), HUGE_VAL) << "Horner's rule once began with 0 times infinity";
    EXPECT_EQ(polval(c, 0, HUGE_VAL) + polval(c, -1, 4.0) + polval(c, 2, 4.0), 2.0 + 0.0 + (2.0 - 12.0 + 8.0));
}

// The mask: parameter 2 keeps its value, and what it contributes is taken off before the others are fitted. The
// covariance of the others is the inverse of their normal matrix, at their places, 0 at the masked one.
TEST(Lfit, FitsTheSelectedParametersOnly) {
    const test::Report report;
    const Values exact{0.7, -1.9, 0.4, 3.3};
    Values x, y, sig, normal(9), inverse(9);
    for (int k = 0; k < 40; ++k) {
        x.push_back(-1.1 + 0.057 * k);
        sig.push_back(0.5 + 0.01 * k);
        y.push_back(polval(exact.data(), 3, x.back()) + (k % 2 ? 0.1 : -0.1) * sig.back());
        double basis[5];
        powers(x.back(), basis, 4);
        const double fitted[] = {basis[1], basis[3], basis[4]};
        for (std::size_t i = 0; i < 9; ++i) normal[i] += fitted[i / 3] * fitted[i % 3] / (sig.back() * sig.back());
    }
    ASSERT_EQ(MatInv(normal.data(), inverse.data(), 3), 0);
    for (const auto fit : {lfit_mod, lfitd}) {
        Values a{9.0, exact[1], 9.0, 9.0};
        const std::vector<int> mask{1, 0, 1, 1};
        OneBased covar{4, 4};
        double chisq = -1.0, expected_chisq = 0.0;
        ASSERT_EQ(fit(x.data() - 1, y.data() - 1, sig.data() - 1, 40, a.data() - 1, mask.data() - 1, 4,
                      covar.get(), &chisq, powers),
                  0);
        EXPECT_EQ(a[1], exact[1]);
        Values gradient(3);  // of the squared residuals, 0 at the minimum
        for (std::size_t k = 0; k < 40; ++k) {
            const double residual = (y[k] - polval(a.data(), 3, x[k])) / sig[k];
            expected_chisq += residual * residual;
            for (const int power : {0, 2, 3})
                gradient[static_cast<std::size_t>(power) * 2 / 3] += residual / sig[k] * std::pow(x[k], power);
        }
        EXPECT_NEAR(chisq, expected_chisq, 1e-12);
        EXPECT_THAT(gradient, testing::Each(testing::DoubleNear(0.0, 1e-10)));
        const std::size_t places[] = {0, 2, 3};
        Values expected(16);
        for (std::size_t i = 0; i < 9; ++i) expected[4 * places[i / 3] + places[i % 3]] = inverse[i];
        EXPECT_THAT(covar.flat(), testing::Pointwise(testing::DoubleNear(1e-14), expected));
    }
}

TEST(Lfit, SaysThatNothingIsToBeFitted) {
    const std::vector<double> ones{1.0};
    const std::vector<int> nones{0};
    std::vector<double> as{5.0};
    const double* const one = ones.data();
    const int* const none = nones.data();
    double *const a = as.data(), chisq = 6.0;
    OneBased covar{1, 1};
    test::CapturedStderr captured;
    for (const auto fit : {lfit_mod, lfitd})
        EXPECT_EQ(fit(one - 1, one - 1, one - 1, 1, a - 1, none - 1, 1, covar.get(), &chisq, powers), 10);
    EXPECT_EQ(captured.text(), "lfit_mod: no parameters to be fittedlfit: no parameters to be fitted");
    EXPECT_EQ(a[0] + chisq, 11.0);
}

// Two equal columns: the fit is still the one of least length, the parameters share what one would take.
void twice(double x, double values[], int) {
    values[1] = values[2] = x;
    values[3] = 1.0;
}
TEST(Svdfit, SharesBetweenDependentColumns) {
    const SvdFit fit{{1, 2, 3, 4, 5}, {-4, -1, 2, 5, 8}, 3, twice};
    ASSERT_EQ(fit.status, 0);
    EXPECT_THAT(fit.a, testing::Pointwise(testing::DoubleNear(1e-12), {1.5, 1.5, -7.0}));
    EXPECT_LT(fit.chisq, 1e-24);
}

TEST(Svdfit, RefusesTooFewPointsAndBadNumbers) {
    const test::Report report;
    const double infinity = std::numeric_limits<double>::infinity();
    for (const Values& x : {Values{1, 2}, Values{1, -infinity, 3}}) {
        test::CapturedStderr captured;
        const SvdFit fit{x, x, x.size() == 2 ? 3 : 2, powers};
        EXPECT_EQ(fit.status, 10);
        EXPECT_EQ(captured.text(), x.size() == 2 ? "SVDCMP: You must augment A with extra zero rows"
                                                 : "No convergence in 60 SVDCMP iterations");
        EXPECT_THAT(fit.a, testing::Each(5.0));
        EXPECT_EQ(fit.chisq, 6.0);
    }
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").size(), 2U);
}

TEST(LsqFit, FindsTheRankAndIgnoresTheScale) {
    // Columns 1 and 3 are the same but for the scale.
    const Values a{1e-200, 1, 3e100, 2e-200, 1, 6e100, 3e-200, 1, 9e100, 4e-200, 1, 12e100};
    const Values b{5, 7, 9, 11};
    Values x(3);
    LsqSummary summary{};
    ASSERT_EQ(lsq_fit(a.data(), 4, 3, b.data(), x.data(), &summary), 0);
    EXPECT_EQ(summary.rank, 2);
    EXPECT_LT(summary.residual_norm, 1e-14);
    EXPECT_NEAR(x[1], 3.0, 1e-13);
    EXPECT_NEAR(x[0] * 1e-200 + x[2] * 3e100, 2.0, 1e-13);
    EXPECT_GE(summary.condition, 1.0);

    const Values zeros(12, 0.0), large{3e250, 0.0, -4e250, 0.0};
    ASSERT_EQ(lsq_fit(zeros.data(), 4, 3, large.data(), x.data(), &summary), 0);
    EXPECT_DOUBLE_EQ(summary.residual_norm, 5e250) << "whose square would be infinite";
    EXPECT_EQ(summary.rank, 0);
    EXPECT_EQ(x, (Values{0, 0, 0}));
}

TEST(LsqFit, RefusesWhatIsNoFit) {
    const test::Report report;
    const test::CapturedStderr silent;
    Values a(6, 1.0), b(3, 1.0), x{5, 5, 5};
    EXPECT_EQ(lsq_fit(a.data(), 1, 2, b.data(), x.data(), nullptr), 10);
    EXPECT_EQ(lsq_fit(a.data(), 3, 0, b.data(), x.data(), nullptr), 10);
    a[4] = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(lsq_fit(a.data(), 3, 2, b.data(), x.data(), nullptr), 10);
    EXPECT_EQ(x, (Values{5, 5, 5}));
    EXPECT_EQ(report.entries("ERROR").size(), 3U);
}

}  // namespace
