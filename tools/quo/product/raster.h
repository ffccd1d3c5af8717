// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_RASTER_H
#define QUO_TOOL_RASTER_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/datafile.h"
#include "quo_base/derived_raster.h"

namespace tool {

/** Reads a raster's side file and makes sure that the raster is there and as long as that says. Throws Failure. */
void read_description(const std::string& name, DataFile& raster);
/** The same for a raster that must hold samples. */
void read_samples_description(const std::string& name, DataFile& raster);

/** Name of a cell type as in side files ("INT32_COMPLEX" for the one without a name there), or its number. */
std::string type_name(int cell_type);
/** The cell type of a name in any letter case. Throws WrongUse for another. */
int type_of(std::string_view name);

/** Part of an axis: first index and the one after the last. */
struct Cut {
    int first, last;
    [[nodiscard]] int count() const { return last - first; }
};
/** Reads "A:B", each end optional, counted from 0, B excluded. Throws WrongUse where it is no part of 0..length.
 */
Cut cut_of(std::string_view text, int length, const char* option);

/** A rectangle of a raster that is worked on at once. */
struct Tile {
    int first_line, lines, first_sample, samples;
    [[nodiscard]] std::size_t size() const {
        return static_cast<std::size_t>(lines) * static_cast<std::size_t>(samples);
    }
};
/** Calls work(tile) for tiles of some megabytes that cover lines x samples, in the order of the file. A line that
 * is longer than a tile is cut at multiples of `grain` samples, so that memory stays bounded whatever the shape.
 */
template <typename Work>
void for_each_tile(int lines, int samples, int grain, Work work) {
    constexpr int kTileSamples = 1 << 19;
    const int across = std::min(samples, std::max(grain, kTileSamples / grain * grain));
    const int down = across < samples ? 1 : std::clamp(kTileSamples / std::max(samples, 1), 1, std::max(lines, 1));
    for (int line = 0; line < lines; line += std::min(down, lines - line)) {
        for (int sample = 0; sample < samples; sample += std::min(across, samples - sample)) {
            work(Tile{line, std::min(down, lines - line), sample, std::min(across, samples - sample)});
        }
    }
}

/** A raster that is read tile by tile, whatever its cell type. */
class RasterReader {
public:
    /** Throws Failure where the raster cannot be opened. */
    RasterReader(std::string name, const RasterDescription& description);

    [[nodiscard]] const RasterDescription& description() const { return file_; }
    /** Reads a tile, packed, as float, double, fcomplex or dcomplex; complex samples of a real raster have the
     * imaginary part 0. Throws Failure, also for complex samples as real ones. */
    template <typename T>
    void read(const Tile& tile, T* to);
    /** Reads a tile's samples as they stand in the file. Throws Failure. */
    void read(const Tile& tile, char* to);

private:
    friend class NewRaster;
    [[noreturn]] void fail() const;

    std::string name_;
    BufferFile file_;
    std::vector<double> real_;  // of a tile that is read as complex
    std::vector<char> narrow_;  // the 8-bit parts of a tile
    std::vector<char> lines_;   // of a tile, with what lies between
};

/** Whether integers of one raster's type fit another's, so that none can be clipped or lost. */
bool holds_every_value(const RasterDescription& to, const RasterDescription& from);

/** How many samples of a raster of integers are not what they should be. */
struct Losses {
    std::int64_t clipped = 0;  ///< held at the bounds of the type
    std::int64_t lost = 0;     ///< no number, which became 0
};

/** A raster under construction: written beside its final name, named and described by commit(). Whatever happens
 * before, an older raster of that name stays whole, with its side file, and the unfinished one is taken away. */
class NewRaster {
public:
    /** Throws Failure where there can be no raster of that name, WrongUse for standard output. */
    NewRaster(const std::string& name, const RasterDescription& description);
    NewRaster(const NewRaster&) = delete;
    NewRaster& operator=(const NewRaster&) = delete;

    [[nodiscard]] const RasterDescription& description() const { return file_; }
    /** Writes a tile of double, dcomplex or, for FLOAT32 and FLOAT_COMPLEX, float and fcomplex. Values for
     * integers are rounded half away from zero and held at the bounds, which is counted. Throws Failure where the
     * disk does not take it. */
    template <typename T>
    void write(const Tile& tile, const T* from);
    /** Writes a tile's samples as they are to stand in the file. Throws Failure. */
    void write(const Tile& tile, const char* from);
    /** Copies bytes of another raster to `offset` and on. Throws Failure. */
    void copy_bytes(std::int64_t offset, RasterReader& from, std::int64_t from_offset, std::int64_t bytes);
    /** The raster is complete: it and its side file, in which other sections stay, take their names together. Says
     * on standard error how many of the samples written could not be kept, if any. Throws Failure, and
     * Interrupted. */
    void commit();
    /** The same for a raster that came of another one: it gets that one's whole header, made to fit. */
    void commit(const std::string& from, const RasterDerivation& how);
    /** No value written from now on is beyond the type: looking for one would cost a third of a copy's time. */
    void expect_no_losses() { counts_losses_ = false; }

private:
    [[noreturn]] void fail() const;
    void say_losses() const;

    std::string name_;
    BufferFile file_;
    Losses losses_;
    bool counts_losses_ = true;
    std::vector<char> narrow_;  // the 8-bit parts of a tile
};

/** Where a sample stands in the file; the prefix of its line ends at sample 0. */
std::int64_t sample_offset(const RasterDescription& raster, std::int64_t line, std::int64_t sample);

}  // namespace tool

#endif
