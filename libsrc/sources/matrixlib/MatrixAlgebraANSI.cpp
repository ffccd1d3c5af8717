// SPDX-License-Identifier: Apache-2.0
#include "quo_base/MatrixAlgebraANSI.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "matrixlib/dense_kernels.h"
#include "matrixlib/matrix_kernels.h"
#include "quo_base/gr_pt.h"
#include "sarutillib/ground/checked_size.h"

namespace quo {

void say(const char* message) noexcept { std::fputs(message, stderr); }

}  // namespace quo

namespace {

using quo::dense_kernels;
using quo::FlatRows;
using quo::Rows;
using quo::subtract_multiple;

// Triangles of so many rows, and panels of so many columns, are worked through row by row, greater ones by halves;
// up to kSmall rows a matrix is not halved at all.
constexpr int kLeaf = 8, kSmall = 64;
int leaf_of(int n) { return n > kSmall ? kLeaf : kSmall; }
// What a zero pivot becomes, so that a matrix that is singular to rounding still has factors.
constexpr double kTinyPivot = 1e-20;

std::size_t square(int n) { return static_cast<std::size_t>(n) * static_cast<std::size_t>(n); }

// scale[i] = 1 / the largest magnitude in row i. False when a row is zero or not finite.
template <typename Matrix>
bool row_scales(const Matrix& a, int n, double* scale) {
    for (int i = 0; i < n; ++i) {
        double largest = 0.0;
        for (int j = 0; j < n; ++j) {
            const double magnitude = std::abs(a[i][j]);
            if (!std::isfinite(magnitude)) return false;
            largest = std::max(largest, magnitude);
        }
        if (largest == 0.0) return false;
        scale[i] = 1.0 / largest;
    }
    return true;
}

template <typename Matrix>
int scaled_pivot_row(const Matrix& a, int n, int column, const double* scale) {
    int best = column;
    double largest = -1.0;
    for (int i = column; i < n; ++i) {
        const double candidate = scale[i] * std::abs(a[i][column]);
        if (candidate >= largest) {
            largest = candidate;
            best = i;
        }
    }
    return best;
}

/** Part of an axis: the first index and the one after the last. */
struct Range {
    int first, last;
    [[nodiscard]] int count() const { return last - first; }
    [[nodiscard]] Range upper_half() const { return {first, first + count() / 2}; }
    [[nodiscard]] Range lower_half() const { return {first + count() / 2, last}; }
};

/** Calls work(piece) for pieces of a range, one after another. */
template <typename Work>
void by_pieces(Range range, int most, Work work) {
    for (int first = range.first; first < range.last; first += most)
        work(Range{first, std::min(first + most, range.last)});
}

/** Takes products of matrix parts off others, tile by tile. */
template <typename Factors, typename Matrix>
class Product {
public:
    Product(const Factors& a, const Matrix& b) : a_{a}, b_{b} {}

    /** c[rows][columns] -= a[rows][inner] * b[inner][columns]. */
    void subtract(const Matrix& c, Range rows, Range inner, Range columns) {
        by_pieces(inner, kStripRows, [&](Range part) {
            by_pieces(columns, kernels_.tile_columns, [&](Range strip) {
                fill_strip(part, strip);
                by_pieces(rows, kTileRows, [&](Range tile) { subtract_tile(c, tile, part, strip); });
            });
        });
    }

private:
    static constexpr int kTileRows = quo::DenseKernels::kTileRows, kMostColumns = 16;
    static constexpr int kStripRows = 128;  // whose strip stays in the nearest cache while the rows pass

    // One row of b after another, with zeros where the columns end.
    void fill_strip(Range rows, Range columns) {
        double* to = strip_;
        for (int k = rows.first; k < rows.last; ++k, to += kernels_.tile_columns) {
            std::copy(b_[k] + columns.first, b_[k] + columns.last, to);
            std::fill(to + columns.count(), to + kernels_.tile_columns, 0.0);
        }
    }

