#include "quo_base/SARpolynomials.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAreArray;

constexpr double kRange = 5.37e-3, kAzimuth = 803457.3;

struct Term {
    int coefficient, x_power, y_power;
};
constexpr Term kTerms[] = {{0, 0, 0}, {1, 1, 0}, {2, 0, 1}, {3, 1, 1}, {4, 2, 0}, {5, 3, 0}, {6, 4, 0}};
constexpr Term kExtendedTerms[] = {{0, 0, 0},  {1, 1, 0},  {2, 0, 1},  {3, 1, 1}, {4, 0, 2},
                                   {5, 1, 1},  {6, 1, 2},  {7, 2, 1},  {8, 3, 0}, {9, 4, 0},
                                   {10, 5, 0}, {11, 0, 3}, {12, 0, 4}, {13, 0, 5}};

// One coefficient at a time, about a reference point away from zero: every term must be where it belongs.
template <typename P, std::size_t N>
void expect_terms(const Term (&terms)[N]) {
    P p;
    static_assert(std::size(decltype(p.pol){}) == N);
    p.trg0 = kRange;
    p.taz0 = kAzimuth;
    const double x = 1.7, y = -2.3;
    for (const Term& term : terms) {
        std::ranges::fill(p.pol, 0.0);
        p.pol[term.coefficient] = 1.3;
        double value = 0.0;
        ASSERT_EQ(p.EvaluatePoly(kRange + x, kAzimuth + y, &value), 0);
        EXPECT_NEAR(value, 1.3 * std::pow(x, term.x_power) * std::pow(y, term.y_power), 1e-8) << term.coefficient;
    }
}
TEST(Poly, PlacesEveryTerm) { expect_terms<polyDC>(kTerms); }
TEST(ExtendedPoly, PlacesEveryTermWithTwoCrossTermsAndNoSquare) { expect_terms<extended_polyDC>(kExtendedTerms); }

TEST(PolyDCOld, MapsItsCoefficients) {
    const test::TemporaryFolder folder;
    const struct {
        const char *name, *section, *n, *coefficients;
        int status;
        std::vector<double> pol;
    } rows[] = {
        {"pure range", "D", "5", "1 2 3 4 5", 0, {1, 2, 0, 0, 3, 4, 5}},
        {"seven", "D", "7", "1 2 3 4 5 6 7", 0, {1, 2, 3, 4, 5, 6, 7}},
        {"other number keeps them", "D", "6", "1 2 3 4 5 6", 0, {9, 9, 9, 9, 9, 9, 9}},
        {"too few", "D", "7", "1 2 3", 1, {9, 9, 9, 9, 9, 9, 9}},
        {"no section", "E", "7", "1 2 3 4 5 6 7", 1, {9, 9, 9, 9, 9, 9, 9}},
    };
    for (const auto& row : rows) {
        const std::string file = folder.file(row.name);
        test::write_text(file,
                         std::string{"["} + row.section + "]\nDopCenPol_nCoeff = " + row.n +
                             "\nDopCenRgRefTimes = 0.25\nDopCenAzRefSec85Times = 9.5\nDopCenRangeCoeffs = {" +
                             row.coefficients + "}\n");
        polyDC p;
        std::ranges::fill(p.pol, 9.0);
        EXPECT_EQ(p.readparold(file.c_str(), "D"), row.status) << row.name;
        EXPECT_THAT(p.pol, ElementsAreArray(row.pol)) << row.name;
        EXPECT_EQ(p.trg0, *row.section == 'D' ? 0.25 : -999.0);
        EXPECT_EQ(p.taz0, *row.section == 'D' ? 9.5 : -999.0);
    }
}

TEST(PolyFROld, MapsItsCoefficientsAndLeavesTheReference) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("old.txt");
    test::write_text(file, "[F]\nAzimuthCoeff = {1 2 3 4 5}\nDopRatRangeCoeff = {11 12 13 14 15 16 17}\n");
    const struct {
        int n, status;
        std::vector<double> pol;
    } rows[] = {{5, 0, {1, 2, 0, 0, 3, 4, 5}},
                {3, 0, {1, 2, 9, 3, 9, 9, 9}},  // the cross term
                {7, 0, {11, 12, 13, 14, 15, 16, 17}},
                {4, 1, {9, 9, 9, 9, 9, 9, 9}}};
    for (const auto& row : rows) {
        polyFR p;
        std::ranges::fill(p.pol, 9.0);
        EXPECT_EQ(p.readparold(file.c_str(), "F", row.n), row.status) << row.n;
        EXPECT_THAT(p.pol, ElementsAreArray(row.pol)) << row.n;
        EXPECT_EQ(p.trg0 + p.taz0, -1998.0);
    }
}

