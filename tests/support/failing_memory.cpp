// SPDX-License-Identifier: Apache-2.0
#include "support/failing_memory.h"

#include <malloc.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>

namespace {

long room_left = -1;  // every allocation succeeds while this is negative
bool only_one = false, has_failed = false, watching = false;
long in_use = 0, most_in_use = 0;

bool refuses() {
    if (room_left < 0 || room_left-- > 0) return false;
    has_failed = true;
    room_left = only_one ? -1 : 0;
    errno = ENOMEM;
    return true;
}
/** Counts a block, with what the C library keeps beside it, as taken (1) or given back (-1). */
void* counted(void* block, long sign = 1) {
    if (!watching || !block) return block;
    in_use += sign * static_cast<long>(malloc_usable_size(block) + sizeof(std::size_t));
    most_in_use = std::max(most_in_use, in_use);
    return block;
}

}  // namespace

void test::watch_memory() {
    in_use = most_in_use = 0;
    watching = true;
}
long test::most_memory() {
    watching = false;
    return most_in_use;
}
void test::refuse_memory(long room, bool once) {
    only_one = once;
    has_failed = false;
    room_left = room;
}
bool test::stop_refusing() {
    room_left = -1;
    errno = 0;
    return has_failed;
}

// NOLINTBEGIN(bugprone-reserved-identifier): the names that the C library has for its own.
extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void __libc_free(void* block);

void* malloc(std::size_t size) { return refuses() ? nullptr : counted(__libc_malloc(size)); }
void* calloc(std::size_t count, std::size_t size) {
    return refuses() ? nullptr : counted(__libc_calloc(count, size));
}
void* realloc(void* block, std::size_t size) {
    if (refuses()) return nullptr;
    return counted(__libc_realloc(counted(block, -1), size));
}
void free(void* block) { __libc_free(counted(block, -1)); }
}
// NOLINTEND(bugprone-reserved-identifier)
