#include "diagnosticslib/call_frame.h"

#include <gmock/gmock.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <functional>
#include <string>
#include <utility>

#include "support/diagnostics.h"

namespace {

using quo::CallFrame;
using quo::TrackedBuffer;
using testing::IsEmpty;
using testing::StartsWith;

constexpr char kSource[] = "frames.cpp";

/** What exit_ckerr() prints, without its heading. */
std::string leak_lines() {
    test::CapturedStderr captured;
    exit_ckerr();
    const std::string text = captured.text();
    const auto heading = text.find("coordinates: \n");
    return heading == text.npos ? "" : text.substr(heading + 14);
}

class Calls : public testing::Test {
public:
    Calls() {
        exit_ckerr();
        init_ckerr_locking();
        errno = 0;
    }
    ~Calls() override {
        const test::CapturedStderr quiet;
        exit_ckerr();
        for (void* block : blocks_) free_ckerr(block);
    }

protected:
    /** A block that shows in the leak report which function is running. */
    void mark() { blocks_.push_back(malloc_ckerr(1)); }

private:
    std::vector<void*> blocks_;
};

// ---- The plain functions

TEST_F(Calls, TrackingIsOnBetweenInitAndExit) {
    EXPECT_EQ(ckflg_ckerr(), 1);
    EXPECT_EQ(init_ckerr_locking(), 0);
    exit_ckerr();
    EXPECT_EQ(ckflg_ckerr(), 0);
    EXPECT_EQ(set_ckerr_fun("unseen()"), 1);
    EXPECT_EQ(init_ckerr_locking(), 0);
    EXPECT_EQ(ckflg_ckerr(), 1);
    mark();
    EXPECT_EQ(leak_lines(), "main() : 0\t\n");
}

TEST_F(Calls, SecondInitKeepsTheStack) {
    EXPECT_EQ(set_ckerr_fun("f()"), 1);
    init_ckerr_locking();
    mark();
    EXPECT_EQ(leak_lines(), "f() : 0\t1\t\n");
}

TEST_F(Calls, CountersNumberTheCallsAtEachDepth) {
    for (int i = 0; i < 3; ++i) {
        set_ckerr_fun("outer");
        for (int j = 0; j < 2; ++j) {
            set_ckerr_fun("inner");
            if (i == 1) mark();
            deccurdep();
        }
        if (i == 2) mark();
        deccurdep();
    }
    mark();
    EXPECT_EQ(leak_lines(), "inner : 0\t2\t3\t\ninner : 0\t2\t4\t\nouter : 0\t3\t\nmain() : 0\t\n");
}

TEST_F(Calls, CountersStartAnewWithTracking) {
    for (int i = 0; i < 5; ++i) set_ckerr_fun("f");
    exit_ckerr();
    init_ckerr_locking();
    set_ckerr_fun("g");
    mark();
    EXPECT_EQ(leak_lines(), "g : 0\t1\t\n");
}

TEST_F(Calls, DepthNeverFallsBelowMain) {
    for (int i = 0; i < 100; ++i) deccurdep();
    mark();
    set_ckerr_fun("f");
    mark();
    EXPECT_EQ(leak_lines(), "main() : 0\t\nf : 0\t1\t\n");
}

TEST_F(Calls, DepthFallsWithoutTrackingToo) {
    set_ckerr_fun("f");
    set_ckerr_fun("g");
    exit_ckerr();
    deccurdep();
    deccurdep();
    init_ckerr_locking();
    set_ckerr_fun("h");
    deccurdep();
    mark();
    EXPECT_EQ(leak_lines(), "main() : 0\t\n");
}

TEST_F(Calls, DepthBeyondTheLastSlotKeepsCounting) {
    for (int depth = 1; depth <= 300; ++depth) set_ckerr_fun(("d" + std::to_string(depth)).c_str());
    mark();
    for (int depth = 300; depth > 62; --depth) deccurdep();
    mark();
    std::string ones;
    for (int depth = 1; depth <= 62; ++depth) ones += "1\t";
    EXPECT_EQ(leak_lines(), "d300 : 0\t" + ones + "238\t\nd62 : 0\t" + ones + "\n");
}

TEST_F(Calls, BlocksBeyondTheLastSlotGoWithTheirCallOrItsCallers) {
    for (int depth = 1; depth <= 61; ++depth) set_ckerr_fun("shallow");
    mark();
    for (int depth = 62; depth <= 100; ++depth) {
        set_ckerr_fun("deep");
        ASSERT_NE(malloc_ckerr(100), nullptr);
    }
    freeall_ckerr();  // what the innermost call holds
    for (int depth = 100; depth > 62; --depth) deccurdep();
    freeall_ckerr();  // what all calls from depth 62 on hold
    EXPECT_THAT(leak_lines(), StartsWith("shallow : 0\t"));
    EXPECT_EQ(leak_lines(), "");
}

TEST_F(Calls, NamesAreBoundedAndReadNoFurtherThanTheirRoom) {
    // A name that ends with its memory: one byte more and the test dies.
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    auto* memory =
        static_cast<char*>(mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    ASSERT_NE(memory, MAP_FAILED);
    ASSERT_EQ(mprotect(memory + page, page, PROT_NONE), 0);
    char* name = memory + page - 128;
    std::memset(name, 'n', 128);
    set_ckerr_fun(name);
    std::memset(name, 'x', 128);  // the name was copied
    mark();
    deccurdep();
    set_ckerr_fun(std::string(127, 'k').c_str());
    mark();
    deccurdep();
    set_ckerr_fun(nullptr);
    mark();
    EXPECT_EQ(leak_lines(),
              std::string(127, 'n') + " : 0\t1\t\n" + std::string(127, 'k') + " : 0\t2\t\n" + " : 0\t3\t\n");
    munmap(memory, 2 * page);
}

// ---- The frame

TEST(CallFrame, EntersItsNameAndLeavesIt) {
    test::Report report;
    int status = -1;
    std::string inside;
    {
        CallFrame frame{"named()", kSource};
        void* block = malloc_ckerr(3);
        inside = leak_lines();
        free_ckerr(block);
        init_ckerr_locking();
        set_flg_report(1);
        status = frame.success();
    }
    EXPECT_EQ(inside, "named() : 0\t1\t\n");
    EXPECT_EQ(status, QUO_OK);
    EXPECT_THAT(report.entries(), IsEmpty());
}

TEST(CallFrame, FailureIsReportedWithItsPositionAndFreesTheBlocks) {
    test::Report report;
    const test::CapturedStderr quiet;
    int line = 0;
    const auto fails = [&] {
        CallFrame frame{"Orbit::fit()", kSource};
        if (!malloc_ckerr(10)) return -1;
        line = __LINE__ + 1;
        return frame.fail(QUO_NUMERIC, "Singular matrix");
    };
    EXPECT_EQ(fails(), QUO_NUMERIC);
    ASSERT_EQ(report.entries().size(), 1U);
    const test::ReportEntry entry = report.entries()[0];
    EXPECT_EQ(entry.kind, "ERROR");
    EXPECT_EQ(entry.message, "Singular matrix");
    EXPECT_EQ(entry.function, "Orbit::fit()");
    EXPECT_EQ(entry.file, kSource);
    EXPECT_EQ(entry.line, line);
}

TEST(CallFrame, CalleeStatusIsPassedOnThroughACallTree) {
    test::Report report;
    const test::CapturedStderr quiet;
    const auto inner = [] {
        CallFrame frame{"inner()", kSource};
        return frame.fail(QUO_NOT_SEEN, "No time found");
    };
    const auto outer = [&] {
        CallFrame frame{"outer()", kSource};
        if (!calloc_ckerr(7, 7)) return -1;
        if (const int status = inner()) return frame.callee(status);
        return frame.success();
    };
    EXPECT_EQ(outer(), QUO_NOT_SEEN);
    ASSERT_EQ(report.entries().size(), 2U);
    EXPECT_EQ(report.entries()[1].kind, "ERROR_CALL_TREE");
    EXPECT_EQ(report.entries()[1].function, "outer()");
}

// Where errno is looked at, and what is left of it. The entries come in the order in which they were found.
struct ErrnoCase {
    const char* name;
    std::function<int(CallFrame&)> body;
    int before;                         // errno on entry
    std::vector<std::string> messages;  // entries of kind ERROR
};
class FrameErrno : public testing::TestWithParam<ErrnoCase> {};

TEST_P(FrameErrno, IsReportedOnceAndCleared) {
    test::Report report;
    const test::CapturedStderr quiet;
    errno = GetParam().before;
    {
        CallFrame frame{"f()", kSource};
        EXPECT_EQ(errno, 0);
        GetParam().body(frame);
        EXPECT_EQ(errno, 0);
    }
    EXPECT_EQ(report.messages("ERROR"), GetParam().messages);
    for (const auto& entry : report.entries("ERROR")) EXPECT_EQ(entry.function, "f()");
}

const std::string kNoFile = std::strerror(ENOENT), kNoRoom = std::strerror(ENOSPC);
int set_and(int number, int result) {
    errno = number;
    return result;
}
INSTANTIATE_TEST_SUITE_P(
    Paths, FrameErrno,
    testing::Values(
        ErrnoCase{"CleanSuccess", [](CallFrame& f) { return f.success(); }, 0, {}},
        ErrnoCase{"LeftByAnEarlierCall", [](CallFrame& f) { return f.success(); }, ENOENT, {kNoFile}},
        ErrnoCase{"LeftAtSuccess", [](CallFrame& f) { return set_and(ENOSPC, 0), f.success(); }, 0, {kNoRoom}},
        ErrnoCase{"Checked",
                  [](CallFrame& f) {
                      errno = ENOSPC;
                      f.check_errno();
                      return f.success();
                  },
                  0,
                  {kNoRoom}},
        ErrnoCase{"Dropped",
                  [](CallFrame& f) {
                      errno = ENOSPC;
                      CallFrame::drop_errno();
                      return f.success();
                  },
                  0,
                  {}},
        ErrnoCase{"AfterTheFailure",
                  [](CallFrame& f) { return set_and(ENOSPC, 0), f.fail(5, "File writing failed!"); },
                  ENOENT,
                  {kNoFile, "File writing failed!", kNoRoom}},
        ErrnoCase{"AfterTheCallTree", [](CallFrame& f) { return set_and(ENOSPC, 0), f.callee(5); }, 0, {kNoRoom}},
        ErrnoCase{"Silent", [](CallFrame& f) { return set_and(ENOSPC, 0), f.silent(1); }, 0, {}}),
    [](const auto& row) { return row.param.name; });

TEST(CallFrame, LeavingWithoutAVerdictIsAFailure) {
    test::Report report;
    void* kept = malloc_ckerr(1);
    {
        CallFrame outer{"outer()", kSource};
        void* mine = malloc_ckerr(2);
        {
            CallFrame inner{"inner()", kSource};
            ASSERT_NE(malloc_ckerr(3), nullptr);
        }
        free_ckerr(mine);  // stood through the failure of the inner call
        ASSERT_EQ(outer.success(), 0);
    }
    free_ckerr(kept);
    EXPECT_THAT(report.entries(), IsEmpty());
}

TEST(CallFrame, SuccessKeepsTheBlocksForTheCaller) {
    test::Report report;
    void* block = nullptr;
    {
        CallFrame frame{"make()", kSource};
        block = malloc_ckerr(40);
        ASSERT_EQ(frame.success(), 0);
    }
    std::memset(block, 1, 40);
    free_ckerr(block);
}

TEST(CallFrame, WorksWithoutTracking) {
    exit_ckerr();
    CallFrame frame{"f()", kSource};
    TrackedBuffer<int> numbers{17};
    ASSERT_TRUE(numbers);
    EXPECT_EQ(frame.success(), 0);
}

// ---- The buffer

TEST(TrackedBuffer, IsZeroFilledAndReleased) {
    test::Report report;
    {
        TrackedBuffer<double> numbers{1001};
        ASSERT_TRUE(numbers);
        EXPECT_EQ(numbers.size(), 1001U);
        for (double& number : numbers) EXPECT_EQ(std::exchange(number, 17.3), 0.0);
        TrackedBuffer<double> moved{std::move(numbers)};
        EXPECT_EQ(moved[1000], 17.3);
        EXPECT_EQ(moved.end() - moved.begin(), 1001);
    }
    {
        const TrackedBuffer<char> none;
        EXPECT_FALSE(none);
    }
}

// A null entry once stayed behind in the table and showed as a leak of a function that had dealt with the failure.
TEST(TrackedBuffer, LeavesNothingBehindWhenItCannotBeHad) {
    test::Report report;
    const TrackedBuffer<double> overflowing{SIZE_MAX / 8 + 1};
    EXPECT_FALSE(overflowing);
    EXPECT_EQ(overflowing.size(), 0U);
    errno = 0;
    test::AllocationLimit limit{1};
    const test::CapturedStderr quiet;
    const TrackedBuffer<int> first{3}, second{3};
    EXPECT_TRUE(first);
    EXPECT_FALSE(second);
}

}  // namespace
