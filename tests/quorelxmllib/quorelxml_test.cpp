// SPDX-License-Identifier: Apache-2.0
#include "header_files.h"
#include "quo_base/quorelxml_v2.h"

namespace {

class Quorelxml : public testing::Test {
protected:
    test::TemporaryFolder folder_;
    const std::string new_file_ = folder_.file("new.xml");
};

// The choice of all documents, and that of one, which rules where it was made.
TEST_F(Quorelxml, ReadsFifteenDigitsBackOrAllOfThem) {
    using Limits = std::numeric_limits<double>;
    const double values[] = {1.0 / 3.0, 803457.318291746, -0.0, 5e-324, Limits::max(), Limits::infinity()};
    for (const bool all : {false, true})
        for (const int own : {-1, 0, 1}) {
            quorelxml::setExactNumbers(all);
            quorelxml document{new_file_.c_str()};
            if (own >= 0) document.useExactNumbers(own == 1);
            double back[6] = {};
            EXPECT_EQ(document.writeDouble(1, "a", values, 6) + document.write(), 0);
            EXPECT_EQ(quorelxml{new_file_.c_str()}.readDouble(1, "a", back, 6), 0);
            for (int i = 0; i < 6; ++i) {
                char rounded[40];
                std::snprintf(rounded, sizeof rounded, "%.15g", values[i]);
                EXPECT_EQ(back[i], own == 1 || (own < 0 && all) ? values[i] : std::strtod(rounded, nullptr));
                EXPECT_EQ(std::signbit(back[i]), std::signbit(values[i]));
            }
        }
    quorelxml::setExactNumbers(false);
}

TEST_F(Quorelxml, KeepsEveryTextThatXmlCanHold) {
    std::vector<std::string> texts{"", " ", "  blanks around  ", "a\rb\nc\td", "]]>&amp;<x/>", "\xE2\x82\xAC"};
    for (int code = 1; code < 128; ++code)
        if (code >= 32 || std::strchr("\t\n\r", code)) texts.emplace_back(3, static_cast<char>(code));
    std::vector<const char*> places;
    for (const std::string& text : texts) places.push_back(text.c_str());
    std::vector<std::array<char, 64>> room(texts.size());
    std::vector<char*> buffers;
    for (auto& buffer : room) buffers.push_back(buffer.data());
    const int count = static_cast<int>(texts.size());
    quorelxml document{new_file_.c_str()};
    EXPECT_EQ(document.writeString(1, "Sec/t", places.data(), count) + document.write(), 0);
    quorelxml back{new_file_.c_str()};
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), count + 1), 1) << "texts are all there or not read";
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), 3, 3), 0);
    EXPECT_STREQ(buffers[2], "  ");
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), count), 0);
    EXPECT_EQ((std::vector<std::string>{buffers.begin(), buffers.end()}), texts);
}

}  // namespace
