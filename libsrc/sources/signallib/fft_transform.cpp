// SPDX-License-Identifier: Apache-2.0
#include "signallib/fft_transform.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <utility>

#include "quo_base/fft.h"
#include "signallib/memory_room.h"
#include "signallib/spare_floats.h"

namespace quo {
namespace {

/** Rows that are run together: enough for the engine to batch, and in the second cache several times over. */
constexpr std::ptrdiff_t kRowBlockBytes = 128 << 10;
/** Samples of a group of columns: long ones are multiplied while they are in some cache. */
constexpr int kGroupSamples = 1 << 21;
constexpr int kLine = 16;  ///< groups of columns are multiples of whole cache lines

int divide_up(int a, int b) { return a / b + (a % b != 0 ? 1 : 0); }

int row_block(const FftGeometry& rows) {
    const auto bytes = rows.length * floats_of(rows.domain) * static_cast<std::ptrdiff_t>(sizeof(float));
    // Blocks of an even number of rows start at the alignment of the first, whatever the distance.
    const std::ptrdiff_t least = rows.distance % 2 != 0 ? 2 : 1;
    const auto fitting = static_cast<std::size_t>(std::max(kRowBlockBytes / bytes, least));
    return static_cast<int>(std::min(std::bit_floor(fitting), static_cast<std::size_t>(rows.count)));
}

int column_block(const FftGeometry& columns) {
    const int most = std::max(kGroupSamples / columns.length, kLine);
    if (columns.count <= most) return columns.count;
    const int groups = divide_up(columns.count, most);
    return divide_up(divide_up(columns.count, groups), kLine) * kLine;
}

FftGeometry with_count(FftGeometry geometry, int count) {
    geometry.count = count;
    return geometry;
}

/** The engine's plans for whole blocks and for what is left at the end. Tells the thread why they fail. */
class BlockBatches {
public:
    BlockBatches(FftEngine& engine, const FftGeometry& block, int total) : engine_{engine}, block_{block} {
        const int left = total % block.count;
        ready_ = make(whole_, block) && (left == 0 || make(rest_, with_count(block, left)));
    }
    [[nodiscard]] bool ready() const { return ready_; }
    [[nodiscard]] std::size_t held_bytes() const noexcept {
        return (whole_ ? whole_->held_bytes() : 0) + (rest_ ? rest_->held_bytes() : 0);
    }

    /** Whole blocks, or as many transforms as are left at the end. */
    [[nodiscard]] bool run(int count, const float* in, float* out) const noexcept {
        FftFailure why;
        if ((count == block_.count ? *whole_ : *rest_).run(in, out, why)) return true;
        note_fft_error(engine_, block_.length, why);
        return false;
    }

private:
    [[nodiscard]] bool make(std::unique_ptr<FftBatch>& batch, const FftGeometry& geometry) {
        FftFailure why;
        batch = engine_.make(geometry, why);
        if (!batch) note_fft_error(engine_, geometry.length, why);
        return batch != nullptr;
    }

    FftEngine& engine_;
    FftGeometry block_;
    std::unique_ptr<FftBatch> whole_, rest_;
    bool ready_ = false;
};

/** Runs blocks where they lie. */
class BlockedTransform final : public FftTransform {
public:
    BlockedTransform(FftEngine& engine, const FftGeometry& geometry, int block)
        : FftTransform{geometry, block}, batches_{engine, with_count(geometry, block), geometry.count} {}
    [[nodiscard]] bool ready() const { return batches_.ready(); }
    [[nodiscard]] std::size_t held_bytes() const noexcept override { return batches_.held_bytes(); }

    bool run(const float* in, float* out, int first, int count, FftFactors factors) noexcept override {
        for (int k = first; k < first + count; k += block_) {
            const int width = std::min(block_, geometry_.count - k);
            const auto offset = k * geometry_.distance * floats_of(geometry_.domain);
            if (!batches_.run(width, in + offset, out + offset)) return false;
            multiply_batch(geometry_, out + offset, width, factors);
        }
        return true;
    }

private:
    BlockBatches batches_;
};

/** Copies neighbouring columns into a tile that stays in the cache, transforms them there and copies them back.
 * The tile keeps the image's rows: turning them into columns costs more than it gains. */
class TiledColumns final : public FftTransform {
public:
    TiledColumns(FftEngine& engine, const FftGeometry& columns, int width)
        : FftTransform{columns, std::min(width, columns.count)},
          batches_{engine, tile_geometry(columns, block_), columns.count},
          bytes_{static_cast<std::size_t>(columns.length * tile_pitch(block_)) * 2 * sizeof(float)},
          engine_{engine},
          fits_{batches_.ready() && has_room({bytes_, bytes_})},
          tiles_{fits_ ? bytes_ / sizeof(float) : 0} {
        if (batches_.ready() && !fits_) note_fft_error(engine_, geometry_.length, {.bytes = bytes_});
    }
    [[nodiscard]] bool ready() const { return fits_; }
    [[nodiscard]] std::size_t held_bytes() const noexcept override { return bytes_ + batches_.held_bytes(); }

