#include "quo_base/SARpolynomials.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <limits>
#include <string>
#include <vector>

#include "support/diagnostics.h"

namespace {

using testing::ElementsAre;
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

TEST(Poly, IsZeroWhenNew) {
    const poly p;
    double value = 5.0;
    p.EvaluatePoly(17.3, -4.1, &value);
    EXPECT_EQ(value, 0.0);
    EXPECT_EQ(p.trg0, -999.0);
    EXPECT_EQ(p.taz0, -999.0);
}

template <typename P>
void fill(P& p, double seed) {
    for (std::size_t i = 0; i < std::size(p.pol); ++i) p.pol[i] = seed + 0.125 * static_cast<double>(i);
    p.trg0 = seed + 0.5;
    p.taz0 = seed + 1000.25;
}
template <typename P>
void expect_equal(const P& a, const P& b) {
    EXPECT_THAT(std::vector<double>(std::begin(a.pol), std::end(a.pol)), ElementsAreArray(b.pol));
    EXPECT_EQ(a.trg0, b.trg0);
    EXPECT_EQ(a.taz0, b.taz0);
}

template <typename P>
class Polynomials : public testing::Test {};
using AllKinds = testing::Types<poly, polyDC, polyFR, polySL2GR, polyGR2SL, polySL2THETA, polySL2PHI,
                                extended_polyDC, extended_polyFR>;
TYPED_TEST_SUITE(Polynomials, AllKinds);

TYPED_TEST(Polynomials, ComeBackFromAHeaderAndFromAClone) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("product.xml");
    TypeParam written, other, read, cloned;
    fill(written, 3.0);
    fill(other, 7.0);
    ASSERT_EQ(written.writepar(file.c_str(), "DopplerCentroid-0"), 0);
    ASSERT_EQ(other.writepar(file.c_str(), "DopplerCentroid-1"), 0);
    ASSERT_EQ(read.readpar(file.c_str(), "DopplerCentroid-0"), 0);
    expect_equal(read, written);
    EXPECT_EQ(written.clone(&cloned), 0);
    expect_equal(cloned, written);
    EXPECT_EQ(read.readpar(file.c_str(), "DopplerCentroid-2"), 1);
    expect_equal(read, written);
}

// The keys as older text headers spell them.
template <typename P>
void expect_keys(const char* coefficients, const char* range, const char* azimuth) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("product.txt");
    test::write_text(file, std::string{"[Name]\n"} + azimuth + " = 17.25\n" + range + " = 0.5\n" + coefficients +
                               " = {1 2 3 4 5 6 7}\n");
    P p;
    ASSERT_EQ(p.readpar(file.c_str(), "Name"), 0) << coefficients;
    EXPECT_THAT(p.pol, ElementsAre(1, 2, 3, 4, 5, 6, 7));
    EXPECT_EQ(p.trg0, 0.5);
    EXPECT_EQ(p.taz0, 17.25);
}
TEST(Poly, ReadsTheParameterFileKeysOfItsQuantity) {
    expect_keys<polyDC>("DCpoly", "DCpoly_rgt0", "DCpoly_azt0");
    expect_keys<polyFR>("FRpoly", "FRPoly_rgt0", "FRpoly_azt0");
    expect_keys<polySL2GR>("SL2GRpoly", "SL2GRpoly_rgt0", "SL2GRpoly_azt0");
    expect_keys<polyGR2SL>("GR2SLpoly", "GR2SLpoly_rgt0", "GR2SLpoly_azt0");
    expect_keys<polySL2THETA>("SL2THETApoly", "SL2THETApoly_rgt0", "SL2THETApoly_azt0");
    expect_keys<polySL2PHI>("SL2PHIpoly", "SL2PHIpoly_rgt0", "SL2PHIpoly_azt0");
}

struct OldDoppler {
    const char *name, *text;
    int status;
    std::vector<double> pol;
    double trg0;
};
const OldDoppler kOldDoppler[] = {
    {"PureRange",
     "[D]\nDopCenPol_nCoeff = 5\nDopCenRgRefTimes = 0.25\nDopCenAzRefSec85Times = 9.5\n"
     "DopCenRangeCoeffs = {1 2 3 4 5}\n",
     0,
     {1, 2, 0, 0, 3, 4, 5},
     0.25},
    {"Seven",
     "[D]\nDopCenPol_nCoeff = 7\nDopCenRgRefTimes = 0.25\nDopCenAzRefSec85Times = 9.5\n"
     "DopCenRangeCoeffs = {1 2 3 4 5 6 7}\n",
     0,
     {1, 2, 3, 4, 5, 6, 7},
     0.25},
    {"OtherNumberKeepsThem",
     "[D]\nDopCenPol_nCoeff = 6\nDopCenRgRefTimes = 0.25\nDopCenAzRefSec85Times = 9.5\n"
     "DopCenRangeCoeffs = {1 2 3 4 5 6}\n",
     0,
     {9, 9, 9, 9, 9, 9, 9},
     0.25},
    {"TooFewCoefficients",
     "[D]\nDopCenPol_nCoeff = 7\nDopCenRgRefTimes = 0.25\nDopCenAzRefSec85Times = 9.5\n"
     "DopCenRangeCoeffs = {1 2 3}\n",
     1,
     {9, 9, 9, 9, 9, 9, 9},
     0.25},
    {"NoSection", "[E]\n", 1, {9, 9, 9, 9, 9, 9, 9}, -999.0},
};
class PolyDCOld : public testing::TestWithParam<OldDoppler> {};
TEST_P(PolyDCOld, MapsItsCoefficients) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("old.txt");
    test::write_text(file, GetParam().text);
    polyDC p;
    std::ranges::fill(p.pol, 9.0);
    EXPECT_EQ(p.readparold(file.c_str(), "D"), GetParam().status);
    EXPECT_THAT(p.pol, ElementsAreArray(GetParam().pol));
    EXPECT_EQ(p.trg0, GetParam().trg0);
}
INSTANTIATE_TEST_SUITE_P(Layouts, PolyDCOld, testing::ValuesIn(kOldDoppler),
                         [](const auto& row) { return row.param.name; });

