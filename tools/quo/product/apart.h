// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_APART_H
#define QUO_TOOL_APART_H

#include <string>
#include <vector>

namespace tool {

/** The raster and its side file. */
std::vector<std::string> raster_files(const std::string& raster);
/** The header, and its raster where the header is named like a side file. */
std::vector<std::string> header_files(const std::string& header);

/** Every verb that writes a file tells here, before anything is opened, what it reads and what it is going to
 * write. Throws Failure where a file to be written is one that is read, or stands among those to be written
 * twice: it would be replaced while it is still needed. Names of no file yet, and "-", are apart from all. */
void require_apart(const std::vector<std::string>& read, const std::vector<std::string>& written);

/** The same for a verb that makes a raster with its side file from another one, whose place it may take: then both
 * files have to be those of the other. */
void require_raster_apart(const std::string& in, const std::string& out);

}  // namespace tool

#endif
