// SPDX-License-Identifier: Apache-2.0
/* Parameter files, and values of them, from any bytes. */

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "profile_property.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string text{reinterpret_cast<const char*>(data), size};
    if (!property::content_breach(text).empty() || !property::value_breach(text).empty()) std::abort();
    return 0;
}