    // Where the columns end a tile is worked on aside. Rows that it lacks are its last one once more, with the
    // same result.
    void subtract_tile(const Matrix& c, Range rows, Range inner, Range columns) const {
        const bool aside = columns.count() < kernels_.tile_columns;
        double edge[kTileRows][kMostColumns] = {};
        const double* factors[kTileRows];
        double *tile[kTileRows], *places[kTileRows];
        for (int r = 0; r < kTileRows; ++r) {
            const int row = std::min(rows.first + r, rows.last - 1);
            factors[r] = a_[row] + inner.first;
            places[r] = c[row] + columns.first;
            tile[r] = aside ? edge[r] : places[r];
            if (aside) std::copy_n(places[r], columns.count(), edge[r]);
        }
        kernels_.subtract_tile(tile, factors, strip_, inner.count());
        for (int r = 0; aside && r < kTileRows; ++r) std::copy_n(edge[r], columns.count(), places[r]);
    }

    const quo::DenseKernels& kernels_ = dense_kernels();
    const Factors& a_;
    const Matrix& b_;
    double strip_[kStripRows * kMostColumns];
};

/** Solves with the triangles of an LU decomposition, for all right-hand sides at once and so that the inner loops
 * run along rows. Great triangles are halved: what lies outside the halves is a product. */
template <typename Matrix, typename Result>
class TriangularSolver {
public:
    TriangularSolver(const Matrix& lu, int n, const Result& y)
        : lu_{lu}, y_{y}, leaf_{leaf_of(n)}, product_{lu, y} {}

    /** y[rows] becomes L^-1 y[rows]. */
    void lower(Range rows, Range columns) {
        if (rows.count() > leaf_) {
            lower(rows.upper_half(), columns);
            product_.subtract(y_, rows.lower_half(), rows.upper_half(), columns);
            return lower(rows.lower_half(), columns);
        }
        for (int i = rows.first + 1; i < rows.last; ++i) {
            for (int k = rows.first; k < i; ++k) subtract_row(i, k, columns);
        }
    }

    /** y[rows] becomes U^-1 y[rows]. */
    void upper(Range rows, Range columns) {
        if (rows.count() > leaf_) {
            upper(rows.lower_half(), columns);
            product_.subtract(y_, rows.upper_half(), rows.lower_half(), columns);
            return upper(rows.upper_half(), columns);
        }
        for (int i = rows.last - 1; i >= rows.first; --i) {
            for (int k = i + 1; k < rows.last; ++k) subtract_row(i, k, columns);
            const double pivot = lu_[i][i];
            for (int j = columns.first; j < columns.last; ++j) y_[i][j] /= pivot;
        }
    }

private:
    void subtract_row(int i, int k, Range columns) const {
        subtract_multiple(y_[i] + columns.first, y_[k] + columns.first, lu_[i][k], columns.count());
    }

    const Matrix& lu_;
    const Result& y_;
    int leaf_;
    Product<Matrix, Result> product_;
};

/** Factors a matrix in place with scaled partial pivoting. */
template <typename Matrix>
class Factoring {
public:
    Factoring(const Matrix& a, int n, double* scale)
        : a_{a}, n_{n}, scale_{scale}, solver_{a, n, a}, product_{a, a} {}

    /** exchanged[j] becomes the row that stage j swaps with row j. The parity of the exchanges. */
    double run(int* exchanged) {
        exchanged_ = exchanged;
        factor({0, n_});
        return parity_;
    }

private:
    // These columns of the rows from their diagonal on. Many are halved: the left ones first, then the right ones
    // less what the left ones take from them, in the order of the stages.
    void factor(Range columns) {
        if (columns.count() > leaf_of(n_)) {
            const Range left = columns.upper_half(), right = columns.lower_half();
            factor(left);
            solver_.lower(left, right);
            product_.subtract(a_, {left.last, n_}, left, right);
            return factor(right);
        }
        for (int j = columns.first; j < columns.last; ++j) eliminate(j, columns.last);
    }

