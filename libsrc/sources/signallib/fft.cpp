// SPDX-License-Identifier: Apache-2.0
#include "quo_base/fft.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <memory>
#include <optional>

#include "diagnosticslib/errno_kept.h"
#include "sarutillib/ground/aligned_block.h"
#include "signallib/image_size.h"
#include "signallib/plan_store.h"

namespace {

using quo::FftDomain;
using quo::FftFactors;
using quo::FftGeometry;
using quo::FftTransform;

enum PlanStatus { kBadSize = 1, kBadRowLength = 2, kBadColumnLength = 3, kNoRows = 4, kNoColumns = 5 };
enum Direction { kForward = 1, kNone = 0, kInverse = -1, kInverseUnscaled = -2 };

/** One dimension of a plan. */
struct Axis {
    int direction;
    FftGeometry geometry;

    [[nodiscard]] bool valid() const { return direction >= kInverseUnscaled && direction <= kForward; }
    [[nodiscard]] bool wanted() const { return direction != kNone && geometry.length > 1; }
    [[nodiscard]] int sign() const { return wanted() ? (direction > 0 ? 1 : -1) : 0; }
    [[nodiscard]] int normalised() const { return wanted() && direction == kInverse ? 1 : 0; }
};

/** The image and what is to be done with it. */
struct Request {
    FftDomain domain;
    int n, nfft, m, mfft, dir_rows, dir_cols;
    bool in_place;

    [[nodiscard]] int check() const {
        if (!(domain == FftDomain::Complex ? quo::addressable<fcomplex>(n, m) : quo::addressable<float>(n, m)))
            return kBadSize;
        if (nfft < 1 || nfft > n) return kBadRowLength;
        if (mfft < 1 || mfft > m) return kBadColumnLength;
        if (!rows().valid()) return kNoRows;
        if (!columns().valid() || (domain == FftDomain::Real && rows().wanted() && columns().wanted()))
            return kNoColumns;
        return QUO_OK;
    }
    [[nodiscard]] Axis rows() const { return {dir_rows, {domain, nfft, mfft, 1, n, dir_rows > 0, in_place}}; }
    [[nodiscard]] Axis columns() const {
        const bool after_rows = dir_rows != kNone && nfft > 1;  // then they find their input in `out`
        return {dir_cols, {domain, mfft, nfft, n, 1, dir_cols > 0, in_place || after_rows}};
    }
};

/** Null when there is no such plan to be had. */
FftEnginePlan* open(const FftGeometry& geometry) noexcept {
    quo::FftEngine* const engine = quo::fft_engine(geometry.length);
    if (!engine) {
        quo::note_no_fft_engine();
        return nullptr;
    }
    try {
        const quo::ErrnoKept kept;
        return quo::plan_store().open(*engine, geometry);
    } catch (...) {
        quo::note_fft_error(*engine, geometry.length, {.bytes = sizeof geometry});  // of the store's own
        return nullptr;
    }
}

void close(const FftEnginePlan* handle) {
    if (handle) quo::plan_store().close(handle);
}

int open_axes(FftPlan& made, const Axis& rows, const Axis& columns) {
    if (rows.wanted() && !(made.rows = open(rows.geometry))) return kNoRows;
    if (columns.wanted() && !(made.columns = open(columns.geometry))) {
        close(made.rows);
        return kNoColumns;
    }
    return QUO_OK;
}

int make_plan(FftPlan* plan, const Request& request) {
    quo::forget_fft_error();
    if (!plan) return kBadSize;
    if (const int status = request.check()) return status;
    const Axis rows = request.rows(), columns = request.columns();
    FftPlan made{nullptr, request.n, request.nfft, rows.normalised(),    rows.sign(),
                 nullptr, request.m, request.mfft, columns.normalised(), columns.sign()};
    if (const int status = open_axes(made, rows, columns)) return status;
    *plan = made;
    return QUO_OK;
}

/** A plan's transforms, looked up and found to be what its record says. */
class LivePlan {
public:
    static std::optional<LivePlan> find(const FftPlan* plan, FftDomain domain) noexcept {
        if (!plan || plan->n < 1 || plan->m < 1) return std::nullopt;
        LivePlan live{*plan, domain};
        if (!live.matches(live.rows_.get(), plan->rows, plan->nfft, plan->mfft, 1, plan->n)) return std::nullopt;
        if (!live.matches(live.columns_.get(), plan->columns, plan->mfft, plan->nfft, plan->n, 1))
            return std::nullopt;
        return live;
    }

