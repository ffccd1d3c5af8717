#ifndef QUO_TESTS_ONE_BASED_H
#define QUO_TESTS_ONE_BASED_H

#include <algorithm>
#include <cstddef>
#include <vector>

#include "quo_base/alloc_free.h"

namespace test {

using Flat = std::vector<double>;

/** A 1-based matrix, filled from a flat row-major one or with zeros. */
class OneBased {
public:
    OneBased(int rows, int columns) : rows_{rows}, columns_{columns}, data_{dmatrix(1, rows, 1, columns)} {
        std::fill_n(&data_[1][1], static_cast<std::ptrdiff_t>(rows) * columns, 0.0);
    }
    OneBased(const Flat& flat, int rows, int columns) : OneBased{rows, columns} {
        std::ranges::copy(flat, &data_[1][1]);
    }
    ~OneBased() { free_dmatrix(data_, 1, rows_, 1, columns_); }
    OneBased(const OneBased&) = delete;
    OneBased& operator=(const OneBased&) = delete;

    double** get() { return data_; }
    [[nodiscard]] Flat flat() const {
        return {&data_[1][1], &data_[1][1] + static_cast<std::ptrdiff_t>(rows_) * columns_};
    }

private:
    int rows_, columns_;
    double** data_;
};

}  // namespace test

#endif
