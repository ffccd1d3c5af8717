// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_CKERR_H
#define QUO_BASE_CKERR_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Diagnostics: the report and log files, the call frames of tracked functions, and tracked allocation.
 *
 * A program calls init_ckerr_locking() and init_report() first, exit_report() and exit_ckerr() last. In between
 * every function of the library that can fail enters its name on a stack of running calls, writes what went wrong
 * into the report, and on failure frees what it and its callees have allocated. A function of the program joins in
 * like this:
 *
 *     quo_check(errno, __LINE__, "focus()", "focus.c");     on entry: what an earlier call left behind
 *     errno = 0;
 *     set_ckerr_fun("focus()");
 *     ...                                                   quo_check and errno = 0 after each system call
 *     quo_add_report("No lines", QUO_ERROR, __LINE__, "focus()", "focus.c");      on failure, before it returns:
 *     quo_check(errno, __LINE__, "focus()", "focus.c");
 *     freeall_ckerr();
 *     deccurdep();
 *
 * and on success only quo_check and deccurdep(). Every path out needs its deccurdep(): a missing one leaves the
 * depth one too high for the rest of the process.
 *
 * Threads: every function here may be called by any number of threads at a time. Tracking, report and log belong
 * to the process; each entry is written in one piece and has a number of its own. The stack of running calls, with
 * its names, counters and depth, belongs to the thread, and so does the table of the blocks that its calls have
 * allocated: the table of a thread that has ended goes on with the next one that begins. Any thread may free a
 * block. A program turns tracking on before it starts threads, and off when they have ended. A thread for whose
 * stack there is no memory ends the process, with "Memory allocation failure" on the standard error stream.
 *
 * Strings are NUL-terminated byte strings, and none is kept by address beyond the call. A null text is shown as
 * "(null)". No function here changes errno, except that an allocation or opening that fails leaves its reason
 * there. */

/* ---- Tracked calls ---- */

/** Turns tracking on: empties the stack of running calls down to "main()" at depth 0, the call counters and the
 * table of tracked blocks, and sets the levels of report and log to 0 without closing a file. Does nothing while
 * tracking is on. Despite its name it makes no lock.
 * @return 0 */
QUO_BASE_API int init_ckerr_locking(void) QUO_NOEXCEPT;

/** Enters a function: the depth rises by one, the counter of functions entered at that depth too, and the name is
 * copied. Does nothing while tracking is off.
 *
 * Names and counters are kept for depths 0 to 63. Deeper calls are counted, so that deccurdep() finds back, but
 * share the last slot.
 * @param name  qualified name of the function, such as "DataFile::seek"; at most 127 bytes are kept, and no more
 * than 128 are read; null counts as empty
 * @return 1 */
QUO_BASE_API int set_ckerr_fun(const char* name) QUO_NOEXCEPT;

/** Leaves a function: the depth falls by one, whether or not tracking is on, but never below 0. */
QUO_BASE_API void deccurdep(void) QUO_NOEXCEPT;

/** @return 1 while tracking is on, else 0 */
QUO_BASE_API int ckflg_ckerr(void) QUO_NOEXCEPT;

/** Turns tracking off. If tracked blocks are left, lists them first on the standard error stream, in the order of
 * the tables: the name of the function that allocated the block and its call graph coordinates, which are the call
 * counters (modulo 65536) at depths 0 to the function's own. The blocks are not freed. Report and log stay as they
 * are. Does nothing while tracking is off. */
QUO_BASE_API void exit_ckerr(void) QUO_NOEXCEPT;

/* ---- Report and log ---- */

/** Opens the report: creates or empties the file and writes a banner with title, level and local time.
 *
 * Report and log share one title and one start time: opening the log after the report makes the
 * report count its elapsed seconds from then on and close with the log's title.
 * @param file_name  opened for appending first, so that a file that cannot be written stays as it is
 * @param title      at most 4095 bytes are kept
 * @param level      1, 2 or 3; all three write every kind of entry
 * @return the open level if the report is open already, which stays as it is; the level (normally 0) while
 * tracking is off; level - 1 for a level outside 1 to 3, and 0 if the file cannot be opened: the report is closed
 * then (level 0). Otherwise the report is open, and the result is that of writing the banner: 0 or EOF. To tell
 * success from failure, ask ckflg_report(). */
QUO_BASE_API int init_report(const char* file_name, const char* title, int level) QUO_NOEXCEPT;

/** Opens the log, as init_report() does the report: the file is created or emptied, but nothing written. A failure
 * leaves the shared title and start time as they are.
 * @return 1 when the log has been opened; otherwise as init_report(), of the log's level. */
