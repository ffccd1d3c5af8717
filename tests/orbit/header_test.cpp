// SPDX-License-Identifier: Apache-2.0
#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/geometry.h"
#include "support/scenes.h"

// The orbit in header files and parameter files whose counts are hostile, and its copies.

namespace {

constexpr test::Times kTimes{803457.3125, 9.75, 6};

/** A count in place of five, and what the orbit and the plain record make of it. */
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

TEST(OrbitHeader, CountsAreJudgedBeforeTheyCount) {
    const test::Report report;
    test::Flight flight{kTimes};
    int files = 0;  // parameter files stay in memory under their names
    const auto expect_read = [&](int status, const std::string& content) {
        const std::string file = report.file(std::to_string(++files));
        test::write_text(file, content);
        GeneralSAROrbit orbit;
        ASSERT_EQ(flight.orbit.clone(&orbit), 0);
        EXPECT_EQ(orbit.readhdr(file.c_str()), status) << content;
        EXPECT_TRUE(!orbit.pSV_m && !orbit.vSV_mOs && orbit.nSV_n == 0);
        double xyz[3] = {};
        EXPECT_EQ(orbit.SVGetPos(kTimes.at(2), xyz), QUO_REFUSED);
    };
    for (const HostileCount& row : kHostileCounts) {
        SCOPED_TRACE(row.count);
        for (const auto& [file, before, status] :
             {std::tuple{"xml", "<nSV_n>", row.in_header}, {"par", "nStateVectors = ", row.in_parameters}}) {
            std::string text = test::read_text(QUO_TEST_DATA + std::string{"/objects/GeneralSAROrbit."} + file);
            text.replace(text.find(before) + std::string{before}.size(), 1, std::to_string(row.count));
            expect_read(status, text);
            EXPECT_EQ(report.messages("ERROR").end()[-2] == "You must provide at least 5 state vectors!",
                      status == QUO_REFUSED);
            SAROrbitStateVectors_Obj record;
            EXPECT_EQ(record.readhdr(report.file(std::to_string(files)).c_str()), row.of_record);
            EXPECT_EQ(record.nSV_n, row.of_record ? 0 : row.count);
        }
    }
    // Too few vectors are told from missing ones even where their values are missing as well.
    expect_read(QUO_REFUSED, "[StateVectorData]\nTimeFirst = 1\nTimeDelta = 2\nnStateVectors = 3\n");
    flight.orbit.pSV_m[7] = std::nan("");
    ASSERT_EQ(flight.orbit.writehdr(report.file("out.xml").c_str()), 0);
    expect_read(QUO_NUMERIC, test::read_text(report.file("out.xml")));
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").back().function, "GeneralSAROrbit::readhdr");
}

// Fifteen digits keep seconds since 1985 to about a microsecond: an orbit written and read moves along its track
// by a few centimetres at most, and not at all with exact numbers.
TEST(SceneHeader, SurvivesRewriting) {
    for (const bool is_exact : {false, true}) {
        const test::TemporaryFolder folder;
        GeneralSAROrbit orbit, back;
        test::load_orbit(test::kScenes[0], orbit);
        orbit.setExactNumbers(is_exact);
        ASSERT_EQ(orbit.writehdr(folder.file("out.xml").c_str()) + back.readhdr(folder.file("out.xml").c_str()),
                  0);
        const double t = orbit.t0SV_s + 33.0;
        const double moved = test::norm(test::position_at(orbit, t) - test::position_at(back, t));
        EXPECT_LE(moved, is_exact ? 0.0 : 0.04);
    }
}

TEST(OrbitCopy, IsOfItsOwn) {
    test::Flight flight{kTimes};
    GeneralSAROrbit &orbit = flight.orbit, copy;
    orbit.setLambda(0.031);
    orbit.setLookSign(-1);
    // The clean-up of a failing caller frees what was allocated on its behalf; an orbit made meanwhile is none of
    // that.
    const test::Report report;
    set_ckerr_fun("caller");
    test::make_orbit(copy, {803457.3, 9.7, 9}, [&](double t) { return flight.state(t); });
    freeall_ckerr();
    deccurdep();
    EXPECT_GT(test::norm(test::position_at(copy, kTimes.at(2))), 6e6);
    ASSERT_EQ(orbit.clone(&copy) + copy.clone(&copy), 0);
    EXPECT_EQ(test::differing_fields(orbit, copy), std::vector<std::string>{});
    const double t = kTimes.at(3) + 0.7, range = 5.4e-3, latitude = orbit.SVGetLat(t, range);
    const double rate = orbit.SVGetFR(t, range);
    orbit.SVDestroy();
    EXPECT_TRUE(copy.SVGetLat(t, range) == latitude && copy.SVGetFR(t, range) == rate);
    ASSERT_EQ(orbit.clone(&copy), 0);
    EXPECT_TRUE(!copy.pSV_m && copy.nSV_n == 0);
    EXPECT_EQ(orbit.clone(nullptr), QUO_REFUSED);
}

// The count is public: one raised by hand once made SVCheck() read, and a header be written, beyond the arrays.
TEST(OrbitHeader, CountsWhatWasAllocatedWhereTheCountIsRaised) {
    const test::TemporaryFolder folder;
    const std::string files[] = {folder.file("orbit.xml"), folder.file("record.xml")};
    test::Flight flight{kTimes};
    GeneralSAROrbit &orbit = flight.orbit, copy;
    SAROrbitStateVectors_Obj record, record_copy;
    ASSERT_EQ(orbit.writehdr(files[0].c_str()) + record.readhdr(files[0].c_str()), 0);
    orbit.nSV_n = record.nSV_n = 300000;
    std::vector<SVFinding> findings;
    EXPECT_EQ(orbit.SVCheck(findings), 0);
    EXPECT_TRUE(findings.empty() && std::isnan(orbit.orbitFitError()));
    EXPECT_EQ(orbit.SVResample(5.0), QUO_REFUSED);
    ASSERT_EQ(orbit.clone(&copy) + record.clone(&record_copy), 0);
    EXPECT_EQ(copy.nSV_n + record_copy.nSV_n, 2 * kTimes.count);
    orbit.nSV_n = record.nSV_n = 300000;
    ASSERT_EQ(orbit.writehdr(files[0].c_str()) + record.writehdr(files[1].c_str()), 0);
    ASSERT_EQ(copy.readhdr(files[0].c_str()) + record_copy.readhdr(files[1].c_str()), 0);
    EXPECT_EQ(copy.nSV_n + record_copy.nSV_n, 2 * kTimes.count);
}

}  // namespace
