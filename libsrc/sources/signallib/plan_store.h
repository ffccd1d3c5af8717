#ifndef QUO_PLAN_STORE_H
#define QUO_PLAN_STORE_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <vector>

#include "quo_base/fft.h"
#include "signallib/fft_transform.h"

namespace quo {

/** The plans of the process, for all threads: those that callers hold, by handles, and those that were measured
 * last, to be had again for nothing. A handle is a number that is never given twice, not an address, so that a
 * stale or made-up one is found out. */
class PlanStore {
public:
    /** Bounds of what is kept beyond the callers' plans. */
    static constexpr std::size_t kMostKept = 32, kMostKeptBytes = std::size_t{64} << 20;

    /** Null when the transform cannot be had. Throws std::bad_alloc. */
    [[nodiscard]] FftEnginePlan* open(FftEngine& engine, const FftGeometry& geometry);
    /** Null for a handle that is not held. */
    [[nodiscard]] FftTransform* find(const FftEnginePlan* handle) const noexcept;
    /** False for a handle that is not held. */
    bool close(const FftEnginePlan* handle) noexcept;

    [[nodiscard]] std::size_t held() const noexcept;
    [[nodiscard]] std::size_t kept() const noexcept;

private:
    struct Kept {
        const FftEngine* engine;
        std::shared_ptr<FftTransform> transform;
    };

    static std::uintptr_t key_of(const FftEnginePlan* handle) { return reinterpret_cast<std::uintptr_t>(handle); }
    std::shared_ptr<FftTransform> transform_for(FftEngine& engine, const FftGeometry& geometry);
    std::shared_ptr<FftTransform> find_kept(const FftEngine& engine, const FftGeometry& geometry);
    void keep(FftEngine& engine, const std::shared_ptr<FftTransform>& transform);

    mutable std::mutex guard_;  ///< never held while a transform is measured or runs
    std::unordered_map<std::uintptr_t, std::shared_ptr<FftTransform>> held_;
    std::vector<Kept> kept_;  ///< the one used last stands first
    std::size_t kept_bytes_ = 0;
    std::uintptr_t next_ = 0x51A7'0000'0001;  ///< odd, so that no address of an object is mistaken for a handle
};

/** The store of the process. */
PlanStore& plan_store();

}  // namespace quo

#endif
