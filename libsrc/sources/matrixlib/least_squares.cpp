// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "matrixlib/dense_kernels.h"
#include "matrixlib/matrix_kernels.h"
#include "quo_base/alloc_free.h"
#include "sarutillib/ground/checked_size.h"

namespace {

using quo::dense_kernels, quo::WeightedPoints;

/** The design matrix of the parameters that are fitted, evaluated once: a row per point holds its basis functions,
 * then what is left of the observation when the other parameters' part is taken off, padded to whole panels. */
class DesignMatrix {
public:
    // Sums of so many neighbouring columns are carried in registers.
    static constexpr int kPanel = 8;
    using Pair __attribute__((vector_size(16))) = double;
    using LoosePair __attribute__((vector_size(16), aligned(8), may_alias)) = double;
    // Points that stay in the nearest cache while all pairs of columns are summed.
    static constexpr std::size_t kBlock = 256;

    /** `order`: the numbers of the fitted parameters, `count` of them, then those of the held ones. */
    DesignMatrix(const int* order, int count, int points)
        : order_{order},
          count_{count},
          stride_{(count + kPanel) / kPanel * kPanel},
          rows_{(quo::Checked<std::size_t>{points} * stride_).value().value_or(kTooMany)},
          weights_{static_cast<std::size_t>(points)},
          sums_{static_cast<std::size_t>(count + 1) * static_cast<std::size_t>(stride_)} {}

    [[nodiscard]] bool has_memory() const { return rows_ && weights_ && sums_; }

    /** `values` is scratch for values[1..ma]. */
    void fill(const WeightedPoints& points, const double* a, int ma, double* values) {
        for (int k = 0; k < points.n; ++k) {
            points.at(k, values, ma);
            double rest = points.y[k];
            double* row = row_of(k);
            for (int i = 0; i < count_; ++i) row[i] = values[order_[i]];
            for (int i = count_; i < ma; ++i) rest -= a[order_[i]] * values[order_[i]];
            row[count_] = rest;
            weights_[static_cast<std::size_t>(k)] = 1.0 / (points.sig[k] * points.sig[k]);
        }
    }

    /** The normal equations as 1-based matrices: the symmetric left side, the right side as one column. */
    void sum_up(double** left, double** right) {
        const std::size_t points = weights_.size();
        for (std::size_t first = 0; first < points; first += kBlock) {
            const std::size_t last = std::min(first + kBlock, points);
            for (int i = 0; i < count_; i += 2) add_rows(first, last, i);
        }
        for (int i = 0; i < count_; ++i) {
            for (int j = i; j < count_; ++j) left[i + 1][j + 1] = left[j + 1][i + 1] = sums_of(i)[j];
            right[i + 1][1] = sums_of(i)[count_];
        }
    }

    /** Weighted sum of the squared residuals for the fitted parameters[1][1], [2][1], ... */
    [[nodiscard]] double chi_square(double** parameters) const {
        double sum = 0.0;
        for (std::size_t k = 0; k < weights_.size(); ++k) {
            const double* row = row_of(static_cast<std::ptrdiff_t>(k));
            double residual = row[count_];
            for (int i = 0; i < count_; ++i) residual -= parameters[i + 1][1] * row[i];
            sum += residual * residual * weights_[k];
        }
        return sum;
    }

private:
    static constexpr std::size_t kTooMany = std::numeric_limits<std::size_t>::max();

    [[nodiscard]] double* row_of(std::ptrdiff_t k) { return rows_.data() + k * stride_; }
    [[nodiscard]] const double* row_of(std::ptrdiff_t k) const { return rows_.data() + k * stride_; }

    // The sums are symmetric: columns left of the diagonal are left out.
    void add_rows(std::size_t first, std::size_t last, int i) {
        const int diagonal = i / kPanel * kPanel;
        switch ((i - diagonal) / 2) {
            case 0:
                add_panel<0>(first, last, i, diagonal);
                break;
            case 1:
                add_panel<1>(first, last, i, diagonal);
                break;
            case 2:
                add_panel<2>(first, last, i, diagonal);
                break;
            default:
                add_panel<3>(first, last, i, diagonal);
        }
        for (int panel = diagonal + kPanel; panel < stride_; panel += kPanel) add_panel<0>(first, last, i, panel);
    }

