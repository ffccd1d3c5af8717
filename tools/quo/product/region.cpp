#include "region.h"

#include <cmath>
#include <filesystem>

#include "document.h"
#include "failure.h"

namespace tool {
void read_region(const std::string& header, ROI_Obj& region) {
    const bool found = region.read_roi(header.c_str(), "ROI") == QUO_OK && region.isNULL() == 0;
    const double sum = region.FastStartTime + region.FastTimeLength + region.SlowStartTime + region.SlowTimeLength;
    if (!found || !std::isfinite(sum)) throw Failure(header + ": no region (section ROI)");
}

void require_document(const std::string& file, bool may_be_missing) {
    std::error_code error;
    if (may_be_missing && std::filesystem::status(file, error).type() == std::filesystem::file_type::not_found)
        return;
    forget_system_error();
    if (!Document::in(file)) refuse_header(file, QUO_REFUSED, "is no header document");
}

}  // namespace tool
