// SPDX-License-Identifier: Apache-2.0
#include "quo_base/gen_utils.h"
#include "support/prelude.h"

namespace {

/** Bytes, the most significant first, and the number that they are read as, or written from. */
struct Number {
    std::string bytes;
    double number;
    double (*read)(const void* bytes, char order);
    void (*write)(double number, void* bytes, char order);
};
template <auto kRead>
double reading(const void* bytes, char order) {
    return kRead(bytes, order);
}
template <typename T, auto kWrite>
void writing(double number, void* bytes, char order) {
    kWrite(static_cast<T>(number), bytes, order);
}
const Number kNumbers[] = {
    {"\xC0\x09", 0xC009, reading<ch2uint2>, nullptr},
    {"\xC0\x09", 0xC009 - 0x10000, reading<ch2int2>, writing<std::int16_t, short2ch>},
    {"\xC0\x09\x21\xFB", 0xC00921FB, reading<ch2uint4>, nullptr},
    {"\xC0\x09\x21\xFB", 0xC00921FB - 4294967296.0, reading<ch2int4>, writing<std::int32_t, long2ch>},
    {"\xC0\x09\x21\xFB", 0xC00921FB - 4294967296.0, reading<ch2long4>, nullptr},
    {"\xC0\x49\x0F\xDB", -3.14159274F, reading<ch2float4>, writing<float, float2ch>},
    {"\xC0\x09\x21\xFB\x54\x44\x2D\x18", -3.141592653589793, ch2double8, nullptr},
};

TEST(ByteOrderDeathTest, IsThatOfTheCodeAtAnyAddressAndNoOtherCodeLives) {
    for (const Number& row : kNumbers) {
        SCOPED_TRACE(&row - kNumbers);
        std::string bytes = "#" + row.bytes + "#", written(bytes.size(), '#');
        for (const char order : {'m', 'l'}) {
            if (order == 'l') std::reverse(bytes.begin(), bytes.end());
            EXPECT_EQ(row.read(bytes.data() + 1, order), row.number);
            if (row.write) row.write(row.number, written.data() + 1, order);
            EXPECT_TRUE(!row.write || written == bytes) << order;
        }
        // The message goes to the standard output.
        constexpr const char* kMessage = "^\norder must be 'm' or 'l'!\n$";
        EXPECT_EXIT((dup2(STDERR_FILENO, STDOUT_FILENO), row.read(bytes.data(), 'M')), testing::ExitedWithCode(1),
                    kMessage);
        if (row.write) {
            EXPECT_EXIT((dup2(STDERR_FILENO, STDOUT_FILENO), row.write(1.0, bytes.data(), '\0')),
                        testing::ExitedWithCode(1), kMessage);
        }
    }
    EXPECT_EQ(endi(), std::endian::native == std::endian::little ? 'l' : 'm');
    EXPECT_EQ(bsw2b(0x12FE), 0xFE12);
}

/** Swaps at an odd address: the first so many elements of so many bytes are reversed, and nothing else. */
template <typename Swap>
void expect_reversed(std::size_t count, std::size_t size, Swap swap) {
    SCOPED_TRACE(testing::Message() << count << " elements of " << size);
    std::vector<unsigned char> bytes(1 + count * size + 40);
    std::iota(bytes.begin(), bytes.end(), static_cast<unsigned char>(17));
    auto expected = bytes;
    for (auto at = expected.begin() + 1; count > 0; --count) {
        const auto end = at + static_cast<std::ptrdiff_t>(size);
        std::reverse(at, end);
        at = end;
    }
    swap(bytes.data() + 1);
    EXPECT_EQ(bytes, expected);
}

// Every count up to a few vectors' width; sizes that are not swapped; and lengths that count bytes: for swp_any,
// and for elements of 16 bytes.
TEST(Swap, ReversesEachElementAndNothingElse) {
    for (const int size : {2, 4, 8})
        for (std::size_t count = 0; count <= 70; ++count)
            expect_reversed(count, static_cast<std::size_t>(size), [&](void* bytes) {
                EXPECT_EQ(get_endian(bytes, static_cast<std::int64_t>(count), size, -1), 0);
                EXPECT_EQ(get_endian(bytes, -3, size, 1), 0);
            });
    struct Case {
        int length, size;
        std::size_t swapped;
        int swap = 1, result = 0;
    };
    for (const Case& row : {Case{5, 1, 0}, Case{5, 4, 0, 0}, Case{5, 3, 0, 0}, Case{5, 3, 0, 1, -1},
                            Case{5, -4, 0, 1, -1}, Case{33, 16, 2}})
        expect_reversed(row.swapped, static_cast<std::size_t>(std::max(row.size, 0)), [&](void* bytes) {
            EXPECT_EQ(get_endian(bytes, row.length, row.size, row.swap), row.result);
        });
    for (const Case& row : {Case{40, 16, 2}, Case{24, 6, 4}, Case{7, 2, 3}, Case{-16, 4, 0}, Case{48, 5, 0},
                            Case{48, -2, 0}, Case{48, 0, 0}})
        expect_reversed(row.swapped, static_cast<std::size_t>(std::max(row.size, 0)),
                        [&](void* bytes) { swp_any(bytes, row.length, row.size); });
}

/** The class that a number is given: f, i or n for finite, infinite or not-a-number; else none or several. */
char class_of(double x) { return "?fi?n???"[myfinite(x) + 2 * myisinf(x) + 4 * myisnan(x)]; }
char class_of(float x) { return "?fi?n???"[myfinite4(x) + 2 * myisinf4(x) + 4 * myisnan4(x)]; }

// Of a double the high word counts alone: some that are no numbers say infinity. The largest float does, too.
TEST(NumberClass, LooksAtTheHighWordAndTakesTheLargestFloatForInfinite) {
    std::string doubles, floats;
    for (const std::uint64_t bits : {0x1UL, 0xFFEFFFFFFFFFFFFFUL, 0x7FF0000000000000UL, 0xFFF0000000000000UL,
                                     0x7FF0000000000001UL, 0xFFF00000FFFFFFFFUL, 0x7FF0000100000000UL})
        doubles += class_of(std::bit_cast<double>(bits));
    EXPECT_EQ(doubles, "ffiiiin");
    for (const std::uint32_t bits :
         {0x80000001U, 0x7F7FFFFEU, 0x7F7FFFFFU, 0xFF7FFFFFU, 0x7F800000U, 0xFF800000U, 0x7F800001U, 0xFFC00000U})
        floats += class_of(std::bit_cast<float>(bits));
    EXPECT_EQ(floats, "ffiiiinn");
}

}  // namespace