    [[nodiscard]] bool fits(const float* in, const float* out) const {
        const FftTransform* first = rows_ ? rows_.get() : columns_.get();
        if (!in || !out) return false;
        if (!first) return true;
        return first->geometry().in_place ? in == out : apart(in, out);
    }
    [[nodiscard]] int run(const float* in, float* out) const {
        const FftFactors factors = normalisation();
        if (rows_ && !rows_->run_all(in, out, columns_ ? FftFactors{} : factors)) return QUO_NO_MEMORY;
        if (columns_ && !columns_->run_all(rows_ ? out : in, out, factors)) return QUO_NO_MEMORY;
        return QUO_OK;
    }

private:
    LivePlan(const FftPlan& plan, FftDomain domain)
        : plan_{plan},
          domain_{domain},
          rows_{quo::plan_store().find(plan.rows)},
          columns_{quo::plan_store().find(plan.columns)} {}

    [[nodiscard]] bool matches(const FftTransform* transform, const FftEnginePlan* handle, int length, int count,
                               std::ptrdiff_t stride, std::ptrdiff_t distance) const {
        if (!handle) return true;
        if (!transform) return false;  // released, or never made
        const FftGeometry& made = transform->geometry();
        return made.domain == domain_ && made.length == length && made.count == count && made.stride == stride &&
               made.distance == distance;
    }
    [[nodiscard]] bool apart(const float* in, const float* out) const {
        const auto samples = (plan_.mfft - 1) * std::ptrdiff_t{plan_.n} + plan_.nfft;
        const auto bytes = static_cast<std::uintptr_t>(samples * quo::floats_of(domain_)) * sizeof(float);
        const auto a = reinterpret_cast<std::uintptr_t>(in), b = reinterpret_cast<std::uintptr_t>(out);
        return a < b ? b - a >= bytes : a - b >= bytes;
    }
    [[nodiscard]] FftFactors normalisation() const {
        float factor = 1.0F;
        if (plan_.normalise_rows == 1) factor /= static_cast<float>(plan_.nfft);
        if (plan_.normalise_columns == 1) factor /= static_cast<float>(plan_.mfft);
        return {factor, 1.0F};
    }

    FftPlan plan_;
    FftDomain domain_;
    std::shared_ptr<FftTransform> rows_, columns_;
};

int run_plan(const FftPlan* plan, FftDomain domain, const float* in, float* out) {
    const quo::ErrnoKept kept;
    const auto live = LivePlan::find(plan, domain);
    if (!live || !live->fits(in, out)) return QUO_REFUSED;
    return live->run(in, out);
}

int transform_once(const Request& request, const float* in, float* out) {
    FftPlan plan{};
    if (const int status = make_plan(&plan, request)) return status;
    const int status = run_plan(&plan, request.domain, in, out);
    fft_destp_c(&plan);
    return status;
}

const float* floats(const fcomplex* samples) { return reinterpret_cast<const float*>(samples); }
float* floats(fcomplex* samples) { return reinterpret_cast<float*>(samples); }

/** Smallest product of powers of 2, 3 and 5 among first, first + step, ...; 0 for none. There are some 1800 such
 * numbers, so that going through them is bounded for any step. */
int first_smooth(int first, std::int64_t step) {
    constexpr std::int64_t kMost = std::numeric_limits<int>::max();
    std::int64_t best = kMost + 1;
    for (std::int64_t five = 1; five <= kMost; five *= 5)
        for (std::int64_t three = five; three <= kMost; three *= 3)
            for (std::int64_t c = three; c < best; c *= 2)
                if (c >= first && (c - first) % step == 0) best = c;
    return best > kMost ? 0 : static_cast<int>(best);
}

}  // namespace

