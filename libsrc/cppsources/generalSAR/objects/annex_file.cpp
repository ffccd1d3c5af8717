// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/objects/annex_file.h"

#include <array>
#include <string_view>

#include "quo_base/datafile.h"
#include "sarutillib/ground/number_text.h"

namespace quo {

int read_annex_data(const char* file, char* data, std::size_t bytes) {
    constexpr std::size_t kMainHeader = 1247, kSpecificHeader = 378, kOffsetPlace = 231;
    std::array<char, kMainHeader + kSpecificHeader> headers;
    DataFile annex;
    if (const int status = annex.setFilename(file)) return status;
    if (const int status = annex.open(0)) return status;
    if (const int status = annex.read(headers.data(), kMainHeader)) return status;
    if (const int status = annex.read(headers.data() + kMainHeader, kSpecificHeader)) return status;

    const std::string_view specific{headers.data() + kMainHeader, kSpecificHeader};
    const auto offset = scan_int64(specific.substr(kOffsetPlace));
    if (offset.length == 0 || offset.value < 0) return QUO_REFUSED;
    if (const int status = annex.seek(offset.value, 0)) return status;
    return annex.read(data, static_cast<std::int64_t>(bytes));
}

}  // namespace quo
