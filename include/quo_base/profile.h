// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_PROFILE_H
#define QUO_BASE_PROFILE_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Parameter files ("profiles"): text files of sections and keys, kept in memory, and typed values in them.
 *
 *     [RasterInfo]
 *     NrOfPixelsPerLine = 1024
 *     Look = {1 2 3}
 *
 * A file is read when it is first named and stays in memory, with all changes, until FreeProfile; changes reach
 * the disk by SyncProfile. Files are known by the exact text of their path: two ways to write one path are two
 * entries. A missing file is an empty one. A file that is there but cannot be read (no right to, no descriptor
 * left, a read error, a folder, a regular file beyond 1 GiB, a pipe or device that gives more than 64 MiB) looks
 * empty too, but is never written: what it holds would be lost. In memory a file takes less than eight times its
 * size.
 *
 * Grammar. There is no comment syntax. Text before the first "[" is skipped. A "[" before an "=" opens a section,
 * even in the middle of a key name; its name runs to the next "]", and the rest of that line is skipped. A key
 * name runs to the first "=", its value from there to the end of the line. Names and values are trimmed of blanks,
 * not of tabs or carriage returns, and end at a NUL byte. A line that starts with "=" is skipped. Any other line
 * without "=", an empty one too, becomes the beginning of the next key's name, line feed included: an empty line
 * among keys therefore hides the key after it. Where a key stands twice in a section, or a section twice in a
 * file, the later one counts.
 *
 * Strings are NUL-terminated byte strings; names are compared byte by byte. A null section, key or file stands for
 * one that is not there and cannot be made. When memory runs out the message "Memory allocation failure" (or
 * "Memory re-allocation failure", when a text outgrows its buffer) goes to the standard error stream and the
 * process ends with status 1.
 *
 * Threads: the files belong to the process, and any number of threads may call these functions at a time; they
 * take turns. A value that GetSetProfileChar gives is only safe as long as no other thread changes or frees it;
 * the typed accessors copy it out under the same turn. */

/* ---- The store ---- */

/** Looks a value up (`write` 0; `value` is not used) or sets it (any other `write`), in memory.
 *
 * Reading searches the sections of that name from the last one in the file to the first. Writing replaces the
 * value in the last section of that name, or adds the key at its end, or a new section at the end of the file.
 *
 * @return the value, owned by the store and valid until the key is changed or deleted or the file freed. Null when
 * the key is not there, or when there is nothing to write (a null argument). */
QUO_BASE_API const char* GetSetProfileChar(int write, const char* section, const char* key, const char* value,
                                           const char* file) QUO_NOEXCEPT;

/** Writes a file back: an empty line and a line "[section]" before each section, "key = value" for each key, in
 * the order of reading, what is new at the end. The disk file is replaced in one step: whatever fails, the old one
 * stays whole. Where nothing can be put in its place but the file itself can be written (a folder without the
 * right to write, a device), it is written in place, with a WARNING entry. Processes do not see each other's
 * changes: of two that save one file the last one wins. Hard links to the file are broken, symbolic ones kept.
 *
 * With null, all files are written, in the order of loading.
 *
 * @return With a path: 0 when written or when no such file is in memory; 1 when it cannot be opened for writing,
 * is a folder or pipe, or could not be read; -1 when writing failed. With null, inverted and of the file loaded
 * last alone: -1 when it was written (or there is none), 0 when it could not be opened or written. */
QUO_BASE_API int SyncProfile(const char* file) QUO_NOEXCEPT;

/** Forgets a file without writing it (all files when null). Its next use reads it again from the disk. */
QUO_BASE_API void FreeProfile(const char* file) QUO_NOEXCEPT;

/** Removes a key's last occurrence from the last section of that name, in memory; earlier sections of the name are
 * not searched. Writes "Warning: DelProfileKey called before init" to the standard error stream when the file is
 * not in memory. */
QUO_BASE_API void DelProfileKey(const char* section, const char* key, const char* file) QUO_NOEXCEPT;

