// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <string_view>
#include <type_traits>

#include "diagnosticslib/call_frame.h"
#include "profilelib/out_of_memory.h"
#include "profilelib/profile_store.h"
#include "quo_base/profile.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/number_text.h"

namespace quo {
namespace {

constexpr const char* kSource = "profile";
constexpr std::size_t kMessageRoom = 2048;
constexpr int kFloatDigits = 7;
constexpr int kDoubleDigits = 15;
constexpr std::string_view kBetweenRows = "\n\t";

/** One call of an accessor: its frame, and the place in the parameter files that its reports name. Until it ends,
 * no other thread changes or frees the value. */
class Access {
public:
    Access(const char* function, const char* section, const char* key, const char* file,
           int line = __builtin_LINE()) noexcept
        : frame_{function, kSource, line}, function_{function}, section_{section}, key_{key}, file_{file} {}

    /** The stored value, or null. */
    [[nodiscard]] const char* value() const noexcept {
        return GetSetProfileChar(0, section_, key_, nullptr, file_);
    }
    /** Stores a value and gives the call's status; a refusal is reported. */
    [[nodiscard]] int store(const char* value, int line = __builtin_LINE()) noexcept {
        if (GetSetProfileChar(1, section_, key_, value, file_)) return success(line);
        return warn("Parameter writing failed", line);
    }
    [[nodiscard]] int success(int line = __builtin_LINE()) noexcept { return frame_.success(line); }
    /** A result that is no news: callers ask for keys that may be missing. */
    [[nodiscard]] int silent(int status) noexcept { return frame_.silent(status); }
    [[nodiscard]] int too_few(int read, int wanted, int line = __builtin_LINE()) noexcept {
        char what[80];
        format_bounded(what, sizeof what, "Read only %d elements of %d", read, wanted);
        return warn(what, line);
    }

private:
    int warn(const char* what, int line) noexcept {
        const auto shown = [](const char* text) { return text ? text : ""; };
        char message[kMessageRoom];
        format_bounded(message, sizeof message, "%s - SEC: %s, KEY: %s, FILE: %s", what, shown(section_),
                       shown(key_), shown(file_));
        quo_add_report(message, QUO_WARNING, line, function_, kSource);
        return silent(QUO_NUMERIC);
    }

