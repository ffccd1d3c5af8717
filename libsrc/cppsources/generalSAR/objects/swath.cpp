// SPDX-License-Identifier: Apache-2.0
#include "quo_base/swath.h"

#include <cstring>
#include <new>
#include <optional>
#include <string>

#include "diagnosticslib/call_frame.h"
#include "quo_base/gen_utils.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

namespace {

constexpr const char* kSource = "generalSAR";
constexpr const char* kNoMemory = "Memory allocation failure";

using Obj = SwathInfo;
constexpr quo::FieldTable kTable{
    "SwathInfo",
    QUO_FIELD(Rank, quo::at_least(0)),
    QUO_FIELD(Rgate_bias, quo::unit("s")),
    QUO_FIELD(Echoes_per_burst, quo::at_least(0)),
    QUO_FIELD(Lines_per_burst, quo::at_least(0)),
    QUO_FIELD(Bursts, quo::at_least(0)),
    QUO_FIELD(Order),
    QUO_FIELD(Acquisition_Start_Time, quo::unit("s")),
    QUO_FIELD(Swst_changes, quo::at_least(0)),
    QUO_FIELD(ProcessorGain),
    QUO_FIELD(NoisePower),
    QUO_FIELD(ChirpPower),
    QUO_FIELD(Swst_changes_bursts, QUO_LENGTH(Swst_changes), quo::profile_only(Obj::kMaxSwstChanges)),
};

/** Where the bursts of a raster stand. */
struct BurstLayout {
    std::int64_t first, stride;  // bytes
    std::int64_t bytes;          // up to the end of the last line header that is read
};

/** Nothing where the descriptions make no bursts. */
std::optional<BurstLayout> layout_of(const SwathInfo& swath, const DataFile& raster) {
    if (swath.Bursts < 0 || swath.Lines_per_burst < 1 || raster.NrOfPixelsPerLine < 0 || raster.HeaderOffset < 0 ||
        raster.element_sizeof() == 0)
        return std::nullopt;
    using Bytes = quo::Checked<std::int64_t>;
    const Bytes line = Bytes{raster.element_sizeof()} * raster.NrOfPixelsPerLine + SwathInfo::kLineHeader;
    const Bytes stride = line * swath.Lines_per_burst;
    const Bytes end = stride * std::max(swath.Bursts - 1, 0) + raster.HeaderOffset + SwathInfo::kLineHeader;
    if (!stride.value() || !end.value()) return std::nullopt;
    return BurstLayout{raster.HeaderOffset, *stride.value(), swath.Bursts > 0 ? *end.value() : 0};
}

/** Reads the start times of the bursts; the status of a file operation that failed. */
int read_times(DataFile& raster, const BurstLayout& layout, std::vector<double>& times) {
    std::int64_t place = layout.first;
    for (double& time : times) {
        char header[SwathInfo::kLineHeader];
        if (const int status = raster.seek(place, 0)) return status;
        if (const int status = raster.read(header, sizeof header)) return status;
        MjdRecord record;
        std::memcpy(&record, header, sizeof record);
        time = mjd2sec85(record);
        place += layout.stride;
    }
    return QUO_OK;
}

}  // namespace

QUO_RECORD(SwathInfo, kTable)

int Obj::createBuffers() {
    quo::CallFrame frame{"SwathInfo::createBuffers", kSource};
    return kTable.of(*this).create_buffers(frame, "More changes of the sampling window than are plausible");
}

int Obj::destroyBuffers() {
    quo::renew_array(BurstStartTimes, 0);
    return kTable.destroy_buffers(*this);
}

int Obj::clone(SwathInfo* to) const {
    quo::CallFrame frame{"SwathInfo::clone", kSource};
    if (to == this) return frame.success();
    const bool copied = kTable.copy(*this, *to) == QUO_OK && quo::copy_array(to->BurstStartTimes, BurstStartTimes);
    return copied ? frame.success() : frame.fail(QUO_NO_MEMORY, kNoMemory);
}

int Obj::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, kTable.section()); }
int Obj::readhdr(const char* file) { return kTable.read(*this, file); }

int Obj::readBurstTimes(const char* raster) {
    quo::CallFrame frame{"SwathInfo::readBurstTimes", kSource};
    return quo::guarded(frame, [&] {
        // Without a name the side file would be some ".hdr" of the folder.
        if (quo::text_or_empty(raster).empty()) return frame.fail(QUO_REFUSED, "No raster named");
        if (const int status = readhdr((std::string{raster} + ".hdr").c_str())) return frame.callee(status);
        DataFile file;
        if (const int status = file.read_hdr(raster)) return frame.callee(status);
        if (const int status = file.open(0)) return frame.callee(status);

        const auto layout = layout_of(*this, file);
        if (!layout) return frame.fail(QUO_REFUSED, "The description makes no bursts");
        if (quo::file_length(raster).value_or(-1) < layout->bytes)
            return frame.fail(QUO_READ_FAILED, "The raster is shorter than its bursts");
        std::vector<double> times;
        if (!quo::renew_array(times, static_cast<std::size_t>(Bursts)))
            return frame.fail(QUO_NO_MEMORY, kNoMemory);
        if (const int status = read_times(file, *layout, times)) return frame.callee(status);
        BurstStartTimes.swap(times);
        return frame.success();
    });
}
