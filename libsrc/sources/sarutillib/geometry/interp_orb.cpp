// SPDX-License-Identifier: Apache-2.0
#include "quo_base/interp_orb.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "sarutillib/geometry/geometry_kernels.h"

namespace {

using quo::CallFrame;
using quo::TrackedBuffer;

constexpr char kSource[] = R"(..\..\..\libsrc\sources\sarutillib\interp_orb)";

/** No fit in double precision gains from higher degrees: the coefficients' rounding outgrows any orbit near 25. */
constexpr std::size_t kMaxDegree = 40;

/** Coefficients, lowest degree first, with the digits that the expansion costs. */
using Series = std::array<long double, kMaxDegree + 1>;

/** Least-squares polynomials of rising degree through n equally spaced values, the last of them, of degree n - 1,
 * through the values themselves. The variable runs from -1 to 1 over the span.
 *
 * The basis is that of the polynomials orthonormal over the nodes (J. P. Gram, "Ueber die Entwickelung reeller
 * Functionen in Reihen mittelst der Methode der kleinsten Quadrate", 1883), so that a further degree leaves the
 * coefficients before it alone. Extended precision carries it past degree 20, where the highest polynomials'
 * values at the ends are small differences of large terms. */
class GramFit {
public:
    /** `rows` has room for 3 n numbers. */
    GramFit(const double* values, std::size_t n, long double* rows) noexcept
        : n_{n}, before_{rows}, current_{rows + n}, rest_{rows + 2 * n} {
        current_series_[0] = 1.0L / std::sqrt(static_cast<long double>(n));
        std::fill_n(before_, n, 0.0L);
        std::fill_n(current_, n, current_series_[0]);
        std::copy_n(values, n, rest_);
        take_current();
    }

    /** Goes one degree up; for degrees below n. */
    void advance() noexcept {
        const long double below = ratio(degree_), above = ratio(++degree_);
        for (std::size_t i = 0; i < n_; ++i) {
            const long double next = (node(i) * current_[i] - below * before_[i]) / above;
            before_[i] = std::exchange(current_[i], next);
        }
        long double lower = 0.0L;
        for (std::size_t k = 0; k <= degree_; ++k) {
            const long double next = (lower - below * before_series_[k]) / above;
            lower = before_series_[k] = std::exchange(current_series_[k], next);
        }
        take_current();
    }

    [[nodiscard]] std::size_t degree() const noexcept { return degree_; }
    [[nodiscard]] const Series& sum() const noexcept { return sum_; }

private:
    [[nodiscard]] long double node(std::size_t i) const noexcept {
        return n_ > 1 ? (2.0L * static_cast<long double>(i)) / static_cast<long double>(n_ - 1) - 1.0L : 0.0L;
    }
    /** Coefficient of the recurrence x p(k-1) = ratio(k) p(k) + ratio(k-1) p(k-2). */
    [[nodiscard]] long double ratio(std::size_t k) const noexcept {
        if (k == 0) return 0.0L;
        const auto kk = static_cast<long double>(k), nn = static_cast<long double>(n_);
        return kk / (nn - 1.0L) * std::sqrt((nn * nn - kk * kk) / (4.0L * kk * kk - 1.0L));
    }
    /** Moves the part along the current polynomial from the rest into the sum. */
    void take_current() noexcept {
        long double part = 0.0L;
        for (std::size_t i = 0; i < n_; ++i) part += rest_[i] * current_[i];
        for (std::size_t i = 0; i < n_; ++i) rest_[i] -= part * current_[i];
        for (std::size_t k = 0; k <= degree_; ++k) sum_[k] += part * current_series_[k];
    }

