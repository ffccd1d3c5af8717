// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_LANE_FFT_H
#define QUO_LANE_FFT_H

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>
#include <utility>
#if defined(__FMA__)
#include <immintrin.h>
#endif

#include "sarutillib/ground/processor_level.h"
#include "signallib/own_fft/fft_kernels.h"

/* The kernels of fft_kernels.h for W lanes. Included once for every level and width, by a source with flags of its
 * own; whatever is not inlined carries both in its name, so that no other source can take it for its own. */

namespace quo {

/** cos(2 pi k / n) and -sin(2 pi k / n), by their series about 0. */
struct ExactRoot {
    double re = 0.0, im = 0.0;

    constexpr ExactRoot(int k, int n) {
        const double x = -2.0 * 3.14159265358979323846 * (2 * k > n ? k - n : k) / n;
        double term = 1.0;
        for (int i = 0; i < 40; ++i, term *= x / i) (i % 2 == 0 ? re : im) += i % 4 < 2 ? term : -term;
    }
};

template <int W, ProcessorLevel Level>
struct LaneFfts {
    typedef float V __attribute__((vector_size(4 * W)));
    typedef float Loose __attribute__((vector_size(4 * W), aligned(4), may_alias));
    static constexpr std::ptrdiff_t kSlot = 2 * W;
    /** Wider vectors would not make them faster: loads and stores of their samples take most of the time. */
    static constexpr bool kShortRows = W <= 8;

#define QUO_FFT_HERE __attribute__((always_inline))
#define QUO_FFT_INLINE QUO_FFT_HERE static inline

    // --- Complex values, one a lane
    // ------------------------------------------------------------------------------

    struct C {
        V re, im;
    };
    /** a b + c, rounded once where the processor can: said here rather than left to the compiler, which would fuse
     * otherwise with its next version. */
    QUO_FFT_INLINE V fused(V a, V b, V c) {
#if defined(__FMA__)
        if constexpr (W == 16) return V(_mm512_fmadd_ps(__m512(a), __m512(b), __m512(c)));
        if constexpr (W == 8) return V(_mm256_fmadd_ps(__m256(a), __m256(b), __m256(c)));
#endif
        return a * b + c;
    }
    QUO_FFT_INLINE C add(C a, C b) { return {a.re + b.re, a.im + b.im}; }
    QUO_FFT_INLINE C subtract(C a, C b) { return {a.re - b.re, a.im - b.im}; }
    QUO_FFT_INLINE C turn(C a, C by) {
        return {fused(-a.im, by.im, a.re * by.re), fused(a.im, by.re, a.re * by.im)};
    }
    /** One root in all lanes. */
    QUO_FFT_INLINE C spread(FftRoot root) {
        return {root.re - V{}, root.im - V{}};  // not 0 +, which would be computed: it turns -0 into 0
    }
    /** In registers from here on: the compiler would rather read what is used twice from memory twice, though
     * each butterfly waits for its loads already. */
    QUO_FFT_INLINE C held(C c) {
#if defined(__x86_64__)
        asm("" : "+v"(c.re), "+v"(c.im));
#endif
        return c;
    }
    /** Turned by exp(-2 pi i K / N). */
    template <int K, int N>
    QUO_FFT_INLINE C turn(C a) {
        constexpr int kEighths = 8 * K % N == 0 ? 8 * K / N % 8 : -1;
        constexpr ExactRoot kRoot{K % N, N};
        constexpr float kRe = static_cast<float>(kRoot.re), kIm = static_cast<float>(kRoot.im);
        if constexpr (kEighths == 0) return a;
        if constexpr (kEighths == 2) return {a.im, -a.re};
        if constexpr (kEighths == 4) return {-a.re, -a.im};
        if constexpr (kEighths == 6) return {-a.im, a.re};
        if constexpr (kEighths == 1 || kEighths == 5) return {(a.re + a.im) * kRe, (a.im - a.re) * kRe};
        if constexpr (kEighths == 3 || kEighths == 7) return {(a.re - a.im) * kRe, (a.re + a.im) * kRe};
        return turn(a, spread({kRe, kIm}));
    }

