// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_MEASUREMENT_H
#define QUO_MEASUREMENT_H

#include <cstddef>
#include <cstdint>
#include <memory>

namespace quo {

/** What the samples of a measurement are. */
enum class MeasuredType : std::uint8_t { kShortComplex, kFloatComplex, kUnsignedShort };

/** An image file of a mission that is open for reading. */
class Measurement {
public:
    Measurement() = default;
    Measurement(const Measurement&) = delete;
    Measurement& operator=(const Measurement&) = delete;
    virtual ~Measurement() = default;

    MeasuredType type = MeasuredType::kShortComplex;
    std::int32_t lines = 0, samples = 0;
    bool big_endian = false;       ///< of the file; what read() gives has the byte order of the machine
    std::int64_t plain_from = -1;  ///< where all lines stand one after the other as they are; -1: nowhere
    std::int32_t block_lines = 1;  ///< lines that are unpacked together

    /** Reads the lines of block `block` (from line block * block_lines on, fewer at the end), packed, into room
     * for block_lines of them. False for a file that is cut short or damaged. */
    virtual bool read(std::int32_t block, void* to) noexcept = 0;
};

/** Bytes of a sample. */
constexpr std::size_t bytes_of(MeasuredType type) {
    return type == MeasuredType::kFloatComplex ? 8 : type == MeasuredType::kShortComplex ? 4 : 2;
}

/** The only exported function of the module that holds libtiff. Null, with the reason in `why`, which has room for
 * `room` bytes, for a file that is no such image, and in a module of another version, whose class may differ. */
using MeasurementEntry = Measurement* (*)(int version, const char* file, char* why, std::size_t room);
inline constexpr int kMeasurementVersion = 1;
inline constexpr const char* kMeasurementEntryName = "quo_base_open_measurement";

}  // namespace quo

#endif
