#ifndef QUO_NUMBER_TEXT_SCALE_H
#define QUO_NUMBER_TEXT_SCALE_H

#include <array>
#include <bit>
#include <cstdint>
#include <optional>

namespace quo {

/* Turning decimal digits and a power of ten into a double, in 64-bit integers.
 *
 * 10^e is split into 10^(16 i) from a table of 64-bit approximations and 10^j, 0 <= j < 16, which is exact. The
 * digits times these two have an error below kMostError units of the 64-bit product. A double keeps 53 of the 64
 * bits, so the product tells how to round unless the eleven bits that go lie that close to one half: one number in
 * three hundred, for which there is no answer here and the caller takes a longer way. */

/** A number in floating form: mantissa * 2^exponent, the mantissa's highest bit set. */
template <typename Mantissa>
struct Scaled {
    Mantissa mantissa;
    int exponent;
};

__extension__ typedef unsigned __int128 Wide;  // NOLINT(modernize-use-using): __extension__ needs a declaration

constexpr int kPowerStep = 16, kPowersBelow = 22, kPowersAbove = 19;  // 10^(16 i), i = -22 to 19
using PowerTable = std::array<Scaled<std::uint64_t>, kPowersBelow + 1 + kPowersAbove>;

constexpr Scaled<std::uint64_t> normalized(std::uint64_t value) noexcept {
    const int free_bits = std::countl_zero(value);
    return {value << free_bits, -free_bits};
}

constexpr Scaled<std::uint64_t> small_power(int exponent) noexcept {
    std::uint64_t value = 1;
    for (int i = 0; i < exponent; ++i) value *= 10;
    return normalized(value);
}

/** The product, cut to 64 bits. */
constexpr Scaled<std::uint64_t> product(Scaled<std::uint64_t> a, Scaled<std::uint64_t> b) noexcept {
    const Wide whole = Wide{a.mantissa} * b.mantissa;
    const int free_bits = (whole >> 127) == 0 ? 1 : 0;  // both factors have their highest bit set
    return {static_cast<std::uint64_t>(whole >> (64 - free_bits)), a.exponent + b.exponent + 64 - free_bits};
}

/** The table is built in 128 bits, so that twenty steps leave its upper 64 bits right to one unit. */
constexpr Scaled<Wide> next_power(Scaled<Wide> power, Scaled<std::uint64_t> step) noexcept {
    const Wide low = Wide{static_cast<std::uint64_t>(power.mantissa)} * step.mantissa;
    const Wide high = (power.mantissa >> 64) * step.mantissa + (low >> 64);
    const int exponent = power.exponent + step.exponent + 64;
    if (high >> 127) return {high, exponent};
    return {high << 1 | (static_cast<std::uint64_t>(low) >> 63), exponent - 1};
}

/** Long division by 64-bit places, carried two places beyond the point. */
constexpr Scaled<Wide> previous_power(Scaled<Wide> power, Scaled<std::uint64_t> step) noexcept {
    const Wide first = power.mantissa >> 64;
    const Wide second = (first % step.mantissa) << 64 | static_cast<std::uint64_t>(power.mantissa);
    const Wide third = (second % step.mantissa) << 64;
    const Wide upper = first / step.mantissa << 64 | second / step.mantissa, lower = third / step.mantissa;
    // The quotient of two mantissas lies between 1/2 and 2: its first place is 0 or 1.
    const int exponent = power.exponent - step.exponent - 64;
    if (upper >> 64) return {upper << 63 | lower >> 1, exponent + 1};
    return {upper << 64 | lower, exponent};
}

constexpr PowerTable make_powers() noexcept {
    constexpr Scaled<Wide> kOne{Wide{1} << 127, -127};
    constexpr auto kStep = small_power(kPowerStep);
    PowerTable table{};
    const auto put = [&](int i, Scaled<Wide> power) {
        table[static_cast<std::size_t>(kPowersBelow + i)] = {static_cast<std::uint64_t>(power.mantissa >> 64),
                                                             power.exponent + 64};
    };
    put(0, kOne);
    auto power = kOne;
    for (int i = 1; i <= kPowersAbove; ++i) put(i, power = next_power(power, kStep));
    power = kOne;
    for (int i = 1; i <= kPowersBelow; ++i) put(-i, power = previous_power(power, kStep));
    return table;
}

constexpr auto make_small_powers() noexcept {
    std::array<Scaled<std::uint64_t>, kPowerStep> table{};
    for (int j = 0; j < kPowerStep; ++j) table[static_cast<std::size_t>(j)] = small_power(j);
    return table;
}

inline constexpr PowerTable kPowers = make_powers();
inline constexpr auto kSmallPowers = make_small_powers();

/** digits * 10^exponent rounded to nearest, ties to even, or nothing where 64 bits do not decide or the result is
 * no normal double. */
inline std::optional<double> scale_by_ten(std::uint64_t digits, std::int64_t exponent) noexcept {
    // Each of two products and the table is cut by less than a unit, and a unit can weigh double after a shift.
    constexpr std::uint64_t kMostError = 6, kHalf = 1024;
    constexpr int kBias = 1023 + 63, kLargestExponent = 2045;
    if (digits == 0) return 0.0;
    if (exponent < -kPowersBelow * kPowerStep || exponent >= (kPowersAbove + 1) * kPowerStep) return std::nullopt;

    const auto places = static_cast<std::size_t>(exponent + kPowersBelow * kPowerStep);
    const auto result =
        product(product(normalized(digits), kSmallPowers[places % kPowerStep]), kPowers[places / kPowerStep]);
    const std::uint64_t rest = result.mantissa % (2 * kHalf);
    const int biased = result.exponent + kBias;
    if (rest - (kHalf - kMostError) <= kMostError || biased < 1 || biased > kLargestExponent) return std::nullopt;

    // The mantissa's highest bit adds one to the exponent; so does a mantissa that rounds up to the next power of
    // two.
    const std::uint64_t rounded = (result.mantissa >> 11) + (rest >> 10);
    return std::bit_cast<double>((static_cast<std::uint64_t>(biased - 1) << 52) + rounded);
}

}  // namespace quo

#endif
