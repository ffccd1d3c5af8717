#include <gmock/gmock.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <string>

#include "quo_base/ckerr.h"
#include "support/diagnostics.h"

namespace {
std::time_t now_s = 0;
}

// The reports of this program are dated by the tests themselves: this definition comes before the system's.
extern "C" std::time_t time(std::time_t* result) noexcept {
    if (result) *result = now_s;
    return now_s;
}

namespace {

using testing::HasSubstr;

const std::string kRule(78, '=');
constexpr char kLaunchDate[] = "Thu Apr  3 21:02:26 2014\n";
constexpr std::time_t kLaunch_s = 1396558946;

class ReportFile : public testing::Test {
public:
    ReportFile() {
        setenv("TZ", "UTC0", 1);
        tzset();
        now_s = kLaunch_s;
        set_flg_report(0);
        exit_ckerr();
        init_ckerr_locking();
        errno = 0;
    }
    ~ReportFile() override {
        if (ckflg_report() == 0) set_flg_report(1);  // a log may be open behind a closed report
        const test::CapturedStderr quiet;
        exit_report();
        exit_ckerr();
    }

protected:
    /** The text of an open report behind its banner. */
    [[nodiscard]] std::string body() const {
        const std::string text = test::read_text(name);
        return text.substr(text.rfind(kRule + "\n") + kRule.size() + 1);
    }

