// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_PORTRAIT_H
#define QUO_EXAMPLES_PORTRAIT_H

#include "../common/drawing/picture.h"
#include "measure.h"

namespace example {

/** Draws the response to a target: from above, its cuts in azimuth and range, and the figures of both. */
drawing::Picture portrait(const Measurement& measurement, const Closeup& closeup);

}  // namespace example

#endif
