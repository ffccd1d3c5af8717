// SPDX-License-Identifier: Apache-2.0
#include "quo_base/alloc_free.h"

#include <cstdint>
#include <cstdlib>
#include <optional>

#include "diagnosticslib/call_frame.h"
#include "sarutillib/ground/checked_size.h"

namespace {

// Reports name this source so; programs that read them look for it.
constexpr const char* kSource = R"(..\..\..\libsrc\sources\matrixlib\alloc_free)";

using Count = quo::Checked<std::int64_t>;

// Number of indices in low..high, which may be empty but not shorter.
std::optional<std::int64_t> range_length(int low, int high) {
    const std::int64_t length = std::int64_t{high} - low + 1;
    return length >= 0 ? std::optional{length} : std::nullopt;
}

// Bytes of one element; elements may be pointers to rows.
template <typename T>
constexpr std::int64_t kElement = static_cast<std::int64_t>(sizeof(T));  // NOLINT(bugprone-sizeof-expression)

// A pointer moved by whole elements. Pointers to an element 0 that is not there lie outside their block, hence the
// arithmetic on the address.
template <typename T>
T* moved_by(T* pointer, std::int64_t elements) {
    const auto address =
        reinterpret_cast<std::uintptr_t>(pointer) + static_cast<std::uintptr_t>(elements * kElement<T>);
    return reinterpret_cast<T*>(address);  // NOLINT(performance-no-int-to-ptr)
}

// The pointer whose element `low` is the block's second element, and the block of such a pointer.
template <typename T>
T* offset_by(T* block, int low) {
    return moved_by(block, 1 - std::int64_t{low});
}
template <typename T>
T* block_of(T* pointer, int low) {
    return moved_by(pointer, std::int64_t{low} - 1);
}

// Bytes of a block of `length` elements and one of slack, or nothing when they cannot be expressed.
template <typename T>
std::optional<std::int64_t> block_bytes(Count length) {
    return ((length + 1) * kElement<T>).value();
}

// A block of `length` elements and one of slack before them.
template <typename T>
T* make_block(Count length) {
    const auto bytes = block_bytes<T>(length);
    return bytes ? static_cast<T*>(malloc_ckerr(static_cast<std::size_t>(*bytes))) : nullptr;
}

// rows pointers to consecutive stretches of `width` elements, the first at block[1], each moved so that `low`
// indexes its first element.
template <typename T>
void chain(T** rows_block, std::int64_t rows, T* block, std::int64_t width, int low) {
    T* first = offset_by(block, low);
    for (std::int64_t i = 0; i < rows; ++i) rows_block[1 + i] = first + i * width;
}

// The memory that a process cannot do without: while tracking is off it ends here, silently and with status 0.
template <typename T>
T* or_end(T* made) {
    if (!made && ckflg_ckerr() == 0) std::exit(0);
    return made;
}

template <typename T>
T* make_vector(const quo::SharedCall& name, int nl, int nh) {
    const auto build = [&]() -> T* {
        quo::CallFrame frame{name, kSource};
        const auto length = range_length(nl, nh);
        T* block = length ? make_block<T>(*length) : nullptr;
        if (!block) return nullptr;
        static_cast<void>(frame.success());
        return offset_by(block, nl);
    };
    return or_end(build());
}

template <typename T>
T** make_matrix(const quo::SharedCall& name, int nrl, int nrh, int ncl, int nch) {
    const auto build = [&]() -> T** {
        quo::CallFrame frame{name, kSource};
        const auto rows = range_length(nrl, nrh);
        const auto columns = range_length(ncl, nch);
        // The data's size is looked at first, so that no row pointers are made for what cannot be.
        if (!rows || !columns || *rows < 1 || !block_bytes<T>(Count{*rows} * *columns)) return nullptr;
        T** row_block = make_block<T*>(*rows);
        T* data = row_block ? make_block<T>(Count{*rows} * *columns) : nullptr;
        if (!data) return nullptr;
        chain(row_block, *rows, data, *columns, ncl);
        static_cast<void>(frame.success());
        return offset_by(row_block, nrl);
    };
    return or_end(build());
}

template <typename T>
void release_vector(T* v, int nl) {
    if (v) free_ckerr(block_of(v, nl));
}

template <typename T>
void release_matrix(T** m, int nrl, int ncl) {
    if (!m) return;
    free_ckerr(block_of(m[nrl], ncl));
    free_ckerr(block_of(m, nrl));
}

// Row pointers over memory of the caller's: row k is `first` moved by k times what `row(k)` tells.
template <typename Row>
float** make_row_pointers(const quo::SharedCall& name, int low, std::optional<std::int64_t> rows, Row row) {
    const auto build = [&]() -> float** {
        quo::CallFrame frame{name, kSource};
        float** block = rows ? make_block<float*>(*rows) : nullptr;
        if (!block) return nullptr;
        for (std::int64_t k = 0; k < *rows; ++k) block[1 + k] = row(k);
        static_cast<void>(frame.success());
        return offset_by(block, low);
    };
    return or_end(build());
}

}  // namespace