    // --- Slots
    // ---------------------------------------------------------------------------------------------------

    template <std::size_t... I>
    QUO_FFT_INLINE C part(V a, V b, std::index_sequence<I...> /*lanes*/) {
        return {__builtin_shufflevector(a, b, (2 * I)...), __builtin_shufflevector(a, b, (2 * I + 1)...)};
    }
    template <std::size_t... I>
    QUO_FFT_INLINE void join(C c, float* to, std::index_sequence<I...> /*lanes*/) {
        *reinterpret_cast<Loose*>(to) = __builtin_shufflevector(c.re, c.im, (I / 2 + I % 2 * W)...);
        *reinterpret_cast<Loose*>(to + W) = __builtin_shufflevector(c.re, c.im, (W / 2 + I / 2 + I % 2 * W)...);
    }
    template <bool Interleaved>
    QUO_FFT_INLINE C load(const float* from) {
        const V a = *reinterpret_cast<const Loose*>(from), b = *reinterpret_cast<const Loose*>(from + W);
        if constexpr (Interleaved) return part(a, b, std::make_index_sequence<W>{});
        return {a, b};
    }
    template <bool Interleaved>
    QUO_FFT_INLINE void save(C c, float* to) {
        if constexpr (Interleaved) return join(c, to, std::make_index_sequence<W>{});
        *reinterpret_cast<Loose*>(to) = c.re;
        *reinterpret_cast<Loose*>(to + W) = c.im;
    }

    // --- Butterflies
    // ---------------------------------------------------------------------------------------------

    template <std::size_t... I, class Body>
    QUO_FFT_INLINE void each_of(std::index_sequence<I...> /*numbers*/, const Body& body) {
        (body(std::integral_constant<int, static_cast<int>(I)>{}), ...);
    }
    /** `body` with 0, 1, ..., N - 1 as constants. */
    template <int N, class Body>
    QUO_FFT_INLINE void each(const Body& body) {
        each_of(std::make_index_sequence<N>{}, body);
    }
    static constexpr int inner_radix(int radix) {
        return radix % 4 == 0 && radix > 4 ? 4 : radix % 2 == 0 ? radix / 2 : radix % 3 == 0 ? 3 : radix;
    }

    /** The transform of R values, in natural order. */
    template <int R>
    QUO_FFT_INLINE void butterfly(C (&x)[R]) {
        if constexpr (R == 2) {
            const C difference = subtract(x[0], x[1]);
            x[0] = add(x[0], x[1]);
            x[1] = difference;
        } else if constexpr (inner_radix(R) != R) {
            composite<inner_radix(R), R / inner_radix(R)>(x);
        } else if constexpr (R > 2) {
            prime(x);
        }
    }
    /** A transforms of length B apart and B of length A; coprime ones, which are numbered by their remainders,
     * need no turns between them. */
    template <int A, int B>
    QUO_FFT_INLINE void composite(C (&x)[A * B]) {
        constexpr int R = A * B;
        constexpr bool kCoprime = A % 2 != B % 2 && A % B != 0 && B % A != 0;
        C y[A][B];
        each<B>([&](auto b) QUO_FFT_HERE {
            C t[A];
            each<A>([&](auto a) QUO_FFT_HERE { t[a] = x[kCoprime ? (B * a + A * b) % R : B * a + b]; });
            butterfly<A>(t);
            each<A>([&](auto k) QUO_FFT_HERE { y[k][b] = turn < kCoprime ? 0 : b * k, R > (t[k]); });
        });
        each<A>([&](auto k) QUO_FFT_HERE { butterfly<B>(y[k]); });
        each<R>([&](auto k) QUO_FFT_HERE { x[k] = y[k % A][kCoprime ? k % B : k / A]; });
    }
    /** Sums and differences of the values that lie opposite need half the products. */
    template <int R>
    QUO_FFT_INLINE void prime(C (&x)[R]) {
        constexpr int kHalf = R / 2;
        C sum[kHalf], difference[kHalf], all = x[0], out[R];
        each<kHalf>([&](auto j) QUO_FFT_HERE {
            sum[j] = add(x[j + 1], x[R - 1 - j]);
            difference[j] = subtract(x[j + 1], x[R - 1 - j]);
            all = add(all, sum[j]);
        });
        each<kHalf>([&](auto k) QUO_FFT_HERE {
            C even = x[0], odd{};
            each<kHalf>([&](auto j) QUO_FFT_HERE {
                constexpr ExactRoot kRoot{(j + 1) * (k + 1) % R, R};
                const V cosine = V{} + static_cast<float>(kRoot.re), sine = V{} - static_cast<float>(kRoot.im);
                const C across{difference[j].im, difference[j].re};
                even = {fused(sum[j].re, cosine, even.re), fused(sum[j].im, cosine, even.im)};
                odd = j == 0 ? C{across.re * sine, across.im * sine}
                             : C{fused(across.re, sine, odd.re), fused(across.im, sine, odd.im)};
            });
            out[k + 1] = {even.re + odd.re, even.im - odd.im};
            out[R - 1 - k] = {even.re - odd.re, even.im + odd.im};
        });
        each<kHalf>([&](auto k) QUO_FFT_HERE {
            x[k + 1] = out[k + 1];
            x[R - 1 - k] = out[R - 1 - k];
        });
        x[0] = all;
    }

