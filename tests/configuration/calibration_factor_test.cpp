#include <gtest/gtest.h>

#include <string>

#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"

namespace {

using Info = DataSetInfo_Obj;
constexpr double kRefused = 0.0, kBefore = 17.3;

/** A kind of product and the factor it takes: table number * 100 + swath, as made by tables(). */
struct Product {
    const char* name;
    Info::DSSensorType sensor;
    Info::DSAcqMode mode;
    Info::DSImageType image;
    const char *polarization, *swath;
    double factor;
    int looks = 1;
};
constexpr auto kAsar = Info::dsAsar;
constexpr auto kStrip = Info::dsStripmap, kDouble = Info::dsDoublePolarization, kScan = Info::dsScansar;
constexpr auto kFocused = Info::dsAzimuthFocused, kLooks = Info::dsMultilook;
const Product kProducts[] = {
    {"ImageHH", kAsar, kStrip, kFocused, "H/H", "IS1", 100},
    {"ImageVV", kAsar, kStrip, kFocused, "V/V", "IS7", 206},
    {"ImageHV", kAsar, kStrip, kFocused, "H/V", "IS3", kRefused},
    {"DoubleHH", kAsar, kDouble, kFocused, "H/H", "IS2", 301},
    {"DoubleHV", kAsar, kDouble, kFocused, "H/V", "IS3", 402},
    {"DoubleVH", kAsar, kDouble, kFocused, "V/H", "IS4", 503},
    {"DoubleVV", kAsar, kDouble, kFocused, "V/V", "IS5", 604},
    {"WideMultilookHH", kAsar, kScan, kLooks, "H/H", "SS1", 700, 7},
    {"WideMultilookVV", kAsar, kScan, kLooks, "V/V", "SS1", 800, 7},
    {"WideOneLookHH", kAsar, kScan, kLooks, "H/H", "SS3", 900},
    {"WideOneLookVV", kAsar, kScan, kLooks, "V/V", "NOT_AVAILABLE", 1000},
    {"WideHV", kAsar, kScan, kLooks, "H/V", "SS1", kRefused},
    {"WideFocused", kAsar, kScan, kFocused, "H/H", "SS1", kRefused},
    {"OtherSensor", Info::dsErs2, kStrip, kFocused, "V/V", "IS2", kRefused},
    {"OtherMode", kAsar, Info::dsQuadPolarization, kFocused, "H/H", "IS2", kRefused},
    {"RawData", kAsar, kStrip, Info::dsRawData, "H/H", "IS2", kRefused},
    {"OtherPolarization", kAsar, kDouble, kFocused, "HH", "IS2", kRefused},
    {"EighthSwath", kAsar, kStrip, kFocused, "H/H", "SS1", kRefused},
    {"UnknownSwath", kAsar, kStrip, kFocused, "H/H", "IS8", kRefused},
};
void PrintTo(const Product& row, std::ostream* stream) { *stream << row.name; }

void fill(EnvisatCalibrationFactors& tables) {
    double(*lists[])[7] = {&tables.IM_HH, &tables.IM_VV, &tables.AP_HH,
                           &tables.AP_HV, &tables.AP_VH, &tables.AP_VV};
    for (int i = 0; i < 6; ++i) {
        for (int swath = 0; swath < 7; ++swath) (*lists[i])[swath] = 100 * (i + 1) + swath;
    }
    tables.WSML_HH = 700;
    tables.WSML_VV = 800;
    tables.WSS_HH = 900;
    tables.WSS_VV = 1000;
}

class WriteFactor : public testing::TestWithParam<Product> {
protected:
    WriteFactor() {
        fill(tables_);
        const Product& row = GetParam();
        product_.dataSetInfo.SetType(row.image, row.sensor, row.mode, Info::dsSlantRange, Info::dsVoltComplex,
                                     Info::dsRefSysUndefined);
        std::snprintf(product_.dataSetInfo.Polarization, 512, "%s", row.polarization);
        std::snprintf(product_.dataSetInfo.Swath, 512, "%s", row.swath);
        product_.dataSetInfo.RangeLooks = row.looks;
        product_.dataSetInfo.ExternalCalibrationFactor = kBefore;
        product_.samplingConstants.prf_hz = 1717.3;
        product_.GSenable(gsDataSetInfo);
        product_.GSenable(gsSamplingConstants);
    }
    [[nodiscard]] static double expected() { return GetParam().factor == kRefused ? kBefore : GetParam().factor; }
    [[nodiscard]] static int status() { return GetParam().factor == kRefused ? 1 : 0; }

    test::Report report_;
    EnvisatCalibrationFactors tables_;
    GeneralSAR product_;
};

TEST_P(WriteFactor, SetsTheFactorOfAProduct) {
    EXPECT_EQ(tables_.writeFactor(&product_), status());
    EXPECT_EQ(product_.dataSetInfo.ExternalCalibrationFactor, expected());
    EXPECT_EQ(report_.entries("ERROR").size(), static_cast<std::size_t>(status()));
}

TEST_P(WriteFactor, SetsTheFactorOfAHeaderFile) {
    const std::string file = report_.file("product.xml");
    product_.GSwrite(file.c_str());
    const std::string before = test::read_text(file);
    EXPECT_EQ(tables_.writeFactor(file.c_str()), status());
    GeneralSAR read;
    ASSERT_EQ(read.GSread(file.c_str()), 0);
    EXPECT_EQ(read.dataSetInfo.ExternalCalibrationFactor, expected());
    EXPECT_EQ(read.samplingConstants.prf_hz, 1717.3);
    if (status() != 0) {
        EXPECT_EQ(test::read_text(file), before);
    }
}
INSTANTIATE_TEST_SUITE_P(Products, WriteFactor, testing::ValuesIn(kProducts),
                         [](const auto& row) { return row.param.name; });

using WriteFactorFails = WriteFactor;

TEST_P(WriteFactorFails, WithoutAHeaderOrAProduct) {
    EXPECT_EQ(tables_.writeFactor(report_.file("missing.xml").c_str()), 1);
    EXPECT_EQ(tables_.writeFactor(static_cast<const char*>(nullptr)), 1);
    EXPECT_EQ(tables_.writeFactor(static_cast<GeneralSAR*>(nullptr)), 1);
}
INSTANTIATE_TEST_SUITE_P(Products, WriteFactorFails, testing::Values(kProducts[0]));

}  // namespace
