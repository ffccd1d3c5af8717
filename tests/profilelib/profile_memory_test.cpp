#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "quo_base/profile.h"
#include "support/diagnostics.h"
#include "support/failing_new.h"

namespace {

int write_long_list(const char* file) {
    static const int values[5000] = {};
    return WriteMyProfileIntArray("s", "k", values, 5000, file);
}

TEST(ProfileMemory, TellsGrowthFromAFirstAllocation) {
    constexpr const char* kMessages[] = {"Memory allocation failure\n", "Memory re-allocation failure\n"};
    for (const int room : {0, 1})
        EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", "/nowhere/a.par"), test::fail_news(room),
                     write_long_list("/nowhere/a.par")),
                    testing::ExitedWithCode(1), testing::Eq(kMessages[room]));
}

/** The line of a file, by its number. */
struct Shape {
    const char* name;
    std::string (*line)(unsigned number);
};
/** A name of four bytes that no other number has. */
std::string short_name(unsigned number) {
    std::string name = "    ";
    for (char& c : name) c = static_cast<char>('^' + (number >> 5 * (&c - name.data())) % 32);
    return name;
}
constexpr Shape kShapes[] = {
    {"NumberedKeys", [](unsigned i) { return "key" + std::to_string(i) + "=1\n"; }},
    {"ShortKeys", [](unsigned i) { return short_name(i) + "=\n"; }},
    {"OneKeyOverAndOver", [](unsigned) { return std::string{"a=\n"}; }},
    {"ShortSections", [](unsigned i) { return "[" + short_name(i) + "]\n"; }},
    {"OneSectionOverAndOver", [](unsigned) { return std::string{"[]\n"}; }},
    {"SectionsOfOneKey", [](unsigned i) { return "[" + short_name(i) + "]\na=\n"; }},
};
class ProfileSize : public testing::TestWithParam<Shape> {};

// A file of a hundred megabytes took 1.8 to 2.4 gigabytes: a list node, two strings and two hash entries for each
// short line. The worst moment is looked for at lengths where the tables have just grown, and such where they are
// full.
TEST_P(ProfileSize, TakesLessThanEightTimesTheFile) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    for (const unsigned lines : {200000U, 260000U, 340000U}) {
        std::string text = "[s]\n";
        for (unsigned i = 0; i < lines; ++i) text += GetParam().line(i);
        test::write_text(path, text);
        test::watch_news();
        GetSetProfileChar(1, "t", "k", "v", path.c_str());
        SyncProfile(path.c_str());
        EXPECT_LT(static_cast<double>(test::most_news()) / static_cast<double>(text.size()), 8.0) << lines;
        FreeProfile(path.c_str());
    }
}
INSTANTIATE_TEST_SUITE_P(Shapes, ProfileSize, testing::ValuesIn(kShapes),
                         [](const auto& row) { return std::string{row.param.name}; });

}  // namespace