extern "C" {

const char* fft_engine_name(void) noexcept {
    const quo::FftEngine* engine = quo::fft_engine(2);  // of the lengths that every engine takes
    return engine ? engine->name() : "none";
}

const char* fft_engine_error(void) noexcept { return quo::fft_error(); }

int fft_makep_c(FftPlan* plan, int n, int nfft, int m, int mfft, int dir_rows, int dir_cols,
                int in_place) noexcept {
    return make_plan(plan, {FftDomain::Complex, n, nfft, m, mfft, dir_rows, dir_cols, in_place != 0});
}

int fft_makep_r(FftPlan* plan, int n, int nfft, int m, int mfft, int dir_rows, int dir_cols,
                int in_place) noexcept {
    return make_plan(plan, {FftDomain::Real, n, nfft, m, mfft, dir_rows, dir_cols, in_place != 0});
}

int pfft_c(const FftPlan* plan, const fcomplex* in, fcomplex* out) noexcept {
    return run_plan(plan, FftDomain::Complex, floats(in), floats(out));
}

int pfft_r(const FftPlan* plan, const float* in, float* out) noexcept {
    return run_plan(plan, FftDomain::Real, in, out);
}

int fft_destp_c(FftPlan* plan) noexcept {
    if (!plan) return QUO_REFUSED;
    bool released = true;
    for (const FftEnginePlan* handle : {plan->rows, plan->columns})
        if (handle) released = quo::plan_store().close(handle) && released;
    *plan = {};
    return released ? QUO_OK : QUO_REFUSED;
}

int fft_c(int n, int nfft, int m, int mfft, int dir_rows, int dir_cols, const fcomplex* in,
          fcomplex* out) noexcept {
    return transform_once({FftDomain::Complex, n, nfft, m, mfft, dir_rows, dir_cols, in == out}, floats(in),
                          floats(out));
}

int fft_r(int n, int nfft, int m, int mfft, int dir_rows, int dir_cols, const float* in, float* out) noexcept {
    return transform_once({FftDomain::Real, n, nfft, m, mfft, dir_rows, dir_cols, in == out}, in, out);
}

int genpow(int n, int step) noexcept {
    constexpr int kExcluded = 5625;
    if (n < 1) return 0;
    // Steps that do not grow leave the first length alone to be looked at.
    const std::int64_t growth = step < 1 ? std::numeric_limits<std::int64_t>::max() : step;
    const int length = first_smooth(n, growth);
    return length == kExcluded ? first_smooth(kExcluded + 1, growth) : length;
}

int fftshift(fcomplex* data, int n, int rows) noexcept {
    if (n < 1) return 0;
    for (; data && rows > 0; --rows, data += n) std::rotate(data, data + (n - n / 2), data + n);
    return n / 2;
}

int ifftshift(fcomplex* data, int n, int rows) noexcept {
    if (n < 1) return 0;
    for (; data && rows > 0; --rows, data += n) std::rotate(data, data + n / 2, data + n);
    return n / 2;
}

void* fft_malloc(size_t bytes) noexcept {
    const auto all = quo::system_bytes(1, bytes);
    return all ? quo::aligned_block(std::malloc(*all)) : nullptr;
}

void* fft_calloc(size_t count, size_t size) noexcept {
    const auto all = quo::system_bytes(count, size);
    return all ? quo::aligned_block(std::calloc(*all, 1)) : nullptr;
}

void fft_free(void* buffer) noexcept {
    if (buffer) std::free(quo::system_memory(buffer));
}

}  // extern "C"
