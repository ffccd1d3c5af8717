#ifndef QUO_NUMBER_TEXT_SCALE_H
#define QUO_NUMBER_TEXT_SCALE_H

#include <array>
#include <bit>
#include <cstdint>
#include <optional>

namespace quo {

/* Between doubles and decimal digits in 64-bit integers.
 *
 * Either way is a product with a power of ten. 10^e is split into 10^(16 i) from a table of 64-bit approximations
 * and 10^j, 0 <= j < 16, which is exact. The product is cut to 64 bits and too small by less than kMostError
 * units. Fewer bits are wanted, so it tells how to round unless the bits that go lie that close to one half. That
 * is one double in three hundred, and one text of 15 digits in a thousand; for these there is no answer here and
 * the caller takes a longer way. */

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
    constexpr std::size_t kPlaceOfOne = kPowersBelow;
    PowerTable table{};
    const auto put = [&](std::size_t place, Scaled<Wide> power) {
        table[place] = {static_cast<std::uint64_t>(power.mantissa >> 64), power.exponent + 64};
    };
    put(kPlaceOfOne, kOne);
    auto power = kOne;
    for (std::size_t place = kPlaceOfOne + 1; place < table.size(); ++place)
        put(place, power = next_power(power, kStep));
    power = kOne;
    for (std::size_t place = kPlaceOfOne; place-- > 0;) put(place, power = previous_power(power, kStep));
    return table;
}

constexpr auto make_small_powers() noexcept {
    std::array<Scaled<std::uint64_t>, kPowerStep> table{};
    for (int j = 0; j < kPowerStep; ++j) table[static_cast<std::size_t>(j)] = small_power(j);
    return table;
}

inline constexpr int kMostFirstDigits = 17;

constexpr auto make_whole_powers() noexcept {
    std::array<std::uint64_t, kMostFirstDigits + 1> table{1};
    for (std::size_t i = 1; i < table.size(); ++i) table[i] = 10 * table[i - 1];
    return table;
}

inline constexpr PowerTable kPowers = make_powers();
inline constexpr auto kSmallPowers = make_small_powers();
inline constexpr auto kWholePowers = make_whole_powers();  // 10^0 to 10^17, as they are

/** Each of two products and the table is cut by less than a unit; a unit of the first two can weigh two of the
 * result's. */
inline constexpr std::uint64_t kMostError = 6;

/** Whether a product's last bits, `rest`, may lie on either side of `half`. */
constexpr bool is_undecided(std::uint64_t rest, std::uint64_t half) noexcept {
    return rest + kMostError >= half && rest <= half;
}

constexpr bool has_power(std::int64_t exponent) noexcept {
    return exponent >= -kPowersBelow * kPowerStep && exponent < (kPowersAbove + 1) * kPowerStep;
}

/** The number times 10^exponent, which has_power. */
inline Scaled<std::uint64_t> times_ten_to(Scaled<std::uint64_t> number, std::int64_t exponent) noexcept {
    const auto places = static_cast<std::size_t>(exponent + kPowersBelow * kPowerStep);
    return product(product(number, kSmallPowers[places % kPowerStep]), kPowers[places / kPowerStep]);
}

/** digits * 10^exponent rounded to nearest, ties to even, or nothing where 64 bits do not decide or the result is
 * no normal double. */
inline std::optional<double> scale_by_ten(std::uint64_t digits, std::int64_t exponent) noexcept {
    constexpr std::uint64_t kHalf = 1024;
    constexpr int kBias = 1023 + 63, kLargestExponent = 2045;
    if (digits == 0) return 0.0;
    if (!has_power(exponent)) return std::nullopt;

    const auto result = times_ten_to(normalized(digits), exponent);
    const std::uint64_t rest = result.mantissa % (2 * kHalf);
    const int biased = result.exponent + kBias;
    if (is_undecided(rest, kHalf) || biased < 1 || biased > kLargestExponent) return std::nullopt;

    // The mantissa's highest bit adds one to the exponent; so does a mantissa that rounds up to the next power of
    // two.
    const std::uint64_t rounded = (result.mantissa >> 11) + (rest >> 10);
    return std::bit_cast<double>((static_cast<std::uint64_t>(biased - 1) << 52) + rounded);
}

/** A number as d.ddd * 10^exponent: its digits as one whole number. */
struct DecimalDigits {
    std::uint64_t digits;
    int exponent;
};

/** The first `count` digits, 1 to kMostFirstDigits, of a positive normal double, rounded to nearest, or nothing
 * where 64 bits do not decide. */
inline std::optional<DecimalDigits> first_digits(double value, int count) noexcept {
    constexpr int kBias = 1023 + 52;
    constexpr std::uint64_t kHiddenBit = std::uint64_t{1} << 52;
    const auto bits = std::bit_cast<std::uint64_t>(value);
    const int biased = static_cast<int>(bits >> 52);
    const auto number = Scaled<std::uint64_t>{(bits % kHiddenBit | kHiddenBit) << 11, biased - kBias - 11};
    const std::uint64_t end = kWholePowers[static_cast<std::size_t>(count)];

    // log10(2) is 1262611 / 2^22, close enough to floor every power of two rightly; the number's own exponent is
    // that or one more.
    int exponent = (biased - 1023) * 1262611 >> 22;
    for (int tries = 0; tries < 2; ++tries, ++exponent) {
        const int power = count - 1 - exponent;
        if (!has_power(power)) return std::nullopt;
        const auto scaled = times_ten_to(number, power);
        // A product of 1 that was cut is a little less: 64 bits then hold nothing before the point.
        if (scaled.exponent < -63) return std::nullopt;
        const std::uint64_t whole = scaled.mantissa >> -scaled.exponent;
        if (whole >= end) continue;  // one digit more than wanted
        const std::uint64_t half = std::uint64_t{1} << (-scaled.exponent - 1);
        const std::uint64_t rest = scaled.mantissa % (2 * half);
        if (is_undecided(rest, half)) return std::nullopt;
        const std::uint64_t rounded = whole + (rest > half ? 1 : 0);
        return rounded < end ? DecimalDigits{rounded, exponent} : DecimalDigits{end / 10, exponent + 1};
    }
    return std::nullopt;
}

}  // namespace quo

#endif