    // --- Passes
    // --------------------------------------------------------------------------------------------------

    /** What results are turned by, if anything: all lanes by one root, or each by its own, in slots. */
    struct Outer {
        const FftRoot* roots = nullptr;
        const float* lanes = nullptr;
    };
    /** A pass from slots `in_step` apart to slots `out_step` apart. `zero` takes result 0. */
    struct Route {
        const float* in;
        float *out, *zero;
        std::ptrdiff_t in_step, out_step = kSlot;
        Outer outer{};
        float sign = 1.0F;  ///< of imaginary parts that become lanes or come from them
        int many = W;       ///< rows or columns that one pass is all of
    };
    enum Turns { kNone, kInner, kOuter, kLanes };

    template <bool Interleaved, int R>
    QUO_FFT_INLINE void save_all(const C (&x)[R], float* to, float* zero, std::ptrdiff_t hop) {
        save<Interleaved>(x[0], zero);
        each<R - 1>([&](auto k) QUO_FFT_HERE { save<Interleaved>(x[k + 1], to + (k + 1) * hop); });
    }

    template <int R, bool InInterleaved, bool OutInterleaved, Turns T>
    static void pass(const FftPass& pass, const Route& route) {
        const std::ptrdiff_t in_hop = pass.count * pass.stride * route.in_step;
        const std::ptrdiff_t out_hop = pass.stride * route.out_step;
        const FftRoot* roots = T == kOuter ? route.outer.roots : pass.roots;
        // Columns that one pass is all of: their packs lie side by side.
        constexpr bool kPacks = InInterleaved && T == kNone;
        const int some = kPacks ? route.many / W : pass.stride;
        const std::ptrdiff_t in_next = kPacks ? kSlot : route.in_step, out_next = kPacks ? kSlot : route.out_step;
        for (int p = 0; p < pass.count; ++p) {
            const float* from = route.in + std::ptrdiff_t{p} * pass.stride * route.in_step;
            float* to = route.out + std::ptrdiff_t{p} * R * out_hop;
            for (int q = 0; q < some; ++q, from += in_next, to += out_next) {
                C x[R];
                each<R>([&](auto j) QUO_FFT_HERE {
                    x[j] = load<InInterleaved>(from + j * in_hop);
                    constexpr bool kFits = Level == ProcessorLevel::kAvx512 && R <= 8;
                    if constexpr (kFits && !InInterleaved) x[j] = held(x[j]);
                });
                butterfly<R>(x);
                if constexpr (T == kInner)
                    each<R - 1>([&](auto k) QUO_FFT_HERE { x[k + 1] = turn(x[k + 1], held(spread(roots[k]))); });
                if constexpr (T == kOuter)
                    each<R>([&](auto k)
                                QUO_FFT_HERE { x[k] = turn(x[k], held(spread(roots[q + k * pass.stride]))); });
                if constexpr (T == kLanes)
                    each<R>([&](auto k) QUO_FFT_HERE {
                        x[k] = turn(x[k], held(load<false>(route.outer.lanes + (q + k * pass.stride) * kSlot)));
                    });
                float* const zero = kPacks ? route.zero + q * kSlot : T != kInner && q == 0 ? route.zero : to;
                save_all<OutInterleaved>(x, to, zero, out_hop);
            }
            if constexpr (T == kInner) roots += R - 1;
        }
    }

