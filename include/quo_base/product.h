// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_PRODUCT_H
#define QUO_BASE_PRODUCT_H

#include "quo_base/api.h"
#include "quo_base/datafile.h"

QUO_BASE_C_BEGIN

/** @file
 * A product in the hands of any language that can call C: its values, geolocation on its orbit, its raster.
 *
 *     quo_product* product;
 *     double prf_hz;
 *     if (quo_product_open("scene.slc.hdr", NULL, &product) != QUO_OK) return 1;
 *     int status = quo_product_number(product, "SamplingConstants/prf_hz", &prf_hz);
 *     ...
 *     quo_product_close(product);
 *
 * A product is read when it is opened and does not change afterwards, whatever becomes of its files; only the
 * samples of the raster are read when they are asked for. A handle is a number that is never given twice, not an
 * address: one that was closed, or never given, is recognised.
 *
 * Fields are named "Section/Field" as in header documents: "SamplingConstants/prf_hz", "StateVectorData/pSV_m",
 * "ROI/Lines"; polynomials are sections within theirs, "PolySAR/DopplerCentroid-0/pol". All elements that the
 * header objects of the product hold can be had, in the units that their classes tell; the corner points of
 * "GroundCornersPoints" are none. What the file does not say has the value of a new object, often -999 or
 * "NOT_AVAILABLE".
 *
 * Arrays belong to the caller, and the library keeps no address beyond the call. Where an array has room for fewer
 * values than there are, nothing is written.
 *
 * Every function returns 0, or 1 for a handle that is not open, a null where something is needed, and what is told
 * with each. Outputs are written with 0 alone, unless said otherwise; every other status has its entry in the
 * report.
 *
 * Any number of threads may use one handle at the same time. A product that is closed meanwhile stays until the
 * calls on it have returned. */

/** An open product. Only quo_product_open() makes handles; they are never followed as pointers. */
typedef struct quo_product quo_product;

/** Opens a product.
 * @param[in]  header   file name of the header, an XML file or one of the older parameter files
 * @param[in]  raster   file name of the raster, whose description stands in the file of that name with ".hdr"
 *                      appended; null for the one that the header describes, whose name is the header's less its
 *                      last four characters. A header may describe none.
 * @param[out] product  the handle, to be given back to quo_product_close()
 * @return 1 also for a header that holds no object of a product, and for a raster without a complete description;
 * 7; 9 for a header that cannot be opened. That the raster is there is not asked before it is read. */
QUO_BASE_API int quo_product_open(const char* header, const char* raster, quo_product** product) QUO_NOEXCEPT;

/** Closes a product; its handle is none from then on. */
QUO_BASE_API int quo_product_close(quo_product* product) QUO_NOEXCEPT;

/* ---- Values ----
 *
 * 1 also for a field that the product does not have. Fields of "ImageGrid" are those of the grid that places the
 * pixels, which a header without that section has of its region. */

/** How many values a field has: 1 for a text, 0 for an array that the product does not fill. */
QUO_BASE_API int quo_product_length(const quo_product* product, const char* field, size_t* length) QUO_NOEXCEPT;

/** The value of a field that holds one number. 1 also for a text and for a field with another number of values.
 */
QUO_BASE_API int quo_product_number(const quo_product* product, const char* field, double* number) QUO_NOEXCEPT;

/** All values of a field of numbers, quo_product_length() of them.
 * @param[in]  product, field  whose values
 * @param[out] numbers         the values
 * @param[in]  room            numbers that there is room for
 * @return 1 also for a text, and where there are more values than room. Without values nothing is written, and
 *         `numbers` may be null. */
QUO_BASE_API int quo_product_numbers(const quo_product* product, const char* field, double* numbers,
                                     size_t room) QUO_NOEXCEPT;

/** Room for every text of a product, bytes, the final NUL included. */
#define QUO_PRODUCT_TEXT_ROOM 512

/** The value of a field that holds a text, with a final NUL.
 * @param[in]  product, field  whose text
 * @param[out] text            the text
 * @param[in]  room            bytes that there is room for, the NUL included
 * @return 1 also for a number, and for a text that is longer than the room */
QUO_BASE_API int quo_product_text(const quo_product* product, const char* field, char* text,
                                  size_t room) QUO_NOEXCEPT;

