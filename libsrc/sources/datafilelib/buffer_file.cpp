// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include "datafilelib/raster_region.h"
#include "datafilelib/raster_stream.h"
#include "datafilelib/sample_kernels.h"
#include "diagnosticslib/report.h"
#include "quo_base/datafile.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

namespace {

/** Requests that fail are ignored, so nothing may be left in errno for the next tracked function to report; and
 * nothing may come in, for errno is kept as the cause of a failure. */
class QuietErrno {
public:
    QuietErrno() noexcept { errno = 0; }
    ~QuietErrno() { errno = 0; }
    QuietErrno(const QuietErrno&) = delete;
    QuietErrno& operator=(const QuietErrno&) = delete;
};

/** The same for requests that run tracked functions. */
class Quiet : QuietErrno, quo::MutedReport {};

/** Two doubles for each sample of a FLOAT64 region whose pieces begin `before` bytes after their lines. Lines
 * without room for them become as long as they need. */
void make_room_for_pairs(quo::RasterRegion& region, int64_t before) {
    region.piece *= 2;
    region.distance = std::max(region.distance, before + region.piece);
}

/** Where the line after such a region starts; nothing when that overflows. */
std::optional<int64_t> line_after_region(const quo::RasterRegion& region, int64_t before) {
    return (quo::Checked<int64_t>{region.distance} * region.count + (region.first - before)).value();
}

}  // namespace

BufferFile::BufferFile() : BufferFile{""} {}
BufferFile::BufferFile(const char* file_name) : stream_{std::make_unique<quo::RasterStream>()} {
    CellType = CELL_NOT_SET;
    setFilename(file_name);
}
BufferFile::~BufferFile() { close(); }

void BufferFile::setFilename(const char* file_name) {
    const std::string_view name = quo::text_or_empty(file_name);
    quo::copy_bounded(name_, name.size() < sizeof name_ ? name : "");  // a cut name would be another file's
}
void BufferFile::getFilename(char* file_name) const { quo::copy_bounded(file_name, sizeof name_, name_); }
bool BufferFile::is_open() const { return stream_->is_open(); }
std::string BufferFile::sideFile() const { return quo::side_file_of(name_); }
bool BufferFile::exists() const { return quo::raster_exists(name_); }

int BufferFile::readhdr(const char* header_name) {
    const Quiet quiet;
    close();
    std::string_view name = quo::text_or_empty(header_name);
    name.remove_suffix(std::min(name.size(), quo::kSideSuffix.size()));
    setFilename(std::string{name}.c_str());
    return name.empty() || name_[0] != '\0' ? readSection(header_name) : QUO_REFUSED;
}
// Without a name the side file would be some ".hdr" of the working directory.
int BufferFile::readhdr() { return name_[0] ? readhdr(sideFile().c_str()) : QUO_REFUSED; }
int BufferFile::writehdr() { return name_[0] ? writehdr(sideFile().c_str()) : QUO_REFUSED; }
int BufferFile::writehdr(const char* header_name) {
    const Quiet quiet;
    return writeSection(header_name);
}

void BufferFile::open(int mode) {
    const QuietErrno quiet;
    if (mode < READ || mode > READ_WRITE) return moveTo(0);
    status_ = error_ = 0;
    close();
    using Mode = quo::RasterStream::Mode;
    constexpr Mode kModes[] = {Mode::kRead, Mode::kCreateAndRead, Mode::kUpdate};
    if (!stream_->open(name_, kModes[mode - READ])) return note(QUO_NOT_OPENED);
    mode_ = mode;
}

int BufferFile::create() {
    const Quiet quiet;
    status_ = error_ = 0;
    close();
    if (!name_[0]) return QUO_REFUSED;
    try {
        // The side file is written last, perhaps hours from now: that it can be replaced is tried out before.
        if (!quo::AtomicFile{sideFile().c_str()}.good()) {
            note(QUO_NOT_OPENED);  // at once, for the next file resets errno
            return status_;
        }
        auto raster = std::make_unique<quo::AtomicFile>(name_);
        if (!raster->good() || !stream_->open_same(raster->descriptor())) {
            note(QUO_NOT_OPENED);
        } else {
            new_raster_ = std::move(raster);
            mode_ = WRITE;
        }
    } catch (const std::bad_alloc&) {
        note(QUO_NO_MEMORY);
    }
    return status_;
}

