// SPDX-License-Identifier: Apache-2.0
#include "quo_base/generalSAR.h"

#include "objects/records.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

using test::differences, test::fill_product, test::present_in;
using testing::IsEmpty;

class Product : public testing::Test {
protected:
    /** A file in a folder of its own, so that names stay the same. */
    std::string file(const char* folder, const char* name = "scene.hdr") {
        std::filesystem::create_directories(report_.file(folder));
        errno = 0;
        return report_.file(std::string{folder} + "/" + name);
    }
    const test::Report report_;
};

TEST_F(Product, HasNoOtherNumbers) {
    GeneralSAR p;
    for (const int number : {-1, 14}) {
        const auto none = static_cast<GSObject>(number);
        EXPECT_EQ(p.GSget(none), nullptr);
        EXPECT_EQ(p.GSenable(none) + p.GSdisable(none) + p.GSexists(none), 2);
    }
}

class ProductFile : public Product, public testing::WithParamInterface<const char*> {};

const char* const kOlderContent =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!-- kept -->\n<QuorelXmlDoc>\n"
    "<NumberOfChannels>2</NumberOfChannels><Description>A scene</Description>\n"
    "<Channel Number=\"1\"><Foreign unit=\"m\"><a>17.3</a><a>-3.7</a></Foreign><Pulse><Old>1</Old></Pulse>"
    "<PolySAR><ndc>1</ndc><Stray/></PolySAR></Channel>\n"
    "<Channel Number=\"2\"><Pulse><PulseLength>803</PulseLength></Pulse></Channel>\n<Unknown/></QuorelXmlDoc>\n";

// Into whatever stands there, the bytes are those of writing object by object, the last of the list first; what
// the product does not know stays, and every field comes back.
TEST_P(ProductFile, ComesBackFieldByFieldFromAnyFile) {
    GeneralSAR product;
    fill_product(product);
    // Where the raster's side file is the header itself, its section is the data file's, and the last one.
    std::vector<std::string> sections = {
        "RasterInfo",     "SwathInfo", "GroundCornersPoints", "SpectralWindows",   "SensorAttitude", "DataSetInfo",
        "AntennaPattern", "Pulse",     "StateVectorData",     "SamplingConstants", "PolySAR",        "ROI"};
    if (GetParam() == std::string{"scene.hdr"})
        std::rotate(sections.begin(), sections.begin() + 1, sections.end());
    for (const std::string older : {"", kOlderContent, "no header at all"}) {
        GeneralSAR read;
        const std::string name = file("a", GetParam()), other = file("b", GetParam());
        for (const std::string& target : {name, other}) {
            std::filesystem::remove(target);
            if (!older.empty()) test::write_text(target, older);
        }
        errno = 0;
        ASSERT_EQ(product.GSwrite(name.c_str()), 0);
        for (int i = GeneralSAR::kObjects; i-- > 0;)
            product.GSget(static_cast<GSObject>(i))->writehdr(other.c_str());
        const std::string text = test::read_text(name);
        EXPECT_EQ(text, test::read_text(other));
        EXPECT_EQ(test::read_text(file("a")), test::read_text(file("b")));
        std::vector<std::string> found;  // sections stand in lines of their own, four blanks in
        std::istringstream lines{text};
        for (std::string line; std::getline(lines, line);)
            if (line.starts_with("    <") && line[5] != '/') found.push_back(test::between(line, "<", ">"));
        EXPECT_TRUE(!older.empty() || found == sections) << testing::PrintToString(found);
        for (const char* gone : {"<Old>", "<Stray"}) EXPECT_EQ(text.find(gone), text.npos);
        for (const char* kept : {"<!-- kept -->", "<Foreign unit=\"m\">", "<a>-3.7</a>", "<Unknown/>",
                                 "<Channel Number=\"2\">", "<PulseLength>803</PulseLength>"})
            EXPECT_EQ(text.find(kept) != text.npos, older == kOlderContent) << kept;

        ASSERT_EQ(read.GSread(name.c_str()), 0);
        EXPECT_EQ(present_in(read), test::all_objects());
        EXPECT_THAT(differences(product, read), IsEmpty());
        ASSERT_EQ(read.GSwrite(other.c_str()), 0);
        EXPECT_EQ(test::read_text(other), text);
    }
    EXPECT_THAT(report_.messages("ERROR"), IsEmpty());
}
INSTANTIATE_TEST_SUITE_P(Names, ProductFile, testing::Values("scene.hdr", "scene.xml"),
                         [](const auto& row) { return std::string{row.param}.substr(6); });

