// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <limits>

#include "diagnosticslib/call_frame.h"
#include "matrixlib/matrix_kernels.h"

namespace {

using quo::Rows;
using quo::WeightedPoints;

constexpr int kMostSteps = 60;
// Singular values below this part of the largest are taken as zero in a fit.
constexpr double kSingularThreshold = 1.0e-5;

struct Rotation {
    double c, s, length;
};

// The rotation that takes (y, z) to (length, 0).
Rotation rotation_of(double y, double z) {
    const double length = std::hypot(y, z);
    return length == 0.0 ? Rotation{1.0, 0.0, 0.0} : Rotation{y / length, z / length, length};
}

void rotate_columns(const Rows& m, int rows, int i, int j, const Rotation& r) {
    for (int k = 0; k < rows; ++k) {
        const double left = m[k][i], right = m[k][j];
        m[k][i] = r.c * left + r.s * right;
        m[k][j] = r.c * right - r.s * left;
    }
}

/** Singular values: U (rows x n) is overwritten with left vectors, d with the values, V (n x n) with right
 * vectors. Householder reflections make the matrix bidiagonal (diagonal d, e[i] above d[i]), then implicit QR
 * steps with a shift empty e. */
class SingularValues {
public:
    SingularValues(const Rows& u, int rows, int n, double* d, const Rows& v, double* e)
        : u_{u}, v_{v}, d_{d}, e_{e}, rows_{rows}, n_{n} {}

    bool run() {
        make_bidiagonal();
        accumulate_right();
        accumulate_left();
        norm_ = 0.0;
        for (int i = 0; i < n_; ++i) norm_ = std::max(norm_, std::abs(d_[i]) + std::abs(e_[i]));
        if (!std::isfinite(norm_)) return false;
        for (int last = n_ - 1; last >= 0; --last) {
            if (!settle(last)) return false;
        }
        return true;
    }

private:
    void make_bidiagonal() {
        e_[0] = 0.0;
        for (int k = 0; k < n_; ++k) {
            d_[k] = reflect_column(k);
            if (k + 1 < n_) e_[k + 1] = reflect_row(k);
        }
    }

    // Leaves the reflection vector in column k from row k on, applied to the columns right of it.
    double reflect_column(int k) {
        double sum = 0.0;
        for (int i = k; i < rows_; ++i) sum = std::hypot(sum, u_[i][k]);
        if (sum == 0.0) return 0.0;
        const double diagonal = -std::copysign(sum, u_[k][k]);
        u_[k][k] -= diagonal;
        for (int j = k + 1; j < n_; ++j) apply_left(k, diagonal, j);
        return diagonal;
    }

    void apply_left(int k, double diagonal, int j) {
        double sum = 0.0;
        for (int i = k; i < rows_; ++i) sum += u_[i][k] * u_[i][j];
        const double factor = sum / diagonal / u_[k][k];
        for (int i = k; i < rows_; ++i) u_[i][j] += factor * u_[i][k];
    }

    // The same along row k, right of the diagonal, applied to the rows below.
    double reflect_row(int k) {
        double* row = u_[k];
        double sum = 0.0;
        for (int j = k + 1; j < n_; ++j) sum = std::hypot(sum, row[j]);
        if (sum == 0.0) return 0.0;
        const double element = -std::copysign(sum, row[k + 1]);
        row[k + 1] -= element;
        for (int i = k + 1; i < rows_; ++i) {
            double dot = 0.0;
            for (int j = k + 1; j < n_; ++j) dot += row[j] * u_[i][j];
            quo::subtract_multiple(u_[i] + k + 1, row + k + 1, -dot / element / row[k + 1], n_ - k - 1);
        }
        return element;
    }

