// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_PICTURE_H
#define QUO_EXAMPLES_PICTURE_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace drawing {

/** A picture of 8 bits a channel, row after row from the top. */
struct Picture {
    std::size_t width = 0, height = 0;
    std::size_t channels = 1;  ///< 1: grey; 3: red, green and blue
    std::vector<std::uint8_t> values;
};

/** The bytes of a picture's PNG file. Throws std::bad_alloc where memory is short. */
std::string png_of(const Picture& picture);

}  // namespace drawing

#endif
