// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cstddef>
#include <limits>

#include "diagnosticslib/call_frame.h"
#include "matrixlib/matrix_kernels.h"
#include "quo_base/alloc_free.h"

namespace {

// Reports of the polynomial fits carry the name of the source that they once stood in.
constexpr const char* kSource = R"(..\..\..\libsrc\sources\sarutillib\interp_orb)";

// Above it the number of power sums is no int.
constexpr int kMostDegree = std::numeric_limits<int>::max() / 3 - 1;

/** The normal equations in powers of x: the element at (i, j) is the sum of x^(i+j), so that 2d + 1 sums make them
 * all. Points are added in their order, powers formed by repeated multiplication. */
class PowerSums {
public:
    /** `work` holds room(terms) zeros. */
    PowerSums(double* work, int terms) : left_{work}, right_{work + 2 * terms - 1}, terms_{terms} {}
    static std::size_t room(int terms) { return 3 * static_cast<std::size_t>(terms); }

    void add(const double* x, const double* y, int n) {
        switch (terms_) {
            case 2:
                return add_fixed<2>(x, y, n);
            case 3:
                return add_fixed<3>(x, y, n);
            case 4:
                return add_fixed<4>(x, y, n);
            case 5:
                return add_fixed<5>(x, y, n);
            default:
                return add_any(x, y, n);
        }
    }
    void store(double** a, double** b) const {
        for (int i = 0; i < terms_; ++i) {
            b[i + 1][1] = right_[i];
            for (int j = 0; j < terms_; ++j) a[i + 1][j + 1] = left_[i + j];
        }
    }

private:
    // The common degrees with their sums in registers: the same additions in the same order.
    template <int Terms>
    void add_fixed(const double* x, const double* y, int n) {
        double left[2 * Terms - 1]{}, right[Terms]{};
        for (int k = 0; k < n; ++k) {
            double power = 1.0;
            for (int i = 0; i < 2 * Terms - 1; ++i) {
                left[i] += power;
                if (i < Terms) right[i] += power * y[k];
                power *= x[k];
            }
        }
        std::copy_n(left, 2 * Terms - 1, left_);
        std::copy_n(right, Terms, right_);
    }
    void add_any(const double* x, const double* y, int n) {
        for (int k = 0; k < n; ++k) {
            double power = 1.0;
            for (int i = 0; i < 2 * terms_ - 1; ++i) {
                left_[i] += power;
                if (i < terms_) right_[i] += power * y[k];
                power *= x[k];
            }
        }
    }

    double *left_, *right_;
    int terms_;
};

int dpolfit(const double* x, const double* y, int n, double* c, int degree) {
    quo::CallFrame frame{"dpolfit", kSource};
    if (n < 1 || degree < 0 || degree > kMostDegree)
        return frame.fail(QUO_NUMERIC, "No points or no degree to fit");
    const int terms = degree + 1;
    quo::TrackedBuffer<double> work{PowerSums::room(terms)};
    double** a = ldmatrix(1, terms, 1, terms);
    double** b = a ? ldmatrix(1, terms, 1, 1) : nullptr;
    if (!work || !b) return frame.silent(QUO_NO_MEMORY);

    PowerSums sums{work.data(), terms};
    sums.add(x, y, n);
    sums.store(a, b);
    // Callers use what the elimination leaves of a singular system; without memory it did not even begin.
    if (ldgaussj(a, terms, b, 1) == QUO_NO_MEMORY) return frame.silent(QUO_NO_MEMORY);
    for (int i = 0; i < terms; ++i) c[i] = b[i + 1][1];
    free_ldmatrix(b, 1, terms, 1, 1);
    free_ldmatrix(a, 1, terms, 1, terms);
    return frame.success();
}

}  // namespace

extern "C" {

int polfit(const double* x, const double* y, int n, double* c, int d) noexcept {
    quo::CallFrame frame{"polfit()", kSource};
    const auto points = static_cast<std::size_t>(std::max(n, 0));
    quo::TrackedBuffer<double> copies{2 * points};
    const auto terms = static_cast<std::size_t>(d > kMostDegree ? 0 : std::max(d, 0)) + 1;
    quo::TrackedBuffer<double> fitted{terms};
    if (!copies || !fitted) return frame.silent(QUO_NO_MEMORY);
    std::copy_n(x, points, copies.data());
    std::copy_n(y, points, copies.data() + points);
    if (const int status = dpolfit(copies.data(), copies.data() + points, n, fitted.data(), d)) {
        return frame.callee(status);
    }
    std::copy_n(fitted.data(), d + 1, c);
    return frame.success();
}

int gen_polfit(int ncoef, const double* x, const double* y, int n, double* c, double* sse) noexcept {
    quo::CallFrame frame{"gen_polfit()", kSource};
    if (const int status = dpolfit(x, y, n, c, std::max(ncoef, 0) - 1)) return frame.callee(status);
    if (sse) {
        double sum = 0.0;
        for (int k = 0; k < n; ++k) {
            const double residual = y[k] - polval(c, ncoef - 1, x[k]);
            sum += residual * residual;
        }
        *sse = sum;
    }
    return frame.success();
}

double polval(const double* c, int d, double x) noexcept {
    if (d < 0) return 0.0;
    double value = c[d];  // not 0 * x + c[d], which is no number at infinity
    for (int i = d - 1; i >= 0; --i) value = value * x + c[i];
    return value;
}

}  // extern "C"