    void accumulate_right() {
        for (int i = 0; i < n_; ++i) {
            std::fill_n(v_[i], n_, 0.0);
            v_[i][i] = 1.0;
        }
        for (int k = n_ - 2; k >= 0; --k) {
            if (e_[k + 1] == 0.0) continue;
            const double* vector = u_[k];
            for (int j = k + 1; j < n_; ++j) {
                double dot = 0.0;
                for (int i = k + 1; i < n_; ++i) dot += vector[i] * v_[i][j];
                const double factor = dot / e_[k + 1] / vector[k + 1];
                for (int i = k + 1; i < n_; ++i) v_[i][j] += factor * vector[i];
            }
        }
    }

    // From the last reflection to the first, each column becomes its unit vector reflected.
    void accumulate_left() {
        for (int k = n_ - 1; k >= 0; --k) {
            for (int j = k + 1; j < n_; ++j) u_[k][j] = 0.0;
            if (d_[k] == 0.0) {
                for (int i = k; i < rows_; ++i) u_[i][k] = 0.0;
                u_[k][k] = 1.0;
                continue;
            }
            for (int j = k + 1; j < n_; ++j) apply_left(k, d_[k], j);
            for (int i = rows_ - 1; i >= k; --i) u_[i][k] /= d_[k];
            u_[k][k] += 1.0;
        }
    }

    // Against the whole matrix: against its neighbours alone, rounding keeps an element of a graded matrix alive.
    [[nodiscard]] bool negligible(int i) const { return std::abs(e_[i]) <= kEpsilon * norm_; }

    // Works on the block that ends at `last` until its final off-diagonal element is gone.
    bool settle(int last) {
        for (int step = 0; step <= kMostSteps; ++step) {
            int first = last;
            while (first > 0 && !negligible(first)) {
                if (std::abs(d_[first - 1]) <= kEpsilon * norm_) clear_row(first - 1, last);
                if (e_[first] == 0.0) break;
                --first;
            }
            if (first == last) {
                e_[last] = 0.0;
                make_positive(last);
                return true;
            }
            if (step < kMostSteps) sweep(first, last);
        }
        return false;
    }

    // A zero on the diagonal: what stands right of it is rotated out of the row.
    void clear_row(int zero, int last) {
        double bulge = e_[zero + 1];
        d_[zero] = 0.0;
        e_[zero + 1] = 0.0;
        for (int j = zero + 1; j <= last && bulge != 0.0; ++j) {
            const Rotation r = rotation_of(d_[j], bulge);
            d_[j] = r.length;
            rotate_columns(u_, rows_, j, zero, r);
            if (j == last) break;
            bulge = -r.s * e_[j + 1];
            e_[j + 1] *= r.c;
        }
    }

    // Eigenvalue of the trailing 2 x 2 part of B^T B that is nearer to its last element.
    [[nodiscard]] double shift(int first, int last) const {
        const double upper = last - 1 > first ? e_[last - 1] : 0.0;
        const double a = d_[last - 1] * d_[last - 1] + upper * upper;
        const double b = d_[last] * d_[last] + e_[last] * e_[last];
        const double c = d_[last - 1] * e_[last];
        if (c == 0.0) return b;
        const double half = 0.5 * (a - b);
        return b - c * c / (half + std::copysign(std::hypot(half, c), half));
    }

    void sweep(int first, int last) {
        double y = d_[first] * d_[first] - shift(first, last);
        double z = d_[first] * e_[first + 1];
        for (int i = first; i < last; ++i) {
            const Rotation right = rotation_of(y, z);
            if (i > first) e_[i] = right.length;
            const double f = right.c * d_[i] + right.s * e_[i + 1];
            e_[i + 1] = right.c * e_[i + 1] - right.s * d_[i];
            const double g = right.s * d_[i + 1];
            d_[i + 1] *= right.c;
            rotate_columns(v_, n_, i, i + 1, right);

            const Rotation left = rotation_of(f, g);
            d_[i] = left.length;
            const double h = left.c * e_[i + 1] + left.s * d_[i + 1];
            d_[i + 1] = left.c * d_[i + 1] - left.s * e_[i + 1];
            e_[i + 1] = h;
            rotate_columns(u_, rows_, i, i + 1, left);
            if (i + 1 == last) break;
            y = e_[i + 1];
            z = left.s * e_[i + 2];
            e_[i + 2] *= left.c;
        }
    }

