// SPDX-License-Identifier: Apache-2.0
#include "quo_base/datafile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <limits>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "datafilelib/raster_region.h"
#include "datafilelib/raster_stream.h"
#include "datafilelib/sample_kernels.h"
#include "diagnosticslib/call_frame.h"
#include "diagnosticslib/saved_in_place.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

namespace {

constexpr const char* kSource = "datafile";

// In the order in which a side file's name is compared. Code 4 has no name.
constexpr std::array<quo::NamedCode, 9> kCellNames{{{"FLOAT32", FLOAT32},
                                                    {"INT32", INT32},
                                                    {"INT16", INT16},
                                                    {"FLOAT_COMPLEX", FLOAT_COMPLEX},
                                                    {"SHORT_COMPLEX", SHORT_COMPLEX},
                                                    {"DOUBLE_COMPLEX", DOUBLE_COMPLEX},
                                                    {"FLOAT64", FLOAT64},
                                                    {"INT8", INT8},
                                                    {"INT8_COMPLEX", INT8_COMPLEX}}};
// Any other text, in any other letter case, means little-endian.
constexpr std::array<quo::NamedCode, 1> kByteOrders{{{"MSBFirst", 1}}};

// The status of a transfer as an entry of the report, which names the caller's line.
int finish(quo::CallFrame& frame, int status, int line = __builtin_LINE()) {
    return status == QUO_OK ? frame.success(line) : frame.fail(status, quo::raster_failure(status), line);
}

/** How the samples of a region stand in memory, in lines of `width`. */
quo::RegionLayout layout_of(const BufferIO& io, quo::SampleKernel kernel, int width) {
    const auto size = static_cast<std::int64_t>(quo::sample_size(io.MemoryType));
    return {kernel, io.Samples, io.Samples * size, width * size, io.File->ByteOrder == 1};
}
quo::RegionLayout layout_of(const quo::RasterRegion& prefixes) {
    return {nullptr, 0, prefixes.piece, prefixes.piece, false};
}

std::int32_t nearest_int(std::int64_t value) {
    using Limits = std::numeric_limits<std::int32_t>;
    return static_cast<std::int32_t>(std::clamp<std::int64_t>(value, Limits::min(), Limits::max()));
}

bool converts(int cell_type) { return cell_type >= FLOAT_COMPLEX && cell_type <= INT16; }

}  // namespace

/** The fields of the description, in a class of its own that sees the private member. */
struct RasterDescription::Table {
    using Obj = RasterDescription;
    static constexpr quo::FieldTable kTable{
        "RasterInfo",
        QUO_FIELD(NrOfLinesPerImage),
        QUO_FIELD(NrOfPixelsPerLine),
        QUO_FIELD(stored_offset_, "HeaderOffset", quo::element("HeaderOffset")),
        QUO_FIELD(RowPrefix),
        QUO_FIELD(ByteOrder, quo::named(kByteOrders, 0)),
        QUO_FIELD(CellType, quo::named(kCellNames, -1)),
    };
};

QUO_RECORD(RasterDescription, Table::kTable)
RasterDescription::~RasterDescription() = default;

void RasterDescription::showOffset() { stored_offset_ = nearest_int(HeaderOffset); }

int RasterDescription::createBuffers() {
    if (stored_offset_ != nearest_int(HeaderOffset)) HeaderOffset = stored_offset_;
    return GeneralSAR_Base::createBuffers();
}

int RasterDescription::element_sizeof() const { return static_cast<int>(quo::sample_size(CellType)); }
int RasterDescription::is_complex() const { return quo::is_complex_type(CellType) ? 1 : 0; }

void RasterDescription::copyDescription(const RasterDescription& from) {
    Table::kTable.copy(from, *this);
    HeaderOffset = from.HeaderOffset;
    showOffset();
}

int64_t RasterDescription::rasterSize() const {
    const auto region = quo::region_of_samples(*this, 0, NrOfLinesPerImage, 0, NrOfPixelsPerLine);
    return region ? quo::line_after(*this, 0, NrOfLinesPerImage) : -1;
}

