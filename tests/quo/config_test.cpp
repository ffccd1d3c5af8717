#include <gmock/gmock.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "support/limits.h"
#include "tool.h"

namespace {

using test::Finished;
using test::quo;
using test::read_text;
using test::write_text;
using testing::HasSubstr;

const std::vector<std::string> kRecords{"AzimuthConf",           "DCestConf",      "ExtractorConf",
                                        "generalProcessingConf", "FinefitestConf", "EnvisatCalibrationFactors",
                                        "DemExtractorConf",      "GeocodingConf",  "ATPrecise_FitestConf",
                                        "CoregistrationConf",    "CoherenceConf"};

class Config : public testing::Test {
protected:
    static Finished make(const std::string& file, std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"config", "new", "-o", file});
        return quo(arguments);
    }
    [[nodiscard]] Finished make(const std::vector<std::string>& arguments) const { return make(file_, arguments); }
    void change(const std::string& from, const std::string& to) {
        std::string text = read_text(file_);
        ASSERT_NE(text.find(from), text.npos) << from;
        write_text(file_, text.replace(text.find(from), from.size(), to));
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("c.xml");
};

TEST_F(Config, NewFilesOfAllRecordsAreFineAndShowTheirDefaults) {
    ASSERT_EQ(make(kRecords).exit_status, 0);
    EXPECT_EQ(quo({"config", "check", file_}).out, "0 errors in 11 records\n");
    const auto json = nlohmann::json::parse(quo({"config", "show", file_, "--json"}).out);
    EXPECT_EQ(json.size(), 12U);
    EXPECT_EQ(json["GeocodingConf"]["InterpolationFilterBandwidth"], 0.8);
    EXPECT_EQ(json["DCestConf"]["Pol_weights"].size(), 7U);
    EXPECT_EQ(json["shared"]["ReportFilename"], "quorelReport.txt");
    EXPECT_EQ(make("-", kRecords).out, read_text(file_));
}

TEST_F(Config, NewRecordsJoinAFileAndReplaceNothingUnasked) {
    ASSERT_EQ(make({"AzimuthConf"}).exit_status, 0);
    change("<LinesInBlock>5000", "<LinesInBlock>4321");
    ASSERT_EQ(make({"ExtractorConf"}).exit_status, 0);
    const std::string before = read_text(file_);
    EXPECT_THAT(before, HasSubstr("<LinesInBlock>4321"));
    const Finished refused = make({"CoherenceConf", "AzimuthConf"});
    EXPECT_EQ(refused.exit_status, 1);
    EXPECT_THAT(refused.err, HasSubstr("c.xml: has a record AzimuthConf"));
    {
        const test::FullDisk full{100};
        EXPECT_EQ(make({"CoherenceConf"}).exit_status, 1);
    }
    EXPECT_EQ(read_text(file_), before);
    ASSERT_EQ(make({"AzimuthConf", "--replace"}).exit_status, 0);
    EXPECT_THAT(read_text(file_), HasSubstr("<LinesInBlock>5000"));
    EXPECT_THAT(read_text(file_), HasSubstr("<RawLinesSkip>"));
    std::size_t files = 0;
    for (const auto& entry : std::filesystem::directory_iterator{folder_.path()})
        files += entry.exists() ? 1U : 0U;
    EXPECT_EQ(files, 1U) << "nothing unfinished is left";
}

TEST_F(Config, ShowTellsWhatDiffersFromTheDefaults) {
    ASSERT_EQ(make({"AzimuthConf", "GeocodingConf"}).exit_status, 0);
    change("<AntennaLength>10", "<AntennaLength>12.3");
    change("<AzimuthConf>", "<generalProcessingConf><Memory>2048</Memory></generalProcessingConf><AzimuthConf>");
    const Finished shown = quo({"config", "show", file_});
    EXPECT_EQ(shown.exit_status, 0);
    EXPECT_THAT(shown.out, HasSubstr("[shared]\nMemory                          2048 MB  (default 512)\n"));
    EXPECT_THAT(shown.out, HasSubstr("\nAntennaLength                   12.3 m  (default 10)\n"));
    EXPECT_THAT(shown.out, HasSubstr("\nInterpolationFilterBandwidth    0.8\n"));
    EXPECT_EQ(quo({"config", "check", file_}).exit_status, 0);
}