    using PassKernel = void (*)(const FftPass&, const Route&);
    using Radices = std::integer_sequence<int, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 12, 14, 15, 16>;
    static constexpr int kRadices = 17;
    template <bool InInterleaved, bool OutInterleaved, Turns T, int... R>
    static constexpr std::array<PassKernel, kRadices> passes_of(std::integer_sequence<int, R...> /*radices*/) {
        std::array<PassKernel, kRadices> table{};
        ((table[R] = pass<R, InInterleaved, OutInterleaved, T>), ...);
        return table;
    }
    template <bool InInterleaved, bool OutInterleaved, Turns T>
    static PassKernel find(int radix) {
        static constexpr auto kTable = passes_of<InInterleaved, OutInterleaved, T>(Radices{});
        return kTable[static_cast<std::size_t>(radix)];
    }

    /** Where the slots of a transform stand: as they are, interleaved, or one lane a row of samples, each `step`
     * after the last. */
    enum Form { kSplit, kInterleaved, kAcross };
    template <class Float>
    struct Slots {
        Float* at;
        std::ptrdiff_t step;
        Form form;
    };
    using From = Slots<const float>;
    using To = Slots<float>;

    static PassKernel first_pass(int radix, Form in) {
        if (in == kAcross) return row_kernels(radix).in;
        return in == kInterleaved ? find<true, false, kInner>(radix) : find<false, false, kInner>(radix);
    }
    static PassKernel last_pass(int radix, Form in, Form out, const Outer& outer) {
        if (in == kAcross) return out == kAcross ? row_kernels(radix).whole : row_kernels(radix).across;
        const bool apart = in == kSplit;
        if (out == kAcross) return row_kernels(radix).out;
        if (outer.lanes) return apart ? find<false, true, kLanes>(radix) : find<true, true, kLanes>(radix);
        if (outer.roots) return apart ? find<false, false, kOuter>(radix) : find<true, false, kOuter>(radix);
        return apart ? find<false, true, kNone>(radix) : find<true, true, kNone>(radix);
    }
    /** `many` of them, if one pass is all; `work` holds the transform twice. Backward transforms are forward ones
     * whose results stand in the opposite order, or the conjugate ones of conjugate rows. */
    static void run(const ShortFft& fft, From in, To out, Outer outer, float* work, int many = W) {
        const int last = fft.passes - 1;
        Route route{in.at, work, work, in.step, kSlot, outer};
        const bool conjugate = fft.backward && out.form == kAcross;
        if (conjugate) route.sign = -1.0F;
        route.many = many;
        for (int k = 0; k < last; ++k) {
            float* const next = route.out == work ? work + fft.length * kSlot : work;
            first_pass(fft.pass[k].radix, k == 0 ? in.form : kSplit)(fft.pass[k], route);
            route.in = route.out;
            route.in_step = kSlot;
            route.out = next;
        }
        route.out = route.zero = out.at;
        route.out_step = out.step;
        if (fft.backward && !conjugate) {
            route.out += fft.length * out.step;
            route.out_step = -out.step;
        }
        last_pass(fft.pass[last].radix, last == 0 ? in.form : kSplit, out.form, outer)(fft.pass[last], route);
    }

    // --- Transforms down the lanes
    // -------------------------------------------------------------------------------

