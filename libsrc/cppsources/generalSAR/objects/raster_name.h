// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_RASTER_NAME_H
#define QUO_RASTER_NAME_H

#include <optional>
#include <string>
#include <string_view>

namespace quo {

/** Name of the raster that a header belongs to: the header's less its last four characters. Nothing for a name
 * that has no more than the ending, whose raster would be another file of the folder. */
inline std::optional<std::string> raster_of_header(std::string_view header) {
    constexpr std::size_t kEnding = 4;
    if (header.size() <= kEnding) return std::nullopt;
    return std::string{header.substr(0, header.size() - kEnding)};
}

}  // namespace quo

#endif
