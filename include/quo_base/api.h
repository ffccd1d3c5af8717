// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_API_H
#define QUO_BASE_API_H

/** @file
 * Linkage of the public declarations, and the types and status codes that every component shares.
 *
 * Plain functions have C linkage and can be called from C11; they let no exception out. Everything that is not
 * marked QUO_BASE_API stays hidden inside the library. */

#include <stddef.h>
#include <stdint.h>

/** Marks what the shared library exports. */
#if defined(QUO_BASE_BUILD)
#define QUO_BASE_API __attribute__((visibility("default")))
#else
#define QUO_BASE_API
#endif

#ifdef __cplusplus
#include <complex>
/** Begins declarations with C linkage, in C++ and in C. */
#define QUO_BASE_C_BEGIN extern "C" {
/** Ends what QUO_BASE_C_BEGIN began. */
#define QUO_BASE_C_END }
/** Marks a function that lets no exception out; empty in C. */
#define QUO_NOEXCEPT noexcept
/** Complex sample, single precision: real part, imaginary part, packed. */
using fcomplex = std::complex<float>;
/** Complex sample, double precision: real part, imaginary part, packed. */
using dcomplex = std::complex<double>;
#else
#define QUO_BASE_C_BEGIN
#define QUO_BASE_C_END
#define QUO_NOEXCEPT
/** Complex sample, single precision: real part, imaginary part, packed. */
typedef float _Complex fcomplex;
/** Complex sample, double precision: real part, imaginary part, packed. */
typedef double _Complex dcomplex;
#endif

/** Marks a printf-like function, so that the compiler checks its callers' arguments. */
#define QUO_PRINTF_LIKE(format_index, first_argument) __attribute__((format(printf, format_index, first_argument)))

/** What the int results of the library mean. */
enum QuoStatus {
    QUO_OK = 0,
    QUO_REFUSED = 1,      /**< bad argument, wrong state, missing data or header key */
    QUO_READ_FAILED = 4,  /**< short read, "File reading failed!" */
    QUO_WRITE_FAILED = 5, /**< short write, "File writing failed!" */
    QUO_NO_MEMORY = 7,    /**< an allocation failed */
    QUO_NOT_OPENED = 9,   /**< "File not opened!" */
    QUO_NUMERIC = 10,     /**< missing profile value, or numerical failure: singular matrix, no convergence */
    QUO_NOT_SEEN = 12     /**< the inverse geolocation found no time within the orbit */
};

/** Kinds of report entries. */
enum QuoReportKind {
    QUO_ERROR = 0,
    QUO_WARNING = 1,
    QUO_CHECKPOINT = 2,
    QUO_ERROR_CALL_TREE = 3,
    QUO_CORRECT_FUNCTION_CALL = 4,
    QUO_CORRECT_SYSTEM_CALL = 5,
    QUO_MESSAGE = 6,
    QUO_EXCEPTION = 22
};

#endif
