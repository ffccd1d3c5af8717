#include "quo_base/debugIO.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <limits>
#include <string>

#include "support/diagnostics.h"

namespace {

struct Dump {
    const char* name;
    int type, first, second;
    std::size_t bytes;
};
constexpr Dump kDumps[] = {
    {"Float32", 0, 3, 7, 84},        {"Float64", 1, 3, 7, 168}, {"FloatComplex", 2, 1, 1, 8},
    {"DoubleComplex", 3, 2, 5, 160}, {"Int16", 4, 11, 3, 66},   {"Int8", 5, 13, 1, 13},
    {"Empty", 3, 0, 5, 0},
};
class WriteDebug : public testing::TestWithParam<Dump> {};

TEST_P(WriteDebug, WritesThreeWordsAndTheElements) {
    const test::Report report;
    const Dump& dump = GetParam();
    std::string data;
    for (std::size_t i = 0; i < dump.bytes; ++i) data += static_cast<char>(i * 37 + 1);
    const std::string file = report.file("dump.bin");
    ASSERT_EQ(write_debug(file.c_str(), data.data(), dump.type, dump.first, dump.second), 0);

    const std::string text = test::read_text(file);
    ASSERT_EQ(text.size(), 12 + dump.bytes);
    int32_t words[3];
    std::memcpy(words, text.data(), sizeof words);
    EXPECT_EQ(words[0], dump.type);
    EXPECT_EQ(words[1], dump.first);
    EXPECT_EQ(words[2], dump.second);
    EXPECT_EQ(text.substr(12), data);
    EXPECT_TRUE(report.entries().empty());
}
INSTANTIATE_TEST_SUITE_P(Types, WriteDebug, testing::ValuesIn(kDumps),
                         [](const auto& row) { return row.param.name; });

struct Refusal {
    const char* name;
    const char* file;  // under the test's folder unless it starts with a slash
    int type, first, second, status;
    const char* message;
};
constexpr Refusal kRefusals[] = {
    {"NoFolder", "missing/dump.bin", 1, 2, 2, 9, "File not opened!"},
    {"FullDisk", "/dev/full", 1, 2, 2, 5, "File writing failed!"},
    {"UnknownType", "dump.bin", 6, 2, 2, 1, nullptr},
    {"NegativeType", "dump.bin", -1, 2, 2, 1, nullptr},
    {"NegativeDimension", "dump.bin", 1, -2, 2, 1, nullptr},
};
class WriteDebugRefuses : public testing::TestWithParam<Refusal> {};

TEST_P(WriteDebugRefuses, WithItsStatusAndAnEntry) {
    const Refusal& refusal = GetParam();
    const test::Report report;
    const test::CapturedStderr silent;
    const double data[4] = {1, 2, 3, 4};
    const std::string file = refusal.file[0] == '/' ? refusal.file : report.file(refusal.file);
    EXPECT_EQ(write_debug(file.c_str(), data, refusal.type, refusal.first, refusal.second), refusal.status);
    const auto messages = report.messages("ERROR");
    ASSERT_FALSE(messages.empty());
    if (refusal.message) {
        EXPECT_EQ(messages.back(), refusal.message);  // behind what the system says
    }
    EXPECT_EQ(report.entries("ERROR")[0].function, "write_debug()");
}
INSTANTIATE_TEST_SUITE_P(Cases, WriteDebugRefuses, testing::ValuesIn(kRefusals),
                         [](const auto& row) { return row.param.name; });

TEST(Waitbar, SpeaksItsLines) {
    test::CapturedStderr captured;
    EXPECT_EQ(waitbar_open("Focusing 100%s"), 0);
    EXPECT_EQ(waitbar_update(0.5F), 0);
    EXPECT_EQ(waitbar_update(-1.0F / 3.0F), 0);
    EXPECT_EQ(waitbar_update(std::numeric_limits<float>::max()), 0);
    EXPECT_EQ(waitbar_close(), 0);
    EXPECT_EQ(captured.text(),
              "USE_WAITBAR\nSET_TITLE: Focusing 100%s\nSET_WAITBAR: 0.500000 \nSET_WAITBAR: -0.333333 \n"
              "SET_WAITBAR: 340282346638528859811704183484516925440.000000 \nCLOSE_WAITBAR\n");
}

// A stream that nobody can write to used to leave its error number to the next tracked function.
TEST(Waitbar, LeavesNoErrorBehindWhereNobodyListens) {
    const int kept = dup(STDERR_FILENO), unwritable = open("/dev/null", O_RDONLY);
    dup2(unwritable, STDERR_FILENO);
    errno = 0;
    EXPECT_EQ(waitbar_open("Focusing"), 0);
    EXPECT_EQ(waitbar_update(0.5F), 0);
    EXPECT_EQ(waitbar_close(), 0);
    EXPECT_EQ(errno, 0);
    dup2(kept, STDERR_FILENO);
    close(kept);
    close(unwritable);
    std::clearerr(stderr);
}

TEST(Waitbar, CutsALongTitle) {
    test::CapturedStderr captured;
    waitbar_open(std::string(5000, 'x').c_str());
    EXPECT_EQ(captured.text(), "USE_WAITBAR\nSET_TITLE: " + std::string(499, 'x') + "\n");
}

}  // namespace
