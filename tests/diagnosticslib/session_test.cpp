// Runs the sessions of data/diagnostics/sessions.txt, where their form is told.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iomanip>
#include <map>
#include <sstream>
#include <string>
#include <vector>

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

std::vector<std::string> titles() {
    std::vector<std::string> all;
    std::istringstream script{test::read_text(kScript)};
    for (std::string line; std::getline(script, line);)
        if (line.starts_with("== ")) all.push_back(line.substr(3));
    return all;
}

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
    }

    /** Carries out a call of words. What is left out is said for it. */
    int call(std::istream& line) {
        std::vector<std::string> words;
        for (std::string word; line >> std::quoted(word);) words.push_back(word);
        const auto text = [&](std::size_t i, const char* otherwise = nullptr) {
            if (i < words.size()) otherwise = words[i] == "(null)" ? nullptr : words[i].c_str();
            return otherwise;
        };
        const auto number = [&](std::size_t i) { return std::stoi(text(i, "1")); };
        const bool inside = words.size() > 1 && !words[1].empty() && words[1].find_first_of("/(") != 0;
        const std::string path = inside ? folder_.file(words[1]) : "";
        const char* const file = inside ? path.c_str() : text(1);
        const auto tried = [](int result, int there = 1) {  // a file that is not there tells so
            if (result * there == 0) errno = EXDEV;
            return result;
        };
        const auto object = [] { return quorelReport{}; };
        const std::map<std::string, std::function<int()>> calls = {
            {"track", init_ckerr_locking},
            {"untrack", [] { return exit_ckerr(), 0; }},
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
            {"show", [&] { return shown_ = test::read_text(path), 0; }},
            {"object",
             [&] {
                 return words.size() < 2 ? object().getLevel() : quorelReport{file, number(2)}.getLevel();
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
                 const int status = object().progress_update(std::stof(words.at(1)), text(2));
                 return errno == 0 ? (errno = EXDEV, status) : -1;
             }}};
        return calls.at(words.at(0))();
    }

    test::TemporaryFolder folder_;
    std::string shown_;
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    std::istringstream script{test::read_text(kScript)};
    std::string line, told, wanted;
    while (std::getline(script, line) && line != "== " + GetParam()) {
    }
    while (std::getline(script, line) && !line.starts_with("== ")) {
        if (line.starts_with('|'))
            wanted += line.ends_with('\\') ? line.substr(2, line.size() - 3) : line.erase(0, 2) + "\n";
        if (!line.starts_with("$ ")) continue;
        EXPECT_EQ(told, wanted) << "before " << line;
        const std::size_t equals = line.find(" = ");
        std::istringstream words{line.substr(2, equals - 2)};
        test::CapturedStderr echo;
        errno = EXDEV;
        const std::string result = std::to_string(call(words));
        EXPECT_EQ(errno, EXDEV) << line;
        if (equals != line.npos) {
            EXPECT_EQ(result, line.substr(equals + 3)) << line;
        }
        told = echo.text() + std::exchange(shown_, "");
        wanted.clear();
    }
    EXPECT_EQ(told, wanted);
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(titles()), [](const auto& row) { return row.param; });

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
