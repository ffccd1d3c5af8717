#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <functional>
#include <limits>
#include <numeric>
#include <random>
#include <string>
#include <vector>

#include "one_based.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/alloc_free.h"
#include "quo_base/gr_pt.h"
#include "support/diagnostics.h"

extern "C" void dgesvd_(const char* jobu, const char* jobvt, const int* m, const int* n, double* a, const int* lda,
                        double* s, double* u, const int* ldu, double* vt, const int* ldvt, double* work,
                        const int* lwork, int* info);
extern "C" void dgesv_(const int* n, const int* nrhs, double* a, const int* lda, int* ipiv, double* b,
                       const int* ldb, int* info);

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
         double sum = 0.0;
         return changed(n, [&](double& a, int, int j) {
             sum = j == 0 ? 0.0 : sum;
             a = j > 0 && j == n - 1 ? sum : a;
             sum += a;
         });
     }},
};
constexpr int kSizes[] = {1, 2, 3, 7, 20, 61, 200};

double norm(const Flat& v) {
    double sum = 0.0;
    for (const double value : v) sum = std::hypot(sum, value);
    return sum;
}

Flat times(const Flat& a, const Flat& x) {
    Flat b(x.size());
    for (std::size_t i = 0; i < b.size(); ++i) {
        for (std::size_t j = 0; j < b.size(); ++j) b[i] += a[i * b.size() + j] * x[j];
    }
    return b;
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

/** |A x - b| / (|A| |x|), the backward error of a solution. */
double backward_error(const Flat& a, const Flat& x, const Flat& b) {
    return distance(times(a, x), b) / (norm(a) * norm(x));
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
Flat solve_lapack(Flat a, Flat b) {
    const int n = static_cast<int>(b.size()), one = 1;
    a = transposed(a, n, n);
    std::vector<int> pivots(b.size());
    int info = 0;
    dgesv_(&n, &one, a.data(), &n, pivots.data(), b.data(), &n, &info);
    errno = 0;  // whatever an installed LAPACK left there
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
// does. On well-conditioned matrices the solution itself must agree with an independent solver's.
TEST_P(Solvers, HaveSmallBackwardErrorsAndAgreeWithLapack) {
    const test::Report report;
    for (const auto& matrix : kMatrices) {
        for (const int n : kSizes) {
            SCOPED_TRACE(testing::Message() << matrix.name << ' ' << n);
            const Flat a = matrix.make(n), columns = random_matrix(n, 99);
            const Flat b = times(a, {columns.begin(), columns.begin() + n}), x = GetParam().solve(a, b);
            if (x.empty() && &matrix == &kMatrices[3]) continue;  // singular to the last bit
            ASSERT_EQ(x.size(), b.size());
            EXPECT_LE(backward_error(a, x, b), 10.0 * n * kEpsilon);

            Flat heavy = a;
            for (int i = 0; i < n; ++i) heavy[at(n, i, i)] += 2.0 * n;
            const Flat close = GetParam().solve(heavy, b), expected = solve_lapack(heavy, b);
            for (std::size_t i = 0; i < b.size(); ++i)
                EXPECT_NEAR(close[i], expected[i], 50.0 * kEpsilon * norm(b));
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

// What svdfit() says of its design matrix A: A = U S V^T with orthogonal columns of U and V, S is diagonal, and
// its elements are an independent solver's, those below the threshold dropped.
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
            EXPECT_LE(
                distance(product(u.flat(), product(s, vt, columns, columns, columns), n, columns, columns), a),
                bound * norm(a));
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
        const Flat a = random_matrix(n, 23), kept = a;
        Flat inverse(a.size()), in_place = a;
        ASSERT_EQ(MatInv(a.data(), inverse.data(), n), 0);
        EXPECT_EQ(a, kept);
        const double bound = 10.0 * n * kEpsilon * norm(a) * norm(inverse);
        EXPECT_LE(distance(product(a, inverse, n, n, n), identity(n)), bound) << n;
        ASSERT_EQ(MatInv(in_place.data(), in_place.data(), n), 0);
        EXPECT_EQ(in_place, inverse);
        OneBased eliminated{a, n, n};
        ASSERT_EQ(ldgaussj(eliminated.get(), n, eliminated.get(), 0), 0);
        EXPECT_LE(distance(eliminated.flat(), inverse), bound * norm(inverse)) << "in place of the matrix";
    }
    const test::CapturedStderr silent;
    const Flat a = random_matrix(5, 3);
    Flat y(a.size());
    test::fail_every_allocation([&] { return MatInv(a.data(), y.data(), 5); });
}

TEST(InvMatrix, OverwritesItsInputWithTheFactors) {
    OneBased a{{0, 2, 1, 1}, 2, 2}, y{{9, 9, 9, 9}, 2, 2};
    ASSERT_EQ(InvMatrix(a.get(), y.get(), 2), 0);
    EXPECT_EQ(y.flat(), (Flat{-0.5, 1.0, 0.5, 0.0}));
    EXPECT_EQ(a.flat(), (Flat{1, 1, 0, 2}));
}

TEST(SingularMatrices, HaveTheirMessages) {
    const test::Report report;
    const struct {
        Flat matrix;
        const char* gauss_jordan;
    } rows[] = {
        {{1, 2, 0, 0}, "2"}, {{0, 0, 0, 0}, "2"}, {{kNan, kNan, kNan, kNan}, "1"}, {{1, 2, HUGE_VAL, 3}, "1"}};
    for (const auto& row : rows) {
        OneBased lu{row.matrix, 2, 2}, left{row.matrix, 2, 2}, b{{1, 1}, 2, 1};
        int exchanges[3];
        double parity = 0.0;
        Flat y{5, 5, 5, 5};
        test::CapturedStderr captured;
        EXPECT_EQ(gaussj(left.get(), 2, b.get(), 1), 10);
        EXPECT_EQ(ludcmp(lu.get(), 2, exchanges, &parity), 10);
        EXPECT_EQ(MatInv(row.matrix.data(), y.data(), 2), 10);
        const std::string lu_message = "Singular matrix in lud decomposition";
        EXPECT_EQ(captured.text(),
                  std::string{"ld-gaussj: Singular Matrix-"} + row.gauss_jordan + lu_message + lu_message);
        EXPECT_THAT(y, testing::Each(5.0));
    }
    EXPECT_TRUE(report.entries("ERROR").empty());
    const auto tree = report.entries("ERROR_CALL_TREE");
    ASSERT_EQ(tree.size(), 8U);
    EXPECT_EQ(tree[0].function, "InvMatrix");
    EXPECT_EQ(tree[1].function, "MatInv");
    EXPECT_EQ(tree[1].file, R"(..\..\..\libsrc\sources\matrixlib\MatrixAlgebraANSI)");
}

TEST(Dimensions, ThatDoNotFitAreRefused) {
    test::CapturedStderr captured;
    const Flat a{1, 2, 3, 4, 5, 6};
    Flat c{9, 9, 9, 9};
    int singular = 7, exchanges[1];
    double parity = 0.0;
    OneBased small{1, 1};
    for (const int n : {0, -3}) {
        EXPECT_EQ(MatInv(a.data(), c.data(), n), 10);
        EXPECT_EQ(gaussj(nullptr, n, nullptr, 0), 10);
        EXPECT_EQ(ludcmp(small.get(), n, exchanges, &parity), 10);
        EXPECT_EQ(qrdcmp(nullptr, n, nullptr, nullptr, &singular), 10);
    }
    EXPECT_EQ(singular, 7);
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 2, 3), 10);
    EXPECT_NE(captured.text(), "");
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 0, 3, 3, 2), 0);
    EXPECT_EQ(c, (Flat{9, 9, 9, 9}));
    // Columns 1 2, 3 4, 5 6 times the column 1 2 3.
    EXPECT_EQ(Mmolt(a.data(), a.data(), c.data(), 2, 3, 3, 1), 0);
    EXPECT_EQ(c, (Flat{22, 28, 9, 9}));
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