int BufferFile::commit() {
    const Quiet quiet;
    if (!new_raster_) return QUO_REFUSED;
    const int64_t size = rasterSize();
    if (flush() && end().value_or(0) < size) note(QUO_WRITE_FAILED);
    int status = size < 0 ? QUO_REFUSED : status_;
    try {
        if (status == QUO_OK) status = commitPair(*new_raster_, sideFile().c_str());
    } catch (const std::bad_alloc&) {
        status = QUO_NO_MEMORY;
    }
    note(status);
    close();
    return status;
}

void BufferFile::note(int status) {
    if (status_ != QUO_OK || status == QUO_OK || status == QUO_REFUSED) return;
    status_ = status;
    error_ = errno;
}

void BufferFile::initbuffer(int size, int keep) {
    const QuietErrno quiet;
    if (size < 1 || !is_open() || !flush()) return;
    const int64_t first = mode_ == READ ? 0 : place();
    buffer_.reset(new (std::nothrow) char[static_cast<std::size_t>(size)]);
    size_ = buffer_ ? size : 0;
    keep_ = mode_ == READ ? std::clamp(keep, 0, size - 1) : 0;
    dropBuffer(first);
    if (buffer_) {
        loadWindow(first);
    } else {
        note(QUO_NO_MEMORY);
    }
}

void BufferFile::close() {
    const QuietErrno quiet;
    flush();
    buffer_.reset();
    size_ = keep_ = dirty_first_ = dirty_last_ = 0;
    dropBuffer(0);
    if (!stream_->close()) note(QUO_WRITE_FAILED);
    new_raster_.reset();
    mode_ = NOT_OPEN;
}

int64_t BufferFile::place() const { return start_ + cursor_; }

int64_t BufferFile::tell() const { return buffer_ && mode_ == READ_WRITE ? start_ : place(); }

// Bytes [first, last) of the buffer are newer than the file's. One range is kept: what lies between two changes is
// valid in the buffer and may be written again.
void BufferFile::markWritten(int64_t first, int64_t last) {
    if (dirty_first_ == dirty_last_) {
        dirty_first_ = first;
        dirty_last_ = last;
    } else {
        dirty_first_ = std::min(dirty_first_, first);
        dirty_last_ = std::max(dirty_last_, last);
    }
}

// What could not be written stays pending.
bool BufferFile::flush() {
    const auto pending = static_cast<std::size_t>(dirty_last_ - dirty_first_);
    if (pending == 0) return true;
    const auto done = stream_->write_at(start_ + dirty_first_, buffer_.get() + dirty_first_, pending);
    dirty_first_ += static_cast<int64_t>(done.bytes);
    if (dirty_first_ < dirty_last_) {
        note(QUO_WRITE_FAILED);
        return false;
    }
    dirty_first_ = dirty_last_ = 0;
    return true;
}

// Makes the buffer start at `start`, holding what the file has there, and 0 where the file has ended. A window
// that cannot be read is none: changes of it are merged with what lies between them, which would then be zeros.
bool BufferFile::loadWindow(int64_t start) {
    start_ = start;
    dirty_first_ = dirty_last_ = 0;
    const auto got = stream_->read_at(start, buffer_.get(), static_cast<std::size_t>(size_));
    if (got.refused) note(QUO_READ_FAILED);
    loaded_ = !got.refused;
    fill_ = loaded_ ? static_cast<int64_t>(got.bytes) : 0;
    std::memset(buffer_.get() + fill_, 0, static_cast<std::size_t>(size_ - fill_));
    return loaded_;
}

bool BufferFile::hasWindow() { return buffer_ && (loaded_ || loadWindow(start_)); }

void BufferFile::dropBuffer(int64_t next) {
    start_ = next;
    cursor_ = fill_ = 0;
    loaded_ = false;
}

