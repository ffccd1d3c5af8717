#ifndef QUO_TOOL_REGION_H
#define QUO_TOOL_REGION_H

#include <string>

#include "quo_base/roi.h"

namespace tool {

/** Reads a header's section ROI. Throws Failure where it is not there or holds no sample. */
void read_region(const std::string& header, ROI_Obj& region);

/** Throws Failure unless the file is a header document, or, where `may_be_missing`, is not there: writing a
 * section would put a fresh document in the place of anything else. */
void require_document(const std::string& file, bool may_be_missing);

}  // namespace tool

#endif
