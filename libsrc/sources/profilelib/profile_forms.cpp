// SPDX-License-Identifier: Apache-2.0
#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <type_traits>

#include "quo_base/profile.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/number_text.h"

namespace {

constexpr int kParStringRoom = 512;
/** Room for "%f" of any double: 309 digits, sign, point, six decimals. */
constexpr std::size_t kDecimalRoom = 320;

/** Ends the process with the message about a failed accessor. Some messages show a value, after a label. */
[[noreturn]] void end_failed_check(const char* named, const char* section, const char* key, const char* file,
                                   const char* label = "", const char* value = "") {
    const auto shown = [](const char* text) { return text ? text : ""; };
    std::fprintf(stderr, "Error in %s: section %s, key %s, %s%s%sfile %s\n", named, shown(section), shown(key),
                 label, shown(value), *label ? ", " : "", shown(file));
    std::exit(EXIT_FAILURE);
}

/** Brings a change to the disk. The status of the write is the result, whatever becomes of the sync. */
int synced(const char* file, int status) {
    // A null path would sync every file.
    if (file) SyncProfile(file);
    return status;
}

}  // namespace

extern "C" void GetCheckMyProfileString(const char* section, const char* key, char* buffer, int size,
                                        const char* file) noexcept {
    if (GetMyProfileString(section, key, buffer, size, file) != 0)
        end_failed_check("GetMyProfileString", section, key, file);
}

extern "C" void WriteCheckMyProfileString(const char* section, const char* key, const char* value,
                                          const char* file) noexcept {
    if (WriteMyProfileString(section, key, value, file) != 0)
        end_failed_check("WriteMyProfileString", section, key, file, "string ", value);
}

extern "C" void GetCheckMyProfileStringArray(const char* section, const char* key, char* const* strings, int count,
                                             int room, const char* file) noexcept {
    if (GetMyProfileStringArray(section, key, strings, count, room, file) != 0)
        end_failed_check("GetMyProfileStringArray", section, key, file);
}

// Four messages name another function: they are kept as users have known them.
#define QUO_CHECKS_LIST(name, plain, Number, named)                                                          \
    extern "C" void name(const char* section, const char* key, std::add_pointer_t<Number> values, int count, \
                         const char* file) noexcept {                                                        \
        if (plain(section, key, values, count, file) != 0) end_failed_check(named, section, key, file);      \
    }
QUO_CHECKS_LIST(GetCheckMyProfileIntArray, GetMyProfileIntArray, int, "GetMyProfileIntArray")
QUO_CHECKS_LIST(GetCheckMyProfileInt64Array, GetMyProfileInt64Array, int64_t, "GetMyProfileInt64Array")
QUO_CHECKS_LIST(GetCheckMyProfileLongArray, GetMyProfileLongArray, int32_t, "GetMyProfileIntArray")
QUO_CHECKS_LIST(GetCheckMyProfileFloatArray, GetMyProfileFloatArray, float, "GetMyProfileFloatArray")
QUO_CHECKS_LIST(GetCheckMyProfileDoubleArray, GetProfileDoubleArray, double, "WriteMyProfileDouble")
QUO_CHECKS_LIST(WriteCheckMyProfileIntArray, WriteMyProfileIntArray, const int, "WriteMyProfileIntArray")
QUO_CHECKS_LIST(WriteCheckMyProfileInt64Array, WriteMyProfileInt64Array, const int64_t, "WriteMyProfileInt64Array")
QUO_CHECKS_LIST(WriteCheckMyProfileLongArray, WriteMyProfileLongArray, const int32_t, "WriteMyProfileLongArray")
QUO_CHECKS_LIST(WriteCheckMyProfileFloatArray, WriteMyProfileFloatArray, const float, "WriteMyProfileDouble")
QUO_CHECKS_LIST(WriteCheckMyProfileDoubleArray, WriteProfileDoubleArray, const double, "WriteMyProfileDouble")
#undef QUO_CHECKS_LIST

extern "C" void WriteCheckMyProfileInt(const char* section, const char* key, int value,
                                       const char* file) noexcept {
    if (WriteMyProfileInt(section, key, value, file) != 0)
        end_failed_check("WriteMyProfileInt", section, key, file, "value ", quo::format_int(value).data);
}

extern "C" void WriteCheckMyProfileInt64(const char* section, const char* key, int64_t value,
                                         const char* file) noexcept {
    if (WriteMyProfileInt64(section, key, value, file) == 0) return;
    char text[kDecimalRoom];
    // The message has six decimals; a double in between would change what is beyond 2^53.
    quo::format_bounded(text, sizeof text, "%" PRId64 ".000000", value);
    end_failed_check("WriteMyProfileInt64", section, key, file, "value ", text);
}

extern "C" void WriteCheckMyProfileDouble(const char* section, const char* key, double value,
                                          const char* file) noexcept {
    if (WriteMyProfileDouble(section, key, value, file) == 0) return;
    char text[kDecimalRoom];
    quo::format_bounded(text, sizeof text, "%f", value);
    end_failed_check("WriteMyProfileDouble", section, key, file, "value ", text);
}

extern "C" int GetParString(const char* file, const char* key, int /*count*/, char* buffer, int /*ignored*/,
                            const char* section) noexcept {
    return GetMyProfileString(section, key, buffer, kParStringRoom, file);
}

extern "C" int SetParString(const char* file, const char* key, int /*count*/, const char* value, int /*ignored*/,
                            const char* section) noexcept {
    return synced(file, WriteMyProfileString(section, key, value, file));
}

#define QUO_PAR_LIST(Get, Set, Number, read, write)                                                         \
    extern "C" int Get(const char* file, const char* key, int count, std::add_pointer_t<Number> values,     \
                       int /*ignored*/, const char* section) noexcept {                                     \
        return read(section, key, values, count, file);                                                     \
    }                                                                                                       \
    extern "C" int Set(const char* file, const char* key, int count, const Number* values, int /*ignored*/, \
                       const char* section) noexcept {                                                      \
        return synced(file, write(section, key, values, count, file));                                      \
    }
QUO_PAR_LIST(GetParInt, SetParInt, int, GetMyProfileIntArray, WriteMyProfileIntArray)
QUO_PAR_LIST(GetParFloat, SetParFloat, float, GetMyProfileFloatArray, WriteMyProfileFloatArray)
QUO_PAR_LIST(GetParDouble, SetParDouble, double, GetProfileDoubleArray, WriteProfileDoubleArray)
#undef QUO_PAR_LIST