    CallFrame frame_;
    std::unique_lock<std::recursive_mutex> access_ = profile_access();
    const char *function_, *section_, *key_, *file_;
};

/** A value under construction. Running out of memory ends the process. */
class ValueText {
public:
    ValueText() noexcept {
        or_end_process(kNoMemory, [this] { text_.reserve(kFirstRoom); });
    }
    ValueText& append(std::string_view part) noexcept {
        or_end_process(kNoMoreMemory, [&] { text_.append(part); });
        return *this;
    }
    [[nodiscard]] const char* data() const noexcept { return text_.c_str(); }

private:
    static constexpr std::size_t kFirstRoom = 4096;
    std::string text_;
};

// "int" and the 32-bit "long" are one type.
NumberText number_text(std::int32_t value) noexcept { return format_int(value); }
NumberText number_text(std::int64_t value) noexcept { return format_int(value); }
NumberText number_text(float value) noexcept { return format_general(value, kFloatDigits); }
NumberText number_text(double value) noexcept { return format_general(value, kDoubleDigits); }

template <typename Number>
void append_cell(ValueText& text, Number value) noexcept {
    text.append(number_text(value));
}
void append_cell(ValueText& text, const char* value) noexcept {
    text.append("\"").append(text_or_empty(value)).append("\"");
}

Scanned<std::int32_t> scan(std::string_view word, std::int32_t) noexcept { return scan_int32(word); }
Scanned<std::int64_t> scan(std::string_view word, std::int64_t) noexcept { return scan_int64(word); }
Scanned<double> scan(std::string_view word, double) noexcept { return scan_double(word); }

/** A float from a double; beyond the range, where a plain conversion is not defined, infinity. */
float narrowed(double value) noexcept {
    using Limits = std::numeric_limits<float>;
    if (std::abs(value) > Limits::max()) return std::copysign(Limits::infinity(), value < 0.0 ? -1.0F : 1.0F);
    return static_cast<float>(value);
}

/** The float nearest to the text: one taken from the nearest double would have been rounded twice. */
Scanned<float> scan(std::string_view word, float) noexcept {
    const Scanned<double> wide = scan_double(word);
    std::string_view digits = word.substr(0, wide.length);
    digits.remove_prefix(std::min(digits.find_first_not_of(" \t\n\v\f\r+"), digits.size()));
    float value{};
    const auto [stop, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value);
    const bool whole = error == std::errc{} && stop == digits.data() + digits.size();
    // What from_chars leaves is beyond the range or hexadecimal.
    return {whole ? value : narrowed(wide.value), wide.length};
}

/** Reads numbers separated by blanks and tabs until `count` are read or a word begins with none. Returns how many.
 */
template <typename Number>
int scan_list(std::string_view text, Number* values, int count) noexcept {
    constexpr const char* kSeparators = " \t";
    if (text.starts_with('{')) text.remove_prefix(1);
    for (int read = 0; read < count; ++read) {
        text.remove_prefix(std::min(text.find_first_not_of(kSeparators), text.size()));
        const std::string_view word = text.substr(0, text.find_first_of(kSeparators));
        const auto [value, length] = scan(word, Number{});
        if (length == 0) return read;
        values[read] = value;
        text.remove_prefix(word.size());
    }
    return std::max(count, 0);
}

template <typename Number>
int read_list(Access& access, Number* values, int count, int line = __builtin_LINE()) noexcept {
    const char* const text = access.value();
    if (!text) return access.silent(QUO_NUMERIC);
    const int read = scan_list(text, values, values ? count : 0);
    return read < count ? access.too_few(read, count, line) : access.success(line);
}

/** Writes element (r, c) from position r + c * rows. */
template <typename Cell>
int write_matrix(Access& access, const Cell* cells, int rows, int columns, int line = __builtin_LINE()) noexcept {
    if (!cells && rows > 0 && columns > 0) return access.store(nullptr, line);
    ValueText text;
    for (int r = 0; r < rows; ++r) {
        text.append(r == 0 ? "" : kBetweenRows).append("{");
        for (int c = 0; c < columns; ++c) {
            if (c > 0) text.append(" ");
            append_cell(text, cells[r + static_cast<std::ptrdiff_t>(c) * rows]);
        }
        text.append("}");
    }
    return access.store(rows > 0 ? text.data() : "{}", line);
}

template <typename Cell>
int write_list(Access& access, const Cell* cells, int count, int line = __builtin_LINE()) noexcept {
    return write_matrix(access, cells, 1, count, line);
}

template <typename Number>
int write_number(Access& access, Number value, int line = __builtin_LINE()) noexcept {
    return access.store(number_text(value).data, line);
}

/** How a scan of a string list ended: strings read, and the character between strings that ended it, or NUL. */
struct StringScan {
    int read;
    char stop;
};

/** Reads strings until `count` are read. `text` begins after the opening brace. */
StringScan scan_strings(std::string_view text, char* const* strings, int count, int room) noexcept {
    for (int read = 0; read < count; ++read) {
        text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
        if (text.empty()) return {read, '\0'};
        if (text.front() != '"') return {read, text.front()};
        const auto end = text.find('"', 1);
        if (end == std::string_view::npos) return {read, '\0'};
        copy_bounded(strings[read], static_cast<std::size_t>(std::max(room, 0)), text.substr(1, end - 1));
        text.remove_prefix(end + 1);
    }
    return {std::max(count, 0), '\0'};
}

int read_strings(Access& access, char* const* strings, int count, int room, int line = __builtin_LINE()) noexcept {
    const char* const text = access.value();
    if (!text) return access.silent(QUO_NUMERIC);
    // A value that is no list leaves the strings as they are, which callers count as read.
    if (*text != '{') return access.success(line);
    const auto [read, stop] = scan_strings(text + 1, strings, strings ? count : 0, room);
    // An early closing brace gives the count for a status: a list that is whole but short is told from one that
    // breaks off. Anything else but a quote ends it as a success.
    if (stop == '}' && read > 0) return access.silent(read);
    return stop == '\0' && read < count ? access.too_few(read, count, line) : access.success(line);
}

}  // namespace
}  // namespace quo

