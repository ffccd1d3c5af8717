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

TEST(FileRoi, ReadsTheRegionThatItsFileHoldsAndNeverCutsAName) {
    const test::Report report;
    const std::string file = report.file("regions.xml"), longest(511, 'a'), too_long(512, 'b');
    ROI_Obj first, second;
    test::fill_fields(first, 1);
    test::fill_fields(second, 2);
    EXPECT_EQ(first.write_roi(file.c_str(), "First") + second.write_roi(file.c_str(), "Second"), 0);
    FileROI_Obj roi{file.c_str(), "Second"};
    EXPECT_EQ(roi.read_roi(), 0);
    EXPECT_THAT(test::differing_fields(roi, second), testing::IsEmpty());
    EXPECT_EQ(roi.SetFile(file.c_str(), "First"), 0);
    EXPECT_EQ(roi.read_roi(), 0);
    EXPECT_THAT(test::differing_fields(roi, first), testing::IsEmpty());
    EXPECT_EQ(report.entries("ERROR").size(), 0U);

    EXPECT_EQ(FileROI_Obj{}.read_roi(), 1);
    EXPECT_EQ(roi.SetFile(longest.c_str(), "ROI"), 0);
    EXPECT_EQ(roi.SetFile(too_long.c_str(), "ROI"), 1);
    EXPECT_EQ(roi.SetFile("b", too_long.c_str()), 1);
    EXPECT_EQ(roi.FileName, longest);
    EXPECT_STREQ(roi.SectionName, "ROI");
    EXPECT_EQ(report.entries("ERROR").size(), 3U);
}

}  // namespace
