// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <limits>
#include <numeric>
#include <random>
#include <string>
#include <vector>

#include "matrixlib/dense_kernels.h"
#include "one_based.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"
#include "support/levels.h"

extern "C" void dgesvd_(const char* jobu, const char* jobvt, const int* m, const int* n, double* a, const int* lda,
                        double* s, double* u, const int* ldu, double* vt, const int* ldvt, double* work,
                        const int* lwork, int* info);

namespace {

constexpr double kEpsilon = std::numeric_limits<double>::epsilon();
constexpr double kNan = std::numeric_limits<double>::quiet_NaN();

using test::Flat, test::OneBased;

std::size_t at(int n, int i, int j) {
    return static_cast<std::size_t>(i) * static_cast<std::size_t>(n) + static_cast<std::size_t>(j);
}

Flat random_matrix(int n, unsigned seed = 17) {
    std::mt19937_64 generator{seed};
    std::uniform_real_distribution<double> uniform{-1.0, 1.0};
    Flat a(at(n, n, 0));
    std::ranges::generate(a, [&] { return uniform(generator); });
    return a;
}
/** A random matrix with every element changed. */
template <typename Change>
Flat changed(int n, Change change) {
    Flat a = random_matrix(n);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j) change(a[at(n, i, j)], i, j);
    }
    return a;
}
constexpr struct {
    const char* name;
    Flat (*make)(int n);
} kMatrices[] = {
    {"random", [](int n) { return random_matrix(n); }},
    // Rows from large to small by twelve decades.
    {"graded",
     [](int n) { return changed(n, [n](double& a, int i, int) { a *= std::pow(10.0, -12.0 * i / n); }); }},
    {"Hilbert", [](int n) { return changed(n, [](double& a, int i, int j) { a = 1.0 / (i + j + 1); }); }},
    // The last column is the sum of the others, to rounding.
    {"dependent",
     [](int n) {
         return changed(
             n, [n](double& a, int, int j) { a = j > 0 && j == n - 1 ? std::accumulate(&a - j, &a, 0.0) : a; });
     }},
};
constexpr int kSizes[] = {1, 2, 3, 7, 20, 67, 200};  // the last two are halved, in odd parts and even ones

double norm(const Flat& v) {
    double sum = 0.0;
    for (const double value : v) sum = std::hypot(sum, value);
    return sum;
}

Flat transposed(const Flat& a, int rows, int columns) {
    Flat t(a.size());
    Transpose_Matrix(a.data(), t.data(), rows, columns);
    return t;
}
// Column-major products of row-major matrices are products in the other order.
Flat product(const Flat& a, const Flat& b, int rows, int inner, int columns) {
    Flat c(at(columns, rows, 0));
    EXPECT_EQ(Mmolt(b.data(), a.data(), c.data(), columns, inner, inner, rows), 0);
    return c;
}
Flat identity(int n) {
    return changed(n, [](double& a, int i, int j) { a = i == j ? 1.0 : 0.0; });
}
double distance(Flat a, const Flat& b) {
    for (std::size_t i = 0; i < a.size(); ++i) a[i] -= b[i];
    return norm(a);
}

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
    if (qrdcmp(qr.get(), n, c.data() - 1, d.data() - 1, &singular) != 0) return {};
    const int status = qr_solve(qr.get(), n, c.data() - 1, d.data() - 1, x.data() - 1);
    EXPECT_EQ(status, singular ? 10 : 0);
    return status == 0 ? x : Flat{};
}
Flat solve_pivoted_qr(const Flat& a, const Flat& b) {
    Flat x(b.size());
    LsqSummary summary{};
    const int n = static_cast<int>(b.size());
    return lsq_fit(a.data(), n, n, b.data(), x.data(), &summary) == 0 ? x : Flat{};
}
/** Solves a x = b in one of the library's ways; empty when it answers 10. */
struct SolverRow {
    const char* name;
    Flat (*solve)(const Flat& a, const Flat& b);
};
constexpr SolverRow kSolvers[] = {
    {"LU", solve_lu}, {"GaussJordan", solve_gauss_jordan}, {"QR", solve_qr}, {"PivotedQR", solve_pivoted_qr}};

