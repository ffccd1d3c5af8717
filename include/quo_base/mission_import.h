// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_MISSION_IMPORT_H
#define QUO_BASE_MISSION_IMPORT_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Products as missions deliver them, taken over as products of this library: a raster and its header beside it.
 * Any number of threads may call at a time, for rasters of their own. */

/** What to take over, and where to. Texts that are null or empty are not given. */
typedef struct quo_import_request {
    const char* source;       /**< the product: its folder, its manifest or an annotation file */
    const char* raster;       /**< the raster to make; its header gets this name and ".hdr" */
    const char* swath;        /**< such as "IW1", where the product has several */
    const char* polarization; /**< such as "VV", where the product has several */
    const char* orbit_file;   /**< state vectors in place of the annotation's; of the same satellite and time */
    int link; /**< 1: the raster becomes a link to samples that stand in the measurement as they are,
                   and they are not copied */
    /** Told of the bytes of the raster that are written, and of all, every 16 MB or oftener; anything but 0 ends
     * the import, with 1. Null: nobody is. A link has no bytes to tell of. */
    int (*progress)(void* context, int64_t done, int64_t all);
    void* context; /**< handed to progress */
} quo_import_request;

/** How far pixel grid and orbit are off the tie points that the producer states, pixels: of the place that a tie
 * point has, and metres on the ground: of the pixel that it has. */
typedef struct quo_tie_points {
    int32_t count;   /**< tie points that were compared: of those that the annotation has, but for the ones that no
                          burst shows or that are more than a pixel off; 0 where there are none, and then all
                          but `stated` is 0 */
    int32_t stated;  /**< tie points that the annotation has */
    double rms_line; /**< root mean square of the lines' differences */
    double most_line;     /**< the largest of them */
    double rms_sample;    /**< the same of the samples */
    double most_sample;   /**< the largest of them */
    double rms_ground_m;  /**< the same on the ground, at the stated heights */
    double most_ground_m; /**< the largest of them */
} quo_tie_points;

/** What became of an import. */
typedef struct quo_import_result {
    char message[512];   /**< why nothing was taken over; empty after 0 */
    int32_t lines;       /**< of the raster */
    int32_t samples;     /**< of a line */
    int32_t linked;      /**< 1 where the raster is a link */
    quo_tie_points ties; /**< what the tie points show */
} quo_import_result;

/** Takes over a Sentinel-1 product: SLC (IW, EW, SM, WV) or GRD, one swath and polarization of it.
 *
 * The header holds what the annotation tells of the acquisition (docs/sentinel1.md has the list field by field),
 * with times to the digits that the annotation has, and the section "ImageGrid". Complex samples keep their type;
 * the unsigned 16-bit samples of detected products become INT32. Raster and header appear together, or nothing
 * does; an older header of that name keeps the sections that the product has not.
 *
 * An image of one swath gets its antenna pattern beside it, in a raster of the name and ".antenna"; of another
 * image, one that an older import left there is removed.
 *
 * @param[in]  request  what to do
 * @param[out] result   filled in any case
 * @return 0; 1 for a null, a product that is none of the mission's, lacks something or
 * contradicts itself (times of bursts, more than a tenth of the tie points, the pass), an orbit that does not fit
 * or does not see the image, or samples that cannot be linked; 4 for a measurement that is cut short; 5, 7, 9. The
 * reason is in the report too. The antenna pattern follows when raster and header are in place: where it alone
 *         cannot be written, the call says so, and they stay. */
QUO_BASE_API int quo_import_sentinel1(const quo_import_request* request, quo_import_result* result) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
