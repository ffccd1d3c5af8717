#include <gmock/gmock.h>

#include <array>
#include <cstdint>
#include <nlohmann/json.hpp>

#include "quo_base/debugIO.h"
#include "raster_folder.h"
#include "tool.h"

namespace {

using test::Finished;
using test::quo;
using testing::HasSubstr;

std::string words(std::int32_t type, std::int32_t first, std::int32_t second) {
    const std::array<std::int32_t, 3> all{type, first, second};
    return {reinterpret_cast<const char*>(all.data()), sizeof all};
}

struct Shown {
    int type;
    std::string bytes;  // of two elements
    const char* as_json;
};
template <typename... T>
std::string bytes_of(T... values) {
    std::string bytes;
    (bytes.append(reinterpret_cast<const char*>(&values), sizeof values), ...);
    return bytes;
}

// Every type code, read back from what write_debug itself wrote.
TEST(DebugDump, ShowsTheValuesOfEveryType) {
    const Shown rows[] = {
        {0, bytes_of(17.3F, -0.5F), "[17.3, -0.5]"},
        {1, bytes_of(0.1, -1e300), "[0.1, -1e300]"},
        {2, bytes_of(1.5F, -2.0F, 0.25F, 8.0F), "[[1.5, -2.0], [0.25, 8.0]]"},
        {3, bytes_of(0.1, 0.2, -0.3, 1e-300), "[[0.1, 0.2], [-0.3, 1e-300]]"},
        {4, bytes_of(std::int16_t{-32768}, std::int16_t{258}), "[-32768, 258]"},
        {5, bytes_of(std::int8_t{-128}, std::int8_t{17}), "[-128, 17]"},
    };
    const test::TemporaryFolder folder;
    const std::string file = folder.file("dump");
    for (const Shown& row : rows) {
        ASSERT_EQ(write_debug(file.c_str(), row.bytes.data(), row.type, 2, 1), 0);
        const Finished shown = quo({"debug-dump", file, "--json"});
        ASSERT_EQ(shown.exit_status, 0) << shown.err;
        const auto json = nlohmann::json::parse(shown.out);
        EXPECT_EQ(json["type_code"], row.type);
        EXPECT_EQ(json["first"], 2);
        EXPECT_EQ(json["second"], 1);
        EXPECT_EQ(json["values"], nlohmann::json::parse(row.as_json)) << row.type;
    }
}

TEST(DebugDump, TellsPlaceAndStopsWhereAsked) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("dump");
    const std::int16_t data[6] = {1, 2, 3, 4, 5, 6};
    ASSERT_EQ(write_debug(file.c_str(), data, 4, 2, 3), 0);
    EXPECT_EQ(quo({"debug-dump", file, "--values", "5"}).out,
              "type code           4, 2 bytes, shown as INT16\nfirst dimension     2\nsecond dimension    3\n"
              "0,0                 1\n0,1                 2\n0,2                 3\n1,0                 4\n"
              "1,1                 5\n");
}

struct Broken {
    const char* name;
    std::string bytes;
    const char* cause;
    bool shown = false;  // whether what is there is shown all the same
};
void PrintTo(const Broken& row, std::ostream* stream) { *stream << row.name; }
const Broken kBroken[] = {
    {"Empty", "", "has 0 bytes"},
    {"HalfAHeader", words(1, 2, 3).substr(0, 11), "has 11 bytes"},
    {"UnknownType", words(6, 1, 1) + "x", "type code is 6"},
    {"OtherByteOrder", words(0x01000000, 1, 1), "type code is 16777216"},
    {"NegativeDimension", words(1, -2, -3) + std::string(48, 'x'), "dimensions are -2 and -3"},
    {"NoValues", words(3, 2, 5), "holds 0 of 10 elements", true},
    {"HalfAValue", words(1, 2, 1) + std::string(12, '\0'), "holds 1 of 2 elements", true},
    {"MoreThanAnyFile", words(3, 2147483647, 2147483647) + std::string(40, '\0'),
     "holds 2 of 4611686014132420609 elements", true},
    {"TooLong", words(5, 1, 1) + "abc", "goes on for 2 bytes", true},
    {"EmptyAndTooLong", words(5, 0, 7) + "a", "goes on for 1 bytes", true},
};
class BrokenDump : public testing::TestWithParam<Broken> {};