void BufferFile::moveTo(int64_t target) {
    if (target < 0) return;
    if (!buffer_) {
        start_ = target;
        return;
    }
    const int64_t last = mode_ == READ ? fill_ : size_;
    if (loaded_ && target >= start_ && target <= start_ + last) {
        cursor_ = target - start_;
        return;
    }
    flush();  // what cannot be written is given up: the place asked for matters more to what follows
    const int64_t before = mode_ == READ ? keep_ : size_ / 2;
    loadWindow(std::max<int64_t>(target - before, 0));
    cursor_ = target - start_;
}

// The end is that of a plain file: pending bytes may lie beyond the end on the disk.
std::optional<int64_t> BufferFile::end() {
    const auto length = stream_->length();
    if (!length) note(QUO_READ_FAILED);
    if (!length || dirty_last_ == dirty_first_) return length;
    return std::max(*length, start_ + dirty_last_);
}

void BufferFile::seek(int64_t offset, int type) {
    const QuietErrno quiet;
    if (offset == 0 || !is_open()) return;  // programs seek by 0 to do nothing, also with bytes pending
    std::optional<int64_t> base;
    if (type == FROM_START) base = 0;
    if (type == FROM_CURRENT) base = place();
    if (type == FROM_END) base = end();
    if (!base) return;
    if (const auto target = (quo::Checked<int64_t>{*base} + offset).value()) moveTo(*target);
}

// Slides the buffer forward, keeping a few bytes that were passed. False when nothing follows.
bool BufferFile::advanceForReading() {
    if (cursor_ > fill_ || !flush()) return false;  // a seek went beyond the end of the file
    const int64_t kept = std::min(keep_, fill_ / 2);
    const int64_t end = start_ + fill_;
    std::memmove(buffer_.get(), buffer_.get() + fill_ - kept, static_cast<std::size_t>(kept));
    const auto got = stream_->read_at(end, buffer_.get() + kept, static_cast<std::size_t>(size_ - kept));
    if (got.refused) {
        note(QUO_READ_FAILED);
        dropBuffer(end);
        return false;
    }
    start_ = end - kept;
    cursor_ = kept;
    fill_ = kept + static_cast<int64_t>(got.bytes);
    std::memset(buffer_.get() + fill_, 0, static_cast<std::size_t>(size_ - fill_));
    return got.bytes > 0;
}

int64_t BufferFile::readDirectly(char* to, int64_t n) {
    const auto got = stream_->read_at(place(), to, static_cast<std::size_t>(n));
    if (got.refused) note(QUO_READ_FAILED);
    dropBuffer(place() + static_cast<int64_t>(got.bytes));
    return static_cast<int64_t>(got.bytes);
}

int BufferFile::read(void* dst, int n) {
    if (n > 0 && n <= fill_ - cursor_ && mode_ != WRITE) {  // the common case: all of it is there
        std::memcpy(dst, buffer_.get() + cursor_, static_cast<std::size_t>(n));
        cursor_ += n;
        return n;
    }
    const QuietErrno quiet;
    if (!is_open() || mode_ == WRITE || n < 1) return 0;
    auto* to = static_cast<char*>(dst);
    int64_t done = 0;
    while (done < n && hasWindow()) {
        const int64_t part = std::min(n - done, std::max<int64_t>(fill_ - cursor_, 0));
        std::memcpy(to + done, buffer_.get() + std::min(cursor_, size_), static_cast<std::size_t>(part));
        cursor_ += part;
        done += part;
        if (done < n && !advanceForReading()) break;
    }
    // Without a window, what can be read at all is read alone.
    if (done < n && !loaded_) done += readDirectly(to + done, n - done);
    return static_cast<int>(done);
}

// Writes what does not fit: the buffer is filled to its end and flushed, then placed so that the tail of the data
// lies in its first half. Returns the bytes taken.
int64_t BufferFile::slideForWriting(const char* src, int64_t n) {
    const int64_t fits = size_ - cursor_;
    std::memcpy(buffer_.get() + cursor_, src, static_cast<std::size_t>(fits));
    markWritten(cursor_, size_);
    const int64_t end = start_ + size_;
    if (!flush()) return 0;
    const int64_t half = size_ / 2, rest = n - fits, direct = std::max<int64_t>(rest - half, 0);
    dropBuffer(end);
    if (direct > 0 && writeDirectly(src + fits, direct) != direct) return fits + (place() - end);
    const int64_t tail = rest - direct;
    if (!loadWindow(end + rest - half)) {
        dropBuffer(end + direct);
        return fits + direct + writeDirectly(src + n - tail, tail);
    }
    std::memcpy(buffer_.get() + half - tail, src + n - tail, static_cast<std::size_t>(tail));
    if (tail > 0) markWritten(half - tail, half);
    cursor_ = half;
    fill_ = std::max(fill_, half);
    return n;
}

