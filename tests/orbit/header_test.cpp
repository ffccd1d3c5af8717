#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/geometry.h"
#include "support/scenes.h"

// The orbit in header files and parameter files, whole and hostile, and its copies.

namespace {

constexpr test::Times kTimes{803457.3125, 9.75, 6};

/** Every part of the section, as an element and as a key. */
constexpr const char* kElements[] = {"pSV_m", "vSV_mOs", "t0SV_s", "dtSV_s", "nSV_n"};
constexpr const char* kKeys[] = {"pos", "vel", "TimeFirst", "TimeDelta", "nStateVectors"};

std::string without(std::string text, const std::string& from, const std::string& to) {
    const auto start = text.find(from);
    return text.erase(start, text.find(to, start) + to.size() - start);
}

/** An orbit, and the same as a header file and as a parameter file. Every content gets a file of its own:
 * parameter files stay in memory under their names. */
class Header : public testing::Test {
protected:
    Header() {
        fill(orbit_);
        orbit_.setExactNumbers(true);
        EXPECT_EQ(orbit_.writehdr(folder_.file("out.xml").c_str()), 0);
        header_ = test::read_text(folder_.file("out.xml"));
        for (int i = 0; i < 5; ++i) {
            parameters_ += std::string{kKeys[i]} + " = {";
            for (const std::string& value : test::values_of(*orbit_.element(i))) parameters_ += value + " ";
            parameters_ += "}\n";
        }
    }
    static void fill(GeneralSAROrbit& orbit) {
        const test::CircularOrbit circle{41.3, 12.8, -12.7};
        test::make_orbit(orbit, kTimes, [&](double t) { return circle.earth_fixed(t - kTimes.first_s); });
    }
    std::string file_of(const std::string& content) {
        const std::string name = folder_.file("header" + std::to_string(++files_));
        test::write_text(name, content);
        return name;
    }
    /** Reads into a filled orbit, which a failure leaves empty. */
    void expect_read(int status, const std::string& file) {
        fill(orbit_);
        EXPECT_EQ(orbit_.readhdr(file.c_str()), status) << test::read_text(file);
        EXPECT_TRUE(!orbit_.pSV_m && !orbit_.vSV_mOs && orbit_.nSV_n == 0);
        double xyz[3] = {};
        EXPECT_EQ(orbit_.SVGetPos(kTimes.at(2), xyz), QUO_REFUSED);
    }

