// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PLAN_STORE_H
#define QUO_PLAN_STORE_H

#include <cstddef>
#include <memory>
#include <mutex>
#include <vector>

#include "quo_base/fft.h"
#include "sarutillib/ground/handle_table.h"
#include "signallib/fft_transform.h"

namespace quo {

/** The plans of the process, for all threads: those that callers hold, by handles, and those that were used
 * last, to be had again for nothing. */
class PlanStore {
public:
    /** Bounds of what is kept beyond the callers' plans. */
    static constexpr std::size_t kMostKept = 32, kMostKeptBytes = std::size_t{64} << 20;

    /** Null when the transform cannot be had. Throws std::bad_alloc. */
    [[nodiscard]] FftEnginePlan* open(FftEngine& engine, const FftGeometry& geometry);
    /** Null for a handle that is not held, and for none. Whoever runs a plan holds it: another thread may release
     * it meanwhile. */
    [[nodiscard]] std::shared_ptr<FftTransform> find(const FftEnginePlan* handle) const noexcept {
        return handle ? held_.find(handle) : nullptr;
    }
    /** False for a handle that is not held. */
    bool close(const FftEnginePlan* handle) noexcept { return held_.release(handle) != nullptr; }

    [[nodiscard]] std::size_t held() const noexcept { return held_.size(); }
    [[nodiscard]] std::size_t kept() const noexcept;

private:
    struct Kept {
        const FftEngine* engine;
        std::shared_ptr<FftTransform> transform;
    };

    std::shared_ptr<FftTransform> transform_for(FftEngine& engine, const FftGeometry& geometry);
    std::shared_ptr<FftTransform> find_kept(const FftEngine& engine, const FftGeometry& geometry);
    void keep(FftEngine& engine, const std::shared_ptr<FftTransform>& transform);

    HandleTable<FftEnginePlan, FftTransform> held_{0x51A7'0000'0001};
    mutable std::mutex guard_;  ///< of what is kept; never held while a transform is made or runs
    std::vector<Kept> kept_;    ///< the one used last stands first
    std::size_t kept_bytes_ = 0;
};

/** The store of the process. */
PlanStore& plan_store();

}  // namespace quo

#endif
