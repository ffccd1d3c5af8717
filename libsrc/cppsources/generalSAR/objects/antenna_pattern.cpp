// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cstddef>
#include <new>
#include <string>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/objects/annex_file.h"
#include "generalSAR/objects/raster_name.h"
#include "quo_base/gen_utils.h"
#include "quo_base/swath.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "generalSAR";
constexpr const char* kNoMemory = "Memory allocation failure";
constexpr const char* kNoPattern = "There is no pattern of that many samples";

using Obj = AntennaPattern_Obj;
constexpr quo::FieldTable kTable{
    "AntennaPattern",
    QUO_FIELD(StartAngle, quo::unit("degrees")),
    QUO_FIELD(DeltaAngle, quo::unit("degrees")),
    QUO_FIELD(PatternSamples, quo::bounds(0, 10000), quo::kOptional),
    QUO_FIELD(Pattern, QUO_LENGTH(PatternSamples), quo::in_memory_only(Obj::kMaxPatternSamples)),
};

constexpr std::size_t kFloat = 4, kAnnexRecord = (2 + Obj::kAnnexSamples) * kFloat;
constexpr std::size_t kAnnexData = kAnnexRecord * Obj::kAnnexSwaths * Obj::kAnnexPolarizations;

float annex_float(const char* record, std::size_t index) { return ch2float4(record + index * kFloat, 'm'); }

}  // namespace

Obj::AntennaPattern_Obj() {
    PatternFile.CellType = FLOAT32;
    PatternFile.NrOfLinesPerImage = 1;
    createElementsVector(kTable.size());
}
void Obj::refreshParameters() { kTable.register_all(*this); }

int Obj::createBuffers() {
    quo::CallFrame frame{"AntennaPattern_Obj::createBuffers", kSource};
    return kTable.of(*this).create_buffers(frame, "More pattern samples than are plausible");
}

int Obj::destroyBuffers() { return kTable.destroy_buffers(*this); }

int Obj::clone(AntennaPattern_Obj* to) const {
    quo::CallFrame frame{"AntennaPattern_Obj::clone", kSource};
    if (to == this) return frame.success();
    if (const int status = kTable.copy(*this, *to)) return frame.fail(status, kNoMemory);
    return quo::pass_on(frame, to->PatternFile.clone(&PatternFile));
}

int Obj::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, kTable.section()); }

int Obj::writehdr() {
    quo::CallFrame frame{"AntennaPattern_Obj::writehdr", kSource};
    if (PatternFile.FileName[0] == '\0') return frame.fail(QUO_REFUSED, "The pattern file has no name");
    PatternFile.NrOfPixelsPerLine = PatternSamples;
    if (const int status = PatternFile.write_hdr()) return frame.callee(status);
    return quo::guarded(frame, [&] {
        const int status = writehdr((std::string{PatternFile.FileName} + ".hdr").c_str());
        return status == QUO_OK ? frame.success() : frame.callee(status);
    });
}

int Obj::readhdr(const char* file) {
    quo::CallFrame frame{"AntennaPattern_Obj::readhdr", kSource};
    if (const int status = kTable.read(*this, file))
        return status == QUO_NO_MEMORY ? frame.callee(status) : frame.silent(status);
    const auto raster = quo::raster_of_header(quo::text_or_empty(file));
    if (!raster) return frame.fail(QUO_REFUSED, "The header's name is no more than its ending");
    if (const int status = PatternFile.read_hdr(raster->c_str())) return frame.callee(status);
    PatternSamples = PatternFile.NrOfPixelsPerLine;
    return quo::pass_on(frame, createBuffers());
}

int Obj::getPatternArray(float* pattern) {
    quo::CallFrame frame{"AntennaPattern_Obj::getPatternArray", kSource};
    if (!pattern || PatternSamples < 1 || PatternSamples > kMaxPatternSamples)
        return frame.fail(QUO_REFUSED, kNoPattern);
    const auto n = static_cast<std::size_t>(PatternSamples);
    if (Pattern.size() == n && Pattern[0] != 0.0F) {
        std::ranges::copy(Pattern, pattern);
        return frame.success();
    }

    // A raster of complex samples has no conversion to floats, which reading does not count as a failure.
    if (PatternFile.is_complex()) return frame.fail(QUO_REFUSED, "The pattern file holds complex samples");
    quo::TrackedBuffer<float> loaded{n};
    if (!loaded) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    DataFile file;
    if (const int status = file.clone(&PatternFile)) return frame.callee(status);
    BufferIO line{&file, 0, PatternSamples, 0, 1, FLOAT32};
    if (const int status = line.readbuffer(reinterpret_cast<char*>(loaded.data()), PatternSamples))
        return frame.callee(status);
    if (Pattern.size() != n && !quo::renew_array(Pattern, n)) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    std::ranges::copy(loaded, Pattern.begin());
    std::ranges::copy(loaded, pattern);
    return frame.success();
}

int Obj::WritePatternArray() {
    quo::CallFrame frame{"AntennaPattern_Obj::WritePatternArray", kSource};
    if (PatternSamples < 1 || Pattern.size() != static_cast<std::size_t>(PatternSamples))
        return frame.fail(QUO_REFUSED, kNoPattern);
    PatternFile.NrOfPixelsPerLine = PatternSamples;
    PatternFile.NrOfLinesPerImage = 1;
    PatternFile.CellType = FLOAT32;
    DataFile file;
    if (const int status = file.clone(&PatternFile)) return frame.callee(status);
    if (const int status = file.open(1)) return frame.callee(status);
    BufferIO line{&file, 0, PatternSamples, 0, 1, FLOAT32};
    if (const int status = line.writebuffer(reinterpret_cast<const char*>(Pattern.data()), PatternSamples))
        return frame.callee(status);
    return quo::pass_on(frame, file.close());
}

int Obj::getPatternENVI(const char* annex_file, int swath, int polarization) {
    quo::CallFrame frame{"AntennaPattern_Obj::getPatternENVI", kSource};
    if (swath < 0 || swath >= kAnnexSwaths || polarization < 0 || polarization >= kAnnexPolarizations)
        return frame.fail(QUO_REFUSED, "The annex file has no such swath or polarization");
    quo::TrackedBuffer<char> data{kAnnexData};
    std::vector<float> gains;
    if (!data || !quo::renew_array(gains, std::size_t{kAnnexSamples})) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    if (const int status = quo::read_annex_data(annex_file, data.data(), data.size())) return frame.callee(status);

    const char* record =
        data.data() + static_cast<std::size_t>(swath * kAnnexPolarizations + polarization) * kAnnexRecord;
    for (std::size_t i = 0; i < gains.size(); ++i) gains[i] = annex_float(record, 2 + i);
    StartAngle = static_cast<double>(annex_float(record, 0));
    DeltaAngle = static_cast<double>(annex_float(record, 1));
    PatternSamples = kAnnexSamples;
    Pattern.swap(gains);
    return frame.success();
}
