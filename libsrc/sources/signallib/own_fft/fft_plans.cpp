#include "signallib/own_fft/fft_plans.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <map>
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
constexpr RadixCost kRadixCosts[] = {{16, 30.0}, {15, 38.0}, {14, 42.0}, {12, 28.0}, {10, 26.0},
                                     {9, 27.0},  {8, 21.0},  {7, 27.0},  {6, 21.0},  {5, 21.0},
                                     {4, 17.0},  {3, 18.0},  {2, 15.0}};
/** Exchanging lanes and slots. */
constexpr double kTransposeCost = 20.0;
/** Lengths up to this one are transformed in one step, whose buffers the first cache holds. */
constexpr int kOneStep = 128;
/** More would not make short rows faster: loads and stores of their samples take most of the time. */
constexpr int kShortRowLanes = 8;
/** Short rows up to this length, eight at a time, leave room in the first cache. */
constexpr int kCachedShortRow = 256;
/** Rows whose turns are kept for one pack of lanes only. */
constexpr int kLongRow = 1 << 16;

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
    // Buffers beyond the first cache cost something: of columns a whole strip stands in them.
    const double per_step = lanes == 1 ? 0.1 : 0.004;
    const auto step = [&](int steps) { return passes.of(steps).cost + per_step * steps; };
    const auto filled = [&](int count) { return static_cast<double>(packs_of(count, lanes)) * lanes / count; };
    for (int second = lanes; second <= length / lanes && second / 64 <= length / second; ++second) {
        const int first = length / second;
        if (length % second != 0) continue;
        const double cost = filled(second) * step(first) + filled(first) * (step(second) + kTransposeCost);
        if (cost < best.cost) best = {cost, second};
    }
    return best;
}

/** The same of rows that stand in one lane each: they take no turns. */
double short_rows_cost(PassChoice& passes, int length) {
    return passes.of(length).cost + 0.05 * std::max(length - kCachedShortRow, 0);
}

/** What an operation takes on a vector of so many lanes. */
double lane_weight(int lanes) { return lanes == 16 ? 1.0 : lanes == 8 ? 0.65 : 0.5; }

// ---- Roots ----

/** exp(-2 pi i e / n) of 0 <= e < n, or exp(+2 pi i e / n): as products of few, in double precision. */
class Roots {
public:
    Roots(int n, bool forward) {
        const double step = (forward ? -2.0 : 2.0) * std::numbers::pi / n;
        for (int k = 0; k <= kMask; ++k) fine_.push_back({std::cos(step * k), std::sin(step * k)});
        for (std::int64_t k = 0; k < n; k += kMask + 1) {
            const double angle = step * static_cast<double>(k);
            coarse_.push_back({std::cos(angle), std::sin(angle)});
        }
    }
    FftRoot operator()(std::int64_t e) const {
        const Exact &a = fine_[static_cast<std::size_t>(e & kMask)],
                    &b = coarse_[static_cast<std::size_t>(e >> kShift)];
        return {static_cast<float>(a.re * b.re - a.im * b.im), static_cast<float>(a.re * b.im + a.im * b.re)};
    }

private:
    static constexpr int kShift = 8, kMask = (1 << kShift) - 1;
    struct Exact {
        double re, im;
    };
    std::vector<Exact> fine_, coarse_;
};

/** roots[i * inner + k] = root(i * k). */
std::vector<FftRoot> root_table(int n, bool forward, int outer, int inner, int first = 0) {
    const Roots root{n, forward};
    std::vector<FftRoot> table;
    table.reserve(static_cast<std::size_t>(outer) * static_cast<std::size_t>(inner - first));
    for (std::int64_t i = 0; i < outer; ++i)
        for (std::int64_t k = first; k < inner; ++k) table.push_back(root(i * k));
    return table;
}

/** First of a pack's lanes: the last pack overlaps the one before it. */
int lane_of(int pack, int lanes, int count) { return std::min(pack * lanes, count - lanes); }

}  // namespace

extern const FftKernels kFftKernels4;
#if defined(QUO_WIDE_LANES)
extern const FftKernels kFftKernels8, kFftKernels16;
#endif

const FftKernels* fft_kernels(int lanes) noexcept {
    if (lanes == 4) return &kFftKernels4;
#if defined(QUO_WIDE_LANES)
    if (lanes == 8 && processor_level() >= ProcessorLevel::kAvx2) return &kFftKernels8;
    if (lanes == 16 && processor_level() >= ProcessorLevel::kAvx512) return &kFftKernels16;
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
        if (lanes <= kShortRowLanes) offer(FftWay::ShortRows, lanes, short_rows_cost(passes, geometry.length));
    }
    // Short rows have the same bits in lanes of any number.
    if (best.way == FftWay::ShortRows && geometry.count <= 4) best.lanes = 4;
    return best;
}

