#include "failing_new.h"

#include <cstddef>
#include <cstdlib>
#include <new>

long test::allowed_news = -1;

void* operator new(std::size_t size) {
    if (test::allowed_news == 0) throw std::bad_alloc{};
    if (test::allowed_news > 0) --test::allowed_news;
    if (void* const block = std::malloc(size)) return block;
    throw std::bad_alloc{};
}
void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