int RasterDescription::readSection(const char* side_file) {
    const std::int64_t before = std::exchange(HeaderOffset, 0);
    showOffset();
    const bool found =
        readAuxiliaryFile(side_file, 1, Table::kTable.section());  // createBuffers() takes the offset over
    if (!found) HeaderOffset = before;
    showOffset();
    return found ? QUO_OK : QUO_REFUSED;
}

bool RasterDescription::readNames(const char* side_file) {
    showOffset();
    const bool complete = Table::kTable.of(*this).read_whole_profile(side_file, Table::kTable.section());
    HeaderOffset = stored_offset_;
    return complete;
}

int RasterDescription::writeSection(const char* side_file) {
    showOffset();
    return stored_offset_ == HeaderOffset ? writeAuxiliaryFile(side_file, 1, Table::kTable.section())
                                          : QUO_REFUSED;
}

int RasterDescription::commitPair(quo::AtomicFile& raster, const char* side_file) {
    quo::JoinedSession session{side_file};  // or the section would be saved by itself
    if (const int status = writeSection(side_file)) return status;
    quo::AtomicFile side{side_file};
    if (!side.good()) return QUO_NOT_OPENED;
    // A process that is killed in between leaves a raster that is at least as long as its description says. The
    // side file's name is the raster's and an ending.
    const std::string_view side_name = quo::text_or_empty(side_file);
    const auto old_bytes = quo::file_length(std::string{side_name.substr(0, side_name.rfind('.'))}.c_str());
    errno = 0;
    const bool shrinks = old_bytes && *old_bytes > rasterSize();
    if (!session.save(side)) return QUO_WRITE_FAILED;
    if (!(shrinks ? quo::commit_pair(side, raster) : quo::commit_pair(raster, side))) return QUO_WRITE_FAILED;
    for (const quo::AtomicFile* file : {&raster, &side})
        quo::warn_if_in_place(*file, "RasterDescription::commitPair", kSource);
    return QUO_OK;
}

int RasterDescription::copyPair(const char* from, const char* to, bool overwrite) {
    try {
        std::optional<quo::AtomicFile> raster;
        const int status = quo::copy_raster(from, to, overwrite, raster);
        return status != QUO_OK ? status : commitPair(*raster, quo::side_file_of(to).c_str());
    } catch (const std::bad_alloc&) {
        return QUO_NO_MEMORY;
    }
}

DataFile::DataFile() : stream_{std::make_unique<quo::RasterStream>()} {}
DataFile::~DataFile() { close(); }

// Whoever fills the public array by hand may leave out the final NUL: that is no name.
std::string DataFile::path() const {
    const std::size_t length = strnlen(FileName, sizeof FileName);
    return {FileName, length < sizeof FileName ? length : 0};
}
std::string DataFile::sideFile() const { return quo::side_file_of(path()); }

int DataFile::setFilename(const char* file_name) {
    const std::string_view name = quo::text_or_empty(file_name);
    if (name.size() >= sizeof FileName) return QUO_REFUSED;  // a cut name would be another file's
    quo::copy_bounded(FileName, name);
    return QUO_OK;
}

int DataFile::open(int mode) {
    quo::CallFrame frame{"DataFile::open", kSource};
    using Mode = quo::RasterStream::Mode;
    constexpr struct {
        Mode how;
        int state;
    } kModes[] = {{Mode::kRead, 0}, {Mode::kCreate, 1}, {Mode::kUpdate, 1}, {Mode::kUpdate, 2}};
    if (mode < 0 || mode >= static_cast<int>(std::size(kModes))) return frame.success();
    if (is_open()) {
        const int wanted = BufferSize;
        if (const int status = close()) return frame.callee(status);
        BufferSize = wanted;
    }
    if (!stream_->open(path().c_str(), kModes[mode].how)) return frame.fail(QUO_NOT_OPENED, "File not opened!");
    state_ = kModes[mode].state;
    position_ = 0;
    cursor_ = fill_ = 0;
    pending_ = false;
    if (BufferSize > 0) {
        buffer_.reset(new (std::nothrow) char[static_cast<std::size_t>(BufferSize)]);
        buffer_size_ = BufferSize;
        if (!buffer_) {
            stream_->close();
            return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
        }
    }
    return frame.success();
}

