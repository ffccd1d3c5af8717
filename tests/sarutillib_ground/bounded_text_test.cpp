#include "sarutillib/bounded_text.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <string>

namespace {

/** What a cut may leave of a text of whole characters: the longest run of whole ones that fits. */
std::string whole_characters(const std::string& text, std::size_t most) {
    std::size_t length = std::min(text.size(), most);
    while (length < text.size() && (static_cast<unsigned char>(text[length]) & 0xC0) == 0x80) --length;
    return text.substr(0, length);
}

constexpr char kUntouched = '#';

// Characters of one to four bytes, cut at every byte, with nothing written behind the room.
TEST(CopyBounded, CutsBetweenCharactersAtEveryRoom) {
    const std::string text = "m\u00b2 \u20ac\U0001F6F0 W\u00fcste";
    for (std::size_t room = 0; room <= text.size() + 2; ++room) {
        SCOPED_TRACE(room);
        std::array<char, 40> to;
        to.fill(kUntouched);
        const std::size_t length = quo::copy_bounded(to.data(), room, text);
        EXPECT_EQ(std::string(to.data() + room, to.size() - room), std::string(to.size() - room, kUntouched));
        if (room == 0) continue;
        EXPECT_STREQ(to.data(), whole_characters(text, room - 1).c_str());
        EXPECT_EQ(length, std::string{to.data()}.size());

        std::array<char, 40> formatted;
        formatted.fill(kUntouched);
        EXPECT_EQ(quo::format_bounded(formatted.data(), room, "%s", text.c_str()), length);
        EXPECT_STREQ(formatted.data(), to.data());
        EXPECT_EQ(formatted[room], kUntouched);
    }
}

TEST(CopyBounded, KeepsBytesThatAreNoUtf8) {
    char to[6];
    EXPECT_EQ(quo::copy_bounded(to, "\x80\x81\x82\x83\x84\x85\x86"), 5U);
    EXPECT_STREQ(to, "\x80\x81\x82\x83\x84");
}

TEST(CopyBounded, TakesATextThatLiesInsideItsTarget) {
    char to[] = "range_time";
    quo::copy_bounded(to, std::string_view{to + 2, 8});
    EXPECT_STREQ(to, "nge_time");
}

TEST(FormatBounded, LeavesErrnoAlone) {
    char to[16];
    errno = ERANGE;
    EXPECT_EQ(quo::format_bounded(to, sizeof to, "%ls", L"\xDC00"), 0U);  // no character of any encoding
    EXPECT_STREQ(to, "");
    EXPECT_EQ(errno, ERANGE);
    errno = 0;
}

}  // namespace
