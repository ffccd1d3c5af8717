#include <gmock/gmock.h>

#include "tool.h"

namespace {

using test::quo;
using test::scene_file;
using testing::HasSubstr;
using testing::StartsWith;

const std::string kHeader = scene_file("s1a_iw1_slc_20220104_asc");

// The names of the subcommands, as the help lists them.
std::vector<std::string> subcommands() {
    std::istringstream help{quo({"--help"}).out};
    std::vector<std::string> names;
    bool listed = false;
    for (std::string line; std::getline(help, line);) {
        if (listed && line.starts_with("  ") && line[2] != ' ')
            names.push_back(line.substr(2, line.find(' ', 2) - 2));
        listed = listed || line == "Subcommands:";
    }
    return names;
}

TEST(CommandLine, EverySubcommandHasItsHelpAndItsSectionInTheManual) {
    const std::string manual = test::read_text(std::string{QUO_TEST_DATA} + "/../../docs/tools.md");
    const std::vector<std::string> names = subcommands();
    EXPECT_GE(names.size(), 15U);
    for (const std::string& name : names) {
        SCOPED_TRACE(name);
        EXPECT_EQ(quo({name, "--help"}).exit_status, 0);
        EXPECT_THAT(manual, testing::ContainsRegex("\n## [^\n]*quo " + name + "[\n,]"));
        EXPECT_THAT(manual, testing::ContainsRegex("\n(\\$ )?quo " + name + " [^\n]")) << "how it is called";
    }
}

TEST(CommandLine, TellsItsVersion) {
    const auto version = quo({"--version"});
    EXPECT_EQ(version.exit_status, 0);
    EXPECT_EQ(version.out, "quo " QUO_VERSION "\n");
}

struct Refusal {
    const char* name;
    std::vector<std::string> arguments;
};
void PrintTo(const Refusal& row, std::ostream* stream) { *stream << row.name; }
const Refusal kWrongUses[] = {
    {"NoSubcommand", {}},
    {"UnknownSubcommand", {"geocode"}},
    {"UnknownOption", {"orbit", kHeader, "--loud"}},
    {"NoHeader", {"geolocate", "--to", "ground"}},
    {"NoDirection", {"geolocate", kHeader}},
    {"UnknownDirection", {"geolocate", kHeader, "--to", "moon"}},
    {"PreciseToTheGround", {"geolocate", kHeader, "--to", "ground", "--precise"}},
    {"UnknownSide", {"geolocate", kHeader, "--to", "ground", "--look", "up"}},
    {"NegativeWavelength", {"geolocate", kHeader, "--to", "ground", "--wavelength", "-0.05"}},
    {"WavelengthInWords", {"geolocate", kHeader, "--to", "ground", "--wavelength", "C"}},
    {"WavelengthNotANumber", {"geolocate", kHeader, "--to", "ground", "--wavelength", "nan"}},
    {"ZeroWavelength", {"geolocate", kHeader, "--to", "ground", "--wavelength", "0"}},
    {"NegativeSpacing", {"geolocate", kHeader, "--to", "ground", "--resample", "-10"}},
    {"ZeroStep", {"orbit", kHeader, "--every", "0"}},
    {"NegativeStep", {"orbit", kHeader, "--every", "-1"}},
    {"StepTooSmall", {"orbit", kHeader, "--every", "1e-9"}},
    {"TimeAndStep", {"orbit", kHeader, "--at", "1167930300", "--every", "1"}},
    {"TimeOfOrbitInWords", {"orbit", kHeader, "--at", "noon"}},
    {"NoTime", {"time"}},
    {"TimeInWords", {"time", "yesterday"}},
    {"UnknownMonth", {"time", "04-XYZ-2022"}},
    {"PointsForTwoHeaders", {"tiepoints", kHeader, kHeader, "--points", "x.csv"}},
};

class WrongUse : public testing::TestWithParam<Refusal> {};

TEST_P(WrongUse, IsRefusedInOneLineWithStatusTwo) {
    const auto refused = quo(GetParam().arguments, "azimuth_time_s,range_time_s\n");
    EXPECT_EQ(refused.exit_status, 2);
    EXPECT_EQ(refused.out, "");
    ASSERT_EQ(refused.messages().size(), 1U) << refused.err;
    EXPECT_THAT(refused.err, StartsWith("quo: "));
    const bool no_verb = GetParam().arguments.empty() || GetParam().arguments[0] == "geocode";
    EXPECT_THAT(refused.err,
                HasSubstr(no_verb ? "; there are geolocate" : "(see quo " + GetParam().arguments[0] + " --help)"));
}
INSTANTIATE_TEST_SUITE_P(CommandLine, WrongUse, testing::ValuesIn(kWrongUses),
                         [](const auto& row) { return row.param.name; });

struct FailedJob {
    const char* name;
    std::string header, table, cause;  // an empty table: the job is `orbit`
    std::vector<std::string> options = {};
};
void PrintTo(const FailedJob& row, std::ostream* stream) { *stream << row.name; }

class Failing : public testing::TestWithParam<FailedJob> {
protected:
    static std::string made(const test::MadeHeader& about) {
        return header_of(test::CircularOrbit{41.3, 12.8, -12.7}, about);
    }
};

const std::string kTable = "azimuth_time_s,range_time_s\n1167930310.25,0.0056\n";
const std::string kFiveVectors = header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.vectors = 5});

