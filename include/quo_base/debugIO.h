// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_DEBUGIO_H
#define QUO_BASE_DEBUGIO_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Debug dumps of arrays, and a progress display that a parent process draws.
 *
 * A dump is three 32-bit signed words in the host's byte order (element type code, first and second dimension),
 * then the elements as they lie in memory. The progress display is driven by command lines on the standard error
 * stream, each in one piece. Any number of threads may call at a time, with files of their own. */

/** Size in bytes of one element of a dump, or 0 for a code that is not valid.
 * Codes 0 to 5 stand for 4, 8, 8, 16, 2 and 1 bytes: by use FLOAT32, FLOAT64, FLOAT_COMPLEX, DOUBLE_COMPLEX, INT16
 * and INT8, though only the size is part of the format. */
QUO_BASE_API size_t debug_element_size(int type) QUO_NOEXCEPT;

/** Dumps an array into a file, replacing one that exists.
 *
 * @param[in] file_name  the file to create
 * @param[in] data       first * second elements; may be null when there are none
 * @param[in] type       element type code, 0 to 5
 * @param[in] first, second  dimensions, >= 0, the second running fastest by convention
 * @return 0; 1 for a type code that is not valid, a negative dimension or missing data, with nothing written;
 *         9 "File not opened!" when the file cannot be created; 5 "File writing failed!" when a write is short. */
QUO_BASE_API int write_debug(const char* file_name, const void* data, int type, int first,
                             int second) QUO_NOEXCEPT;

/** Asks the parent process for a progress display: the lines "USE_WAITBAR" and "SET_TITLE: title". Of a title
 * at most 499 bytes are sent. Returns 0. */
QUO_BASE_API int waitbar_open(const char* title) QUO_NOEXCEPT;

/** Tells the progress: the line "SET_WAITBAR: value " with six decimals. The library passes the value on
 * unchanged; its own tools give a fraction from 0 to 1. Returns 0. */
QUO_BASE_API int waitbar_update(float value) QUO_NOEXCEPT;

/** Ends the display: the line "CLOSE_WAITBAR". Returns 0. */
QUO_BASE_API int waitbar_close(void) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
