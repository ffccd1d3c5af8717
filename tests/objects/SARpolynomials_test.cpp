#include "quo_base/SARpolynomials.h"

#include "support/diagnostics.h"

namespace {

constexpr double kRange = 5.37e-3, kAzimuth = 803457.3;

struct Powers {
    int x, y;
};
constexpr Powers kTerms[] = {{0, 0}, {1, 0}, {0, 1}, {1, 1}, {2, 0}, {3, 0}, {4, 0}};
// Two cross terms and no square of x.
constexpr Powers kExtendedTerms[] = {{0, 0}, {1, 0}, {0, 1}, {1, 1}, {0, 2}, {1, 1}, {1, 2},
                                     {2, 1}, {3, 0}, {4, 0}, {5, 0}, {0, 3}, {0, 4}, {0, 5}};

// One coefficient at a time, about a reference point away from zero: every term must be where it belongs.
template <typename P, std::size_t N>
void expect_terms(const Powers (&terms)[N]) {
    const double x = 1.7, y = -2.3;
    for (std::size_t i = 0; i < N; ++i) {
        P p;
        static_assert(std::size(decltype(p.pol){}) == N);
        p.trg0 = kRange;
        p.taz0 = kAzimuth;
        p.pol[i] = 1.3;
        double value = 0.0;
        ASSERT_EQ(p.EvaluatePoly(kRange + x, kAzimuth + y, &value), 0);
        EXPECT_NEAR(value, 1.3 * std::pow(x, terms[i].x) * std::pow(y, terms[i].y), 1e-8) << i;
    }
}
TEST(Poly, PlacesEveryTerm) {
    expect_terms<polyDC>(kTerms);
    expect_terms<extended_polyDC>(kExtendedTerms);
}

/** All that a set tells of one of its quantities. */
struct Quantity {
    const char* name;
    bool extrapolates;
    int (polySAR::*select)(double, double, double*) const;
    int (polySAR::*interpolate)(double, double, double*) const;
    double (polySAR::*selected)(double, double) const;
    double (polySAR::*interpolated)(double, double) const;
    int (polySAR::*coefficients)(double, double*) const;
    int (polySAR::*number)(double, int*) const;
};
#define QUO_QUANTITY(KIND, extrapolates)                                                           \
    {                                                                                              \
#KIND, extrapolates, &polySAR::Evaluate##KIND, &polySAR::Evaluate##KIND##interp,           \
            &polySAR::Evaluate##KIND, &polySAR::Evaluate##KIND##interp, &polySAR::get##KIND##poly, \
            &polySAR::get##KIND##num                                                               \
    }
constexpr Quantity kQuantities[] = {QUO_QUANTITY(DC, true),        QUO_QUANTITY(FR, true),
                                    QUO_QUANTITY(SL2GR, false),    QUO_QUANTITY(GR2SL, false),
                                    QUO_QUANTITY(SL2THETA, false), QUO_QUANTITY(SL2PHI, false)};

/** Three polynomials of each quantity, constant in range, at azimuth times 10, 20 and 40. */
class PolySAR : public testing::Test {
protected:
    PolySAR() {
        set_.CreatePolys(3, 3, 3, 3, 3, 3);
        const double times[] = {10.0, 20.0, 40.0}, values[] = {100.0, 130.0, 110.0};
        for (std::size_t i = 0; i < 3; ++i)
            for (poly* p : std::initializer_list<poly*>{&set_.DC[i], &set_.FR[i], &set_.SL2GR[i], &set_.GR2SL[i],
                                                        &set_.SL2THETA[i], &set_.SL2PHI[i]}) {
                p->pol[0] = values[i];
                p->taz0 = times[i];
                p->trg0 = 0.5 * static_cast<double>(i);
            }
    }
    polySAR set_;
};

TEST_F(PolySAR, SelectsTheFirstAtOrAfterAndInterpolatesBetween) {
    const struct {
        double azimuth, selected;
        int number;
        double extrapolated, held;  // interpolated value of the kinds that do and do not extrapolate
    } rows[] = {{0.0, 100.0, 0, 70.0, 100.0},   {10.0, 100.0, 0, 100.0, 100.0}, {15.0, 130.0, 0, 115.0, 115.0},
                {30.0, 110.0, 1, 120.0, 120.0}, {40.0, 110.0, 2, 110.0, 110.0}, {60.0, 110.0, 2, 90.0, 110.0}};
    for (const auto& row : rows) {
        for (const Quantity& kind : kQuantities) {
            SCOPED_TRACE(testing::Message() << kind.name << " at " << row.azimuth);
            const double expected = kind.extrapolates ? row.extrapolated : row.held;
            double selected = 0.0, interpolated = 0.0, c[7] = {};
            int number = -1;
            EXPECT_EQ((set_.*kind.select)(0.3, row.azimuth, &selected) +
                          (set_.*kind.interpolate)(0.3, row.azimuth, &interpolated) +
                          (set_.*kind.coefficients)(row.azimuth, c) + (set_.*kind.number)(row.azimuth, &number),
                      0);
            EXPECT_EQ(selected, row.selected);
            EXPECT_EQ((set_.*kind.selected)(0.3, row.azimuth), row.selected);
            EXPECT_EQ(number, row.number);
            EXPECT_NEAR(interpolated, expected, 1e-9);
            EXPECT_EQ((set_.*kind.interpolated)(0.3, row.azimuth), interpolated);
            EXPECT_NEAR(c[0], expected, 1e-9);
        }
    }
}

// An empty list says which, leaves the output and gives 10.
TEST(PolySARSet, SaysWhichListIsEmpty) {
    const test::Report report;
    const polySAR set;
    double value = 5.0, c[7] = {5.0};
    int number = 5;
    std::vector<std::string> messages;
    for (const Quantity& kind : kQuantities) {
        EXPECT_EQ((set.*kind.select)(0, 0, &value) + (set.*kind.interpolate)(0, 0, &value) +
                      (set.*kind.coefficients)(0, c) + (set.*kind.number)(0, &number),
                  4 * 10);
        EXPECT_EQ((set.*kind.selected)(0, 0) + (set.*kind.interpolated)(0, 0), 0.0);
        messages.insert(messages.end(), 6, std::string{"NO "} + kind.name + " poly available");
    }
    EXPECT_EQ(value + c[0] + number, 15.0);
    EXPECT_EQ(report.messages("ERROR"), messages);
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
    EXPECT_TRUE(number >= 0 && number < 3 && std::isnan(set_.EvaluateDCinterp(0.1, std::nan(""))));
    set_.CreatePolys(1, 0);
    set_.DC[0].pol[0] = 7.0;
    for (const double azimuth : {-100.0, 100.0})
        EXPECT_EQ(set_.EvaluateDC(0.0, azimuth) + set_.EvaluateDCinterp(0.0, azimuth), 14.0);
}

// The counts are public: a raised one was written, copied and evaluated from beyond the list.
TEST(PolySARSet, HoldsWhatItsListsHoldWhateverTheCountsSay) {
    const test::TemporaryFolder folder;
    polySAR set, copy, read;
    ASSERT_EQ(set.CreatePolys(2, 1), 0);
    set.DC[1].pol[0] = 17.3;
    set.DC[1].taz0 = 1.0;
    set.ndc = set.nfr = set.nsl2phi = 100000;
    EXPECT_EQ(set.EvaluateDC(0.0, 1e9), 17.3);
    EXPECT_EQ(set.EvaluateSL2PHI(0.0, 0.0), 0.0);
    ASSERT_EQ(set.clone(&copy), 0);
    set.ndc = set.nfr = set.nsl2phi = 100000;
    const std::string file = folder.file("set.xml");
    ASSERT_EQ(set.writehdr(file.c_str()) + read.readhdr(file.c_str()), 0);
    for (const polySAR* of : {&copy, &read}) EXPECT_EQ(of->ndc + 10 * of->nfr + 100 * of->nsl2phi, 12);

    set.FR = std::make_unique<polyFR[]>(3);  // a list of one's own is as long as its count says
    set.nfr = 3;
    ASSERT_EQ(set.clone(&copy), 0);
    EXPECT_EQ(copy.nfr, 3);
}

TEST(PolySARSet, DoesNotBelieveCountsThatTheFileCannotHold) {
    const test::Report report;
    const std::string file = report.file("product.xml"),
                      text = test::read_text(QUO_TEST_DATA "/objects/polySAR.xml");
    for (const std::string count : {"-1", "2147483647", "1000000", "9"}) {
        test::write_text(file, std::string{text}.replace(text.find("<ndc>2") + 5, 1, count));
        polySAR set;
        set.CreatePolys(2, 2);
        EXPECT_EQ(set.readhdr(file.c_str()), 1) << count;
        EXPECT_EQ(set.SL2PHI == nullptr, count != "9") << count;  // few enough, but not there
    }
    EXPECT_EQ(report.entries("ERROR").empty(), false);
}

}  // namespace
