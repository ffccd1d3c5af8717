// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_COREGIST_H
#define QUO_BASE_COREGIST_H

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"
#include "quo_base/roi.h"

/** @file
 * The mapping of a master image onto a slave image. One object serves one thread at a time; its `const` members
 * may run side by side. */

/** Two fit polynomials, one for the range and one for the azimuth coordinate of the slave, in two forms.
 *
 * Time form: with dr = range time - trg0 and da = azimuth time - taz0 of the master, the slave's range time is
 * RgFit C0 dr^2 + C1 dr + C2 da + C3, its azimuth time AzFit likewise. Range times are two-way, in seconds;
 * azimuth times are seconds since 1985.
 *
 * Sample form: with ds = sample - Rg_Samples_Origin and dl = line - Az_Samples_Origin of the master, the slave's
 * sample is Rg_Fit_Coeff C0 ds^2 + C1 ds + C2 dl + C3, its line Az_Fit_Coeff likewise. Samples and lines count
 * from 0 at the start of each image.
 *
 * Section "REGIST" of an XML header; in a parameter file the time form's keys are Rg_Fit_Coeff_Time,
 * Az_Fit_Coeff_Time, Rg_Time_Origin and Az_Time_Origin, the others are the members' names. The relative errors may
 * be missing in both. */
class QUO_BASE_API Coregist : public GeneralSAR_Base {
public:
    Coregist();

    /** Reads the mapping, from the XML section or else from the parameter file, and calls init(). 0; 1 with the
     * ERROR entry "Fit polynomials read error" when a mandatory key is missing, with the keys found taken over. */
    int readpar(const char* file);
    /** Replaces the section in the file. Returns 0 even where the file cannot be written; the report tells. */
    int writepar(const char* file);
    int clone(Coregist* to) const;  ///< copies every member; 0

    /** Slave times of a master time. Returns 0. */
    int evaluateSLtime(double rangeTime, double azimuthTime, double* slaveRange, double* slaveAzimuth) const;
    double evaluateSLtimeRange(double rangeTime, double azimuthTime) const;
    double evaluateSLtimeAzimuth(double rangeTime, double azimuthTime) const;

    /** Prepares evaluateMAtime(); to be called after the time form was set by hand. Returns 0. */
    int init();
    /** Master times of a slave time, the inverse of evaluateSLtime(): of the two solutions of the quadratic the
     * one that stays when its quadratic term vanishes. 0; 10 when the mapping has no inverse there, with the
     * outputs unchanged. */
    int evaluateMAtime(double slaveRange, double slaveAzimuth, double* masterRange, double* masterAzimuth) const;
    /** One coordinate of evaluateMAtime(); not a number where there is none. */
    double evaluateMAtimeRange(double slaveRange, double slaveAzimuth) const;
    double evaluateMAtimeAzimuth(double slaveRange, double slaveAzimuth) const;

    /** Makes the sample form from the time form. The sample origin becomes the master sample and line nearest to
     * the time origin. 0; 1 without a region or when an interval is 0 or not finite, with everything unchanged. */
    int Time2Samples(const ROI_Obj* master, const ROI_Obj* slave);
    /** The same for two images with common intervals, s. */
    int Time2Samples(double masterRangeStart, double masterAzimuthStart, double slaveRangeStart,
                     double slaveAzimuthStart, double rangeInterval, double azimuthInterval);
    /** Makes the time form from the sample form, the inverse of Time2Samples(), and calls init(). The time origin
     * becomes the time of the sample origin in the master. 0 or 1 as there. */
    int ConvertPolys(const ROI_Obj* master, const ROI_Obj* slave);

    double Az_Fit_Coeff[4] = {};                   ///< slave line: line offset per ds^2, ds, dl; constant
    double Rg_Fit_Coeff[4] = {};                   ///< slave sample
    double RgFit[4] = {};                          ///< slave range time: 1/s, 1, 1, s
    double AzFit[4] = {};                          ///< slave azimuth time: 1/s, 1, 1, s since 1985
    double trg0 = 0.0;                             ///< master range time origin, s; element "trg0_s"
    double taz0 = 0.0;                             ///< master azimuth time origin, s since 1985; element "taz0_s"
    int Az_Samples_Origin = 0;                     ///< master line origin
    int Rg_Samples_Origin = 0;                     ///< master sample origin
    double Rg_Fit_Coeffs_Relative_Errors[4] = {};  ///< of Rg_Fit_Coeff
    double Az_Fit_Coeffs_Relative_Errors[4] = {};  ///< of Az_Fit_Coeff

protected:
    void refreshParameters() override;

private:
    // The quadratic in dr that remains when da is eliminated: quadratic_ dr^2 + linear_ dr = right side.
    double quadratic_ = 0.0, linear_ = 0.0, linear_square_ = 0.0;
};

#endif
