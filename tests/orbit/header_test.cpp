#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <string>
#include <type_traits>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/geometry.h"
#include "support/scenes.h"

// The orbit in header files and parameter files, whole and hostile, and its copies.

namespace {

constexpr test::Times kTimes{803457.3125, 9.75, 6};

void fill(GeneralSAROrbit& orbit) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    test::make_orbit(orbit, kTimes, [&](double t) { return circle.earth_fixed(t - kTimes.first_s); });
}

void expect_same(GeneralSAROrbit& a, GeneralSAROrbit& b) {
    EXPECT_EQ(test::differing_fields(a, b), std::vector<std::string>{});
    const double t = a.t0SV_s + 1.7 * a.dtSV_s;
    EXPECT_EQ(test::norm(test::position_at(a, t) - test::position_at(b, t)), 0.0);
}

void expect_empty(const GeneralSAROrbit& orbit) {
    EXPECT_EQ(orbit.pSV_m, nullptr);
    EXPECT_EQ(orbit.vSV_mOs, nullptr);
    EXPECT_EQ(orbit.nSV_n, 0);
}

/** The fields without their defaults. */
constexpr test::FieldRow kRows[] = {
    test::real("pSV_m", 0, 0).keyed("pos"), test::real("vSV_mOs", 0, 0).keyed("vel"),
    test::real("t0SV_s").keyed("TimeFirst"), test::real("dtSV_s").keyed("TimeDelta"),
    test::whole("nSV_n", 0).keyed("nStateVectors")};

/** The orbit as a parameter file, without one of the keys. */
std::string parameter_file(const GeneralSAROrbit& orbit, const char* left_out = "") {
    return test::profile_text(orbit, "StateVectorData", kRows, left_out);
}
/** The orbit as a header file. */
std::string header_file(GeneralSAROrbit& orbit, const std::string& file) {
    orbit.setExactNumbers(true);
    EXPECT_EQ(orbit.writehdr(file.c_str()), 0);
    return test::read_text(file);
}

class Header : public testing::Test {
protected:
    Header() { fill(orbit_); }
    /** A file of its own for every content: parameter files stay in memory under their names. */
    std::string file_of(const std::string& content) {
        std::string name = folder_.file("header" + std::to_string(++files_));
        test::write_text(name, content);
        return name;
    }
    int read(GeneralSAROrbit& orbit, const std::string& content) {
        return orbit.readhdr(file_of(content).c_str());
    }

    test::TemporaryFolder folder_;
    int files_ = 0;
    GeneralSAROrbit orbit_;
};

TEST_F(Header, ComesBackFromASectionAndFromAParameterFile) {
    for (const std::string& content : {header_file(orbit_, folder_.file("out.xml")), parameter_file(orbit_)}) {
        const std::string file = file_of(content);
        GeneralSAROrbit back;
        ASSERT_EQ(back.readhdr(file.c_str()), 0);
        expect_same(orbit_, back);
        std::vector<std::string> names;
        for (const test::FieldRow& row : kRows) names.emplace_back(row.name);
        EXPECT_EQ(test::field_names(back), names);
        SAROrbitStateVectors_Obj record;
        ASSERT_EQ(record.readhdr(file.c_str()), 0);
        EXPECT_EQ(record.nSV_n, kTimes.count);
        EXPECT_EQ(record.vSV_mOs[17], orbit_.vSV_mOs[17]);
    }
}

TEST_F(Header, MissingPartsGiveFourAndAnEmptyOrbit) {
    std::vector<std::string> files{folder_.file("missing"), folder_.path().string(), file_of("")};
    for (const char* key : {"TimeFirst", "TimeDelta", "nStateVectors", "pos", "vel"})
        files.push_back(file_of(parameter_file(orbit_, key)));
    for (const char* element : {"pSV_m", "vSV_mOs", "t0SV_s", "dtSV_s", "nSV_n", "StateVectorData"})
        files.push_back(file_of(test::without_element(header_file(orbit_, folder_.file("out.xml")), element)));
    const test::Report report;
    for (const std::string& file : files) {
        fill(orbit_);
        EXPECT_EQ(orbit_.readhdr(file.c_str()), QUO_READ_FAILED) << test::read_text(file);
        expect_empty(orbit_);
    }
    EXPECT_FALSE(std::filesystem::exists(folder_.file("missing")));
    EXPECT_EQ(orbit_.readhdr(nullptr), QUO_READ_FAILED);
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").back().function, "GeneralSAROrbit::readhdr");
}

