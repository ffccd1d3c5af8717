// SPDX-License-Identifier: Apache-2.0
#include "quo_base/interp.h"

#include <algorithm>
#include <cstddef>
#include <numeric>

#include "diagnosticslib/call_frame.h"
#include "signallib/image_size.h"
#include "signallib/plan_store.h"

namespace {

// Reports name this source so; programs that read them look for it.
constexpr const char* kSource = R"(..\..\..\binsrc\cutover\sources\interp)";
constexpr const char* kBothAxes = "Only one axis may change size";
constexpr const char* kNoImage = "No image, a size below 1 or beyond any memory";

/** Where the bins of N samples go among those of M. */
struct Padding {
    int n, m;

    /** Bins from zero upwards, with the Nyquist bin of an even number. */
    [[nodiscard]] int upper() const { return n % 2 == 0 ? n / 2 + 1 : (n + 1) / 2; }
    [[nodiscard]] int lower() const { return n - upper(); }
    [[nodiscard]] bool has_nyquist() const { return n % 2 == 0; }
    [[nodiscard]] int nyquist() const { return upper() - 1; }
    [[nodiscard]] int mirror() const { return nyquist() - n + m; }
    /** Of the inverse transform, and of the longer row. */
    [[nodiscard]] quo::FftFactors factors() const {
        return {1.0F / static_cast<float>(m), static_cast<float>(m) / static_cast<float>(n)};
    }

    void place(const fcomplex* spectrum, fcomplex* padded) const {
        std::copy_n(spectrum, upper(), padded);
        std::fill_n(padded + upper(), m - n, fcomplex{});
        std::copy_n(spectrum + upper(), lower(), padded + m - lower());
    }
};

/** Halved once for every row of the image, though only the first row is treated at all. */
void mirror_first_row(const Padding& padding, int rows, fcomplex* row) {
    fcomplex value = row[padding.nyquist()];
    for (int k = 0; k < rows && value != fcomplex{}; ++k) value *= 0.5F;
    row[padding.nyquist()] = row[padding.mirror()] = value;
}

const float* floats(const fcomplex* samples) { return reinterpret_cast<const float*>(samples); }
float* floats(fcomplex* samples) { return reinterpret_cast<float*>(samples); }

/** Linear interpolation along the middle of three axes; rows of the outer axis are `pitch` apart in the output. */
template <typename Real>
void interpolate_linearly(const Real* in, std::ptrdiff_t outer, std::ptrdiff_t axis, std::ptrdiff_t inner,
                          int factor, Real* out, std::ptrdiff_t pitch) {
    const auto f = static_cast<float>(factor);
    for (std::ptrdiff_t o = 0; o < outer; ++o, in += axis * inner, out += pitch) {
        for (std::ptrdiff_t i = 0; i < axis; ++i) {
            const Real* const here = in + i * inner;
            const Real* const next = i + 1 < axis ? here + inner : here;  // the last one is held
            Real* const to = out + i * factor * inner;
            std::copy_n(here, inner, to);
            for (int k = 1; k < factor; ++k)
                for (std::ptrdiff_t j = 0; j < inner; ++j)
                    to[k * inner + j] = (next[j] - here[j]) * static_cast<float>(k) / f + here[j];
        }
    }
}

/** `parts` numbers of type Real make a sample. */
template <typename Real>
int grow_linearly(quo::CallerFrame frame, const Real* in, int nx_in, int ny_in, int nx_out, int ny_out, Real* out,
                  int parts) {
    if (nx_out <= nx_in && ny_out <= ny_in) return frame.success();
    if (!in || !out || !quo::addressable<dcomplex>(nx_in, ny_in) || !quo::addressable<dcomplex>(nx_out, ny_out))
        return frame.fail(QUO_REFUSED, kNoImage);
    if (nx_in != nx_out && ny_in != ny_out) return frame.fail(QUO_REFUSED, kBothAxes);
    const auto row = std::ptrdiff_t{nx_in} * parts;
    if (ny_out > ny_in) interpolate_linearly<Real>(in, 1, ny_in, row, ny_out / ny_in, out, 0);
    if (nx_out > nx_in)
        interpolate_linearly<Real>(in, ny_in, nx_in, parts, nx_out / nx_in, out, std::ptrdiff_t{nx_out} * parts);
    return frame.success();
}

}  // namespace

interp::~interp() { destroyplans(); }

int interp::setplans(int nx_in, int ny_in, int nx_out, int ny_out) {
    quo::CallFrame frame{"interp::setplans", kSource};
    destroyplans();
    resetplans();
    if (nx_in != nx_out && ny_in != ny_out) return frame.fail(QUO_REFUSED, kBothAxes);
    if (!quo::addressable<fcomplex>(nx_in, ny_in) || !quo::addressable<fcomplex>(nx_out, ny_out))
        return frame.fail(QUO_REFUSED, kNoImage);
    if (nx_out < nx_in || ny_out < ny_in) return frame.fail(QUO_REFUSED, "Zero-padding makes no image smaller");
    nx_in_ = nx_in;
    ny_in_ = ny_in;
    if (const int status = open_plans(nx_out, ny_out)) {
        destroyplans();
        resetplans();
        return frame.callee(status);
    }
    nx_out_ = nx_out;
    ny_out_ = ny_out;
    return frame.success();
}