int64_t BufferFile::writeDirectly(const char* src, int64_t n) {
    const auto done = stream_->write_at(place(), src, static_cast<std::size_t>(n));
    if (static_cast<int64_t>(done.bytes) != n) note(QUO_WRITE_FAILED);
    dropBuffer(place() + static_cast<int64_t>(done.bytes));
    return static_cast<int64_t>(done.bytes);
}

int BufferFile::write(const void* src, int n) {
    const QuietErrno quiet;
    if (!is_open() || mode_ == READ || n < 1) return 0;
    const auto* from = static_cast<const char*>(src);
    if (!hasWindow()) return static_cast<int>(writeDirectly(from, n));
    if (n > size_ - cursor_) return static_cast<int>(slideForWriting(from, n));
    std::memcpy(buffer_.get() + cursor_, from, static_cast<std::size_t>(n));
    markWritten(cursor_, cursor_ + n);
    cursor_ += n;
    fill_ = std::max(fill_, cursor_);
    return n;
}

int BufferFile::copyFrom(BufferFile& source, int64_t n) {
    const Quiet quiet;
    if (!is_writing() || !source.is_open() || source.mode_ == WRITE || &source == this || n < 0)
        return QUO_REFUSED;
    if (!source.flush()) return source.status_;
    if (!flush()) return status_;
    const int status = n > 0 ? quo::copy_range(*source.stream_, source.place(), *stream_, place(), n) : QUO_OK;
    if (status == QUO_REFUSED) return status;
    (status == QUO_READ_FAILED ? source : *this).note(status);
    if (status != QUO_OK) n = 0;
    source.dropBuffer(source.place() + n);
    dropBuffer(place() + n);
    return status;
}

void BufferFile::readBlock(void* dst, int memory_type, int first_line, int lines, int first_sample, int samples) {
    const Quiet quiet;
    const auto kernel = quo::find_kernel(quo::SampleAccess::kBlockRead, CellType, memory_type);
    if (samples == 0) samples = NrOfPixelsPerLine;
    const auto region = quo::region_of_samples(*this, first_line, lines, first_sample, samples);
    if (!is_open() || mode_ == WRITE || !kernel || !region || !flush()) return;
    const auto piece = samples * static_cast<int64_t>(quo::sample_size(memory_type));
    const int status = quo::read_region(*stream_, *region, {kernel, samples, piece, piece, ByteOrder == 1},
                                        static_cast<char*>(dst));
    note(status);
    if (status == QUO_OK) dropBuffer(quo::line_after(*this, first_line, lines));
}

void BufferFile::writeBlock(const void* src, int memory_type, int first_line, int lines, int first_sample,
                            int samples) {
    const Quiet quiet;
    const auto kernel = quo::find_kernel(quo::SampleAccess::kBlockWrite, CellType, memory_type);
    if (samples == 0) samples = NrOfPixelsPerLine;
    auto region = quo::region_of_samples(*this, first_line, lines, first_sample, samples);
    if (!is_writing() || !kernel || !region) return;
    const int64_t before = RowPrefix + int64_t{first_sample} * element_sizeof();
    if (memory_type == FLOAT_COMPLEX && CellType == FLOAT64) make_room_for_pairs(*region, before);
    const auto next = line_after_region(*region, before);
    if (!next || !flush()) return;
    const auto piece = samples * static_cast<int64_t>(quo::sample_size(memory_type));
    note(quo::write_region(*stream_, *region, {kernel, samples, piece, piece, ByteOrder == 1},
                           static_cast<const char*>(src)));
    dropBuffer(*next);
}

