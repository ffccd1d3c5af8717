#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/alloc_free.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"

extern "C" void dgesv_(const int* n, const int* nrhs, double* a, const int* lda, int* ipiv, double* b,
                       const int* ldb, int* info);

namespace {

constexpr double kEpsilon = std::numeric_limits<double>::epsilon();
constexpr double kNan = std::numeric_limits<double>::quiet_NaN();

using Flat = std::vector<double>;

/** A 1-based matrix filled from a flat row-major one. */
class OneBased {
public:
    OneBased(const Flat& flat, int rows, int columns)
        : rows_{rows}, columns_{columns}, data_{dmatrix(1, rows, 1, columns)} {
        std::copy(flat.begin(), flat.end(), &data_[1][1]);
    }
    ~OneBased() { free_dmatrix(data_, 1, rows_, 1, columns_); }
    OneBased(const OneBased&) = delete;
    OneBased& operator=(const OneBased&) = delete;
    double** get() { return data_; }
    [[nodiscard]] Flat flat() const {
        return {&data_[1][1], &data_[1][1] + static_cast<std::ptrdiff_t>(rows_) * columns_};
    }

private:
    int rows_, columns_;
    double** data_;
};

std::size_t at(int n, int i, int j) {
    return static_cast<std::size_t>(i) * static_cast<std::size_t>(n) + static_cast<std::size_t>(j);
}

Flat random_matrix(int n, unsigned seed) {
    std::mt19937_64 generator{seed};
    std::uniform_real_distribution<double> uniform{-1.0, 1.0};
    Flat a(at(n, n, 0));
    std::generate(a.begin(), a.end(), [&] { return uniform(generator); });
    return a;
}
// Rows from large to small by twelve decades.
Flat graded_matrix(int n, unsigned seed) {
    Flat a = random_matrix(n, seed);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j) a[at(n, i, j)] *= std::pow(10.0, -12.0 * i / n);
    }
    return a;
}
Flat hilbert_matrix(int n) {
    Flat a(at(n, n, 0));
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j) a[at(n, i, j)] = 1.0 / (i + j + 1);
    }
    return a;
}

double norm(const Flat& v) {
    double sum = 0.0;
    for (const double value : v) sum = std::hypot(sum, value);
    return sum;
}

/** |A x - b| / (|A| |x|), the backward error of a solution. */
double backward_error(const Flat& a, const Flat& x, const Flat& b) {
    const int n = static_cast<int>(x.size());
    Flat residual(b);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j)
            residual[static_cast<std::size_t>(i)] -= a[at(n, i, j)] * x[static_cast<std::size_t>(j)];
    }
    return norm(residual) / (norm(a) * norm(x));
}

/** Solves a x = b in one of the library's ways; empty when it answers 10. */
using Solver = std::function<Flat(const Flat& a, const Flat& b)>;

Flat solve_lu(const Flat& a, const Flat& b) {
    const int n = static_cast<int>(b.size());
    OneBased lu{a, n, n};
    std::vector<int> exchanges(b.size() + 1);
    Flat x(b);
    double parity = 0.0;
    if (ludcmp(lu.get(), n, exchanges.data(), &parity) != 0) return {};
    lubksb(lu.get(), n, exchanges.data(), x.data() - 1);
    return x;
}
Flat solve_gauss_jordan(const Flat& a, const Flat& b) {
    const int n = static_cast<int>(b.size());
    OneBased left{a, n, n}, right{b, n, 1};
    return gaussj(left.get(), n, right.get(), 1) == 0 ? right.flat() : Flat{};
}
Flat solve_qr(const Flat& a, const Flat& b) {
    const int n = static_cast<int>(b.size());
    OneBased qr{a, n, n};
    Flat c(b.size()), d(b.size()), x(b);
    int singular = 0;
    EXPECT_EQ(qrdcmp(qr.get(), n, c.data() - 1, d.data() - 1, &singular), 0);
    const int status = qr_solve(qr.get(), n, c.data() - 1, d.data() - 1, x.data() - 1);
    EXPECT_EQ(status, singular ? 10 : 0);
    return status == 0 ? x : Flat{};
}
Flat solve_pivoted_qr(const Flat& a, const Flat& b) {
    Flat x(b.size());
    LsqSummary summary{};
    const int n = static_cast<int>(b.size());
    EXPECT_EQ(lsq_fit(a.data(), n, n, b.data(), x.data(), &summary), 0);
    return summary.rank == n ? x : Flat{};
}
Flat solve_lapack(Flat a, Flat b) {
    const int n = static_cast<int>(b.size()), one = 1;
    Flat transposed(a.size());
    Transpose_Matrix(a.data(), transposed.data(), n, n);
    std::vector<int> pivots(b.size());
    int info = 0;
    dgesv_(&n, &one, transposed.data(), &n, pivots.data(), b.data(), &n, &info);
    return info == 0 ? b : Flat{};
}

