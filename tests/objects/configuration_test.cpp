// SPDX-License-Identifier: Apache-2.0
#include <sys/inotify.h>

#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::HasSubstr, testing::Not;

// The records' own fields are tested with those of every other header object, the review with the tool's verbs.
class Configuration : public testing::Test {
protected:
    test::Report report_;
    std::string file_ = report_.file("configuration.xml");
};

// They are input only: what a file lacks stays.
TEST_F(Configuration, SharedParametersAreReadAndClonedButNotWritten) {
    GeneralSAR_BaseConfiguration plain;
    std::vector<std::string> listed, shared;
    for (const auto& field : test::listed_fields("GeneralSAR_BaseConfiguration"))
        listed.push_back(field.description);
    for (int i = 0; i < 5; ++i)
        shared.push_back(test::described(plain.sharedParameter(i)) + "," + plain.sharedUnit(i) + "," +
                         plain.sharedMeaning(i));
    EXPECT_EQ(shared, listed);
    GeocodingConf record, copy;
    DemExtractorConf other;
    record.writepar(file_.c_str(), 2);
    std::string text = test::read_text(file_);
    EXPECT_THAT(text, Not(HasSubstr("generalProcessingConf")));
    test::write_text(file_, text.insert(text.find("<GeocodingConf>"),
                                        "<generalProcessingConf><Memory>2048</Memory><ReportLevel>3</ReportLevel>"
                                        "<ReportFilename>focus.txt</ReportFilename></generalProcessingConf>"));
    record.Verbose = 17;
    ASSERT_EQ(record.readpar(file_.c_str(), 2) + record.clone(&copy), 0);
    for (const auto* shown : {&record, &copy}) {
        EXPECT_EQ(shown->Memory + shown->ReportLevel + shown->Verbose, 2048 + 3 + 17);
        EXPECT_STREQ(shown->ReportFilename, "focus.txt");
    }
    EXPECT_EQ(record.clone(&plain) + record.clone(&other) + record.clone(nullptr) + plain.clone(nullptr), 4);
}

// Absent records leave the other container alone.
TEST_F(Configuration, ContainerClonesAndWritesWhatIsEnabled) {
    GeneralSAR_configuration written, cloned;
    for (const GScObject object : {gscAzimuthConf, gscFinefitestConf, static_cast<GScObject>(6)})
        EXPECT_EQ(written.GSenable(object), object == 6 ? 1 : 0);
    written.azimuth.LinesInBlock = 4321;
    cloned.GSenable(gscExtractorConf);
    EXPECT_EQ(written.GSclone(nullptr), 1);
    EXPECT_EQ(written.GSclone(&cloned), 0);
    EXPECT_EQ(cloned.azimuth.LinesInBlock, 4321);
    EXPECT_TRUE(cloned.GSexists(gscExtractorConf));
    cloned.GSdisable(gscExtractorConf);
    EXPECT_EQ(cloned.GSwrite(file_.c_str(), 1), 0);
    EXPECT_THAT(test::read_text(file_), testing::AllOf(HasSubstr("<AzimuthConf>"), HasSubstr("<FinefitestConf>"),
                                                       Not(HasSubstr("ExtractorConf"))));
}

// Saved as a whole, with the bytes of writing record by record.
TEST_F(Configuration, ContainerReadsAllOrThrowsAtTheFirst) {
    const std::string other = report_.file("one_by_one.xml"), missing = report_.file("missing.xml");
    GeneralSAR_configuration all, read, partial;
    for (int i = 0; i < 6; ++i) {
        all.GSenable(static_cast<GScObject>(i));
        ASSERT_EQ(all.GSget(static_cast<GScObject>(i))->writepar(other.c_str(), 1), 0);
    }
    ASSERT_EQ(all.GSwrite(file_.c_str(), 1) + read.GSread(file_.c_str(), 1), 0);
    EXPECT_EQ(test::read_text(file_), test::read_text(other));
    test::write_text(file_, test::without_element(test::read_text(file_), "ExtractorConf"));
    EXPECT_THROW(partial.GSread(file_.c_str(), 1), quorelException);
    for (int i = 0; i < 6; ++i) {
        EXPECT_TRUE(read.GSexists(static_cast<GScObject>(i))) << i;
        EXPECT_EQ(partial.GSexists(static_cast<GScObject>(i)), i <= gscExtractorConf)
            << i << ": set before it was read";
    }
    EXPECT_THROW(partial.GSread(report_.folder().path().c_str(), 1), quorelException);
    EXPECT_EQ(partial.GSread(missing.c_str(), 1) + partial.GSread(nullptr, 1), 2);
    EXPECT_THAT(report_.messages("ERROR"), testing::Contains("File : " + missing + " DOES NOT EXIST!"));
}

