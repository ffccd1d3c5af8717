// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_FRAMED_PICTURE_H
#define QUO_TOOL_FRAMED_PICTURE_H

#include <optional>
#include <string>

#include "common/drawing/frame.h"

namespace tool {

/** What stands around a grey picture. */
struct FrameAround {
    std::string title, about;
    drawing::Axis across, down;
    double aspect = 1.0;  ///< height of a pixel over its width
    double low_db = 0.0, high_db = 1.0;
    /** Where north and east are in the picture: steps to the right and down, of length 1. */
    std::optional<std::pair<drawing::Point, drawing::Point>> north_and_east;
};

/** Whether a picture of that size can be framed: it is neither too large nor stretched to nothing. */
bool can_be_framed(double width, double height, double aspect);

/** Draws a frame with title, axes, a bar of decibels and an arrow to the north around a picture, which is enlarged
 * where it is very small, and stretched in height where its pixels are no squares. */
drawing::Picture framed(const drawing::Picture& picture, const FrameAround& around);

}  // namespace tool

#endif
