// SPDX-License-Identifier: Apache-2.0
#include <string>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/objects/raster_name.h"
#include "quo_base/geo_grid.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"

// The raster and the region of a product, as objects of its header.

namespace {

constexpr const char* kSource = "generalSAR";
constexpr const char* kRoiSection = "ROI";

}  // namespace

int GSRoi_Obj::readhdr(const char* file) { return Roi.read_roi(file, kRoiSection); }
int GSRoi_Obj::writehdr(const char* file) { return Roi.write_roi(file, kRoiSection); }
int GSRoi_Obj::clone(GSRoi_Obj* to) const { return Roi.clone(&to->Roi); }

int GSDataFile_Obj::readhdr(const char* file) {
    quo::CallFrame frame{"GSDataFile_Obj::readhdr", kSource};
    return quo::guarded(frame, [&] {
        const auto raster = quo::raster_of_header(quo::text_or_empty(file));
        if (raster && File.read_hdr(raster->c_str()) == QUO_NO_MEMORY) return frame.callee(QUO_NO_MEMORY);
        return frame.success();  // whatever else the raster says: a product always has this entry
    });
}

int GSDataFile_Obj::writehdr(const char* file) {
    quo::CallFrame frame{"GSDataFile_Obj::writehdr", kSource};
    const int status = quo::guarded(frame, [&] {
        const auto raster = quo::raster_of_header(quo::text_or_empty(file));
        const std::string kept = File.FileName;
        if (!raster || File.setFilename(raster->c_str()) != QUO_OK) return frame.success();
        const int written = File.write_hdr();
        File.setFilename(kept.c_str());
        return written == QUO_NO_MEMORY ? frame.silent(written) : frame.success();
    });
    // A product without its data file would be neither the old one nor the new one.
    if (status != QUO_OK) quo::HeaderSession::fail_all(status);
    return QUO_OK;  // a header is written without its raster, too: the outcome stands in the report alone
}

int GSDataFile_Obj::clone(GSDataFile_Obj* to) const { return to->File.clone(&File); }
