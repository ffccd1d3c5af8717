#ifndef QUO_BASE_CKERR_H
#define QUO_BASE_CKERR_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Diagnostics: the report and log files, the call frames of tracked functions, and tracked allocation.
 *
 * All state is process-wide and unguarded: the library is to be called from one thread at a time. Strings are
 * NUL-terminated byte strings; none is kept by address beyond the call unless said so. */

QUO_BASE_API int init_ckerr_locking(void) QUO_NOEXCEPT;
QUO_BASE_API int set_ckerr_fun(const char* name) QUO_NOEXCEPT;
QUO_BASE_API void deccurdep(void) QUO_NOEXCEPT;
QUO_BASE_API int ckflg_ckerr(void) QUO_NOEXCEPT;

QUO_BASE_API int init_report(const char* file_name, const char* title, int level) QUO_NOEXCEPT;
QUO_BASE_API int init_log(const char* file_name, const char* title, int level) QUO_NOEXCEPT;
QUO_BASE_API int exit_report(void) QUO_NOEXCEPT;
QUO_BASE_API int ckflg_report(void) QUO_NOEXCEPT;
QUO_BASE_API int set_flg_report(int level) QUO_NOEXCEPT;
QUO_BASE_API void quo_add_report(const char* message, int kind, int line, const char* function,
                                 const char* file) QUO_NOEXCEPT;
QUO_BASE_API int quo_add_log(const char* text) QUO_NOEXCEPT;
QUO_BASE_API void quo_check(int error_number, int line, const char* function, const char* file) QUO_NOEXCEPT;

QUO_BASE_API void* malloc_ckerr(size_t size) QUO_NOEXCEPT;
QUO_BASE_API void* calloc_ckerr(size_t count, size_t size) QUO_NOEXCEPT;
QUO_BASE_API void free_ckerr(void* block) QUO_NOEXCEPT;
QUO_BASE_API void freeall_ckerr(void) QUO_NOEXCEPT;
QUO_BASE_API void* matalloc_ckerr(int rows, size_t row_bytes) QUO_NOEXCEPT;
QUO_BASE_API void matfree_ckerr(void** rows_array, int rows) QUO_NOEXCEPT;
QUO_BASE_API void exit_ckerr(void) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
