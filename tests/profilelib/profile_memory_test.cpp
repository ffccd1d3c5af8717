#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <string>
#include <string_view>

#include "failing_new.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

/** A call, and whether it did what it is for. */
struct Call {
    const char* name;
    bool (*run)(const char* file);
};
const std::string long_name(99, 'n');

bool read_key(const char* file) {
    const char* const value = GetSetProfileChar(0, "s", "k", nullptr, file);
    return value && value == std::string_view{"2"};
}
bool change_key(const char* file) {
    return GetSetProfileChar(1, "s", "k", long_name.c_str(), file) == std::string_view{long_name};
}
bool add_section(const char* file) {
    return GetSetProfileChar(1, long_name.c_str(), "k", "v", file) == std::string_view{"v"};
}
bool write_back(const char* file) { return read_key(file) && SyncProfile(file) == 0; }
bool write_long_list(const char* file) {
    static const int values[5000] = {};
    return WriteMyProfileIntArray("s", "k", values, 5000, file) == 0;
}
constexpr Call kCalls[] = {
    {"Read", read_key},
    {"Change", change_key},
    {"AddSection", add_section},
    {"WriteBack", write_back},
    {"WriteLongList", write_long_list},
};
class ProfileMemory : public testing::TestWithParam<Call> {};

// The n-th allocation fails, for every n until the call gets through: each time the process ends with the message.
TEST_P(ProfileMemory, EveryFailedAllocationEndsTheProcess) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par"), old = "[s]\n" + std::string(99, 'k') + " = 1\nk = 2\n";
    test::write_text(path, old);

    bool through = false;
    int failures = 0;
    for (; !through && failures < 200 && !HasFailure(); ++failures) {
        EXPECT_EXIT(
            {
                test::allowed_news = failures;
                _exit(GetParam().run(path.c_str()) ? 0 : 2);
            },
            [&](int status) {
                through = testing::ExitedWithCode(0)(status);
                return through || testing::ExitedWithCode(1)(status);
            },
            "^(Memory (re-)?allocation failure\n)?$");
        if (!through) {
            EXPECT_EQ(test::read_text(path), old);
        }
    }
    EXPECT_TRUE(through);
    EXPECT_GT(failures, 3) << "no allocation was seen to fail";
}
INSTANTIATE_TEST_SUITE_P(Calls, ProfileMemory, testing::ValuesIn(kCalls),
                         [](const auto& row) { return std::string{row.param.name}; });

TEST(ProfileMemory, TellsGrowthFromAFirstAllocation) {
    static const int values[5000] = {};
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", path.c_str()), test::allowed_news = 0,
                 WriteMyProfileIntArray("s", "k", values, 5000, path.c_str())),
                testing::ExitedWithCode(1), testing::Eq("Memory allocation failure\n"));
    EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", path.c_str()), test::allowed_news = 1,
                 WriteMyProfileIntArray("s", "k", values, 5000, path.c_str())),
                testing::ExitedWithCode(1), testing::Eq("Memory re-allocation failure\n"));
}

}  // namespace
