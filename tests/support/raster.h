// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_RASTER_H
#define QUO_TESTS_SUPPORT_RASTER_H

#include "quo_base/datafile.h"
#include "support/prelude.h"

namespace test {

/** Appends a number's bytes, most significant first when `big`. */
template <typename T>
void append_bytes(std::string& text, T value, bool big) {
    char bytes[sizeof(T)];
    std::memcpy(bytes, &value, sizeof bytes);
    if (big) std::reverse(bytes, bytes + sizeof bytes);
    text.append(bytes, sizeof bytes);
}

/** Appends one part of a sample of the given cell type. */
inline void append_part(std::string& text, int cell_type, double value, bool big) {
    switch (cell_type) {
        case FLOAT_COMPLEX:
        case FLOAT32:
            return append_bytes(text, static_cast<float>(value), big);
        case DOUBLE_COMPLEX:
        case FLOAT64:
            return append_bytes(text, value, big);
        case INT_COMPLEX:
        case INT32:
            return append_bytes(text, static_cast<std::int32_t>(value), big);
        case SHORT_COMPLEX:
        case INT16:
            return append_bytes(text, static_cast<std::int16_t>(value), big);
        default:
            return append_bytes(text, static_cast<std::int8_t>(value), big);
    }
}

/** The value that part `part` (0, 1) of a sample has in a made raster. */
inline double part_value(int line, int sample, int part) { return (line * 37 + sample * 5 + part * 3) % 101 - 50; }

/** The bytes of a raster of part_value(): header and prefixes hold letters that tell their place. */
inline std::string raster_bytes(const RasterDescription& raster) {
    std::string text(static_cast<std::size_t>(raster.HeaderOffset), 'H');
    for (int line = 0; line < raster.NrOfLinesPerImage; ++line) {
        for (int i = 0; i < raster.RowPrefix; ++i) text += static_cast<char>('a' + (line + i) % 26);
        for (int sample = 0; sample < raster.NrOfPixelsPerLine; ++sample) {
            for (int part = 0; part <= raster.is_complex(); ++part) {
                append_part(text, raster.CellType, part_value(line, sample, part), raster.ByteOrder == 1);
            }
        }
    }
    return text;
}

}  // namespace test

#endif
