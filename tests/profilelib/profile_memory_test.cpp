#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <new>
#include <string>

#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

/** How many allocations still succeed; none is counted while negative. */
long allowed = -1;

}  // namespace

void* operator new(std::size_t size) {
    if (allowed == 0) throw std::bad_alloc{};
    if (allowed > 0) --allowed;
    if (void* const block = std::malloc(size)) return block;
    throw std::bad_alloc{};
}
// Not inlined: the compiler would take free() for the wrong partner of new.
[[gnu::noinline]] void operator delete(void* block) noexcept { std::free(block); }
[[gnu::noinline]] void operator delete(void* block, std::size_t) noexcept { std::free(block); }

namespace {

struct Call {
    const char* name;
    void (*run)(const char* file);
};
const std::string long_name(99, 'n');

void read_key(const char* file) { GetSetProfileChar(0, "s", "k", nullptr, file); }
void change_key(const char* file) { GetSetProfileChar(1, "s", "k", long_name.c_str(), file); }
void add_section(const char* file) { GetSetProfileChar(1, long_name.c_str(), "k", "v", file); }
void write_back(const char* file) {
    GetSetProfileChar(1, "s", "j", "v", file);
    SyncProfile(file);
}
void write_long_list(const char* file) {
    static const int values[5000] = {};
    WriteMyProfileIntArray("s", "k", values, 5000, file);
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
                allowed = failures;
                GetParam().run(path.c_str());
                _exit(0);
            },
            [&](int status) {
                through = testing::ExitedWithCode(0)(status);
                return through || testing::ExitedWithCode(1)(status);
            },
            testing::AnyOf("", "Memory allocation failure\n", "Memory re-allocation failure\n"));
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
    EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", path.c_str()), allowed = 0,
                 WriteMyProfileIntArray("s", "k", values, 5000, path.c_str())),
                testing::ExitedWithCode(1), testing::Eq("Memory allocation failure\n"));
    EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", path.c_str()), allowed = 1,
                 WriteMyProfileIntArray("s", "k", values, 5000, path.c_str())),
                testing::ExitedWithCode(1), testing::Eq("Memory re-allocation failure\n"));
}

}  // namespace
