// SPDX-License-Identifier: Apache-2.0
#include "failure.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <new>
#include <system_error>

#include "quo_base/ckerr.h"
#include "shown.h"

namespace tool {

std::string system_cause() { return std::generic_category().message(errno); }

std::string status_text(int status) {
    struct Meaning {
        int status;
        const char* text;
    };
    constexpr Meaning kMeanings[] = {
        {QUO_REFUSED, "refused"},
        {QUO_READ_FAILED, "data missing or cut short"},
        {QUO_WRITE_FAILED, "writing failed"},
        {QUO_NO_MEMORY, "out of memory"},
        {QUO_NOT_OPENED, "file not opened"},
        {QUO_NUMERIC, "no solution"},
        {QUO_NOT_SEEN, "not seen within the orbit"},
    };
    const std::string number = std::to_string(status);
    const auto* known = std::find_if(std::begin(kMeanings), std::end(kMeanings),
                                     [status](const Meaning& meaning) { return meaning.status == status; });
    return known == std::end(kMeanings) ? number : number + " (" + known->text + ")";
}

void forget_system_error() {
    errno = 0;
    (void)quo_take_system_error();
}

std::string library_cause(int status) {
    const int error = quo_take_system_error();
    return error != 0 ? std::generic_category().message(error) : "status " + status_text(status);
}

void complain(std::string_view message) noexcept {
    try {
        const std::string line = "quo: " + shown(message) + '\n';
        std::fwrite(line.data(), 1, line.size(), stderr);
    } catch (const std::bad_alloc&) {
        std::fputs("quo: out of memory\n", stderr);
    }
}

}  // namespace tool