// What six records and the shared parameters say is parsed once; the other look tells whether the file is there.
TEST_F(Configuration, ContainerOpensItsFileTwice) {
    GeneralSAR_configuration all;
    for (int i = 0; i < 6; ++i) all.GSenable(static_cast<GScObject>(i));
    ASSERT_EQ(all.GSwrite(file_.c_str(), 1), 0);
    const int watch = inotify_init1(IN_NONBLOCK);
    ASSERT_GE(inotify_add_watch(watch, file_.c_str(), IN_OPEN | IN_CLOSE), 0);
    ASSERT_EQ(all.GSread(file_.c_str(), 1), 0);
    char events[100 * sizeof(inotify_event)];  // of a file that is watched itself they bear no name
    EXPECT_EQ(read(watch, events, sizeof events), 2 * 2 * static_cast<ssize_t>(sizeof(inotify_event)));
    close(watch);
}

TEST_F(Configuration, GeneralRecordReadsAtConstruction) {
    generalProcessingConf written;
    written.Flag_rgpatt = 0;
    written.writepar(file_.c_str(), 1);
    EXPECT_EQ(generalProcessingConf(file_.c_str(), 1).Flag_rgpatt, 0);
    EXPECT_THROW(generalProcessingConf(report_.file("missing.xml").c_str(), 1), quorelException);
}

// Each factor is a number of its own, which the rows of the table name.
TEST_F(Configuration, SetsTheCalibrationFactorOfAProductAndOfAHeaderFile) {
    EnvisatCalibrationFactors tables;
    double(*lists[])[7] = {&tables.IM_HH, &tables.IM_VV, &tables.AP_HH,
                           &tables.AP_HV, &tables.AP_VH, &tables.AP_VV};
    for (int i = 0; i < 42; ++i) (*lists[i / 7])[i % 7] = 100 * (i / 7 + 1) + i % 7;
    std::tie(tables.WSML_HH, tables.WSML_VV, tables.WSS_HH, tables.WSS_VV) = std::tuple{700, 800, 900, 1000};
    for (const std::vector<std::string>& row : test::read_table("objects/calibration_factors.csv")) {
        SCOPED_TRACE(row[0]);
        GeneralSAR product, read;
        DataSetInfo_Obj& info = product.dataSetInfo;
        char* const members[] = {info.SensorName, info.AcquisitionMode, info.ImageType, info.Polarization,
                                 info.Swath};
        for (std::size_t i = 0; i < 5; ++i) std::snprintf(members[i], 512, "%s", row[1 + i].c_str());
        info.RangeLooks = std::stoi(row[6]);
        info.ExternalCalibrationFactor = 17.3;
        product.GSenable(gsDataSetInfo);
        product.GSenable(gsSamplingConstants);
        const int status = row[7] == "0" ? 1 : 0;
        product.GSwrite(file_.c_str());
        const std::string before = test::read_text(file_);
        const std::size_t errors = report_.entries("ERROR").size();
        EXPECT_EQ(tables.writeFactor(&product), status);
        EXPECT_EQ(report_.entries("ERROR").size() - errors, static_cast<std::size_t>(status));
        EXPECT_EQ(tables.writeFactor(file_.c_str()), status);
        ASSERT_EQ(read.GSread(file_.c_str()), 0);
        for (const GeneralSAR* of : {&product, &read})
            EXPECT_EQ(of->dataSetInfo.ExternalCalibrationFactor, status ? 17.3 : std::stod(row[7]));
        EXPECT_TRUE(read.GSexists(gsSamplingConstants));
        EXPECT_EQ(test::read_text(file_) == before, status != 0);
    }
    EXPECT_EQ(tables.writeFactor(report_.file("missing.xml").c_str()), 1);
    EXPECT_EQ(tables.writeFactor(static_cast<const char*>(nullptr)), 1);
    EXPECT_EQ(tables.writeFactor(static_cast<GeneralSAR*>(nullptr)), 1);
}

}  // namespace
