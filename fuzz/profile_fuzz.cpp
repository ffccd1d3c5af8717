/* Parameter files from any bytes: the content must read back from its written form, and the readers of typed
 * values must stay within their arrays whatever a value looks like. */

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "profilelib/profile_content.h"
#include "quo_base/profile.h"

namespace {

void require(bool holds) {
    if (!holds) std::abort();
}

std::string written(const quo::ProfileContent& content) {
    std::string text;
    content.write([&text](std::string_view piece) { return text += piece, true; });
    return text;
}

void read_back(const std::string& text) {
    quo::ProfileContent content, again;
    content.parse(text);
    again.parse(written(content));
    // An empty key name, which only a NUL byte leaves, does not read back.
    if (text.find('\0') == text.npos) require(written(again) == written(content));
}

/** One value through all readers. The arrays are watched by the address sanitizer. */
void read_values(const std::string& value) {
    constexpr const char* kFile = "/nowhere/fuzz.par";
    constexpr int kCount = 3, kRoom = 5;
    GetSetProfileChar(1, "s", "k", value.c_str(), kFile);

    std::array<int, kCount> ints{};
    std::array<int64_t, kCount> wide{};
    std::array<float, kCount> floats{};
    std::array<double, kCount> doubles{};
    std::array<char, kRoom> buffer{};
    std::array<std::array<char, kRoom>, kCount> rooms{};
    char* const strings[kCount] = {rooms[0].data(), rooms[1].data(), rooms[2].data()};
    GetMyProfileIntArray("s", "k", ints.data(), kCount, kFile);
    GetMyProfileInt64Array("s", "k", wide.data(), kCount, kFile);
    GetMyProfileFloatArray("s", "k", floats.data(), kCount, kFile);
    GetProfileDoubleArray("s", "k", doubles.data(), kCount, kFile);
    GetMyProfileStringArray("s", "k", strings, kCount, kRoom, kFile);
    GetMyProfileString("s", "k", buffer.data(), kRoom, kFile);
    require(buffer.back() == '\0');
    for (const auto& room : rooms) require(room.back() == '\0');
    DelProfileSection("s", kFile);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string text{reinterpret_cast<const char*>(data), size};
    read_back(text);
    read_values(text);
    return 0;
}
