// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GEN_UTILS_H
#define QUO_BASE_GEN_UTILS_H

#include <stdio.h>

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Byte order, number classes, time, and file names.
 *
 * Byte-order codes are single characters: 'l' least significant byte first, 'm' most significant byte first.
 * Byte buffers need no alignment. Lengths and counts of zero or below stand for nothing to do.
 *
 * Three time notations are converted into each other. None counts leap seconds: every day has 86400 seconds.
 * - sec85: double, seconds since 1 January 1985 00:00:00, the library's working scale;
 * - MJD record: the binary time of satellite product files, from 1 January 2000 00:00:00, 473299200 s later;
 * - long date text: DD-MON-YYYY hh:mm:ss.uuuuuu, 27 characters, MON one of JAN FEB ... DEC.
 *
 * No function here takes part in the call frames or leaves an entry in the report. Errors are written to the
 * standard error stream where the function's comment says so. Nothing is kept between calls: any number of
 * threads may call at a time. A null text or path counts as an empty one where nothing else is said; buffers and
 * records must be there. */

/* Byte order.
 *
 * Any order other than 'l' and 'm' prints "\norder must be 'm' or 'l'!\n" on the standard output and ENDS THE
 * PROCESS with exit status 1, in every reader and writer below. */

/** Byte-order code of the host: 'l' on every supported one. */
QUO_BASE_API char endi(void) QUO_NOEXCEPT;

/** The 16-bit value with its two bytes exchanged. */
QUO_BASE_API uint16_t bsw2b(uint16_t value) QUO_NOEXCEPT;