int DataFile::close() {
    if (!is_open()) return QUO_OK;
    quo::CallFrame frame{"DataFile::close", kSource};
    // What a file open for reading and writing has pending is dropped: there only seek() writes it.
    if (buffer_ && state_ == 1 && flushBuffer() != QUO_OK) return finish(frame, QUO_WRITE_FAILED);
    buffer_.reset();
    BufferSize = 0;
    position_ = 0;
    cursor_ = fill_ = 0;
    pending_ = false;
    if (!stream_->close()) return finish(frame, QUO_WRITE_FAILED);
    return frame.success();
}

// Writes what is pending up to the cursor; the emptied buffer then starts at the cursor's place. After a failure
// all of it is still pending.
int DataFile::flushBuffer() {
    const auto pending = static_cast<std::size_t>(cursor_);
    if (pending_ && stream_->write_at(position_, buffer_.get(), pending).bytes != pending) return QUO_WRITE_FAILED;
    pending_ = false;
    position_ += cursor_;
    cursor_ = fill_ = 0;
    return QUO_OK;
}

int DataFile::refill() {
    fill_ = static_cast<std::int32_t>(
        stream_->read_at(position_, buffer_.get(), static_cast<std::size_t>(buffer_size_)).bytes);
    cursor_ = 0;
    return fill_;
}

int DataFile::seekWriting(int64_t offset) {
    const auto target = (quo::Checked<std::int64_t>{position_} + offset).value();  // from the buffer's start
    if (flushBuffer() != QUO_OK) return QUO_WRITE_FAILED;
    if (!target || *target < 0) return QUO_REFUSED;
    position_ = *target;
    return QUO_OK;
}

int DataFile::seekReading(int64_t offset, int whence) {
    const auto target = (quo::Checked<std::int64_t>{whence == 0 ? 0 : position_} + offset).value();
    if (whence == 0 && offset > position_ && offset < position_ + fill_) {
        cursor_ = static_cast<std::int32_t>(offset - position_);
        return QUO_OK;
    }
    const auto within = (quo::Checked<std::int64_t>{cursor_} + offset).value();
    if (whence == 1 && within && *within >= 0 && *within < fill_) {
        cursor_ = static_cast<std::int32_t>(*within);
        return QUO_OK;
    }
    // Relative targets count from the buffer's start here, not from the cursor.
    if (!target || *target < 0) return QUO_REFUSED;
    position_ = *target;
    refill();
    return QUO_OK;
}

int DataFile::seek(int64_t offset, int whence) {
    quo::CallFrame frame{"DataFile::seek", kSource};
    if (!is_open() || (whence != 0 && whence != 1)) return frame.fail(QUO_REFUSED, "No such place to seek from");
    if (buffer_) {
        const int status = state_ == 0 ? seekReading(offset, whence) : seekWriting(offset);
        return finish(frame, status);
    }
    const auto target = (quo::Checked<std::int64_t>{whence == 0 ? 0 : position_} + offset).value();
    if (!target || *target < 0) return frame.fail(QUO_REFUSED, "A place before the start of the file");
    position_ = *target;
    return frame.success();
}

int DataFile::readBuffered(char* dst, int64_t n) {
    while (n > 0) {
        if (cursor_ >= fill_) {
            if (flushBuffer() != QUO_OK) return QUO_WRITE_FAILED;
            if (refill() == 0) return QUO_READ_FAILED;
        }
        const int64_t part = std::min<int64_t>(n, fill_ - cursor_);
        std::memcpy(dst, buffer_.get() + cursor_, static_cast<std::size_t>(part));
        cursor_ += static_cast<std::int32_t>(part);
        dst += part;
        n -= part;
    }
    return QUO_OK;
}