// Each object alone: its section brings it back, with those that share or need none, and a copy has it beside what
// was there.
TEST_F(Product, HasTheObjectsWhoseSectionsAreThere) {
    const std::string name = file("a", "scene.xml");
    for (const GSObject object : test::all_objects()) {
        SCOPED_TRACE(object);
        GeneralSAR source, target, copy;
        fill_product(source);
        for (const GSObject other : test::all_objects())
            if (other != object) source.GSdisable(other);
        std::filesystem::remove(name);
        source.GSwrite(name.c_str());
        if (object == gsDataFile) test::write_text(name, "");
        std::vector<GSObject> expected = {gsDataFile};
        if (object == gsStateVectors || object == gsOrbit) expected = {gsDataFile, gsStateVectors, gsOrbit};
        if (expected.size() == 1 && object != gsDataFile) expected.push_back(object);
        // The antenna pattern needs its raster too, which the data file wrote at first.
        EXPECT_EQ(target.GSread(name.c_str()), 0);
        EXPECT_EQ(present_in(target), expected);

        copy.GSenable(gsPulse);
        copy.pulse.Bandwidth = 803457.3;
        ASSERT_EQ(source.GSclone(&copy) + source.GSclone(&source), 0);
        EXPECT_TRUE(copy.GSexists(object) && copy.GSexists(gsPulse));
        EXPECT_EQ(present_in(copy).size(), object == gsPulse ? 1U : 2U);
        EXPECT_THAT(test::differences(*source.GSget(object), *copy.GSget(object)), IsEmpty());
        EXPECT_EQ(copy.pulse.Bandwidth, object == gsPulse ? source.pulse.Bandwidth : 803457.3);
    }
    EXPECT_EQ(GeneralSAR{}.GSclone(nullptr), 1);
}

// What is in memory counts, and nothing that was only looked into stays there: every section that a header lacked
// once left its file among the parameter files, and a save of all of them emptied it.
TEST_F(Product, LeavesNoTraceAmongTheParameterFiles) {
    const std::string header = file("a"), older = file("a", "old.hdr"), before = "[Pulse]\nBandwidth = 15.55e6\n";
    test::write_text(header, kOlderContent);
    test::write_text(older, before);
    FreeProfile(nullptr);
    GetSetProfileChar(1, "Pulse", "Bandwidth", "17.3e6", older.c_str());
    GeneralSAR product;
    for (const std::string& name : {header, older}) {
        for (const GSObject object : test::all_objects()) product.GSget(object)->readhdr(name.c_str());
        product.swathInfo.readBurstTimes(name.substr(0, name.size() - 4).c_str());
        polyDC{}.readpar(name.c_str(), "DopplerCentroid-0");
        polyDC{}.readparold(name.c_str(), "Doppler");
        polyFR{}.readparold(name.c_str(), "Doppler", 7);
        geopoint{}.readhdr(name.c_str(), "NorthWest");
    }
    EXPECT_EQ(product.pulse.Bandwidth, 17.3e6);
    EXPECT_EQ(test::read_text(older), before);
    EXPECT_EQ(SyncProfile(nullptr), -1);
    EXPECT_EQ(test::read_text(header) + test::read_text(older),
              kOlderContent + std::string{"\n[Pulse]\nBandwidth = 17.3e6\n"});
    FreeProfile(nullptr);
}

TEST_F(Product, IsReleasedByReadingAndDestroying) {
    for (const bool reading : {true, false}) {
        GeneralSAR p;
        fill_product(p);
        p.swathInfo.BurstStartTimes = {17.3};
        EXPECT_EQ(reading ? p.GSread(report_.folder().path().c_str()) : p.GSdestroy() + p.GSdestroy(), 0);
        EXPECT_EQ(present_in(p), reading ? std::vector<GSObject>{gsDataFile} : test::all_objects());
        EXPECT_TRUE(!p.polynomials.DC && !p.stateVectors.pSV_m && !p.orbit.vSV_mOs &&
                    p.swathInfo.BurstStartTimes.empty() && p.antennaPattern.Pattern.empty());
    }
}

// One object that cannot be written keeps no other from the file, and none makes no file.
TEST_F(Product, Says0WhateverCannotBeWritten) {
    GeneralSAR none, product, read;
    fill_product(product);
    const std::string name = file("a");
    EXPECT_EQ(none.GSwrite(name.c_str()) + product.GSwrite(report_.file("no_such_folder/scene.hdr").c_str()), 0);
    EXPECT_FALSE(std::filesystem::exists(name));
    EXPECT_THAT(report_.messages("ERROR"), testing::Contains(testing::EndsWith("File writing failed!")));
    product.dataSetInfo.Track[0] = '\x01';
    EXPECT_EQ(product.GSwrite(name.c_str()) + read.GSread(name.c_str()), 0);
    EXPECT_EQ(present_in(read).size(), 13U);
    EXPECT_FALSE(read.GSexists(gsDataSetInfo));
}

TEST_F(Product, LinksItsObjectsAfterReading) {
    const std::string name = file("a");
    for (const GSObject missing : {gsBufferFile, gsSamplingConstants, gsDataSetInfo}) {
        GeneralSAR source, target;
        const GeneralSAROrbit fresh;
        fill_product(source);
        source.samplingConstants.lambda_m = 0.2384;
        source.dataSetInfo.LookDirection = -1;
        source.GSdisable(missing);
        std::filesystem::remove(name);
        ASSERT_EQ(source.GSwrite(name.c_str()) + target.GSread(name.c_str()), 0);
        EXPECT_EQ(target.orbit.getLambda(), missing == gsSamplingConstants ? fresh.getLambda() : 0.2384);
        EXPECT_EQ(target.orbit.getLookSign(), missing == gsDataSetInfo ? fresh.getLookSign() : -1);
        EXPECT_EQ(target.stateVectors.LookDirection, missing == gsDataSetInfo ? 0 : -1);
    }
}

}  // namespace
