// SPDX-License-Identifier: Apache-2.0
#include "xml_header_property.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    property::check({reinterpret_cast<const char*>(data), size});
    return 0;
}