/** Numbers assembled from 2, 4 or 8 bytes that stand in the given order. */
QUO_BASE_API uint16_t ch2uint2(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API int16_t ch2int2(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API uint32_t ch2uint4(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API int32_t ch2int4(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API int32_t ch2long4(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API float ch2float4(const void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API double ch2double8(const void* bytes, char order) QUO_NOEXCEPT;

/** Writes the 4, 4 or 2 bytes of a number in the given order. */
QUO_BASE_API void float2ch(float value, void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API void long2ch(int32_t value, void* bytes, char order) QUO_NOEXCEPT;
QUO_BASE_API void short2ch(int16_t value, void* bytes, char order) QUO_NOEXCEPT;

/** Reverses in place the bytes of each of `count` elements of 2, 4 or 8 bytes. */
QUO_BASE_API void swp2(void* buffer, int64_t count) QUO_NOEXCEPT;
QUO_BASE_API void swp4(void* buffer, int64_t count) QUO_NOEXCEPT;
QUO_BASE_API void swp8(void* buffer, int64_t count) QUO_NOEXCEPT;

/** Reverses in place the bytes of each whole element within the first `length_in_bytes` bytes; an incomplete last
 * element stays. An element size that is odd, negative or zero does nothing. */
QUO_BASE_API void swp_any(void* buffer, int64_t length_in_bytes, int element_size) QUO_NOEXCEPT;

/** Brings a block that was read from a raster file into the host's byte order.
 *
 * @param[in,out] buffer    `count` elements of `element_size` bytes
 * @param[in] count         number of elements; see below for 16 bytes
 * @param[in] element_size  1, 2, 4, 8 or 16
 * @param[in] swap          0: leave everything as it is
 * @return 0, or -1 for any other element size (nothing is touched; not tested when `swap` is 0).
 *
 * For elements of 16 bytes `count` is taken as a length in bytes, so only the first count / 16
 * elements are swapped, each as one number of 16 bytes. */
QUO_BASE_API int get_endian(void* buffer, int64_t count, int element_size, int swap) QUO_NOEXCEPT;

/* Number classes: 1 or 0 from the bit pattern alone. */

/** Double: only the high 32-bit word is looked at. A not-a-number whose fraction bits all lie in the
 * low word counts as infinite and not as not-a-number. */
QUO_BASE_API int myisinf(double x) QUO_NOEXCEPT;
QUO_BASE_API int myisnan(double x) QUO_NOEXCEPT;
QUO_BASE_API int myfinite(double x) QUO_NOEXCEPT;

/** Float. Plus and minus the largest finite float (0x7F7FFFFF) count as infinite and as not finite. */
QUO_BASE_API int myisinf4(float x) QUO_NOEXCEPT;
QUO_BASE_API int myisnan4(float x) QUO_NOEXCEPT;
QUO_BASE_API int myfinite4(float x) QUO_NOEXCEPT;

/* Time. */

/** Time of satellite product files: 12 bytes, each field most significant byte first on every host. */
typedef struct MjdRecord {
    unsigned char days[4];         /**< days since 1 January 2000, signed */
    unsigned char seconds[4];      /**< seconds within the day, unsigned */
    unsigned char microseconds[4]; /**< microseconds within the second, unsigned */
} MjdRecord;

/** A date text taken apart. */
typedef struct DateFields {
    int32_t year;        /**< as written, 0 or above */
    int32_t month;       /**< 1 to 12 */
    int32_t day_of_year; /**< 1 to 366 (0 for day 0 of January, which date2str lets pass) */
    int32_t hour;        /**< 0 to 24 */
    int32_t minute;      /**< 0 to 60 */
    int32_t second;      /**< whole seconds */
    double fraction;     /**< rest of the second, 0 <= fraction < 1 */
} DateFields;

/** Codes of date2str. All but the first are flags that combine; month and minute share one. */
enum DateError {
    DATE_NO_TEXT = -1,                 /**< empty, or no digit in it */
    DATE_BAD_DAY = 0x1,                /**< below 0 or beyond the month's end */
    DATE_BAD_HOUR = 0x10,              /**< below 0 or from 25 on */
    DATE_BAD_YEAR = 0x100,             /**< below 0 */
    DATE_BAD_MONTH_OR_MINUTE = 0x1000, /**< unknown month name; minute below 0 or from 61 on */
    DATE_BAD_SECOND = 0x10000          /**< below 0, from 61 on, or no finite number */
};

/** Characters of the long date text. */
enum { DATE_TEXT_LENGTH = 27 };

/** MJD record to sec85: days * 86400 + seconds + microseconds * 1e-6 + 473299200. */
QUO_BASE_API double mjd2sec85(MjdRecord record) QUO_NOEXCEPT;

/** sec85 to MJD record, cut to whole microseconds. Times whose day does not fit the record give its first or last
 * day with no seconds; not-a-number gives the first. */
QUO_BASE_API void sec852mjd(double t, MjdRecord* record_out) QUO_NOEXCEPT;

/** sec85 to the long date text, cut (never rounded) to microseconds.
 *
 * @param[in]  t         sec85
 * @param[out] text_out  28 bytes: the text and its terminating zero; unchanged unless 0 is returned
 * @return 0; or -1 with "Date should be later than 1-JAN-1985\n" on the standard error stream for a negative time,
 * and with "Date should be earlier than 1-JAN-10000\n" for one beyond four-digit years or not-a-number. */
QUO_BASE_API int sec852myascii(double t, char* text_out) QUO_NOEXCEPT;

/** Characters of an ISO text. */
enum { ISO_TEXT_LENGTH = 26 };

/** sec85 to ISO 8601 text, such as "2022-01-04T17:05:58.268589", rounded to microseconds.
 *
 * @param[in]  t         sec85, 0 or later and before the year 10000
 * @param[out] text_out  room for ISO_TEXT_LENGTH + 1 characters; unchanged unless 0 is returned
 * @return 0; 1 for a null pointer or another time */
QUO_BASE_API int sec852iso(double t, char* text_out) QUO_NOEXCEPT;

/** ISO 8601 text to sec85: date and time of day to any number of decimals, with or without "UTC=" before it and
 * "Z" behind it. Of a time in this century the double keeps quarters of a microsecond.
 *
 * @param[in]  text   the text
 * @param[out] t_out  sec85, negative before 1985; unchanged unless 0 is returned
 * @return 0; 1 for a null pointer or another text */
QUO_BASE_API int iso2sec85(const char* text, double* t_out) QUO_NOEXCEPT;

/** sec85 or MJD record to the long date text, without the terminating zero: exactly 27 characters are written.
 * A time that sec852myascii refuses leaves its message there and 27 blanks here. */
QUO_BASE_API void sec852ascii(double t, char* text_out) QUO_NOEXCEPT;
QUO_BASE_API void mjd2ascii(MjdRecord record, char* text_out) QUO_NOEXCEPT;

/** Takes a date text apart: day-month-year hour:minute:seconds, such as "1-JAN-1985" or "03-jul-2004 20:53:38.23".
 *
 * Reading begins at the first digit among the first 40 characters, else at the 41st character whatever it is.
 * Missing trailing fields are 0. Month names are compared without regard to case.
 *
 * @param[in]  text        ends with a NUL
 * @param[out] fields_out  unchanged unless 0 is returned
 * @return 0, DATE_NO_TEXT, or the other DateError flags combined.
 *
 * Day 0, hour 24, minute 60 and second 60 pass; leap years are Gregorian. With an unknown month the
 * day is only tested for being negative. */
QUO_BASE_API int date2str(const char* text, DateFields* fields_out) QUO_NOEXCEPT;

/** sec85 of any text that date2str accepts (negative before 1985). After an error 0.0, with
 * "Error: incorrect date format, code %d\n" and the code of date2str on the standard error stream. */
QUO_BASE_API double ascii2sec85(const char* text) QUO_NOEXCEPT;

/** The number YYYYMMDDhhmmss.fff of a text "DD-MON-YYYY hh:mm:ss.fff". The three digits after the point are read
 * as a count of milliseconds, so ".5" stands for 5 ms. Nothing is validated, and only upper-case month names are
 * known: any other counts as month 13. Missing trailing fields are 0. */
QUO_BASE_API double utc_ch2num(const char* text) QUO_NOEXCEPT;

/* Texts, files and paths. */

/** Compares two texts with A-Z folded to lower case, whatever the locale. 0 when they are equal or the same
 * pointer, else the difference of the first two folded characters (as unsigned bytes) that differ. A null pointer
 * compares as an empty text. */
QUO_BASE_API int mystrcasecmp(const char* a, const char* b) QUO_NOEXCEPT;

/** Moves a stream to a 64-bit offset from the start (whence 0), its present position (1) or its end (2).
 *
 * @return 0: what was written is flushed, the underlying descriptor stands at the new place, the stream reads
 * and writes there, and its end-of-file flag is cleared. -1: no stream, another whence, an offset that
 * overflows or lies before the start, or a failed flush or seek (whence 2 may then have moved the stream
 * to its end). */
QUO_BASE_API int myfseek64_msc(FILE* stream, int64_t offset64, int whence) QUO_NOEXCEPT;

/** Removes one final slash or backslash in place. Returns the length before that. */
QUO_BASE_API int check_fsep(char* path) QUO_NOEXCEPT;

/** Points into `path`: behind the last slash; behind the last backslash only when there is no slash at all; else
 * at its begin. Null for null. A backslash after the last slash belongs to the name. */
QUO_BASE_API const char* getFileNameFromPath(const char* path) QUO_NOEXCEPT;

/** Copies a whole file, into the destination in place where no other file can be put there. Always 0, as its
 * callers expect, and nothing is reported: compare the files to learn whether it worked. When the source cannot be
 * read or the destination not written, the destination stays as it was; copying a file onto itself leaves it
 * whole. */
QUO_BASE_API int copyParameterFile(const char* source, const char* destination) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
