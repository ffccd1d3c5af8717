#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <bit>
#include <cstdint>
#include <numeric>
#include <string>
#include <utility>
#include <vector>

#include "quo_base/gen_utils.h"

namespace {

using Bytes = std::vector<unsigned char>;

/** Different bytes all along, none of them symmetric under an exchange. */
Bytes ramp(std::size_t size) {
    Bytes bytes(size);
    std::iota(bytes.begin(), bytes.end(), static_cast<unsigned char>(17));
    return bytes;
}

/** The first `count` elements after `offset`, each reversed. */
Bytes reversed(Bytes bytes, std::size_t offset, std::size_t count, std::size_t size) {
    for (std::size_t i = 0; i < count; ++i) {
        const auto element = bytes.begin() + static_cast<std::ptrdiff_t>(offset + i * size);
        std::reverse(element, element + static_cast<std::ptrdiff_t>(size));
    }
    return bytes;
}

TEST(ByteOrder, ReadsNumbersAtAnyAddressInBothOrders) {
    const unsigned char b[] = {0x00, 0xC0, 0x09, 0x21, 0xFB, 0x54, 0x44, 0x2D, 0x18};  // at 1: -3.1415926535897931
    EXPECT_EQ(ch2double8(b + 1, 'm'), -3.141592653589793);
    EXPECT_EQ(ch2uint2(b + 1, 'm'), 0xC009);
    EXPECT_EQ(ch2uint2(b + 1, 'l'), 0x09C0);
    EXPECT_EQ(ch2int2(b + 1, 'm'), 0xC009 - 0x10000);
    EXPECT_EQ(ch2uint4(b + 1, 'm'), 0xC00921FB);
    EXPECT_EQ(ch2uint4(b + 1, 'l'), 0xFB2109C0);
    EXPECT_EQ(ch2int4(b + 1, 'l'), static_cast<std::int64_t>(0xFB2109C0) - 0x100000000);
    EXPECT_EQ(ch2long4(b + 1, 'm'), static_cast<std::int64_t>(0xC00921FB) - 0x100000000);
    const unsigned char f[] = {0xDB, 0x0F, 0x49, 0xC0};
    EXPECT_EQ(ch2float4(f, 'l'), -3.14159274F);
    const unsigned char d[] = {0x18, 0x2D, 0x44, 0x54, 0xFB, 0x21, 0x09, 0x40};
    EXPECT_EQ(ch2double8(d, 'l'), 3.141592653589793);
    EXPECT_EQ(endi(), std::endian::native == std::endian::little ? 'l' : 'm');
    EXPECT_EQ(bsw2b(0x12FE), 0xFE12);
}

TEST(ByteOrder, WritesNumbersInBothOrders) {
    const auto written = [](auto writer, auto value, char order) {
        Bytes bytes(7, 0xEE);
        writer(value, bytes.data() + 1, order);
        return bytes;
    };
    EXPECT_EQ(written(float2ch, -3.14159274F, 'm'), (Bytes{0xEE, 0xC0, 0x49, 0x0F, 0xDB, 0xEE, 0xEE}));
    EXPECT_EQ(written(float2ch, -3.14159274F, 'l'), (Bytes{0xEE, 0xDB, 0x0F, 0x49, 0xC0, 0xEE, 0xEE}));
    EXPECT_EQ(written(long2ch, -5478, 'm'), (Bytes{0xEE, 0xFF, 0xFF, 0xEA, 0x9A, 0xEE, 0xEE}));
    EXPECT_EQ(written(long2ch, 5478, 'l'), (Bytes{0xEE, 0x66, 0x15, 0x00, 0x00, 0xEE, 0xEE}));
    EXPECT_EQ(written(short2ch, std::int16_t{-2}, 'm'), (Bytes{0xEE, 0xFF, 0xFE, 0xEE, 0xEE, 0xEE, 0xEE}));
    EXPECT_EQ(written(short2ch, std::int16_t{258}, 'l'), (Bytes{0xEE, 0x02, 0x01, 0xEE, 0xEE, 0xEE, 0xEE}));
}

TEST(ByteOrderDeathTest, EndsTheProcessOnAnyOtherCode) {
    unsigned char bytes[8] = {};
    const auto dies = [](auto call) {
        // The message goes to the standard output.
        EXPECT_EXIT((dup2(STDERR_FILENO, STDOUT_FILENO), call()), testing::ExitedWithCode(1),
                    "^\norder must be 'm' or 'l'!\n$");
    };
    dies([&] { ch2uint2(bytes, 'b'); });
    dies([&] { ch2int4(bytes, 'M'); });
    dies([&] { ch2float4(bytes, '\0'); });
    dies([&] { ch2double8(bytes, 'L'); });
    dies([&] { float2ch(1.0F, bytes, 'x'); });
    dies([&] { long2ch(1, bytes, ' '); });
    dies([&] { short2ch(1, bytes, '1'); });
}

// Every count up to a few vectors' width, at an odd address, with bytes before and behind that stay.
TEST(Swap, ReversesEachElementAndNothingElse) {
    struct Swapper {
        std::size_t size;
        void (*swap)(void*, std::int64_t);
    };
    for (const auto [size, swap] : {Swapper{2, swp2}, Swapper{4, swp4}, Swapper{8, swp8}})
        for (std::size_t count = 0; count <= 70; ++count) {
            const Bytes before = ramp(1 + size * count + 8);
            Bytes bytes = before;
            swap(bytes.data() + 1, static_cast<std::int64_t>(count));
            swap(bytes.data() + 1, -3);
            EXPECT_EQ(bytes, reversed(before, 1, count, size)) << count << " elements of " << size;
        }
}

/** Elements of `size` bytes, and how many are swapped. For swp_any the length counts bytes. */
struct Case {
    int length, size;
    std::size_t swapped;
    int swap = 1, result = 0;
};

TEST(SwapAny, TakesWholeElementsOfEvenSize) {
    for (const auto [length, size, swapped, swap, result] :
         {Case{48, 16, 3}, Case{40, 16, 2}, Case{15, 16, 0}, Case{24, 6, 4}, Case{7, 2, 3}, Case{-16, 4, 0},
          Case{48, 5, 0}, Case{48, -2, 0}, Case{48, 0, 0}, Case{48, 48, 1}}) {
        Bytes bytes = ramp(50);
        swp_any(bytes.data() + 1, length, size);
        EXPECT_EQ(bytes, reversed(ramp(50), 1, swapped, static_cast<std::size_t>(std::max(size, 0)))) << length;
    }
}

// The count of 16-byte elements is taken for bytes: 33 hold two of them, and 5 none.
TEST(GetEndian, SwapsByElementSize) {
    for (const auto [count, size, swapped, swap, result] :
         {Case{5, 2, 5}, Case{5, 4, 5, -1}, Case{5, 8, 5}, Case{5, 1, 0}, Case{5, 4, 0, 0}, Case{5, 3, 0, 0},
          Case{5, 3, 0, 1, -1}, Case{5, 32, 0, 1, -1}, Case{5, -4, 0, 1, -1}, Case{5, 16, 0}, Case{33, 16, 2}}) {
        Bytes bytes = ramp(600);
        EXPECT_EQ(get_endian(bytes.data(), count, size, swap), result);
        EXPECT_EQ(bytes, reversed(ramp(600), 0, swapped, static_cast<std::size_t>(std::max(size, 0)))) << size;
    }
}

/** The class that a number is given: f, i or n for finite, infinite or not-a-number; else none or several. */
char class_of(double x) { return "?fi?n???"[myfinite(x) + 2 * myisinf(x) + 4 * myisnan(x)]; }
char class_of(float x) { return "?fi?n???"[myfinite4(x) + 2 * myisinf4(x) + 4 * myisnan4(x)]; }

using Double = std::pair<std::uint64_t, char>;
using Float = std::pair<std::uint32_t, char>;

TEST(NumberClass, OfADoubleLooksAtTheHighWordOnly) {
    for (const auto& [bits, number_class] :
         {Double{1, 'f'}, Double{0x400921FB54442D18, 'f'}, Double{0xFFEFFFFFFFFFFFFF, 'f'},
          Double{0x7FF0000000000000, 'i'}, Double{0xFFF0000000000000, 'i'}, Double{0xFFF8000000000000, 'n'},
          Double{0x7FF0000100000000, 'n'},
          // These are no numbers, but their high words say infinity.
          Double{0x7FF0000000000001, 'i'}, Double{0xFFF00000FFFFFFFF, 'i'}})
        EXPECT_EQ(class_of(std::bit_cast<double>(bits)), number_class) << std::hex << bits;
}

TEST(NumberClass, OfAFloatTakesTheLargestForInfinite) {
    for (const auto& [bits, number_class] :
         {Float{0x80000001, 'f'}, Float{0x40490FDB, 'f'}, Float{0x7F7FFFFE, 'f'}, Float{0xFF7FFFFE, 'f'},
          Float{0x7F800000, 'i'}, Float{0xFF800000, 'i'}, Float{0x7F7FFFFF, 'i'}, Float{0xFF7FFFFF, 'i'},
          Float{0x7F800001, 'n'}, Float{0xFFC00000, 'n'}})
        EXPECT_EQ(class_of(std::bit_cast<float>(bits)), number_class) << std::hex << bits;
}

}  // namespace
