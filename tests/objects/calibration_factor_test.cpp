#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

constexpr double kBefore = 17.3;

void fill(EnvisatCalibrationFactors& tables) {
    double(*lists[])[7] = {&tables.IM_HH, &tables.IM_VV, &tables.AP_HH,
                           &tables.AP_HV, &tables.AP_VH, &tables.AP_VV};
    for (int i = 0; i < 6; ++i)
        for (int swath = 0; swath < 7; ++swath) (*lists[i])[swath] = 100 * (i + 1) + swath;
    tables.WSML_HH = 700;
    tables.WSML_VV = 800;
    tables.WSS_HH = 900;
    tables.WSS_VV = 1000;
}

TEST(WriteFactor, SetsTheFactorOfAProductAndOfAHeaderFile) {
    EnvisatCalibrationFactors tables;
    fill(tables);
    for (const std::vector<std::string>& row : test::read_table("objects/calibration_factors.csv")) {
        SCOPED_TRACE(row[0]);
        const test::Report report;
        GeneralSAR product, read;
        DataSetInfo_Obj& info = product.dataSetInfo;
        char* const members[] = {info.SensorName, info.AcquisitionMode, info.ImageType, info.Polarization,
                                 info.Swath};
        for (std::size_t i = 0; i < 5; ++i) std::snprintf(members[i], 512, "%s", row[1 + i].c_str());
        info.RangeLooks = std::stoi(row[6]);
        info.ExternalCalibrationFactor = kBefore;
        product.samplingConstants.prf_hz = 1717.3;
        product.GSenable(gsDataSetInfo);
        product.GSenable(gsSamplingConstants);
        const int status = row[7] == "0" ? 1 : 0;
        const double expected = status ? kBefore : std::stod(row[7]);

        const std::string file = report.file("product.xml");
        product.GSwrite(file.c_str());
        const std::string before = test::read_text(file);
        EXPECT_EQ(tables.writeFactor(&product), status);
        EXPECT_EQ(info.ExternalCalibrationFactor, expected);
        EXPECT_EQ(report.entries("ERROR").size(), static_cast<std::size_t>(status));
        EXPECT_EQ(tables.writeFactor(file.c_str()), status);
        ASSERT_EQ(read.GSread(file.c_str()), 0);
        EXPECT_EQ(read.dataSetInfo.ExternalCalibrationFactor, expected);
        EXPECT_EQ(read.samplingConstants.prf_hz, 1717.3);
        EXPECT_EQ(test::read_text(file) == before, status != 0);
    }
    const test::Report report;
    EXPECT_EQ(tables.writeFactor(report.file("missing.xml").c_str()), 1);
    EXPECT_EQ(tables.writeFactor(static_cast<const char*>(nullptr)), 1);
    EXPECT_EQ(tables.writeFactor(static_cast<GeneralSAR*>(nullptr)), 1);
}

}  // namespace