    /** Rows of an image: too far apart for the processor to see them coming, so that they are asked for early.
     * More of them, a power of two apart, would push each other out of the first caches. */
    static constexpr int kAhead = 6;
    template <int Nearness = 3>
    QUO_FFT_INLINE void ask(const float* row, std::ptrdiff_t floats) {
        constexpr std::ptrdiff_t kLine = 16;
        for (std::ptrdiff_t k = 0; k < floats; k += kLine) __builtin_prefetch(row + k, 0, Nearness);
    }
    /** The first ones, while there is other work. */
    static void ask_first(const float* row, std::ptrdiff_t step, int rows, std::ptrdiff_t floats) {
        for (int k = 0; k < rows && k < kAhead; ++k, row += step) ask(row, floats);
    }
    /** Copies rows from an image to a stage or back; the stage's are closer together. */
    static void move(const float* from, std::ptrdiff_t from_step, float* to, std::ptrdiff_t to_step, int rows,
                     std::ptrdiff_t floats) {
        constexpr std::ptrdiff_t kWhole = kStripPacks * kSlot;
        const bool reads = from_step > to_step;
        const float* image = reads ? from : to;
        const std::ptrdiff_t step = reads ? from_step : to_step;
        for (int row = 0; row < rows; ++row, from += from_step, to += to_step, image += step) {
            if (row + kAhead < rows) ask(image + kAhead * step, floats);
            if (floats == kWhole)
                std::memcpy(to, from, sizeof(float) * kWhole);
            else
                std::memcpy(to, from, sizeof(float) * static_cast<std::size_t>(floats));
        }
    }

    /** So many columns in two steps, a pack of those that are split behind the other: through a stage whose rows
     * lie close together. */
    static void two_steps(const FftSteps& fft, const FftImage& columns, float* room) {
        const int n1 = fft.second.length, n2 = fft.first.length, packs = (columns.count + W - 1) / W;
        const std::ptrdiff_t step = columns.step, floats = 2 * std::ptrdiff_t{columns.count};
        const std::ptrdiff_t stage_step = packs * kSlot, tile_row = packs * fft.pitch * kSlot;
        float *const work = room, *const stage = work + fft.work, *const tile = stage + fft.stage;
        for (int i = 0; i < n1; ++i) {
            const float* const in = columns.in + i * step;
            move(in, n1 * step, stage, stage_step, n2, floats);
            if (i + 1 < n1) ask_first(in + step, n1 * step, n2, floats);
            for (int b = 0; b < packs; ++b)
                run(fft.first, {stage + b * kSlot, stage_step, kInterleaved},
                    {tile + (b * fft.pitch + i) * kSlot, tile_row, kSplit}, {fft.outer + std::ptrdiff_t{i} * n2},
                    work);
        }
        for (int k = 0; k < n2; ++k) {
            float* const out = columns.out + k * step;
            ask_first(out, n2 * step, n1, floats);
            for (int b = 0; b < packs; ++b)
                run(fft.second, {tile + (k * packs + b) * fft.pitch * kSlot, kSlot, kSplit},
                    {stage + b * kSlot, stage_step, kInterleaved}, {}, work);
            move(stage, stage_step, out, n2 * step, n1, floats);
        }
    }
    /** Whole packs, of which more than one are a single pass; or no more columns than lanes. */
    static void one_step(const FftSteps& fft, const FftImage& columns, float* room) {
        const std::ptrdiff_t step = columns.step, floats = 2 * std::ptrdiff_t{columns.count};
        if (columns.count % W == 0)
            return run(fft.first, {columns.in, step, kInterleaved}, {columns.out, step, kInterleaved}, {}, room,
                       columns.count);
        float* const stage = room + fft.work;
        move(columns.in, step, stage, kSlot, fft.first.length, floats);
        run(fft.first, {stage, kSlot, kInterleaved}, {stage, kSlot, kInterleaved}, {}, room);
        move(stage, kSlot, columns.out, step, fft.first.length, floats);
    }
    static void columns(const FftSteps& fft, const FftImage& columns, float* room) noexcept {
        const bool whole = !fft.two() && fft.first.passes == 1 && columns.count > W;
        const int width = whole ? columns.count / W * W : fft.two() ? kStripPacks * W : W;
        for (std::ptrdiff_t c = 0; c < columns.count; c += width) {
            const int left = columns.count - static_cast<int>(c);
            (fft.two() ? two_steps : one_step)(
                fft, {columns.in + 2 * c, columns.out + 2 * c, columns.step, left < width ? left : width}, room);
        }
    }

