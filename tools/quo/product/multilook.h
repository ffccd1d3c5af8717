// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_MULTILOOK_H
#define QUO_TOOL_MULTILOOK_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "raster.h"
#include "view.h"

namespace tool {

/** The mean power of looks x looks samples each, over the whole raster. Looks at the far ends that are not full
 * are left out. */
class Multilook {
public:
    /** Throws Failure where the picture would be too large. */
    Multilook(const RasterDescription& raster, const std::string& name, Looks looks);

    /** Reads the raster once. Each thread reads by itself and works on rows of pixels that are its alone. */
    void run(const RasterDescription& raster, const std::string& name, int threads, bool waitbar);

    /** The picture, which is not turned yet. */
    [[nodiscard]] View view() const { return {looks_, width_, height_}; }
    [[nodiscard]] const Looks& looks() const { return looks_; }
    /** Whether any sample has a power that is a finite number. */
    [[nodiscard]] bool has_power() const { return has_power_; }
    /** Row after row; values that are no number count as 0. */
    [[nodiscard]] const std::vector<float>& power() const { return power_; }

private:
    class Band;

    [[nodiscard]] std::int64_t rows() const { return static_cast<std::int64_t>(height_); }

    Looks looks_;
    std::size_t width_, height_;
    std::vector<float> power_;
    bool has_power_ = false;
};

}  // namespace tool

#endif