QUO_BASE_API int init_log(const char* file_name, const char* title, int level) QUO_NOEXCEPT;

/** Writes the closing banner and closes the report, and the log if it is open; both levels are 0 afterwards. While
 * the report's level is not 1, 2 or 3, closes nothing, not even the log.
 * @return 0, or EOF if anything written to either file was lost (a full disk); level - 1 while the report's level
 * is not 1, 2 or 3, thus -1 for a closed report */
QUO_BASE_API int exit_report(void) QUO_NOEXCEPT;

/** @return level of the report: 1 to 3 while it is open, 0 while it is closed */
QUO_BASE_API int ckflg_report(void) QUO_NOEXCEPT;

/** Overwrites the level of the report without opening or closing anything. 0 silences all entries until the level
 * is set back.
 * @return the level */
QUO_BASE_API int set_flg_report(int level) QUO_NOEXCEPT;

/** Writes an entry into the report and flushes it. Entries are numbered from 0, with the whole seconds since the
 * start. Does nothing unless the report's level is 1, 2 or 3.
 *
 * ERROR entries take five lines, ERROR_CALL_TREE entries one without a number (though they use one up), all others
 * two. The messages of ERROR and MESSAGE entries also go to the standard error stream, as "MSG_ERROR: ...".
 * @param message         one line of text
 * @param kind            a QuoReportKind; any other value is written as UNKNOWN
 * @param line, function, file  the caller's source position, written as they stand */
QUO_BASE_API void quo_add_report(const char* message, int kind, int line, const char* function,
                                 const char* file) QUO_NOEXCEPT;

/** Reports a system error: an ERROR entry with the system's text for the number. 0 writes nothing. errno itself is
 * left to the caller. */
QUO_BASE_API void quo_check(int error_number, int line, const char* function, const char* file) QUO_NOEXCEPT;

/** Why the system refused what a function of the library could not do, for a message about it: ask once before the
 * call, to forget what is older, and again when its status is not 0.
 * @return the number that this thread last gave to quo_check() since this was asked before, whether or not a
 * report is open; 0 where there was none */
QUO_BASE_API int quo_take_system_error(void) QUO_NOEXCEPT;

/** Writes a numbered line into the log, after an empty one, and flushes it. The level is not looked at.
 * @return 0, or EOF if the log is not open or could not be written */
QUO_BASE_API int quo_add_log(const char* text) QUO_NOEXCEPT;

/* ---- Tracked allocation ----
 *
 * Blocks are aligned to 16 bytes and must go back through free_ckerr() or freeall_ckerr(), never through free().
 * While tracking is on, each is entered in its thread's table of 16384 together with the running function; an
 * allocation that finds the table full fails with an ERROR entry. Tracking must not be switched between a block's
 * allocation and its release. */

/** Allocates a block for the running function.
 * @return the block, uninitialised, owned by the caller; null if there is no memory or the table is full. Nothing
 * else is reported: that is the caller's business. A block that the system refused leaves a null entry in the
 * table. */
QUO_BASE_API void* malloc_ckerr(size_t size) QUO_NOEXCEPT;

/** As malloc_ckerr(), for `count` elements of `size` bytes, zero-filled. A product that overflows counts as
 * refused by the system.
 * @return the block, owned by the caller, or null as there */
QUO_BASE_API void* calloc_ckerr(size_t count, size_t size) QUO_NOEXCEPT;

/** Frees a block. While tracking is on, a block that is not in the table is neither freed nor reported,
 * and null takes the first null entry, if there is one, out of the table. The table's last entry
 * moves to the place of the one that goes. */
QUO_BASE_API void free_ckerr(void* block) QUO_NOEXCEPT;

/** Frees every block that the running call, and the calls made from it, have allocated on this thread and not yet
 * freed. Blocks of its callers, of earlier calls and of other threads stay. At depth 0, main(), every block of the
 * thread goes. Does nothing while tracking is
 * off. */
QUO_BASE_API void freeall_ckerr(void) QUO_NOEXCEPT;

/** Allocates a matrix as separate rows, zero-filled.
 * @return an array of `rows` pointers to rows of `row_bytes` each, all owned by the caller, to be freed with
 * matfree_ckerr(); an empty array for rows below 1; null if any allocation failed. While tracking is on, what was
 * made until then stays, for freeall_ckerr() to reclaim; otherwise it is freed. */
QUO_BASE_API void** matalloc_ckerr(int rows, size_t row_bytes) QUO_NOEXCEPT;

/** Frees the `rows` rows of a matrix in order, then the array of pointers; of a null array, only that. */
QUO_BASE_API void matfree_ckerr(void** rows_array, int rows) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
