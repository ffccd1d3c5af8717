// SPDX-License-Identifier: Apache-2.0
#include "quo_base/debugIO.h"

#include "support/diagnostics.h"

namespace {

// Three words in the machine's byte order, then the elements as they are.
TEST(WriteDebug, WritesThreeWordsAndTheElements) {
    constexpr std::int32_t kDumps[][4] = {{0, 3, 7, 84},  {1, 3, 7, 168}, {2, 1, 1, 8}, {3, 2, 5, 160},
                                          {4, 11, 3, 66}, {5, 13, 1, 13}, {3, 0, 5, 0}};  // the last: bytes
    const test::Report report;
    const std::string file = report.file("dump.bin");
    for (const auto& dump : kDumps) {
        std::string data;
        for (int i = 0; i < dump[3]; ++i) data += static_cast<char>(i * 37 + 1);
        ASSERT_EQ(write_debug(file.c_str(), data.data(), dump[0], dump[1], dump[2]), 0);
        EXPECT_EQ(test::read_text(file), std::string(reinterpret_cast<const char*>(dump), 12) + data) << dump[0];
    }
    EXPECT_TRUE(report.entries().empty());
}

TEST(WriteDebug, RefusesWithItsStatusAndAnEntry) {
    struct Row {
        const char* file;
        int type, first, status;
        const char* message;  // behind what the system says; empty for any
    };
    for (const Row& row :
         {Row{"/missing/dump.bin", 1, 2, 9, "File not opened!"}, Row{"/dev/full", 1, 2, 5, "File writing failed!"},
          Row{"/dev/null", 6, 2, 1, ""}, Row{"/dev/null", -1, 2, 1, ""}, Row{"/dev/null", 1, -2, 1, ""}}) {
        const test::Report report;
        const test::CapturedStderr silent;
        EXPECT_EQ(write_debug(row.file, "01234567890123456789012345678901", row.type, row.first, 2), row.status);
        ASSERT_FALSE(report.entries("ERROR").empty());
        EXPECT_EQ(report.entries("ERROR")[0].function, "write_debug()");
        EXPECT_TRUE(!*row.message || report.entries("ERROR").back().message == row.message) << row.file;
    }
}

// A stream that nobody can write to used to leave its error number to the next tracked function.
TEST(Waitbar, SpeaksItsLinesCutsALongTitleAndLeavesNoErrorBehind) {
    test::CapturedStderr captured;
    EXPECT_EQ(waitbar_open("Focusing 100%s"), 0);
    for (const float share : {0.5F, -1.0F / 3.0F, std::numeric_limits<float>::max()})
        EXPECT_EQ(waitbar_update(share), 0);
    EXPECT_EQ(waitbar_close() + waitbar_open(std::string(5000, 'x').c_str()), 0);
    const int kept = dup(STDERR_FILENO);
    close(STDERR_FILENO);
    errno = 0;
    EXPECT_EQ(waitbar_open("Focusing") + waitbar_update(0.5F) + waitbar_close(), 0);
    EXPECT_EQ(errno, 0);
    dup2(kept, STDERR_FILENO);
    close(kept);
    std::clearerr(stderr);
    EXPECT_EQ(captured.text(),
              "USE_WAITBAR\nSET_TITLE: Focusing 100%s\nSET_WAITBAR: 0.500000 \nSET_WAITBAR: -0.333333 \n"
              "SET_WAITBAR: 340282346638528859811704183484516925440.000000 \nCLOSE_WAITBAR\n"
              "USE_WAITBAR\nSET_TITLE: " +
                  std::string(499, 'x') + "\n");
}

}  // namespace