TEST(PolyFROld, MapsItsCoefficientsAndLeavesTheReference) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("old.txt");
    test::write_text(file, "[F]\nAzimuthCoeff = {1 2 3 4 5}\nDopRatRangeCoeff = {11 12 13 14 15 16 17}\n");
    const auto read = [&](int n, int status) {
        polyFR p;
        std::ranges::fill(p.pol, 9.0);
        EXPECT_EQ(p.readparold(file.c_str(), "F", n), status) << n;
        EXPECT_EQ(p.trg0, -999.0);
        EXPECT_EQ(p.taz0, -999.0);
        return std::vector<double>(std::begin(p.pol), std::end(p.pol));
    };
    EXPECT_THAT(read(5, 0), ElementsAre(1, 2, 0, 0, 3, 4, 5));
    EXPECT_THAT(read(3, 0), ElementsAre(1, 2, 9, 3, 9, 9, 9));  // the cross term
    EXPECT_THAT(read(7, 0), ElementsAre(11, 12, 13, 14, 15, 16, 17));
    EXPECT_THAT(read(4, 1), ElementsAre(9, 9, 9, 9, 9, 9, 9));
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

// Range and azimuth terms count from the reference point of the chosen, or of the earlier, polynomial.
TEST_F(PolySAR, EvaluatesAboutTheRightReference) {
    for (int i = 0; i < 3; ++i) set_.DC[i].pol[1] = set_.DC[i].pol[2] = 1.0;
    EXPECT_NEAR(set_.EvaluateDC(2.0, 15.0), 130.0 + (2.0 - 0.5) + (15.0 - 20.0), 1e-12);
    EXPECT_NEAR(set_.EvaluateDCinterp(2.0, 15.0), 115.0 + (2.0 - 0.0) + (15.0 - 10.0), 1e-12);
    EXPECT_NEAR(set_.EvaluateDCinterp(2.0, 30.0), 120.0 + (2.0 - 0.5) + (30.0 - 20.0), 1e-12);
}

TEST_F(PolySAR, ASinglePolynomialHoldsEverywhere) {
    set_.CreatePolys(1, 0);
    set_.DC[0].pol[0] = 7.0;
    set_.DC[0].taz0 = 5.0;
    for (const double azimuth : {-100.0, 5.0, 100.0}) {
        EXPECT_EQ(set_.EvaluateDC(0.0, azimuth), 7.0);
        EXPECT_EQ(set_.EvaluateDCinterp(0.0, azimuth), 7.0);
    }
}

TEST_F(PolySAR, ATimeThatIsNoNumberReadsNothingOutside) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    int number = -1;
    EXPECT_EQ(set_.getDCnum(nan, &number), 0);
    EXPECT_TRUE(number >= 0 && number < 3);
    EXPECT_TRUE(std::isnan(set_.EvaluateDCinterp(0.1, nan)));
}

TEST(PolySARSet, SaysWhichListIsEmpty) {
    const test::Report report;
    const test::CapturedStderr silent;
    polySAR set;
    double value = 5.0;
    const int statuses[] = {set.EvaluateDC(0, 0, &value),       set.EvaluateFR(0, 0, &value),
                            set.EvaluateSL2GR(0, 0, &value),    set.EvaluateGR2SL(0, 0, &value),
                            set.EvaluateSL2THETA(0, 0, &value), set.EvaluateSL2PHI(0, 0, &value),
                            set.EvaluateDCinterp(0, 0, &value)};
    EXPECT_THAT(statuses, testing::Each(10));
    EXPECT_EQ(value, 5.0);
    EXPECT_EQ(set.EvaluateDC(0, 0), 0.0);
    EXPECT_THAT(report.messages("ERROR"),
                ElementsAre("NO DC poly available", "NO FR poly available", "NO SL2GR poly available",
                            "NO GR2SL poly available", "NO SL2THETA poly available", "NO SL2PHI poly available",
                            "NO DC poly available", "NO DC poly available"));
}

