// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_FOCUS_H
#define QUO_EXAMPLES_FOCUS_H

#include <string>

#include "quo_base/generalSAR_configuration.h"
#include "stopwatch.h"

namespace example {

/** What is to be focused, and how. */
struct FocusJob {
    std::string raw;        // raw raster; its product header is "<raw>.hdr"
    std::string image;      // raster to make, with the header "<image>.hdr"
    double height_m = 0.0;  // of the scene above the ellipsoid, on average
    bool waitbar = false;
    int threads = 1;  // that work on blocks; each takes a block's memory
};

/** What was made, and what the time went into. */
struct FocusResult {
    int lines, samples;              // of the image
    int block_lines, block_samples;  // of the blocks in azimuth
    Stopwatch stopwatch;
};

/** The intermediate raster of a job. */
inline std::string compressed_raster(const FocusJob& job) { return job.image + ".rc"; }

/** Focuses stripmap data: range compression of whole lines into an intermediate raster "<image>.rc" or, with
 * `Flag_incore`, into memory, then azimuth focusing of that in blocks which overlap. The image is in slant range
 * and zero-Doppler time, on the grid of the raw data; a target of amplitude 1 in the raw data has amplitude 1 in
 * the image, and the phase -4 pi R / lambda.
 *
 * Of AzimuthConf the bandwidths, Hamming parameters, block sizes and overlaps are taken; overlaps are the least
 * ones, a block's range overlap standing on both of its sides. Of generalProcessingConf `Memory` bounds the block
 * and what is kept in memory, and `EraseTemp` removes the intermediate raster. Throws Failure. */
FocusResult focus(const FocusJob& job, const AzimuthConf& azimuth, const generalProcessingConf& processing);

}  // namespace example

#endif
