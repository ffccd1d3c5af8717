// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_ALLOC_FREE_H
#define QUO_BASE_ALLOC_FREE_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Vectors, matrices and tensors whose index ranges the caller chooses, most often 1..n.
 *
 * Every block comes from the tracked allocator (quo_base/ckerr.h), so that what a failing routine leaves behind is
 * found, and leaks are listed. Contents are not initialised. Both bounds of a range belong to it.
 *
 * A vector nl..nh stands in one block of nh - nl + 2 elements, one of slack before v[nl]; a range with nh = nl - 1
 * is empty but valid. A matrix nrl..nrh by ncl..nch needs at least one row: a block of row pointers, one of slack
 * before m[nrl], and one block of rows x columns + 1 elements, one of slack before m[nrl][ncl], so that the rows
 * follow each other without gaps and m[nrl] + ncl is the start of a row-major array. A tensor adds one level of
 * the same kind.
 *
 * An allocator returns null while tracking is on, and ends the process with status 0 while it is off, when memory
 * cannot be had, when a range is shorter than empty or when its size in bytes cannot be expressed. No message is
 * written. Blocks already made by the failing call are released.
 *
 * A release function takes the same lower bounds as the allocator; upper bounds are accepted and ignored. Null is
 * accepted. Any number of threads may call at a time. "long" elements are 32-bit integers and "long double" ones
 * are doubles. */

QUO_BASE_API float* vector(int nl, int nh) QUO_NOEXCEPT;    /**< float elements nl..nh */
QUO_BASE_API int* ivector(int nl, int nh) QUO_NOEXCEPT;     /**< int elements nl..nh */
QUO_BASE_API int32_t* lvector(int nl, int nh) QUO_NOEXCEPT; /**< 32-bit integer elements nl..nh */
QUO_BASE_API double* dvector(int nl, int nh) QUO_NOEXCEPT;  /**< double elements nl..nh */
QUO_BASE_API double* ldvector(int nl, int nh) QUO_NOEXCEPT; /**< double elements nl..nh */
/** Byte elements nl..nh. Older versions placed the bytes as if they were 8-byte elements, which only its own
 * release function, and only for nl = 1, could find again; nothing depended on it, so it is a plain byte vector.
 */
QUO_BASE_API unsigned char* cvector(int nl, int nh) QUO_NOEXCEPT;

QUO_BASE_API void free_vector(float* v, int nl, int nh) QUO_NOEXCEPT;          /**< releases a vector() */
QUO_BASE_API void free_ivector(int* v, int nl, int nh) QUO_NOEXCEPT;           /**< releases an ivector() */
QUO_BASE_API void free_lvector(int32_t* v, int nl, int nh) QUO_NOEXCEPT;       /**< releases an lvector() */
QUO_BASE_API void free_dvector(double* v, int nl, int nh) QUO_NOEXCEPT;        /**< releases a dvector() */
QUO_BASE_API void free_ldvector(double* v, int nl, int nh) QUO_NOEXCEPT;       /**< releases an ldvector() */
QUO_BASE_API void free_cvector(unsigned char* v, int nl, int nh) QUO_NOEXCEPT; /**< releases a cvector() */

QUO_BASE_API float** matrix(int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;     /**< float matrix */
QUO_BASE_API int** imatrix(int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;      /**< int matrix */
QUO_BASE_API double** dmatrix(int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;   /**< double matrix */
QUO_BASE_API double** ldmatrix(int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;  /**< double matrix */
QUO_BASE_API fcomplex** cmatrix(int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT; /**< complex matrix */

/** Row pointers into an existing matrix, no data: result[newrl + k][newcl + j] is a[oldrl + k][oldcl + j] for k
 * from 0 to oldrh - oldrl. The matrix `a` stays the caller's and must outlive the result. oldch is not used. */
QUO_BASE_API float** submatrix(float** a, int oldrl, int oldrh, int oldcl, int oldch, int newrl,
                               int newcl) QUO_NOEXCEPT;

/** Row pointers over an existing row-major array of rows x columns floats: result[nrl][ncl] is a[0]. The array
 * stays the caller's and must outlive the result. */
QUO_BASE_API float** convert_matrix(float* a, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;

/** Float tensor with rows nrl..nrh, columns ncl..nch and depths ndl..ndh: t[row][column][depth], row-major without
 * gaps. Needs at least one row and one column. */
QUO_BASE_API float*** f3tensor(int nrl, int nrh, int ncl, int nch, int ndl, int ndh) QUO_NOEXCEPT;

/** Releases a matrix(). */
QUO_BASE_API void free_matrix(float** m, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases an imatrix(). */
QUO_BASE_API void free_imatrix(int** m, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases a dmatrix(). */
QUO_BASE_API void free_dmatrix(double** m, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases an ldmatrix(). */
QUO_BASE_API void free_ldmatrix(double** m, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases a cmatrix(). */
QUO_BASE_API void free_cmatrix(fcomplex** m, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases the row pointers of a submatrix(); the matrix under it stays. */
QUO_BASE_API void free_submatrix(float** b, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases the row pointers of a convert_matrix(); the array under it stays. */
QUO_BASE_API void free_convert_matrix(float** b, int nrl, int nrh, int ncl, int nch) QUO_NOEXCEPT;
/** Releases an f3tensor(). */
QUO_BASE_API void free_f3tensor(float*** t, int nrl, int nrh, int ncl, int nch, int ndl, int ndh) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
