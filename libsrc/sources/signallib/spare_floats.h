// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_SPARE_FLOATS_H
#define QUO_SPARE_FLOATS_H

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <memory>
#include <utility>

namespace quo {

struct FreeFloats {
    void operator()(float* block) const noexcept { std::free(block); }
};
/** Aligned to a cache line. */
using Floats = std::unique_ptr<float, FreeFloats>;

/** Memory that is not touched: of a strided batch only the pages in use come into being. Null where there is none.
 */
inline Floats allocate_floats(std::size_t floats) noexcept {
    constexpr std::size_t kAlignment = 64;
    std::size_t bytes = 0;
    if (__builtin_mul_overflow(floats, sizeof(float), &bytes) ||
        __builtin_add_overflow(bytes, kAlignment - 1, &bytes))
        return nullptr;
    return Floats{static_cast<float*>(std::aligned_alloc(kAlignment, bytes / kAlignment * kAlignment))};
}

/** Room that a transform works in, for any number of threads that run it at a time: one room is kept, which the
 * first of them takes; others get rooms of their own. */
class SpareFloats {
public:
    explicit SpareFloats(std::size_t floats) noexcept
        : floats_{floats}, spare_{allocate_floats(floats).release()} {}
    ~SpareFloats() { FreeFloats{}(spare_); }
    SpareFloats(const SpareFloats&) = delete;
    SpareFloats& operator=(const SpareFloats&) = delete;

    /** Null where there is no memory. */
    [[nodiscard]] Floats take() noexcept {
        Floats room{spare_.exchange(nullptr)};
        return room ? std::move(room) : allocate_floats(floats_);
    }
    void give_back(Floats room) noexcept { Floats{spare_.exchange(room.release())}.reset(); }

private:
    std::size_t floats_;
    std::atomic<float*> spare_;
};

}  // namespace quo

#endif
