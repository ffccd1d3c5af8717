// SPDX-License-Identifier: Apache-2.0
#include "signallib/plan_store.h"

#include <algorithm>

namespace quo {

FftEnginePlan* PlanStore::open(FftEngine& engine, const FftGeometry& geometry) {
    std::shared_ptr<FftTransform> transform = transform_for(engine, geometry);
    return transform ? held_.hold(std::move(transform)) : nullptr;
}

std::size_t PlanStore::kept() const noexcept {
    const std::lock_guard guard{guard_};
    return kept_.size();
}

std::shared_ptr<FftTransform> PlanStore::find_kept(const FftEngine& engine, const FftGeometry& geometry) {
    const auto found = std::find_if(kept_.begin(), kept_.end(), [&](const Kept& kept) {
        return kept.engine == &engine && kept.transform->geometry() == geometry;
    });
    if (found == kept_.end()) return nullptr;
    std::rotate(kept_.begin(), found, found + 1);
    return kept_.front().transform;
}

std::shared_ptr<FftTransform> PlanStore::transform_for(FftEngine& engine, const FftGeometry& geometry) {
    {
        const std::lock_guard guard{guard_};
        if (auto known = find_kept(engine, geometry)) return known;
    }
    std::shared_ptr<FftTransform> transform = make_fft_transform(engine, geometry);
    if (!transform) return nullptr;
    const std::lock_guard guard{guard_};
    if (auto known = find_kept(engine, geometry)) return known;  // another thread was faster
    keep(engine, transform);
    return transform;
}

void PlanStore::keep(FftEngine& engine, const std::shared_ptr<FftTransform>& transform) {
    kept_.insert(kept_.begin(), Kept{&engine, transform});
    kept_bytes_ += transform->held_bytes();
    // The newest stays in any case, however large.
    while (kept_.size() > 1 && (kept_.size() > kMostKept || kept_bytes_ > kMostKeptBytes)) {
        kept_bytes_ -= kept_.back().transform->held_bytes();
        kept_.pop_back();
    }
}

PlanStore& plan_store() {
    // Never destroyed: objects that outlive this file's statics may still release their plans.
    static PlanStore& store = *new PlanStore;
    return store;
}

}  // namespace quo