struct SolverRow {
    const char* name;
    Solver solve;
};
const SolverRow kSolvers[] = {
    {"LU", solve_lu}, {"GaussJordan", solve_gauss_jordan}, {"QR", solve_qr}, {"PivotedQR", solve_pivoted_qr}};

class Solvers : public testing::TestWithParam<SolverRow> {};

// The backward error does not suffer from a bad condition: a wrong exchange, a missed element or a wrong sign
// does.
TEST_P(Solvers, HaveSmallBackwardErrors) {
    const test::Report report;
    for (const int n : {1, 2, 3, 7, 20, 61, 200}) {
        const Flat b = random_matrix(n, 99);
        const Flat right(b.begin(), b.begin() + n);
        for (const Flat& a : {random_matrix(n, 17), graded_matrix(n, 18), hilbert_matrix(std::min(n, 8))}) {
            const Flat part(right.begin(), right.begin() + static_cast<std::ptrdiff_t>(
                                                               std::sqrt(static_cast<double>(a.size()) + 0.5)));
            const Flat x = GetParam().solve(a, part);
            ASSERT_EQ(x.size(), part.size()) << n;
            EXPECT_LE(backward_error(a, x, part), 10.0 * n * kEpsilon) << n;
        }
    }
    EXPECT_TRUE(report.entries().empty());
}

// On well-conditioned matrices the solution itself must agree with an independent solver's.
TEST_P(Solvers, AgreeWithLapack) {
    for (const int n : {3, 7, 50, 200}) {
        Flat a = random_matrix(n, 5);
        for (int i = 0; i < n; ++i) a[at(n, i, i)] += n;
        const Flat b = random_matrix(n, 6);
        const Flat right(b.begin(), b.begin() + n);
        const Flat expected = solve_lapack(a, right);
        const Flat x = GetParam().solve(a, right);
        ASSERT_EQ(x.size(), expected.size());
        for (std::size_t i = 0; i < x.size(); ++i) EXPECT_NEAR(x[i], expected[i], 50.0 * kEpsilon) << n;
    }
}

// One row is twice another; a row is zero.
TEST_P(Solvers, FindSingularMatrices) {
    const test::CapturedStderr silent;
    const Flat zero_row{1, 2, 3, 0, 0, 0, 7, 8, 10};
    EXPECT_TRUE(GetParam().solve(zero_row, {1, 2, 3}).empty());
    if (std::string{GetParam().name} == "PivotedQR") {
        EXPECT_TRUE(GetParam().solve({1, 2, 3, 2, 4, 6, 7, 8, 10}, {1, 2, 3}).empty());
    }
}

INSTANTIATE_TEST_SUITE_P(All, Solvers, testing::ValuesIn(kSolvers),
                         [](const auto& row) { return row.param.name; });

