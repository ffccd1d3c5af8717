// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ANNEX_FILE_H
#define QUO_ANNEX_FILE_H

#include <cstddef>

namespace quo {

/** Reads `bytes` bytes from the start of the data set of an annex file: behind a main header of 1247 bytes stands
 * a specific header of 378, and 231 bytes into that the offset of the data set, in decimal.
 * @return 0; 1 for an offset that is no number or negative; the status of a file operation that failed. The array
 *         may be changed by a failed call. */
int read_annex_data(const char* file, char* data, std::size_t bytes);

}  // namespace quo

#endif
