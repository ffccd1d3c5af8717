// SPDX-License-Identifier: Apache-2.0

// Transforms by kernels of our own, of lengths without a prime factor above 7: nothing to load and nothing to
// measure.
#include <map>
#include <memory>
#include <mutex>
#include <new>
#include <utility>

#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"
#include "signallib/own_fft/fft_plans.h"
#include "signallib/spare_floats.h"

namespace quo {
namespace {

class OwnBatch final : public FftBatch {
public:
    OwnBatch(const FftGeometry& geometry, std::shared_ptr<const FftTables> tables)
        : tables_{std::move(tables)},
          pitch_{2 * (geometry.stride == 1 ? geometry.distance : geometry.stride)},
          count_{geometry.count},
          room_{tables_->room()} {}

    bool run(const float* in, float* out, FftFailure& why) noexcept override {
        Floats room = room_.take();
        if (!room) why.bytes = tables_->room() * sizeof(float);
        const bool done = room != nullptr;
        if (done) tables_->run(in, out, pitch_, count_, room.get());
        room_.give_back(std::move(room));
        return done;
    }

    [[nodiscard]] std::size_t held_bytes() const noexcept override { return tables_->bytes(); }

private:
    std::shared_ptr<const FftTables> tables_;
    std::ptrdiff_t pitch_;
    int count_;
    SpareFloats room_;
};

class OwnEngine final : public FftEngine {
public:
    [[nodiscard]] const char* name() const noexcept override { return "quo"; }
    [[nodiscard]] bool takes(int length) const noexcept override { return is_own_fft_length(length); }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry, FftFailure& why) noexcept override {
        std::size_t bytes = 0;
        try {
            const FftKind kind = choose_fft(geometry);
            bytes = fft_bytes(kind);
            if (has_room({bytes, bytes})) return std::make_unique<OwnBatch>(geometry, tables_of(kind));
        } catch (const std::bad_alloc&) {
            bytes += sizeof(OwnBatch);
        }
        why.bytes = bytes;
        return nullptr;
    }

private:
    /** Plans of one kind share their tables as long as there are any. */
    std::shared_ptr<const FftTables> tables_of(const FftKind& kind) {
        std::shared_ptr<const FftTables> tables;
        if (const std::lock_guard guard{guard_}; auto known = tables_[kind].lock()) return known;
        tables = std::make_shared<const FftTables>(kind);  // long ones take a while: nobody waits for them
        const std::lock_guard guard{guard_};
        std::weak_ptr<const FftTables>& known = tables_[kind];
        if (auto other = known.lock()) return other;
        known = tables;
        std::erase_if(tables_, [](const auto& entry) { return entry.second.expired(); });
        return tables;
    }

    std::mutex guard_;
    std::map<FftKind, std::weak_ptr<const FftTables>> tables_;
};

}  // namespace

FftEngine* load_own_engine() noexcept {
    // Never destroyed: objects that outlive this file's statics may still use their plans.
    static OwnEngine* const engine = new (std::nothrow) OwnEngine;
    return engine;
}

}  // namespace quo