int DataFile::read(char* dst, int64_t n) {
    quo::CallFrame frame{"DataFile::read", kSource};
    if (!is_open() || state_ == 1 || n < 0) return frame.fail(QUO_REFUSED, "The file is not open for reading");
    if (buffer_) return finish(frame, readBuffered(dst, n));
    if (stream_->read_at(position_, dst, static_cast<std::size_t>(n)).bytes != static_cast<std::size_t>(n)) {
        return finish(frame, QUO_READ_FAILED);
    }
    position_ += n;
    return frame.success();
}

int DataFile::writeBuffered(const char* src, int64_t n) {
    if (n < buffer_size_ - cursor_) {
        std::memcpy(buffer_.get() + cursor_, src, static_cast<std::size_t>(n));
        cursor_ += static_cast<std::int32_t>(n);
        pending_ = true;
        return QUO_OK;
    }
    if (flushBuffer() != QUO_OK) return QUO_WRITE_FAILED;
    return writeDirectly(src, n);
}

int DataFile::writeDirectly(const char* src, int64_t n) {
    const auto bytes = static_cast<std::size_t>(n);
    if (stream_->write_at(position_, src, bytes).bytes != bytes) return QUO_WRITE_FAILED;
    position_ += n;
    return QUO_OK;
}

int DataFile::write(const char* src, int64_t n) {
    quo::CallFrame frame{"DataFile::write", kSource};
    if (!is_open() || state_ == 0 || n < 0) return frame.fail(QUO_REFUSED, "The file is not open for writing");
    return finish(frame, buffer_ ? writeBuffered(src, n) : writeDirectly(src, n));
}

int64_t DataFile::tell() const { return buffer_ ? position_ + cursor_ : position_; }
int DataFile::is_open() const { return stream_->is_open() ? 1 : 0; }
int DataFile::is_buffered() const { return BufferSize > 0 ? 1 : 0; }
int DataFile::is_writing() const { return state_; }
int DataFile::exists() const { return quo::raster_exists(path().c_str()) ? 1 : 0; }

int DataFile::read_hdr(const char* file_name) {
    quo::CallFrame frame{"DataFile::read_hdr", kSource};
    if (const int status = close()) return frame.callee(status);
    BufferSize = 0;
    if (setFilename(file_name) != QUO_OK) return frame.fail(QUO_REFUSED, "File name too long");
    return quo::guarded(frame, [&] {
        const std::string side_file = sideFile();
        if (readSection(side_file.c_str()) == QUO_OK) return frame.success();
        if (quo::Record::unread(*this) == QUO_NO_MEMORY) return frame.callee(QUO_NO_MEMORY);
        if (!readNames(side_file.c_str())) return frame.fail(QUO_REFUSED, "The raster's side file is incomplete");
        return frame.success();
    });
}

int DataFile::write_hdr() {
    quo::CallFrame frame{"DataFile::write_hdr", kSource};
    return quo::guarded(frame, [&] {
        // Without a name the side file would be some ".hdr" of the working directory.
        if (path().empty()) return frame.fail(QUO_REFUSED, "No raster named");
        if (writeSection(sideFile().c_str()) != QUO_OK)
            return frame.fail(QUO_REFUSED, "The raster's side file cannot be written");
        return frame.success();
    });
}

int DataFile::clone(const DataFile* source) {
    quo::CallFrame frame{"DataFile::clone", kSource};
    if (source == this) return frame.success();
    if (const int status = close()) return frame.callee(status);
    quo::copy_bounded(FileName, source->path());
    copyDescription(*source);
    BufferSize = source->BufferSize;
    return frame.success();
}

int DataFile::copy(const char* file_name, int overwrite) {
    quo::CallFrame frame{"DataFile::copy", kSource};
    if (buffer_ && state_ != 0 && flushBuffer() != QUO_OK) return finish(frame, QUO_WRITE_FAILED);
    DataFile target;
    target.clone(this);
    if (target.setFilename(file_name) != QUO_OK) return frame.fail(QUO_REFUSED, "File name too long");
    return finish(frame, target.copyPair(path().c_str(), target.FileName, overwrite != 0));
}