/** Removes the last section of that name with its keys, in memory. Writes "Warning: DelProfileSection called
 * before init" to the standard error stream when the file is not in memory. */
QUO_BASE_API void DelProfileSection(const char* section, const char* file) QUO_NOEXCEPT;

/* ---- Typed values ----
 *
 * A list is written {1 2 3}, a list of strings {"a" "b c"}; scalars have no braces and are read as lists of one. A
 * matrix of R rows is written row by row, each in braces, the rows joined by a line feed and a tab; element (r, c)
 * is taken from position r + c * R. A matrix is written only: its value spans lines, which a file does not give
 * back. float carries 7 significant digits, double 15, in the shortest of "%.*g"'s forms.
 *
 * All return 0, or 10 when the key is not there (silently), when a list has too few elements or when the store
 * refuses a value. The last two are WARNING entries:
 *
 *     Read only %d elements of %d - SEC: %s, KEY: %s, FILE: %s
 *     Parameter writing failed - SEC: %s, KEY: %s, FILE: %s
 *
 * Writers change memory only. A count below 1 is an empty list.
 *
 * Numeric readers take an opening brace or none, then numbers separated by blanks and tabs, and stop at the first
 * word that does not begin with a number or when `count` are read; what follows a number within its word is
 * ignored. Elements read before a failure (status 10: too few) stay in `values`, those after them are not touched;
 * a key that is not there leaves all as they were. Integers beyond the type's
 * range are read as its nearest bound, numbers beyond the floating range as infinity; every locale reads and
 * writes a point. */

/** Copies a value into `buffer` of `size` bytes, cut to size - 1 and filled up with NUL bytes.
 * A cut never splits a character that is whole in UTF-8; text in another encoding is cut at that byte.
 * @return 0; 10 when the key is not there or `size` is below 1, with nothing written. */
QUO_BASE_API int GetMyProfileString(const char* section, const char* key, char* buffer, int size,
                                    const char* file) QUO_NOEXCEPT;
/** Stores the value as it stands. */
QUO_BASE_API int WriteMyProfileString(const char* section, const char* key, const char* value,
                                      const char* file) QUO_NOEXCEPT;
/** Stores the value between double quotes, which reading gives back. */
QUO_BASE_API int WriteMyProfileStringQuote(const char* section, const char* key, const char* value,
                                           const char* file) QUO_NOEXCEPT;

/** Reads `count` strings, each into `strings[i]` of `room` bytes, cut to room - 1.
 *
 * Strings that are not read keep their content; a room below 1 leaves all as they are.
 *
 * @return 0 when all are read; 10 as above. Kept as callers know it: a closing brace before `count` strings
 * returns the number read so far, unreported; a value without an opening brace, and any other character than a
 * blank between the strings, ends the reading with 0. */
