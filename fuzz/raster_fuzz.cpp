// SPDX-License-Identifier: Apache-2.0
#include "raster_property.h"

/* The first byte chooses between blocks of a raster and a side file. */

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view content{reinterpret_cast<const char*>(data), size};
    if (content.starts_with('#'))
        property::check_blocks(content.substr(1));
    else
        property::check_side_file(content);
    return 0;
}