std::string without(std::string text, const std::string& part) { return text.erase(text.find(part), part.size()); }

const FailedJob kFailedJobs[] = {
    {"EmptyHeader", " ", "", "no state vectors"},
    {"HeaderInWords", "not a header", "", "no state vectors"},
    {"HeaderCutShort", kFiveVectors.substr(0, kFiveVectors.size() / 2), "", "is no XML, line 1: "},
    {"BrokenXml", "<QuorelXmlDoc>\n<a>\n</b>\n</QuorelXmlDoc>", "", "is no XML, line 3: "},
    {"NoCountOfVectors", without(kFiveVectors, "<nSV_n>5</nSV_n>"), "", "no state vectors"},
    {"FourVectors", header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.vectors = 4}), "", "at least 5"},
    {"NoSpacing", header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.spacing_s = 0.0}), "", "spacing"},
    {"NoWavelength", header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.wavelength_m = ""}), kTable,
     "--wavelength"},
    {"UnknownWavelength", header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.wavelength_m = "-999"}), kTable,
     "--wavelength"},
    {"NoLookSide", header_of(test::CircularOrbit{41.3, 12.8, -12.7}, {.look_direction = ""}), kTable, "--look"},
    {"EmptyTable", kFiveVectors, "\n\n", "no line of column names"},
    {"OnlyComments", kFiveVectors, "# a\n# b", "no line of column names"},
    {"MissingColumn", kFiveVectors, "azimuth_time_s,range_s\n1,2\n", "no column range_time_s"},
    {"ColumnTwice", kFiveVectors, "azimuth_time_s,range_time_s,range_time_s\n1,2,3\n", "two columns"},
    {"OpenQuoteInTheHeading", kFiveVectors, "azimuth_time_s,\"range_time_s\n1,2\n", "quote"},
    {"EndlessLine", kFiveVectors, kTable + std::string(2'000'000, '7') + "\n", "longer than 1 MiB"},
};

// A guess in place of what is missing, here above all wavelength and look side, would give plausible wrong
// numbers.
TEST_P(Failing, NamesFileAndCauseInOneLineWithStatusOne) {
    const FailedJob& job = GetParam();
    const test::TemporaryFolder folder;
    const std::string header = folder.file("header.xml");
    const std::string table = folder.file("table.csv");
    test::write_text(header, job.header);
    test::write_text(table, job.table);
    const auto failed = job.table.empty() ? quo({"orbit", header})
                                          : quo({"geolocate", header, "--to", "ground", "--input", table,
                                                 "--output", folder.file("result.csv")});
    EXPECT_EQ(failed.exit_status, 1);
    ASSERT_EQ(failed.messages().size(), 1U) << failed.err;
    EXPECT_THAT(failed.err, HasSubstr(job.cause));
    EXPECT_THAT(failed.err, testing::ContainsRegex("(header.xml|table.csv): "));
    EXPECT_FALSE(std::filesystem::exists(folder.file("result.csv")));
}
INSTANTIATE_TEST_SUITE_P(CommandLine, Failing, testing::ValuesIn(kFailedJobs),
                         [](const auto& row) { return row.param.name; });

