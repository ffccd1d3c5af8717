// SPDX-License-Identifier: Apache-2.0

// The module that holds libtiff: measurements as missions deliver them. A library of its own, so that only who
// imports loads libtiff and the compression libraries below it.
#include <tiffio.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <vector>

#include "missions/measurement.h"
#include "quo_base/api.h"

namespace {

using quo::MeasuredType;

/** Where libtiff's first complaint about a file goes. */
struct Complaint {
    char text[256] = "";
};

[[gnu::format(printf, 4, 0)]] int keep_complaint(TIFF* /*file*/, void* complaint, const char* /*module*/,
                                                 const char* format, va_list values) {
    char* const text = static_cast<Complaint*>(complaint)->text;
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): libtiff has started the list
    if (text[0] == '\0') std::vsnprintf(text, sizeof Complaint::text, format, values);
    return 1;
}
int ignore_warning(TIFF* /*file*/, void* /*data*/, const char* /*module*/, const char* /*format*/,
                   va_list /*values*/) {
    return 1;
}

class TiffMeasurement final : public quo::Measurement {
public:
    explicit TiffMeasurement(const char* file) {
        TIFFOpenOptions* const options = TIFFOpenOptionsAlloc();
        if (!options) return;
        TIFFOpenOptionsSetErrorHandlerExtR(options, keep_complaint, &complaint_);
        TIFFOpenOptionsSetWarningHandlerExtR(options, ignore_warning, nullptr);
        tiff_ = TIFFOpenExt(file, "r", options);
        TIFFOpenOptionsFree(options);
    }
    ~TiffMeasurement() override {
        if (tiff_) TIFFClose(tiff_);
    }
    TiffMeasurement(TiffMeasurement&&) = delete;

    /** Null when the file is an image that can be taken over, else why not. */
    const char* examine() {
        if (!tiff_) return complaint_.text[0] ? complaint_.text : "cannot be opened";
        std::uint32_t width = 0, height = 0;
        std::uint16_t bits = 0, per_pixel = 1, format = SAMPLEFORMAT_UINT;
        TIFFGetField(tiff_, TIFFTAG_IMAGEWIDTH, &width);
        TIFFGetField(tiff_, TIFFTAG_IMAGELENGTH, &height);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_BITSPERSAMPLE, &bits);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_SAMPLESPERPIXEL, &per_pixel);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_SAMPLEFORMAT, &format);
        constexpr auto kMost = static_cast<std::uint32_t>(std::numeric_limits<std::int32_t>::max());
        if (width == 0 || height == 0 || width > kMost || height > kMost) return "the image has no size";
        if (per_pixel != 1) return "the image has several samples in a pixel";
        if (format == SAMPLEFORMAT_COMPLEXINT && bits == 32)
            type = MeasuredType::kShortComplex;
        else if (format == SAMPLEFORMAT_COMPLEXIEEEFP && bits == 64)
            type = MeasuredType::kFloatComplex;
        else if (format == SAMPLEFORMAT_UINT && bits == 16)
            type = MeasuredType::kUnsignedShort;
        else
            return "its samples are neither complex 16-bit integers nor complex floats nor unsigned 16-bit";
        lines = static_cast<std::int32_t>(height);
        samples = static_cast<std::int32_t>(width);
        big_endian = TIFFIsBigEndian(tiff_) != 0;
        return lay_out();
    }

    bool read(std::int32_t block, void* to) noexcept override {
        if (tiled_) return read_tiles(block, static_cast<char*>(to));
        return block_lines == strip_lines_ ? read_strip(block, to) : read_lines(block, static_cast<char*>(to));
    }

