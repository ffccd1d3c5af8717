// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_SENTINEL1_H
#define QUO_TESTS_SUPPORT_SENTINEL1_H

#include <gtest/gtest.h>
#include <tiffio.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "support/diagnostics.h"

/** Products of the mission to import: real annotations, and measurements made here. */
namespace test {

inline constexpr const char* kSlc = "S1A_IW_SLC__1SDV_20220104T170557_20220104T170624_041314_04E951_F1F1.SAFE";
inline constexpr const char* kGrd = "S1B_IW_GRDH_1SDV_20211223T051122_20211223T051147_030148_039993_5371.SAFE";

/** How a made measurement stores its samples. */
struct Layout {
    const char* name;
    std::uint16_t bits, format, compression;
    bool tiled, big_endian;
    std::uint32_t rows;  // of a strip
};
inline constexpr Layout kPlain{"Plain", 32, SAMPLEFORMAT_COMPLEXINT, COMPRESSION_NONE, false, false, 1};
inline constexpr Layout kDetected{"Detected", 16, SAMPLEFORMAT_UINT, COMPRESSION_NONE, false, false, 1000};

/** Part `part` of a made sample. */
inline std::int16_t part_of(std::uint32_t line, std::uint32_t sample, std::uint32_t part) {
    return static_cast<std::int16_t>(line * 1013 + sample * 37 + part * 5003);
}

inline void fill(const Layout& layout, std::uint32_t line, std::uint32_t sample, char* to) {
    const std::int16_t parts[] = {part_of(line, sample, 0), part_of(line, sample, 1)};
    const float floats[] = {parts[0] + 0.5F, parts[1] - 0.25F};
    std::memcpy(to, layout.bits == 64 ? static_cast<const void*>(floats) : parts, layout.bits / 8);
}

inline void write_tiff(const std::string& file, const Layout& layout, std::uint32_t lines, std::uint32_t samples,
                       bool with_samples) {
    TIFF* const tiff = TIFFOpen(file.c_str(), layout.big_endian ? "wb" : "wl");
    ASSERT_NE(tiff, nullptr);
    const std::size_t size = layout.bits / 8;
    TIFFSetField(tiff, TIFFTAG_IMAGEWIDTH, samples);
    TIFFSetField(tiff, TIFFTAG_IMAGELENGTH, lines);
    TIFFSetField(tiff, TIFFTAG_BITSPERSAMPLE, layout.bits);
    TIFFSetField(tiff, TIFFTAG_SAMPLEFORMAT, layout.format);
    TIFFSetField(tiff, TIFFTAG_COMPRESSION, layout.compression);
    TIFFSetField(tiff, TIFFTAG_PHOTOMETRIC, PHOTOMETRIC_MINISBLACK);
    constexpr std::uint32_t kTile = 16;
    if (layout.tiled) {
        TIFFSetField(tiff, TIFFTAG_TILEWIDTH, kTile);
        TIFFSetField(tiff, TIFFTAG_TILELENGTH, kTile);
    } else {
        TIFFSetField(tiff, TIFFTAG_ROWSPERSTRIP, layout.rows);
    }
    const std::uint32_t wide = layout.tiled ? kTile : samples, high = layout.tiled ? kTile : layout.rows;
    for (std::uint32_t line = 0; line < (with_samples ? lines : 1); line += high)
        for (std::uint32_t sample = 0; sample < (with_samples ? samples : 1); sample += wide) {
            std::vector<char> block(std::size_t{wide} * high * size);
            for (std::uint32_t i = 0; i < high && line + i < lines; ++i)
                for (std::uint32_t j = 0; j < wide && sample + j < samples; ++j)
                    fill(layout, line + i, sample + j, block.data() + (i * wide + j) * size);
            const auto rows = layout.tiled ? high : std::min(high, lines - line);
            const auto bytes = static_cast<tmsize_t>(std::size_t{wide} * rows * size);
            if (layout.tiled)
                TIFFWriteEncodedTile(tiff, TIFFComputeTile(tiff, sample, line, 0, 0), block.data(), bytes);
            else
                TIFFWriteEncodedStrip(tiff, line / high, block.data(), bytes);
        }
    TIFFClose(tiff);
    errno = 0;
}

inline std::string replaced(std::string text, const std::string& from, const std::string& to) {
    for (auto at = text.find(from); at != text.npos; at = text.find(from, at + to.size()))
        text.replace(at, from.size(), to);
    return text;
}

/** A copy of a product, to be changed, with a measurement. */
class Safe {
public:
    Safe(const test::TemporaryFolder& folder, const char* name) : path_{folder.path() / name} {
        std::filesystem::copy(std::filesystem::path{QUO_TEST_DATA "/sentinel1"} / name, path_,
                              std::filesystem::copy_options::recursive);
        std::filesystem::create_directory(path_ / "measurement");
        for (const auto& file : std::filesystem::directory_iterator{path_ / "annotation"})
            annotation_ = file.path();
        setenv("QUO_TIFF_MODULE", QUO_TEST_TIFF_MODULE, 1);
    }
    [[nodiscard]] std::string path() const { return path_.string(); }
    [[nodiscard]] std::filesystem::path annotation() const { return annotation_; }
    [[nodiscard]] std::string measurement() const {
        return (path_ / "measurement" / (annotation_.stem().string() + ".tiff")).string();
    }
    void change(const std::string& from, const std::string& to) {
        const std::string text = test::read_text(annotation_), changed = replaced(text, from, to);
        EXPECT_NE(text, changed) << from;
        test::write_text(annotation_, changed);
    }
    /** Renames the annotation, and so the measurement. */
    void rename(const std::string& from, const std::string& to) {
        const auto old = annotation_;
        annotation_.replace_filename(replaced(old.filename().string(), from, to));
        std::filesystem::rename(old, annotation_);
    }
    void change_element(const std::string& name, const std::string& content) {
        std::string text = test::read_text(annotation_);
        const auto from = text.find("<" + name + ">") + name.size() + 2;
        text.replace(from, text.find('<', from) - from, content);
        test::write_text(annotation_, text);
    }
    /** An image of 40 lines of 30 samples, no bursts. */
    void shrink(bool grd) {
        change(grd ? "<numberOfLines>16705<" : "<numberOfLines>4503<", "<numberOfLines>40<");
        change(grd ? "<numberOfSamples>26102<" : "<numberOfSamples>22694<", "<numberOfSamples>30<");
        if (grd) return;
        change("burst>", "past>");
        change("<line>1501<", "<line>1342<");  // of an image without bursts
        change("<line>3002<", "<line>2684<");
    }

private:
    std::filesystem::path path_, annotation_;
};

}  // namespace test

#endif
