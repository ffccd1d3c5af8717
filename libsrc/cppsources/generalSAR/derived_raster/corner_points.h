// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_CORNER_POINTS_H
#define QUO_CORNER_POINTS_H

#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"

namespace quo {

/** Fills the points of a product's geographic description from the corner pixels and the middle of its raster, at
 * height 0. A region cannot tell them: in ground range every line has slant ranges of its own.
 * @return 0; or the status of what found no place for a pixel, with the points as they were */
int place_corners(const ImageGrid_Obj& grid, std::int32_t lines, std::int32_t samples, GeneralSAR& product);

}  // namespace quo

#endif