    bool run(const float* in, float* out, int first, int count, FftFactors factors) noexcept override {
        Floats tile = tiles_.take();
        if (!tile) note_fft_error(engine_, geometry_.length, {.bytes = bytes_});
        bool done = tile != nullptr;
        for (int k = first; done && k < first + count; k += block_)
            done = run_block(in + 2 * std::ptrdiff_t{k}, out + 2 * std::ptrdiff_t{k},
                             std::min(block_, geometry_.count - k), tile.get(), factors);
        tiles_.give_back(std::move(tile));
        return done;
    }

private:
    /** Samples from row to row: no power of two, or rows a power of two apart would share a few lines of the
     * cache; even, for the rows' alignment. */
    static std::ptrdiff_t tile_pitch(int width) { return width + width % 2 + 8; }
    static FftGeometry tile_geometry(FftGeometry columns, int width) {
        columns.count = width;
        columns.stride = tile_pitch(width);
        columns.in_place = true;
        return columns;
    }
    [[nodiscard]] std::ptrdiff_t pitch() const noexcept { return 2 * tile_pitch(block_); }

    [[nodiscard]] bool run_block(const float* in, float* out, int width, float* tile,
                                 FftFactors factors) const noexcept {
        fill(in, width, tile);
        if (!batches_.run(width, tile, tile)) return false;
        multiply_rows(tile, geometry_.length, 2 * std::ptrdiff_t{width}, pitch(), factors);
        empty(tile, width, out);
        return true;
    }

    /** The rows are too far apart for the processor to see them coming. */
    void fill(const float* from, int width, float* to) const noexcept {
        constexpr std::ptrdiff_t kAhead = 16, kLineFloats = 16;
        const std::ptrdiff_t floats = 2 * std::ptrdiff_t{width}, step = 2 * geometry_.stride;
        for (int row = 0; row < geometry_.length; ++row, from += step, to += pitch()) {
            const float* const next = from + std::min<std::ptrdiff_t>(kAhead, geometry_.length - 1 - row) * step;
            for (std::ptrdiff_t k = 0; k < floats; k += kLineFloats) __builtin_prefetch(next + k);
            std::memcpy(to, from, static_cast<std::size_t>(floats) * sizeof(float));
        }
    }
    void empty(const float* from, int width, float* to) const noexcept {
        const std::size_t bytes = 2 * sizeof(float) * static_cast<std::size_t>(width);
        for (int row = 0; row < geometry_.length; ++row, from += pitch(), to += 2 * geometry_.stride)
            std::memcpy(to, from, bytes);
    }

    BlockBatches batches_;
    std::size_t bytes_;
    FftEngine& engine_;
    bool fits_;
    SpareFloats tiles_;
};

/** Narrow tiles waste half of each access to memory; of very long columns wide ones would leave even the last
 * cache. */
int tile_width(int length) { return length <= 32768 ? 64 : 8; }

template <typename Transform>
std::unique_ptr<FftTransform> if_ready(std::unique_ptr<Transform> transform) {
    if (!transform->ready()) return nullptr;
    return transform;
}

}  // namespace

void multiply_rows(float* data, std::ptrdiff_t rows, std::ptrdiff_t floats, std::ptrdiff_t pitch,
                   FftFactors factors) noexcept {
    if (factors.first == 1.0F && factors.second == 1.0F) return;
    for (std::ptrdiff_t row = 0; row < rows; ++row, data += pitch)
        for (std::ptrdiff_t k = 0; k < floats; ++k) data[k] = data[k] * factors.first * factors.second;
}

void multiply_batch(const FftGeometry& batch, float* data, int count, FftFactors factors) noexcept {
    const auto floats = floats_of(batch.domain);
    if (batch.stride == 1)
        multiply_rows(data, count, batch.length * floats, batch.distance * floats, factors);
    else
        multiply_rows(data, batch.length, count * floats, batch.stride * floats, factors);
}

std::unique_ptr<FftTransform> make_fft_transform(FftEngine& engine, const FftGeometry& geometry) {
    const bool columns = geometry.stride != 1;
    if (geometry.domain == FftDomain::Real && !engine.takes_real()) return make_packed_real(engine, geometry);
    if (columns && geometry.domain == FftDomain::Complex && engine.wants_tile(geometry))
        return if_ready(std::make_unique<TiledColumns>(engine, geometry, tile_width(geometry.length)));
    const int block = columns ? column_block(geometry) : row_block(geometry);
    return if_ready(std::make_unique<BlockedTransform>(engine, geometry, block));
}

}  // namespace quo
