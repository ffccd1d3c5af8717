// SPDX-License-Identifier: Apache-2.0
#include "diagnosticslib/call_frame.h"

#include <sys/mman.h>

#include "tracking.h"

namespace {

using quo::CallFrame;
using quo::TrackedBuffer;
using test::leak_lines;

constexpr char kSource[] = "frames.cpp";

// ---- The plain functions. Depths, counters and names are compared with a model in tracked_allocation_test.cpp.

using Calls = test::Tracking;

// A name that ends with its memory: one byte more and the test dies.
TEST_F(Calls, NamesAreCopiedBoundedAndReadNoFurtherThanTheirRoom) {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    auto* const memory =
        static_cast<char*>(mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    ASSERT_EQ(mprotect(memory + page, page, PROT_NONE), 0);
    char* const unterminated = memory + page - 128;
    std::memset(unterminated, 'n', 128);
    for (const char* name : {static_cast<const char*>(unterminated), "short", static_cast<const char*>(nullptr)}) {
        set_ckerr_fun(name);
        std::memset(unterminated, 'x', 128);
        mark();
        deccurdep();
    }
    EXPECT_EQ(leak_lines(), std::string(127, 'n') + " : 0\t1\t\nshort : 0\t2\t\n : 0\t3\t\n");
    munmap(memory, 2 * page);
}

// ---- The frame

// The blocks of both calls go: the report would tell of any that is left. Entries of a helper that several
// functions share tell the line of its call.
int check_twice(quo::CallerFrame frame, bool good) {
    return good ? frame.success() : frame.callee(frame.fail(QUO_REFUSED, "Not good"));
}
int open_and_fail(const quo::SharedCall& call) {
    CallFrame frame{call, kSource};
    errno = ENOENT;
    return malloc_ckerr(10) ? frame.fail(QUO_REFUSED, "Not made") : -1;
}
TEST(CallFrame, FailuresTellKindPlaceAndTheLineOfTheCall) {
    test::Report report;
    const test::CapturedStderr quiet;
    constexpr int kLine = __LINE__ + 4;
    {
        CallFrame frame{"f()", kSource};
        ASSERT_TRUE(calloc_ckerr(7, 7));
        EXPECT_EQ(check_twice(frame, false), QUO_REFUSED);
        EXPECT_EQ(open_and_fail("g()"), QUO_REFUSED);
        EXPECT_EQ(frame.fail(QUO_NOT_SEEN, "No time found"), QUO_NOT_SEEN);
        EXPECT_EQ(frame.callee(QUO_NO_MEMORY), QUO_NO_MEMORY);
    }
    CallFrame good{"h()", kSource};
    EXPECT_EQ(check_twice(good, true), QUO_OK);
    std::vector<std::string> places;
    for (const auto& entry : report.entries())
        places.push_back(entry.kind + " " + entry.message + " " + entry.file + " " + entry.function + " " +
                         std::to_string(entry.line - kLine));
    EXPECT_THAT(places, testing::ElementsAre(
                            "ERROR Not good frames.cpp f() 0", "ERROR_CALL_TREE  frames.cpp f() 0",
                            "ERROR No such file or directory frames.cpp g() 1", "ERROR Not made frames.cpp g() 1",
                            "ERROR No time found frames.cpp f() 2", "ERROR_CALL_TREE  frames.cpp f() 3"));
}

// Where errno is looked at, and what is left of it. The entries come in the order in which they were found: what
// the system said came after what the function made of it.
TEST(CallFrame, ReportsErrnoOnceAndClearsIt) {
    const std::string no_file = std::strerror(ENOENT), no_room = std::strerror(ENOSPC);
    const auto succeeds = [](CallFrame& frame) { return frame.success(); };
    const struct {
        int before, within;  // errno on entry and when the body begins
        std::function<int(CallFrame&)> body;
        std::vector<std::string> messages;
    } rows[] = {
        {0, 0, succeeds, {}},
        {ENOENT, 0, succeeds, {no_file}},
        {0, ENOSPC, succeeds, {no_room}},
        {0, ENOSPC, [](CallFrame& frame) { return frame.check_errno(), frame.success(); }, {no_room}},
        {0, ENOSPC, [](CallFrame& frame) { return CallFrame::drop_errno(), frame.success(); }, {}},
        {ENOENT, ENOSPC, [](CallFrame& frame) { return frame.fail(5, "Lost"); }, {no_file, no_room, "Lost"}},
        {0, ENOSPC, [](CallFrame& frame) { return frame.callee(5); }, {no_room}},
        {0, ENOSPC, [](CallFrame& frame) { return frame.silent(1); }, {}},
    };
    const test::CapturedStderr quiet;
    for (const auto& [before, within, body, messages] : rows) {
        const test::Report report;
        errno = before;
        {
            CallFrame frame{"f()", kSource};
            EXPECT_EQ(errno, 0);
            errno = within;
            body(frame);
            EXPECT_EQ(errno, 0);
        }
        EXPECT_EQ(report.messages("ERROR"), messages);
    }
}

TEST(CallFrame, OnlyAVerdictOfSuccessKeepsTheBlocks) {
    test::Report report;
    void *kept = malloc_ckerr(1), *made = nullptr;
    {
        CallFrame outer{"outer()", kSource};
        made = malloc_ckerr(40);
        {
            CallFrame inner{"inner()", kSource};
            ASSERT_NE(malloc_ckerr(3), nullptr);
        }
        ASSERT_EQ(outer.success(), 0);
    }
    std::memset(made, 1, 40);
    for (void* block : {made, kept}) free_ckerr(block);
}

// ---- The buffer

// A null entry once stayed behind in the table and showed as a leak of a function that had dealt with the failure.
TEST(TrackedBuffer, IsZeroFilledAndReleasedOrLeavesNothingBehind) {
    test::Report report;
    TrackedBuffer<double> numbers{1001};
    for (double& number : numbers) EXPECT_EQ(std::exchange(number, 17.3), 0.0);
    TrackedBuffer<double> moved{std::move(numbers)};
    EXPECT_EQ(moved[1000], 17.3);
    EXPECT_EQ(moved.end() - moved.begin(), 1001);
    const TrackedBuffer<double> overflowing{SIZE_MAX / 8 + 1};
    EXPECT_FALSE(overflowing || TrackedBuffer<char>{});
    EXPECT_EQ(overflowing.size(), 0U);
    errno = 0;
    test::AllocationLimit limit{1};
    const test::CapturedStderr quiet;
    const TrackedBuffer<int> first{3}, second{3};
    EXPECT_TRUE(first && !second);
}

}  // namespace
