// SPDX-License-Identifier: Apache-2.0
#include <string>

#include "errors.h"
#include "quo_base/gen_utils.h"
#include "tools.h"

namespace quo_python {

namespace {

double seconds_of_text(const std::string& text) {
    double seconds = 0.0;
    if (iso2sec85(text.c_str(), &seconds) == QUO_OK) return seconds;
    DateFields fields;
    if (date2str(text.c_str(), &fields) != 0) throw py::value_error("no time: " + text);
    return ascii2sec85(text.c_str());
}

std::string text_of_seconds(double seconds, bool iso) {
    static_assert(int{ISO_TEXT_LENGTH} < int{DATE_TEXT_LENGTH});
    char text[DATE_TEXT_LENGTH + 1] = "";
    // The older form writes a message of its own for what the other one refuses as well.
    if (sec852iso(seconds, text) != QUO_OK) throw py::value_error("a time from 1985 to the year 9999 is needed");
    if (!iso) (void)sec852myascii(seconds, text);
    return text;
}

}  // namespace

void bind_times(py::module_& module) {
    module.def("seconds_of_text", &seconds_of_text);
    module.def("text_of_seconds", &text_of_seconds);
}

}  // namespace quo_python
