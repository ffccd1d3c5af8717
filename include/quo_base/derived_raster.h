// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_DERIVED_RASTER_H
#define QUO_BASE_DERIVED_RASTER_H

#include "quo_base/api.h"
#include "quo_base/datafile.h"

/** @file
 * Rasters that are made of others: cuts and other samplings, which keep the product's description and geometry.
 * Any number of threads may call at a time, with objects and files of their own. */

#ifdef __cplusplus

/** How a raster came of another one: its pixel (0, 0) is the other's (first_line, first_sample), and its lines and
 * samples are so many of the other's apart. */
struct RasterDerivation {
    double first_line = 0.0;    ///< lines of the other raster before this one's first
    double first_sample = 0.0;  ///< samples before the first
    double line_step = 1.0;     ///< lines of the other raster from line to line
    double sample_step = 1.0;   ///< its samples from sample to sample
};

class GeneralSAR;
class ImageGrid_Obj;

/** The description of the raster that a product's header belongs to, from the header itself or, in the older form,
 * from the side file of its raster; null where there is none. It lives as long as the product. */
QUO_BASE_API const RasterDescription* described_raster(const GeneralSAR& product) noexcept;

/** The pixel grid of a product: the header's section "ImageGrid", else that of its region, where that has the size
 * of the raster, or the header tells of no raster.
 * @param header   the file that the product was read from
 * @param product  what was read of it
 * @param grid     changed in any case
 * @return 0; 1 where there is neither; 4 for a section that makes no grid, which no region may stand for; 7 */
QUO_BASE_API int read_image_grid(const char* header, const GeneralSAR& product, ImageGrid_Obj& grid) noexcept;

/** The grid of the product's region alone, as read_image_grid() makes it where the header lists none. 0; 1 where
 * there is no region, or none of the raster's size; 7. `grid` is changed in any case. */
QUO_BASE_API int region_image_grid(const GeneralSAR& product, ImageGrid_Obj& grid) noexcept;

/** Completes a raster that BufferFile::create() started, as BufferFile::commit() does, with the whole header of
 * the raster that it came of.
 *
 * All sections of that header are taken over, and those that place the raster are made to fit: "ImageGrid" (made
 * of the region where the other header has none, so that every pixel keeps its times), "ROI", sampling rates that
 * are the image's own with the bands that they bound ("SpectralWindows", "DataSetInfo"; the pulse's stays), bursts
 * and start in "SwathInfo" where they were the whole image's, and corner points, which the orbit gives of the
 * corner pixels; where it does not, those of a raster that shows less than the other one are left out. Of bursts
 * those stay of which the raster has lines; one alone becomes an image without bursts. A header that stood at the
 * raster's place is replaced.
 * @param raster  its description is the new raster's
 * @param header  header of the other raster; it may be the new one's own place
 * @param how     where its pixels come from
 * @return as BufferFile::commit(); 1 also for steps that are not above 0, for lines of bursts at another sampling,
 * and for a header that cannot be read; 4 for a grid that makes no image. The unfinished raster goes then. */
QUO_BASE_API int commit_derived(BufferFile& raster, const char* header, const RasterDerivation& how);

#endif

#endif