extern "C" {

float* vector(int nl, int nh) noexcept { return make_vector<float>("vector", nl, nh); }
int* ivector(int nl, int nh) noexcept { return make_vector<int>("ivector", nl, nh); }
int32_t* lvector(int nl, int nh) noexcept { return make_vector<std::int32_t>("lvector", nl, nh); }
double* dvector(int nl, int nh) noexcept { return make_vector<double>("dvector", nl, nh); }
double* ldvector(int nl, int nh) noexcept { return make_vector<double>("ldvector", nl, nh); }
unsigned char* cvector(int nl, int nh) noexcept { return make_vector<unsigned char>("cvector", nl, nh); }

void free_vector(float* v, int nl, int) noexcept { release_vector(v, nl); }
void free_ivector(int* v, int nl, int) noexcept { release_vector(v, nl); }
void free_lvector(int32_t* v, int nl, int) noexcept { release_vector(v, nl); }
void free_dvector(double* v, int nl, int) noexcept { release_vector(v, nl); }
void free_ldvector(double* v, int nl, int) noexcept { release_vector(v, nl); }
void free_cvector(unsigned char* v, int nl, int) noexcept { release_vector(v, nl); }

float** matrix(int nrl, int nrh, int ncl, int nch) noexcept {
    return make_matrix<float>("matrix", nrl, nrh, ncl, nch);
}
int** imatrix(int nrl, int nrh, int ncl, int nch) noexcept {
    return make_matrix<int>("imatrix", nrl, nrh, ncl, nch);
}
double** dmatrix(int nrl, int nrh, int ncl, int nch) noexcept {
    return make_matrix<double>("dmatrix", nrl, nrh, ncl, nch);
}
double** ldmatrix(int nrl, int nrh, int ncl, int nch) noexcept {
    return make_matrix<double>("ldmatrix", nrl, nrh, ncl, nch);
}
fcomplex** cmatrix(int nrl, int nrh, int ncl, int nch) noexcept {
    return make_matrix<fcomplex>("cmatrix", nrl, nrh, ncl, nch);
}

float** submatrix(float** a, int oldrl, int oldrh, int oldcl, int, int newrl, int newcl) noexcept {
    return make_row_pointers("submatrix", newrl, range_length(oldrl, oldrh), [&](std::int64_t k) {
        // Column newcl of the result is column oldcl of the old row.
        return offset_by(block_of(a[oldrl + k], oldcl), newcl);
    });
}

float** convert_matrix(float* a, int nrl, int nrh, int ncl, int nch) noexcept {
    const auto columns = range_length(ncl, nch);
    return make_row_pointers("convert_matrix", nrl, columns ? range_length(nrl, nrh) : std::nullopt,
                             [&](std::int64_t k) { return offset_by(a + k * *columns, ncl) - 1; });
}

float*** f3tensor(int nrl, int nrh, int ncl, int nch, int ndl, int ndh) noexcept {
    const auto build = [&]() -> float*** {
        quo::CallFrame frame{"f3tensor", kSource};
        const auto rows = range_length(nrl, nrh);
        const auto columns = range_length(ncl, nch);
        const auto depths = range_length(ndl, ndh);
        if (!rows || !columns || !depths || *rows < 1 || *columns < 1) return nullptr;
        const Count row_count = Count{*rows} * *columns;
        if (!block_bytes<float>(row_count * *depths)) return nullptr;
        float*** top = make_block<float**>(*rows);
        float** row_block = top ? make_block<float*>(row_count) : nullptr;
        float* data = row_block ? make_block<float>(row_count * *depths) : nullptr;
        if (!data) return nullptr;
        chain(top, *rows, row_block, *columns, ncl);
        chain(row_block, *row_count.value(), data, *depths, ndl);
        static_cast<void>(frame.success());
        return offset_by(top, nrl);
    };
    return or_end(build());
}

void free_matrix(float** m, int nrl, int, int ncl, int) noexcept { release_matrix(m, nrl, ncl); }
void free_imatrix(int** m, int nrl, int, int ncl, int) noexcept { release_matrix(m, nrl, ncl); }
void free_dmatrix(double** m, int nrl, int, int ncl, int) noexcept { release_matrix(m, nrl, ncl); }
void free_ldmatrix(double** m, int nrl, int, int ncl, int) noexcept { release_matrix(m, nrl, ncl); }
void free_cmatrix(fcomplex** m, int nrl, int, int ncl, int) noexcept { release_matrix(m, nrl, ncl); }
void free_submatrix(float** b, int nrl, int, int, int) noexcept { release_vector(b, nrl); }
void free_convert_matrix(float** b, int nrl, int, int, int) noexcept { release_vector(b, nrl); }

void free_f3tensor(float*** t, int nrl, int, int ncl, int, int ndl, int) noexcept {
    if (!t) return;
    free_ckerr(block_of(t[nrl][ncl], ndl));
    free_ckerr(block_of(t[nrl], ncl));
    free_ckerr(block_of(t, nrl));
}

}  // extern "C"
