#include "quo_base/acquisition.h"

#include <string>
#include <vector>

#include "support/header_object_suite.h"

namespace {

using test::real, test::text;

struct Sampling : test::HeaderCase {
    using Object = SamplingConstants_Obj;
    static constexpr const char* kSection = "SamplingConstants";
    static constexpr test::FieldRow kRows[] = {
        real("fc_hz").keyed("CarrierFrequency"),
        real("frg_hz").keyed("SamplingRate"),
        real("Brg_hz").keyed("RangeBandWidth"),
        real("Trg_s").keyed("RangeTSamplingStep"),
        real("prf_hz").keyed("PRF"),
        real("pri_s").keyed("PRI"),
        real("Baz_hz").keyed("AzimuthBandwidth"),
        real("brf_hz").keyed("BRF"),
        real("bri_s").keyed("BRI"),
        real("lambda_m").keyed("WaveLength"),
    };
};
struct Pulse : test::HeaderCase {
    using Object = SARPulse_Obj;
    static constexpr const char* kSection = "Pulse";
    static constexpr test::FieldRow kRows[] = {
        real("PulseLength"), real("Bandwidth"), real("PulseKRate"), real("PulseEnergy"), real("PulseSamplingRate"),
    };
};
struct Attitude : test::HeaderCase {
    using Object = SensorAttitude_Obj;
    static constexpr const char* kSection = "SensorAttitude";
    static constexpr test::FieldRow kRows[] = {
        real("Eq_speed"),      real("Eq_distance"),       real("Mean_DC"),     real("SquintAngle"),
        real("AntennaLength"), real("DroopGain", 0.0, 8), real("Temperature"),
    };
};
struct Windows : test::HeaderCase {
    using Object = SpectralWindows_Obj;
    static constexpr const char* kSection = "SpectralWindows";
    static constexpr test::FieldRow kRows[] = {
        text("AzMatchedFilterType"), text("RgMatchedFilterType"), real("RgMatchedFilterCoef"),
        real("AzMatchedFilterCoef"), real("RgLookBandwidth"),     real("AzLookBandwidth"),
    };
};
constexpr test::FieldRow count(const char* name, double value) {
    return test::whole(name, value, 0.0, 2147483647.0);
}
struct QuickLook : test::HeaderCase {
    using Object = QuickLook_Obj;
    static constexpr const char* kSection = "QuickLook";
    static constexpr bool kFallsBack = false, kReadAlwaysSays0 = true;
    static constexpr test::FieldRow kRows[] = {
        count("QL_FirstSample", 0), count("QL_Samples", 0),   count("QL_FirstLine", 0),
        count("QL_Lines", 0),       count("QL_AzimuthML", 1), count("QL_RangeML", 1),
    };
    static std::vector<std::string> not_cloned() { return {"QL_AzimuthML", "QL_RangeML"}; }
};
using Cases = testing::Types<Sampling, Pulse, Attitude, Windows, QuickLook>;
}  // namespace
namespace test {
INSTANTIATE_TYPED_TEST_SUITE_P(Acquisition, HeaderObject, Cases, CaseName);
}
namespace {

// A text longer than its member must not run into the next one.
TEST(AcquisitionObjects, CutLongTextsToTheirMembers) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("windows.par"), longest(511, 'w');
    test::write_text(file, "[SpectralWindows]\nAzMatchedFilterType = " + longest +
                               "xyz\nRgMatchedFilterType = HAMMING\nRgMatchedFilterCoef = 0.75\n"
                               "AzMatchedFilterCoef = 0.54\nRgLookBandwidth = 17.5\nAzLookBandwidth = 1378.25\n");
    SpectralWindows_Obj windows;
    EXPECT_EQ(windows.readhdr(file.c_str()), 0);
    EXPECT_EQ(windows.AzMatchedFilterType, longest);
    EXPECT_STREQ(windows.RgMatchedFilterType, "HAMMING");
}

}  // namespace
