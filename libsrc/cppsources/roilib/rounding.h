// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ROUNDING_H
#define QUO_ROUNDING_H

#include <cmath>
#include <cstdint>
#include <limits>

namespace quo {

/** The integer part of a number, stopped at the bounds of 32 bits; 0 for a value that is no number. A plain
 * conversion of such values is undefined. */
inline std::int32_t truncate_clamped(double value) noexcept {
    using Limits = std::numeric_limits<std::int32_t>;
    if (std::isnan(value)) return 0;
    if (value <= static_cast<double>(Limits::min())) return Limits::min();
    if (value >= static_cast<double>(Limits::max())) return Limits::max();
    return static_cast<std::int32_t>(value);
}

/** The nearest integer, halves away from zero, stopped at the bounds of 32 bits; 0 for a value that is no number.
 */
inline std::int32_t round_clamped(double value) noexcept {
    return truncate_clamped(value >= 0.0 ? value + 0.5 : value - 0.5);
}

}  // namespace quo

#endif
