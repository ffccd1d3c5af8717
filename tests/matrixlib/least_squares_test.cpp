#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <limits>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/alloc_free.h"
#include "support/diagnostics.h"

extern "C" void dgesvd_(const char* jobu, const char* jobvt, const int* m, const int* n, double* a, const int* lda,
                        double* s, double* u, const int* ldu, double* vt, const int* ldvt, double* work,
                        const int* lwork, int* info);

namespace {

using Values = std::vector<double>;

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

/** One of the library's fits of a polynomial; ascending coefficients. */
using Fit = Values (*)(const Reference&);

Values fit_polfit(const Reference& r) {
    Values c(r.certified.size());
    EXPECT_EQ(polfit(r.x.data(), r.y.data(), r.points(), c.data(), r.degree()), 0);
    return c;
}
Values fit_lfitd(const Reference& r) {
    const int ma = r.degree() + 1;
    Values c(r.certified.size()), sig(r.x.size(), 1.0);
    const std::vector<int> all(r.certified.size(), 1);
    double** covar = dmatrix(1, ma, 1, ma);
    double chisq = 0.0;
    EXPECT_EQ(lfitd(r.x.data() - 1, r.y.data() - 1, sig.data() - 1, r.points(), c.data() - 1, all.data() - 1, ma,
                    covar, &chisq, powers),
              0);
    EXPECT_NEAR(chisq, r.residual_sum_of_squares, 1e-5 * (1.0 + r.residual_sum_of_squares));
    free_dmatrix(covar, 1, ma, 1, ma);
    return c;
}
Values fit_svdfit(const Reference& r) {
    const int ma = r.degree() + 1, n = r.points();
    Values c(r.certified.size()), sig(r.x.size(), 1.0), w(r.certified.size());
    double** u = dmatrix(1, n, 1, ma);
    double** v = dmatrix(1, ma, 1, ma);
    double chisq = 0.0;
    EXPECT_EQ(svdfit(r.x.data() - 1, r.y.data() - 1, sig.data() - 1, n, c.data() - 1, ma, u, v, w.data() - 1,
                     &chisq, powers),
              0);
    free_dmatrix(v, 1, ma, 1, ma);
    free_dmatrix(u, 1, n, 1, ma);
    return c;
}
Values fit_qr(const Reference& r) {
    const auto cols = r.certified.size();
    Values design, c(cols);
    for (const double x : r.x) {
        Values row(cols + 1);
        powers(x, row.data(), static_cast<int>(cols));
        design.insert(design.end(), row.begin() + 1, row.end());
    }
    LsqSummary summary{};
    EXPECT_EQ(lsq_fit(design.data(), r.points(), static_cast<int>(cols), r.y.data(), c.data(), &summary), 0);
    EXPECT_EQ(summary.rank, static_cast<int>(cols));
    EXPECT_NEAR(summary.residual_norm * summary.residual_norm, r.residual_sum_of_squares,
                1e-9 * (1.0 + r.residual_sum_of_squares));
    return c;
}

double digits(const Values& fitted, const Values& certified) {
    double fewest = 15.0;
    for (std::size_t i = 0; i < fitted.size(); ++i) {
        const double error = std::abs(fitted[i] - certified[i]) / std::abs(certified[i]);
        fewest = std::min(fewest, error > 0.0 ? -std::log10(error) : 15.0);
    }
    return fewest;
}

// Least digits: what the normal equations in double reach, and what an orthogonal decomposition must reach. svdfit
// drops singular values below 1e-5 of the largest, which the raw powers of these sets fall under: it is only
// shown.
TEST(CertifiedData, IsReproducedToTheDigitsOfEachMethod) {
    struct Row {
        const char* name;
        Fit fit;
        double least_digits;
    };
    const Row rows[] = {{"polfit", fit_polfit, 6.0},
                        {"lfitd", fit_lfitd, 6.0},
                        {"svdfit", fit_svdfit, -1e9},
                        {"lsq_fit", fit_qr, 7.0}};
    std::printf("%-10s %8s %8s %8s\n", "digits", "pontius", "wampler1", "wampler3");
    for (const Row& row : rows) {
        std::printf("%-10s", row.name);
        for (const char* set : {"pontius", "wampler1", "wampler3"}) {
            const Reference reference = load(set);
            ASSERT_GT(reference.points(), 20) << set;
            const double reached = digits(row.fit(reference), reference.certified);
            std::printf(" %8.1f", reached);
            EXPECT_GE(reached, row.least_digits) << row.name << ' ' << set;
        }
        std::printf("\n");
    }
}

TEST(Polfit, RunsThroughAnExactPolynomialOfAnyDegree) {
    const test::Report report;
    for (int degree = 0; degree <= 7; ++degree) {
        Values exact, x, y;
        for (int i = 0; i <= degree; ++i) exact.push_back(1.3 - 0.7 * i);
        for (int k = 0; k < 17; ++k) {
            x.push_back(-0.9 + 0.11 * k);
            y.push_back(polval(exact.data(), degree, x.back()));
        }
        Values c(exact.size()), general(exact.size());
        ASSERT_EQ(polfit(x.data(), y.data(), 17, c.data(), degree), 0);
        double sse = -1.0;
        ASSERT_EQ(gen_polfit(degree + 1, x.data(), y.data(), 17, general.data(), &sse), 0);
        EXPECT_EQ(c, general);
        EXPECT_LT(sse, 1e-18);
        for (std::size_t i = 0; i < c.size(); ++i) EXPECT_NEAR(c[i], exact[i], 1e-9) << degree;
    }
}

TEST(Polfit, IgnoresASingularSystemAndRefusesNoPoints) {
    const test::Report report;
    const test::CapturedStderr silent;
    const Values x(10, 2.5), y(10, 1.0);
    double c[3] = {7, 7, 7};
    EXPECT_EQ(polfit(x.data(), y.data(), 10, c, 2), 0);
    const Values kept{7, 7, 7};
    std::copy(kept.begin(), kept.end(), c);
    EXPECT_EQ(polfit(x.data(), y.data(), 0, c, 2), 10);
    EXPECT_EQ(polfit(x.data(), y.data(), -5, c, 2), 10);
    EXPECT_EQ(polfit(x.data(), y.data(), 10, c, -1), 10);
    EXPECT_EQ((Values{c, c + 3}), kept);
    const auto errors = report.entries("ERROR");
    ASSERT_FALSE(errors.empty());
    EXPECT_EQ(errors[0].function, "dpolfit");
    EXPECT_EQ(errors[0].file, R"(..\..\..\libsrc\sources\sarutillib\interp_orb)");
    EXPECT_EQ(report.entries("ERROR_CALL_TREE")[0].function, "polfit()");
}

TEST(Polval, IsZeroBelowDegreeZero) {
    const double c[] = {2.0, -3.0, 0.5};
    EXPECT_EQ(polval(c, -1, 4.0), 0.0);
    EXPECT_EQ(polval(c, 2, 4.0), 2.0 - 12.0 + 8.0);
}

// The mask: parameter 2 keeps its value, and what it contributes is taken off before the others are fitted.
TEST(Lfit, FitsTheSelectedParametersOnly) {
    const test::Report report;
    const Values exact{0.7, -1.9, 0.4, 3.3};
    Values x, y, sig;
    for (int k = 0; k < 40; ++k) {
        x.push_back(-1.1 + 0.057 * k);
        y.push_back(polval(exact.data(), 3, x.back()));
        sig.push_back(0.5 + 0.01 * k);
    }
    for (const auto fit : {lfit_mod, lfitd}) {
        Values a{9.0, exact[1], 9.0, 9.0};
        const std::vector<int> mask{1, 0, 1, 1};
        double** covar = dmatrix(1, 4, 1, 4);
        double chisq = -1.0;
        ASSERT_EQ(fit(x.data() - 1, y.data() - 1, sig.data() - 1, 40, a.data() - 1, mask.data() - 1, 4, covar,
                      &chisq, powers),
                  0);
        for (std::size_t i = 0; i < 4; ++i) EXPECT_NEAR(a[i], exact[i], 1e-12);
        EXPECT_LT(chisq, 1e-24);
        for (int i = 1; i <= 4; ++i) {
            EXPECT_EQ(covar[2][i], 0.0);
            EXPECT_EQ(covar[i][2], 0.0);
            if (i != 2) {
                EXPECT_GT(covar[i][i], 0.0);
            }
        }
        free_dmatrix(covar, 1, 4, 1, 4);
    }
}

// The covariance's diagonal is the variance of the parameters over many noisy repetitions.
TEST(Lfit, TellsTheVarianceOfItsParameters) {
    std::mt19937_64 generator{11};
    std::normal_distribution<double> noise{0.0, 0.3};
    const Values exact{0.7, -1.9};
    Values x, sig(30, 0.3);
    for (int k = 0; k < 30; ++k) x.push_back(0.1 * k);
    double sum = 0.0, squares = 0.0, variance = 0.0;
    constexpr int kRuns = 4000;
    double** covar = dmatrix(1, 2, 1, 2);
    for (int run = 0; run < kRuns; ++run) {
        Values y, a(2);
        for (const double t : x) y.push_back(polval(exact.data(), 1, t) + noise(generator));
        const int all[] = {1, 1};
        double chisq = 0.0;
        ASSERT_EQ(
            lfitd(x.data() - 1, y.data() - 1, sig.data() - 1, 30, a.data() - 1, all - 1, 2, covar, &chisq, powers),
            0);
        sum += a[1];
        squares += a[1] * a[1];
        variance = covar[2][2];
    }
    free_dmatrix(covar, 1, 2, 1, 2);
    const double observed = squares / kRuns - sum * sum / kRuns / kRuns;
    EXPECT_NEAR(observed / variance, 1.0, 0.1);
}

TEST(Lfit, SaysThatNothingIsToBeFitted) {
    const double one[] = {1.0};
    const int none[] = {0};
    double a[] = {5.0}, chisq = 6.0;
    double** covar = dmatrix(1, 1, 1, 1);
    {
        test::CapturedStderr captured;
        EXPECT_EQ(lfit_mod(one - 1, one - 1, one - 1, 1, a - 1, none - 1, 1, covar, &chisq, powers), 10);
        EXPECT_EQ(captured.text(), "lfit_mod: no parameters to be fitted");
    }
    {
        test::CapturedStderr captured;
        EXPECT_EQ(lfitd(one - 1, one - 1, one - 1, 1, a - 1, none - 1, 1, covar, &chisq, powers), 10);
        EXPECT_EQ(captured.text(), "lfit: no parameters to be fitted");
    }
    EXPECT_EQ(a[0], 5.0);
    EXPECT_EQ(chisq, 6.0);
    free_dmatrix(covar, 1, 1, 1, 1);
}

TEST(Covsrt, SpreadsRowsAndColumnsToTheirPlaces) {
    double** covar = dmatrix(1, 4, 1, 4);
    for (int i = 1; i <= 2; ++i) {
        for (int j = 1; j <= 2; ++j) covar[i][j] = 10.0 * i + j;
    }
    const int mask[] = {0, 1, 0, 1};
    covsrt(covar, 4, mask - 1, 2);
    for (int i = 1; i <= 4; ++i) {
        for (int j = 1; j <= 4; ++j) {
            const bool both = i % 2 == 0 && j % 2 == 0;
            EXPECT_EQ(covar[i][j], both ? 10.0 * (i / 2) + j / 2 : 0.0) << i << ' ' << j;
        }
    }
    free_dmatrix(covar, 1, 4, 1, 4);
}

constexpr int kWide = 6;
// Rows of a fixed random matrix, looked up by the point's number.
void table_row(double x, double values[], int count) {
    std::mt19937_64 generator{static_cast<unsigned>(x)};
    std::uniform_real_distribution<double> uniform{-1.0, 1.0};
    for (int i = 1; i <= count; ++i) values[i] = uniform(generator);
}

TEST(Svdfit, DecomposesTheDesignMatrixLikeLapack) {
    const test::Report report;
    const int n = 25;
    Values x, y(25, 0.5), sig(25, 1.0), a(kWide), w(kWide);
    for (int k = 0; k < n; ++k) x.push_back(k + 1);
    double** u = dmatrix(1, n, 1, kWide);
    double** v = dmatrix(1, kWide, 1, kWide);
    double chisq = 0.0;
    ASSERT_EQ(svdfit(x.data() - 1, y.data() - 1, sig.data() - 1, n, a.data() - 1, kWide, u, v, w.data() - 1,
                     &chisq, table_row),
              0);

    Values column_major(static_cast<std::size_t>(n) * kWide), expected(kWide), work(500);
    double worst = 0.0;
    for (int k = 1; k <= n; ++k) {
        double row[kWide + 1];
        table_row(k, row, kWide);
        for (int j = 1; j <= kWide; ++j) {
            double rebuilt = 0.0;
            for (int i = 1; i <= kWide; ++i) rebuilt += u[k][i] * w[static_cast<std::size_t>(i - 1)] * v[j][i];
            worst = std::max(worst, std::abs(rebuilt - row[j]));
            column_major[static_cast<std::size_t>((j - 1) * n + k - 1)] = row[j];
        }
    }
    EXPECT_LT(worst, 1e-14);
    const int wide = kWide, lwork = 500, one = 1;
    int info = -1;
    dgesvd_("N", "N", &n, &wide, column_major.data(), &n, expected.data(), nullptr, &one, nullptr, &one,
            work.data(), &lwork, &info);
    ASSERT_EQ(info, 0);
    std::sort(w.rbegin(), w.rend());
    for (std::size_t i = 0; i < kWide; ++i) EXPECT_NEAR(w[i], expected[i], 1e-14);
    free_dmatrix(v, 1, kWide, 1, kWide);
    free_dmatrix(u, 1, n, 1, kWide);
}

// Two equal columns: the fit is still the one of least length, the parameters share what one would take.
void twice(double x, double values[], int) {
    values[1] = values[2] = x;
    values[3] = 1.0;
}
TEST(Svdfit, SharesBetweenDependentColumns) {
    const Values x{1, 2, 3, 4, 5}, sig(5, 1.0);
    Values y, a(3), w(3);
    for (const double t : x) y.push_back(3.0 * t - 7.0);
    double** u = dmatrix(1, 5, 1, 3);
    double** v = dmatrix(1, 3, 1, 3);
    double chisq = 0.0;
    ASSERT_EQ(
        svdfit(x.data() - 1, y.data() - 1, sig.data() - 1, 5, a.data() - 1, 3, u, v, w.data() - 1, &chisq, twice),
        0);
    EXPECT_NEAR(a[0], 1.5, 1e-12);
    EXPECT_NEAR(a[1], 1.5, 1e-12);
    EXPECT_NEAR(a[2], -7.0, 1e-12);
    free_dmatrix(v, 1, 3, 1, 3);
    free_dmatrix(u, 1, 5, 1, 3);
}

TEST(Svdfit, RefusesTooFewPointsAndBadNumbers) {
    const test::Report report;
    const Values x{1, 2}, sig(2, 1.0);
    Values y{1, 2}, a{5, 5, 5}, w(3);
    double** u = dmatrix(1, 3, 1, 3);
    double** v = dmatrix(1, 3, 1, 3);
    double chisq = 0.0;
    const auto fit = [&](int ma) {
        return svdfit(x.data() - 1, y.data() - 1, sig.data() - 1, 2, a.data() - 1, ma, u, v, w.data() - 1, &chisq,
                      powers);
    };
    {
        test::CapturedStderr captured;
        EXPECT_EQ(fit(3), 10);
        EXPECT_EQ(captured.text(), "SVDCMP: You must augment A with extra zero rows");
    }
    {
        test::CapturedStderr captured;
        const Values bad{std::numeric_limits<double>::infinity(), 2};
        EXPECT_EQ(svdfit(bad.data() - 1, y.data() - 1, sig.data() - 1, 2, a.data() - 1, 2, u, v, w.data() - 1,
                         &chisq, powers),
                  10);
        EXPECT_EQ(captured.text(), "No convergence in 60 SVDCMP iterations");
    }
    EXPECT_EQ(a, (Values{5, 5, 5}));
    free_dmatrix(v, 1, 3, 1, 3);
    free_dmatrix(u, 1, 3, 1, 3);
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

    const Values zeros(12, 0.0);
    ASSERT_EQ(lsq_fit(zeros.data(), 4, 3, b.data(), x.data(), &summary), 0);
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

TEST(Fits, FreeEverythingWhenMemoryRunsOut) {
    const test::Report report;
    const Reference r = load("wampler1");
    test::fail_every_allocation([&] {
        Values c(6);
        return polfit(r.x.data(), r.y.data(), r.points(), c.data(), 5);
    });
    Values design(40, 1.0), b(20, 1.0), x(2);
    for (std::size_t i = 0; i < 20; ++i) design[2 * i] = static_cast<double>(i);
    test::fail_every_allocation([&] { return lsq_fit(design.data(), 20, 2, b.data(), x.data(), nullptr); });
}

}  // namespace
