// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_IMAGE_SIZE_H
#define QUO_IMAGE_SIZE_H

#include <cstddef>

#include "sarutillib/ground/checked_size.h"

namespace quo {

/** Whether there can be an image of ny rows of nx samples: no size below 1, and no more bytes than a pointer
 * difference counts. */
template <typename Sample>
constexpr bool addressable(int nx, int ny) noexcept {
    return nx >= 1 && ny >= 1 && (Checked<std::ptrdiff_t>{nx} * ny * sizeof(Sample)).value().has_value();
}

}  // namespace quo

#endif