class Solvers : public testing::TestWithParam<SolverRow> {};

// The backward error does not suffer from a bad condition: a wrong exchange, a missed element or a wrong sign
// does.
TEST_P(Solvers, HaveSmallBackwardErrors) {
    const test::Report report;
    for (const auto& matrix : kMatrices) {
        for (const int n : kSizes) {
            SCOPED_TRACE(testing::Message() << matrix.name << ' ' << n);
            const Flat a = matrix.make(n), columns = random_matrix(n, 99);
            const Flat b = product(a, columns, n, n, 1), x = GetParam().solve(a, b);
            if (x.empty() && &matrix == &kMatrices[3]) continue;  // singular to the last bit
            ASSERT_EQ(x.size(), b.size());
            EXPECT_LE(distance(product(a, x, n, n, 1), b), 10.0 * n * kEpsilon * norm(a) * norm(x));
        }
    }
    EXPECT_TRUE(report.entries().empty());
}

TEST_P(Solvers, RefuseSingularAndNonFiniteMatrices) {
    const test::CapturedStderr silent;
    Flat a{1, 2, 3, 0, 0, 0, 7, 8, 10};
    const bool ranks = std::string{GetParam().name} == "PivotedQR";  // answers with the shortest of the solutions
    EXPECT_EQ(GetParam().solve(a, {1, 2, 3}).empty(), !ranks);
    for (const double bad : {kNan, HUGE_VAL, -HUGE_VAL}) {
        for (std::size_t place = 0; place < a.size(); ++place) {
            Flat spoilt = random_matrix(3, 7);
            spoilt[place] = bad;
            EXPECT_TRUE(GetParam().solve(spoilt, {1, 2, 3}).empty()) << bad << " at " << place;
        }
    }
}
INSTANTIATE_TEST_SUITE_P(All, Solvers, testing::ValuesIn(kSolvers),
                         [](const auto& row) { return row.param.name; });

Flat singular_values_by_lapack(const Flat& a, int rows, int columns) {
    Flat values(static_cast<std::size_t>(columns)), columnwise = transposed(a, rows, columns), work(5000);
    const int room = static_cast<int>(work.size()), one = 1;
    int info = -1;
    dgesvd_("N", "N", &rows, &columns, columnwise.data(), &rows, values.data(), nullptr, &one, nullptr, &one,
            work.data(), &room, &info);
    EXPECT_EQ(info, 0);
    return values;
}

const Flat* design = nullptr;  // what design_row() reads: point number x, from 1 on, has row x - 1
void design_row(double x, double values[], int count) {
    std::copy_n(design->data() + at(count, static_cast<int>(x) - 1, 0), count, values + 1);
}

// What svdfit() says of its design matrix A: U and V have orthogonal columns, U^T A V is diagonal, and its
// elements are an independent solver's, those below the threshold dropped.
TEST(Svdfit, DecomposesTheDesignMatrixLikeLapack) {
    const test::Report report;
    for (const auto& matrix : kMatrices) {
        for (const int n : kSizes) {
            SCOPED_TRACE(testing::Message() << matrix.name << ' ' << n);
            const int columns = matrix.name[0] == 'r' ? (n + 3) / 4 : n;  // also more rows than columns
            Flat a = matrix.make(n);
            a.resize(at(columns, n, 0));
            design = &a;
            const auto points = static_cast<std::size_t>(n), parameters = static_cast<std::size_t>(columns);
            Flat x(points), parameter(parameters), w(parameters);
            const Flat sig(points, 1.0);
            std::iota(x.begin(), x.end(), 1.0);
            OneBased u{n, columns}, v{columns, columns};
            double chisq = 0.0;
            ASSERT_EQ(svdfit(x.data() - 1, sig.data() - 1, sig.data() - 1, n, parameter.data() - 1, columns,
                             u.get(), v.get(), w.data() - 1, &chisq, design_row),
                      0);
            const double bound = 10.0 * n * kEpsilon, dropped = 1e-5 * *std::ranges::max_element(w);
            const Flat ut = transposed(u.flat(), n, columns), vt = transposed(v.flat(), columns, columns);
            const Flat s = product(ut, product(a, v.flat(), n, columns, columns), columns, n, columns);
            EXPECT_LE(distance(product(ut, u.flat(), columns, n, columns), identity(columns)), bound);
            EXPECT_LE(distance(product(vt, v.flat(), columns, columns, columns), identity(columns)), bound);
            Flat diagonal(s.size());
            for (int j = 0; j < columns; ++j) {
                const double value = w[static_cast<std::size_t>(j)], found = s[at(columns, j, j)];
                diagonal[at(columns, j, j)] = value == 0.0 && std::abs(found) <= dropped ? found : value;
            }
            EXPECT_LE(distance(s, diagonal), bound * norm(a));
            Flat expected = singular_values_by_lapack(a, n, columns);
            for (double& value : expected) value = value < dropped ? 0.0 : value;
            std::ranges::sort(w, std::greater{});
            EXPECT_LE(distance(w, expected), bound * norm(a));
        }
    }
    EXPECT_TRUE(report.entries().empty());
}