int interp::open_plans(int nx_out, int ny_out) {
    if (nx_out == nx_in_ && ny_out == ny_in_) return QUO_OK;
    const int along = nx_out != nx_in_ ? 1 : 0, down = 1 - along;
    if (const int status = fft_makep_c(&forward_, nx_in_, nx_in_, ny_in_, ny_in_, along, down, 1)) return status;
    return fft_makep_c(&inverse_, nx_out, nx_out, ny_out, ny_out, -along, -down, 1);
}

int interp::destroyplans() {
    fft_destp_c(&forward_);
    fft_destp_c(&inverse_);
    return QUO_OK;
}

void interp::resetplans() { nx_in_ = ny_in_ = nx_out_ = ny_out_ = -1; }

int interp::interpft_p(fcomplex* in, fcomplex* out) {
    quo::CallFrame frame{"interp::interpft_p", kSource};
    if (!in || !out || nx_in_ < 1) return frame.fail(QUO_REFUSED, "No image or no plans");
    int status = QUO_OK;
    if (nx_in_ != nx_out_) {
        status = resample_rows(in, out);
    } else if (ny_in_ != ny_out_) {
        status = resample_columns(in, out);
    } else {
        std::copy_n(in, std::ptrdiff_t{nx_in_} * ny_in_, out);
    }
    return status == QUO_OK ? frame.success() : frame.fail(status, "The transforms failed");
}

// A few rows at a time, from the samples to the result while they are in the cache.
int interp::resample_rows(fcomplex* in, fcomplex* out) const {
    const Padding padding{nx_in_, nx_out_};
    const auto forward = quo::plan_store().find(forward_.rows), inverse = quo::plan_store().find(inverse_.rows);
    if (!inverse || (nx_in_ > 1 && !forward)) return QUO_REFUSED;
    const int step = std::lcm(inverse->block(), forward ? forward->block() : 1);
    for (int first = 0; first < ny_in_; first += step) {
        const int rows = std::min(step, ny_in_ - first);
        if (forward && !forward->run(floats(in), floats(in), first, rows, {})) return QUO_NO_MEMORY;
        for (std::ptrdiff_t row = first; row < first + rows; ++row)
            padding.place(in + row * nx_in_, out + row * nx_out_);
        if (first == 0 && padding.has_nyquist()) mirror_first_row(padding, ny_in_, out);
        if (!inverse->run(floats(out), floats(out), first, rows, padding.factors())) return QUO_NO_MEMORY;
    }
    return QUO_OK;
}

int interp::resample_columns(fcomplex* in, fcomplex* out) const {
    const Padding padding{ny_in_, ny_out_};
    const std::ptrdiff_t row = nx_in_;
    const auto inverse = quo::plan_store().find(inverse_.columns);
    if (!inverse) return QUO_REFUSED;
    if (const int status = pfft_c(&forward_, in, in)) return status;
    std::copy_n(in, padding.upper() * row, out);
    std::fill_n(out + padding.upper() * row, (padding.m - padding.n) * row, fcomplex{});
    std::copy_n(in + padding.upper() * row, padding.lower() * row, out + (padding.m - padding.lower()) * row);
    if (padding.has_nyquist()) {
        fcomplex* const nyquist = out + padding.nyquist() * row;
        std::transform(nyquist, nyquist + row, nyquist, [](fcomplex value) { return value * 0.5F; });
        std::copy_n(nyquist, row, out + padding.mirror() * row);
    }
    return inverse->run_all(floats(out), floats(out), padding.factors()) ? QUO_OK : QUO_NO_MEMORY;
}

int interp::interpft(fcomplex* in, int nx_in, int ny_in, int nx_out, int ny_out, fcomplex* out) {
    quo::CallFrame frame{"interp::interpft", kSource};
    if (const int status = setplans(nx_in, ny_in, nx_out, ny_out)) return frame.callee(status);
    const int status = interpft_p(in, out);
    destroyplans();
    return status == QUO_OK ? frame.success() : frame.callee(status);
}

int interp::interp_lin(const fcomplex* in, int nx_in, int ny_in, int nx_out, int ny_out, fcomplex* out) {
    quo::CallFrame frame{"interp::interp_lin(fcomplex)", kSource};
    return grow_linearly(frame, floats(in), nx_in, ny_in, nx_out, ny_out, floats(out), 2);
}

int interp::interp_lin(const float* in, int nx_in, int ny_in, int nx_out, int ny_out, float* out) {
    quo::CallFrame frame{"interp::interp_lin(float)", kSource};
    return grow_linearly(frame, in, nx_in, ny_in, nx_out, ny_out, out, 1);
}

int interp::interp_lin(const double* in, int nx_in, int ny_in, int nx_out, int ny_out, double* out) {
    quo::CallFrame frame{"interp::interp_lin(double)", kSource};
    return grow_linearly(frame, in, nx_in, ny_in, nx_out, ny_out, out, 1);
}