TEST_F(Config, CheckNamesSectionParameterAndReason) {
    ASSERT_EQ(make({"AzimuthConf", "GeocodingConf"}).exit_status, 0);
    change("<WhiteningFlag>0", "<WhiteningFlag>2");
    change("<StoltPadding>", "<StoltPading>1</StoltPading><StoltPadding>");
    change("<InterpolationPrecision>2</InterpolationPrecision>", "");
    change("<GeocodingConf>", "<Geo/><GeocodingConf>");
    const Finished checked = quo({"config", "check", file_});
    EXPECT_EQ(checked.exit_status, 1);
    EXPECT_EQ(checked.out,
              "AzimuthConf/WhiteningFlag  2 lies above 1\nAzimuthConf/StoltPading  is unknown\n"
              "Geo  is no configuration record\nGeocodingConf/InterpolationPrecision  is missing\n"
              "4 errors in 2 records\n");
    const auto json = nlohmann::json::parse(quo({"config", "check", file_, "--json"}).out);
    ASSERT_EQ(json.size(), 4U);
    EXPECT_EQ(json[3],
              (nlohmann::json{
                  {"section", "GeocodingConf"}, {"name", "InterpolationPrecision"}, {"reason", "is missing"}}));
    const Finished shown = quo({"config", "show", file_});
    EXPECT_EQ(shown.exit_status, 1);
    EXPECT_THAT(shown.out, HasSubstr("[AzimuthConf]"));
    EXPECT_THAT(shown.err, HasSubstr("GeocodingConf is incomplete"));
}

struct Refused {
    const char* name;
    std::vector<std::string> arguments;  // FILE stands for the file
    std::string content;                 // "" for none
    int status;
    const char* cause;
};
void PrintTo(const Refused& row, std::ostream* stream) { *stream << row.name; }
const std::string kEmpty =
    "<QuorelXmlDoc><NumberOfChannels>1</NumberOfChannels><Description/><Channel Number=\"1\"/></QuorelXmlDoc>";
const Refused kRefused[] = {
    {"Missing", {"config", "show", "FILE"}, "", 1, "no such file"},
    {"Words", {"config", "check", "FILE"}, "words", 1, "is no configuration file"},
    {"CutShort", {"config", "check", "FILE"}, kEmpty.substr(0, 90), 1, "is no XML, line "},
    {"NoRecord", {"config", "check", "FILE"}, kEmpty, 1, "holds no record"},
    {"NoRecordToShow", {"config", "show", "FILE"}, kEmpty, 1, "holds no record"},
    {"AddToWords", {"config", "new", "AzimuthConf", "-o", "FILE"}, "words", 1, "is no configuration file"},
    {"NoSuchRecord", {"config", "new", "AzimutConf", "-o", "FILE"}, "", 2, "no record"},
    {"NoSuchRecordToDescribe", {"config", "doc", "Azimuth"}, "", 2, "there are AzimuthConf"},
    {"NoOutput", {"config", "new", "AzimuthConf"}, "", 2, "--output"},
    {"NoVerb", {"config"}, "", 2, "subcommand"},
};
class ConfigRefuses : public testing::TestWithParam<Refused> {};

TEST_P(ConfigRefuses, InOneLine) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("c.xml");
    std::vector<std::string> arguments = GetParam().arguments;
    std::replace(arguments.begin(), arguments.end(), std::string{"FILE"}, file);
    if (!GetParam().content.empty()) write_text(file, GetParam().content);
    const Finished refused = quo(arguments);
    EXPECT_EQ(refused.exit_status, GetParam().status);
    EXPECT_EQ(refused.out, "");
    EXPECT_EQ(refused.messages().size(), 1U) << refused.err;
    EXPECT_THAT(refused.err, HasSubstr(GetParam().cause));
    EXPECT_EQ(read_text(file), GetParam().content);
}
INSTANTIATE_TEST_SUITE_P(Cases, ConfigRefuses, testing::ValuesIn(kRefused),
                         [](const auto& row) { return row.param.name; });

// The page shows the tables that the program prints.
TEST(ConfigDoc, StandsInTheDocumentation) {
    const std::string page = read_text(QUO_TEST_DATA "/../../docs/configuration.md");
    const std::string begin = "<!-- printed by quo config doc -->\n", end = "<!-- end -->\n";
    const auto first = page.find(begin) + begin.size(), last = page.find(end);
    ASSERT_NE(last, page.npos);
    ASSERT_LT(first, last);
    EXPECT_TRUE(quo({"config", "doc"}).out == page.substr(first, last - first))
        << "docs/configuration.md differs from what quo config doc prints";
    for (const std::string& record : kRecords) {
        EXPECT_THAT(page, HasSubstr("**" + record + ".**")) << "no reasons for its defaults";
        EXPECT_THAT(page, HasSubstr(quo({"config", "doc", record}).out));
    }
}

}  // namespace