struct HostileCount {
    std::int64_t count;
    int in_header, in_parameters;  // status of the orbit
    int of_record;                 // and of the plain record, in either
};
// A count of which the file cannot hold the values costs no memory; fewer than five are no orbit.
constexpr HostileCount kHostileCounts[] = {
    {-1, QUO_READ_FAILED, QUO_REFUSED, QUO_READ_FAILED},
    {std::numeric_limits<std::int32_t>::min(), QUO_READ_FAILED, QUO_REFUSED, QUO_READ_FAILED},
    {std::numeric_limits<std::int32_t>::max(), QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {std::numeric_limits<std::int32_t>::max() / 3, QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {100000, QUO_READ_FAILED, QUO_READ_FAILED, QUO_READ_FAILED},
    {-999, QUO_READ_FAILED, QUO_REFUSED, QUO_READ_FAILED},
    {0, QUO_REFUSED, QUO_REFUSED, 0},
    {4, QUO_REFUSED, QUO_REFUSED, 0},
};

TEST_F(Header, CountsAreJudgedBeforeTheyCount) {
    const test::Report report;
    for (const HostileCount& row : kHostileCounts) {
        SCOPED_TRACE(row.count);
        const std::string count = std::to_string(row.count);
        fill(orbit_);
        std::string text = header_file(orbit_, folder_.file("out.xml"));
        const std::string header = file_of(text.replace(text.find("<nSV_n>") + 7, 1, count));
        const std::string parameters =
            file_of(parameter_file(orbit_, "nStateVectors") + "nStateVectors = " + count + "\n");
        for (const std::string& file : {header, parameters}) {
            SCOPED_TRACE(file == header ? "header" : "parameter file");
            fill(orbit_);
            const int status = file == header ? row.in_header : row.in_parameters;
            EXPECT_EQ(orbit_.readhdr(file.c_str()), status);
            EXPECT_EQ(report.messages("ERROR").back() == "You must provide at least 5 state vectors!",
                      status == QUO_REFUSED);
            expect_empty(orbit_);
            double xyz[3] = {1.0, 2.0, 3.0};
            EXPECT_EQ(orbit_.SVGetPos(803460.0, xyz), QUO_REFUSED);
            SAROrbitStateVectors_Obj record;
            EXPECT_EQ(record.readhdr(file.c_str()), row.of_record);
            EXPECT_EQ(record.nSV_n, row.of_record ? 0 : row.count);
        }
    }
    // Too few vectors are told from missing ones even where their values are missing as well.
    fill(orbit_);
    std::string few = parameter_file(orbit_, "pos");
    few.replace(few.find("Vectors = 6") + 10, 1, "3");
    EXPECT_EQ(read(orbit_, few), QUO_REFUSED);
}

TEST_F(Header, NotANumberInAPositionIsNoOrbit) {
    orbit_.pSV_m[7] = std::numeric_limits<double>::quiet_NaN();
    const std::string content = header_file(orbit_, folder_.file("out.xml"));
    EXPECT_EQ(read(orbit_, content), QUO_NUMERIC);
    expect_empty(orbit_);
}

TEST_F(Header, UnwritableFilesAreReported) {
    const test::Report report;
    EXPECT_EQ(orbit_.writehdr((folder_.file("no") + "/such/folder.xml").c_str()), 1);
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").back().function, "GeneralSAROrbit::writehdr");
}

// Fifteen digits keep seconds since 1985 to about a microsecond: an orbit written and read moves along its track
// by a few centimetres at most, and not at all with exact numbers.
TEST(SceneHeader, SurvivesRewriting) {
    for (const bool is_exact : {false, true}) {
        for (const test::Scene& scene : test::kScenes) {
            const test::TemporaryFolder folder;
            GeneralSAROrbit orbit, back;
            test::load_orbit(scene, orbit);
            orbit.setExactNumbers(is_exact);
            ASSERT_EQ(orbit.writehdr(folder.file("out.xml").c_str()), 0);
            ASSERT_EQ(back.readhdr(folder.file("out.xml").c_str()), 0);
            const double t = orbit.t0SV_s + 33.0;
            const double moved = test::norm(test::position_at(orbit, t) - test::position_at(back, t));
            EXPECT_LE(moved, is_exact ? 0.0 : 0.04);
        }
    }
}

TEST(Clone, IsACopyOfItsOwn) {
    GeneralSAROrbit orbit{0.031}, copy;
    fill(orbit);
    orbit.setLookSign(-1);
    fill(copy);
    ASSERT_EQ(copy.SVResample(2.0), 0);  // had vectors of another number
    ASSERT_EQ(orbit.clone(&copy), 0);
    expect_same(orbit, copy);
    const double t = kTimes.at(3) + 0.7, range = 5.4e-3;
    const double latitude = orbit.SVGetLat(t, range), rate = orbit.SVGetFR(t, range);
    orbit.SVDestroy();
    ASSERT_EQ(copy.clone(&copy), 0);
    EXPECT_EQ(copy.SVGetLat(t, range), latitude);
    EXPECT_EQ(copy.SVGetFR(t, range), rate);
    ASSERT_EQ(orbit.clone(&copy), 0);
    expect_empty(copy);
    EXPECT_EQ(orbit.clone(nullptr), QUO_REFUSED);
}

// The clean-up of a failing caller frees what was allocated on its behalf; an orbit made meanwhile is none of
// that.
TEST(OrbitMemory, OutlivesAFailingCaller) {
    const test::Report report;
    GeneralSAROrbit orbit;
    set_ckerr_fun("caller");
    fill(orbit);
    ASSERT_EQ(orbit.SVResample(3.0), 0);
    freeall_ckerr();
    deccurdep();
    EXPECT_GT(test::norm(test::position_at(orbit, kTimes.at(2))), 7e6);
    EXPECT_GT(orbit.pSV_m[0] * orbit.pSV_m[0], 0.0);
}

// The count is public: one raised by hand once made SVCheck() read, and a header be written, beyond the arrays.
template <typename Orbit>
void expect_raised_count_harmless() {
    const test::TemporaryFolder folder;
    GeneralSAROrbit full;
    fill(full);
    ASSERT_EQ(full.writehdr(folder.file("full.xml").c_str()), 0);
    Orbit raised, copy, back;
    ASSERT_EQ(raised.readhdr(folder.file("full.xml").c_str()), 0);
    raised.nSV_n = 300000;
    if constexpr (std::is_same_v<Orbit, GeneralSAROrbit>) {
        std::vector<SVFinding> findings;
        EXPECT_EQ(raised.SVCheck(findings), 0);
        EXPECT_TRUE(findings.empty());
        EXPECT_EQ(raised.SVResample(5.0), QUO_REFUSED);
        EXPECT_TRUE(std::isnan(raised.orbitFitError()));
    }
    ASSERT_EQ(raised.clone(&copy), 0);
    EXPECT_EQ(copy.nSV_n, kTimes.count);
    EXPECT_EQ(copy.pSV_m[3 * kTimes.count - 1], raised.pSV_m[3 * kTimes.count - 1]);
    raised.nSV_n = 300000;
    ASSERT_EQ(raised.writehdr(folder.file("raised.xml").c_str()), 0);
    ASSERT_EQ(back.readhdr(folder.file("raised.xml").c_str()), 0);
    EXPECT_EQ(back.nSV_n, kTimes.count);
}
TEST(RaisedCount, CountsAsWhatWasAllocated) {
    expect_raised_count_harmless<GeneralSAROrbit>();
    expect_raised_count_harmless<SAROrbitStateVectors_Obj>();
}

}  // namespace