    test::TemporaryFolder folder;
    const std::string name = folder.file("report.txt"), log_name = folder.file("log.txt");
};

std::string opening(int level, const std::string& title, const std::string& date = kLaunchDate) {
    return "\n" + kRule + "\n QUOREL report (level " + std::to_string(level) + ") - " + title + " - Started on " +
           date + kRule + "\n";
}
std::string closing(const std::string& title, const std::string& date) {
    return "\n" + kRule + "\n QUOREL report - " + title + " - Ended on " + date + kRule + "\n";
}

void warn(const char* message) { quo_add_report(message, QUO_WARNING, 1, "f", "s"); }
/** How such a warning stands in the report. */
std::string warning(int number, const std::string& message, int elapsed_s = 0) {
    return "\n" + std::to_string(number) + ")  WARNING [" + std::to_string(elapsed_s) + " sec]: " + message +
           "\n    . FILE s, FUNCTION f, LINE 1.\n";
}

// ---- Opening

struct Opening {
    bool tracking;
    int level, result;
};
class ReportOpening : public ReportFile, public testing::WithParamInterface<Opening> {};

TEST_P(ReportOpening, AnswersAndOpensAsItsLevelSays) {
    const auto [tracking, level, result] = GetParam();
    const bool opens = tracking && level >= 1 && level <= 3;
    if (!tracking) exit_ckerr();
    EXPECT_EQ(init_report(name.c_str(), "scene 17", level), result);
    EXPECT_EQ(ckflg_report(), opens ? level : 0);
    EXPECT_EQ(test::read_text(name), opens ? opening(level, "scene 17") : "");
    EXPECT_EQ(init_log(log_name.c_str(), "scene 17", level), opens ? 1 : result);
    EXPECT_EQ(std::filesystem::exists(name) + std::filesystem::exists(log_name), opens ? 2 : 0);
    EXPECT_EQ(quo_add_log("x"), opens ? 0 : EOF);
}
INSTANTIATE_TEST_SUITE_P(Levels, ReportOpening,
                         testing::Values(Opening{true, 1, 0}, Opening{true, 2, 0}, Opening{true, 3, 0},
                                         Opening{true, 0, -1}, Opening{true, 4, 3}, Opening{true, -7, -8},
                                         Opening{true, INT_MIN, INT_MIN}, Opening{true, INT_MAX, INT_MAX - 1},
                                         Opening{false, 1, 0}, Opening{false, 4, 0}));

TEST_F(ReportFile, StaysAsItIsWhenOpenedAgain) {
    const std::string other = folder.file("other.txt");
    init_report(name.c_str(), "first", 2);
    warn("kept");
    const std::string before = test::read_text(name);
    for (const int level : {3, 7}) EXPECT_EQ(init_report(other.c_str(), "second", level), 2);
    exit_ckerr();  // an open report answers before the tracking flag is looked at
    EXPECT_EQ(init_report(name.c_str(), "second", 1), 2);
    EXPECT_EQ(test::read_text(name), before);
    EXPECT_FALSE(std::filesystem::exists(other));
    // A level that is forced to 0 hides that it is open.
    set_flg_report(0);
    init_ckerr_locking();
    EXPECT_EQ(init_report(other.c_str(), "second", 2), 0);
    warn("b");
    EXPECT_EQ(exit_report(), 0);
    EXPECT_EQ(test::read_text(name), before);
    EXPECT_THAT(test::read_text(other), HasSubstr(warning(0, "b")));
}

TEST_F(ReportFile, CannotBeOpenedWhereNoFileCanBeAndDropsEntries) {
    const std::string missing = folder.file("missing/report.txt");
    test::CapturedStderr echo;
    for (const char* bad : {missing.c_str(), folder.path().c_str(), "", static_cast<const char*>(nullptr)}) {
        set_flg_report(0);
        EXPECT_EQ(init_report(bad, "t", 1) + ckflg_report() + init_log(bad, "t", 1), 0);
        quo_add_report("dropped", QUO_ERROR, 1, "f", "s");
        quo_check(EIO, 1, "f", "s");
        EXPECT_EQ(exit_report(), -1);
        set_flg_report(7);  // a forced level is set back
        init_report(bad, "t", 1);
        EXPECT_EQ(ckflg_report(), 0);
    }
    EXPECT_EQ(echo.text(), "");
}

// ---- Entries

struct Kind {
    int code;
    const char* name;
};

TEST_F(ReportFile, WritesEveryShortKindInTwoLines) {
    init_report(name.c_str(), "t", 3);
    std::string expected;
    test::CapturedStderr echo;
    for (const auto& [code, kind] : {Kind{1, "WARNING"}, Kind{2, "CHECKPOINT"}, Kind{4, "CORRECT_FUNCTION_CALL"},
                                     Kind{5, "CORRECT_SYSTEM_CALL"}, Kind{6, "MESSAGE"}, Kind{22, "EXCEPTION"},
                                     Kind{7, "UNKNOWN"}, Kind{INT_MIN, "UNKNOWN"}}) {
        const auto number = (now_s - kLaunch_s) / 13;
        now_s += 13;
        quo_add_report("half 50% done", code, 217, "DataFile::seek", "datafile.cpp");
        expected += "\n" + std::to_string(number) + ")  " + kind + " [" + std::to_string(now_s - kLaunch_s) +
                    " sec]: half 50% done\n    . FILE datafile.cpp, FUNCTION DataFile::seek, LINE 217.\n";
        EXPECT_EQ(body(), expected) << "each entry is to survive a crash";
    }
    EXPECT_EQ(echo.text(), "MSG_MESSAGE: half 50% done.\n");
}

TEST_F(ReportFile, NumbersErrorsAndCallTreeLines) {
    init_report(name.c_str(), "Zürich 17", 1);
    test::CapturedStderr echo;
    now_s += 12;
    EXPECT_EQ(init_log(folder.file("missing/log.txt").c_str(), "a title not taken over", 1), 0);
    quo_add_report("File not opened!", QUO_ERROR, 88, "DataFile::open", "datafile.cpp");
    quo_add_report("not shown", QUO_ERROR_CALL_TREE, 41, "GSread", "generalSAR.cpp");
    EXPECT_TRUE(body().ends_with(" LINE 41.\n")) << "flushed, too";
    now_s += 3600;
    quo_check(0, -1, "", "");
    quo_check(ENOENT, -1, "", "");
    now_s += 5;
    EXPECT_EQ(exit_report(), 0);

    EXPECT_EQ(echo.text(), "MSG_ERROR: File not opened!.\nMSG_ERROR: No such file or directory.\n");
    EXPECT_EQ(test::read_text(name),
              opening(1, "Zürich 17") +
                  "\n0)  ERROR [12 sec].\n    FILE : datafile.cpp.\n    FUNCTION : DataFile::open.\n"
                  "    LINE : 88.\n    MESSAGE : File not opened!.\n"
                  "    . Call tree: FILE generalSAR.cpp, FUNCTION GSread, LINE 41.\n"
                  "\n2)  ERROR [3612 sec].\n    FILE : .\n    FUNCTION : .\n    LINE : -1.\n"
                  "    MESSAGE : No such file or directory.\n" +
                  closing("Zürich 17", "Thu Apr  3 22:02:43 2014\n"));
}

TEST_F(ReportFile, KeepsLongMessagesWholeBoundsTheTitleAndShowsNullTexts) {
    const std::string endless(300000, 'x'), title(4095, 'x');
    const test::CapturedStderr echo;
    init_report(name.c_str(), endless.c_str(), 1);
    warn(endless.c_str());
    for (const int kind : {QUO_MESSAGE, QUO_ERROR_CALL_TREE, QUO_ERROR})
        quo_add_report(nullptr, kind, 1, nullptr, nullptr);
    EXPECT_THAT(test::read_text(name), testing::StartsWith(opening(1, title) + warning(0, endless)));
    EXPECT_THAT(test::read_text(name), HasSubstr("    . Call tree: FILE (null), FUNCTION (null), LINE 1.\n"));
    init_log(log_name.c_str(), nullptr, 1);
    quo_add_log(nullptr);
    exit_report();
    EXPECT_EQ(test::read_text(log_name), "\n0) (null)\n");
    EXPECT_THAT(test::read_text(name), HasSubstr(" QUOREL report - (null) - Ended on "));
}

// ---- Levels

TEST_F(ReportFile, IsSilencedAndResumedByItsLevel) {
    test::CapturedStderr echo;
    set_flg_report(2);  // opens nothing
    quo_add_report("m", QUO_ERROR, 1, "f", "s");
    EXPECT_NE(exit_report(), 0);
    EXPECT_EQ(ckflg_report(), 0);
    EXPECT_EQ(echo.text(), "MSG_ERROR: m.\n");
    init_report(name.c_str(), "t", 2);
    warn("a");
    for (const int silent : {0, 4, -1, INT_MAX}) {
        EXPECT_EQ(set_flg_report(silent), silent);
        EXPECT_EQ(ckflg_report(), silent);
        quo_add_report("dropped", QUO_ERROR, 1, "f", "s");
        EXPECT_EQ(exit_report(), silent - 1);
    }
    set_flg_report(3);
    warn("b");
    EXPECT_EQ(body(), warning(0, "a") + warning(1, "b"));
}

TEST_F(ReportFile, IsSilencedButNotClosedWhenTrackingStartsAnew) {
    init_report(name.c_str(), "t", 1);
    init_log(log_name.c_str(), "t", 1);
    exit_ckerr();
    EXPECT_EQ(ckflg_report(), 1);
    warn("still written");
    init_ckerr_locking();
    EXPECT_EQ(ckflg_report(), 0);
    warn("dropped");
    EXPECT_EQ(body(), warning(0, "still written"));
    quo_add_log("the log's level is not looked at");
    EXPECT_EQ(test::read_text(log_name), "\n0) the log's level is not looked at\n");
}

TEST_F(ReportFile, LeavesErrnoAlone) {
    const test::CapturedStderr quiet;
    for (const char* file : {name.c_str(), "/dev/full"}) {
        const std::function<void()> calls[] = {[&] { init_report(file, "t", 1); },
                                               [&] { init_log(file, "t", 1); },
                                               [] { quo_add_report("m", QUO_ERROR, 1, "f", "s"); },
                                               [] { quo_add_report("m", QUO_ERROR_CALL_TREE, 1, "f", "s"); },
                                               [] { quo_add_report("m", QUO_MESSAGE, 1, "f", "s"); },
                                               [] { quo_check(ENOENT, 1, "f", "s"); },
                                               [] { quo_add_log("x"); },
                                               [] { exit_report(); }};
        for (const auto& call : calls) {
            errno = EXDEV;
            call();
            EXPECT_EQ(errno, EXDEV) << file << ", call " << &call - calls;
        }
    }
}

// ---- Log

TEST_F(ReportFile, LogTakesNumberedLinesUntilTheReportIsClosed) {
    init_report(name.c_str(), "report", 1);
    now_s += 100;
    EXPECT_EQ(init_log(log_name.c_str(), "log", 3), 1);
    EXPECT_EQ(init_log(log_name.c_str(), "t", 1), 3);
    EXPECT_EQ(quo_add_log("burst 1 of 9") + quo_add_log("100% of %s"), 0);
    EXPECT_EQ(test::read_text(log_name), "\n0) burst 1 of 9\n\n1) 100% of %s\n");
    now_s += 7;
    warn("m");
    EXPECT_EQ(exit_report(), 0);
    // The log opened later took over title and start time.
    EXPECT_EQ(test::read_text(name),
              opening(1, "report") + warning(0, "m", 7) + closing("log", "Thu Apr  3 21:04:13 2014\n"));
    EXPECT_EQ(quo_add_log("too late"), EOF);
    EXPECT_EQ(init_log(log_name.c_str(), "t", 1), 1) << "the log's level was not set back";
    // With no report open there is no way to close a log: exit_report() looks at the report first.
    EXPECT_EQ(exit_report(), -1);
    EXPECT_EQ(quo_add_log("still open"), 0);
    EXPECT_EQ(test::read_text(log_name), "\n0) still open\n");
}

// ---- Full disk

// The result once came from the log alone: a report lost to a full disk was closed with 0 when a log was open.
TEST_F(ReportFile, OnAFullDiskGivesANonZeroResultAsDoesTheLog) {
    for (const bool log_is_lost : {false, true}) {
        SCOPED_TRACE(log_is_lost);
        EXPECT_EQ(init_report(log_is_lost ? name.c_str() : "/dev/full", "t", 1), log_is_lost ? 0 : EOF);
        EXPECT_EQ(ckflg_report(), 1);
        EXPECT_EQ(init_log(log_is_lost ? "/dev/full" : log_name.c_str(), "t", 1), 1);
        warn("m");
        EXPECT_EQ(quo_add_log("x"), log_is_lost ? EOF : 0);
        EXPECT_EQ(exit_report(), EOF);
        EXPECT_EQ(ckflg_report(), 0);
    }
    EXPECT_EQ(test::read_text(log_name), "\n0) x\n");
    EXPECT_EQ(test::read_text(name), opening(1, "t") + warning(0, "m") + closing("t", kLaunchDate));
}

}  // namespace
