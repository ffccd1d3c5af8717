#include <algorithm>
#include <cmath>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "matrixlib/matrix_kernels.h"
#include "quo_base/alloc_free.h"
#include "sarutillib/checked_size.h"

namespace quo {

double chi_square(const WeightedPoints& points, const double* a, int ma, double* values) {
    double sum = 0.0;
    for (int k = 0; k < points.n; ++k) {
        points.at(k, values, ma);
        double fitted = 0.0;
        for (int j = 1; j <= ma; ++j) fitted += a[j] * values[j];
        const double residual = (points.y[k] - fitted) / points.sig[k];
        sum += residual * residual;
    }
    return sum;
}

}  // namespace quo

namespace {

using quo::WeightedPoints;

/** The normal equations of the parameters that are fitted, summed up point by point. */
class NormalEquations {
public:
    /** `work` holds room(ma) doubles, `fitted_index` ma ints. */
    NormalEquations(const double* a, const int* ia, int ma, double* work, int* fitted_index)
        : a_{a}, ma_{ma}, values_{work}, fitted_values_{work + ma + 1}, fitted_{fitted_index} {
        for (int j = 1; j <= ma; ++j) {
            if (ia[j] != 0) fitted_[count_++] = j;
        }
        right_ = fitted_values_ + ma;
        normal_ = right_ + ma;
    }
    static quo::Checked<std::size_t> room(int ma) {
        return quo::Checked<std::size_t>{ma} * ma + quo::Checked<std::size_t>{ma} * 3 + 1;
    }

    void add(const WeightedPoints& points) {
        for (int k = 0; k < points.n; ++k) {
            points.at(k, values_, ma_);
            const double weight = 1.0 / (points.sig[k] * points.sig[k]);
            add_point(points.y[k] - fixed_part(), weight);
        }
    }

    /** The sums as 1-based matrices: the full symmetric left side, the right side as one column. */
    void store(double** left, double** right) const {
        for (int i = 0; i < count_; ++i) {
            right[i + 1][1] = right_[i];
            for (int j = 0; j <= i; ++j) left[i + 1][j + 1] = left[j + 1][i + 1] = row(i)[j];
        }
    }
    [[nodiscard]] int count() const { return count_; }
    [[nodiscard]] int parameter(int i) const { return fitted_[i]; }
    [[nodiscard]] double* values() const { return values_; }

private:
    [[nodiscard]] double* row(int i) const { return normal_ + static_cast<std::ptrdiff_t>(i) * ma_; }

    // What the parameters that keep their values contribute at the current point.
    [[nodiscard]] double fixed_part() const {
        double sum = 0.0;
        int next = 0;
        for (int j = 1; j <= ma_; ++j) {
            if (next < count_ && fitted_[next] == j) {
                fitted_values_[next++] = values_[j];
            } else {
                sum += a_[j] * values_[j];
            }
        }
        return sum;
    }

    void add_point(double observed, double weight) {
        for (int i = 0; i < count_; ++i) {
            const double weighted = fitted_values_[i] * weight;
            double* sums = row(i);
            for (int j = 0; j <= i; ++j) sums[j] += weighted * fitted_values_[j];
            right_[i] += weighted * observed;
        }
    }

    const double* a_;
    int ma_, count_ = 0;
    double *values_, *fitted_values_, *right_ = nullptr, *normal_ = nullptr;
    int* fitted_;
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
    const char *function, *nothing_to_fit;
};

int fit_by_normal_equations(const FitName& name, const WeightedPoints& points, double* a, const int* ia, int ma,
                            double** covar, double* chisq) {
    quo::CallFrame frame{name.function, quo::kMatrixSource};
    const auto room = NormalEquations::room(std::max(ma, 0)).value();
    quo::TrackedBuffer<double> work{room.value_or(0)};
    quo::TrackedBuffer<int> index{static_cast<std::size_t>(std::max(ma, 0))};
    if (!room || !work || !index) return frame.silent(QUO_NO_MEMORY);
    NormalEquations equations{a, ia, ma, work.data(), index.data()};
    if (equations.count() == 0) {
        quo::say(name.nothing_to_fit);
        return frame.silent(QUO_NUMERIC);
    }

    equations.add(points);
    const WorkMatrix solution{equations.count(), 1};
    if (!solution.get()) return frame.silent(QUO_NO_MEMORY);
    equations.store(covar, solution.get());
    if (const int status = gaussj(covar, equations.count(), solution.get(), 1)) return frame.callee(status);

    for (int i = 0; i < equations.count(); ++i) a[equations.parameter(i)] = solution.get()[i + 1][1];
    *chisq = quo::chi_square(points, a, ma, equations.values());
    covsrt(covar, ma, ia, equations.count());
    return frame.success();
}

/** Householder QR with column pivoting of a column-major matrix, carrying one right-hand side along. */
class PivotedQr {
public:
    PivotedQr(double* columns, double* b, int rows, int cols, int* order)
        : a_{columns}, b_{b}, rows_{rows}, cols_{cols}, order_{order} {
        for (int j = 0; j < cols; ++j) order[j] = j;
    }

