// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_LANE_FFT_H
#define QUO_LANE_FFT_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>
#if defined(__SSE2__)
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

    /** What results are turned by, if anything: all lanes by one root, or each by its own, in slots. With these,
     * half as much of what comes `next` is asked for, into the second cache. */
    struct Outer {
        const FftRoot* roots = nullptr;
        const float* lanes = nullptr;
        const float* next = nullptr;
    };
    /** Slots `step` apart; where one pass is all of several packs, these lie side by side. */
    template <class Float>
    struct Slots {
        Float* at;
        std::ptrdiff_t step;
        bool interleaved;
    };
    using From = Slots<const float>;
    using To = Slots<float>;

    /** A pass over `count` butterflies, whose first values lie `next` apart. `zero` takes result 0. */
    struct Route {
        const float* in;
        float *out, *zero;
        std::ptrdiff_t in_step, out_step, in_next, out_next;
        int count;
        Outer outer;
    };
    enum Turns { kNone, kInner, kOuter, kLanes };

    /** One address that moves on: the compiler would keep more of them than there are registers. */
    template <class Float>
    QUO_FFT_INLINE Float* behind(Float* at, std::ptrdiff_t hop) {
        at += hop;
        asm("" : "+r"(at));
        return at;
    }

    template <int R, bool InInterleaved, bool OutInterleaved, Turns T>
    static void pass(const FftPass& pass, const Route& route) {
        const std::ptrdiff_t in_hop = pass.count * pass.stride * route.in_step;
        const std::ptrdiff_t out_hop = pass.stride * route.out_step, lanes_hop = pass.stride * kSlot;
        const FftRoot* roots = T == kOuter ? route.outer.roots : pass.roots;
        const float *lanes = route.outer.lanes, *next = route.outer.next;
        const float* from = route.in;
        float *to = route.out, *zero = route.zero;
        for (int i = 0, q = 0; i < route.count; ++i) {
            C x[R];
            const float* in = from;
            each<R>([&](auto j) QUO_FFT_HERE {
                x[j] = load<InInterleaved>(in);
                constexpr bool kFits = Level == ProcessorLevel::kAvx512 && R <= 8;
                if constexpr (kFits && !InInterleaved) x[j] = held(x[j]);
                in = behind(in, in_hop);
            });
            butterfly<R>(x);
            float* out = to;
            const float *turns = lanes, *ahead = next;
            each<R>([&](auto k) QUO_FFT_HERE {
                if constexpr (T == kInner && k > 0) x[k] = turn(x[k], held(spread(roots[k - 1])));
                if constexpr (T == kOuter) x[k] = turn(x[k], held(spread(roots[k * pass.stride])));
                if constexpr (T == kLanes) {
                    x[k] = turn(x[k], held(load<false>(turns)));
                    turns = behind(turns, lanes_hop);
                    if (next) ask<2>(ahead, W);
                    ahead = behind(ahead, lanes_hop / 2);
                }
                save<OutInterleaved>(x[k], T != kInner && k == 0 ? zero : out);
                out = behind(out, out_hop);
            });
            from += route.in_next;
            to += route.out_next;
            zero = pass.stride == 1 ? zero + route.out_next : to;
            if (T == kOuter) ++roots;
            if (T == kLanes) {
                lanes += kSlot;
                if (next) next += W;
            }
            if (T == kInner && ++q == pass.stride) {
                q = 0;
                to += (R - 1) * out_hop;
                roots += R - 1;
            }
        }
    }

    /** `body` with the radix as a constant. */
    template <class Body, int... R>
    QUO_FFT_INLINE void of_radix(int radix, std::integer_sequence<int, R...> /*radices*/, const Body& body) {
        (void)((radix == R && (body(std::integral_constant<int, R>{}), true)) || ...);
    }
    using Radices = std::integer_sequence<int, 16, 8, 4, 2, 20, 15, 14, 12, 10, 9, 7, 6, 5, 3, 1>;
    template <bool OutInterleaved, Turns T>
    static void any_pass(const FftPass& own, const Route& route, bool in_interleaved) {
        of_radix(own.radix, Radices{}, [&](auto radix) {
            if (in_interleaved) return pass<radix, true, OutInterleaved, T>(own, route);
            pass<radix, false, OutInterleaved, T>(own, route);
        });
    }
    /** So many packs, of which more than one are a single pass; `work` holds the transform twice. Backward
     * transforms are forward ones whose results stand in the opposite order. */
    static void run(const ShortFft& fft, From in, To out, Outer outer, float* work, int packs = 1) {
        const int last = fft.passes - 1;
        Route route{in.at, work, work, in.step, kSlot, in.step, kSlot, packs, outer};
        for (int k = 0; k < last; ++k) {
            float* const next = route.out == work ? work + fft.length * kSlot : work;
            route.count = fft.length / fft.pass[k].radix;
            any_pass<false, kInner>(fft.pass[k], route, k == 0 && in.interleaved);
            route.in = route.out;
            route.in_step = route.in_next = kSlot;
            route.out = next;
        }
        route.out = route.zero = out.at;
        route.out_step = out.step;
        if (fft.backward) {
            route.out += fft.length * out.step;
            route.out_step = -out.step;
        }
        if (last == 0) {
            route.in_next = route.out_next = kSlot;
        } else {
            route.count = fft.pass[last].stride;
            route.out_next = route.out_step;
        }
        const bool interleaved = last == 0 && in.interleaved;
        if (outer.lanes) return any_pass<false, kLanes>(fft.pass[last], route, interleaved);
        if (outer.roots) return any_pass<false, kOuter>(fft.pass[last], route, interleaved);
        if (out.interleaved) return any_pass<true, kNone>(fft.pass[last], route, interleaved);
        any_pass<false, kNone>(fft.pass[last], route, interleaved);
    }

    // --- Transforms down the lanes
    // -------------------------------------------------------------------------------

    static constexpr std::ptrdiff_t kLine = 16;  ///< floats of a line of the cache
    template <int Nearness = 3>
    QUO_FFT_INLINE void ask(const float* row, std::ptrdiff_t floats) {
        for (std::ptrdiff_t k = 0; k < floats; k += kLine) __builtin_prefetch(row + k, 0, Nearness);
    }
    /** Copies rows from an image to a stage or back; the stage's are closer together. The image's are too far
     * apart for the processor to see them coming: a few are asked for early, and in the end the first of those
     * that come `next`. More of them, a power of two apart, would push each other out of the first caches. */
    static void move(const float* from, std::ptrdiff_t from_step, float* to, std::ptrdiff_t to_step, int rows,
                     std::ptrdiff_t floats, std::ptrdiff_t next = 0) {
        constexpr int kAhead = 6;
        constexpr std::ptrdiff_t kWhole = kStripPacks * kSlot;
        const bool reads = from_step > to_step;
        const float* image = reads ? from : to;
        const std::ptrdiff_t step = reads ? from_step : to_step;
        for (int row = 0; row < rows; ++row, from += from_step, to += to_step, image += step) {
            const bool here = row + kAhead < rows;
            ask(here ? image + kAhead * step : image + (kAhead - rows) * step + next, floats);
            if (floats == kWhole)
                std::memcpy(to, from, sizeof(float) * kWhole);
            else
                std::memcpy(to, from, sizeof(float) * static_cast<std::size_t>(floats));
        }
    }

    /** The same of whole strips to an image that no cache holds until it is read again: past the caches, which
     * would fetch the lines first. */
    static void move_past_caches(const float* from, std::ptrdiff_t from_step, float* to, std::ptrdiff_t to_step,
                                 int rows) {
#if defined(__SSE2__)
        for (int row = 0; row < rows; ++row, from += from_step, to += to_step)
            each<2 * kStripPacks>([&](auto k) QUO_FFT_HERE {
                const V v = *reinterpret_cast<const Loose*>(from + k * W);
                if constexpr (W == 16) _mm512_stream_ps(to + k * W, __m512(v));
                if constexpr (W == 8) _mm256_stream_ps(to + k * W, __m256(v));
                if constexpr (W == 4) _mm_stream_ps(to + k * W, __m128(v));
            });
        _mm_sfence();
#else
        move(from, from_step, to, to_step, rows, kStripPacks * kSlot);
#endif
    }
    /** Whether a strip stands in whole lines of such an image. */
    static bool passes_caches(const FftSteps& fft, const FftImage& columns) {
        constexpr std::ptrdiff_t kMostCached = 1 << 24;  // floats
        return columns.count == kStripPacks * W && columns.step % kLine == 0 &&
               reinterpret_cast<std::uintptr_t>(columns.out) % (kLine * sizeof(float)) == 0 &&
               columns.step * fft.first.length * fft.second.length > kMostCached;
    }

    /** So many columns in two steps, a pack of those that are split behind the other: through a stage whose rows
     * lie close together. */
    static void two_steps(const FftSteps& fft, const FftImage& columns, float* room) {
        const int n1 = fft.second.length, n2 = fft.first.length, packs = (columns.count + W - 1) / W;
        const std::ptrdiff_t step = columns.step, floats = 2 * std::ptrdiff_t{columns.count};
        const std::ptrdiff_t stage_step = packs * kSlot, tile_row = packs * fft.pitch * kSlot;
        float *const work = room, *const stage = work + fft.work, *const tile = stage + fft.stage;
        const bool past = passes_caches(fft, columns);
        for (int i = 0; i < n1; ++i) {
            const float* const in = columns.in + i * step;
            move(in, n1 * step, stage, stage_step, n2, floats, step);
            for (int b = 0; b < packs; ++b)
                run(fft.first, {stage + b * kSlot, stage_step, true},
                    {tile + (b * fft.pitch + i) * kSlot, tile_row, false}, {fft.outer + std::ptrdiff_t{i} * n2},
                    work);
        }
        for (int k = 0; k < n2; ++k) {
            float* const out = columns.out + k * step;
            for (int b = 0; b < packs; ++b)
                run(fft.second, {tile + (k * packs + b) * fft.pitch * kSlot, kSlot, false},
                    {stage + b * kSlot, stage_step, true}, {}, work);
            if (past)
                move_past_caches(stage, stage_step, out, n2 * step, n1);
            else
                move(stage, stage_step, out, n2 * step, n1, floats, step);
        }
    }
    /** Whole packs, of which more than one are a single pass; or no more columns than lanes. */
    static void one_step(const FftSteps& fft, const FftImage& columns, float* room) {
        const std::ptrdiff_t step = columns.step, floats = 2 * std::ptrdiff_t{columns.count};
        if (columns.count % W == 0)
            return run(fft.first, {columns.in, step, true}, {columns.out, step, true}, {}, room,
                       columns.count / W);
        float* const stage = room + fft.work;
        move(columns.in, step, stage, kSlot, fft.first.length, floats);
        run(fft.first, {stage, kSlot, true}, {stage, kSlot, true}, {}, room);
        move(stage, kSlot, columns.out, step, fft.first.length, floats);
    }
    /** Columns between the beginning of a line of the cache, or of a narrower strip, and the first; where rows
     * differ, none is better than another. */
    static int skew(const FftImage& columns, int strip) {
        const auto first = reinterpret_cast<std::uintptr_t>(columns.in) / sizeof(FftRoot);
        return columns.step % kLine == 0 ? static_cast<int>(first % std::min(strip, 8)) : 0;
    }
    /** After the first strip, all begin with a line of the cache. */
    static void columns(const FftSteps& fft, const FftImage& columns, float* room) noexcept {
        const bool two = fft.two();
        const int strip = two ? kStripPacks * W : W;
        int width = strip - skew(columns, strip);
        for (std::ptrdiff_t c = 0; c < columns.count; c += width, width = strip) {
            const int left = columns.count - static_cast<int>(c);
            if (!two && fft.first.passes == 1 && left > W && width == strip) width = left / W * W;
            (two ? two_steps : one_step)(
                fft, {columns.in + 2 * c, columns.out + 2 * c, columns.step, std::min(left, width)}, room);
        }
    }

    // --- Rows
    // ----------------------------------------------------------------------------------------------------

    /** Of two vectors: `Run` lanes are taken and as many left by turns, beginning with the first, or those left.
     */
    template <int Run, bool Left, std::size_t... I>
    QUO_FFT_INLINE V pick(V a, V b, std::index_sequence<I...> /*lanes*/) {
        return __builtin_shufflevector(a, b, (I / Run * 2 * Run + I % Run + (Left ? Run : 0))...);
    }
    /** Within each quarter of four lanes: two of the first vector and two of the second, `Step` apart. */
    template <int First, int Step, std::size_t... I>
    QUO_FFT_INLINE V twos(V a, V b, std::index_sequence<I...> /*lanes*/) {
        return __builtin_shufflevector(a, b, (I / 4 * 4 + First + I % 2 * Step + I / 2 % 2 * W)...);
    }
    /** Lane i of vector k was lane k of vector i: squares of four lanes first, then these among each other. */
    QUO_FFT_INLINE void turn_square(V (&v)[W]) {
        constexpr std::make_index_sequence<W> kLanes;
        each<W / 4>([&](auto g) QUO_FFT_HERE {
            V* const f = v + 4 * g;
            const V low = twos<0, 1>(f[0], f[1], kLanes), high = twos<2, 1>(f[0], f[1], kLanes);
            const V low2 = twos<0, 1>(f[2], f[3], kLanes), high2 = twos<2, 1>(f[2], f[3], kLanes);
            f[0] = twos<0, 2>(low, low2, kLanes);
            f[1] = twos<1, 2>(low, low2, kLanes);
            f[2] = twos<0, 2>(high, high2, kLanes);
            f[3] = twos<1, 2>(high, high2, kLanes);
        });
        for (int run = 4; run < W; run *= 2) {
            V turned[W];
            each<W / 2>([&](auto k) QUO_FFT_HERE {
                constexpr int at = k / 4 * 8 + k % 4;
                turned[k] = pick<4, false>(v[at], v[at + 4], kLanes);
                turned[k + W / 2] = pick<4, true>(v[at], v[at + 4], kLanes);
            });
            each<W>([&](auto k) QUO_FFT_HERE { v[k] = turned[k]; });
        }
    }
    /** W floats of each of W rows, lane by lane: reads them where they are rows and leaves them turned. */
    QUO_FFT_INLINE void load_square(const float* from, std::ptrdiff_t step, V (&v)[W]) {
        each<W>([&](auto k) QUO_FFT_HERE {
            v[k] = *reinterpret_cast<const Loose*>(from);
            from = behind(from, step);
        });
        turn_square(v);
    }
    QUO_FFT_INLINE void save_rows(const V (&v)[W], float* to, std::ptrdiff_t step) {
        each<W>([&](auto k) QUO_FFT_HERE {
            *reinterpret_cast<Loose*>(to) = v[k];
            to = behind(to, step);
        });
    }
    QUO_FFT_INLINE void turn_rows(const float* from, std::ptrdiff_t from_step, float* to, std::ptrdiff_t to_step) {
        V v[W];
        load_square(from, from_step, v);
        save_rows(v, to, to_step);
    }
    /** First of a pack's lanes: the last pack overlaps the one before it. */
    QUO_FFT_INLINE int lane_of(int pack, int count) { return (pack + 1) * W <= count ? pack * W : count - W; }

    /** Step 1: what it leaves is the slots of its results, pack by pack. */
    static void across_samples(const FftSteps& fft, const float* in, const float* next, float* tile, float* work) {
        const int n1 = fft.second.length;
        const std::ptrdiff_t share = fft.first.length * kSlot;
        for (int b = 0; b * W < n1; ++b, tile += share)
            run(fft.first, {in + 2 * lane_of(b, n1), 2 * std::ptrdiff_t{n1}, true}, {tile, kSlot, false},
                {nullptr, fft.turns + b * share, next ? next + b * share / 2 : nullptr}, work);
    }
    /** Step 2: W results are the lanes. The other half of what comes `next` is asked for: all at once would keep
     * waiting what is needed here. */
    static void across_results(const FftSteps& fft, const float* tile, float* out, const float* next, float* stage,
                               float* work) {
        const int n1 = fft.second.length, n2 = fft.first.length;
        for (int c = 0; c * W < n2; ++c) {
            const int result = lane_of(c, n2);
            for (int b = 0; b * W < n1; ++b) {
                if (next) ask<2>(next + (std::ptrdiff_t{n1} * c + std::ptrdiff_t{b} * W) * W, W * W);
                for (const int part : {0, W})
                    turn_rows(tile + (std::ptrdiff_t{b} * n2 + result) * kSlot + part, kSlot,
                              stage + lane_of(b, n1) * kSlot + part, kSlot);
            }
            run(fft.second, {stage, kSlot, false}, {out + 2 * result, 2 * std::ptrdiff_t{n2}, true}, {}, work);
        }
    }
    static void rows(const FftSteps& fft, const FftImage& rows, float* room) noexcept {
        constexpr int kMostAsked = 1 << 14;  // samples: the second cache has no room for the next of longer rows
        float *const tile = room, *const stage = tile + fft.tile, *const work = stage + fft.stage;
        for (std::ptrdiff_t row = 0; row < rows.count; ++row) {
            const float* const in = rows.in + row * rows.step;
            const bool asks = row + 1 < rows.count && fft.first.length * fft.second.length <= kMostAsked;
            const float* const next = asks ? in + rows.step : nullptr;
            across_samples(fft, in, next, tile, work);
            across_results(fft, tile, rows.out + row * rows.step,
                           asks ? next + fft.first.length * fft.second.length : nullptr, stage, work);
        }
    }

    // --- Short rows, one a lane
    // ----------------------------------------------------------------------------------

    /** Packs of rows that registers hold; the backward transform is the conjugate one of the conjugate row. */
    template <int N>
    static void whole_rows(const FftImage& rows, float sign) {
        constexpr int kSquares = (2 * N + W - 1) / W;
        for (std::ptrdiff_t row = 0; row < rows.count; row += W) {
            C x[N];
            const V conjugate = V{} + sign;
            each<kSquares>([&](auto k) QUO_FFT_HERE {
                constexpr int at = std::min(k * W / 2, N - W / 2);
                V v[W];
                load_square(rows.in + row * rows.step + 2 * at, rows.step, v);
                each<W / 2>([&](auto i) QUO_FFT_HERE { x[at + i] = {v[2 * i], v[2 * i + 1] * conjugate}; });
            });
            butterfly<N>(x);
            each<kSquares>([&](auto k) QUO_FFT_HERE {
                constexpr int at = std::min(k * W / 2, N - W / 2);
                V v[W];
                each<W / 2>([&](auto i) QUO_FFT_HERE {
                    v[2 * i] = x[at + i].re;
                    v[2 * i + 1] = x[at + i].im * conjugate;
                });
                turn_square(v);
                save_rows(v, rows.out + row * rows.step + 2 * at, rows.step);
            });
        }
    }
    static void row_packs(const ShortFft& fft, const FftImage& rows, float* stage, float* work) {
        const int floats = 2 * fft.length;
        if (W <= 8 && fft.passes == 1)
            return of_radix(fft.length, Radices{}, [&](auto length) {
                whole_rows<std::max<int>(length, W / 2)>(rows, fft.backward ? -1.0F : 1.0F);
            });
        for (std::ptrdiff_t row = 0; row < rows.count; row += W) {
            const float* const in = rows.in + row * rows.step;
            float* const out = rows.out + row * rows.step;
            for (int k = 0; k * W < floats; ++k)
                turn_rows(in + lane_of(k, floats), rows.step, stage + lane_of(k, floats) * W, W);
            run(fft, {stage, kSlot, false}, {stage, kSlot, false}, {}, work);
            for (int k = 0; k * W < floats; ++k)
                turn_rows(stage + lane_of(k, floats) * W, W, out + lane_of(k, floats), rows.step);
        }
    }
    /** Sums and differences of four floats, which need no lanes. */
    static void rows_of_two(const FftImage& rows) {
        typedef float Four __attribute__((vector_size(16), aligned(4), may_alias));
        for (std::ptrdiff_t row = 0; row < rows.count; ++row) {
            const Four v = *reinterpret_cast<const Four*>(rows.in + row * rows.step);
            *reinterpret_cast<Four*>(rows.out + row * rows.step) =
                __builtin_shufflevector(v, v, 2, 3, 0, 1) + v * Four{1.0F, 1.0F, -1.0F, -1.0F};
        }
    }
    static void short_rows(const FftSteps& fft, const FftImage& rows, float* room) noexcept {
        const std::ptrdiff_t floats = 2 * std::ptrdiff_t{fft.first.length}, step = rows.step;
        const int rest = rows.count % W, whole = rows.count - rest;
        float *const stage = room, *const work = stage + fft.stage, *const spare = work + fft.work;
        if (floats == 2) return move(rows.in, step, rows.out, step, rows.count, floats);
        if (floats == 4) return rows_of_two(rows);
        row_packs(fft.first, {rows.in, rows.out, step, whole}, stage, work);
        if (rest == 0) return;
        // The lanes that are left over repeat others.
        for (int row = 0; row < W; ++row)
            move(rows.in + (whole + row % rest) * step, 0, spare + row * floats, 0, 1, floats);
        row_packs(fft.first, {spare, spare, floats, W}, stage, work);
        move(spare, floats, rows.out + whole * step, step, rest, floats);
    }

    static constexpr FftKernels kernels() { return {{columns, rows, short_rows}}; }
#undef QUO_FFT_HERE
#undef QUO_FFT_INLINE
};

}  // namespace quo

#endif