/** Three Doppler and three slant-to-ground polynomials, constant in range, at azimuth times 10, 20 and 40. */
class PolySAR : public testing::Test {
protected:
    PolySAR() {
        set_.CreatePolys(3, 3, 3, 3, 3, 3);
        const double times[] = {10.0, 20.0, 40.0}, values[] = {100.0, 130.0, 110.0};
        for (std::size_t i = 0; i < 3; ++i) {
            for (poly* p : {static_cast<poly*>(&set_.DC[i]), static_cast<poly*>(&set_.FR[i]),
                            static_cast<poly*>(&set_.SL2GR[i]), static_cast<poly*>(&set_.GR2SL[i]),
                            static_cast<poly*>(&set_.SL2THETA[i]), static_cast<poly*>(&set_.SL2PHI[i])}) {
                p->pol[0] = values[i];
                p->taz0 = times[i];
                p->trg0 = 0.5 * static_cast<double>(i);
            }
        }
    }
    polySAR set_;
};

struct At {
    double azimuth, selected;
    int number;
    double extrapolated, held;  // interpolated value of the kinds that do and do not extrapolate
};
constexpr At kAt[] = {
    {0.0, 100.0, 0, 70.0, 100.0},   {10.0, 100.0, 0, 100.0, 100.0},    {15.0, 130.0, 0, 115.0, 115.0},
    {20.0, 130.0, 0, 130.0, 130.0}, {30.0, 110.0, 1, 120.0, 120.0},    {40.0, 110.0, 2, 110.0, 110.0},
    {60.0, 110.0, 2, 90.0, 110.0},  {1040.0, 110.0, 2, -890.0, 110.0},
};

TEST_F(PolySAR, SelectsTheFirstAtOrAfterAndInterpolatesBetween) {
    for (const At& row : kAt) {
        SCOPED_TRACE(row.azimuth);
        int dc = -1, phi = -1;
        EXPECT_EQ(set_.EvaluateDC(0.3, row.azimuth), row.selected);
        EXPECT_EQ(set_.EvaluateSL2PHI(0.3, row.azimuth), row.selected);
        EXPECT_EQ(set_.getDCnum(row.azimuth, &dc), 0);
        EXPECT_EQ(set_.getSL2PHInum(row.azimuth, &phi), 0);
        EXPECT_EQ(dc, row.number);
        EXPECT_EQ(phi, row.number);
        EXPECT_NEAR(set_.EvaluateDCinterp(0.3, row.azimuth), row.extrapolated, 1e-9);
        EXPECT_NEAR(set_.EvaluateFRinterp(0.3, row.azimuth), row.extrapolated, 1e-9);
        EXPECT_NEAR(set_.EvaluateSL2GRinterp(0.3, row.azimuth), row.held, 1e-9);
        EXPECT_NEAR(set_.EvaluateGR2SLinterp(0.3, row.azimuth), row.held, 1e-9);
        EXPECT_NEAR(set_.EvaluateSL2THETAinterp(0.3, row.azimuth), row.held, 1e-9);
        EXPECT_NEAR(set_.EvaluateSL2PHIinterp(0.3, row.azimuth), row.held, 1e-9);
        double c[7];
        EXPECT_EQ(set_.getFRpoly(row.azimuth, c), 0);
        EXPECT_NEAR(c[0], row.extrapolated, 1e-9);
    }
}

// Range and azimuth terms count from the reference point of the chosen, or of the earlier, polynomial; an only one
// holds everywhere, and a time that is no number reads nothing outside the list.
TEST_F(PolySAR, EvaluatesAboutTheRightReference) {
    for (int i = 0; i < 3; ++i) set_.DC[i].pol[1] = set_.DC[i].pol[2] = 1.0;
    EXPECT_NEAR(set_.EvaluateDC(2.0, 15.0), 130.0 + (2.0 - 0.5) + (15.0 - 20.0), 1e-12);
    EXPECT_NEAR(set_.EvaluateDCinterp(2.0, 15.0), 115.0 + (2.0 - 0.0) + (15.0 - 10.0), 1e-12);
    EXPECT_NEAR(set_.EvaluateDCinterp(2.0, 30.0), 120.0 + (2.0 - 0.5) + (30.0 - 20.0), 1e-12);
    int number = -1;
    EXPECT_EQ(set_.getDCnum(std::nan(""), &number), 0);
    EXPECT_TRUE(number >= 0 && number < 3);
    EXPECT_TRUE(std::isnan(set_.EvaluateDCinterp(0.1, std::nan(""))));

    set_.CreatePolys(1, 0);
    set_.DC[0].pol[0] = 7.0;
    set_.DC[0].taz0 = 5.0;
    for (const double azimuth : {-100.0, 5.0, 100.0}) {
        EXPECT_EQ(set_.EvaluateDC(0.0, azimuth), 7.0);
        EXPECT_EQ(set_.EvaluateDCinterp(0.0, azimuth), 7.0);
    }
}

