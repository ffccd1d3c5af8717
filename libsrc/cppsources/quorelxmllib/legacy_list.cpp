// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/legacy_list.h"

#include <locale.h>
#include <trio.h>

#include <algorithm>
#include <array>
#include <limits>
#include <string_view>

namespace quo {
namespace {

/** The decimal point is a point while this lives: the scanner asks the C locale of the thread. */
class PointLocale {
public:
    PointLocale() noexcept : point_{newlocale(LC_NUMERIC_MASK, "C", nullptr)} {
        if (point_) before_ = uselocale(point_);
    }
    ~PointLocale() {
        if (!point_) return;
        uselocale(before_);
        freelocale(point_);
    }
    PointLocale(const PointLocale&) = delete;
    PointLocale& operator=(const PointLocale&) = delete;

private:
    locale_t point_, before_{};
};

constexpr int kBlock = 32;  // items of one scan: the format stays short however long the list is

/** What the scanner stores for an item, and the item's own formats. "%g" would not do for doubles: the scanner
 * stores a float for it, whatever the precision. */
template <typename T>
struct Item;
template <>
struct Item<double> {
    using Stored = double;
    static constexpr std::string_view kText = "%lg, ";
    static double value(double stored) { return stored; }
};
template <>
struct Item<float> : Item<double> {
    static float value(double stored) { return static_cast<float>(stored); }
};
template <>
struct Item<std::int32_t> {
    using Stored = long;
    static constexpr std::string_view kText = "%ld, ";
    static std::int32_t value(long stored) {
        using Limits = std::numeric_limits<std::int32_t>;
        return static_cast<std::int32_t>(std::clamp<long>(stored, Limits::min(), Limits::max()));
    }
};

/** `count` items, then the place that was reached: after the last comma, or nowhere when the list ends there. */
template <typename T>
void make_format(char* format, int count) {
    for (int i = 0; i < count; ++i) format = std::ranges::copy(Item<T>::kText, format).out;
    *std::ranges::copy(std::string_view{"%n"}, format).out = '\0';
}

template <typename T>
int scan_block(const char* text, T* values, int count, int& length) noexcept {
    std::array<typename Item<T>::Stored, kBlock> stored{};
    std::array<trio_pointer_t, kBlock + 1> places{};
    for (int i = 0; i < count; ++i) places[static_cast<std::size_t>(i)] = &stored[static_cast<std::size_t>(i)];
    places[static_cast<std::size_t>(count)] = &length;
    std::array<char, kBlock * 8> format;
    make_format<T>(format.data(), count);

    const int found = std::clamp(trio_sscanfv(text, format.data(), places.data()), 0, count);
    for (int i = 0; i < found; ++i) values[i] = Item<T>::value(stored[static_cast<std::size_t>(i)]);
    return found;
}

template <typename T>
int scan(const char* text, T* values, int count) noexcept {
    const PointLocale locale;
    for (int read = 0;;) {
        int length = 0;
        read += scan_block(text, values + read, std::min(kBlock, count - read), length);
        if (length == 0 || read >= count) return read;
        text += length;
    }
}

struct FormatItem {
    std::string_view text, last;
};
constexpr FormatItem kFormats[] = {{"%.15g, ", "%.15g"}, {"%.15g, ", "%.15g"}, {"%d, ", "%d"}, {"%s, \n", "%s"}};

}  // namespace

std::string list_format(int count, int type) {
    if (count < 1 || type < 0 || type >= static_cast<int>(std::size(kFormats))) return {};
    const auto [text, last] = kFormats[type];
    const auto fitting = (kFormatRoom - 1 - last.size()) / text.size();
    std::string format;
    for (std::size_t i = std::min<std::size_t>(static_cast<std::size_t>(count) - 1, fitting); i > 0; --i)
        format += text;
    return format += last;
}

int scan_list(const char* text, double* values, int count) noexcept { return scan(text, values, count); }
int scan_list(const char* text, float* values, int count) noexcept { return scan(text, values, count); }
int scan_list(const char* text, std::int32_t* values, int count) noexcept { return scan(text, values, count); }

}  // namespace quo
