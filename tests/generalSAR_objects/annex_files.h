#ifndef QUO_TESTS_ANNEX_FILES_H
#define QUO_TESTS_ANNEX_FILES_H

#include <cstddef>
#include <string>
#include <string_view>

namespace test {

/** An annex file: two headers of fixed length, the offset of the data set in the second, the data set. */
inline std::string annex_file(std::string_view offset_text, std::size_t offset, std::string_view data) {
    constexpr std::size_t kHeaders = 1247 + 378, kOffsetPlace = 1247 + 231;
    std::string file(kHeaders, 'h');
    file.replace(kOffsetPlace, offset_text.size(), offset_text);
    file[kOffsetPlace + offset_text.size()] = '<';
    file.resize(std::max(offset, kHeaders), '?');
    return file.append(data);
}
inline std::string annex_file(std::size_t offset, std::string_view data) {
    return annex_file("+" + std::to_string(offset), offset, data);
}

/** Offsets that no file has. `status` is what a reader answers, `offset_text` what stands in the header. */
struct BadOffset {
    const char *name, *offset_text;
    int status;
};
inline constexpr BadOffset kBadOffsets[] = {{"NotANumber", "offset", 1},
                                            {"Blank", "        ", 1},
                                            {"Negative", "-1625", 1},
                                            {"BeyondTheEnd", "000000000012345678", 4},
                                            {"BeyondSixtyFourBits", "99999999999999999999999", 4}};

}  // namespace test

#endif