    // Stage j in the columns before `last`, row by row so that the inner loop runs along memory.
    void eliminate(int j, int last) {
        const int pivot = scaled_pivot_row(a_, n_, j, scale_);
        exchanged_[j] = pivot;
        if (pivot != j) {
            std::swap_ranges(a_[pivot], a_[pivot] + n_, a_[j]);
            scale_[pivot] = scale_[j];
            parity_ = -parity_;
        }
        double* top = a_[j];
        if (top[j] == 0.0) top[j] = kTinyPivot;
        const double inverse = 1.0 / top[j];
        for (int i = j + 1; i < n_; ++i) {
            double* row = a_[i];
            row[j] *= inverse;
            subtract_multiple(row + j + 1, top + j + 1, row[j], last - j - 1);
        }
    }

    const Matrix& a_;
    int n_;
    double* scale_;
    int* exchanged_ = nullptr;
    TriangularSolver<Matrix, Matrix> solver_;
    Product<Matrix, Matrix> product_;
    double parity_ = 1.0;
};

// Inverse from the factors. L^-1 has no entry above its diagonal, and its columns change places last, so that much
// of it can be left out.
template <typename Matrix, typename Result>
void invert_from_lu(const Matrix& lu, int n, const int* exchanged, const Result& y) {
    for (int i = 0; i < n; ++i) {
        std::fill_n(y[i], n, 0.0);
        y[i][i] = 1.0;
    }
    TriangularSolver<Matrix, Result> solver{lu, n, y};
    by_pieces({0, n}, kSmall, [&](Range columns) { solver.lower({columns.first, n}, columns); });
    solver.upper({0, n}, {0, n});
    for (int i = 0; i < n; ++i) {
        for (int j = n - 1; j >= 0; --j) std::swap(y[i][j], y[i][exchanged[j]]);
    }
}

// The frame of ludcmp(): shared by its callers on any matrix layout.
template <typename Matrix>
int tracked_ludcmp(const Matrix& a, int n, int* exchanged, double* parity) {
    quo::CallFrame frame{"ludcmp", quo::kMatrixSource};
    if (n < 1) return frame.silent(QUO_NUMERIC);
    quo::TrackedBuffer<double> scale{static_cast<std::size_t>(n)};
    if (!scale) return frame.silent(QUO_NO_MEMORY);
    if (!row_scales(a, n, scale.data())) {
        quo::say("Singular matrix in lud decomposition");
        return frame.silent(QUO_NUMERIC);
    }
    *parity = Factoring<Matrix>{a, n, scale.data()}.run(exchanged);
    return frame.success();
}

// The frame of InvMatrix(), likewise.
template <typename Matrix, typename Result>
int tracked_invert(const Matrix& a, const Result& y, int n) {
    quo::CallFrame frame{"InvMatrix", quo::kMatrixSource};
    quo::TrackedBuffer<int> exchanged{static_cast<std::size_t>(std::max(n, 0)) + 1};
    if (!exchanged) return frame.silent(QUO_NO_MEMORY);
    double parity = 0.0;
    if (const int status = tracked_ludcmp(a, n, exchanged.data(), &parity)) return frame.callee(status);
    invert_from_lu(a, n, exchanged.data(), y);
    return frame.success();
}

/** Gauss-Jordan elimination with full pivoting, in place. */
class GaussJordan {
public:
    GaussJordan(double** a, int n, double** b, int m, int* row_of, int* column_of, int* used)
        : a_{a}, b_{b}, n_{n}, m_{m}, row_of_{row_of}, column_of_{column_of}, used_{used} {}

