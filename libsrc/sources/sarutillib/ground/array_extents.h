// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ARRAY_EXTENTS_H
#define QUO_ARRAY_EXTENTS_H

#include <cstddef>
#include <cstdint>
#include <span>

namespace quo {

/** Where an array lies; nowhere for one that is not given. */
struct Extent {
    std::uintptr_t first = 0, bytes = 0;

    Extent(const void* data, std::size_t element, std::size_t count) noexcept
        : first{reinterpret_cast<std::uintptr_t>(data)}, bytes{data ? element * count : 0} {}
    [[nodiscard]] bool fits() const noexcept { return first <= UINTPTR_MAX - bytes; }
    [[nodiscard]] bool overlaps(const Extent& other) const noexcept {
        return bytes > 0 && other.bytes > 0 && first < other.first + other.bytes && other.first < first + bytes;
    }
    [[nodiscard]] bool same(const Extent& other) const noexcept {
        return first == other.first && bytes == other.bytes;
    }
};

/** Whether the arrays of a call, `count` numbers each, fit into memory, and an output may be written while inputs
 * are read: it is the very array of an input, or overlaps with none; nor does it with another output or the
 * statuses. Arrays that are not given are null. */
inline bool lie_well(std::span<const double* const> inputs, std::span<double* const> outputs,
                     const std::int32_t* status, std::size_t count) noexcept {
    if (count > PTRDIFF_MAX / sizeof(double)) return false;
    const Extent told{status, sizeof *status, count};
    if (!told.fits()) return false;
    for (const double* const input : inputs) {
        const Extent in{input, sizeof *input, count};
        if (!in.fits() || in.overlaps(told)) return false;
    }
    for (auto output = outputs.begin(); output != outputs.end(); ++output) {
        const Extent out{*output, sizeof **output, count};
        if (!out.fits() || out.overlaps(told)) return false;
        for (const double* const input : inputs) {
            const Extent in{input, sizeof *input, count};
            if (in.overlaps(out) && !in.same(out)) return false;
        }
        for (auto other = outputs.begin(); other != output; ++other)
            if (out.overlaps({*other, sizeof **other, count})) return false;
    }
    return true;
}

}  // namespace quo

#endif