    // --- Rows
    // ----------------------------------------------------------------------------------------------------

    /** Within each quarter of four lanes: `Run` of the first vector and `Run` of the second by turns, from the
     * lower halves or the upper ones. */
    template <int Run, bool Upper, std::size_t... I>
    QUO_FFT_INLINE V weave(V a, V b, std::index_sequence<I...> /*lanes*/) {
        return __builtin_shufflevector(
            a, b, (I / 4 * 4 + I % 4 / (2 * Run) + I % Run + (Upper ? 2 : 0) + I / Run % 2 * W)...);
    }
    typedef float Four __attribute__((vector_size(16), aligned(4), may_alias));
    template <class A, std::size_t... I>
    QUO_FFT_INLINE auto concatenate(A a, A b, std::index_sequence<I...> /*lanes of both*/) {
        return __builtin_shufflevector(a, b, I...);
    }
    /** Four floats each of N rows. */
    template <int N>
    QUO_FFT_INLINE auto fours(const float* from, std::ptrdiff_t step) {
        if constexpr (N == 1)
            return *reinterpret_cast<const Four*>(from);
        else
            return concatenate(fours<N / 2>(from, step), fours<N / 2>(from + N / 2 * step, step),
                               std::make_index_sequence<4 * N>{});
    }
    template <int First, std::size_t... I>
    QUO_FFT_INLINE void save_four(V v, float* to, std::index_sequence<I...> /*lanes*/) {
        *reinterpret_cast<Four*>(to) = __builtin_shufflevector(v, v, (First + I)...);
    }
    /** Squares of four lanes of four vectors are turned: lane 4 c + i of vector j was lane 4 c + j of vector i. */
    QUO_FFT_INLINE void turn_fours(V (&v)[4]) {
        constexpr std::make_index_sequence<W> kLanes;
        const V low = weave<1, false>(v[0], v[1], kLanes), high = weave<1, true>(v[0], v[1], kLanes);
        const V next_low = weave<1, false>(v[2], v[3], kLanes), next_high = weave<1, true>(v[2], v[3], kLanes);
        v[0] = weave<2, false>(low, next_low, kLanes);
        v[1] = weave<2, true>(low, next_low, kLanes);
        v[2] = weave<2, false>(high, next_high, kLanes);
        v[3] = weave<2, true>(high, next_high, kLanes);
    }
    /** Four vectors, whose squares are turned, become four floats each of W rows. */
    QUO_FFT_INLINE void save_fours(V (&v)[4], float* to, std::ptrdiff_t step) {
        turn_fours(v);
        each<W>([&](auto row) QUO_FFT_HERE {
            save_four<row / 4 * 4>(v[row % 4], to + row * step, std::make_index_sequence<4>{});
        });
    }
    /** First of a pack's lanes: the last pack overlaps the one before it. */
    QUO_FFT_INLINE int lane_of(int pack, int count) { return (pack + 1) * W <= count ? pack * W : count - W; }