    // Two rows of sums at a time, points in their order: enough independent additions to hide their latency.
    // Explicit pairs, because left to itself the compiler unrolls the points and spills the sums.
    template <int FirstPair>
    [[gnu::noinline]] void add_panel(std::size_t first, std::size_t last, int i, int panel) {
        Pair upper[kPanel / 2], lower[kPanel / 2];
        std::memcpy(upper, sums_of(i) + panel, sizeof upper);
        std::memcpy(lower, sums_of(i + 1) + panel, sizeof lower);
        for (std::size_t k = first; k < last; ++k) {
            const double* row = row_of(static_cast<std::ptrdiff_t>(k));
            const double weight = weights_[k];
            const auto* values = reinterpret_cast<const LoosePair*>(row + panel);
            const double weighted = row[i] * weight, weighted_next = row[i + 1] * weight;
            for (int j = FirstPair; j < kPanel / 2; ++j) {
                upper[j] += values[j] * weighted;
                lower[j] += values[j] * weighted_next;
            }
        }
        std::memcpy(sums_of(i) + panel, upper, sizeof upper);
        std::memcpy(sums_of(i + 1) + panel, lower, sizeof lower);
    }

    // One row more than there are parameters, so that rows can be summed in pairs.
    [[nodiscard]] double* sums_of(int i) { return sums_.data() + static_cast<std::ptrdiff_t>(i) * stride_; }

    const int* order_;
    int count_, stride_;
    quo::TrackedBuffer<double> rows_, weights_, sums_;
};

/** Index-ranged working matrix, released when it goes. */
class WorkMatrix {
public:
    WorkMatrix(int rows, int columns) : rows_{rows}, columns_{columns}, data_{dmatrix(1, rows, 1, columns)} {}
    ~WorkMatrix() { free_dmatrix(data_, 1, rows_, 1, columns_); }
    WorkMatrix(const WorkMatrix&) = delete;
    WorkMatrix& operator=(const WorkMatrix&) = delete;
    [[nodiscard]] double** get() const { return data_; }

private:
    int rows_, columns_;
    double** data_;
};

struct FitName {
    quo::SharedCall function;
    const char* nothing_to_fit;
};

int fit_by_normal_equations(const FitName& name, const WeightedPoints& points, double* a, const int* ia, int ma,
                            double** covar, double* chisq) {
    quo::CallFrame frame{name.function, quo::kMatrixSource};
    if (points.n < 1) return frame.fail(QUO_NUMERIC, "No points to be fitted");
    const auto parameters = static_cast<std::size_t>(std::max(ma, 0));
    quo::TrackedBuffer<int> order{parameters};  // the fitted ones, then the held ones
    quo::TrackedBuffer<double> values{parameters + 1};
    if (!order || !values) return frame.silent(QUO_NO_MEMORY);
    int count = 0;
    for (int j = 1; j <= ma; ++j) {
        if (ia[j] != 0) order[static_cast<std::size_t>(count++)] = j;
    }
    for (int j = 1, held = count; j <= ma; ++j) {
        if (ia[j] == 0) order[static_cast<std::size_t>(held++)] = j;
    }
    if (count == 0) {
        quo::say(name.nothing_to_fit);
        return frame.silent(QUO_NUMERIC);
    }

    DesignMatrix design{order.data(), count, points.n};
    const WorkMatrix solution{count, 1};
    if (!design.has_memory() || !solution.get()) return frame.silent(QUO_NO_MEMORY);
    design.fill(points, a, ma, values.data());
    design.sum_up(covar, solution.get());
    if (const int status = gaussj(covar, count, solution.get(), 1)) return frame.callee(status);

    for (int i = 0; i < count; ++i) a[order[static_cast<std::size_t>(i)]] = solution.get()[i + 1][1];
    *chisq = design.chi_square(solution.get());
    covsrt(covar, ma, ia, count);
    return frame.success();
}

double norm(double* values, std::ptrdiff_t count) {
    double square = 0.0;
    dense_kernels().dots(values, {values, count, 1, count}, &square);
    return std::sqrt(square);
}

/** Householder QR with column pivoting of a column-major matrix, carrying the right-hand side along as a column
 * after the others. */
class PivotedQr {
public:
    static std::size_t room(int cols) { return 2 * static_cast<std::size_t>(cols) + 1; }
    /** `squares` are those of the columns' lengths, and scratch; `work` holds room() values, `order` one per
     * column.
     */
    PivotedQr(double* columns, int rows, int cols, double* squares, double* work, int* order)
        : a_{columns},
          rows_{rows},
          cols_{cols},
          leads_{work},
          squares_{squares},
          factors_{work + cols},
          order_{order} {
        for (int j = 0; j < cols; ++j) order[j] = j;
    }