TEST_P(BrokenDump, GivesItsCauseAndStatusOne) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("dump");
    test::write_text(file, GetParam().bytes);
    const Finished finished = quo({"debug-dump", file, "--values", "2000000000"});
    EXPECT_EQ(finished.exit_status, 1);
    EXPECT_EQ(finished.messages().size(), 1U);
    EXPECT_THAT(finished.err, HasSubstr(GetParam().cause));
    EXPECT_EQ(finished.out.empty(), !GetParam().shown);
}
INSTANTIATE_TEST_SUITE_P(Files, BrokenDump, testing::ValuesIn(kBroken),
                         [](const auto& row) { return row.param.name; });

TEST(DebugDump, NamesWhatIsNoFile) {
    const test::TemporaryFolder folder;
    EXPECT_THAT(quo({"debug-dump", folder.path()}).err, HasSubstr("not a regular file"));
    EXPECT_THAT(quo({"debug-dump", folder.file("none")}).err, HasSubstr("No such file"));
    EXPECT_EQ(quo({"debug-dump", folder.file("none"), "--values", "-1"}).exit_status, 2);
}

// --- waitbars ---------------------------------------------------------------------------------------------------

double value_of(const std::string& line) {
    const std::string command = "SET_WAITBAR: ";
    EXPECT_THAT(line, testing::StartsWith(command));
    EXPECT_EQ(line.back(), ' ');
    return std::stod(line.substr(command.size()));
}

/** Open, title, rising shares that end at 1, close. */
void expect_waitbar(const Finished& finished, const std::string& title) {
    EXPECT_EQ(finished.exit_status, 0);
    const auto lines = finished.messages();
    ASSERT_GT(lines.size(), 3U);
    EXPECT_EQ(lines[0], "USE_WAITBAR");
    EXPECT_EQ(lines[1], "SET_TITLE: " + title);
    EXPECT_EQ(lines.back(), "CLOSE_WAITBAR");
    double before = -1.0;
    for (std::size_t i = 2; i + 1 < lines.size(); ++i) {
        EXPECT_GT(value_of(lines[i]), before);
        before = value_of(lines[i]);
    }
    EXPECT_EQ(before, 1.0);
    EXPECT_LE(lines.size(), 110U) << "a parent process is told about every hundredth";
}

class Waitbar : public test::RasterFolder {};

TEST_F(Waitbar, FollowsTheLongJobs) {
    const std::string raster = make_sparse("in.raw", 3000, 1000, FLOAT_COMPLEX);
    expect_waitbar(quo({"convert", raster, file("out.raw"), "--waitbar"}), "Converting");
    expect_waitbar(quo({"quicklook", raster, file("out.png"), "--waitbar"}), "Quick look");

    const std::string table = file("table.csv"), header = test::scene_file("s1a_iw1_slc_20220104_asc");
    std::string rows = "azimuth_time_s,range_time_s\n";
    for (int i = 0; i < 300; ++i) rows += "1167930358.5,0.0054\n";
    test::write_text(table, rows);
    std::vector<std::string> job{"geolocate", header, "--to", "ground", "--input", table, "--waitbar"};
    expect_waitbar(quo(job), "Geolocating");
    job.insert(job.end(), {"--output", "/dev/full"});
    const Finished failed = quo(job);
    EXPECT_EQ(failed.exit_status, 1);
    EXPECT_THAT(failed.err, HasSubstr("\nCLOSE_WAITBAR\nquo: ")) << "closed before the cause is told";
}

}  // namespace