TEST(MatInv, TimesTheMatrixIsTheIdentity) {
    const test::Report report;
    for (const int n : {1, 2, 3, 7, 50, 200}) {
        const Flat a = random_matrix(n, 23), kept = a;
        Flat inverse(a.size()), product(a.size());
        ASSERT_EQ(MatInv(a.data(), inverse.data(), n), 0);
        EXPECT_EQ(a, kept);
        // Column-major products of row-major matrices are products in the other order.
        ASSERT_EQ(Mmolt(a.data(), inverse.data(), product.data(), n, n, n, n), 0);
        double worst = 0.0;
        for (int i = 0; i < n; ++i) {
            for (int j = 0; j < n; ++j)
                worst = std::max(worst, std::abs(product[at(n, i, j)] - (i == j ? 1.0 : 0.0)));
        }
        EXPECT_LE(worst, 10.0 * n * kEpsilon * norm(a) * norm(inverse)) << n;

        Flat in_place = a;
        ASSERT_EQ(MatInv(in_place.data(), in_place.data(), n), 0);
        EXPECT_EQ(in_place, inverse);
    }
}

TEST(InvMatrix, OverwritesItsInputWithTheFactors) {
    OneBased a{{0, 2, 1, 1}, 2, 2}, y{{9, 9, 9, 9}, 2, 2};
    ASSERT_EQ(InvMatrix(a.get(), y.get(), 2), 0);
    EXPECT_EQ(y.flat(), (Flat{-0.5, 1.0, 0.5, 0.0}));
    EXPECT_EQ(a.flat(), (Flat{1, 1, 0, 2}));
}

TEST(GaussJordan, LeavesTheInverseInPlaceOfTheMatrix) {
    const int n = 9;
    const Flat a = random_matrix(n, 31);
    Flat expected(a.size());
    ASSERT_EQ(MatInv(a.data(), expected.data(), n), 0);
    OneBased left{a, n, n};
    ASSERT_EQ(ldgaussj(left.get(), n, left.get(), 0), 0);
    for (std::size_t i = 0; i < expected.size(); ++i) EXPECT_NEAR(left.flat()[i], expected[i], 1e-12);
}

struct Failure {
    const char* name;
    Flat matrix;
    const char* lu_message;
    const char* gauss_message;
};
const Failure kFailures[] = {
    {"ZeroRow", {1, 2, 0, 0}, "Singular matrix in lud decomposition", "ld-gaussj: Singular Matrix-2"},
    {"Zero", {0, 0, 0, 0}, "Singular matrix in lud decomposition", "ld-gaussj: Singular Matrix-2"},
    {"NotANumber",
     {kNan, kNan, kNan, kNan},
     "Singular matrix in lud decomposition",
     "ld-gaussj: Singular Matrix-1"},
};
class Failures : public testing::TestWithParam<Failure> {};

TEST_P(Failures, SayTheirMessageAndReturnTen) {
    const test::Report report;
    {
        test::CapturedStderr captured;
        OneBased a{GetParam().matrix, 2, 2};
        int exchanges[3];
        double parity = 0.0;
        EXPECT_EQ(ludcmp(a.get(), 2, exchanges, &parity), 10);
        EXPECT_EQ(captured.text(), GetParam().lu_message);
    }
    {
        test::CapturedStderr captured;
        OneBased a{GetParam().matrix, 2, 2}, b{{1, 1}, 2, 1};
        EXPECT_EQ(gaussj(a.get(), 2, b.get(), 1), 10);
        EXPECT_EQ(captured.text(), GetParam().gauss_message);
    }
    EXPECT_TRUE(report.entries().empty());
    const test::CapturedStderr silent;
    Flat y{5, 5, 5, 5};
    EXPECT_EQ(MatInv(GetParam().matrix.data(), y.data(), 2), 10);
    EXPECT_EQ(y, (Flat{5, 5, 5, 5}));
    const auto tree = report.entries("ERROR_CALL_TREE");
    ASSERT_EQ(tree.size(), 2U);
    EXPECT_EQ(tree[0].function, "InvMatrix");
    EXPECT_EQ(tree[1].function, "MatInv");
    EXPECT_EQ(tree[1].file, R"(..\..\..\libsrc\sources\matrixlib\MatrixAlgebraANSI)");
}
INSTANTIATE_TEST_SUITE_P(All, Failures, testing::ValuesIn(kFailures),
                         [](const auto& row) { return row.param.name; });