    /** Step 1: what it leaves is a row of the tile for each of its results. The `next` row is asked for on the
     * way, into the second cache: all at once it would keep what this one needs waiting. */
    static void across_samples(const FftSteps& fft, const float* in, const float* next, float* tile, float* room) {
        constexpr std::ptrdiff_t kMostAsked = 1 << 15;
        const int n1 = fft.second.length;
        const std::ptrdiff_t share = fft.first.length * kSlot;
        for (int b = 0; b * W < n1; ++b) {
            const int lane = lane_of(b, n1);
            if (b * share < kMostAsked) ask<2>(next + b * share, share);
            run(fft.first, {in + 2 * lane, 2 * std::ptrdiff_t{n1}, kInterleaved},
                {tile + 2 * lane, fft.pitch, kInterleaved}, {nullptr, fft.turns + b * share}, room);
        }
    }
    /** Step 2: W rows of the tile are the lanes. */
    static void across_results(const FftSteps& fft, const float* tile, float* out, float* room) {
        const int n2 = fft.first.length;
        const std::ptrdiff_t step = 2 * std::ptrdiff_t{n2};
        if (fft.second.passes == 1)
            return run(fft.second, {tile, fft.pitch, kAcross}, {out, step, kInterleaved}, {}, room, n2);
        for (int c = 0; c * W < n2; ++c) {
            const int result = lane_of(c, n2);
            run(fft.second, {tile + result * fft.pitch, fft.pitch, kAcross},
                {out + 2 * result, step, kInterleaved}, {}, room);
        }
    }
    static void rows(const FftSteps& fft, const FftImage& rows, float* room) noexcept {
        float* const rest = room + fft.tile;
        for (std::ptrdiff_t row = 0; row < rows.count; ++row) {
            const float* const in = rows.in + row * rows.step;
            across_samples(fft, in, row + 1 < rows.count ? in + rows.step : in, room, rest);
            across_results(fft, room, rows.out + row * rows.step, rest);
        }
    }

    // --- Short rows, one a lane
    // ----------------------------------------------------------------------------------

    /** Floats from row to row, and 1, or -1 for the backward transform: the conjugate one of the conjugate row. */
    struct Gap {
        std::ptrdiff_t step;
        float sign;
    };
    /** Two neighbouring samples of W rows, their imaginary parts times `sign`. */
    QUO_FFT_INLINE void load_two(const float* from, const Gap& gap, C& first, C& second) {
        V v[4];
        each<4>([&](auto k) QUO_FFT_HERE { v[k] = fours<W / 4>(from + k * gap.step, 4 * gap.step); });
        turn_fours(v);
        first = {v[0], v[1] * gap.sign};
        second = {v[2], v[3] * gap.sign};
    }
    QUO_FFT_INLINE void save_two(C first, C second, float* to, const Gap& gap) {
        V v[4] = {first.re, first.im * gap.sign, second.re, second.im * gap.sign};
        save_fours(v, to, gap.step);
    }
    /** First of two neighbours: at an odd end the last two overlap those before. */
    static constexpr int pair_of(int i, int count) { return i + 2 > count ? count - 2 : i; }

