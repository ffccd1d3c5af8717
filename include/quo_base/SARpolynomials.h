// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_SARPOLYNOMIALS_H
#define QUO_BASE_SARPOLYNOMIALS_H

#include <atomic>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"

namespace quo {
struct PolynomialLists;
}

/** @file
 * Polynomials in range and azimuth time, and the set of them that describes a product.
 *
 * Range times are two-way, in seconds; azimuth times are seconds since 1985. Every polynomial is taken around its
 * reference point: x = range time - trg0, y = azimuth time - taz0. Operations return 0 unless said otherwise.
 * One object serves one thread at a time; `const` members, such as all evaluations, may run side by side. */

/** c0 + c1 x + c2 y + c3 x y + c4 x^2 + c5 x^3 + c6 x^4: degree 4 in range, linear in azimuth. A new one is zero.
 */
class QUO_BASE_API poly : public GeneralSAR_Base {
public:
    poly();

    /** The value at a range and an azimuth time. */
    int EvaluatePoly(double rangeTime, double azimuthTime, double* value) const;
    int clone(poly* to) const;  ///< copies coefficients and reference times
    /** Writes the polynomial as the section "PolySAR/NAME" of a header file, replacing an older one. 0 or the
     * failing status of the write. */
    int writepar(const char* file, const char* name);
    /** Reads the section "PolySAR/NAME" of a header file. 0, or 1 when it is not there. */
    int readpar(const char* file, const char* name);

    double pol[7] = {};    ///< c0 .. c6
    double trg0 = -999.0;  ///< reference range time, s; element "trg0_s"
    double taz0 = -999.0;  ///< reference azimuth time, s since 1985; element "taz0_s"

protected:
    void refreshParameters() override;
};

/** @name The quantities of a product
 * Their readpar() falls back to the parameter file: section NAME with the keys that each class lists, azimuth and
 * range reference and the 7 coefficients. 0, or 1 when a key is missing, with the keys found taken over.
 * @{ */

/** Doppler centroid, Hz. Keys DCpoly_azt0, DCpoly_rgt0, DCpoly. */
class QUO_BASE_API polyDC : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
    /** Older parameter-file form: DopCenPol_nCoeff tells n, DopCenRgRefTimes and DopCenAzRefSec85Times the
     * reference, DopCenRangeCoeffs the n coefficients: 5 are a pure range polynomial (c0, c1, c4, c5, c6), 7 are
     * c0 .. c6, any other number leaves the coefficients. 0, or 1 when a key is missing. */
    int readparold(const char* file, const char* section);
};
/** Azimuth FM rate, Hz/s. Keys FRpoly_azt0, FRPoly_rgt0 (with a capital P: files depend on it), FRpoly. */
class QUO_BASE_API polyFR : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
    /** Older parameter-file forms, n coefficients; reference times are not read. n = 5: AzimuthCoeff as a pure
     * range polynomial (c0, c1, c4, c5, c6, the others 0). n = 3: AzimuthCoeff into c0, c1 and c3, the term in x
     * y, the others stay. n = 7: DopRatRangeCoeff into c0 .. c6. 0, or 1 when the key is missing or for any other
     * n.
     */
    int readparold(const char* file, const char* section, int n);
};
/** Slant to ground range. Keys SL2GRpoly_azt0, SL2GRpoly_rgt0, SL2GRpoly. */
class QUO_BASE_API polySL2GR : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
};
/** Ground to slant range. Keys GR2SLpoly_azt0, GR2SLpoly_rgt0, GR2SLpoly. */
class QUO_BASE_API polyGR2SL : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
};
/** Slant range to incidence angle, degrees. Keys SL2THETApoly_azt0, SL2THETApoly_rgt0, SL2THETApoly. */
class QUO_BASE_API polySL2THETA : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
};
/** Slant range to look angle, degrees. Keys SL2PHIpoly_azt0, SL2PHIpoly_rgt0, SL2PHIpoly. */
class QUO_BASE_API polySL2PHI : public poly {
public:
    int readpar(const char* file, const char* name);  ///< XML form, else the keys above; 0 or 1
};

/** @} */

/** The higher-order form: e0 + e1 x + e2 y + e3 x y + e4 y^2 + e5 x y + e6 x y^2 + e7 x^2 y + e8 x^3 + e9 x^4 +
 * e10 x^5
 * + e11 y^3 + e12 y^4 + e13 y^5. x y stands twice and there is no x^2: stored sets were fitted so. */
class QUO_BASE_API extended_poly : public poly {
public:
    extended_poly();

    /** The value at a range and an azimuth time; 0. */
    int EvaluatePoly(double rangeTime, double azimuthTime, double* value) const;
    int clone(extended_poly* to) const;  ///< copies coefficients and reference times

    double pol[14] = {};  ///< e0 .. e13; stands for the base's in the header

protected:
    void refreshParameters() override;
};
/** Doppler centroid, Hz; XML form only. */
class QUO_BASE_API extended_polyDC : public extended_poly {};
/** Azimuth FM rate, Hz/s; XML form only. */
class QUO_BASE_API extended_polyFR : public extended_poly {};

