// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_ONE_BASED_H
#define QUO_TESTS_ONE_BASED_H

#include <cstddef>
#include <utility>
#include <vector>

namespace test {

using Flat = std::vector<double>;

/** A flat row-major matrix, or zeros, with the row pointers that make it 1-based. */
class OneBased {
public:
    OneBased(Flat flat, int rows, int columns) : flat_{std::move(flat)} {
        flat_.resize(static_cast<std::size_t>(rows) * static_cast<std::size_t>(columns));
        for (std::ptrdiff_t i = 0; i < rows; ++i) rows_.push_back(flat_.data() + i * columns - 1);
    }
    OneBased(int rows, int columns) : OneBased{{}, rows, columns} {}
    OneBased(const OneBased&) = delete;
    OneBased& operator=(const OneBased&) = delete;

    double** get() { return rows_.data() - 1; }
    [[nodiscard]] const Flat& flat() const { return flat_; }

private:
    Flat flat_;
    std::vector<double*> rows_;
};

}  // namespace test

#endif