    void make_positive(int i) {
        if (d_[i] >= 0.0) return;
        d_[i] = -d_[i];
        for (int k = 0; k < n_; ++k) v_[k][i] = -v_[k][i];
    }

    static constexpr double kEpsilon = std::numeric_limits<double>::epsilon();
    Rows u_, v_;
    double *d_, *e_;
    int rows_, n_;
    double norm_ = 0.0;
};

int svdcmp(double** u, int rows, int n, double* w, double** v) {
    quo::CallFrame frame{"svdcmp", quo::kMatrixSource};
    if (rows < n) {
        quo::say("SVDCMP: You must augment A with extra zero rows");
        return frame.silent(QUO_NUMERIC);
    }
    quo::TrackedBuffer<double> above{static_cast<std::size_t>(n)};
    if (!above) return frame.silent(QUO_NO_MEMORY);
    if (!SingularValues{Rows{u}, rows, n, w + 1, Rows{v}, above.data()}.run()) {
        quo::say("No convergence in 60 SVDCMP iterations");
        return frame.silent(QUO_NUMERIC);
    }
    return frame.success();
}

// x = V diag(1/w) U^T b, leaving out singular values that are 0. `scratch` holds n doubles.
void svbksb(double** u, const double* w, double** v, int rows, int n, const double* b, double* x,
            double* scratch) {
    for (int j = 1; j <= n; ++j) {
        double sum = 0.0;
        if (w[j] != 0.0) {
            for (int i = 1; i <= rows; ++i) sum += u[i][j] * b[i - 1];
            sum /= w[j];
        }
        scratch[j - 1] = sum;
    }
    for (int i = 1; i <= n; ++i) {
        double sum = 0.0;
        for (int j = 1; j <= n; ++j) sum += v[i][j] * scratch[j - 1];
        x[i] = sum;
    }
}

// Weighted sum of the squared residuals of sum a[1..ma] f_i(x). `values` is scratch for values[1..ma].
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

void fill_design(const WeightedPoints& points, int ma, double** u, double* b, double* values) {
    for (int k = 0; k < points.n; ++k) {
        points.at(k, values, ma);
        for (int j = 1; j <= ma; ++j) u[k + 1][j] = values[j] / points.sig[k];
        b[k] = points.y[k] / points.sig[k];
    }
}

void drop_small(double* w, int n) {
    const double threshold = kSingularThreshold * *std::max_element(w + 1, w + 1 + n);
    std::replace_if(
        w + 1, w + 1 + n, [threshold](double value) { return value < threshold; }, 0.0);
}

}  // namespace

extern "C" int svdfit(const double* x, const double* y, const double* sig, int n, double* a, int ma, double** u,
                      double** v, double* w, double* chisq, QuoBasisFunction basis) noexcept {
    quo::CallFrame frame{"svdfit", quo::kMatrixSource};
    if (n < 1 || ma < 1) return frame.fail(QUO_NUMERIC, "No points or no parameters to be fitted");
    const auto count = static_cast<std::size_t>(ma);
    quo::TrackedBuffer<double> b{static_cast<std::size_t>(n)};
    quo::TrackedBuffer<double> work{2 * count + 1};
    if (!b || !work) return frame.silent(QUO_NO_MEMORY);
    const WeightedPoints points{x + 1, y + 1, sig + 1, n, basis};

    fill_design(points, ma, u, b.data(), work.data());
    if (const int status = svdcmp(u, n, ma, w, v)) return frame.callee(status);
    drop_small(w, ma);
    svbksb(u, w, v, n, ma, b.data(), a, work.data() + count + 1);
    *chisq = chi_square(points, a, ma, work.data());
    return frame.success();
}
