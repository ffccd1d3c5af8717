// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ALIGNED_BLOCK_H
#define QUO_ALIGNED_BLOCK_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>

#include "sarutillib/ground/checked_size.h"

namespace quo {

/** Alignment of the blocks that callers get. Each stands at the first multiple of it strictly above the address
 * that the system gave, and the pointer-sized word just below the block holds that address. */
inline constexpr std::size_t kBlockAlignment = 16;

/** What is asked of the system for `count` elements; nothing where that is more than memory can have. */
inline std::optional<std::size_t> system_bytes(std::size_t count, std::size_t size) noexcept {
    return (Checked<std::size_t>{count} * size + kBlockAlignment).value();
}

/** The block within the memory that the system gave for it; null for null. */
inline void* aligned_block(void* system) noexcept {
    if (!system) return nullptr;
    const std::size_t step = kBlockAlignment - reinterpret_cast<std::uintptr_t>(system) % kBlockAlignment;
    char* const block = static_cast<char*>(system) + step;
    std::memcpy(block - sizeof system, &system, sizeof system);
    return block;
}

/** The memory that the system gave for a block. */
inline void* system_memory(const void* block) noexcept {
    void* system = nullptr;
    std::memcpy(&system, static_cast<const char*>(block) - sizeof system, sizeof system);
    return system;
}

}  // namespace quo

#endif