    std::size_t n_, degree_ = 0;
    long double *before_, *current_, *rest_;  // two basis polynomials and what is left of the values, at the nodes
    Series before_series_{}, current_series_{}, sum_{};
};

/** Largest magnitude of n numbers; infinite where one is not finite. */
template <typename Number>
double largest(std::size_t n, Number number) noexcept {
    double most = 0.0;
    for (std::size_t i = 0; i < n; ++i) {
        const double magnitude = std::abs(number(i));
        if (!std::isfinite(magnitude)) return std::numeric_limits<double>::infinity();
        most = std::max(most, magnitude);
    }
    return most;
}

/** Coefficients as they are stored: highest degree first, the last of them kMaxDegree + 1. */
using Stored = std::array<double, kMaxDegree + 1>;

/** Times of n nodes. */
struct Nodes {
    double first, spacing;
    std::size_t count;
    [[nodiscard]] double at(std::size_t i) const noexcept { return first + static_cast<double>(i) * spacing; }
};

/** The polynomial in the variable from -1 to 1, of a degree, as one in time. */
Stored expanded(const GramFit& fit, const Nodes& nodes) noexcept {
    const long double half = 0.5L * static_cast<long double>(nodes.count - 1) * nodes.spacing;
    const long double middle = nodes.first + half;
    Series a = fit.sum();
    long double scale = 1.0L;
    for (std::size_t k = 1; k <= fit.degree(); ++k) a[k] /= scale *= half;
    for (std::size_t i = 0; i < fit.degree(); ++i)
        for (std::size_t k = fit.degree(); k-- > i;) a[k] -= middle * a[k + 1];
    Stored c{};
    for (std::size_t k = 0; k <= fit.degree(); ++k) c[kMaxDegree - k] = static_cast<double>(a[k]);
    return c;
}

/** Largest distance from the values at the nodes, as evaluation in double precision finds it; infinite where it
 * finds no number. */
double misfit(const Stored& c, std::size_t degree, const Nodes& nodes, const double* values) noexcept {
    const double* highest = c.data() + (kMaxDegree - degree);
    const auto terms = static_cast<unsigned>(degree) + 1;
    return largest(nodes.count, [&](std::size_t i) { return POSMACRO(nodes.at(i), highest, terms) - values[i]; });
}

/** The polynomial of the highest degree. False where it misses the values by more than `rounding`. */
bool fit_through(GramFit fit, const Nodes& nodes, const double* values, double rounding, Stored* kept) noexcept {
    if (nodes.count > kMaxDegree + 1) return false;
    while (fit.degree() + 1 < nodes.count) fit.advance();
    *kept = expanded(fit, nodes);
    return misfit(*kept, fit.degree(), nodes, values) <= rounding;
}

/** Fits rising degrees and keeps the highest whose misfit is next to the smallest seen. False where no
 * coefficients are finite. */
bool fit_near(GramFit fit, const Nodes& nodes, const double* values, double rounding, Stored* kept) noexcept {
    constexpr double kHopeless = 1e3;  // a misfit grown this much is the coefficients' rounding, and keeps growing
    double best = std::numeric_limits<double>::max();
    bool found = false;
    for (;; fit.advance()) {
        const Stored c = expanded(fit, nodes);
        const double distance = misfit(c, fit.degree(), nodes, values);
        if (!std::isfinite(distance) || distance > kHopeless * (best + rounding)) break;
        best = std::min(best, distance);
        if (distance <= 2.0 * best + rounding) {
            *kept = c;
            found = true;
        }
        if (fit.degree() == std::min(nodes.count - 1, kMaxDegree)) break;
    }
    return found;
}

}  // namespace

extern "C" double POSMACRO(double u, const double* c, unsigned n) noexcept {
    double sum = 0.0;
    for (unsigned i = 0; i < n; ++i) sum = sum * u + c[i];
    return sum;
}

extern "C" double VELMACRO(double u, const double* c, unsigned n) noexcept {
    double sum = 0.0;
    for (unsigned i = 0; i + 1 < n; ++i) sum = sum * u + static_cast<double>(n - 1 - i) * c[i];
    return sum;
}

extern "C" double ACCMACRO(double u, const double* c, unsigned n) noexcept {
    double sum = 0.0;
    for (unsigned i = 0; i + 2 < n; ++i) {
        const double power = n - 1 - i;
        sum = sum * u + power * (power - 1.0) * c[i];
    }
    return sum;
}

extern "C" void POSVELACC_5(double u, const double cx[5], const double cy[5], const double cz[5], double pos[3],
                            double vel[3], double acc[3]) noexcept {
    const quo::OrbitState state = quo::orbit_state({cx, cy, cz}, u);
    quo::store(state.position, pos);
    quo::store(state.velocity, vel);
    quo::store(state.acceleration, acc);
}

extern "C" int orbffit(double t0, double dt, const double* values, int n, double* c) noexcept {
    CallFrame frame{"orbffit", kSource};
    if (n < 1 || !std::isfinite(t0) || (n > 1 && (dt == 0.0 || !std::isfinite(dt))))
        return frame.fail(QUO_REFUSED, "No values, or no usable time of the first or spacing");

    const auto count = static_cast<std::size_t>(n);
    TrackedBuffer<long double> rows{3 * count};
    if (!rows) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");

    const double most = largest(count, [values](std::size_t i) { return values[i]; });
    const double rounding = 2.0 * std::numeric_limits<double>::epsilon() * most;
    const Nodes nodes{t0, n > 1 ? dt : 0.0, count};
    Stored kept;
    if (!std::isfinite(most) || (!fit_through({values, count, rows.data()}, nodes, values, rounding, &kept) &&
                                 !fit_near({values, count, rows.data()}, nodes, values, rounding, &kept)))
        return frame.fail(QUO_NUMERIC, "No polynomial with finite coefficients fits the values");

    const std::size_t stored = std::min(count, kept.size());
    std::fill_n(c, count - stored, 0.0);
    std::copy_n(kept.end() - stored, stored, c + (count - stored));
    return frame.success();
}

extern "C" int orb_interp(double t0, double dt, const double* pos, const double* /*vel*/, int n, double* cx,
                          double* cy, double* cz) noexcept {
    CallFrame frame{"orb_interp", kSource};
    if (n < 1) return frame.fail(QUO_REFUSED, "No state vectors");

    const auto count = static_cast<std::size_t>(n);
    TrackedBuffer<double> work{4 * count};  // one axis of the positions, and the three results
    if (!work) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    double* const fitted = work.data() + count;
    for (std::size_t axis = 0; axis < 3; ++axis) {
        for (std::size_t i = 0; i < count; ++i) work[i] = pos[3 * i + axis];
        if (const int status = orbffit(t0, dt, work.data(), n, fitted + axis * count)) return frame.callee(status);
    }
    std::copy_n(fitted, count, cx);
    std::copy_n(fitted + count, count, cy);
    std::copy_n(fitted + 2 * count, count, cz);
    return frame.success();
}