// Contents come before the buffer's bookkeeping: pending bytes reach the file before a region is moved, and the
// buffer starts anew at the line after it.
int DataFile::prepareRegion(int64_t next) {
    if (buffer_ && state_ != 0 && flushBuffer() != QUO_OK) return QUO_WRITE_FAILED;
    position_ = next;
    cursor_ = fill_ = 0;
    return QUO_OK;
}

int DataFile::read(const quo::RasterRegion& region, const quo::RegionLayout& layout, char* dst, int64_t next) {
    quo::CallFrame frame{"DataFile::read", kSource};
    if (const int status = prepareRegion(next)) return finish(frame, status);
    return finish(frame,
                  dst ? quo::read_region(*stream_, region, layout, dst) : quo::check_region(*stream_, region));
}

int DataFile::write(const quo::RasterRegion& region, const quo::RegionLayout& layout, const char* src,
                    int64_t next) {
    quo::CallFrame frame{"DataFile::write", kSource};
    if (const int status = prepareRegion(next)) return finish(frame, status);
    return finish(frame, quo::write_region(*stream_, region, layout, src));
}

BufferIO::BufferIO(DataFile* file, int first_sample, int samples, int first_line, int lines, int memory_type)
    : File{file},
      FirstSample{first_sample},
      Samples{samples},
      FirstLine{first_line},
      Lines{lines},
      MemoryType{memory_type} {}

int BufferIO::openForReading() { return File->is_open() ? QUO_OK : File->open(0); }

bool BufferIO::prefixRegion(quo::RasterRegion& region) const {
    const auto found = quo::region_of_prefixes(*File, FirstLine, Lines);
    if (found) region = *found;
    return found.has_value();
}

int BufferIO::readprefix(char* dst) {
    quo::CallFrame frame{"BufferIO::readprefix", kSource};
    if (const int status = openForReading()) return frame.callee(status);
    quo::RasterRegion region;
    if (File->state_ == 1 || !prefixRegion(region)) return finish(frame, QUO_REFUSED);
    return quo::pass_on(frame,
                        File->read(region, layout_of(region), dst, quo::line_after(*File, FirstLine, Lines)));
}

int BufferIO::writeprefix(const char* src) {
    quo::CallFrame frame{"BufferIO::writeprefix", kSource};
    quo::RasterRegion region;
    if (!File->is_open() || File->state_ == 0 || !prefixRegion(region)) return finish(frame, QUO_REFUSED);
    return quo::pass_on(frame,
                        File->write(region, layout_of(region), src, quo::line_after(*File, FirstLine, Lines)));
}

int BufferIO::readbuffer(char* dst, int width) {
    quo::CallFrame frame{"BufferIO::readbuffer", kSource};
    if (!converts(MemoryType) || !converts(File->CellType)) return finish(frame, QUO_REFUSED);
    if (const int status = openForReading()) return frame.callee(status);
    const auto region = quo::region_of_samples(*File, FirstLine, Lines, FirstSample, Samples);
    if (File->state_ == 1 || !region || width < Samples) return finish(frame, QUO_REFUSED);
    // Without a kernel the destination stays as it is: callers ask for pairs that have no conversion, and go on.
    const auto kernel = quo::find_kernel(quo::SampleAccess::kRegionRead, File->CellType, MemoryType);
    return quo::pass_on(frame, File->read(*region, layout_of(*this, kernel, width), kernel ? dst : nullptr,
                                          quo::line_after(*File, FirstLine, Lines)));
}

int BufferIO::writebuffer(const char* src) { return writebuffer(src, Samples); }

int BufferIO::writebuffer(const char* src, int width) {
    quo::CallFrame frame{"BufferIO::writebuffer", kSource};
    const auto kernel = quo::find_kernel(quo::SampleAccess::kRegionWrite, File->CellType, MemoryType);
    const auto region = quo::region_of_samples(*File, FirstLine, Lines, FirstSample, Samples);
    if (!File->is_open() || File->state_ == 0 || !kernel || !region || width < Samples) {
        return finish(frame, QUO_REFUSED);
    }
    return quo::pass_on(frame, File->write(*region, layout_of(*this, kernel, width), src,
                                           quo::line_after(*File, FirstLine, Lines)));
}