std::size_t fft_bytes(const FftKind& kind) noexcept {
    // At most two buffers, a stage, a tile of some packs and the roots; of long rows the tile alone is of their
    // size.
    const auto samples = static_cast<std::size_t>(kind.length) * 2 * sizeof(float);
    const auto lanes = static_cast<std::size_t>(kind.lanes);
    const std::size_t copies = kind.way != FftWay::Rows ? 4 * lanes + 1 : kind.length > kLongRow ? 2 : 4;
    return copies * samples + (std::size_t{1} << 19);
}

FftTables::FftTables(const FftKind& kind) : kind_{kind}, kernels_{fft_kernels(kind.lanes)} {
    if (kind.way == FftWay::Rows)
        row_ = along_row();
    else
        lanes_ = down_lanes(kind.length, kStripPacks);
}

std::size_t FftTables::room() const noexcept {
    const std::ptrdiff_t floats = kind_.way == FftWay::Rows
                                      ? row_.tile + row_.lanes + std::max(row_.first.room(), row_.second.room())
                                      : lanes_.room();
    return static_cast<std::size_t>(floats);
}

void FftTables::run(const float* in, float* out, std::ptrdiff_t pitch, int count, float* room) const noexcept {
    switch (kind_.way) {
        case FftWay::Columns:
            return kernels_->columns(lanes_, {in, out, pitch, count}, room);
        case FftWay::Rows:
            return kernels_->rows(row_, {in, out, pitch, count}, room);
        case FftWay::ShortRows:
            return kernels_->short_rows(lanes_, {in, out, pitch, count}, room);
    }
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
        const FftRoot* const roots = count > 1 ? keep(root_table(left, true, count, radix, 1)) : nullptr;
        fft.pass[fft.passes++] = {radix, count, length / left, roots};
        left = count;
    }
    if (fft.passes == 0) fft.pass[fft.passes++] = {1, 1, 1, nullptr};  // one sample is its own transform
    return fft;
}

LaneFft FftTables::down_lanes(int length, int packs) {
    LaneFft fft;
    const std::ptrdiff_t slot = 2 * std::ptrdiff_t{kind_.lanes};
    if (length <= kOneStep || kind_.way == FftWay::ShortRows) {
        fft.first = take_apart(length);
        fft.stage = length * slot;
        fft.work = 2 * fft.stage;
        return fft;
    }
    PassChoice passes;
    const int second = split(passes, length, 1).second, first = length / second;
    fft.first = take_apart(first);
    fft.second = take_apart(second);
    fft.outer = keep(root_table(length, kind_.forward, second, first));
    fft.pitch = second | 1;  // an even one would have slots share a few lines of the cache
    fft.work = 2 * std::max(first, second) * slot;
    fft.stage = std::max(first, second) * slot * packs;
    fft.tile = first * fft.pitch * slot * packs;
    return fft;
}

RowFft FftTables::along_row() {
    PassChoice passes;
    RowFft row;
    const int second = split(passes, kind_.length, kind_.lanes).second, first = kind_.length / second;
    const std::ptrdiff_t slot = 2 * std::ptrdiff_t{kind_.lanes};
    row.first = down_lanes(first, 1);
    row.second = down_lanes(second, 1);
    row.pitch = first | 1;
    row.tile = packs_of(second, kind_.lanes) * row.pitch * slot;
    row.lanes = second * slot;
    turn_lanes(row);
    return row;
}

void FftTables::turn_lanes(RowFft& row) {
    const int first = row.first.length(), second = row.second.length(), lanes = kind_.lanes;
    const int packs = packs_of(second, lanes);
    const bool one_pack = kind_.length > kLongRow;
    const Roots root{kind_.length, kind_.forward};
    turns_.reserve(static_cast<std::size_t>(one_pack ? 1 : packs) * static_cast<std::size_t>(first) * 2 *
                   static_cast<std::size_t>(lanes));
    for (int b = 0; b < (one_pack ? 1 : packs); ++b)
        for (std::int64_t k = 0; k < first; ++k)
            for (const auto part : {&FftRoot::re, &FftRoot::im})
                for (int i = 0; i < lanes; ++i) turns_.push_back(root(k * (lane_of(b, lanes, second) + i)).*part);
    row.turns = turns_.data();
    if (!one_pack) return;
    std::vector<FftRoot> of_packs;
    for (int b = 0; b < packs; ++b)
        for (std::int64_t k = 0; k < first; ++k) of_packs.push_back(root(k * lane_of(b, lanes, second)));
    row.packs = keep(std::move(of_packs));
}

std::size_t FftTables::bytes() const noexcept {
    std::size_t floats = room() + turns_.size();
    for (const auto& roots : roots_) floats += roots.size() * (sizeof(FftRoot) / sizeof(float));
    return floats * sizeof(float);
}

}  // namespace quo
