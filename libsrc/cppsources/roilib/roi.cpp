// SPDX-License-Identifier: Apache-2.0
#include "quo_base/roi.h"

#include <algorithm>
#include <string_view>

#include "diagnosticslib/call_frame.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "roilib/rounding.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "roi";

namespace roi {
using Obj = ROI_Obj;
// In a parameter file only the last key decides whether the region could be read.
constexpr quo::FieldTable kTable{
    "ROI",
    QUO_FIELD(SlowStartTime, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(SlowTimeLength, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(SlowTimeDelta, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(FastStartTime, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(FastTimeLength, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(FastTimeDelta, quo::kProfileOptional, quo::unit("s")),
    QUO_FIELD(Lines, quo::kProfileOptional, quo::at_least(0)),
    QUO_FIELD(Samples, quo::at_least(0)),
};
}  // namespace roi

namespace coords {
using Obj = ROI_Coords;
constexpr quo::FieldTable kTable{
    "ROI_Coords", QUO_FIELD(FirstSample), QUO_FIELD(FirstLine), QUO_FIELD(Samples), QUO_FIELD(Lines),
};
}  // namespace coords

/** How many intervals a length of time holds; an axis whose interval is 0 has none. */
double intervals(double length, double delta) { return delta == 0.0 ? 0.0 : length / delta; }

struct Axis {
    double start, length, delta;
    [[nodiscard]] double end() const { return start + length; }
};

/** What `a` and `b` share, counted in a's intervals; the part of an interval at the end is dropped. */
int shared_intervals(const Axis& a, const Axis& b, double start) {
    return quo::truncate_clamped(intervals(std::min(a.end(), b.end()) - start, a.delta));
}

}  // namespace

QUO_RECORD(ROI_Obj, roi::kTable)

int ROI_Obj::SetFastAxe(double start, double delta, int n) {
    FastStartTime = start;
    FastTimeDelta = delta;
    Samples = n;
    FastTimeLength = delta * n;
    return QUO_OK;
}

int ROI_Obj::SetSlowAxe(double start, double delta, int n) {
    SlowStartTime = start;
    SlowTimeDelta = delta;
    Lines = n;
    SlowTimeLength = delta * n;
    return QUO_OK;
}

int ROI_Obj::ResetROI() {
    Samples = Lines = 0;
    return QUO_OK;
}

int ROI_Obj::isNULL() const { return Samples < 1 || Lines < 1 ? 1 : 0; }

int ROI_Obj::GetFastIndex(double time) const { return GetFastRange(time - FastStartTime); }

int ROI_Obj::GetSlowIndex(double time) const { return GetSlowRange(time - SlowStartTime); }

int ROI_Obj::GetFastRange(double length) const { return quo::round_clamped(intervals(length, FastTimeDelta)); }

int ROI_Obj::GetSlowRange(double length) const { return quo::round_clamped(intervals(length, SlowTimeDelta)); }

ROI_Time ROI_Obj::GetUpLeft() const { return {FastStartTime, SlowStartTime}; }

ROI_Time ROI_Obj::GetUpRight() const { return {FastStartTime, SlowStartTime + SlowTimeLength}; }

ROI_Time ROI_Obj::GetDownLeft() const { return {FastStartTime + FastTimeLength, SlowStartTime}; }

ROI_Time ROI_Obj::GetDownRight() const { return {FastStartTime + FastTimeLength, SlowStartTime + SlowTimeLength}; }

ROI_Time ROI_Obj::GetCenter() const {
    return {FastStartTime + 0.5 * FastTimeLength, SlowStartTime + 0.5 * SlowTimeLength};
}

int ROI_Obj::read_roi(const char* file, const char* name) {
    return readAuxiliaryFile(file, 1, name) ? QUO_OK : roi::kTable.of(*this).read_profile(file, name);
}

int ROI_Obj::write_roi(const char* file, const char* name) {
    writeAuxiliaryFile(file, 1, name);  // callers rely on 0: the outcome stands in the report alone
    return QUO_OK;
}

int ROI_Obj::IntersectROI(const ROI_Obj* a, const ROI_Obj* b, ROI_Obj* out) {
    quo::CallFrame frame{"ROI_Obj::IntersectROI", kSource};
    if (!a || !b || !out) return frame.fail(QUO_REFUSED, "No region given");

    const Axis fast{a->FastStartTime, a->FastTimeLength, a->FastTimeDelta};
    const Axis slow{a->SlowStartTime, a->SlowTimeLength, a->SlowTimeDelta};
    const double fast_start = std::max(a->FastStartTime, b->FastStartTime);
    const double slow_start = std::max(a->SlowStartTime, b->SlowStartTime);
    const int samples =
        shared_intervals(fast, {b->FastStartTime, b->FastTimeLength, b->FastTimeDelta}, fast_start);
    const int lines = shared_intervals(slow, {b->SlowStartTime, b->SlowTimeLength, b->SlowTimeDelta}, slow_start);

    out->SetFastAxe(fast_start, fast.delta, samples);
    out->SetSlowAxe(slow_start, slow.delta, lines);
    if (out->isNULL()) out->ResetROI();
    return frame.success();
}

int ROI_Obj::clone(ROI_Obj* to) const { return roi::kTable.copy(*this, *to); }

int FileROI_Obj::SetFile(const char* file, const char* name) {
    quo::CallFrame frame{"FileROI_Obj::SetFile", kSource};
    const std::string_view file_text = quo::text_or_empty(file), name_text = quo::text_or_empty(name);
    // A cut name would be that of another file.
    if (file_text.size() >= sizeof FileName || name_text.size() >= sizeof SectionName)
        return frame.fail(QUO_REFUSED, "File or section name too long");
    quo::copy_bounded(FileName, file_text);
    quo::copy_bounded(SectionName, name_text);
    return frame.success();
}

int FileROI_Obj::read_roi() {
    quo::CallFrame frame{"FileROI_Obj::read_roi", kSource};
    if (FileName[0] == '\0') return frame.fail(QUO_REFUSED, "The region has no file");
    return quo::pass_on(frame, read_roi(FileName, SectionName));
}

QUO_HEADER_RECORD(ROI_Coords, coords::kTable)

int ROI_Coords::GetROI(const ROI_Obj* image, ROI_Obj* out) const {
    quo::CallFrame frame{"ROI_Coords::GetROI", kSource};
    if (!image || !out) return frame.fail(QUO_REFUSED, "No region given");
    out->SetFastAxe(image->FastStartTime + FirstSample * image->FastTimeDelta, image->FastTimeDelta, Samples);
    out->SetSlowAxe(image->SlowStartTime + FirstLine * image->SlowTimeDelta, image->SlowTimeDelta, Lines);
    return frame.success();
}