QUO_BASE_API int GetMyProfileStringArray(const char* section, const char* key, char* const* strings, int count,
                                         int room, const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` strings. */
QUO_BASE_API int WriteMyProfileStringArray(const char* section, const char* key, const char* const* strings,
                                           int count, const char* file) QUO_NOEXCEPT;
/** Writes a matrix of strings, `strings[r + c * rows]`. */
QUO_BASE_API int WriteMyProfileStringMatrix(const char* section, const char* key, const char* const* strings,
                                            int rows, int columns, const char* file) QUO_NOEXCEPT;

/** Reads `count` integers into `values`. */
QUO_BASE_API int GetMyProfileIntArray(const char* section, const char* key, int* values, int count,
                                      const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` integers. */
QUO_BASE_API int WriteMyProfileIntArray(const char* section, const char* key, const int* values, int count,
                                        const char* file) QUO_NOEXCEPT;
/** Writes one integer. */
QUO_BASE_API int WriteMyProfileInt(const char* section, const char* key, int value, const char* file) QUO_NOEXCEPT;

/** Reads `count` 64-bit integers into `values`. */
QUO_BASE_API int GetMyProfileInt64Array(const char* section, const char* key, int64_t* values, int count,
                                        const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` 64-bit integers. */
QUO_BASE_API int WriteMyProfileInt64Array(const char* section, const char* key, const int64_t* values, int count,
                                          const char* file) QUO_NOEXCEPT;
/** Writes one 64-bit integer. */
QUO_BASE_API int WriteMyProfileInt64(const char* section, const char* key, int64_t value,
                                     const char* file) QUO_NOEXCEPT;

/** Reads `count` integers into `values`: "long" has 32 bits here. */
QUO_BASE_API int GetMyProfileLongArray(const char* section, const char* key, int32_t* values, int count,
                                       const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` integers: "long" has 32 bits here. */
QUO_BASE_API int WriteMyProfileLongArray(const char* section, const char* key, const int32_t* values, int count,
                                         const char* file) QUO_NOEXCEPT;

/** Reads `count` numbers into `values`, each rounded to the nearest float. */
QUO_BASE_API int GetMyProfileFloatArray(const char* section, const char* key, float* values, int count,
                                        const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` numbers with 7 significant digits. */
QUO_BASE_API int WriteMyProfileFloatArray(const char* section, const char* key, const float* values, int count,
                                          const char* file) QUO_NOEXCEPT;

/** Reads `count` numbers into `values`. */
QUO_BASE_API int GetProfileDoubleArray(const char* section, const char* key, double* values, int count,
                                       const char* file) QUO_NOEXCEPT;
/** Writes a list of `count` numbers with 15 significant digits. */
QUO_BASE_API int WriteProfileDoubleArray(const char* section, const char* key, const double* values, int count,
                                         const char* file) QUO_NOEXCEPT;
/** Writes one number with 15 significant digits. */
QUO_BASE_API int WriteMyProfileDouble(const char* section, const char* key, double value,
                                      const char* file) QUO_NOEXCEPT;
/** Writes a matrix of numbers, `values[r + c * rows]`. */
QUO_BASE_API int WriteMyProfileDoubleMatrix(const char* section, const char* key, const double* values, int rows,
                                            int columns, const char* file) QUO_NOEXCEPT;

/* ---- "Check" forms ----
 *
 * The same, but any result other than 0 writes "Error in ...: section ..., key ..., file ..." to the standard
 * error stream and ends the process with status 1. Some messages name another function: scripts look for these
 * texts. */

/** GetMyProfileString, checked. */
QUO_BASE_API void GetCheckMyProfileString(const char* section, const char* key, char* buffer, int size,
                                          const char* file) QUO_NOEXCEPT;
/** WriteMyProfileString, checked; the message shows the string. */
QUO_BASE_API void WriteCheckMyProfileString(const char* section, const char* key, const char* value,
                                            const char* file) QUO_NOEXCEPT;
/** GetMyProfileStringArray, checked: a closing brace that comes too early, after one string or more, is a failure
 * too. */
QUO_BASE_API void GetCheckMyProfileStringArray(const char* section, const char* key, char* const* strings,
                                               int count, int room, const char* file) QUO_NOEXCEPT;
/** GetMyProfileIntArray, checked. */
QUO_BASE_API void GetCheckMyProfileIntArray(const char* section, const char* key, int* values, int count,
                                            const char* file) QUO_NOEXCEPT;
/** GetMyProfileInt64Array, checked. */
QUO_BASE_API void GetCheckMyProfileInt64Array(const char* section, const char* key, int64_t* values, int count,
                                              const char* file) QUO_NOEXCEPT;
/** GetMyProfileLongArray, checked; the message names GetMyProfileIntArray. */
QUO_BASE_API void GetCheckMyProfileLongArray(const char* section, const char* key, int32_t* values, int count,
                                             const char* file) QUO_NOEXCEPT;
/** WriteMyProfileIntArray, checked. */
QUO_BASE_API void WriteCheckMyProfileIntArray(const char* section, const char* key, const int* values, int count,
                                              const char* file) QUO_NOEXCEPT;
/** WriteMyProfileInt64Array, checked. */
QUO_BASE_API void WriteCheckMyProfileInt64Array(const char* section, const char* key, const int64_t* values,
                                                int count, const char* file) QUO_NOEXCEPT;
/** WriteMyProfileInt, checked; the message shows the value. */
QUO_BASE_API void WriteCheckMyProfileInt(const char* section, const char* key, int value,
                                         const char* file) QUO_NOEXCEPT;
/** WriteMyProfileInt64, checked; the message shows the value. */
QUO_BASE_API void WriteCheckMyProfileInt64(const char* section, const char* key, int64_t value,
                                           const char* file) QUO_NOEXCEPT;
/** WriteMyProfileLongArray, checked. */
QUO_BASE_API void WriteCheckMyProfileLongArray(const char* section, const char* key, const int32_t* values,
                                               int count, const char* file) QUO_NOEXCEPT;
/** GetMyProfileFloatArray, checked. */
QUO_BASE_API void GetCheckMyProfileFloatArray(const char* section, const char* key, float* values, int count,
                                              const char* file) QUO_NOEXCEPT;
/** WriteMyProfileDouble, checked; the message shows the value. */
QUO_BASE_API void WriteCheckMyProfileDouble(const char* section, const char* key, double value,
                                            const char* file) QUO_NOEXCEPT;
/** WriteMyProfileFloatArray, checked; the message names WriteMyProfileDouble. */
QUO_BASE_API void WriteCheckMyProfileFloatArray(const char* section, const char* key, const float* values,
                                                int count, const char* file) QUO_NOEXCEPT;
/** WriteProfileDoubleArray, checked; the message names WriteMyProfileDouble. */
QUO_BASE_API void WriteCheckMyProfileDoubleArray(const char* section, const char* key, const double* values,
                                                 int count, const char* file) QUO_NOEXCEPT;
/** GetProfileDoubleArray, checked; the message names WriteMyProfileDouble. */
QUO_BASE_API void GetCheckMyProfileDoubleArray(const char* section, const char* key, double* values, int count,
                                               const char* file) QUO_NOEXCEPT;

/* ---- Short forms ----
 *
 * The arguments in another order; `ignored` is not used. All return 0 or 10 as the functions above do, and leave
 * the same unchanged. The Set forms write and then call SyncProfile(file), so that the change is on the disk at
 * once; they return the status of the write, not of the sync: call SyncProfile(file) to learn whether it is. */

/** Reads a string into `buffer` of 512 bytes; `count` is not used. */
QUO_BASE_API int GetParString(const char* file, const char* key, int count, char* buffer, int ignored,
                              const char* section) QUO_NOEXCEPT;
/** Writes a string; `count` is not used. */
QUO_BASE_API int SetParString(const char* file, const char* key, int count, const char* value, int ignored,
                              const char* section) QUO_NOEXCEPT;
/** Reads `count` integers into `values`. */
QUO_BASE_API int GetParInt(const char* file, const char* key, int count, int* values, int ignored,
                           const char* section) QUO_NOEXCEPT;
/** Writes a list of `count` integers. */
QUO_BASE_API int SetParInt(const char* file, const char* key, int count, const int* values, int ignored,
                           const char* section) QUO_NOEXCEPT;
/** Reads `count` numbers into `values`, each rounded to the nearest float. */
QUO_BASE_API int GetParFloat(const char* file, const char* key, int count, float* values, int ignored,
                             const char* section) QUO_NOEXCEPT;
/** Writes a list of `count` numbers with 7 significant digits. */
QUO_BASE_API int SetParFloat(const char* file, const char* key, int count, const float* values, int ignored,
                             const char* section) QUO_NOEXCEPT;
/** Reads `count` numbers into `values`. */
QUO_BASE_API int GetParDouble(const char* file, const char* key, int count, double* values, int ignored,
                              const char* section) QUO_NOEXCEPT;
/** Writes a list of `count` numbers with 15 significant digits. */
QUO_BASE_API int SetParDouble(const char* file, const char* key, int count, const double* values, int ignored,
                              const char* section) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