using quo::Access;

extern "C" int GetMyProfileString(const char* section, const char* key, char* buffer, int size,
                                  const char* file) noexcept {
    Access access{"GetMyProfileString", section, key, file};
    const char* const value = access.value();
    if (!value || !buffer || size < 1) return access.silent(QUO_NUMERIC);
    const auto room = static_cast<std::size_t>(size);
    const std::size_t length = quo::copy_bounded(buffer, room, value);
    std::memset(buffer + length, 0, room - length);
    return access.success();
}

extern "C" int WriteMyProfileString(const char* section, const char* key, const char* value,
                                    const char* file) noexcept {
    Access access{"WriteMyProfileString", section, key, file};
    return access.store(value);
}

extern "C" int WriteMyProfileStringQuote(const char* section, const char* key, const char* value,
                                         const char* file) noexcept {
    Access access{"WriteMyProfileStringQuote", section, key, file};
    if (!value) return access.store(nullptr);
    quo::ValueText text;
    quo::append_cell(text, value);
    return access.store(text.data());
}

extern "C" int GetMyProfileStringArray(const char* section, const char* key, char* const* strings, int count,
                                       int room, const char* file) noexcept {
    Access access{"GetMyProfileStringArray", section, key, file};
    return quo::read_strings(access, strings, count, room);
}

#define QUO_READS_LIST(name, Number)                                                                        \
    extern "C" int name(const char* section, const char* key, std::add_pointer_t<Number> values, int count, \
                        const char* file) noexcept {                                                        \
        Access access{#name, section, key, file};                                                           \
        return quo::read_list(access, values, count);                                                       \
    }
QUO_READS_LIST(GetMyProfileIntArray, int)
QUO_READS_LIST(GetMyProfileInt64Array, int64_t)
QUO_READS_LIST(GetMyProfileLongArray, int32_t)
QUO_READS_LIST(GetMyProfileFloatArray, float)
QUO_READS_LIST(GetProfileDoubleArray, double)
#undef QUO_READS_LIST

#define QUO_WRITES_LIST(name, Cell)                                                          \
    extern "C" int name(const char* section, const char* key, const Cell* values, int count, \
                        const char* file) noexcept {                                         \
        Access access{#name, section, key, file};                                            \
        return quo::write_list(access, values, count);                                       \
    }
using Text = const char*;
QUO_WRITES_LIST(WriteMyProfileStringArray, Text)
QUO_WRITES_LIST(WriteMyProfileIntArray, int)
QUO_WRITES_LIST(WriteMyProfileInt64Array, int64_t)
QUO_WRITES_LIST(WriteMyProfileLongArray, int32_t)
QUO_WRITES_LIST(WriteMyProfileFloatArray, float)
QUO_WRITES_LIST(WriteProfileDoubleArray, double)
#undef QUO_WRITES_LIST

#define QUO_WRITES_MATRIX(name, Cell)                                                                    \
    extern "C" int name(const char* section, const char* key, const Cell* values, int rows, int columns, \
                        const char* file) noexcept {                                                     \
        Access access{#name, section, key, file};                                                        \
        return quo::write_matrix(access, values, rows, columns);                                         \
    }
QUO_WRITES_MATRIX(WriteMyProfileStringMatrix, Text)
QUO_WRITES_MATRIX(WriteMyProfileDoubleMatrix, double)
#undef QUO_WRITES_MATRIX

#define QUO_WRITES_NUMBER(name, Number)                                                                  \
    extern "C" int name(const char* section, const char* key, Number value, const char* file) noexcept { \
        Access access{#name, section, key, file};                                                        \
        return quo::write_number(access, value);                                                         \
    }
QUO_WRITES_NUMBER(WriteMyProfileInt, int)
QUO_WRITES_NUMBER(WriteMyProfileInt64, int64_t)
QUO_WRITES_NUMBER(WriteMyProfileDouble, double)
#undef QUO_WRITES_NUMBER
