// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_IMAGE_GRID_H
#define QUO_BASE_IMAGE_GRID_H

#include <cstddef>
#include <cstdint>
#include <vector>

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"

class ROI_Obj;

/** @file
 * Where the pixels of an image stand in azimuth and range time, and back.
 *
 * Lines and samples count from 0 at the raster's first line and sample; whole numbers are the centres of pixels,
 * and every pixel reaches half a line and half a sample to either side. Azimuth times are zero-Doppler times in
 * seconds since 1985, as the orbit takes them; range times are two-way, in seconds.
 *
 * Statuses: 0; 1 for a grid that makes no image (isComplete()), for a missing array, for arrays that no memory can
 * hold or that overlap (an output may be the very array of an input); nothing is written then. One object serves
 * one thread at a time; its `const` members may run side by side. */

/** Pixels: arrays of `count` numbers each. */
struct ImagePixels {
    std::size_t count;     ///< of the pixels, and so of every array
    const double* line;    ///< lines of the raster
    const double* sample;  ///< samples of the raster
};
/** What is wanted of pixels; null where it is not. */
struct PixelTimes {
    double* azimuth_s{};     ///< zero-Doppler azimuth times; not-a-number for a pixel without
    double* range_s{};       ///< two-way range times; not-a-number for a pixel without
    std::int32_t* status{};  ///< 0; 1 for a pixel without times: not finite, or in no burst
};
/** Times that the orbit gave: arrays of `count` numbers each. */
struct ImageTimes {
    std::size_t count;        ///< of the times, and so of every array
    const double* azimuth_s;  ///< zero-Doppler azimuth times
    const double* range_s;    ///< two-way range times
};
/** What is wanted of them; null where it is not. Times without a pixel get not-a-number. Lines and samples may lie
 * outside the raster: whoever has the raster knows its size. */
struct TimePixels {
    /** Lines; of a point that two bursts see, the earlier burst's, unless the raster begins behind it. */
    double* line{};
    double* second_line{};   ///< the line in a burst later than that; not-a-number where there is none
    double* sample{};        ///< samples
    std::int32_t* status{};  ///< 0; 1 for times that are not finite, lie in no burst or on no ground range
};

/** The pixel grid of an image. Section "ImageGrid".
 *
 * An image without bursts has line k at FirstLine_s + k LineStep_s after Epoch_s; one of bursts has line j of
 * burst b at BurstStart_s[b] + j LineStep_s, and its lines of all bursts follow each other in the raster. Samples
 * are SampleStep_s apart from FirstSample_s on in slant range; in ground range they are GroundStep_m apart, and
 * the slant range is the polynomial GroundToSlant of the ground range, the one of the listed azimuth time that is
 * nearest to the line's. (Polynomials of neighbouring times begin at different slant ranges; one between them
 * would be wrong.)
 *
 * Where a processor's focusing leaves a part of the two-way delay in the line times, DelayShare of the delay
 * beyond DelayReference_s belongs to them: a target at range time tau stands at the line whose time is its
 * zero-Doppler time less DelayShare (tau - DelayReference_s).
 *
 * A raster that was cut out begins at line FirstLine and sample FirstSample of the grid, so that its pixels keep
 * their times to the bit. Times are seconds after the whole second Epoch_s: the 15 digits of a header then hold
 * them to a picosecond.
 */
class QUO_BASE_API ImageGrid_Obj : public GeneralSAR_Base {
public:
    /** Coefficients of a polynomial from ground to slant range, in ascending powers of the ground range. */
    static constexpr int kTerms = 12;

    ImageGrid_Obj();

    /** Reads the section. 0; 1 where it is missing; 4 where it makes no grid, is not complete or the file cannot
     * be read; 7. */
    int readhdr(const char* file) override;
    using GeneralSAR_Base::writehdr;
    int writehdr(const char* file) override;  ///< writes the section; 0 or a failing status
    /** Makes the arrays for Bursts bursts and GroundLists polynomials, zeros. 0; 1 for lengths that make none, 7.
     */
    int createBuffers() override;
    int destroyBuffers() override;       ///< releases the arrays; there are no bursts and no polynomials then
    int clone(ImageGrid_Obj* to) const;  ///< copies every member; 0 or 7

    /** The grid of a region: lines and samples at its steps from its start, in slant range. What was there is
     * dropped. 0; 1 for a region without a step. */
    int setRegion(const ROI_Obj& region);
    /** Gives a region the axes of a raster of this grid: from its first line, without the delay, and its first
     * sample to its last ones. Bursts overlap, so that their lines are more than the region's,
     * which reaches from the earliest of them to the latest. In ground range the
     * samples of the first line are taken as evenly spaced in time.
     * @return 0; 1, with nothing changed and nothing reported, for a grid that makes no image, a null, and a
     * raster that reaches beyond the bursts or has no line or no sample */
    int getRegion(ROI_Obj* region, std::int32_t lines, std::int32_t samples) const;

    /** Makes it the grid of a raster that was cut out of this one's, at another sampling or the same: the raster's
     * pixel (0, 0) is (line, sample) of this grid's raster, and its lines and samples are so many of this one's
     * apart. 0; 1 for steps not above 0, and for lines of bursts at another sampling; nothing changes then. */
    int cut(double line, double sample, double line_step, double sample_step);

    /** Whether steps and lists are such that pixels have times. */
    [[nodiscard]] bool isComplete() const;
    /** Times of pixels. @return 0 or 1 */
    int pixelTimes(const ImagePixels& pixels, const PixelTimes& times) const noexcept;
    /** Pixels of times. @return 0 or 1 */
    int timePixels(const ImageTimes& times, const TimePixels& pixels) const noexcept;

    double Epoch_s = 0.0;            ///< a whole second before the first line, seconds since 1985
    double FirstLine_s = 0.0;        ///< time of the grid's line 0, seconds after Epoch_s
    double LineStep_s = 0.0;         ///< from line to line, s
    double FirstSample_s = 0.0;      ///< range time of the grid's sample 0; of ground range its near range time
    double SampleStep_s = 0.0;       ///< from sample to sample, s; 0 in ground range
    double GroundStep_m = 0.0;       ///< from sample to sample; 0 in slant range
    double DelayShare = 0.0;         ///< share of the delay that is left in the line times
    double DelayReference_s = 0.0;   ///< range time at which nothing is left
    double FirstLine = 0.0;          ///< line of the grid that is the raster's line 0
    double FirstSample = 0.0;        ///< sample of the grid that is the raster's sample 0
    std::int32_t LinesPerBurst = 0;  ///< lines of each burst; 0 without bursts
    std::int32_t Bursts = 0;         ///< number of bursts
    std::int32_t GroundLists = 0;    ///< number of polynomials from ground to slant range

    std::vector<double> BurstStart_s;   ///< time of each burst's line 0, seconds after Epoch_s
    std::vector<double> GroundTime_s;   ///< azimuth time of each polynomial, seconds after Epoch_s
    std::vector<double> GroundToSlant;  ///< kTerms coefficients of each polynomial: slant range, m, of m

protected:
    void refreshParameters() override;
};

#endif