// Every form of every quantity: an empty list says which, leaves the output and gives 10.
#define QUO_EMPTY_LIST(KIND)                                                                             \
    for (const int status : {set.Evaluate##KIND(0, 0, &value), set.Evaluate##KIND##interp(0, 0, &value), \
                             set.get##KIND##poly(0, c), set.get##KIND##num(0, &number)})                 \
        EXPECT_EQ(status, 10) << #KIND;                                                                  \
    EXPECT_EQ(set.Evaluate##KIND(0, 0) + set.Evaluate##KIND##interp(0, 0), 0.0);                         \
    for (int i = 0; i < 6; ++i) messages.push_back("NO " #KIND " poly available")
TEST(PolySARSet, SaysWhichListIsEmpty) {
    const test::Report report;
    const test::CapturedStderr silent;
    const polySAR set;
    double value = 5.0, c[7] = {5.0};
    int number = 5;
    std::vector<std::string> messages;
    QUO_EMPTY_LIST(DC);
    QUO_EMPTY_LIST(FR);
    QUO_EMPTY_LIST(SL2GR);
    QUO_EMPTY_LIST(GR2SL);
    QUO_EMPTY_LIST(SL2THETA);
    QUO_EMPTY_LIST(SL2PHI);
    EXPECT_EQ(value + c[0] + number, 15.0);
    EXPECT_EQ(report.messages("ERROR"), messages);
}

TEST(PolySARSet, LeavesNothingOfALargerOneBehind) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("product.xml");
    polySAR written, read;
    for (const int rates : {3, 0}) {
        ASSERT_EQ(written.CreatePolys(2, rates), 0);
        ASSERT_EQ(written.writehdr(file.c_str()), 0);
        EXPECT_EQ(test::read_text(file).find("<DopplerRate-") == std::string::npos, rates == 0);
        ASSERT_EQ(read.readhdr(file.c_str()), 0);
        EXPECT_THAT(test::differing_fields(read, written), testing::IsEmpty());
    }
    EXPECT_EQ(read.FR, nullptr);
}

// The counts are public: a raised one was written, copied and evaluated from beyond the list.
TEST(PolySARSet, HoldsWhatItsListsHoldWhateverTheCountsSay) {
    const test::TemporaryFolder folder;
    polySAR set, copy, read;
    ASSERT_EQ(set.CreatePolys(2, 1), 0);
    set.DC[1].pol[0] = 17.3;
    set.DC[1].taz0 = 1.0;
    const auto raise = [&set] { set.ndc = set.nfr = set.nsl2phi = 100000; };
    raise();
    EXPECT_EQ(set.EvaluateDC(0.0, 1e9), 17.3);
    int last = 0;
    EXPECT_EQ(set.getDCnum(1e9, &last), 0);
    EXPECT_EQ(last, 1);
    EXPECT_EQ(set.EvaluateSL2PHI(0.0, 0.0), 0.0);
    ASSERT_EQ(set.clone(&copy), 0);
    EXPECT_EQ(copy.ndc + 10 * copy.nfr + 100 * copy.nsl2phi, 12);
    raise();
    ASSERT_EQ(set.writehdr(folder.file("set.xml").c_str()), 0);
    ASSERT_EQ(read.readhdr(folder.file("set.xml").c_str()), 0);
    EXPECT_EQ(read.ndc + 10 * read.nfr + 100 * read.nsl2phi, 12);

    set.FR = std::make_unique<polyFR[]>(3);  // a list of one's own is as long as its count says
    set.nfr = 3;
    ASSERT_EQ(set.clone(&copy), 0);
    EXPECT_EQ(copy.nfr, 3);
}

TEST(PolySARSet, DoesNotBelieveCountsThatTheFileCannotHold) {
    for (const std::string count : {"-1", "2147483647", "1000000", "9"}) {
        const test::Report report;
        const test::CapturedStderr silent;
        const std::string file = report.file("product.xml");
        std::string text = test::read_text(QUO_TEST_DATA "/objects/polySAR.xml");
        test::write_text(file, text.replace(text.find("<ndc>2") + 5, 1, count));
        polySAR set;
        set.CreatePolys(2, 2);
        EXPECT_EQ(set.readhdr(file.c_str()), 1) << count;
        EXPECT_EQ(set.SL2PHI == nullptr, count != "9") << count;  // few enough, but not there
        EXPECT_FALSE(report.entries().empty());
    }
}

}  // namespace