#define QUO_BLOCKS_OF(T, cell_type)                                                                        \
    void BufferFile::readbuffer(std::add_pointer_t<T> dst, int line, int lines, int sample, int samples) { \
        readBlock(dst, cell_type, line, lines, sample, samples);                                           \
    }                                                                                                      \
    void BufferFile::writebuffer(const T* src, int line, int lines, int sample, int samples) {             \
        writeBlock(src, cell_type, line, lines, sample, samples);                                          \
    }
QUO_BLOCKS_OF(float, FLOAT32)
QUO_BLOCKS_OF(double, FLOAT64)
QUO_BLOCKS_OF(int, INT32)
QUO_BLOCKS_OF(short, INT16)
QUO_BLOCKS_OF(fcomplex, FLOAT_COMPLEX)
QUO_BLOCKS_OF(dcomplex, DOUBLE_COMPLEX)
#undef QUO_BLOCKS_OF

bool BufferFile::prefixRegion(int first_line, int lines, quo::RasterRegion& region) const {
    const auto found = quo::region_of_prefixes(*this, first_line, lines);
    if (found) region = *found;
    return found.has_value();
}

void BufferFile::readprefix(char* dst, int first_line, int lines) {
    const Quiet quiet;
    quo::RasterRegion region;
    if (!is_open() || mode_ == WRITE || !prefixRegion(first_line, lines, region) || !flush()) return;
    const int status = quo::read_region(*stream_, region, {nullptr, 0, region.piece, region.piece, false}, dst);
    note(status);
    if (status == QUO_OK) dropBuffer(quo::line_after(*this, first_line, lines));
}

void BufferFile::writeprefix(const char* src, int first_line, int lines) {
    const Quiet quiet;
    quo::RasterRegion region;
    if (!is_writing() || !prefixRegion(first_line, lines, region) || !flush()) return;
    note(quo::write_region(*stream_, region, {nullptr, 0, region.piece, region.piece, false}, src));
    dropBuffer(quo::line_after(*this, first_line, lines));
}

void BufferFile::writeOffset(const char* src, int n) {
    const QuietErrno quiet;
    if (!is_writing() || n < 1 || HeaderOffset < 1 || !flush()) return;
    const auto bytes = static_cast<std::size_t>(std::min<int64_t>(n, HeaderOffset));
    if (stream_->write_at(0, src, bytes).bytes != bytes) note(QUO_WRITE_FAILED);
    if (buffer_) loadWindow(start_);
}

template <typename T>
T BufferFile::readSample(int type, int line, int sample) {
    const QuietErrno quiet;
    const auto region = quo::region_of_samples(*this, line, 1, sample, 1);
    T value{};
    if (!is_open() || mode_ == WRITE || CellType != type || ByteOrder != 0 || !region) return value;
    moveTo(region->first);
    T found{};
    if (read(&found, static_cast<int>(sizeof found)) == static_cast<int>(sizeof found)) return found;
    note(QUO_READ_FAILED);
    return value;
}

float BufferFile::readFloat(int line, int sample) { return readSample<float>(FLOAT32, line, sample); }
double BufferFile::readDouble(int line, int sample) { return readSample<double>(FLOAT64, line, sample); }
int BufferFile::readInt(int line, int sample) { return readSample<int>(INT32, line, sample); }
short BufferFile::readShort(int line, int sample) { return readSample<short>(INT16, line, sample); }
fcomplex BufferFile::readFloatComplex(int line, int sample) {
    return readSample<fcomplex>(FLOAT_COMPLEX, line, sample);
}
dcomplex BufferFile::readDoubleComplex(int line, int sample) {
    return readSample<dcomplex>(DOUBLE_COMPLEX, line, sample);
}

int BufferFile::clone(const BufferFile* source) {
    if (source == this) return QUO_OK;
    close();
    quo::copy_bounded(name_, source->name_);
    copyDescription(*source);
    return QUO_OK;
}

int BufferFile::copy(const char* file_name, int overwrite) {
    const Quiet quiet;
    if (!flush()) return QUO_WRITE_FAILED;
    BufferFile target{file_name};
    if (!target.name_[0]) return QUO_REFUSED;
    target.copyDescription(*this);
    return target.copyPair(name_, target.name_, overwrite != 0);
}
