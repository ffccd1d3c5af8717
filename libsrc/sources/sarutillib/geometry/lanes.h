// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_LANES_H
#define QUO_LANES_H

#include <cmath>
#include <limits>
#include <type_traits>

#include "quo_base/geometry.h"

#if defined(__SSE2__)
#include <immintrin.h>
#endif

/* Numbers that formulas are written for once: one double, or a pack of doubles, a lane for each of several points.
 * Lanes never mix, and every operation is rounded as it is for one double, so that a lane has the bits that its
 * point has alone, whatever the width of the pack.
 *
 * Sources that use packs are compiled once per width with flags of their own. So that the linker cannot let one
 * width run another one's code, what they call are templates on the pack, and nothing of it is a plain function.
 */

#define QUO_LANES_INLINE [[gnu::always_inline]] inline

namespace quo {

/** So many doubles side by side, a power of two. Operators work lane by lane, as the compiler knows them. */
template <int width>
struct PackOf {
    using Type __attribute__((vector_size(width * sizeof(double)))) = double;
};
template <int width>
using Pack = typename PackOf<width>::Type;

/** What a comparison of numbers gives: a bool, or all bits of a lane set or none. */
template <class T>
using MaskOf = decltype(T{} < T{});

template <class T>
inline constexpr int kLanes = sizeof(T) / sizeof(double);

/** The greatest finite number and the least normal one. */
inline constexpr double kMost = std::numeric_limits<double>::max(), kLeast = std::numeric_limits<double>::min();

// --- Masks ------------------------------------------------------------------------------------------------------

/** True in every lane. */
template <class M>
QUO_LANES_INLINE M everywhere() noexcept {
    if constexpr (std::is_same_v<M, bool>)
        return true;
    else
        return ~M{};
}
template <class M>
QUO_LANES_INLINE M both(M a, M b) noexcept {
    if constexpr (std::is_same_v<M, bool>)
        return a && b;
    else
        return a & b;
}
template <class M>
QUO_LANES_INLINE M either(M a, M b) noexcept {
    if constexpr (std::is_same_v<M, bool>)
        return a || b;
    else
        return a | b;
}
/** Where the first holds and the second does not. */
template <class M>
QUO_LANES_INLINE M but_not(M a, M b) noexcept {
    if constexpr (std::is_same_v<M, bool>)
        return a && !b;
    else
        return a & ~b;
}
template <class T, class M>
QUO_LANES_INLINE T select(M mask, T a, T b) noexcept {
    return mask ? a : b;
}
/** A bit for each lane, the first lane's lowest. */
template <class M>
QUO_LANES_INLINE unsigned bits_of(M mask) noexcept {
    if constexpr (std::is_same_v<M, bool>) {
        return mask ? 1U : 0U;
    } else {
#if defined(__AVX512DQ__)
        if constexpr (sizeof(M) == 64) return _mm512_movepi64_mask(reinterpret_cast<__m512i>(mask));
#endif
#if defined(__AVX__)
        if constexpr (sizeof(M) == 32)
            return static_cast<unsigned>(_mm256_movemask_pd(reinterpret_cast<__m256d>(mask)));
#endif
#if defined(__SSE2__)
        if constexpr (sizeof(M) == 16)
            return static_cast<unsigned>(_mm_movemask_pd(reinterpret_cast<__m128d>(mask)));
#endif
        unsigned bits = 0;
        for (unsigned i = 0; i < sizeof(M) / sizeof(double); ++i) bits |= mask[i] != 0 ? 1U << i : 0U;
        return bits;
    }
}
template <class M>
QUO_LANES_INLINE bool any(M mask) noexcept {
    return bits_of(mask) != 0;
}

template <class M>
QUO_LANES_INLINE bool all(M mask) noexcept {
    return !any(but_not(everywhere<M>(), mask));
}

// --- Numbers ----------------------------------------------------------------------------------------------------

/** The number in every lane. */
template <class T>
QUO_LANES_INLINE T fill(double value) noexcept {
    return value - T{};  // less 0 keeps all bits
}
template <class T>
QUO_LANES_INLINE T root(T x) noexcept {
    if constexpr (std::is_same_v<T, double>) {
        return std::sqrt(x);
    } else {
#if defined(__AVX512F__)
        if constexpr (sizeof(T) == 64)
            return reinterpret_cast<T>(_mm512_maskz_sqrt_pd(0xff, reinterpret_cast<__m512d>(x)));
#endif
#if defined(__AVX__)
        if constexpr (sizeof(T) == 32) return reinterpret_cast<T>(_mm256_sqrt_pd(reinterpret_cast<__m256d>(x)));
#endif
#if defined(__SSE2__)
        if constexpr (sizeof(T) == 16) return reinterpret_cast<T>(_mm_sqrt_pd(reinterpret_cast<__m128d>(x)));
#endif
        T result;
        for (int i = 0; i < kLanes<T>; ++i) result[i] = __builtin_sqrt(x[i]);
        return result;
    }
}
template <class T>
QUO_LANES_INLINE T magnitude(T x) noexcept {
    if constexpr (std::is_same_v<T, double>) {
        return std::abs(x);
    } else {
        using Bits = MaskOf<T>;
        return reinterpret_cast<T>(reinterpret_cast<Bits>(x) & (Bits{} + 0x7fffffffffffffffL));
    }
}
/** The greater one; `a` where one is not a number. */
template <class T>
QUO_LANES_INLINE T at_least(T a, T b) noexcept {
    return select(a < b, b, a);
}
/** As std::clamp(). */
template <class T>
QUO_LANES_INLINE T clamped(T x, T lowest, T highest) noexcept {
    return select(x < lowest, lowest, select(highest < x, highest, x));
}
/** Without the places after the point. |x| < 2^31. */
template <class T>
QUO_LANES_INLINE T whole_part(T x) noexcept {
    if constexpr (std::is_same_v<T, double>) {
        return static_cast<double>(static_cast<int>(x));
    } else {
        using Whole __attribute__((vector_size(kLanes<T> * sizeof(int)))) = int;
        return __builtin_convertvector(__builtin_convertvector(x, Whole), T);
    }
}
template <class T>
QUO_LANES_INLINE T rounded_down(T x) noexcept {
    const T whole = whole_part(x);
    return select(whole > x, whole - 1.0, whole);
}
template <class T>
QUO_LANES_INLINE T rounded_up(T x) noexcept {
    const T whole = whole_part(x);
    return select(whole < x, whole + 1.0, whole);
}
/** To the nearest whole number, halves away from 0, for x >= 0. */
template <class T>
QUO_LANES_INLINE T rounded(T x) noexcept {
    const T whole = whole_part(x);
    return select(x - whole >= 0.5, whole + 1.0, whole);
}

/** The angle of (x, y) from the x axis, -pi to pi; 0 for (0, 0). Within two units in the last place for packs. */
template <class T>
QUO_LANES_INLINE T angle_of(T y, T x) noexcept {
    if constexpr (std::is_same_v<T, double>) {
        return std::atan2(y, x);
    } else {
        // atan(t) / t in t^2, for |t| up to the tangent of an eighth of a half turn: a Chebyshev fit, to 5e-20.
        constexpr double kSeries[] = {0x1.ef33cd44e0e28p-7,  -0x1.118077129fd94p-5, 0x1.709820a6f6214p-5,
                                      -0x1.ab66aaec4a53cp-5, 0x1.e16e17ff518a7p-5,  -0x1.110c39da13b1dp-4,
                                      0x1.3b1369cdc4362p-4,  -0x1.745d148036a99p-4, 0x1.c71c71b55fec7p-4,
                                      -0x1.24924924706d6p-3, 0x1.9999999999565p-3,  -0x1.5555555555554p-2};
        constexpr double kEighth = 0.41421356237309503, kQuarterTurn = 0.78539816339744828;
        const T ax = magnitude(x), ay = magnitude(y);
        const MaskOf<T> steep = ay > ax;
        const T longer = select(steep, ay, ax), shorter = select(steep, ax, ay);
        const MaskOf<T> upper = shorter > kEighth * longer;
        const T over = select(upper, shorter - longer, shorter), under = select(upper, shorter + longer, longer);
        const T t = over / select(under > 0.0, under, fill<T>(1.0)), t2 = t * t;
        T series = fill<T>(kSeries[0]);
        for (int i = 1; i < 12; ++i) series = series * t2 + kSeries[i];
        T angle = t + t * (t2 * series);
        angle = select(upper, kQuarterTurn + angle, angle);
        angle = select(steep, 2.0 * kQuarterTurn - angle, angle);
        angle = select(x < 0.0, 4.0 * kQuarterTurn - angle, angle);
        return select(y < 0.0, -angle, angle);
    }
}

// --- Vectors ----------------------------------------------------------------------------------------------------

/** As Vec3, of packs. */
template <class T>
struct PackVec3 {
    T x, y, z;
};
template <class T>
QUO_LANES_INLINE PackVec3<T> operator+(const PackVec3<T>& a, const PackVec3<T>& b) noexcept {
    return {a.x + b.x, a.y + b.y, a.z + b.z};
}
template <class T>
QUO_LANES_INLINE PackVec3<T> operator-(const PackVec3<T>& a, const PackVec3<T>& b) noexcept {
    return {a.x - b.x, a.y - b.y, a.z - b.z};
}
template <class T, class K>
QUO_LANES_INLINE PackVec3<T> operator*(const K& k, const PackVec3<T>& a) noexcept {
    return {k * a.x, k * a.y, k * a.z};
}
template <class T>
QUO_LANES_INLINE T dot(const PackVec3<T>& a, const PackVec3<T>& b) noexcept {
    return a.x * b.x + a.y * b.y + a.z * b.z;
}
template <class T>
QUO_LANES_INLINE PackVec3<T> cross(const PackVec3<T>& a, const PackVec3<T>& b) noexcept {
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
template <class T>
QUO_LANES_INLINE T norm(const PackVec3<T>& a) noexcept {
    return root(dot(a, a));
}
template <class T>
QUO_LANES_INLINE T angle_deg(const PackVec3<T>& a, const PackVec3<T>& b) noexcept {
    return angle_of(norm(cross(a, b)), dot(a, b)) * kDegPerRad;
}

template <class T>
using Vector = std::conditional_t<std::is_same_v<T, double>, Vec3, PackVec3<T>>;
template <class V>
using NumberOf = decltype(V::x);
template <class V, class M>
QUO_LANES_INLINE V select_vector(M mask, const V& a, const V& b) noexcept {
    return {select(mask, a.x, b.x), select(mask, a.y, b.y), select(mask, a.z, b.z)};
}

/** As Ellipsoid, one for each lane. */
template <class T>
struct PackEllipsoid {
    T equatorial_m, polar_m;
};

}  // namespace quo

#endif