    test::TemporaryFolder folder_;
    int files_ = 0;
    GeneralSAROrbit orbit_;
    std::string header_, parameters_ = "[StateVectorData]\n";
};

TEST_F(Header, ComesBackFromASectionAndFromAParameterFile) {
    for (const std::string& content : {header_, parameters_}) {
        const std::string file = file_of(content);
        GeneralSAROrbit back;
        SAROrbitStateVectors_Obj record;
        ASSERT_EQ(back.readhdr(file.c_str()) + record.readhdr(file.c_str()), 0);
        EXPECT_EQ(test::differing_fields(orbit_, back), std::vector<std::string>{});
        EXPECT_EQ(test::differing_fields(orbit_, record), std::vector<std::string>{});
        const double t = kTimes.at(2) + 0.7;
        EXPECT_EQ(test::norm(test::position_at(orbit_, t) - test::position_at(back, t)), 0.0);
        for (int i = 0; i < 5; ++i) EXPECT_STREQ(back.element(i)->name, kElements[i]);
    }
}

TEST_F(Header, MissingPartsGiveFourAndAnEmptyOrbit) {
    const test::Report report;
    for (int i = 0; i < 5; ++i) {
        const std::string name = kElements[i];
        expect_read(QUO_READ_FAILED, file_of(without(header_, "<" + name + ">", "</" + name + ">")));
        expect_read(QUO_READ_FAILED, file_of(without(parameters_, std::string{kKeys[i]} + " =", "\n")));
    }
    expect_read(QUO_READ_FAILED, file_of(""));
    expect_read(QUO_READ_FAILED, folder_.file("missing"));
    EXPECT_FALSE(std::filesystem::exists(folder_.file("missing")));
    EXPECT_EQ(orbit_.readhdr(nullptr), QUO_READ_FAILED);
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").back().function, "GeneralSAROrbit::readhdr");
    EXPECT_EQ(orbit_.writehdr((folder_.file("no") + "/such/folder.xml").c_str()), 1);
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").back().function, "GeneralSAROrbit::writehdr");
}

struct HostileCount {
    std::int64_t count;
    int in_header, in_parameters;  // status of the orbit
    int of_record;                 // and of the plain record, in either
};
// A count of which the file cannot hold the values costs no memory; fewer than five are no orbit.
constexpr HostileCount kHostileCounts[] = {
    {-1, QUO_READ_FAILED, QUO_REFUSED, QUO_READ_FAILED},
    {std::numeric_limits<std::int32_t>::max(), QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {std::numeric_limits<std::int32_t>::max() / 3, QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {100000, QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {0, QUO_REFUSED, QUO_REFUSED, 0},
    {4, QUO_REFUSED, QUO_REFUSED, 0},
};

TEST_F(Header, CountsAreJudgedBeforeTheyCount) {
    const test::Report report;
    for (const HostileCount& row : kHostileCounts) {
        SCOPED_TRACE(row.count);
        std::string header = header_, parameters = parameters_;
        header.replace(header.find("<nSV_n>") + 7, 1, std::to_string(row.count));
        parameters.replace(parameters.find("Vectors = {6") + 11, 1, std::to_string(row.count));
        for (const auto& [content, status] : {std::pair{header, row.in_header}, {parameters, row.in_parameters}}) {
            const std::string file = file_of(content);
            expect_read(status, file);
            EXPECT_EQ(report.messages("ERROR").end()[-2] == "You must provide at least 5 state vectors!",
                      status == QUO_REFUSED);
            SAROrbitStateVectors_Obj record;
            EXPECT_EQ(record.readhdr(file.c_str()), row.of_record);
            EXPECT_EQ(record.nSV_n, row.of_record ? 0 : row.count);
        }
    }
    // Too few vectors are told from missing ones even where their values are missing as well.
    expect_read(QUO_REFUSED, file_of("[StateVectorData]\nTimeFirst = 1\nTimeDelta = 2\nnStateVectors = 3\n"));
    fill(orbit_);
    orbit_.pSV_m[7] = std::nan("");
    ASSERT_EQ(orbit_.writehdr(folder_.file("out.xml").c_str()), 0);
    expect_read(QUO_NUMERIC, folder_.file("out.xml"));
}

// Fifteen digits keep seconds since 1985 to about a microsecond: an orbit written and read moves along its track
// by a few centimetres at most, and not at all with exact numbers.
TEST(SceneHeader, SurvivesRewriting) {
    for (const bool is_exact : {false, true}) {
        const test::TemporaryFolder folder;
        GeneralSAROrbit orbit, back;
        test::load_orbit(test::kScenes[0], orbit);
        orbit.setExactNumbers(is_exact);
        ASSERT_EQ(orbit.writehdr(folder.file("out.xml").c_str()), 0);
        ASSERT_EQ(back.readhdr(folder.file("out.xml").c_str()), 0);
        const double t = orbit.t0SV_s + 33.0;
        const double moved = test::norm(test::position_at(orbit, t) - test::position_at(back, t));
        EXPECT_LE(moved, is_exact ? 0.0 : 0.04);
    }
}

TEST_F(Header, IsClonedIntoACopyOfItsOwn) {
    GeneralSAROrbit orbit{0.031}, copy;
    fill(orbit);
    orbit.setLookSign(-1);
    // The clean-up of a failing caller frees what was allocated on its behalf; an orbit made meanwhile is none of
    // that.
    const test::Report report;
    set_ckerr_fun("caller");
    fill(copy);
    ASSERT_EQ(copy.SVResample(2.0), 0);  // vectors of another number
    freeall_ckerr();
    deccurdep();
    EXPECT_GT(test::norm(test::position_at(copy, kTimes.at(2))), 7e6);
    ASSERT_EQ(orbit.clone(&copy), 0);
    const double t = kTimes.at(3) + 0.7, range = 5.4e-3;
    const double latitude = orbit.SVGetLat(t, range), rate = orbit.SVGetFR(t, range);
    orbit.SVDestroy();
    ASSERT_EQ(copy.clone(&copy), 0);
    EXPECT_EQ(test::differing_fields(orbit_, copy), std::vector<std::string>{});
    EXPECT_EQ(copy.SVGetLat(t, range), latitude);
    EXPECT_EQ(copy.SVGetFR(t, range), rate);
    ASSERT_EQ(orbit.clone(&copy), 0);
    EXPECT_TRUE(!copy.pSV_m && copy.nSV_n == 0);
    EXPECT_EQ(orbit.clone(nullptr), QUO_REFUSED);
}

// The count is public: one raised by hand once made SVCheck() read, and a header be written, beyond the arrays.
TEST_F(Header, CountsWhatWasAllocatedWhereTheCountIsRaised) {
    GeneralSAROrbit copy, back;
    SAROrbitStateVectors_Obj record, record_copy, record_back;
    ASSERT_EQ(record.readhdr(folder_.file("out.xml").c_str()), 0);
    orbit_.nSV_n = record.nSV_n = 300000;
    std::vector<SVFinding> findings;
    EXPECT_EQ(orbit_.SVCheck(findings), 0);
    EXPECT_TRUE(findings.empty() && std::isnan(orbit_.orbitFitError()));
    EXPECT_EQ(orbit_.SVResample(5.0), QUO_REFUSED);
    ASSERT_EQ(orbit_.clone(&copy) + record.clone(&record_copy), 0);
    EXPECT_EQ(copy.nSV_n + record_copy.nSV_n, 2 * kTimes.count);
    orbit_.nSV_n = record.nSV_n = 300000;
    const std::string raised[] = {folder_.file("raised.xml"), folder_.file("record.xml")};
    ASSERT_EQ(orbit_.writehdr(raised[0].c_str()) + record.writehdr(raised[1].c_str()), 0);
    ASSERT_EQ(back.readhdr(raised[0].c_str()) + record_back.readhdr(raised[1].c_str()), 0);
    EXPECT_EQ(back.nSV_n + record_back.nSV_n, 2 * kTimes.count);
}

}  // namespace
