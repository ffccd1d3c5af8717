#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/failing_new.h"
#include "support/geometry.h"

// Every allocation that an orbit makes fails in turn. The arrays of an object come from the operators that return
// null; of those that throw, only SVCheck's list of findings is under test.

namespace {

constexpr test::Times kTimes{803457.3, 9.7, 7};

/** Two orbits, one full and one empty, and a header file of the full one. */
struct Desk {
    Desk() {
        const test::CircularOrbit circle{41.3, 12.8, -12.7};
        test::make_orbit(full, kTimes, [&](double t) { return circle.earth_fixed(t - kTimes.first_s); });
        if (full.writehdr(file.c_str())) throw std::runtime_error{"writehdr"};
    }
    test::TemporaryFolder folder;
    std::string file = folder.file("orbit.xml");
    GeneralSAROrbit full, empty;
    SAROrbitStateVectors_Obj record;
    std::vector<SVFinding> findings;
};

struct Job {
    const char* name;
    bool makes_empty;  // the object worked on is without vectors after a failure
    int (*run)(Desk& desk);
};
constexpr Job kJobs[] = {
    {"SVCreate", true, [](Desk& d) { return d.empty.SVCreate(1.5, 9.7, 12); }},
    {"SVCreateOfTheRecord", true, [](Desk& d) { return d.record.SVCreate(1.5, 9.7, 12); }},
    {"readhdr", true, [](Desk& d) { return d.empty.readhdr(d.file.c_str()); }},
    {"readhdrOfTheRecord", true, [](Desk& d) { return d.record.readhdr(d.file.c_str()); }},
    {"clone", true, [](Desk& d) { return d.full.clone(&d.empty); }},
    {"SVResample", false, [](Desk& d) { return d.full.SVResample(3.0); }},
};
class Allocations : public testing::TestWithParam<Job> {};
INSTANTIATE_TEST_SUITE_P(Of, Allocations, testing::ValuesIn(kJobs),
                         [](const auto& row) { return row.param.name; });

TEST_P(Allocations, FailWithSevenAndWithoutHalves) {
    for (long room = 0; room < 50; ++room) {
        Desk desk;
        test::fail_news(room, test::News::kReturningNull);
        const int status = GetParam().run(desk);
        test::stop_failing();
        if (status == 0) {
            EXPECT_GT(room, 1) << "nothing was refused";
            return;
        }
        SCOPED_TRACE("room for " + std::to_string(room));
        EXPECT_EQ(status, QUO_NO_MEMORY);
        EXPECT_EQ(desk.empty.pSV_m, nullptr);
        EXPECT_EQ(desk.empty.vSV_mOs, nullptr);
        EXPECT_EQ(desk.empty.nSV_n, 0);
        EXPECT_EQ(desk.record.pSV_m, nullptr);
        if (GetParam().makes_empty) continue;
        EXPECT_EQ(desk.full.nSV_n, kTimes.count);
        EXPECT_EQ(desk.full.dtSV_s, kTimes.spacing_s);
        EXPECT_GT(test::norm(test::position_at(desk.full, kTimes.at(2))), 7e6);
    }
    ADD_FAILURE() << "never succeeded";
}

TEST(Allocations, OfTheFindingsFailWithSeven) {
    Desk desk;
    desk.full.pSV_m[7] += 5.0;
    int status = QUO_NO_MEMORY;
    for (long room = 0; status && room < 50; ++room) {
        test::fail_news(room, test::News::kThrowing);
        status = desk.full.SVCheck(desk.findings);
        test::stop_failing();
        EXPECT_TRUE(status == 0 || (status == QUO_NO_MEMORY && desk.findings.empty()));
    }
    EXPECT_EQ(status, 0);
    EXPECT_EQ(desk.findings.size(), 1U);
}

}  // namespace