/* ---- Geolocation of arrays ----
 *
 * Arrays hold `count` numbers each. Azimuth times are seconds since 1985, range times are two-way, in seconds;
 * angles are in degrees, latitude is geodetic (WGS84), heights are in metres above the ellipsoid, x, y, z in
 * metres and Earth-fixed. Outputs that are not wanted are null, and so are inputs that may be left out.
 *
 * Points without a solution, such as those whose inputs are not finite, get not-a-number; `status` tells each
 * point's own status, 0 where it has a solution. They are no failure of the call. Results do not hang on how
 * points are cut into arrays, nor on what was asked before: they are those of a GeneralSAROrbit that was just
 * read.
 *
 * An output may be the very array of an input, but must not overlap with one otherwise, nor with another output.
 *
 * 1 also without an orbit, without a wavelength where a Doppler or an FM rate takes part, and for arrays that
 * overlap or that no memory can hold. */

/** Where samples lie on the ground, and how they are seen.
 * @param[in]  product        whose orbit, wavelength and look side
 * @param[in]  count          number of samples
 * @param[in]  azimuth_s, range_s  times of the samples
 * @param[in]  doppler_hz     Doppler, positive while the target approaches; null for 0
 * @param[in]  height_m       heights of the ground points; null for 0
 * @param[out] latitude_deg, longitude_deg, ground_height_m  place of the ground points
 * @param[out] x_m, y_m, z_m  the same, Earth-fixed
 * @param[out] incidence_deg  angle between the line of sight and the ellipsoid's normal
 * @param[out] look_deg       angle at the platform from the direction to the Earth's centre
 * @param[out] fm_rate_hz_s   azimuth FM rate, Hz/s, negative at broadside
 * @param[out] speed_m_s      platform speed over the rotating Earth
 * @param[out] status         of each sample: 0; 1 for a value that is not finite, or a range or height that
 *                            cannot be; 10 where no ground is seen
 * @return 1 also for a header without the data set, which tells the look side: right where it leaves it open */
QUO_BASE_API int quo_product_to_ground(const quo_product* product, size_t count, const double* azimuth_s,
                                       const double* range_s, const double* doppler_hz, const double* height_m,
                                       double* latitude_deg, double* longitude_deg, double* ground_height_m,
                                       double* x_m, double* y_m, double* z_m, double* incidence_deg,
                                       double* look_deg, double* fm_rate_hz_s, double* speed_m_s,
                                       int32_t* status) QUO_NOEXCEPT;

/** When ground points are seen, and how far away.
 * @param[in]  product        whose orbit and wavelength
 * @param[in]  count          number of points
 * @param[in]  latitude_deg, longitude_deg, height_m  the points, height null for 0; or all three null for
 * @param[in]  x_m, y_m, z_m  the points, Earth-fixed
 * @param[in]  doppler_hz     Doppler at which they are seen; null for 0
 * @param[out] azimuth_s, range_s  times of the points. Neither the look side nor the horizon plays a part.
 * @param[out] status         of each point: 0; 1 for a value that is not finite; 12 where it is not seen
 * @return 1 also for points that are not given in exactly one of the two forms */
QUO_BASE_API int quo_product_to_radar(const quo_product* product, size_t count, const double* latitude_deg,
                                      const double* longitude_deg, const double* height_m, const double* x_m,
                                      const double* y_m, const double* z_m, const double* doppler_hz,
                                      double* azimuth_s, double* range_s, int32_t* status) QUO_NOEXCEPT;

/* ---- Pixels, as arrays ----
 *
 * The same, with lines and samples in place of times. They count from 0 at the raster's first line and sample;
 * whole numbers are the centres of pixels. They may lie outside the raster. Where they stand is told by the
 * header's section "ImageGrid" or, without one, by its region, where that has the raster's size.
 *
 * Statuses, null, not-a-number and overlaps are as above; 1 also for a product that does not place its pixels, 4
 * where its section "ImageGrid" makes no grid, 7. */

/** When pixels were seen, at zero Doppler, and how far away.
 * @param[in]  product        whose pixels
 * @param[in]  count          number of pixels
 * @param[in]  line, sample   the pixels
 * @param[out] azimuth_s, range_s  their times
 * @param[out] status         of each pixel: 0; 1 for one that is not finite or in no burst */
