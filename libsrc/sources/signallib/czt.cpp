// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>

#include "quo_base/fft.h"
#include "sarutillib/ground/checked_size.h"
#include "signallib/memory_room.h"

namespace {

struct BufferFree {
    void operator()(fcomplex* buffer) const noexcept { fft_free(buffer); }
};
using Buffer = std::unique_ptr<fcomplex, BufferFree>;

Buffer zeros(int count) noexcept {
    return Buffer{static_cast<fcomplex*>(fft_calloc(static_cast<std::size_t>(count), sizeof(fcomplex)))};
}

/** exp(i phase) of a phase in double precision, rounded once. */
fcomplex unit(double phase) { return {static_cast<float>(std::cos(phase)), static_cast<float>(std::sin(phase))}; }

/** Plain products: the library's own multiplication looks for infinities. */
fcomplex product(fcomplex a, fcomplex b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

/** nk = (n^2 + k^2 - (k - n)^2) / 2 turns the sum into a convolution with a chirp of phase k^2 w / 2. */
class Convolution {
public:
    Convolution(const CztPlan& plan, double w) noexcept : plan_{plan}, w_{w}, length_{plan.forward.n} {
        const std::size_t need =
            sizeof(fcomplex) * (std::size_t{2} * static_cast<std::size_t>(length_) +
                                static_cast<std::size_t>(plan.N) + static_cast<std::size_t>(plan.M));
        if (!quo::has_room({need, need})) return;
        before_ = zeros(plan.N);
        after_ = zeros(plan.M);
        filter_ = zeros(length_);
        work_ = zeros(length_);
    }
    [[nodiscard]] bool has_memory() const { return before_ && after_ && filter_ && work_; }

    [[nodiscard]] int prepare(double a) {
        for (int n = 0; n < plan_.N; ++n) before_.get()[n] = unit(phase(n) - n * a);
        for (int m = 0; m < plan_.M; ++m) after_.get()[m] = unit(phase(m));
        for (int k = 1 - plan_.N; k < plan_.M; ++k) filter_.get()[k + plan_.N - 1] = unit(-phase(k));
        return pfft_c(&plan_.forward, filter_.get(), filter_.get());
    }
    [[nodiscard]] int run(const fcomplex* in, fcomplex* out) {
        fcomplex* const work = work_.get();
        std::transform(in, in + plan_.N, before_.get(), work, product);
        std::fill(work + plan_.N, work + length_, fcomplex{});
        if (const int status = pfft_c(&plan_.forward, work, work)) return status;
        std::transform(work, work + length_, filter_.get(), work, product);
        if (const int status = pfft_c(&plan_.inverse, work, work)) return status;
        std::transform(after_.get(), after_.get() + plan_.M, work + plan_.N - 1, out, product);
        return QUO_OK;
    }

private:
    [[nodiscard]] double phase(int k) const { return static_cast<double>(k) * k * w_ / 2.0; }

    const CztPlan& plan_;
    double w_;
    int length_;
    Buffer before_, after_, filter_, work_;
};

bool is_made(const CztPlan* plan) {
    if (!plan || plan->N < 1 || plan->M < 1) return false;
    const auto needed = (quo::Checked<int>{plan->N} + plan->M + -1).value();
    return needed && plan->forward.n >= *needed && plan->inverse.n == plan->forward.n;
}

/** Vectors are read before their results are written; only results that outgrow their input would overtake it. */
bool apart(const CztPlan& plan, const fcomplex* in, const fcomplex* out, int count) {
    if (in == out) return plan.M <= plan.N;
    const auto bytes = [count](int samples) {
        return static_cast<std::uintptr_t>(samples) * static_cast<std::uintptr_t>(count) * sizeof(fcomplex);
    };
    const auto a = reinterpret_cast<std::uintptr_t>(in), b = reinterpret_cast<std::uintptr_t>(out);
    return a < b ? b - a >= bytes(plan.N) : a - b >= bytes(plan.M);
}

}  // namespace

extern "C" {

int czt_makep_c(CztPlan* plan, int N, int M) noexcept {
    if (!plan || N < 1 || M < 1) return QUO_REFUSED;
    const auto needed = (quo::Checked<int>{N} + M + -1).value();
    const int length = needed ? genpow(*needed, 1) : 0;
    if (length == 0) return QUO_REFUSED;
    CztPlan made{{}, {}, N, M};
    if (const int status = fft_makep_c(&made.forward, length, length, 1, 1, 1, 0, 1)) return status;
    if (const int status = fft_makep_c(&made.inverse, length, length, 1, 1, -1, 0, 1)) {
        fft_destp_c(&made.forward);
        return status;
    }
    *plan = made;
    return QUO_OK;
}

int pczt_c(const CztPlan* plan, const fcomplex* in, fcomplex* out, double w, double a, int count) noexcept {
    if (!is_made(plan) || !in || !out || count < 0 || !apart(*plan, in, out, count)) return QUO_REFUSED;
    Convolution convolution{*plan, w};
    if (!convolution.has_memory()) return QUO_NO_MEMORY;
    if (const int status = convolution.prepare(a)) return status;
    for (; count > 0; --count, in += plan->N, out += plan->M)
        if (const int status = convolution.run(in, out)) return status;
    return QUO_OK;
}

int czt_destp_c(CztPlan* plan) noexcept {
    if (!plan) return QUO_REFUSED;
    const int forward = fft_destp_c(&plan->forward), inverse = fft_destp_c(&plan->inverse);
    *plan = {};
    return forward ? forward : inverse;
}

int czt_c(const fcomplex* in, int N, fcomplex* out, int M, double w, double a, int count) noexcept {
    CztPlan plan{};
    if (const int status = czt_makep_c(&plan, N, M)) return status;
    const int status = pczt_c(&plan, in, out, w, a, count);
    czt_destp_c(&plan);
    return status;
}

}  // extern "C"