    /** Null, or the message of the failure. */
    const char* run() {
        for (int stage = 0; stage < n_; ++stage) {
            const auto [row, column] = find_pivot();
            if (row < 0 || !std::isfinite(a_[row][column])) return "ld-gaussj: Singular Matrix-1";
            used_[column] = 1;
            bring_to_diagonal(row, column);
            row_of_[stage] = row;
            column_of_[stage] = column;
            if (a_[column][column] == 0.0) return "ld-gaussj: Singular Matrix-2";
            eliminate(column);
        }
        restore_columns();
        return nullptr;
    }

private:
    // The largest element outside the rows and columns that are done; row -1 when none compares.
    [[nodiscard]] std::pair<int, int> find_pivot() const {
        std::pair<int, int> best{-1, -1};
        double largest = 0.0;
        for (int i = 0; i < n_; ++i) {
            if (used_[i]) continue;
            for (int j = 0; j < n_; ++j) {
                if (used_[j] || !(std::abs(a_[i][j]) >= largest)) continue;
                largest = std::abs(a_[i][j]);
                best = {i, j};
            }
        }
        return best;
    }

    void bring_to_diagonal(int row, int column) {
        if (row == column) return;
        std::swap_ranges(a_[row], a_[row] + n_, a_[column]);
        if (m_ > 0) std::swap_ranges(b_[row], b_[row] + m_, b_[column]);
    }

    // The pivot's column becomes that of the inverse: a unit vector is put in its place before the row operations.
    void eliminate(int p) {
        const double inverse = 1.0 / a_[p][p];
        a_[p][p] = 1.0;
        for (int j = 0; j < n_; ++j) a_[p][j] *= inverse;
        for (int j = 0; j < m_; ++j) b_[p][j] *= inverse;
        for (int i = 0; i < n_; ++i) {
            if (i == p) continue;
            const double factor = std::exchange(a_[i][p], 0.0);
            subtract_multiple(a_[i], a_[p], factor, n_);
            if (m_ > 0) subtract_multiple(b_[i], b_[p], factor, m_);
        }
    }

    // The row exchanges turned the inverse's columns around: undone in reverse order.
    void restore_columns() {
        for (int stage = n_ - 1; stage >= 0; --stage) {
            if (row_of_[stage] == column_of_[stage]) continue;
            for (int i = 0; i < n_; ++i) std::swap(a_[i][row_of_[stage]], a_[i][column_of_[stage]]);
        }
    }

    Rows a_, b_;
    int n_, m_;
    int *row_of_, *column_of_, *used_;
};

int tracked_gauss_jordan(const quo::SharedCall& name, double** a, int n, double** b, int m) {
    quo::CallFrame frame{name, quo::kMatrixSource};
    if (n < 1) return frame.silent(QUO_NUMERIC);
    const auto count = static_cast<std::size_t>(n);
    quo::TrackedBuffer<int> work{3 * count};
    if (!work) return frame.silent(QUO_NO_MEMORY);
    GaussJordan elimination{a, n, b, m, work.data(), work.data() + count, work.data() + 2 * count};
    if (const char* message = elimination.run()) {
        quo::say(message);
        return frame.silent(QUO_NUMERIC);
    }
    return frame.success();
}

bool all_finite(const Rows& a, int n) {
    for (int i = 0; i < n; ++i) {
        if (!std::all_of(a[i], a[i] + n, [](double value) { return std::isfinite(value); })) return false;
    }
    return true;
}

// Reflects column `column` of the rows from `from` on by 1 - u u^T / c, u in column `from`.
void reflect(const Rows& a, int n, int from, double c, int column) {
    double sum = 0.0;
    for (int i = from; i < n; ++i) sum += a[i][from] * a[i][column];
    const double factor = sum / c;
    for (int i = from; i < n; ++i) a[i][column] -= factor * a[i][from];
}

// Turns column j below the diagonal into its reflection vector. Returns c and R's diagonal element; both are 0 for
// a column without content.
std::pair<double, double> make_reflection(const Rows& a, int n, int j) {
    double scale = 0.0;
    for (int i = j; i < n; ++i) scale = std::max(scale, std::abs(a[i][j]));
    if (scale == 0.0) return {0.0, 0.0};
    double sum = 0.0;
    for (int i = j; i < n; ++i) {
        a[i][j] /= scale;
        sum += a[i][j] * a[i][j];
    }
    const double length = std::copysign(std::sqrt(sum), a[j][j]);
    a[j][j] += length;
    return {length * a[j][j], -scale * length};
}

double dot3(const double* a, const double* b) { return a[0] * b[0] + a[1] * b[1] + a[2] * b[2]; }

}  // namespace