QUO_BASE_API int quo_product_pixels_to_times(const quo_product* product, size_t count, const double* line,
                                             const double* sample, double* azimuth_s, double* range_s,
                                             int32_t* status) QUO_NOEXCEPT;

/** The pixels at which zero-Doppler times stand.
 * @param[in]  product        whose pixels
 * @param[in]  count          number of times
 * @param[in]  azimuth_s, range_s  the times
 * @param[out] line, sample   the pixels; of what two bursts see, the earlier burst's, unless the raster
 *                            begins behind it
 * @param[out] later_line     the line in a burst later than that; not-a-number where there is none
 * @param[out] status         of each: 0; 1 for times that are not finite, or in no burst or on no ground range */
QUO_BASE_API int quo_product_times_to_pixels(const quo_product* product, size_t count, const double* azimuth_s,
                                             const double* range_s, double* line, double* later_line,
                                             double* sample, int32_t* status) QUO_NOEXCEPT;

/** Where pixels lie on the ground, and how they are seen.
 * @param[in]  product, count, line, sample  as quo_product_pixels_to_times()
 * @param[in]  height_m       heights of the ground points; null for 0
 * @param[out] latitude_deg, longitude_deg, ground_height_m, x_m, y_m, z_m, incidence_deg, look_deg  as
 *                            quo_product_to_ground()
 * @param[out] status         of each pixel: 0; 1 for one without times; 10 where no ground is seen
 * @return 1 also without an orbit, or the data set that tells the look side */
QUO_BASE_API int quo_product_pixels_to_ground(const quo_product* product, size_t count, const double* line,
                                              const double* sample, const double* height_m, double* latitude_deg,
                                              double* longitude_deg, double* ground_height_m, double* x_m,
                                              double* y_m, double* z_m, double* incidence_deg, double* look_deg,
                                              int32_t* status) QUO_NOEXCEPT;

/** The pixels that show ground points.
 * @param[in]  product, count, latitude_deg, longitude_deg, height_m, x_m, y_m, z_m  as quo_product_to_radar()
 * @param[out] line, later_line, sample  as quo_product_times_to_pixels()
 * @param[out] status         of each point: 0; 1 for one that is not finite or has no pixel; 12 where it is not
 * seen
 * @return 1 also without an orbit, and for points that are not given in exactly one of the two forms */
QUO_BASE_API int quo_product_ground_to_pixels(const quo_product* product, size_t count, const double* latitude_deg,
                                              const double* longitude_deg, const double* height_m,
                                              const double* x_m, const double* y_m, const double* z_m,
                                              double* line, double* later_line, double* sample,
                                              int32_t* status) QUO_NOEXCEPT;

/* ---- The raster ---- */

/** Shape and type of the raster's samples. Outputs that are not wanted are null.
 * @param[in]  product         whose raster
 * @param[out] lines, samples  number of lines, and of samples in a line
 * @param[out] cell_type       a RasterCellType
 * @return 0 also for a product without a raster: 0 lines, 0 samples, CELL_NOT_SET */
QUO_BASE_API int quo_product_raster(const quo_product* product, int32_t* lines, int32_t* samples,
                                    int32_t* cell_type) QUO_NOEXCEPT;

/** Reads a block of the raster, line after line without gaps, in the machine's byte order.
 *
 * Samples are converted into `cell_type`, a RasterCellType: real numbers that become integers are rounded half
 * away from zero, what lies beyond an integer's bounds is held there, and not-a-number becomes 0; real samples get
 * the imaginary part 0.
 * @param[in]  product                   whose raster
 * @param[in]  first_line, first_sample  where the block starts, counted from 0
 * @param[in]  lines, samples            its size; where one is 0 nothing is read, and `block` may be null
 * @param[in]  cell_type                 type of the block's samples
 * @param[out] block                     lines * samples samples; no alignment is asked
 * @param[in]  room                      bytes that `block` has room for
 * @return 1 also for a product without a raster, a block that is not within it or for which there is no room, and
 *         complex samples as real ones; 4 where the file ends before the block; 9 where it cannot be opened; 7.
 *         Where the disk fails within the block it is 4, with a part of the block written. */
QUO_BASE_API int quo_product_read(const quo_product* product, int32_t first_line, int32_t lines,
                                  int32_t first_sample, int32_t samples, int32_t cell_type, void* block,
                                  size_t room) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