    /** W rows. */
    template <int N>
    QUO_FFT_INLINE void load_rows(const float* from, const Gap& gap, C (&x)[N]) {
        each<(N + 1) / 2>([&](auto i) QUO_FFT_HERE {
            constexpr int at = pair_of(2 * i, N);
            load_two(from + 2 * at, gap, x[at], x[at + 1]);
        });
    }
    /** Rows whose samples registers hold: they become rows again, or slots, so many that these lie side by side.
     */
    template <int N, bool RowsAgain>
    static void whole_rows(const FftPass& /*pass*/, const Route& route) {
        const Gap in{route.in_step, route.sign}, out{route.out_step, route.sign};
        const std::ptrdiff_t out_row = RowsAgain ? out.step : 2;
        const int rows = route.many;
        const float* from = route.in;
        float* to = route.out;
        for (int row = 0, hop = 0; row < rows; row += hop, from += hop * in.step, to += hop * out_row) {
            const int left = rows - row - W;
            hop = left == 0 || left >= W ? W : left;  // the last pack overlaps the one before it
            if constexpr (N == 1) {
                each<W>([&](auto i)
                            QUO_FFT_HERE { std::memcpy(to + i * out.step, from + i * in.step, sizeof(FftRoot)); });
            } else {
                C x[N];
                load_rows(from, in, x);
                butterfly<N>(x);
                if constexpr (RowsAgain)
                    each<(N + 1) / 2>([&](auto i) QUO_FFT_HERE {
                        constexpr int at = pair_of(2 * i, N);
                        save_two(x[at], x[at + 1], to + 2 * at, out);
                    });
                else
                    save_all<true>(x, to, route.zero + 2 * row, out.step);
            }
        }
    }
    /** The first pass over W rows, which become slots. */
    template <int R>
    static void pass_in(const FftPass& pass, const Route& route) {
        const Gap gap{route.in_step, route.sign};
        for (int p = 0; p < pass.count; p += 2) {
            const int at = pair_of(p, pass.count);
            C x[2][R];
            each<R>([&](auto j)
                        QUO_FFT_HERE { load_two(route.in + 2 * (at + j * pass.count), gap, x[0][j], x[1][j]); });
            each<2>([&](auto i) QUO_FFT_HERE {
                const FftRoot* const roots = pass.roots + (at + i) * (R - 1);
                float* const to = route.out + (at + i) * R * kSlot;
                butterfly<R>(x[i]);
                save<false>(x[i][0], to);
                each<R - 1>([&](auto k) QUO_FFT_HERE {
                    save<false>(turn(x[i][k + 1], held(spread(roots[k]))), to + (k + 1) * kSlot);
                });
            });
        }
    }
    /** The last pass, whose slots become rows. */
    template <int R>
    static void pass_out(const FftPass& pass, const Route& route) {
        const Gap gap{route.out_step, route.sign};
        for (int q = 0; q < pass.stride; q += 2) {
            const int at = pair_of(q, pass.stride);
            C x[2][R];
            each<2>([&](auto i) QUO_FFT_HERE {
                each<R>([&](auto j) QUO_FFT_HERE {
                    x[i][j] = load<false>(route.in + (at + i + j * pass.stride) * kSlot);
                });
                butterfly<R>(x[i]);
            });
            each<R>([&](auto k)
                        QUO_FFT_HERE { save_two(x[0][k], x[1][k], route.out + 2 * (at + k * pass.stride), gap); });
        }
    }
    struct RowKernels {
        PassKernel whole = nullptr, in = nullptr, out = nullptr, across = nullptr;
    };
    template <int... R>
    static constexpr std::array<RowKernels, kRadices> row_table(std::integer_sequence<int, R...> /*radices*/) {
        std::array<RowKernels, kRadices> table{};
        // Rows that are transformed across have a sample for every lane at least.
        ((table[R].in = pass_in<R>, table[R].across = whole_rows<std::max(R, W), false>), ...);
        if constexpr (kShortRows) ((table[R].whole = whole_rows<R, true>, table[R].out = pass_out<R>), ...);
        return table;
    }
    static const RowKernels& row_kernels(int radix) {
        static constexpr auto kTable = row_table(Radices{});
        return kTable[static_cast<std::size_t>(radix)];
    }
    /** Packs of W rows. */
    static void row_packs(const ShortFft& fft, const FftImage& rows, float* work) {
        const int together = fft.passes == 1 ? rows.count : W;
        for (std::ptrdiff_t row = 0; row < rows.count; row += together)
            run(fft, {rows.in + row * rows.step, rows.step, kAcross},
                {rows.out + row * rows.step, rows.step, kAcross}, {}, work, together);
    }
    static void short_rows(const FftSteps& fft, const FftImage& rows, float* room) noexcept {
        const std::ptrdiff_t floats = 2 * std::ptrdiff_t{fft.first.length}, step = rows.step;
        const std::size_t bytes = sizeof(float) * static_cast<std::size_t>(floats);
        const int rest = rows.count % W, whole = rows.count - rest;
        row_packs(fft.first, {rows.in, rows.out, step, whole}, room);
        if (rest == 0) return;
        // The lanes that are left over repeat others.
        float* const stage = room + fft.work;
        for (int row = 0; row < W; ++row)
            std::memcpy(stage + row * floats, rows.in + (whole + row % rest) * step, bytes);
        row_packs(fft.first, {stage, stage, floats, W}, room);
        for (int row = 0; row < rest; ++row)
            std::memcpy(rows.out + (whole + row) * step, stage + row * floats, bytes);
    }

    static constexpr FftKernels kernels() {
        if constexpr (kShortRows) return {{columns, rows, short_rows}};
        return {{columns, rows, nullptr}};
    }
#undef QUO_FFT_HERE
#undef QUO_FFT_INLINE
};

}  // namespace quo

#endif
