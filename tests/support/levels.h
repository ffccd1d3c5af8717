// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_LEVELS_H
#define QUO_TESTS_SUPPORT_LEVELS_H

#include <vector>

#include "sarutillib/ground/processor_level.h"

namespace test {

/** The levels of vector instructions that this processor has, the lowest first. */
inline std::vector<quo::ProcessorLevel> processor_levels() {
    using enum quo::ProcessorLevel;
    std::vector<quo::ProcessorLevel> levels;
    for (const auto level : {kBase, kAvx2, kAvx512})
        if (level <= quo::processor_level()) levels.push_back(level);
    return levels;
}

}  // namespace test

#endif
