// SPDX-License-Identifier: Apache-2.0
#include "quo_base/alloc_free.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <numeric>
#include <utility>

#include "support/diagnostics.h"

namespace {

// Every element is written, so that the sanitizer sees a block that is too short, and the report sees a leak.
template <typename T>
void check_vector(T* (*make)(int, int) noexcept, void (*release)(T*, int, int) noexcept) {
    const test::Report report;
    for (const auto& [low, high] : {std::pair{1, 7}, {0, 6}, {-5, 3}, {1000003, 1000017}, {4, 3}}) {
        T* v = make(low, high);
        ASSERT_NE(v, nullptr);
        for (int i = low; i <= high; ++i) v[i] = T(i % 100);
        for (int i = low; i <= high; ++i) EXPECT_EQ(v[i], T(i % 100));
        release(v, low, high);
    }
}
TEST(Vectors, HoldTheirRangeAndAreReleased) {
    check_vector(vector, free_vector);
    check_vector(ivector, free_ivector);
    check_vector(lvector, free_lvector);
    check_vector(dvector, free_dvector);
    check_vector(ldvector, free_ldvector);
    check_vector(cvector, free_cvector);
}

template <typename T>
void check_matrix(T** (*make)(int, int, int, int) noexcept, void (*release)(T**, int, int, int, int) noexcept) {
    const test::Report report;
    T** m = make(-2, 1, 3, 8);
    ASSERT_NE(m, nullptr);
    for (int k = 0; k < 4 * 6; ++k) m[k / 6 - 2][3 + k % 6] = static_cast<T>(static_cast<float>(k));
    for (int k = 0; k < 4 * 6; ++k)
        EXPECT_EQ(m[-2][3 + k], static_cast<T>(static_cast<float>(k))) << "without gaps";
    release(m, -2, 1, 3, 8);
    EXPECT_FALSE(make(1, 0, 1, 4) || make(1, 3, 1, -1) || make(INT_MIN, INT_MAX, INT_MIN, INT_MAX));
}
TEST(Matrices, AreRowMajorWithoutGapsAndAreReleased) {
    check_matrix(matrix, free_matrix);
    check_matrix(imatrix, free_imatrix);
    check_matrix(dmatrix, free_dmatrix);
    check_matrix(ldmatrix, free_ldmatrix);
    check_matrix(cmatrix, free_cmatrix);
}

TEST(Matrices, AddressATensorAndTheMatrixUnderThem) {
    const test::Report report;
    float*** t = f3tensor(2, 4, -1, 0, 5, 9);
    ASSERT_NE(t, nullptr);
    std::iota(&t[2][-1][5], &t[2][-1][5] + 3 * 2 * 5, 0.0F);
    for (int k = 0; k < 3 * 2 * 5; ++k) EXPECT_EQ(t[2 + k / 10][k / 5 % 2 - 1][5 + k % 5], static_cast<float>(k));
    free_f3tensor(t, 2, 4, -1, 0, 5, 9);

    float data[12] = {};
    float** whole = convert_matrix(data, 1, 3, 1, 4);
    float** part = submatrix(whole, 2, 3, 3, 4, 11, 21);
    EXPECT_TRUE(&whole[1][1] == data && &whole[3][4] == data + 11);
    EXPECT_TRUE(&part[11][21] == &whole[2][3] && &part[12][22] == &whole[3][4]);
    free_submatrix(part, 11, 12, 21, 22);
    free_convert_matrix(whole, 1, 3, 1, 4);
}

// A failing second or third block must not leave the first ones behind.
TEST(Allocators, RefuseWhatCannotBeWhileTrackingAndLeaveNothing) {
    const test::Report report;
    EXPECT_FALSE(dvector(1, -1) || dvector(5, INT_MIN));
    EXPECT_FALSE(f3tensor(1, INT_MAX, 1, INT_MAX, 1, INT_MAX) || f3tensor(1, 2, 1, 0, 1, 2) ||
                 f3tensor(1, 0, 1, 2, 1, 2) || f3tensor(1, 2, 1, 2, 1, INT_MIN));
    EXPECT_EQ(convert_matrix(nullptr, 1, 0, 3, 1), nullptr);
    test::fail_every_allocation([] {
        double** m = dmatrix(1, 3, 1, 4);
        float*** t = m ? f3tensor(1, 2, 1, 3, 1, 4) : nullptr;
        free_f3tensor(t, 1, 2, 1, 3, 1, 4);
        free_dmatrix(m, 1, 3, 1, 4);
        return t ? 0 : 7;
    });
}

TEST(AllocatorsDeathTest, EndTheProcessWithStatusZeroWhileNotTracking) {
    EXPECT_EXIT(static_cast<void>(dvector(1, -1)), testing::ExitedWithCode(0), "^$");
    EXPECT_EXIT(static_cast<void>(dmatrix(1, INT_MAX, 1, INT_MAX)), testing::ExitedWithCode(0), "");
}

}  // namespace
