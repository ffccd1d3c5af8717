// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/diagnostics/sessions.txt.
#include "support/session.h"

#include <ctime>
#include <thread>
#include <tuple>

#include "quo_base/ckerr.h"
#include "quo_base/quorelReport.h"
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

constexpr char kScript[] = QUO_TEST_DATA "/diagnostics/sessions.txt";

class Session : public testing::TestWithParam<std::string> {
protected:
    Session() {
        setenv("TZ", "UTC0", 1);
        tzset();
        now_s = 1396558946;
        set_flg_report(0);
        exit_ckerr();
        init_ckerr_locking();
    }
    ~Session() override {
        if (ckflg_report() == 0) set_flg_report(1);  // a log may be open behind a closed report
        const test::CapturedStderr quiet;
        exit_report();
        exit_ckerr();
        for (void* block : blocks_) free_ckerr(block);
    }

    /** Files are those of a folder of the session's own. */
    int call(const test::Words& words, std::string& told) {
        const std::string given = words.text(1) ? words.text(1) : "",
                          path = given.empty() || given[0] == '/' ? given : folder_.file(given);
        const char* const file = words.text(1) ? path.c_str() : nullptr;
        const auto text = [&](std::size_t n, const char* otherwise = nullptr) { return words.text(n, otherwise); };
        const auto number = [&](std::size_t n) { return words.whole(n); };
        const auto tried = [](int result, int there = 1) {  // a file that is not there tells so
            if (result * there == 0) errno = EXDEV;
            return result;
        };
        const auto had = [this](auto allocate) {
            const test::CapturedStderr quiet;  // a sanitizer tells of sizes that cannot be had
            blocks_.push_back(allocate());
            const int error = std::exchange(errno, EXDEV);
            return blocks_.back() ? 1 : error;
        };
        const auto object = [] { return quorelReport{}; };
        const std::map<std::string, std::function<int()>> calls = {
            {"track", init_ckerr_locking},
            {"untrack", [] { return exit_ckerr(), 0; }},
            {"tracking?", ckflg_ckerr},
            {"enter", [&] { return set_ckerr_fun(text(1)); }},
            {"calloc",
             [&] { return had([&] { return calloc_ckerr(std::stoull(given), std::stoull(text(2))); }); }},
            {"malloc", [&] { return had([&] { return malloc_ckerr(std::stoull(given)); }); }},
            {"freeall", [&] { return blocks_.clear(), freeall_ckerr(), 0; }},
            {"wait", [&] { return now_s += number(1), 0; }},
            {"report", [&] { return tried(init_report(file, text(2), number(3)), ckflg_report()); }},
            {"log", [&] { return tried(init_log(file, text(2), number(3))); }},
            {"entry",
             [&] { return quo_add_report(text(1), number(2), number(3), text(4, "f"), text(5, "s")), 0; }},
            {"check", [&] { return quo_check(number(1), 1, "f", "s"), 0; }},
            {"line", [&] { return quo_add_log(text(1)); }},
            {"level", [&] { return set_flg_report(number(1)); }},
            {"level?", ckflg_report},
            {"close", exit_report},
            {"there", [&] { return tried(std::filesystem::exists(path) ? 1 : 0); }},
            {"show", [&] { return told = test::read_text(path), 0; }},
            {"object",
             [&] {
                 return !words.text(1) ? object().getLevel() : quorelReport{file, number(2)}.getLevel();
             }},
            {"setReportName", [&] { return object().setReportName(file), ckflg_report(); }},
            {"setLevel", [&] { return object().setLevel(number(1)), object().getLevel(); }},
            {"setLogName", [&] { return object().setLogName(file), 0; }},
            {"setProgressName", [&] { return object().setProgressName(file), 0; }},
            {"named", [&] { return object().getReportName() == path ? 1 : 0; }},
            {"plain", [&] { return object().addEntry("no kind %d", 5), 0; }},
            {"ofKind", [&] { return object().addEntry(number(1), "at %d", 5), 0; }},
            {"placed",
             [&] {
                 return object().addEntry(number(1), number(2), "chain.cpp", "focus", "%d of %s", 3, "seven"), 0;
             }},
            {"addLog", [&] { return object().addLog("%d lines", 12), 0; }},
            {"end_report", [&] { return object().end_report(), 0; }},
            {"exception",
             [&] {
                 const quorelException thrown{number(1), "scan", "io.cpp", text(2)};
                 return quorelReport::addEntry(&thrown), 0;
             }},
            {"checkErrno",
             [&] {
                 errno = number(1);
                 quorelReport::checkErrno(number(2), "focus", "chain.cpp");
                 return std::exchange(errno, EXDEV);
             }},
            {"progress", [&] {
                 errno = 0;
                 const int status = object().progress_update(std::stof(given), text(2));
                 return errno == 0 ? (errno = EXDEV, status) : -1;
             }}};
        return calls.at(words.text(0))();
    }

private:
    test::TemporaryFolder folder_;
    std::vector<void*> blocks_;
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    test::run_session(kScript, GetParam(), [this](const test::Words& words, std::string& told) {
        errno = EXDEV;
        const int result = call(words, told);
        EXPECT_EQ(errno, EXDEV) << words.text(0);
        return result;
    });
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

// ---- Bounds

TEST(Texts, LongMessagesStayWholeTitlesAndFormattedOnesAreCut) {
    const std::string endless(300000, 'x');
    const test::Report report{endless.c_str()};
    quo_add_report(endless.c_str(), QUO_WARNING, 1, "f", "s");
    quorelReport{}.addEntry(QUO_CHECKPOINT, "%s", endless.c_str());
    EXPECT_THAT(report.text(), testing::HasSubstr(" - " + std::string(4095, 'x') + " - "));
    EXPECT_EQ(report.entries()[0].message, endless);
    EXPECT_EQ(report.entries()[1].message, std::string(2047, 'x'));
}

TEST(TakenErrors, AreTheThreadsLatestWhetherOrNotAReportIsOpen) {
    quo_add_report("first", QUO_ERROR, 17, "f()", "f.c");
    quo_add_report("second", QUO_ERROR, 18, "g()", "g.c");
    quo_add_report("neither", QUO_ERROR_CALL_TREE, 19, "h()", "h.c");
    std::thread{[] { EXPECT_STREQ(quorelReport::takeError().message, ""); }}.join();
    const quorelReportEntry taken = quorelReport::takeError();
    EXPECT_EQ((std::tuple<std::string, std::string, std::string, int>{taken.message, taken.function, taken.file,
                                                                      taken.line}),
              (std::tuple{"second", "g()", "g.c", 18}));
    EXPECT_STREQ(quorelReport::takeError().message, "");
}

TEST(QuorelException, KeepsMessageAndPositionUpTo511Bytes) {
    errno = ENOENT;
    const std::string endless(5000, 'x'), cut(511, 'x');
    const char* const text = endless.c_str();
    const struct {
        quorelException made;
        std::string message;
        int line;
        std::string function, file;
        int error;
    } rows[] = {
        {{}, "generic quorel exception.\n", 0, "", "", ENOENT},
        {{17, "focus", "chain.cpp"}, "chain.cpp: focus (17): exception found", 17, "focus", "chain.cpp", ENOENT},
        {{18, "scan", "io.cpp", "no 100%s luck"}, "no 100%s luck", 18, "scan", "io.cpp", 0},
        {quorelException{"alone"}, "alone", -1, "UNKNOWN FUNCTION", "UNKNOWN FILE", 0},
        {{19, text, text, text}, cut, 19, cut, cut, 0},
        {{20, text, text}, cut, 20, cut, cut, ENOENT},
        {{21, nullptr, nullptr, nullptr}, "", 21, "", "", 0},
    };
    for (const auto& [made, message, line, function, file, error] : rows) {
        EXPECT_EQ(made.what(), message);
        EXPECT_EQ(made.getLine(), line);
        EXPECT_EQ(made.getFunction(), function);
        EXPECT_EQ(made.getFile(), file);
        EXPECT_EQ(made.getErrorNumber(), error);
    }
    errno = 0;
}

}  // namespace