    /** Decomposes until what is left of every column is below `tolerance` times the first pivot. */
    int run(double tolerance) {
        for (rank_ = 0; rank_ < cols_; ++rank_) {
            bring_longest_forward();
            const double length = norm(column(rank_) + rank_, rows_ - rank_);
            if (rank_ == 0) first_ = length;
            if (length <= tolerance * first_) break;
            last_ = length;
            reflect_the_rest(length);
        }
        return rank_;
    }
    [[nodiscard]] double condition() const { return rank_ > 0 ? first_ / last_ : HUGE_VAL; }
    [[nodiscard]] double residual_norm() const { return norm(b_ + rank_, rows_ - rank_); }

    /** Parameters by back substitution; those of dependent columns are 0. */
    void solve(double* x) const {
        std::fill_n(x, cols_, 0.0);
        for (int i = rank_ - 1; i >= 0; --i) {
            double value = b_[i];
            for (int j = i + 1; j < rank_; ++j) value -= column(j)[i] * x[order_[j]];
            x[order_[i]] = value / column(i)[i];
        }
    }

    static double norm(const double* v, int n) {
        double sum = 0.0;
        for (int i = 0; i < n; ++i) sum += v[i] * v[i];
        return std::sqrt(sum);
    }

private:
    [[nodiscard]] double* column(int j) const { return a_ + static_cast<std::ptrdiff_t>(j) * rows_; }

    void bring_longest_forward() {
        int best = rank_;
        double longest = -1.0;
        for (int j = rank_; j < cols_; ++j) {
            const double length = norm(column(j) + rank_, rows_ - rank_);
            if (length > longest) {
                longest = length;
                best = j;
            }
        }
        if (best == rank_) return;
        std::swap_ranges(column(best), column(best) + rows_, column(rank_));
        std::swap(order_[best], order_[rank_]);
    }

    // The reflection that turns the pivot column into a multiple of the unit vector; R's element takes its place.
    void reflect_the_rest(double length) {
        double* pivot = column(rank_) + rank_;
        const int n = rows_ - rank_;
        const double diagonal = -std::copysign(length, pivot[0]);
        pivot[0] -= diagonal;
        const double half_square = -diagonal * pivot[0];
        for (int j = rank_ + 1; j < cols_; ++j) apply(pivot, half_square, column(j) + rank_, n);
        apply(pivot, half_square, b_ + rank_, n);
        pivot[0] = diagonal;
    }

    static void apply(const double* u, double half_square, double* v, int n) {
        double sum = 0.0;
        for (int i = 0; i < n; ++i) sum += u[i] * v[i];
        quo::subtract_multiple(v, u, sum / half_square, n);
    }

    double *a_, *b_;
    int rows_, cols_;
    int* order_;
    int rank_ = 0;
    double first_ = 0.0, last_ = 0.0;
};

bool all_finite(const double* values, std::size_t count) {
    return std::all_of(values, values + count, [](double value) { return std::isfinite(value); });
}

// The columns of `a`, scaled by powers of two to lengths of about 1, so that nothing is rounded.
void scale_columns(const double* a, int rows, int cols, double* columns, int* exponents) {
    for (std::ptrdiff_t j = 0; j < cols; ++j) {
        double largest = 0.0;
        for (std::ptrdiff_t i = 0; i < rows; ++i) largest = std::max(largest, std::abs(a[i * cols + j]));
        std::frexp(largest, &exponents[j]);
        double* column = columns + j * rows;
        for (std::ptrdiff_t i = 0; i < rows; ++i) column[i] = std::ldexp(a[i * cols + j], -exponents[j]);
        int length_exponent = 0;
        std::frexp(PivotedQr::norm(column, rows), &length_exponent);
        for (std::ptrdiff_t i = 0; i < rows; ++i) column[i] = std::ldexp(column[i], -length_exponent);
        exponents[j] += length_exponent;
    }
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
    const auto elements = static_cast<std::size_t>(rows) * static_cast<std::size_t>(cols);
    if (!all_finite(a, elements) || !all_finite(b, static_cast<std::size_t>(rows))) {
        return frame.fail(QUO_NUMERIC, "A value to fit is not finite");
    }
    quo::TrackedBuffer<double> columns{elements};
    quo::TrackedBuffer<double> right{static_cast<std::size_t>(rows)};
    quo::TrackedBuffer<int> work{2 * static_cast<std::size_t>(cols)};
    if (!columns || !right || !work) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");

    int* exponents = work.data() + cols;
    scale_columns(a, rows, cols, columns.data(), exponents);
    std::copy_n(b, rows, right.data());
    PivotedQr qr{columns.data(), right.data(), rows, cols, work.data()};
    const int rank = qr.run(rows * 0x1p-52);
    qr.solve(x);
    for (int j = 0; j < cols; ++j) x[j] = std::ldexp(x[j], -exponents[j]);
    if (summary) *summary = {rank, qr.condition(), qr.residual_norm()};
    return frame.success();
}

}  // extern "C"
