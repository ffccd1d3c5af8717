// SPDX-License-Identifier: Apache-2.0

// What files, disks and users can do to the verbs that read rasters or write files.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "raster_folder.h"
#include "support/limits.h"

namespace {

using testing::HasSubstr;

using HostileFiles = test::RasterFolder;

// In a folder without the right to write the file itself is overwritten, which is less safe: nothing told so.
TEST_F(HostileFiles, OutputsWrittenInPlaceAreTold) {
    const std::string out = file("out.csv"), scene = test::scene_file("s1a_iw1_slc_20220104_asc.xml");
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
    const std::string table = file("t.csv"), scene = test::scene_file("s1a_iw1_slc_20220104_asc.xml");
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

// The job waits for input that never comes and is asked to stop: the signal ends it, and neither a half result nor
// the unfinished file beside it is left.
TEST_F(HostileFiles, TablesAreNotLeftHalfWritten) {
    const std::string pipe = file("pipe"), scene = test::scene_file("s1a_iw1_slc_20220104_asc.xml");
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    test::Child child{QUO_TOOL,
                      {"geolocate", scene, "--to", "ground", "--input", pipe, "--output", file("result.csv")}};
    std::ofstream rows{pipe};
    rows << "azimuth_time_s,range_time_s\n1167930370.5,0.0056\n" << std::flush;
    while (files().size() < 2) usleep(1000);  // the pipe and the unfinished file
    kill(child.id(), SIGTERM);
    EXPECT_EQ(child.wait().signal, SIGTERM);
    EXPECT_EQ(files(), std::set<std::string>{"pipe"});
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
