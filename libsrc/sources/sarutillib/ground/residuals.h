// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_RESIDUALS_H
#define QUO_RESIDUALS_H

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace quo {

/** Size of a quantity's residuals. */
class Residuals {
public:
    void add(double difference) {
        largest_ = std::max(largest_, std::abs(difference));
        squares_ += difference * difference;
        ++count_;
    }
    [[nodiscard]] double largest() const { return largest_; }
    [[nodiscard]] double rms() const {
        return count_ > 0 ? std::sqrt(squares_ / static_cast<double>(count_)) : 0.0;
    }
    [[nodiscard]] std::int64_t count() const { return count_; }

private:
    double largest_ = 0.0, squares_ = 0.0;
    std::int64_t count_ = 0;
};

}  // namespace quo

#endif