TEST(Dimensions, BelowOneAreRefused) {
    const test::CapturedStderr silent;
    double value = 5.0;
    EXPECT_EQ(MatInv(&value, &value, 0), 10);
    EXPECT_EQ(MatInv(&value, &value, -3), 10);
    EXPECT_EQ(value, 5.0);
    EXPECT_EQ(gaussj(nullptr, 0, nullptr, 0), 10);
    int singular = 7;
    EXPECT_EQ(qrdcmp(nullptr, 0, nullptr, nullptr, &singular), 10);
    EXPECT_EQ(singular, 7);
}

TEST(Dimensions, MustFitInProducts) {
    test::CapturedStderr captured;
    const Flat a{1, 2, 3, 4, 5, 6};
    Flat c{9, 9, 9, 9};
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 2, 3), 10);
    EXPECT_EQ(c, (Flat{9, 9, 9, 9}));
    EXPECT_NE(captured.text(), "");
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 0, 3, 3, 2), 0);
    EXPECT_EQ(c, (Flat{9, 9, 9, 9}));
    // Columns 1 2, 3 4, 5 6 times the column 1 2 3.
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 3, 1), 0);
    EXPECT_EQ(c, (Flat{22, 28, 9, 9}));
}

TEST(Inversion, FreesEverythingWhenMemoryRunsOut) {
    const test::Report report;
    const Flat a = random_matrix(5, 3);
    Flat y(a.size());
    test::fail_every_allocation([&] { return MatInv(a.data(), y.data(), 5); });
}

// Tied to each other by identities rather than to stored numbers.
TEST(ThreeByThree, IdentitiesHold) {
    for (unsigned seed = 1; seed <= 20; ++seed) {
        const Flat a = random_matrix(3, seed), b = random_matrix(3, seed + 100);
        Flat ab(9), inverse(9), product(9), left(3), right(3), flat_inverse(9);
        mul3x3(a.data(), b.data(), ab.data());
        EXPECT_NEAR(determ(ab.data()), determ(a.data()) * determ(b.data()), 1e-14);
        inv3x3(a.data(), inverse.data());
        ASSERT_EQ(MatInv(a.data(), flat_inverse.data(), 3), 0);
        const double scale = norm(inverse);
        for (std::size_t i = 0; i < 9; ++i) EXPECT_NEAR(inverse[i], flat_inverse[i], 1e-14 * scale * scale);

        mul3x1(ab.data(), b.data(), left.data());
        mul_NxM_M(b.data(), b.data(), right.data());
        mul3x1(a.data(), right.data(), right.data());
        for (std::size_t i = 0; i < 3; ++i) EXPECT_NEAR(left[i], right[i], 1e-14);

        Flat at_a(9), bt_at(9), ab_t(9), bt(9);
        tran(a.data(), at_a.data());
        tran(b.data(), bt.data());
        mul(bt.data(), at_a.data(), bt_at.data());
        tran(ab.data(), ab_t.data());
        EXPECT_EQ(bt_at, ab_t);

        const double cosine = COS_PHI_V(a.data(), b.data());
        double cross[3];
        v1pv2(a.data(), b.data(), cross);
        const double sine =
            norm({cross, cross + 3}) / (norm({a.begin(), a.begin() + 3}) * norm({b.begin(), b.begin() + 3}));
        EXPECT_NEAR(cosine * cosine + sine * sine, 1.0, 1e-14);

        double solution[3];
        ASSERT_EQ(MSE_poly(a.data(), b.data(), solution), 0);
        mul3x1(a.data(), solution, left.data());
        for (std::size_t i = 0; i < 3; ++i) EXPECT_NEAR(left[i], b[i], 1e-12 * scale * scale);
    }
}

}  // namespace
