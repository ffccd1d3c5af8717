// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_LEGACY_LIST_H
#define QUO_LEGACY_LIST_H

#include <cstdint>
#include <string>

namespace quo {

/** Longest scan format, characters, the final NUL included. */
inline constexpr int kFormatRoom = 4096;

/** The scan format of a list of `count` values: type 0 double, 1 float, 2 int, 3 string. Cut to the
 * whole items that fit into kFormatRoom; empty for another type or a count below 1. */
std::string list_format(int count, int type);

/** Reads a list "1.5, 2.5, 3.5" (a comma, then white space or none) into the first `count` values. The scan stops
 * at the first place that does not fit; the values beyond stay as they are. Returns how many were read. */
int scan_list(const char* text, double* values, int count) noexcept;
int scan_list(const char* text, float* values, int count) noexcept;
/** Ints beyond 32 bits stop at the bounds. */
int scan_list(const char* text, std::int32_t* values, int count) noexcept;

}  // namespace quo

#endif
