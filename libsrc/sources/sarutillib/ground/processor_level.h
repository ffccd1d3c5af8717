// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PROCESSOR_LEVEL_H
#define QUO_PROCESSOR_LEVEL_H

#include <cstdint>

namespace quo {

/** Vector instructions that kernels are compiled for, each level with all of those before. */
enum class ProcessorLevel : std::uint8_t {
    kBase,   ///< what every processor has: SSE2 on x86-64
    kAvx2,   ///< and FMA
    kAvx512  ///< F, BW, DQ and VL
};

/** The processor's own level, or the lower one that the environment variable QUO_CPU names: sse2, avx2 or avx512.
 * Whatever else it says changes nothing. It is looked at once: every kernel of a process keeps to one level. */
[[nodiscard]] ProcessorLevel processor_level() noexcept;

/** `own`, or the lower level of that name, which may be null. */
[[nodiscard]] ProcessorLevel lowered_level(ProcessorLevel own, const char* name) noexcept;

}  // namespace quo

#endif