    /** Decomposes until what is left of every column is below `tolerance` times the first pivot. */
    int run(double tolerance) {
        for (rank_ = 0; rank_ < cols_; ++rank_) {
            bring_longest_forward();
            const double length = std::sqrt(squares_[rank_]);
            if (rank_ == 0) first_ = length;
            if (length <= tolerance * first_) break;
            last_ = length;
            reflect_the_rest(length);
        }
        return rank_;
    }
    [[nodiscard]] double condition() const { return rank_ > 0 ? first_ / last_ : HUGE_VAL; }
    [[nodiscard]] double residual_norm() const { return std::sqrt(squares_[cols_]); }

    /** Parameters by back substitution; those of dependent columns are 0. */
    void solve(double* x) const { solve_upper(column(cols_), x); }
    /** The same for another right-hand side that has been through the reflections. */
    void solve_upper(const double* b, double* x) const {
        std::fill_n(x, cols_, 0.0);
        for (int i = rank_ - 1; i >= 0; --i) {
            double value = b[i];
            for (int j = i + 1; j < rank_; ++j) value -= column(j)[i] * x[order_[j]];
            x[order_[i]] = value / column(i)[i];
        }
    }
    /** h of R^T h = g, where g has the columns' own order. */
    void solve_lower(const double* g, double* h) const {
        for (int i = 0; i < rank_; ++i) {
            double value = g[order_[i]];
            for (int j = 0; j < i; ++j) value -= column(i)[j] * h[j];
            h[i] = value / column(i)[i];
        }
    }
    /** v becomes Q^T v. */
    void reflect_forward(double* v) const {
        for (int k = 0; k < rank_; ++k) reflect(k, v);
    }
    /** v becomes Q v. */
    void reflect_backward(double* v) const {
        for (int k = rank_ - 1; k >= 0; --k) reflect(k, v);
    }

private:
    [[nodiscard]] double* column(int j) const { return a_ + static_cast<std::ptrdiff_t>(j) * rows_; }

    void bring_longest_forward() {
        const auto best = static_cast<int>(std::max_element(squares_ + rank_, squares_ + cols_) - squares_);
        if (best == rank_) return;
        std::swap_ranges(column(best), column(best) + rows_, column(rank_));
        std::swap(squares_[best], squares_[rank_]);
        std::swap(order_[best], order_[rank_]);
    }

    // The reflection that turns the pivot column into a multiple of the unit vector; R's element takes its place.
    void reflect_the_rest(double length) {
        double* pivot = column(rank_) + rank_;
        const double diagonal = -std::copysign(length, pivot[0]);
        leads_[rank_] = pivot[0] - diagonal;
        pivot[0] = diagonal;
        apply(rank_, {column(rank_ + 1), rows_, cols_ - rank_, rows_});
    }
    // One reflection again.
    void reflect(int k, double* v) const { apply(k, {v, rows_, 1, rows_}); }

