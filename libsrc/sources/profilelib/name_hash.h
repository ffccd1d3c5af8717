// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_NAME_HASH_H
#define QUO_NAME_HASH_H

#include <cstdint>
#include <string_view>

namespace quo {

/** Hash of one or more names, in their order. The names come from files that anybody may have made: a fixed hash
 * would let a file choose names that all fall together, and look-ups would become walks. Here names that were
 * chosen without knowing the process's random numbers have the same hash with a probability of about 1e-18.
 *
 * The names are the coefficients of a polynomial modulo the prime 2^61 - 1, evaluated at a random point: two of
 * them meet at no more points than their degree. J. L. Carter and M. N. Wegman, "Universal Classes of Hash
 * Functions", Journal of Computer and System Sciences 18, 1979. */
class NameHash {
public:
    NameHash& add(std::string_view name) noexcept;
    /** Below 2^61. */
    [[nodiscard]] std::uint64_t value() const noexcept;

private:
    std::uint64_t sum_ = 1;  // a leading coefficient, without which an empty first name would not count
};

}  // namespace quo

#endif
