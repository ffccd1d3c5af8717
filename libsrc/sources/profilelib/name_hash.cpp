// SPDX-License-Identifier: Apache-2.0
#include "profilelib/name_hash.h"

#include <sys/random.h>

#include <cerrno>
#include <cstddef>
#include <cstring>

namespace quo {
namespace {

__extension__ using Wide = unsigned __int128;

constexpr std::uint64_t kPrime = (std::uint64_t{1} << 61) - 1;
/** Bytes that make one coefficient: as many as stay below the prime. */
constexpr std::size_t kChunk = 7;
/** Above the bytes of a chunk, and below the prime. */
constexpr std::uint64_t kEndMark = std::uint64_t{1} << 60;

/** a * b + c modulo the prime, for values up to it. 2^61 is 1 there, so that the upper bits are added to the
 * lower. */
std::uint64_t multiply_add(std::uint64_t a, std::uint64_t b, std::uint64_t c) noexcept {
    const Wide sum = Wide{a} * b + c;
    const std::uint64_t folded =
        (static_cast<std::uint64_t>(sum) & kPrime) + static_cast<std::uint64_t>(sum >> 61);
    return folded >= kPrime ? folded - kPrime : folded;
}

/** The random numbers of the process. */
struct Secret {
    std::uint64_t point, factor;
};

Secret draw() noexcept {
    Secret drawn{};
    if (::getrandom(&drawn, sizeof drawn, 0) != static_cast<ssize_t>(sizeof drawn)) {
        drawn = {0x9E3779B97F4A7C15, 0xD1B54A32D192ED03};  // a system without random numbers
        errno = 0;
    }
    return {2 + drawn.point % (kPrime - 2), drawn.factor | 1U};
}

const Secret& secret() noexcept {
    static const Secret drawn = draw();
    return drawn;
}

}  // namespace

NameHash& NameHash::add(std::string_view name) noexcept {
    const std::uint64_t point = secret().point;
    for (; name.size() >= kChunk; name.remove_prefix(kChunk)) {
        std::uint64_t coefficient = 0;
        std::memcpy(&coefficient, name.data(), kChunk);
        sum_ = multiply_add(sum_, point, coefficient);
    }
    // The last coefficient, of less bytes than the others, tells by a mark above them that the name ends here.
    std::uint64_t coefficient = 1;
    for (const char byte : name) coefficient = coefficient << 8 | static_cast<unsigned char>(byte);
    sum_ = multiply_add(sum_, point, coefficient | kEndMark);
    return *this;
}

std::uint64_t NameHash::value() const noexcept {
    // Names that differ in a last digit have sums in even steps: both halves of a product spread them over all
    // bits.
    const Wide product = Wide{sum_} * secret().factor;
    return (static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64)) & kPrime;
}

}  // namespace quo
