// What the tool makes of products of a mission.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "quo_base/api.h"
#include "support/sentinel1.h"
#include "tool.h"

namespace {

struct Mission {
    const char *name, *safe, *wide;
    std::uint32_t lines;
    test::Layout layout;
};
const Mission kMissions[] = {{"Slc", test::kSlc, "<numberOfSamples>22694<", 4503, test::kPlain},
                             {"Grd",
                              test::kGrd,
                              "<numberOfSamples>26102<",
                              16705,
                              {"", 16, SAMPLEFORMAT_UINT, COMPRESSION_NONE, false, false, 16705}}};

/** A product that the tool imported: all lines, of which 30 samples. */
class Imported : public testing::TestWithParam<Mission> {
protected:
    void SetUp() override {
        const Mission& mission = GetParam();
        test::Safe safe{folder_, mission.safe};
        safe.change(mission.wide, "<numberOfSamples>30<");
        test::write_tiff(safe.measurement(), mission.layout, mission.lines, 30, true);
        const auto made = test::quo({"import", safe.path(), raster()});
        ASSERT_EQ(made.exit_status, 0) << made.err;
    }
    [[nodiscard]] std::string raster() const { return folder_.file("scene"); }
    [[nodiscard]] std::string header() const { return raster() + ".hdr"; }

    test::TemporaryFolder folder_;
};

// Of bursts, whose lines are more than the region's, no less than of an image without. What was cut out of one is
// as right; headers and rasters that are none of each other's are not.
TEST_P(Imported, IsRightUntilHeaderAndRasterPart) {
    EXPECT_EQ(test::quo({"validate", raster()}).out, "0 errors, 0 warnings\n");
    const std::string part = folder_.file("part");
    EXPECT_EQ(test::quo({"convert", raster(), part, "--lines", "1400:1600", "--samples", "7:20"}).exit_status, 0);
    EXPECT_EQ(test::quo({"validate", part}).out, "0 errors, 0 warnings\n");

    const bool bursts = GetParam().safe == test::kSlc;
    const struct {
        const char *from, *to, *finding;
    } kSpoilt[] = {
        {"<NrOfLinesPerImage>200<", "<NrOfLinesPerImage>199<", "warning  ROI/Lines  "},
        {"<FirstLine>1400<", "<FirstLine>1300<", "warning  ROI/SlowStartTime  "},
        {"<FirstSample>7<", "<FirstSample>9<", "warning  ROI/FastStartTime  "},
        {"<LineStep_s>", "<LineStep_s>x", "error  ImageGrid/-  makes no pixel grid"},
        {"<LinesPerBurst>1501<", "<LinesPerBurst>501<", "error  ImageGrid/BurstStart_s  places no raster of 200 "},
        {"<LinesPerBurst>1501<", "<LinesPerBurst>1502<", "warning  SwathInfo/Lines_per_burst  1501, but "},
    };
    const std::string whole = test::read_text(part + ".hdr");
    for (const auto& [from, to, finding] : kSpoilt) {
        const std::string spoilt = test::replaced(whole, from, to);
        if (!bursts && spoilt == whole) continue;  // there are none of its lines
        test::write_text(part + ".hdr", spoilt);
        EXPECT_NE(test::quo({"validate", part}).out.find(finding), std::string::npos) << from;
    }
}

INSTANTIATE_TEST_SUITE_P(Sentinel1, Imported, testing::ValuesIn(kMissions),
                         [](const auto& test) { return std::string{test.param.name}; });

}  // namespace
