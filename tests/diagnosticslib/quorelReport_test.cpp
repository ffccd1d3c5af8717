#include "quo_base/quorelReport.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "support/diagnostics.h"

namespace {

TEST(QuorelException, KeepsMessageAndPosition) {
    errno = ENOENT;
    const struct {
        quorelException made;
        const char* message;
        int line;
        const char *function, *file;
        int error;
    } rows[] = {
        {{}, "generic quorel exception.\n", 0, "", "", ENOENT},
        {{17, "focus", "chain.cpp"}, "chain.cpp: focus (17): exception found", 17, "focus", "chain.cpp", ENOENT},
        {{18, "scan", "io.cpp", "no 100%s luck"}, "no 100%s luck", 18, "scan", "io.cpp", 0},
        {quorelException{"alone"}, "alone", -1, "UNKNOWN FUNCTION", "UNKNOWN FILE", 0},
    };
    for (const auto& [made, message, line, function, file, error] : rows) {
        EXPECT_STREQ(made.what(), message);
        EXPECT_EQ(made.getLine(), line) << message;
        EXPECT_STREQ(made.getFunction(), function) << message;
        EXPECT_STREQ(made.getFile(), file) << message;
        EXPECT_EQ(made.getErrorNumber(), error) << message;
    }
    errno = 0;
}

TEST(QuorelException, CutsEveryTextAt511Bytes) {
    const std::string endless(5000, 'x');
    const char* const text = endless.c_str();
    const quorelException whole{1, text, text, text}, placed{1, text, text};
    for (const char* kept : {whole.what(), whole.getFunction(), whole.getFile(), placed.what()})
        EXPECT_EQ(std::strlen(kept), 511U);
    EXPECT_STREQ(quorelException(1, nullptr, nullptr, nullptr).what(), "");
}

std::string shown(const test::ReportEntry& entry) {
    return entry.kind + ": " + entry.message + ", " + entry.file + ", " + entry.function + ", " +
           std::to_string(entry.line);
}

TEST(QuorelReport, WritesEntriesOfEveryForm) {
    const test::CapturedStderr silent;
    quorelReport report;
    report.addEntry("dropped while closed %d", 1);
    const test::Report open;
    quorelReport::addEntry(QUO_WARNING, 17, "chain.cpp", "focus", "%d of %s", 3, "seven");
    report.addEntry("no kind %d", 5);
    report.addEntry(QUO_CHECKPOINT, "%s", std::string(100000, 'x').c_str());
    const quorelException exception{9, "scan", "io.cpp", "100%s %n done"};
    quorelReport::addEntry(&exception);
    errno = ENOENT;
    for (const int line : {5, 6}) quorelReport::checkErrno(line, "focus", "chain.cpp");
    EXPECT_EQ(errno, 0);
    report.end_report();
    std::vector<std::string> entries;
    for (const test::ReportEntry& entry : open.entries()) entries.push_back(shown(entry));
    EXPECT_THAT(entries, testing::ElementsAre("WARNING: 3 of seven, chain.cpp, focus, 17",
                                              "UNKNOWN: no kind 5, UNKNOWN, UNKNOWN, 0",
                                              "CHECKPOINT: " + std::string(2047, 'x') + ", UNKNOWN, UNKNOWN, 0",
                                              "ERROR: 100%s %n done, io.cpp, scan, 9",
                                              "WARNING: errno 2 (No such file or directory), chain.cpp, focus, 5",
                                              "CHECKPOINT: End of processing, UNKNOWN, UNKNOWN, 0"));
}

TEST(QuorelReport, OpensOnceAndWarnsOfChanges) {
    const test::TemporaryFolder folder;
    const std::string first = folder.file("first.txt"), second = folder.file("second.txt"),
                      log = folder.file("log.txt");
    quorelReport report;
    report.setLevel(2);  // no name yet
    EXPECT_EQ(report.getLevel(), 0);
    report.setLogName(log.c_str());
    report.addLog("dropped");
    report.setReportName(first.c_str());
    EXPECT_EQ(report.getLevel(), 1);
    report.addLog("%d lines", 12);
    report.setReportName(second.c_str());
    report.setLevel(2);
    EXPECT_EQ(report.getLevel(), 1);
    EXPECT_STREQ(report.getReportName(), first.c_str());
    EXPECT_THAT(test::read_text(first), testing::HasSubstr("Cannot change report FILENAME!"));
    EXPECT_THAT(test::read_text(first), testing::HasSubstr("Cannot change report LEVEL!"));
    EXPECT_EQ(test::read_text(second), "");
    exit_report();
    EXPECT_EQ(test::read_text(log), "\n0) 12 lines\n");
    report.setLevel(3);  // the name is still known
    EXPECT_EQ(report.getLevel(), 3);
    exit_report();

    // The name of the report that was closed stood in the way of every later one; one of an invalid level is kept.
    EXPECT_EQ((quorelReport{second.c_str(), 7}.getLevel()), 0);
    EXPECT_EQ(ckflg_ckerr(), 1);
    report.setLevel(2);
    EXPECT_STREQ(report.getReportName(), second.c_str());
    quorelReport{first.c_str(), 3};
    EXPECT_EQ(report.getLevel(), 2);
    EXPECT_THAT(test::read_text(second), testing::AllOf(testing::HasSubstr("QUOREL report (level 2) - - -"),
                                                        testing::HasSubstr("Cannot change report FILENAME!")));
    exit_report();
}

struct Progress {
    float percentage;
    const char *text, *content;
};

TEST(QuorelReport, ProgressFileHoldsTheLatestStateOnly) {
    const test::TemporaryFolder folder;
    const std::string name = folder.file("progress.txt");
    quorelReport report;
    EXPECT_EQ(report.progress_update(5.0F, "nowhere"), 9);
    EXPECT_EQ(errno, 0);
    report.setProgressName(name.c_str());
    for (const auto& [percentage, text, content] :
         {Progress{150.0F, "done", "100 \ndone"}, Progress{99.99F, "100%s of %n", "99 \n100%s of %n"},
          Progress{0.0F, "", "0 \n"}, Progress{-3.7F, "odd", "-3 \nodd"}, Progress{NAN, "lost", "0 \nlost"},
          Progress{-INFINITY, "", "-2147483648 \n"}, Progress{INFINITY, nullptr, "100 \n"}}) {
        EXPECT_EQ(report.progress_update(percentage, text), 0);
        EXPECT_EQ(test::read_text(name), content);
    }
    report.setProgressName("/dev/full");
    EXPECT_EQ(report.progress_update(5.0F, "full"), 5);
    EXPECT_EQ(errno, 0);
}

}  // namespace
