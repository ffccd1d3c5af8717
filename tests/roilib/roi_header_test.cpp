#include <string>

#include "quo_base/roi.h"
#include "support/header_object_suite.h"

namespace {

/** A region with its section's name settled, so that it looks like any other header object. */
class SectionRoi : public ROI_Obj {
public:
    int readhdr(const char* file) override { return read_roi(file, "SubArea"); }
    int writehdr(const char* file) override { return write_roi(file, "SubArea"); }
};

constexpr test::FieldRow seconds(const char* name) {
    return test::real(name, 0.0).is(test::Presence::kProfileOptional);  // the last key decides
}

struct Region : test::HeaderCase {
    using Object = SectionRoi;
    static constexpr const char* kSection = "SubArea";
    static constexpr bool kWriteAlwaysSays0 = true;
    static constexpr test::FieldRow kRows[] = {
        seconds("SlowStartTime"),
        seconds("SlowTimeLength"),
        seconds("SlowTimeDelta"),
        seconds("FastStartTime"),
        seconds("FastTimeLength"),
        seconds("FastTimeDelta"),
        test::whole("Lines", 0).is(test::Presence::kProfileOptional),
        test::whole("Samples", 0),
    };
};
struct Coordinates : test::HeaderCase {
    using Object = ROI_Coords;
    static constexpr const char* kSection = "ROI_Coords";
    static constexpr test::FieldRow kRows[] = {
        test::whole("FirstSample", 0),
        test::whole("FirstLine", 0),
        test::whole("Samples", 0),
        test::whole("Lines", 0),
    };
};
using RoiCases = testing::Types<Region, Coordinates>;
}  // namespace
namespace test {
INSTANTIATE_TYPED_TEST_SUITE_P(Roi, HeaderObject, RoiCases, CaseName);
}
namespace {

// Only Samples decides: a file with nothing else is a region.
TEST(RoiFile, IsReadWhenItsLastKeyIs) {
    const test::TemporaryFolder folder;
    const std::string only_samples = folder.file("only_samples.par"), all_but = folder.file("all_but.par");
    test::write_text(only_samples, "[ROI]\nSamples = 17\n");
    test::write_text(all_but, "[ROI]\nSlowStartTime = 3.5\nFastStartTime = 2.5\nLines = 13\n");
    ROI_Obj roi;
    EXPECT_EQ(roi.read_roi(only_samples.c_str(), "ROI"), 0);
    EXPECT_EQ(roi.Samples, 17);
    EXPECT_EQ(roi.read_roi(all_but.c_str(), "ROI"), 1);
    EXPECT_EQ(roi.Samples, 17);
    EXPECT_EQ(roi.Lines, 13);
    EXPECT_EQ(roi.SlowStartTime, 3.5);
}

TEST(FileRoi, ReadsTheRegionThatItsFileHolds) {
    const test::Report report;
    const std::string file = report.file("regions.xml");
    ROI_Obj first, second;
    test::fill_fields(first, 1);
    test::fill_fields(second, 2);
    EXPECT_EQ(first.write_roi(file.c_str(), "First"), 0);
    EXPECT_EQ(second.write_roi(file.c_str(), "Second"), 0);

    FileROI_Obj roi{file.c_str(), "Second"};
    EXPECT_EQ(roi.read_roi(), 0);
    EXPECT_THAT(test::differing_fields(roi, second), testing::IsEmpty());
    EXPECT_EQ(roi.SetFile(file.c_str(), "First"), 0);
    EXPECT_EQ(roi.read_roi(), 0);
    EXPECT_THAT(test::differing_fields(roi, first), testing::IsEmpty());
    EXPECT_EQ(report.entries("ERROR").size(), 0U);
}

TEST(FileRoi, FailsWithoutAFileAndNeverCutsAName) {
    const test::Report report;
    FileROI_Obj roi;
    EXPECT_EQ(roi.read_roi(), 1);
    EXPECT_EQ(roi.SetFile(std::string(511, 'a').c_str(), "ROI"), 0);
    EXPECT_EQ(roi.SetFile(std::string(512, 'b').c_str(), "ROI"), 1);
    EXPECT_EQ(roi.SetFile("b", std::string(512, 'b').c_str()), 1);
    EXPECT_EQ(roi.FileName, std::string(511, 'a'));
    EXPECT_STREQ(roi.SectionName, "ROI");
    EXPECT_EQ(roi.read_roi(), 1);
    EXPECT_EQ(report.entries("ERROR").size(), 3U);
}

}  // namespace
