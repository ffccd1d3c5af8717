#include <cinttypes>
#include <cstdio>
#include <cstdlib>

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

extern "C" void GetCheckMyProfileIntArray(const char* section, const char* key, int* values, int count,
                                          const char* file) noexcept {
    if (GetMyProfileIntArray(section, key, values, count, file) != 0)
        end_failed_check("GetMyProfileIntArray", section, key, file);
}

extern "C" void GetCheckMyProfileInt64Array(const char* section, const char* key, int64_t* values, int count,
                                            const char* file) noexcept {
    if (GetMyProfileInt64Array(section, key, values, count, file) != 0)
        end_failed_check("GetMyProfileInt64Array", section, key, file);
}

extern "C" void GetCheckMyProfileLongArray(const char* section, const char* key, int32_t* values, int count,
                                           const char* file) noexcept {
    // This message and three below name another function: they are kept as users have known them.
    if (GetMyProfileLongArray(section, key, values, count, file) != 0)
        end_failed_check("GetMyProfileIntArray", section, key, file);
}

extern "C" void WriteCheckMyProfileIntArray(const char* section, const char* key, const int* values, int count,
                                            const char* file) noexcept {
    if (WriteMyProfileIntArray(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileIntArray", section, key, file);
}

extern "C" void WriteCheckMyProfileInt64Array(const char* section, const char* key, const int64_t* values,
                                              int count, const char* file) noexcept {
    if (WriteMyProfileInt64Array(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileInt64Array", section, key, file);
}

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

extern "C" void WriteCheckMyProfileLongArray(const char* section, const char* key, const int32_t* values,
                                             int count, const char* file) noexcept {
    if (WriteMyProfileLongArray(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileLongArray", section, key, file);
}

extern "C" void GetCheckMyProfileFloatArray(const char* section, const char* key, float* values, int count,
                                            const char* file) noexcept {
    if (GetMyProfileFloatArray(section, key, values, count, file) != 0)
        end_failed_check("GetMyProfileFloatArray", section, key, file);
}

extern "C" void WriteCheckMyProfileDouble(const char* section, const char* key, double value,
                                          const char* file) noexcept {
    if (WriteMyProfileDouble(section, key, value, file) == 0) return;
    char text[kDecimalRoom];
    quo::format_bounded(text, sizeof text, "%f", value);
    end_failed_check("WriteMyProfileDouble", section, key, file, "value ", text);
}

extern "C" void WriteCheckMyProfileFloatArray(const char* section, const char* key, const float* values, int count,
                                              const char* file) noexcept {
    if (WriteMyProfileFloatArray(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileDouble", section, key, file);
}

extern "C" void WriteCheckMyProfileDoubleArray(const char* section, const char* key, const double* values,
                                               int count, const char* file) noexcept {
    if (WriteProfileDoubleArray(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileDouble", section, key, file);
}

extern "C" void GetCheckMyProfileDoubleArray(const char* section, const char* key, double* values, int count,
                                             const char* file) noexcept {
    if (GetProfileDoubleArray(section, key, values, count, file) != 0)
        end_failed_check("WriteMyProfileDouble", section, key, file);
}

extern "C" int GetParString(const char* file, const char* key, int /*count*/, char* buffer, int /*ignored*/,
                            const char* section) noexcept {
    return GetMyProfileString(section, key, buffer, kParStringRoom, file);
}

extern "C" int SetParString(const char* file, const char* key, int /*count*/, const char* value, int /*ignored*/,
                            const char* section) noexcept {
    return synced(file, WriteMyProfileString(section, key, value, file));
}

extern "C" int GetParInt(const char* file, const char* key, int count, int* values, int /*ignored*/,
                         const char* section) noexcept {
    return GetMyProfileIntArray(section, key, values, count, file);
}

extern "C" int SetParInt(const char* file, const char* key, int count, const int* values, int /*ignored*/,
                         const char* section) noexcept {
    return synced(file, WriteMyProfileIntArray(section, key, values, count, file));
}

extern "C" int GetParFloat(const char* file, const char* key, int count, float* values, int /*ignored*/,
                           const char* section) noexcept {
    return GetMyProfileFloatArray(section, key, values, count, file);
}

extern "C" int SetParFloat(const char* file, const char* key, int count, const float* values, int /*ignored*/,
                           const char* section) noexcept {
    return synced(file, WriteMyProfileFloatArray(section, key, values, count, file));
}

extern "C" int GetParDouble(const char* file, const char* key, int count, double* values, int /*ignored*/,
                            const char* section) noexcept {
    return GetProfileDoubleArray(section, key, values, count, file);
}

extern "C" int SetParDouble(const char* file, const char* key, int count, const double* values, int /*ignored*/,
                            const char* section) noexcept {
    return synced(file, WriteProfileDoubleArray(section, key, values, count, file));
}