    // Reflection k: its vector stands below the diagonal, the first element among the leads. The squares of what
    // it leaves below row k are noted, for the columns that are still to be decomposed.
    void apply(int k, const quo::Columns& columns) const {
        const double *const below = column(k) + k + 1, lead = leads_[k], half_square = -column(k)[k] * lead;
        double *const top = columns.first + k, *const squares = squares_ + cols_ + 1 - columns.count;
        const quo::Columns rest{top + 1, rows_, columns.count, rows_ - k - 1};
        kernels_.dots(below, rest, factors_);
        for (int j = 0; j < columns.count; ++j) {
            double& first = top[static_cast<std::ptrdiff_t>(j) * rows_];
            factors_[j] = (factors_[j] + lead * first) / half_square;
            first -= factors_[j] * lead;
        }
        kernels_.subtract_multiples(below, factors_, rest, squares);
    }

    const quo::DenseKernels& kernels_ = dense_kernels();
    double* a_;
    int rows_, cols_;
    double *leads_, *squares_, *factors_;
    int* order_;
    int rank_ = 0;
    double first_ = 0.0, last_ = 0.0;
};

/** Corrects a solution and its residual together by what they leave of r + A x = b and A^T r = 0, summed with
 * twice the digits: large residuals cost a solution as many digits as the square of the condition has, and get
 * them back so (A. Bjorck, "Iterative refinement of linear least squares solutions I", BIT 7, 1967). */
class Refinement {
public:
    static std::size_t room(int rows, int cols) {
        return 2 * static_cast<std::size_t>(rows) + 3 * static_cast<std::size_t>(cols);
    }
    /** `a` is the column-major matrix that `qr` has decomposed, and the right-hand side; `work` holds room()
     * values, all 0. */
    Refinement(const PivotedQr& qr, double* a, int rows, int cols, double* work)
        : qr_{qr},
          a_{a, rows, cols, rows},
          b_{a + static_cast<std::ptrdiff_t>(cols) * rows},
          residual_{work},
          change_{work + rows},
          gradient_{change_ + rows},
          lower_{gradient_ + cols},
          step_{lower_ + cols} {}

    /** Steps are taken while each is far shorter than the one before, and until the next, shorter again by as
     * much, would be lost in every parameter. For matrices of full rank. */
    void run(double* x) {
        constexpr int kMostSteps = 4;
        constexpr double kHalfDigit = 0x1p-54;
        kernels_.long_residual(a_, x, b_, residual_, residual_, change_);
        double before = norm(x, a_.count);
        for (int k = 0; k < kMostSteps; ++k) {
            find_step();
            const double length = norm(step_, a_.count);
            if (!(length < 0.25 * before)) return;
            double smallest = HUGE_VAL;
            for (int j = 0; j < a_.count; ++j) smallest = std::min(smallest, std::abs(x[j] += step_[j]));
            for (std::ptrdiff_t i = 0; i < a_.length; ++i) residual_[i] += change_[i];
            if (length * (length / before) <= kHalfDigit * smallest) return;
            before = length;
            kernels_.long_residual(a_, x, b_, residual_, change_, nullptr);
        }
    }
    [[nodiscard]] double residual_norm() const { return norm(residual_, a_.length); }

private:
    // From what is left of the first equation, which stands in change_ and becomes the residual's change.
    void find_step() {
        for (int j = 0; j < a_.count; ++j)
            gradient_[j] = -kernels_.long_dot(a_.first + j * a_.distance, residual_, a_.length);
        qr_.solve_lower(gradient_, lower_);
        qr_.reflect_forward(change_);
        for (int j = 0; j < a_.count; ++j) change_[j] -= lower_[j];
        qr_.solve_upper(change_, step_);
        std::copy_n(lower_, a_.count, change_);
        qr_.reflect_backward(change_);
    }

