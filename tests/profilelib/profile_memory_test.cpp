#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <string>
#include <string_view>

#include "quo_base/profile.h"
#include "support/diagnostics.h"
#include "support/failing_new.h"

namespace {

const std::string long_name(99, 'n');

bool reads(const char* file, std::string_view value) {
    const char* const found = GetSetProfileChar(0, "s", "k", nullptr, file);
    return found && found == value;
}
int write_long_list(const char* file) {
    static const int values[5000] = {};
    return WriteMyProfileIntArray("s", "k", values, 5000, file);
}

/** A call, and whether it did what it is for. */
struct Call {
    const char* name;
    bool (*run)(const char* file);
};
constexpr Call kCalls[] = {
    {"Read", [](const char* file) { return reads(file, "2"); }},
    {"Change",
     [](const char* file) {
         return GetSetProfileChar(1, "s", "k", long_name.c_str(), file) && reads(file, long_name);
     }},
    {"AddSection",
     [](const char* file) {
         return GetSetProfileChar(1, long_name.c_str(), "k", "v", file) == std::string_view{"v"};
     }},
    {"WriteBack", [](const char* file) { return reads(file, "2") && SyncProfile(file) == 0; }},
    {"WriteLongList", [](const char* file) { return write_long_list(file) == 0; }},
};
class ProfileMemory : public testing::TestWithParam<Call> {};

// The n-th allocation fails, for every n until the call gets through: each time the process ends with the message.
TEST_P(ProfileMemory, EveryFailedAllocationEndsTheProcess) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par"), old = "[s]\n" + std::string(99, 'k') + " = 1\nk = 2\n";
    test::write_text(path, old);
    bool through = false;
    int room = 0;
    for (; !through && room < 200 && !HasFailure(); ++room) {
        EXPECT_EXIT((test::fail_news(room), _exit(GetParam().run(path.c_str()) ? 0 : 2)),
                    [&](int status) {
                        through = testing::ExitedWithCode(0)(status);
                        return through || testing::ExitedWithCode(1)(status);
                    },
                    "^(Memory (re-)?allocation failure\n)?$");
        EXPECT_TRUE(through || test::read_text(path) == old);
    }
    EXPECT_TRUE(through);
    EXPECT_GT(room, 3) << "no allocation was seen to fail";
}
INSTANTIATE_TEST_SUITE_P(Calls, ProfileMemory, testing::ValuesIn(kCalls),
                         [](const auto& row) { return std::string{row.param.name}; });

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
