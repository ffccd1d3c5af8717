// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FUZZ_RASTER_PROPERTY_H
#define QUO_FUZZ_RASTER_PROPERTY_H

/* What holds for rasters of any shape over files of any length: blocks read and written in the raster's own type
 * are the bytes of a plain file, turned where the byte orders differ, and what the file has not moves nothing. And
 * for side files of any text: whatever they say, blocks stay within their arrays. */

#include <algorithm>
#include <array>
#include <memory>
#include <vector>

#include "bytes.h"
#include "quo_base/datafile.h"

namespace property {

/** Cells that are read as they stand: the type, bytes of a cell and of each of its numbers. */
struct Cell {
    int type;
    std::size_t bytes, number;
};
inline constexpr Cell kCells[] = {{FLOAT_COMPLEX, 8, 4}, {FLOAT32, 4, 4}, {DOUBLE_COMPLEX, 16, 8},
                                  {FLOAT64, 8, 8},       {INT32, 4, 4},   {INT16, 2, 2}};

/** A block of cells in memory. */
using Block = std::vector<char>;

inline void turn(Block& block, std::size_t number) {
    for (auto at = block.begin(); at != block.end(); at += static_cast<std::ptrdiff_t>(number))
        std::reverse(at, at + static_cast<std::ptrdiff_t>(number));
}

struct Window {
    int line, lines, sample, samples;
};

template <typename T>
void move_as(BufferFile& file, bool writing, Block& block, const Window& w) {
    const auto room = std::make_unique<T[]>(block.size() / sizeof(T) + 1);
    std::copy(block.begin(), block.end(), reinterpret_cast<char*>(room.get()));
    if (writing)
        file.writebuffer(room.get(), w.line, w.lines, w.sample, w.samples);
    else
        file.readbuffer(room.get(), w.line, w.lines, w.sample, w.samples);
    std::copy_n(reinterpret_cast<const char*>(room.get()), block.size(), block.begin());
}
inline void move(BufferFile& file, int type, bool writing, Block& block, const Window& w) {
    switch (type) {
        case FLOAT_COMPLEX:
            return move_as<fcomplex>(file, writing, block, w);
        case FLOAT32:
            return move_as<float>(file, writing, block, w);
        case DOUBLE_COMPLEX:
            return move_as<dcomplex>(file, writing, block, w);
        case FLOAT64:
            return move_as<double>(file, writing, block, w);
        case INT32:
            return move_as<int>(file, writing, block, w);
        default:
            return move_as<short>(file, writing, block, w);
    }
}

/** A raster of the shape that the bytes tell, over the rest of them, beside the same bytes in memory. */
class RasterModel {
public:
    explicit RasterModel(Bytes& bytes) : cell_{kCells[bytes.between(0, 5)]} {
        lines_ = bytes.between(1, 6);
        samples_ = bytes.between(1, 6);
        offset_ = bytes.between(0, 5);
        prefix_ = bytes.between(0, 5);
        big_ = bytes.between(0, 1) == 1;
        buffer_ = bytes.between(0, 40);
    }
    void describe(BufferFile& file, const char* name) const {
        file.setFilename(name);
        file.setLines(lines_);
        file.setSamples(samples_);
        file.setRowPrefix(prefix_);
        file.setType(cell_.type);
        file.HeaderOffset = offset_;
        file.ByteOrder = big_ ? 1 : 0;
    }
    [[nodiscard]] Window window(Bytes& bytes) const {
        const int line = bytes.between(0, lines_ - 1), sample = bytes.between(0, samples_ - 1);
        return {line, bytes.between(1, lines_ - line), sample, bytes.between(1, samples_ - sample)};
    }
    [[nodiscard]] Block block(const Window& w, char filler) const {
        return Block(static_cast<std::size_t>(w.lines) * static_cast<std::size_t>(w.samples) * cell_.bytes,
                     filler);
    }
    /** Where a row of a window stands in the file, and its bytes. */
    [[nodiscard]] std::size_t place(const Window& w, int row) const {
        const auto pitch = static_cast<std::size_t>(prefix_) + static_cast<std::size_t>(samples_) * cell_.bytes;
        return static_cast<std::size_t>(offset_ + prefix_) + static_cast<std::size_t>(w.line + row) * pitch +
               static_cast<std::size_t>(w.sample) * cell_.bytes;
    }
    [[nodiscard]] std::size_t row_bytes(const Window& w) const {
        return static_cast<std::size_t>(w.samples) * cell_.bytes;
    }
    [[nodiscard]] const Cell& cell() const { return cell_; }
    [[nodiscard]] bool big() const { return big_; }
    [[nodiscard]] int buffer() const { return buffer_; }

private:
    Cell cell_;
    int lines_, samples_, offset_, prefix_, buffer_;
    bool big_;
};

/** Whether the file has the block. */
inline bool check_read(BufferFile& file, const RasterModel& model, const std::string& plain, const Window& w) {
    Block got = model.block(w, '?'), expected = got;
    const bool there = model.place(w, w.lines - 1) + model.row_bytes(w) <= plain.size();
    if (there) {
        for (int row = 0; row < w.lines; ++row)
            std::copy_n(plain.data() + model.place(w, row), model.row_bytes(w),
                        expected.data() + static_cast<std::size_t>(row) * model.row_bytes(w));
        if (model.big()) turn(expected, model.cell().number);
    }
    move(file, model.cell().type, false, got, w);
    require(got == expected, "a block is what the file holds, or nothing");
    return there;
}
inline void write_both(BufferFile& file, const RasterModel& model, std::string& plain, const Window& w,
                       char value) {
    Block block = model.block(w, value);
    for (std::size_t i = 0; i < block.size(); ++i) block[i] = static_cast<char>(value + static_cast<char>(i));
    Block stored = block;
    if (model.big()) turn(stored, model.cell().number);
    move(file, model.cell().type, true, block, w);
    plain.resize(std::max(plain.size(), model.place(w, w.lines - 1) + model.row_bytes(w)), '\0');
    for (int row = 0; row < w.lines; ++row)
        plain.replace(model.place(w, row), model.row_bytes(w),
                      stored.data() + static_cast<std::size_t>(row) * model.row_bytes(w), model.row_bytes(w));
}

/** Blocks of a raster against a plain file. */
inline void check_blocks(std::string_view content) {
    Bytes bytes{content};
    const RasterModel model{bytes};
    std::string plain{bytes.take(static_cast<std::size_t>(bytes.between(0, 300)))};
    const MemoryFile disk{plain, "raster"};
    BufferFile file;
    model.describe(file, disk.name());
    file.open(BufferFile::READ_WRITE);
    require(file.is_open(), "a raster that is there opens");
    if (model.buffer() > 0) file.initbuffer(model.buffer(), 0);
    bool all_there = true;
    for (int step = 0; step < 40 && !bytes.empty(); ++step) {
        const Window w = model.window(bytes);
        if (bytes.between(0, 1) == 0)
            all_there = check_read(file, model, plain, w) && all_there;
        else
            write_both(file, model, plain, w, bytes.number<char>());
    }
    file.close();
    require(file.status() == (all_there ? 0 : 4), "only what lies beyond the file cannot be read");
    require(disk.content() == plain, "the file holds what was written");
}

/** A side file of any text, and what it describes, over a file of a few bytes. */
inline void check_side_file(std::string_view text) {
    const MemoryFile disk{"0123456789abcdefghijklmnopqrstuvwxyz", "side"};
    disk.write(text, ".hdr");
    BufferFile file{disk.name()};
    if (file.readhdr() != 0) return;
    file.setFilename(disk.name());
    file.open(BufferFile::READ);
    std::array<double, 13> room{};
    room.back() = 7.0;
    file.readbuffer(room.data(), 0, 3, 0, 4);
    if (file.getSamples() <= 6) file.readbuffer(room.data(), 1, 2, 0, 0);  // whole lines
    require(room.back() == 7.0, "a block stays within its array");
    char prefix[64] = {};
    if (file.getRowPrefix() >= 0 && file.getRowPrefix() <= 32) file.readprefix(prefix, 0, 2);
}

}  // namespace property

#endif