TEST(Inversion, TimesTheMatrixIsTheIdentity) {
    const test::Report report;
    for (const int n : kSizes) {
        const Flat a = random_matrix(n, 23);
        Flat inverse(a.size()), in_place = a;
        ASSERT_EQ(MatInv(a.data(), inverse.data(), n), 0);
        const double bound = 10.0 * n * kEpsilon * norm(a) * norm(inverse);
        EXPECT_LE(distance(product(a, inverse, n, n, n), identity(n)), bound) << n;
        ASSERT_EQ(MatInv(in_place.data(), in_place.data(), n), 0);
        EXPECT_EQ(in_place, inverse);
        OneBased eliminated{a, n, n};
        ASSERT_EQ(ldgaussj(eliminated.get(), n, eliminated.get(), 0), 0);
        EXPECT_LE(distance(eliminated.flat(), inverse), bound * norm(inverse)) << "in place of the matrix";
    }
    OneBased a{{0, 2, 1, 1}, 2, 2}, y{2, 2};
    test::fail_every_allocation([&] { return InvMatrix(a.get(), y.get(), 2); });
    EXPECT_EQ(y.flat(), (Flat{-0.5, 1.0, 0.5, 0.0}));
    EXPECT_EQ(a.flat(), (Flat{1, 1, 0, 2})) << "the factors";
}

TEST(DenseKernels, GiveTheSameBitsAtEveryWidth) {
    Flat first;
    for (const auto level : test::processor_levels()) {
        const quo::DenseKernels& kernels = quo::dense_kernels(level);
        Flat a = random_matrix(60), found(1046);
        const double *const u = &a[2600], *const factors[] = {u, u + 100, u + 200, u + 300};
        double *const sums = &found[1034], *const rows[] = {&a[0], &a[600], &a[1200], &a[1800]};
        const quo::Columns columns{rows[0], 517, 5, 517};
        kernels.dots(u, columns, sums);
        kernels.subtract_multiples(u, sums, columns, sums + 5);
        kernels.long_residual(columns, sums, u, u + 1, &found[0], &found[517]);
        sums[10] = kernels.long_dot(u, rows[0], 517);
        sums[11] = kernels.largest(u, 517);
        kernels.subtract_tile(rows, factors, Flat(30 * 16, 0.3).data(), 30);
        for (const double* row : rows) found.insert(found.end(), row, row + 4);
        EXPECT_EQ(found, level == quo::ProcessorLevel::kBase ? first = found : first) << static_cast<int>(level);
    }
}