    const quo::DenseKernels& kernels_ = dense_kernels();
    const PivotedQr& qr_;
    quo::Columns a_;
    const double* b_;
    double *residual_, *change_, *gradient_, *lower_, *step_;
};

// Multiplies a column by a power of two, so that nothing is rounded.
void scale(double* column, std::ptrdiff_t rows, int exponent) {
    const double factor = std::ldexp(1.0, exponent);
    for (std::ptrdiff_t i = 0; i < rows; ++i) column[i] *= factor;
}

// The columns of `a`, and `b` after them, scaled to lengths of about 1, and the squares of these. False where a
// value is not finite.
bool scale_columns(const double* a, const double* b, int rows, int cols, double* columns, double* squares,
                   int* exponents) {
    constexpr int kSquareFits = 400, kMost = 1000;  // 2^1000 is a number, and so is its inverse
    Transpose_Matrix(a, columns, rows, cols);
    std::copy_n(b, rows, columns + static_cast<std::ptrdiff_t>(cols) * rows);
    for (std::ptrdiff_t j = 0; j <= cols; ++j) {
        double* column = columns + j * rows;
        const double largest = dense_kernels().largest(column, rows);
        if (!std::isfinite(largest)) return false;
        std::frexp(largest, &exponents[j]);
        exponents[j] = std::abs(exponents[j]) < kSquareFits ? 0 : std::clamp(exponents[j], -kMost, kMost);
        if (exponents[j] != 0) scale(column, rows, -exponents[j]);
        double square = 0.0;
        int length_exponent = 0;
        dense_kernels().dots(column, {column, rows, 1, rows}, &square);
        std::frexp(std::sqrt(square), &length_exponent);
        scale(column, rows, -length_exponent);
        squares[j] = std::ldexp(square, -2 * length_exponent);
        exponents[j] += length_exponent;
    }
    return true;
}

}  // namespace

extern "C" {

int lfit_mod(const double* x, const double* y, const double* sig, int n, double* a, const int* ia, int ma,
             double** covar, double* chisq, QuoBasisFunction basis) noexcept {
    return fit_by_normal_equations({"lfit_mod", "lfit_mod: no parameters to be fitted"},
                                   {x + 1, y + 1, sig + 1, n, basis}, a, ia, ma, covar, chisq);
}

int lfitd(const double* x, const double* y, const double* sig, int n, double* a, const int* ia, int ma,
          double** covar, double* chisq, QuoBasisFunction basis) noexcept {
    return fit_by_normal_equations({"lfitd", "lfit: no parameters to be fitted"},
                                   {x + 1, y + 1, sig + 1, n, basis}, a, ia, ma, covar, chisq);
}

int lsq_fit(const double* a, int rows, int cols, const double* b, double* x, LsqSummary* summary) noexcept {
    quo::CallFrame frame{"lsq_fit", quo::kMatrixSource};
    if (cols < 1 || rows < cols)
        return frame.fail(QUO_NUMERIC, "A fit needs at least as many points as parameters");
    const auto parameters = static_cast<std::size_t>(cols),
               elements = static_cast<std::size_t>(rows) * (parameters + 1);
    quo::TrackedBuffer<double> columns{elements}, scaled{elements};
    quo::TrackedBuffer<double> squares{parameters + 1};
    quo::TrackedBuffer<double> work{PivotedQr::room(cols) + Refinement::room(rows, cols)};
    quo::TrackedBuffer<int> places{2 * parameters + 1};
    if (!columns || !scaled || !squares || !work || !places)
        return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");

    int* const exponents = places.data() + cols;
    if (!scale_columns(a, b, rows, cols, scaled.data(), squares.data(), exponents))
        return frame.fail(QUO_NUMERIC, "A value to fit is not finite");
    std::copy_n(scaled.data(), elements, columns.data());
    PivotedQr qr{columns.data(), rows, cols, squares.data(), work.data(), places.data()};
    LsqSummary found{
        .rank = qr.run(rows * 0x1p-52), .condition = qr.condition(), .residual_norm = qr.residual_norm()};
    qr.solve(x);
    if (found.rank == cols) {
        Refinement refinement{qr, scaled.data(), rows, cols, work.data() + PivotedQr::room(cols)};
        refinement.run(x);
        found.residual_norm = refinement.residual_norm();
    }
    for (int j = 0; j < cols; ++j) x[j] = std::ldexp(x[j], exponents[cols] - exponents[j]);
    found.residual_norm = std::ldexp(found.residual_norm, exponents[cols]);
    if (summary) *summary = found;
    return frame.success();
}

}  // extern "C"
