// What files, disks and users can do to the verbs that read rasters or write files.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "raster_folder.h"
#include "support/limits.h"

namespace {

using testing::HasSubstr;

class HostileFiles : public test::RasterFolder {
protected:
    // The verbs that open a raster.
    [[nodiscard]] std::vector<std::vector<std::string>> jobs_on(const std::string& raster) const {
        return {{"convert", raster, file("out.raw")}, {"quicklook", raster, file("out.png")}, {"vrt", raster}};
    }
    void expect_refused(const std::string& raster, const std::string& cause) const {
        const auto before = files();
        for (const auto& job : jobs_on(raster)) {
            SCOPED_TRACE(job.front());
            const test::Finished finished = test::quo(job);
            EXPECT_EQ(finished.exit_status, 1);
            ASSERT_EQ(finished.messages().size(), 1U) << finished.err;
            EXPECT_THAT(finished.err, HasSubstr(cause));
            EXPECT_EQ(files(), before);
        }
    }
};

struct Description {
    std::vector<std::pair<const char*, const char*>> fields;
    const char* cause;
};
TEST_F(HostileFiles, DescriptionsThatMakeNoRasterAreRefused) {
    const char *const most = "2147483647", *const impossible = "describes no possible raster";
    const Description rows[] = {
        {{{"CellType", "-1"}}, impossible},
        {{{"CellType", "42"}}, impossible},
        {{{"NrOfLinesPerImage", "-4"}}, impossible},
        {{{"NrOfPixelsPerLine", "-5"}}, impossible},
        {{{"RowPrefix", "-1"}}, impossible},
        {{{"HeaderOffset", "-1"}}, impossible},
        {{{"NrOfLinesPerImage", most}, {"NrOfPixelsPerLine", most}, {"CellType", "2"}}, impossible},  // 2^66 bytes
        {{{"NrOfLinesPerImage", most}}, "its description needs"},                                     // 2^34
        {{{"NrOfLinesPerImage", "5"}}, "has 40 bytes, its description needs 50"},
        {{{"HeaderOffset", most}}, "its description needs"},
    };
    for (const Description& row : rows) {
        const std::string in = make("in.raw", 4, 5, INT16, 0);
        for (const auto& [field, value] : row.fields) {
            SCOPED_TRACE(std::string{field} + " " + value);
            ASSERT_EQ(test::quo({"set", in + ".hdr", std::string{"RasterInfo/"} + field, value}).exit_status, 0);
        }
        SCOPED_TRACE(row.fields.front().first);
        expect_refused(in, row.cause);
        EXPECT_EQ(test::quo({"info", in + ".hdr"}).exit_status, 0);
        EXPECT_EQ(test::quo({"validate", in + ".hdr"}).exit_status, 1);
    }
}

TEST_F(HostileFiles, FoldersAreNoRasters) {
    const std::string in = make("in.raw", 4, 5, INT16, 0);
    std::filesystem::remove(in);
    std::filesystem::create_directory(in);
    expect_refused(in, "in.raw: Is a directory");
    EXPECT_EQ(test::quo({"validate", in + ".hdr"}).exit_status, 1);
}

// A header belongs to the raster beside it; no name that stands in one is followed.
TEST_F(HostileFiles, NamesInHeadersAreNotFollowed) {
    const std::string in = make("in.raw", 4, 5, INT16, 0), bytes = test::read_text(in);
    for (const char* field : {"RasterInfo/FileName", "RasterInfo/SourceFilename"}) {
        ASSERT_EQ(test::quo({"set", in + ".hdr", field, "../../../../../etc/passwd", "--create"}).exit_status, 0);
    }
    for (const auto& job : jobs_on(in)) EXPECT_EQ(test::quo(job).exit_status, 0);
    EXPECT_TRUE(test::read_text(file("out.raw")) == bytes);
    EXPECT_THAT(test::read_text(in + ".vrt"), Not(HasSubstr("passwd")));
    EXPECT_EQ(test::quo({"validate", in + ".hdr"}).exit_status, 0);
}

// Each of these used to replace what it had just read, without a word: the raster by its own picture, the header
// by a table.
TEST_F(HostileFiles, OutputsAreNoneOfTheInputs) {
    const std::string in = make("r", 40, 30, INT16, 0), header = file("g.hdr"), table = file("t.csv");
    test::write_text(header, test::read_text(test::scene_file(test::scenes().front())));
    test::write_text(table, "azimuth_time_s,range_time_s\n1167930360,0.0054\n");
    std::filesystem::create_symlink(in, file("link"));
    std::filesystem::create_hard_link(in, file("hard"));
    std::filesystem::create_symlink(in + ".hdr", file("side"));
    std::filesystem::create_hard_link(in + ".hdr", file("new.hdr"));  // the side file of a raster "new"
    std::filesystem::create_symlink(in + ".hdr", in + ".vrt");
    std::vector<std::vector<std::string>> jobs{
        {"vrt", in},
        {"spectrum", in, header, "--header", header},
        {"geolocate", header, "--to", "ground", "--input", table, "--output", header},
    };
    for (const std::string& out : {file("./link"), file("hard"), file("side"), in + ".hdr"}) {
        for (const char* verb : {"quicklook", "spectrum", "convert"}) jobs.push_back({verb, in, out});
        jobs.push_back({"resample", in, out, "--lines", "50"});
    }
    for (const char* verb : {"quicklook", "spectrum"}) jobs.push_back({verb, in + ".hdr", in});
    jobs.push_back({"convert", in, file("new")});
    const auto bytes = [this] {
        std::map<std::string, std::string> all;
        for (const std::string& name : files()) all[name] = test::read_text(file(name));
        return all;
    };
    const auto before = bytes();
    for (const auto& job : jobs) {
        SCOPED_TRACE(testing::PrintToString(job));
        const test::Finished finished = test::quo(job);
        EXPECT_EQ(finished.exit_status, 1);
        EXPECT_THAT(finished.err, testing::MatchesRegex("quo: [^\n]*: would replace [^\n]*the job reads\n"));
        EXPECT_EQ(bytes(), before);
    }
    for (const auto& job : std::vector<std::vector<std::string>>{
             {"convert", in, in},
             {"resample", in, in, "--lines", "50"},
             {"geolocate", header, "--to", "ground", "--input", table, "--output", table}})
        EXPECT_EQ(test::quo(job).exit_status, 0) << job[0];
}

// Whichever name of a product the user has.
TEST_F(HostileFiles, HeadersAndRastersAnswerToBothNames) {
    const std::string in = make("in.raw", 40, 30, INT16, 0), out = file("out.raw");
    for (const std::string& name : {in, in + ".hdr"}) {
        for (const std::vector<std::string>& job : {std::vector<std::string>{"info", name},
                                                    {"validate", name},
                                                    {"get", name, "RasterInfo/CellType"},
                                                    {"convert", name, out},
                                                    {"quicklook", name, file("out.png")},
                                                    {"vrt", name}})
            EXPECT_EQ(test::quo(job).exit_status, 0) << testing::PrintToString(job);
    }
    // A header with another one beside it: `set p` used to change p.hdr.
    const std::string header = file("p"), scene = test::read_text(test::scene_file(test::scenes().front()));
    test::write_text(header, scene);
    test::write_text(header + ".hdr", scene);
    EXPECT_EQ(test::quo({"set", header, "SamplingConstants/prf_hz", "17.3"}).exit_status, 0);
    EXPECT_NE(test::read_text(header), scene);
    EXPECT_EQ(test::read_text(header + ".hdr"), scene);
}

// A file that is there, but on which every read fails, used to pass for an empty one: "holds no object of a
// product".
TEST_F(HostileFiles, HeadersThatCannotBeReadAreNotCalledEmpty) {
    const std::string header = "/proc/self/mem", field = "ROI/Lines";
    for (const std::vector<std::string>& job : {std::vector<std::string>{"info", header},
                                                {"validate", header},
                                                {"orbit", header},
                                                {"derive", header},
                                                {"get", header, field},
                                                {"set", header, field, "17"},
                                                {"config", "check", header}}) {
        const test::Finished finished = test::quo(job);
        EXPECT_EQ(finished.exit_status, 1);
        EXPECT_EQ(finished.err, "quo: /proc/self/mem: cannot be read: Input/output error\n") << job[0];
    }
}

// In a folder without the right to write the file itself is overwritten, which is less safe: nothing told so.
TEST_F(HostileFiles, OutputsWrittenInPlaceAreTold) {
    const std::string out = file("out.csv"), scene = test::scene_file(test::scenes().front());
    test::write_text(out, "older");
    chmod(out.c_str(), 0666);
    chmod(folder_.path().c_str(), 0555);
    test::Finished finished;
    {
        const test::OrdinaryUser user;
        finished =
            test::quo({"geolocate", scene, "--to", "ground", "--output", out}, "azimuth_time_s,range_time_s\n");
    }
    chmod(folder_.path().c_str(), 0755);
    EXPECT_EQ(finished.exit_status, 0);
    EXPECT_EQ(finished.err, "quo: " + out + ": written in place, no other file can be put there\n");
    EXPECT_THAT(test::read_text(out), HasSubstr("latitude_deg"));
}

TEST_F(HostileFiles, AFullStandardOutputIsAFailure) {
    const std::string scene = test::scene_file(test::scenes().front());
    for (const std::string job : {"info", "validate", "footprint", "orbit", "get"}) {
        std::vector<std::string> arguments{"-c", R"(exec "$0" "$@" > /dev/full)", QUO_TOOL, job, scene};
        if (job == "get") arguments.emplace_back("SamplingConstants/prf_hz");
        const test::Finished finished = test::Child{"/bin/sh", arguments}.wait();
        EXPECT_EQ(finished.exit_status, 1) << job;
        EXPECT_EQ(finished.err, "quo: standard output: No space left on device\n");
    }
}

// One line of 160 million samples: were it held whole, it would take 640 MB, and the part of it 560 MB. The
// sanitizers keep up to 256 MB of what is freed.
TEST_F(HostileFiles, LongLinesAreReadInPieces) {
    constexpr long kMost_kib = 450 * 1024;
    const std::string in = make_sparse("in.raw", 1, 160'000'000, INT16);
    const test::Finished seen = test::quo({"quicklook", in, file("out.png"), "--looks", "1x70001"});
    EXPECT_EQ(seen.exit_status, 0) << seen.err;
    EXPECT_LT(seen.peak_kib, kMost_kib);
    const test::Finished cut = test::quo({"convert", in, file("out.raw"), "--samples", ":70000001"});
    EXPECT_EQ(cut.exit_status, 0) << cut.err;
    EXPECT_LT(cut.peak_kib, kMost_kib);
    EXPECT_EQ(std::filesystem::file_size(file("out.raw")), 140'000'002U);
}

/** A terminal for a child process to write to. */
class Terminal {
public:
    Terminal() : master_{posix_openpt(O_RDWR | O_NOCTTY)} {
        if (master_ < 0 || grantpt(master_) != 0 || unlockpt(master_) != 0)
            throw std::runtime_error{"no terminal"};
    }
    ~Terminal() { close(master_); }
    Terminal(const Terminal&) = delete;
    Terminal& operator=(const Terminal&) = delete;

