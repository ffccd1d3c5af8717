// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_TRANSFORM_H
#define QUO_EXAMPLES_TRANSFORM_H

#include <cstddef>
#include <memory>

#include "../common/session.h"
#include "quo_base/fft.h"

namespace example {

/** A block of samples that transforms run in, aligned for them. They are whatever the memory held: who fills them
 * first, on its own thread, has the memory near. */
class Block {
public:
    Block(int lines, int samples)
        : lines_{lines},
          samples_{samples},
          data_{static_cast<fcomplex*>(fft_malloc(static_cast<std::size_t>(lines) *
                                                  static_cast<std::size_t>(samples) * sizeof(fcomplex)))} {
        if (!data_) throw Failure{"no memory for a block"};
    }
    [[nodiscard]] int lines() const { return lines_; }
    [[nodiscard]] int samples() const { return samples_; }
    [[nodiscard]] std::size_t size() const { return offset(lines_); }
    [[nodiscard]] fcomplex* data() { return data_.get(); }
    [[nodiscard]] fcomplex* line(int index) { return data_.get() + offset(index); }

private:
    struct Free {
        void operator()(fcomplex* buffer) const { fft_free(buffer); }
    };
    [[nodiscard]] std::size_t offset(int lines) const {
        return static_cast<std::size_t>(lines) * static_cast<std::size_t>(samples_);
    }
    int lines_, samples_;
    std::unique_ptr<fcomplex[], Free> data_;
};

/** A plan for transforms within blocks of one shape: +1 forward, -2 inverse without a factor, 0 none. */
class Transform {
public:
    Transform(int lines, int samples, int along_lines, int down_columns) {
        require(fft_makep_c(&plan_, samples, samples, lines, lines, along_lines, down_columns, 1), "an FFT plan");
    }
    ~Transform() { fft_destp_c(&plan_); }
    Transform(const Transform&) = delete;
    Transform& operator=(const Transform&) = delete;

    void run(Block& block) const { require(pfft_c(&plan_, block.data(), block.data()), "a transform"); }

private:
    FftPlan plan_{};
};

}  // namespace example

#endif
