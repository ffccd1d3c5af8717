#include "support/failing_new.h"

#include <malloc.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

long room_left = -1;  // every allocation succeeds while this is negative
test::News failing = test::News::kAll;
bool only_one = false, has_failed = false;

bool refuses(test::News kind) { return (failing == kind || failing == test::News::kAll) && test::is_refused(); }
std::atomic<bool> watching = false;
std::atomic<long> in_use = 0, most_in_use = 0;

/** With what the C library keeps beside each block. */
long bytes_of(void* block) {
    return block ? static_cast<long>(malloc_usable_size(block) + sizeof(std::size_t)) : 0;
}
void count(long bytes) {
    if (watching) most_in_use = std::max(most_in_use.load(), in_use += bytes);
}
void* memory(std::size_t size) {
    void* const block = std::malloc(size ? size : 1);
    count(bytes_of(block));
    return block;
}
void release(void* block) {
    count(-bytes_of(block));
    std::free(block);
}

}  // namespace

void test::watch_news() {
    in_use = most_in_use = 0;
    watching = true;
}
long test::most_news() {
    watching = false;
    return most_in_use;
}

void test::fail_news(long room, News which, bool once) {
    failing = which;
    only_one = once;
    has_failed = false;
    room_left = room;
}
bool test::stop_failing() {
    room_left = -1;
    errno = 0;
    return has_failed;
}
bool test::is_refused() {
    if (room_left != 0) {
        if (room_left > 0) --room_left;
        return false;
    }
    has_failed = true;
    if (only_one) room_left = -1;
    return true;
}

// Never inlined: the compiler would take the malloc and free inside for a mismatch.
[[gnu::noinline]] void* operator new(std::size_t size) {
    if (!refuses(test::News::kThrowing))
        if (void* const block = memory(size)) return block;
    throw std::bad_alloc{};
}
[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return refuses(test::News::kReturningNull) ? nullptr : memory(size);
}
[[gnu::noinline]] void* operator new[](std::size_t size) { return operator new(size); }
[[gnu::noinline]] void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept {
    return operator new(size, tag);
}
[[gnu::noinline]] void operator delete(void* block) noexcept { release(block); }
[[gnu::noinline]] void operator delete(void* block, std::size_t) noexcept { release(block); }
[[gnu::noinline]] void operator delete[](void* block) noexcept { release(block); }
[[gnu::noinline]] void operator delete[](void* block, std::size_t) noexcept { release(block); }