private:
    [[nodiscard]] std::size_t row_bytes() const { return static_cast<std::size_t>(samples) * bytes_of(type); }
    [[nodiscard]] std::int32_t lines_in(std::int32_t block) const {
        return static_cast<std::int32_t>(
            std::min(std::int64_t{block_lines}, std::int64_t{lines} - std::int64_t{block} * block_lines));
    }

    const char* lay_out() {
        constexpr std::uint32_t kMostTile = 1 << 16;
        constexpr std::uint64_t kMostTileBytes = 1 << 26;
        tiled_ = TIFFIsTiled(tiff_) != 0;
        std::uint32_t rows = 0;
        if (tiled_) {
            TIFFGetField(tiff_, TIFFTAG_TILEWIDTH, &tile_width_);
            TIFFGetField(tiff_, TIFFTAG_TILELENGTH, &rows);
            if (tile_width_ == 0 || tile_width_ > kMostTile || rows == 0 || rows > kMostTile)
                return "its tiles have no size that is believed";
            const std::uint64_t bytes = std::uint64_t{tile_width_} * rows * bytes_of(type);
            if (bytes > kMostTileBytes || static_cast<std::uint64_t>(TIFFTileSize(tiff_)) != bytes)
                return "its tiles have no size that is believed";
            try {
                tile_.resize(static_cast<std::size_t>(tile_width_) * rows * bytes_of(type));
            } catch (const std::bad_alloc&) {
                return "there is no memory for its tiles";
            }
        } else {
            TIFFGetFieldDefaulted(tiff_, TIFFTAG_ROWSPERSTRIP, &rows);
            if (rows == 0) return "its strips have no lines";
            if (static_cast<std::uint64_t>(TIFFScanlineSize(tiff_)) != row_bytes())
                return "its lines have no size that is believed";
        }
        block_lines = static_cast<std::int32_t>(std::min<std::uint32_t>(rows, static_cast<std::uint32_t>(lines)));
        if (!tiled_) {
            strip_lines_ = block_lines;
            constexpr std::size_t kMostBytes = 1 << 20;  // a strip may be the whole image
            const auto fitting = static_cast<std::int32_t>(std::max<std::size_t>(1, kMostBytes / row_bytes()));
            block_lines = std::min(block_lines, fitting);
        }
        plain_from = find_plain();
        return nullptr;
    }

    /** Where the lines begin, if the strips hold them as they are and follow each other without a gap. */
    [[nodiscard]] std::int64_t find_plain() const {
        std::uint16_t compression = COMPRESSION_NONE, order = FILLORDER_MSB2LSB;
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_COMPRESSION, &compression);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_FILLORDER, &order);
        if (tiled_ || compression != COMPRESSION_NONE || order != FILLORDER_MSB2LSB) return -1;
        const std::uint64_t first = TIFFGetStrileOffset(tiff_, 0);
        std::uint64_t next = first;
        for (std::int32_t line = 0, strip = 0; line < lines;
             line += std::min(strip_lines_, lines - line), ++strip) {
            const std::uint64_t bytes =
                static_cast<std::uint64_t>(std::min(strip_lines_, lines - line)) * row_bytes();
            if (TIFFGetStrileOffset(tiff_, static_cast<std::uint32_t>(strip)) != next ||
                TIFFGetStrileByteCount(tiff_, static_cast<std::uint32_t>(strip)) != bytes)
                return -1;
            next += bytes;
        }
        return first > 0 && next < std::numeric_limits<std::int64_t>::max() ? static_cast<std::int64_t>(first)
                                                                            : -1;
    }

    /** What was never written of an image is not in its file, and is 0. */
    bool fill_absent(std::uint32_t strile, void* to, tmsize_t bytes) noexcept {
        if (TIFFGetStrileByteCount(tiff_, strile) != 0 || TIFFGetStrileOffset(tiff_, strile) != 0) return false;
        std::memset(to, 0, static_cast<std::size_t>(bytes));
        return true;
    }

    bool read_strip(std::int32_t block, void* to) noexcept {
        const auto bytes = static_cast<tmsize_t>(static_cast<std::size_t>(lines_in(block)) * row_bytes());
        const auto strip = static_cast<std::uint32_t>(block);
        return fill_absent(strip, to, bytes) || TIFFReadEncodedStrip(tiff_, strip, to, bytes) == bytes;
    }

    /** Line by line, which libtiff unpacks without the rest of a strip. */
    bool read_lines(std::int32_t block, char* to) noexcept {
        const std::int32_t first = block * block_lines;
        for (std::int32_t line = first; line < first + lines_in(block); ++line, to += row_bytes()) {
            const auto row = static_cast<std::uint32_t>(line);
            if (!fill_absent(row / static_cast<std::uint32_t>(strip_lines_), to,
                             static_cast<tmsize_t>(row_bytes())) &&
                TIFFReadScanline(tiff_, to, row, 0) != 1)
                return false;
        }
        return true;
    }

    bool read_tiles(std::int32_t block, char* to) noexcept {
        const std::size_t size = bytes_of(type);
        const auto rows = static_cast<std::size_t>(lines_in(block));
        const auto first_line = static_cast<std::uint32_t>(std::int64_t{block} * block_lines);
        for (std::uint32_t sample = 0; sample < static_cast<std::uint32_t>(samples); sample += tile_width_) {
            const std::uint32_t tile = TIFFComputeTile(tiff_, sample, first_line, 0, 0);
            const auto bytes = static_cast<tmsize_t>(tile_.size());
            if (!fill_absent(tile, tile_.data(), bytes) &&
                TIFFReadEncodedTile(tiff_, tile, tile_.data(), bytes) != bytes)
                return false;
            const std::size_t width =
                std::min<std::size_t>(tile_width_, static_cast<std::size_t>(samples) - sample) * size;
            for (std::size_t row = 0; row < rows; ++row)
                std::memcpy(to + row * row_bytes() + sample * size, tile_.data() + row * tile_width_ * size,
                            width);
        }
        return true;
    }

    TIFF* tiff_ = nullptr;
    Complaint complaint_;
    bool tiled_ = false;
    std::int32_t strip_lines_ = 0;
    std::uint32_t tile_width_ = 0;
    std::vector<char> tile_;
};

}  // namespace

extern "C" QUO_BASE_API quo::Measurement* quo_base_open_measurement(int version, const char* file, char* why,
                                                                    std::size_t room) {
    if (version != quo::kMeasurementVersion) {
        std::snprintf(why, room, "the module that reads it belongs to another version of the library");
        return nullptr;
    }
    try {
        auto measurement = std::make_unique<TiffMeasurement>(file);
        const char* const defect = measurement->examine();
        errno = 0;
        if (!defect) return measurement.release();
        std::snprintf(why, room, "%s", defect);
    } catch (const std::bad_alloc&) {
        std::snprintf(why, room, "there is no memory for it");
    }
    return nullptr;
}