TEST(SingularMatrices, HaveTheirMessages) {
    const test::Report report;
    for (const Flat& matrix :
         {Flat{1, 2, 0, 0}, Flat{0, 0, 0, 0}, Flat{kNan, kNan, kNan, kNan}, Flat{1, 2, HUGE_VAL, 3}}) {
        OneBased left{matrix, 2, 2}, b{{1, 1}, 2, 1};
        Flat y{5, 5, 5, 5};
        test::CapturedStderr captured;
        EXPECT_EQ(gaussj(left.get(), 2, b.get(), 1), 10);
        EXPECT_EQ(MatInv(matrix.data(), y.data(), 2), 10);
        EXPECT_EQ(captured.text(), std::string{"ld-gaussj: Singular Matrix-"} +
                                       (std::isfinite(norm(matrix)) ? '2' : '1') +
                                       "Singular matrix in lud decomposition");
        EXPECT_THAT(y, testing::Each(5.0));
    }
    const auto tree = report.entries();
    ASSERT_EQ(tree.size(), 8U);
    EXPECT_EQ(tree[0].kind + tree[0].function + tree[1].kind + tree[1].function,
              "ERROR_CALL_TREEInvMatrixERROR_CALL_TREEMatInv");
    EXPECT_EQ(tree[1].file, R"(..\..\..\libsrc\sources\matrixlib\MatrixAlgebraANSI)");
}

TEST(Dimensions, ThatDoNotFitAreRefused) {
    const test::CapturedStderr silent;
    const Flat a{1, 2, 3, 4, 5, 6};
    Flat c{9, 9, 9, 9};
    for (const int n : {0, -3}) {
        EXPECT_EQ(MatInv(a.data(), c.data(), n) + gaussj(nullptr, n, nullptr, 0), 20);
        EXPECT_EQ(ludcmp(nullptr, n, nullptr, nullptr) + qrdcmp(nullptr, n, nullptr, nullptr, nullptr), 20);
    }
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 2, 3), 10);
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 0, 3, 3, 2), 0);
    EXPECT_EQ(c, (Flat{9, 9, 9, 9}));
    // Columns 1 2, 3 4, 5 6 times the column 1 2 3.
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 3, 1), 0);
    EXPECT_EQ(c, (Flat{22, 28, 9, 9}));
}

TEST(ThreeByThree, DoWhatTheGeneralFormsDo) {
    for (unsigned seed = 1; seed <= 20; ++seed) {
        const Flat a = random_matrix(3, seed), b = random_matrix(3, seed + 100), v(b.begin(), b.begin() + 3);
        const Flat ab = product(a, b, 3, 3, 3), av = product(a, v, 3, 3, 1);
        Flat found(9), inverse(9), of_vector(3), cross(3);
        for (const auto multiply : {mul3x3, mul}) {
            multiply(a.data(), b.data(), found.data());
            EXPECT_LE(distance(found, ab), 1e-14);
        }
        for (const auto multiply : {mul3x1, mul_NxM_M}) {
            multiply(a.data(), v.data(), of_vector.data());
            EXPECT_LE(distance(of_vector, av), 1e-14);
        }
        tran(a.data(), found.data());
        EXPECT_EQ(found, transposed(a, 3, 3));
        ASSERT_EQ(MatInv(a.data(), inverse.data(), 3), 0);
        inv3x3(a.data(), found.data());
        EXPECT_LE(distance(found, inverse), 1e-14 * norm(inverse) * norm(inverse));
        ASSERT_EQ(MSE_poly(a.data(), av.data(), of_vector.data()), 0);
        EXPECT_LE(distance(of_vector, v), 1e-12 * norm(inverse) * norm(inverse));

        v1pv2(a.data(), a.data() + 3, cross.data());
        EXPECT_NEAR(determ(a.data()), std::inner_product(cross.begin(), cross.end(), a.begin() + 6, 0.0), 1e-14);
        v1pv2(a.data(), v.data(), cross.data());
        const double sine = norm(cross) / (norm({a.begin(), a.begin() + 3}) * norm(v));
        EXPECT_NEAR(std::pow(COS_PHI_V(a.data(), v.data()), 2.0) + sine * sine, 1.0, 1e-14);
        EXPECT_EQ(COS_PHI_V(a.data(), v.data()) > 0.0, av[0] > 0.0);
    }
}

}  // namespace