extern "C" {

int InvMatrix(double** a, double** y, int n) noexcept { return tracked_invert(Rows{a}, Rows{y}, n); }

int MatInv(const double* a, double* y, int n) noexcept {
    quo::CallFrame frame{"MatInv", quo::kMatrixSource};
    if (n < 1) return frame.silent(QUO_NUMERIC);
    quo::TrackedBuffer<double> work{2 * square(n)};
    if (!work) return frame.silent(QUO_NO_MEMORY);
    double* inverse = work.data() + square(n);
    std::copy_n(a, square(n), work.data());
    if (const int status = tracked_invert(FlatRows{work.data(), n}, FlatRows{inverse, n}, n)) {
        return frame.callee(status);
    }
    std::copy_n(inverse, square(n), y);
    return frame.success();
}

int Mmolt(const double* a, const double* b, double* c, int rows_a, int cols_a, int rows_b, int cols_b) noexcept {
    quo::CallFrame frame{"Mmolt", quo::kMatrixSource};
    if (cols_a != rows_b) {
        quo::say("Mmolt: the columns of the first matrix do not match the rows of the second");
        return frame.silent(QUO_NUMERIC);
    }
    if (rows_a < 1) return frame.success();
    const std::ptrdiff_t rows = rows_a;
    for (std::ptrdiff_t k = 0; k < cols_b; ++k) {
        double* column = c + k * rows;
        std::fill_n(column, rows, 0.0);
        for (std::ptrdiff_t j = 0; j < cols_a; ++j)
            subtract_multiple(column, a + j * rows, -b[j + k * rows_b], rows);
    }
    return frame.success();
}

void Transpose_Matrix(const double* a, double* out, int rows, int cols) noexcept {
    for (std::ptrdiff_t i = 0; i < rows; ++i) {
        for (std::ptrdiff_t j = 0; j < cols; ++j) out[j * rows + i] = a[i * cols + j];
    }
}

int ludcmp(double** a, int n, int* indx, double* d) noexcept {
    const int status = tracked_ludcmp(Rows{a}, n, indx + 1, d);
    if (status == QUO_OK) {
        for (int j = 1; j <= n; ++j) ++indx[j];
    }
    return status;
}

void lubksb(double** a, int n, const int* indx, double* b) noexcept {
    const Rows lu{a};
    double* x = b + 1;
    for (int i = 0; i < n; ++i) {
        std::swap(x[i], x[indx[i + 1] - 1]);
    }
    for (int i = 1; i < n; ++i) {
        for (int k = 0; k < i; ++k) x[i] -= lu[i][k] * x[k];
    }
    for (int i = n - 1; i >= 0; --i) {
        for (int k = i + 1; k < n; ++k) x[i] -= lu[i][k] * x[k];
        x[i] /= lu[i][i];
    }
}

int gaussj(double** a, int n, double** b, int m) noexcept { return tracked_gauss_jordan("gaussj", a, n, b, m); }
int ldgaussj(double** a, int n, double** b, int m) noexcept {
    return tracked_gauss_jordan("ldgaussj", a, n, b, m);
}

void covsrt(double** covar, int ma, const int* ia, int mfit) noexcept {
    for (int i = mfit + 1; i <= ma; ++i) {
        for (int j = 1; j <= i; ++j) covar[i][j] = covar[j][i] = 0.0;
    }
    // From the last parameter down, so that nothing is overwritten before it has moved.
    int from = mfit;
    for (int to = ma; to >= 1; --to) {
        if (ia[to] == 0) continue;
        if (from != to) {
            for (int i = 1; i <= ma; ++i) std::swap(covar[i][from], covar[i][to]);
            std::swap_ranges(covar[from] + 1, covar[from] + 1 + ma, covar[to] + 1);
        }
        --from;
    }
}

int qrdcmp(double** a, int n, double* c, double* d, int* sing) noexcept {
    quo::CallFrame frame{"qrdcmp", quo::kMatrixSource};
    if (n < 1 || !all_finite(Rows{a}, n)) return frame.silent(QUO_NUMERIC);
    const Rows rows{a};
    *sing = 0;
    for (int j = 0; j < n - 1; ++j) {
        const auto [length, diagonal] = make_reflection(rows, n, j);
        c[j + 1] = length;
        d[j + 1] = diagonal;
        if (length == 0.0) {
            *sing = 1;
            continue;
        }
        for (int k = j + 1; k < n; ++k) reflect(rows, n, j, length, k);
    }
    c[n] = 0.0;
    d[n] = rows[n - 1][n - 1];
    if (d[n] == 0.0) *sing = 1;
    return frame.success();
}

int qr_solve(double** a, int n, const double* c, const double* d, double* b) noexcept {
    quo::CallFrame frame{"qr_solve", quo::kMatrixSource};
    if (n < 1 || std::any_of(d + 1, d + 1 + n, [](double r) { return r == 0.0; }))
        return frame.silent(QUO_NUMERIC);
    const Rows rows{a};
    double* x = b + 1;
    for (int j = 0; j < n - 1; ++j) {
        double sum = 0.0;
        for (int i = j; i < n; ++i) sum += rows[i][j] * x[i];
        const double factor = sum / c[j + 1];
        for (int i = j; i < n; ++i) x[i] -= factor * rows[i][j];
    }
    for (int i = n - 1; i >= 0; --i) {
        for (int k = i + 1; k < n; ++k) x[i] -= rows[i][k] * x[k];
        x[i] /= d[i + 1];
    }
    return frame.success();
}

int MSE_poly(const double* a, const double* b, double* out) noexcept {
    quo::CallFrame frame{"MSE_poly", quo::kMatrixSource};
    double transposed[9], product[9], inverse[9], projector[9];
    tran(a, transposed);
    mul(transposed, a, product);
    if (const int status = MatInv(product, inverse, 3)) return frame.callee(status);
    mul(inverse, transposed, projector);
    mul_NxM_M(projector, b, out);
    return frame.success();
}

double determ(const double* m) noexcept {
    double minor[3];
    v1pv2(m + 3, m + 6, minor);
    return dot3(m, minor);
}

// The rows' cross products are the columns of the adjugate.
void inv3x3(const double* m, double* out) noexcept {
    const double determinant = determ(m);
    double adjugate[9];
    v1pv2(m + 3, m + 6, adjugate);
    v1pv2(m + 6, m, adjugate + 3);
    v1pv2(m, m + 3, adjugate + 6);
    for (double& value : adjugate) value /= determinant;
    tran(adjugate, out);
}

void mul3x3(const double* a, const double* b, double* out) noexcept {
    double product[9];
    for (int i = 0; i < 3; ++i) {
        for (int j = 0; j < 3; ++j) {
            product[3 * i + j] = a[3 * i] * b[j] + a[3 * i + 1] * b[3 + j] + a[3 * i + 2] * b[6 + j];
        }
    }
    std::copy_n(product, 9, out);
}

void mul(const double* a, const double* b, double* out) noexcept { mul3x3(a, b, out); }

void mul3x1(const double* a, const double* v, double* out) noexcept {
    const double product[3] = {dot3(a, v), dot3(a + 3, v), dot3(a + 6, v)};
    std::copy_n(product, 3, out);
}

void mul_NxM_M(const double* a, const double* v, double* out) noexcept { mul3x1(a, v, out); }

void tran(const double* m, double* out) noexcept {
    const double transposed[9] = {m[0], m[3], m[6], m[1], m[4], m[7], m[2], m[5], m[8]};
    std::copy_n(transposed, 9, out);
}

double COS_PHI_V(const double* a, const double* b) noexcept {
    return dot3(a, b) / (std::sqrt(dot3(a, a)) * std::sqrt(dot3(b, b)));
}

}  // extern "C"
