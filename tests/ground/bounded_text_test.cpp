#include "sarutillib/ground/bounded_text.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>
#include <utility>

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
        const std::string kept = room == 0 ? "" : whole_characters(text, room - 1);
        const std::string end = room == 0 ? "" : std::string(1, '\0');
        for (const bool formats : {false, true}) {
            std::string to(40, kUntouched);
            EXPECT_EQ(formats ? quo::format_bounded(to.data(), room, "%s", text.c_str())
                              : quo::copy_bounded(to.data(), room, text),
                      kept.size());
            EXPECT_EQ(to.substr(0, kept.size() + end.size()), kept + end);
            EXPECT_EQ(to.substr(room), std::string(40 - room, kUntouched));
        }
    }
}

// Latin-1 texts lost a letter of theirs that looks like the begin of a UTF-8 character.
TEST(CopyBounded, CutsTextThatIsNoUtf8AtItsRoom) {
    for (const char* text : {"\x80\x81\x82\x83\x84\x85\x86",
                             "Stra\xDF"
                             "e",
                             "Caf\xE9 noir", "abc\xE9\xE9z", "abcd\xC3", "abcd\xC0\x80", "abcd\xF9\x80\x80\x80"}) {
        char to[6];
        EXPECT_EQ(quo::copy_bounded(to, text), 5U);
        EXPECT_EQ(std::string{to}, std::string(text, 5));
    }
}

TEST(CopyBounded, TakesATextInsideItsTarget) {
    char inside[] = "range_time";
    quo::copy_bounded(inside, std::string_view{inside + 2, 8});
    EXPECT_STREQ(inside, "nge_time");
}

TEST(FormatBounded, GivesNoTextAndKeepsErrnoWhenItCannotFormat) {
    char to[16];
    errno = ERANGE;
    EXPECT_EQ(quo::format_bounded(to, sizeof to, "%ls", L"\xDC00"), 0U);  // no character of any encoding
    EXPECT_STREQ(to, "");
    EXPECT_EQ(std::exchange(errno, 0), ERANGE);
}

}  // namespace