void fill_set(polySAR& set) {
    ASSERT_EQ(set.CreatePolys(2, 3, 1, 1, 2, 1), 0);
    double seed = 1.0;
    for (int i = 0; i < 2; ++i) fill(set.DC[i], seed++);
    for (int i = 0; i < 3; ++i) fill(set.FR[i], seed++);
    fill(set.SL2GR[0], seed++);
    fill(set.GR2SL[0], seed++);
    for (int i = 0; i < 2; ++i) fill(set.SL2THETA[i], seed++);
    fill(set.SL2PHI[0], seed++);
}
void expect_same_set(const polySAR& a, const polySAR& b) {
    ASSERT_EQ(a.ndc, b.ndc);
    ASSERT_EQ(a.nfr, b.nfr);
    ASSERT_EQ(a.nsl2theta, b.nsl2theta);
    for (int i = 0; i < a.ndc; ++i) expect_equal(a.DC[i], b.DC[i]);
    for (int i = 0; i < a.nfr; ++i) expect_equal(a.FR[i], b.FR[i]);
    expect_equal(a.SL2GR[0], b.SL2GR[0]);
    expect_equal(a.GR2SL[0], b.GR2SL[0]);
    for (int i = 0; i < a.nsl2theta; ++i) expect_equal(a.SL2THETA[i], b.SL2THETA[i]);
    expect_equal(a.SL2PHI[0], b.SL2PHI[0]);
}

TEST(PolySARSet, ComesBackFromAHeaderAndFromAClone) {
    const test::Report report;
    const std::string file = report.file("product.xml");
    polySAR written, read, cloned;
    fill_set(written);
    ASSERT_EQ(written.writehdr(file.c_str()), 0);
    EXPECT_THAT(test::read_text(file), testing::HasSubstr("<DopplerRate-2>"));
    ASSERT_EQ(read.readhdr(file.c_str()), 0);
    expect_same_set(read, written);
    ASSERT_EQ(written.clone(&cloned), 0);
    expect_same_set(cloned, written);

    // A smaller set leaves nothing of the larger one behind.
    ASSERT_EQ(written.CreatePolys(1, 0), 0);
    ASSERT_EQ(written.writehdr(file.c_str()), 0);
    EXPECT_THAT(test::read_text(file), testing::Not(testing::HasSubstr("DopplerRate-")));
    ASSERT_EQ(read.readhdr(file.c_str()), 0);
    EXPECT_EQ(read.ndc, 1);
    EXPECT_EQ(read.nfr, 0);
    EXPECT_EQ(read.FR, nullptr);
    EXPECT_TRUE(report.entries().empty());
}

TEST(PolySARSet, ReadsAParameterFile) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("product.txt");
    test::write_text(file,
                     "[PolySAR]\nndc = 1\nnfr = 0\nnsl2gr = 0\nngr2sl = 0\nnsl2theta = 0\nnsl2phi = 0\n"
                     "[DopplerCentroid-0]\nDCpoly_azt0 = 17.25\nDCpoly_rgt0 = 0.5\nDCpoly = {1 2 3 4 5 6 7}\n");
    polySAR set;
    ASSERT_EQ(set.readhdr(file.c_str()), 0);
    ASSERT_EQ(set.ndc, 1);
    EXPECT_THAT(set.DC[0].pol, ElementsAre(1, 2, 3, 4, 5, 6, 7));
}

std::string counts_header(const char* ndc) {
    return std::string{
               "<?xml "
               "version=\"1.0\"?><QuorelXmlDoc><NumberOfChannels>1</NumberOfChannels><Description>d</Description>"
               "<Channel Number=\"1\"><PolySAR><ndc>"} +
           ndc +
           "</ndc><nfr>0</nfr><nsl2gr>0</nsl2gr><ngr2sl>0</ngr2sl><nsl2theta>0</nsl2theta><nsl2phi>0</nsl2phi>"
           "</PolySAR></Channel></QuorelXmlDoc>";
}
TEST(PolySARSet, DoesNotBelieveCountsThatTheFileCannotHold) {
    for (const char* count : {"-1", "2147483647", "1000000", "1"}) {
        const test::Report report;
        const test::CapturedStderr silent;
        const std::string file = report.file("product.xml");
        test::write_text(file, counts_header(count));
        polySAR set;
        set.CreatePolys(2, 2);
        EXPECT_EQ(set.readhdr(file.c_str()), 1) << count;
        EXPECT_EQ(set.nfr, 0);
        EXPECT_FALSE(report.entries().empty());
    }
}

TEST(PolySARSet, MissingOrUnwritableFilesGiveAStatus) {
    const test::Report report;
    const test::CapturedStderr silent;
    polySAR set;
    fill_set(set);
    EXPECT_NE(set.writehdr("/dev/full"), 0);
    EXPECT_NE(set.writehdr(report.file("missing/product.xml").c_str()), 0);
    EXPECT_EQ(set.ndc, 2);
    EXPECT_EQ(set.readhdr(report.file("missing.xml").c_str()), 1);
    EXPECT_EQ(set.ndc, 0);
    EXPECT_EQ(set.DC, nullptr);
}

}  // namespace
