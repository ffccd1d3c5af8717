// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_STRETCH_H
#define QUO_TOOL_STRETCH_H

#include <cstddef>
#include <vector>

#include "common/drawing/picture.h"
#include "view.h"

namespace tool {

/** The levels that are black and white. */
struct Stretch {
    double low_db, high_db;
};

/** From the 2nd to the 98th percentile of blocks of pixels, and 3 dB more either way; 15 to 35 dB in all. A scene
 * of one level stays dark under what is bright in it, and a dark border does not take the contrast from all else.
 */
Stretch automatic_stretch(const std::vector<float>& power, std::size_t width);

/** The grey picture of powers that stand row after row, turned. */
drawing::Picture picture_of(const std::vector<float>& power, const Stretch& stretch, const View& view);

}  // namespace tool

#endif
