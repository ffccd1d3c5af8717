// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <new>
#include <numbers>

#include "diagnosticslib/call_frame.h"
#include "quo_base/interp.h"
#include "signallib/image_size.h"

namespace {

// Reports name this source so; programs that read them look for it.
constexpr const char* kSource = R"(..\..\..\binsrc\cutover\sources\interp)";
constexpr const char* kNoMemory = "Memory allocation failure";
constexpr int kHalf = 16;       ///< samples on either side of a position, before narrowing
constexpr int kPlaces = 512;    ///< tabulated places from one sample to the next
constexpr double kShape = 9.0;  ///< of the Kaiser window
constexpr int kMostLowpass = 64;

/** Modified Bessel function of order 0, by its series; all terms are positive. */
double bessel_i0(double x) {
    double term = 1.0, sum = 1.0;
    for (int k = 1; term > 1e-17 * sum; ++k) {
        term *= (x / (2.0 * k)) * (x / (2.0 * k));
        sum += term;
    }
    return sum;
}

/** The kernel at `t` samples from its middle, in units of its own stretch. */
double kernel(double t) {
    const double inside = 1.0 - (t / kHalf) * (t / kHalf);
    if (inside <= 0.0) return 0.0;
    const double angle = std::numbers::pi * t;
    const double sinc = angle == 0.0 ? 1.0 : std::sin(angle) / angle;
    return sinc * bessel_i0(kShape * std::sqrt(inside)) / bessel_i0(kShape);
}

/** The samples that a position draws on and their weights. */
struct Taps {
    std::ptrdiff_t first = 0;
    int count = 0;  ///< 0 outside the image
    float* weights = nullptr;
};

/** Looks weights up in the table. */
class Weights {
public:
    Weights(const float* table, int lowpass) : table_{table}, half_{kHalf * lowpass} {}
    [[nodiscard]] int most() const { return 2 * half_; }

    [[nodiscard]] Taps at(double position, int samples, float* weights) const {
        if (!(position >= 0.0 && position <= samples - 1)) return {};
        const int base = static_cast<int>(position);
        const double place = (position - base) * kPlaces;
        const auto below = static_cast<std::ptrdiff_t>(place);
        const auto part = static_cast<float>(place - static_cast<double>(below));
        const float* const row = table_ + below * most();
        const int first = std::max(base - half_ + 1, 0), last = std::min(base + half_, samples - 1);
        const float* const lower = row + (first - (base - half_ + 1));
        float sum = 0.0F;
        for (int k = 0; k <= last - first; ++k) {
            weights[k] = lower[k] + part * (lower[k + most()] - lower[k]);
            sum += weights[k];
        }
        for (int k = 0; k <= last - first; ++k) weights[k] /= sum;
        return {first, last - first + 1, weights};
    }

private:
    const float* table_;
    int half_;
};

fcomplex weighted_sum(const fcomplex* samples, const Taps& taps) {
    float re = 0.0F, im = 0.0F;
    for (int k = 0; k < taps.count; ++k) {
        re += taps.weights[k] * samples[taps.first + k].real();
        im += taps.weights[k] * samples[taps.first + k].imag();
    }
    return {re, im};
}

fcomplex value_at(const fcomplex* in, int nx, const Taps& x, const Taps& y) {
    if (x.count == 0) return {};
    fcomplex sum{};
    for (int k = 0; k < y.count; ++k) sum += y.weights[k] * weighted_sum(in + (y.first + k) * nx, x);
    return sum;
}

/** One row of the image between its rows. */
void blend_rows(const fcomplex* in, int nx, const Taps& y, fcomplex* row) {
    std::fill_n(row, nx, fcomplex{});
    for (int k = 0; k < y.count; ++k) {
        const fcomplex* const from = in + (y.first + k) * nx;
        for (int i = 0; i < nx; ++i) row[i] += y.weights[k] * from[i];
    }
}

bool valid(const fcomplex* in, int nx, int ny, const double* x, const double* y, const fcomplex* out,
           int lowpass) {
    return in && x && y && out && quo::addressable<fcomplex>(nx, ny) && lowpass >= 1 && lowpass <= kMostLowpass;
}

}  // namespace

bool interp2D::tabulate(int lowpass) try {
    if (tabulated_ == lowpass) return true;
    const int half = kHalf * lowpass;
    tabulated_ = 0;
    table_.resize(static_cast<std::size_t>(2 * half) * (kPlaces + 1));
    float* to = table_.data();
    for (int place = 0; place <= kPlaces; ++place)
        for (int k = 1 - half; k <= half; ++k)
            *to++ = static_cast<float>(kernel((k - static_cast<double>(place) / kPlaces) / lowpass));
    tabulated_ = lowpass;
    return true;
} catch (const std::bad_alloc&) {
    return false;
}

int interp2D::interp2(const fcomplex* in, int nx, int ny, const double* x, const double* y, int count,
                      fcomplex* out, int lowpass) {
    quo::CallFrame frame{"interp2D::interp2", kSource};
    if (!valid(in, nx, ny, x, y, out, lowpass) || count < 0)
        return frame.fail(QUO_REFUSED, "No image, no positions or a wrong size");
    if (!tabulate(lowpass)) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    const Weights weights{table_.data(), lowpass};
    const auto most = static_cast<std::size_t>(weights.most());
    quo::TrackedBuffer<float> room{2 * most};
    if (!room) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    for (int k = 0; k < count; ++k)
        out[k] = value_at(in, nx, weights.at(x[k], nx, room.data()), weights.at(y[k], ny, room.data() + most));
    return frame.success();
}

int interp2D::interp2(const fcomplex* in, int nx, int ny, const double* x, int nx_out, const double* y, int ny_out,
                      fcomplex* out, int lowpass) {
    quo::CallFrame frame{"interp2D::interp2", kSource};
    if (!valid(in, nx, ny, x, y, out, lowpass) || !quo::addressable<fcomplex>(nx_out, ny_out))
        return frame.fail(QUO_REFUSED, "No image, no positions or a wrong size");
    if (!tabulate(lowpass)) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    const Weights weights{table_.data(), lowpass};
    const auto most = static_cast<std::size_t>(weights.most()), columns = static_cast<std::size_t>(nx_out);
    quo::TrackedBuffer<float> room{(columns + 1) * most};  // of every column, and of the row at hand
    quo::TrackedBuffer<Taps> taps{columns};
    quo::TrackedBuffer<fcomplex> row{static_cast<std::size_t>(nx)};
    if (!room || !taps || !row) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    for (std::size_t i = 0; i < columns; ++i) taps[i] = weights.at(x[i], nx, room.data() + (i + 1) * most);
    for (int j = 0; j < ny_out; ++j) {
        blend_rows(in, nx, weights.at(y[j], ny, room.data()), row.data());
        out = std::transform(taps.begin(), taps.end(), out,
                             [&row](const Taps& at) { return weighted_sum(row.data(), at); });
    }
    return frame.success();
}

int interp2D::interp2(const fcomplex* in, int nx, int ny, const double* x, const double* y, int count,
                      fcomplex* out) {
    return interp2(in, nx, ny, x, y, count, out, 1);
}

int interp2D::interp2(const fcomplex* in, int nx, int ny, const double* x, int nx_out, const double* y, int ny_out,
                      fcomplex* out) {
    return interp2(in, nx, ny, x, nx_out, y, ny_out, out, 1);
}
