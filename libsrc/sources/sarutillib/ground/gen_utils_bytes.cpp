// SPDX-License-Identifier: Apache-2.0
/* Byte order and number classes. */

#include <algorithm>
#include <bit>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/processor_level.h"

namespace {

static_assert(std::endian::native == std::endian::little, "endi answers 'l'");

std::uint16_t swapped(std::uint16_t bits) noexcept { return __builtin_bswap16(bits); }
std::uint32_t swapped(std::uint32_t bits) noexcept { return __builtin_bswap32(bits); }
std::uint64_t swapped(std::uint64_t bits) noexcept { return __builtin_bswap64(bits); }

/** Whether bytes in this order must be exchanged on the host. */
bool needs_swap(char order) noexcept {
    if (order != 'l' && order != 'm') {
        std::fputs("\norder must be 'm' or 'l'!\n", stdout);
        std::exit(1);
    }
    return order == 'm';
}

template <typename Bits>
Bits load(const void* bytes) noexcept {
    Bits bits;
    std::memcpy(&bits, bytes, sizeof bits);
    return bits;
}

template <typename Bits>
Bits read_bits(const void* bytes, char order) noexcept {
    const Bits bits = load<Bits>(bytes);
    return needs_swap(order) ? swapped(bits) : bits;
}

template <typename Bits>
void write_bits(Bits bits, void* bytes, char order) noexcept {
    if (needs_swap(order)) bits = swapped(bits);
    std::memcpy(bytes, &bits, sizeof bits);
}

template <typename Bits>
[[gnu::always_inline]] inline void swap_each(void* buffer, std::int64_t count) noexcept {
    auto* const bytes = static_cast<unsigned char*>(buffer);
    for (std::int64_t i = 0; i < count; ++i) {
        unsigned char* const element = bytes + i * static_cast<std::int64_t>(sizeof(Bits));
        const Bits bits = swapped(load<Bits>(element));
        std::memcpy(element, &bits, sizeof bits);
    }
}

#if defined(__x86_64__)
// The byte shuffles that make these loops fast came after the processors' common base.
template <typename Bits>
[[gnu::target("avx2")]] void swap_each_avx2(void* buffer, std::int64_t count) noexcept {
    swap_each<Bits>(buffer, count);
}
#endif
template <typename Bits>
void swap_all(void* buffer, std::int64_t count) noexcept {
#if defined(__x86_64__)
    if (quo::processor_level() >= quo::ProcessorLevel::kAvx2) return swap_each_avx2<Bits>(buffer, count);
#endif
    swap_each<Bits>(buffer, count);
}

// High words of a double and words of a float.
constexpr std::uint32_t kDoubleExponent = 0x7FF00000, kDoubleHighFraction = 0x000FFFFF;
constexpr std::uint32_t kFloatMagnitude = 0x7FFFFFFF, kFloatInfinity = 0x7F800000, kLargestFloat = 0x7F7FFFFF;

std::uint32_t high_word(double x) noexcept {
    return static_cast<std::uint32_t>(std::bit_cast<std::uint64_t>(x) >> 32);
}
bool has_full_exponent(double x) noexcept { return (high_word(x) & kDoubleExponent) == kDoubleExponent; }
bool has_high_fraction(double x) noexcept { return (high_word(x) & kDoubleHighFraction) != 0; }
std::uint32_t magnitude(float x) noexcept { return std::bit_cast<std::uint32_t>(x) & kFloatMagnitude; }

}  // namespace

extern "C" {

char endi() noexcept { return 'l'; }
std::uint16_t bsw2b(std::uint16_t value) noexcept { return swapped(value); }

std::uint16_t ch2uint2(const void* bytes, char order) noexcept { return read_bits<std::uint16_t>(bytes, order); }
std::uint32_t ch2uint4(const void* bytes, char order) noexcept { return read_bits<std::uint32_t>(bytes, order); }
std::int16_t ch2int2(const void* bytes, char order) noexcept {
    return static_cast<std::int16_t>(ch2uint2(bytes, order));
}
std::int32_t ch2int4(const void* bytes, char order) noexcept {
    return static_cast<std::int32_t>(ch2uint4(bytes, order));
}
std::int32_t ch2long4(const void* bytes, char order) noexcept { return ch2int4(bytes, order); }
float ch2float4(const void* bytes, char order) noexcept {
    return std::bit_cast<float>(read_bits<std::uint32_t>(bytes, order));
}
double ch2double8(const void* bytes, char order) noexcept {
    return std::bit_cast<double>(read_bits<std::uint64_t>(bytes, order));
}

void float2ch(float value, void* bytes, char order) noexcept {
    write_bits(std::bit_cast<std::uint32_t>(value), bytes, order);
}
void long2ch(std::int32_t value, void* bytes, char order) noexcept {
    write_bits(static_cast<std::uint32_t>(value), bytes, order);
}
void short2ch(std::int16_t value, void* bytes, char order) noexcept {
    write_bits(static_cast<std::uint16_t>(value), bytes, order);
}

void swp2(void* buffer, std::int64_t count) noexcept { swap_all<std::uint16_t>(buffer, count); }
void swp4(void* buffer, std::int64_t count) noexcept { swap_all<std::uint32_t>(buffer, count); }
void swp8(void* buffer, std::int64_t count) noexcept { swap_all<std::uint64_t>(buffer, count); }

void swp_any(void* buffer, std::int64_t length_in_bytes, int element_size) noexcept {
    if (element_size <= 0 || element_size % 2 != 0) return;
    auto* element = static_cast<unsigned char*>(buffer);
    for (std::int64_t left = length_in_bytes; left >= element_size; left -= element_size) {
        std::reverse(element, element + element_size);
        element += element_size;
    }
}

int get_endian(void* buffer, std::int64_t count, int element_size, int swap) noexcept {
    if (swap == 0 || element_size == 1) return 0;
    switch (element_size) {
        case 2:
            swp2(buffer, count);
            return 0;
        case 4:
            swp4(buffer, count);
            return 0;
        case 8:
            swp8(buffer, count);
            return 0;
        case 16:
            swp_any(buffer, count, 16);  // takes a length in bytes, so that count / 16 elements are swapped
            return 0;
        default:
            return -1;
    }
}

int myisinf(double x) noexcept { return has_full_exponent(x) && !has_high_fraction(x); }
int myisnan(double x) noexcept { return has_full_exponent(x) && has_high_fraction(x); }
int myfinite(double x) noexcept { return !has_full_exponent(x); }

int myisinf4(float x) noexcept { return magnitude(x) == kFloatInfinity || magnitude(x) == kLargestFloat; }
int myisnan4(float x) noexcept { return magnitude(x) > kFloatInfinity; }
int myfinite4(float x) noexcept { return magnitude(x) < kLargestFloat; }

}  // extern "C"
