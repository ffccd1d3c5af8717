#ifndef QUO_TOOL_PICTURE_H
#define QUO_TOOL_PICTURE_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tool {

/** An 8-bit grey picture, row after row from the top. */
struct Picture {
    std::size_t width = 0, height = 0;
    std::vector<std::uint8_t> grey;
};

/** Writes a picture as PNG, in one step. Throws Failure. */
void write_png(const Picture& picture, const std::string& name);

}  // namespace tool

#endif
