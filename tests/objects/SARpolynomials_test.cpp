// SPDX-License-Identifier: Apache-2.0
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
