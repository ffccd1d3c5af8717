// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_MEMORY_ROOM_H
#define QUO_MEMORY_ROOM_H

#include <cstddef>

namespace quo {

/** Memory that a piece of work is going to take. */
struct MemoryNeed {
    std::size_t addresses = 0;  ///< bytes that are asked for at once
    std::size_t touched = 0;    ///< bytes of them that come into use
};

/** Whether the work can be begun: the addresses are really asked for, and given back; what comes into use is
 * compared with the memory that the system has free and with the limit of the container that the process runs in,
 * because a system that promises more than it has ends the process later. Needs of a few megabytes are only asked
 * for. errno stays as it was. */
[[nodiscard]] bool has_room(const MemoryNeed& need) noexcept;

}  // namespace quo

#endif