/** The polynomials of a product: for each of six quantities a list, ordered by increasing taz0 (nothing sorts it).
 *
 * Selection takes the first polynomial whose taz0 is at or after the azimuth time, which need not be the nearest,
 * or the last one. What order a long list is in is found at the first evaluation after it was made or read: times
 * that change later count at once, but must not leave that order. Interpolation blends the coefficients of the two
 * around the azimuth time, about the reference point of the earlier one; outside the list the Doppler centroid and
 * FM rate go on linearly, the other four stay at the end's coefficients. An empty list gives 10 and the ERROR
 * entry "NO DC poly available" (FR, SL2GR, GR2SL, SL2THETA, SL2PHI likewise), with the output unchanged; the forms
 * that return the value then return 0.
 *
 * Section "PolySAR" holds the counts, and one section per polynomial: "PolySAR/DopplerCentroid-0" and so on, with
 * DopplerRate, SlantToGround, GroundToSlant, SlantToTheta, SlantToPhi for the others. */
class QUO_BASE_API polySAR : public GeneralSAR_Base {
public:
    polySAR();

    /** Makes new lists of default polynomials; a negative count counts as 0. 0, or 7 with all lists empty. */
    int CreatePolys(int dc, int fr, int sl2gr, int gr2sl, int sl2theta, int sl2phi);
    /** The older form: the four geometric lists become empty. */
    int CreatePolys(int dc, int fr);
    int DestroyPolys();  ///< empties all lists

    /** Selection: the value of the chosen polynomial. */
    int EvaluateDC(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateFR(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2GR(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateGR2SL(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2THETA(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2PHI(double rangeTime, double azimuthTime, double* value) const;
    double EvaluateDC(double rangeTime, double azimuthTime) const;
    double EvaluateFR(double rangeTime, double azimuthTime) const;
    double EvaluateSL2GR(double rangeTime, double azimuthTime) const;
    double EvaluateGR2SL(double rangeTime, double azimuthTime) const;
    double EvaluateSL2THETA(double rangeTime, double azimuthTime) const;
    double EvaluateSL2PHI(double rangeTime, double azimuthTime) const;

    /** Interpolation: the value of the blended polynomial. */
    int EvaluateDCinterp(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateFRinterp(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2GRinterp(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateGR2SLinterp(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2THETAinterp(double rangeTime, double azimuthTime, double* value) const;
    int EvaluateSL2PHIinterp(double rangeTime, double azimuthTime, double* value) const;
    double EvaluateDCinterp(double rangeTime, double azimuthTime) const;
    double EvaluateFRinterp(double rangeTime, double azimuthTime) const;
    double EvaluateSL2GRinterp(double rangeTime, double azimuthTime) const;
    double EvaluateGR2SLinterp(double rangeTime, double azimuthTime) const;
    double EvaluateSL2THETAinterp(double rangeTime, double azimuthTime) const;
    double EvaluateSL2PHIinterp(double rangeTime, double azimuthTime) const;

    /** The 7 coefficients valid at an azimuth time. */
    int getDCpoly(double azimuthTime, double* coefficients) const;
    int getFRpoly(double azimuthTime, double* coefficients) const;
    int getSL2GRpoly(double azimuthTime, double* coefficients) const;
    int getGR2SLpoly(double azimuthTime, double* coefficients) const;
    int getSL2THETApoly(double azimuthTime, double* coefficients) const;
    int getSL2PHIpoly(double azimuthTime, double* coefficients) const;

    /** The index of the earlier of the two polynomials around an azimuth time, 0 before, n - 1 after the list. */
    int getDCnum(double azimuthTime, int* index) const;
    int getFRnum(double azimuthTime, int* index) const;
    int getSL2GRnum(double azimuthTime, int* index) const;
    int getGR2SLnum(double azimuthTime, int* index) const;
    int getSL2THETAnum(double azimuthTime, int* index) const;
    int getSL2PHInum(double azimuthTime, int* index) const;

    /** Writes counts and polynomials, saving the file once. 0, or the first failing status, with the file as it
     * was. */
    int writehdr(const char* file) override;
    /** Reads counts and polynomials, each from the XML section or else from the same file as a parameter file: the
     * counts from its section "PolySAR", a polynomial from the section named like it. 0; 1 when the counts are
     * missing (all lists are then empty) or more than the file can hold; the first failing status of a polynomial,
     * with those before it read; 7. */
    int readhdr(const char* file) override;
    /** Copies all lists. 0 or 7. */
    int clone(polySAR* to) const;
    /** The polynomial that bears a name such as "DopplerCentroid-0" in headers; null where there is none. It stays
     * until its list is made anew. */
    const poly* polynomial(std::string_view name) const noexcept;
    /** The names of all polynomials of the lists, in the order of a header. Throws bad_alloc. */
    std::vector<std::string> names() const;

    std::unique_ptr<polyDC[]> DC;              ///< ndc Doppler centroids
    std::unique_ptr<polyFR[]> FR;              ///< nfr FM rates
    std::unique_ptr<polySL2GR[]> SL2GR;        ///< nsl2gr slant-to-ground polynomials
    std::unique_ptr<polyGR2SL[]> GR2SL;        ///< ngr2sl ground-to-slant polynomials
    std::unique_ptr<polySL2THETA[]> SL2THETA;  ///< nsl2theta incidence angles
    std::unique_ptr<polySL2PHI[]> SL2PHI;      ///< nsl2phi look angles
    /** Lengths of the lists. One that is raised above what CreatePolys() made counts as that; a list put in place
     * by hand is as long as its length says. */
    int32_t ndc = 0, nfr = 0, nsl2gr = 0, ngr2sl = 0, nsl2theta = 0, nsl2phi = 0;

protected:
    void refreshParameters() override;

private:
    friend struct quo::PolynomialLists;
    struct Made {
        const void* list = nullptr;
        int32_t length = 0;
        mutable std::atomic<int32_t> ordered = 0;  // so many first ones do not decrease in time; 0 not known yet
    };
    Made made_[6];  // by CreatePolys(), in the order of the lists
};

#endif
