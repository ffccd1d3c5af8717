// SPDX-License-Identifier: Apache-2.0
#include "signallib/own_fft/fft_plans.h"

#include <algorithm>
#include <complex>
#include <cstdint>
#include <limits>
#include <map>
#include <new>
#include <numbers>
#include <utility>

#include "sarutillib/ground/processor_level.h"

namespace quo {
namespace {

// ---- Choice: the costs are counts of operations, weighed by what passes of each kind were found to take ----

/** A pass over one slot. */
struct RadixCost {
    int radix;
    double cost;
};
constexpr RadixCost kRadixCosts[] = {{20, 37.0}, {16, 30.0}, {15, 38.0}, {14, 42.0}, {12, 28.0},
                                     {10, 26.0}, {9, 27.0},  {8, 21.0},  {7, 27.0},  {6, 21.0},
                                     {5, 21.0},  {4, 17.0},  {3, 18.0},  {2, 15.0}};
/** A slot whose lanes and results are exchanged, between the two steps of a row. */
constexpr double kTurned = 8.0;
/** Slots that begin within a line of the cache. */
constexpr double kUnaligned = 2.6;
/** For each sample of a step, whose buffers may lie beyond the first cache. */
constexpr double kPerSample = 0.19;
/** Lengths up to this one are transformed in one step, whose buffers the first cache holds. */
constexpr int kOneStep = 128;
/** So many samples of short rows, and the buffers that they pass through, fit the first cache. */
constexpr int kCachedShortRows = 2000;

struct Passes {
    double cost = 0.0;
    std::vector<int> radices;
};

/** The cheapest passes for every length that comes up. */
class PassChoice {
public:
    const Passes& of(int length) {
        const auto known = known_.find(length);
        if (known != known_.end()) return known->second;
        Passes best{length == 1 ? 0.0 : std::numeric_limits<double>::infinity(), {}};
        for (const RadixCost& radix : kRadixCosts)
            if (length % radix.radix == 0) {
                const Passes& rest = of(length / radix.radix);
                if (rest.cost + radix.cost >= best.cost) continue;
                best = {rest.cost + radix.cost, {radix.radix}};
                best.radices.insert(best.radices.end(), rest.radices.begin(), rest.radices.end());
            }
        return known_[length] = std::move(best);
    }

private:
    std::map<int, Passes> known_;
};

struct Split {
    double cost = std::numeric_limits<double>::infinity();
    int second = 1;
};

int packs_of(int count, int lanes) { return count / lanes + (count % lanes != 0 ? 1 : 0); }

/** The cheapest two steps of a length, of which each works on whole packs of lanes; columns, which share none, on
 * packs of one. The cost is that of one value. */
Split split(PassChoice& passes, int length, int lanes) {
    Split best;
    const bool rows = lanes > 1;
    const auto first_cost = [&](int first, int second) {
        return passes.of(first).cost + kPerSample * first + (rows && second % 8 != 0 ? kUnaligned : 0.0);
    };
    const auto second_cost = [&](int second) {
        return passes.of(second).cost + kPerSample * second + (rows ? kTurned : 0.0);
    };
    const auto filled = [&](int count) { return static_cast<double>(packs_of(count, lanes)) * lanes / count; };
    for (int second = lanes; second <= length / lanes && second / 64 <= length / second; ++second) {
        const int first = length / second;
        if (length % second != 0) continue;
        const double cost = filled(second) * first_cost(first, second) + filled(first) * second_cost(second);
        if (cost < best.cost) best = {cost, second};
    }
    return best;
}

/** The same of rows that stand in one lane each: they take no turns, but squares of them become slots and slots
 * rows. Registers that hold a whole transform are best eight lanes wide. */
double short_rows_cost(PassChoice& passes, int length, int lanes) {
    const bool wide = lanes == 16;
    const int side = lanes / 2;  // samples of a square
    if (side > length || (wide && passes.of(length).radices.size() < 2))
        return length == 1 ? 0.0 : std::numeric_limits<double>::infinity();
    const double squares = static_cast<double>(packs_of(length, side)) * side / length;
    const int beyond = std::max(length - kCachedShortRows / lanes, 0);
    return passes.of(length).cost + (wide ? 13.0 : 10.0) * squares + (wide ? 0.5 : 0.18) * beyond;
}

/** What an operation takes on a vector of so many lanes. */
double lane_weight(int lanes) { return lanes == 16 ? 1.0 : lanes == 8 ? 0.58 : 0.5; }

// ---- Roots ----

/** exp(-2 pi i e / n) of 0 <= e < n, or exp(+2 pi i e / n): as products of few, in double precision. */
class Roots {
public:
    Roots(int n, bool forward) {
        const double step = (forward ? -2.0 : 2.0) * std::numbers::pi / n;
        for (int k = 0; k <= kMask; ++k) fine_.push_back(std::polar(1.0, step * k));
        for (std::int64_t k = 0; k < n; k += kMask + 1)
            coarse_.push_back(std::polar(1.0, step * static_cast<double>(k)));
    }
    FftRoot operator()(std::int64_t e) const {
        const std::complex<double> root =
            fine_[static_cast<std::size_t>(e & kMask)] * coarse_[static_cast<std::size_t>(e >> kShift)];
        return {static_cast<float>(root.real()), static_cast<float>(root.imag())};
    }

private:
    static constexpr int kShift = 8, kMask = (1 << kShift) - 1;
    std::vector<std::complex<double>> fine_, coarse_;
};

/** The result that the k-th slot of `count` leaves a transform as: backward ones leave in the opposite order. */
int result_of(int k, int count, bool forward) { return forward || k == 0 ? k : count - k; }

/** First of a pack's lanes: the last pack overlaps the one before it. */
int lane_of(int pack, int lanes, int count) { return std::min(pack * lanes, count - lanes); }

}  // namespace

extern const FftKernels kFftKernels4;
#if defined(QUO_WIDE_LANES)
extern const FftKernels kFftKernels8, kFftKernels8Avx512, kFftKernels16;
#endif

const FftKernels* fft_kernels(int lanes) noexcept {
    if (lanes == 4) return &kFftKernels4;
#if defined(QUO_WIDE_LANES)
    const ProcessorLevel level = processor_level();
    if (lanes == 16 && level == ProcessorLevel::kAvx512) return &kFftKernels16;
    if (lanes == 8 && level == ProcessorLevel::kAvx512) return &kFftKernels8Avx512;  // with twice the registers
    if (lanes == 8 && level == ProcessorLevel::kAvx2) return &kFftKernels8;
#endif
    return nullptr;
}

bool is_own_fft_length(int length) noexcept {
    if (length < 1) return false;
    for (const int prime : {2, 3, 5, 7})
        while (length % prime == 0) length /= prime;
    return length == 1;
}

FftKind choose_fft(const FftGeometry& geometry, int widest) {
    PassChoice passes;
    FftKind best;
    double least = std::numeric_limits<double>::infinity();
    const auto offer = [&](FftWay way, int lanes, double cost) {
        cost *= lane_weight(lanes) / lanes;
        if (cost < least) best = {way, geometry.length, geometry.forward, lanes};
        least = std::min(least, cost);
    };
    for (const int lanes : {16, 8, 4}) {
        if (lanes > widest || !fft_kernels(lanes)) continue;
        if (geometry.stride != 1) {
            offer(FftWay::Columns, lanes, lanes * packs_of(geometry.count, lanes));
            continue;
        }
        // The number of rows must not matter: a row has the same bits among others as alone.
        offer(FftWay::Rows, lanes, split(passes, geometry.length, lanes).cost);
        offer(FftWay::ShortRows, lanes, short_rows_cost(passes, geometry.length, lanes));
    }
    return best;
}

std::size_t fft_bytes(const FftKind& kind) noexcept {
    // At most two buffers, a stage, a tile of some packs and the roots; of rows the turns and the tile alone are
    // of their size.
    const auto samples = static_cast<std::size_t>(kind.length) * 2 * sizeof(float);
    const auto lanes = static_cast<std::size_t>(kind.lanes);
    const std::size_t copies = kind.way != FftWay::Rows ? 4 * lanes + 1 : 4;
    return copies * samples + (std::size_t{1} << 19);
}

FftTables::FftTables(const FftKind& kind) : kind_{kind}, kernels_{fft_kernels(kind.lanes)} {
    const bool rows = kind.way == FftWay::Rows;
    PassChoice passes;
    int second = 1;
    if (rows || (kind.way == FftWay::Columns && kind.length > kOneStep))
        second = split(passes, kind.length, rows ? kind.lanes : 1).second;
    fft_.first = take_apart(kind.length / second);
    if (second > 1) fft_.second = take_apart(second);
    const std::ptrdiff_t longest = std::max(fft_.first.length, second), slot = 2 * std::ptrdiff_t{kind.lanes};
    fft_.work = 2 * longest * slot;
    fft_.stage = longest * slot * (second > 1 && !rows ? kStripPacks : 1);
    if (kind.way == FftWay::ShortRows) fft_.tile = longest * slot;
    if (rows)
        lay_out_rows();
    else if (second > 1)
        lay_out_columns();
}

void FftTables::run(const float* in, float* out, std::ptrdiff_t pitch, int count, float* room) const noexcept {
    kernels_->of(kind_.way)(fft_, {in, out, pitch, count}, room);
}

const FftRoot* FftTables::keep(std::vector<FftRoot> roots) { return roots_.emplace_back(std::move(roots)).data(); }

ShortFft FftTables::take_apart(int length) {
    ShortFft fft;
    fft.length = length;
    fft.backward = !kind_.forward;
    PassChoice passes;
    int left = length;
    for (const int radix : passes.of(length).radices) {
        const int count = left / radix;
        std::vector<FftRoot> roots;
        if (count > 1) {
            const Roots root{left, true};
            for (int i = 0; i < count; ++i)
                for (int k = 1; k < radix; ++k) roots.push_back(root(std::int64_t{i} * k));
        }
        fft.pass[fft.passes++] = {radix, count, length / left, keep(std::move(roots))};
        left = count;
    }
    if (fft.passes == 0) fft.pass[fft.passes++] = {1, 1, 1, nullptr};  // one sample is its own transform
    return fft;
}

void FftTables::lay_out_columns() {
    const int first = fft_.first.length, second = fft_.second.length;
    const Roots root{kind_.length, kind_.forward};
    std::vector<FftRoot> outer;
    for (std::int64_t i = 0; i < second; ++i)
        for (int k = 0; k < first; ++k) outer.push_back(root(i * result_of(k, first, kind_.forward)));
    fft_.outer = keep(std::move(outer));
    fft_.pitch = second | 1;  // an even one would have slots share a few lines of the cache
    fft_.tile = first * fft_.pitch * 2 * kind_.lanes * kStripPacks;
}

void FftTables::lay_out_rows() {
    const int first = fft_.first.length, second = fft_.second.length, lanes = kind_.lanes;
    const Roots root{kind_.length, kind_.forward};
    const int packs = packs_of(second, lanes);
    fft_.tile = std::ptrdiff_t{packs} * first * lanes * 2;
    turned_ = static_cast<std::size_t>(fft_.tile);
    turns_ = allocate_floats(turned_);
    if (!turns_) throw std::bad_alloc{};
    fft_.turns = turns_.get();
    float* to = turns_.get();
    for (int b = 0; b < packs; ++b)
        for (int k = 0; k < first; ++k, to += 2 * lanes)
            for (int i = 0; i < lanes; ++i) {
                const std::int64_t result = result_of(k, first, kind_.forward);
                const FftRoot turn = root(result * (lane_of(b, lanes, second) + i));
                to[i] = turn.re;
                to[lanes + i] = turn.im;
            }
}

std::size_t FftTables::bytes() const noexcept {
    std::size_t floats = room() + turned_;
    for (const auto& roots : roots_) floats += roots.size() * (sizeof(FftRoot) / sizeof(float));
    return floats * sizeof(float);
}

}  // namespace quo