    [[nodiscard]] const char* name() const { return ptsname(master_); }
    // What has been written once `end` is part of it, or nobody writes any more.
    std::string read_until(const std::string& end) const {
        std::string text;
        char piece[256];
        while (text.find(end) == std::string::npos) {
            const ssize_t got = read(master_, piece, sizeof piece);
            if (got <= 0) break;
            text.append(piece, static_cast<std::size_t>(got));
        }
        return text;
    }

private:
    int master_;
};

// What stands in a table reaches a file as it is, but a terminal only as a text that it cannot obey.
TEST_F(HostileFiles, TablesOnATerminalAreShown) {
    const std::string table = file("t.csv"), scene = test::scene_file(test::scenes().front());
    test::write_text(table, "name,azimuth_time_s,range_time_s\nx\u009B2J,1167930360,0.0054\n");
    const std::vector<std::string> job{"geolocate", scene, "--to", "ground", "--input", table};
    EXPECT_THAT(test::quo(job).out, HasSubstr("\nx\u009B2J,"));
    const Terminal terminal;
    std::vector<std::string> all{"-c", std::string{R"(exec "$0" "$@" > )"} + terminal.name(), QUO_TOOL};
    all.insert(all.end(), job.begin(), job.end());
    EXPECT_EQ(test::Child("/bin/sh", all).wait().exit_status, 0);
    const std::string seen = terminal.read_until("2J,");
    EXPECT_THAT(seen, HasSubstr("\nx\\u009b2J,"));
}

// 32 GB to be read, of which the user sees the beginning.
TEST_F(HostileFiles, ConversionsShowTheirProgressAndCanBeInterrupted) {
    const std::string in = make_sparse("in.raw", 400'000'000, 40, INT16), out = file("out.raw");
    test::write_text(out, "older");
    const auto before = files();
    const Terminal terminal;
    test::Child child{QUO_TOOL, {"convert", in, out, "--samples", "3:4"}, "", terminal.name()};
    const std::string shown = terminal.read_until("left");
    EXPECT_THAT(shown, testing::ContainsRegex("[0-9]+ %  [0-9]+ MB/s  [0-9:]+ left"));
    EXPECT_EQ(files().size(), before.size() + 1) << "the unfinished raster";
    kill(child.id(), SIGINT);
    EXPECT_EQ(child.wait().signal, SIGINT);
    EXPECT_EQ(files(), before);
    EXPECT_EQ(test::read_text(out), "older");
}

}  // namespace
