// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/bounded_text.h"

#include "support/prelude.h"

namespace {

// Characters of one to four bytes, cut at every byte, with nothing written behind the room.
TEST(CopyBounded, CutsBetweenCharactersAtEveryRoom) {
    const std::string text = "m\u00b2 \u20ac\U0001F6F0 W\u00fcste";
    for (std::size_t room = 0; room <= text.size() + 2; ++room) {
        SCOPED_TRACE(room);
        std::size_t kept = room == 0 ? 0 : std::min(text.size(), room - 1);
        while (kept < text.size() && (static_cast<unsigned char>(text[kept]) & 0xC0) == 0x80) --kept;
        const std::string end = room == 0 ? "" : std::string(1, '\0');
        for (const bool formats : {false, true}) {
            std::string to(40, '#');
            EXPECT_EQ(formats ? quo::format_bounded(to.data(), room, "%s", text.c_str())
                              : quo::copy_bounded(to.data(), room, text),
                      kept);
            EXPECT_EQ(to.substr(0, kept + end.size()), text.substr(0, kept) + end);
            EXPECT_EQ(to.substr(room), std::string(40 - room, '#'));
        }
    }
}

// Latin-1 texts lost a letter of theirs that looks like the begin of a UTF-8 character.
TEST(CopyBounded, CutsTextThatIsNoUtf8AtItsRoom) {
    for (const char* text : {"\x80\x81\x82\x83\x84\x85\x86", "Caf\xE9 noir", "abc\xE9\xE9z", "abcd\xC3",
                             "abcd\xC0\x80", "abcd\xF9\x80\x80\x80"}) {
        char to[6];
        EXPECT_EQ(quo::copy_bounded(to, text), 5U);
        EXPECT_EQ(std::string{to}, std::string(text, 5));
    }
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