TEST(CommandLine, NamesFilesThatCannotBeOpened) {
    const test::TemporaryFolder folder;
    const std::string missing = folder.file("missing");
    EXPECT_EQ(quo({"orbit", missing}).err, "quo: " + missing + ": No such file or directory\n");
    EXPECT_EQ(quo({"orbit", folder.path()}).err, "quo: " + folder.path().string() + ": not a regular file\n");
    const auto no_input = quo({"geolocate", kHeader, "--to", "ground", "--input", missing});
    EXPECT_EQ(no_input.exit_status, 1);
    EXPECT_EQ(no_input.err, "quo: " + missing + ": No such file or directory\n");
    const std::string unreachable = folder.file("no/such/folder");
    const auto no_output = quo({"geolocate", kHeader, "--to", "ground", "--output", unreachable}, kTable);
    EXPECT_EQ(no_output.exit_status, 1);
    EXPECT_EQ(no_output.err, "quo: " + unreachable + ": No such file or directory\n");
}

// File names and headers are data: what is in them must neither forge lines nor steer a terminal. Control
// characters of one byte were blanked, those of U+0080 on and the ones that turn the writing came through.
TEST(CommandLine, ShowsWhatATerminalWouldObey) {
    struct Row {
        const char *raw, *shown;
    };
    constexpr Row kRows[] = {
        {"a\nquo: b\033[2J", "a\\nquo: b\\u001b[2J"},
        {"\x7F", "\\u007f"},
        {"\u0080\u009B2J\u009F", "\\u0080\\u009b2J\\u009f"},
        {"\u061C\u200E\u200F", "\\u061c\\u200e\\u200f"},
        {"\u202Agpj.\u202Etxt", "\\u202agpj.\\u202etxt"},
        {"\u2066a\u2069", "\\u2066a\\u2069"},
        {"\x9B"
         "2J",
         "\\x9b2J"},
        {"\xC2", "\\xc2"},
        {"\xE0\x82\x9B", "\\xe0\\x82\\x9b"},
        {"Z\u00FCrich \u65E5\u672C \U0001F6F0", "Z\u00FCrich \u65E5\u672C \U0001F6F0"},
    };
    for (const auto& [raw, shown] : kRows)
        EXPECT_EQ(quo({"orbit", raw}).err, std::string{"quo: "} + shown + ": No such file or directory\n");

    const std::string evil = "\u009B2J\u202E\u2066\u200F";
    const test::TemporaryFolder folder;
    std::string text = test::read_text(kHeader);
    for (const char* element : {"<SceneID>", "<SenseDate>", "<Swath>"})
        text.insert(text.find(element) + std::string_view{element}.size(), evil);
    const std::string header = folder.file("scene" + evil + ".xml"), table = folder.file("t" + evil + ".csv");
    test::write_text(header, text);
    test::write_text(table, "time" + evil + ",b\n1,2\n3,4\n");
    const std::vector<std::vector<std::string>> jobs{
        {"info", header},
        {"info", header, "--json"},
        {"validate", header},
        {"validate", header, "--json"},
        {"get", header, "DataSetInfo/SceneID"},
        {"get", header, "DataSetInfo/SceneID", "--json"},
        {"get", header, "A/" + evil},
        {"footprint", header},
        {"orbit", header},
        {"orbit", header, "--json"},
        {"config", "check", header},
        {"config", "show", header},
        {"quicklook", header, "x"},
        {"fit", "--degree", "1", "--input", table},
        {"fit", "--degree", "1", "--json", "--input", table},
        {"fit", "--degree", "3", "--input", table},
        {"time", evil},
        {evil},
        {"tiepoints", header, "--points", test::scene_file("s1a_iw1_slc_20220104_asc", "_tie_points.csv")}};
    for (const auto& job : jobs) {
        SCOPED_TRACE(testing::PrintToString(job));
        const auto finished = quo(job);
        const std::string said = finished.out + finished.err;
        EXPECT_NE(said, "");
        for (const char* code : {"\u009B", "\u202E", "\u2066", "\u200F"}) EXPECT_EQ(said.find(code), said.npos);
    }
}

TEST(CommandLine, NamesTheVerbsWhereNoneIsMeant) {
    const auto refused = quo({"nosuch"});
    EXPECT_EQ(refused.exit_status, 2);
    EXPECT_THAT(refused.err, StartsWith("quo: no verb nosuch; there are geolocate, orbit, time"));
}

}  // namespace
