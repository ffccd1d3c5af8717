// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HANDLE_TABLE_H
#define QUO_HANDLE_TABLE_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <utility>

namespace quo {

/** What callers hold by handles, for all threads. A handle is a number that is never given twice, not an address,
 * so that a stale or made-up one is found out. */
template <typename Handle, typename Object>
class HandleTable {
public:
    /** `first` is odd, so that no address of an object is mistaken for a handle. */
    explicit HandleTable(std::uintptr_t first) : next_{first} {}

    /** Throws std::bad_alloc. */
    [[nodiscard]] Handle* hold(std::shared_ptr<Object> object) {
        const std::lock_guard guard{guard_};
        const std::uintptr_t key = next_;
        held_.emplace(key, std::move(object));
        next_ += 2;
        return reinterpret_cast<Handle*>(key);  // NOLINT(performance-no-int-to-ptr): never followed
    }
    /** Null for a handle that is not held. */
    [[nodiscard]] std::shared_ptr<Object> find(const Handle* handle) const noexcept {
        const std::lock_guard guard{guard_};
        const auto found = held_.find(key_of(handle));
        return found == held_.end() ? nullptr : found->second;
    }
    /** What was held by the handle, which is none from then on; null as above. */
    std::shared_ptr<Object> release(const Handle* handle) noexcept {
        const std::lock_guard guard{guard_};
        auto node = held_.extract(key_of(handle));
        return node.empty() ? nullptr : std::move(node.mapped());
    }
    [[nodiscard]] std::size_t size() const noexcept {
        const std::lock_guard guard{guard_};
        return held_.size();
    }

private:
    static std::uintptr_t key_of(const Handle* handle) { return reinterpret_cast<std::uintptr_t>(handle); }

    mutable std::mutex guard_;
    std::unordered_map<std::uintptr_t, std::shared_ptr<Object>> held_;
    std::uintptr_t next_;
};

}  // namespace quo

#endif
