// SPDX-License-Identifier: Apache-2.0
#include "quo_base/profile.h"
#include "support/diagnostics.h"
#include "support/failing_memory.h"

namespace {

TEST(ProfileMemory, TellsGrowthFromAFirstAllocation) {
    constexpr const char* kMessages[] = {"Memory allocation failure\n", "Memory re-allocation failure\n"};
    static const int values[5000] = {};
    for (const int room : {0, 1})
        EXPECT_EXIT((GetSetProfileChar(1, "s", "k", "", "/nowhere/a.par"), test::refuse_memory(room),
                     WriteMyProfileIntArray("s", "k", values, 5000, "/nowhere/a.par")),
                    testing::ExitedWithCode(1), testing::Eq(kMessages[room]));
}

/** A name of four bytes that no other number has. */
std::string short_name(unsigned number) {
    std::string name = "    ";
    for (char& c : name) c = static_cast<char>('^' + (number >> 5 * (&c - name.data())) % 32);
    return name;
}

// A file of a hundred megabytes took 1.8 to 2.4 gigabytes: a list node, two strings and two hash entries for each
// short line. The worst moment is looked for at lengths where the tables have just grown, and such where they are
// full.
TEST(ProfileSize, IsLessThanEightTimesTheFile) {
    using Line = std::string (*)(unsigned number);
    constexpr Line kLines[] = {[](unsigned i) { return "key" + std::to_string(i) + "=1\n"; },
                               [](unsigned i) { return short_name(i) + "=\n"; },
                               [](unsigned) { return std::string{"a=\n"}; },
                               [](unsigned i) { return "[" + short_name(i) + "]\n"; },
                               [](unsigned) { return std::string{"[]\n"}; },
                               [](unsigned i) { return "[" + short_name(i) + "]\na=\n"; }};
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    for (const Line line : kLines)
        for (const unsigned lines : {200000U, 260000U, 340000U}) {
            std::string text = "[s]\n";
            for (unsigned i = 0; i < lines; ++i) text += line(i);
            test::write_text(path, text);
            test::watch_memory();
            GetSetProfileChar(1, "t", "k", "v", path.c_str());
            SyncProfile(path.c_str());
            EXPECT_LT(static_cast<double>(test::most_memory()) / static_cast<double>(text.size()), 8.0)
                << lines << " times " << line(17);
            FreeProfile(path.c_str());
        }
}

}  // namespace
