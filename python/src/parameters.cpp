// SPDX-License-Identifier: Apache-2.0
#include <pybind11/stl.h>

#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "errors.h"
#include "quo_base/profile.h"
#include "tools.h"

namespace quo_python {

namespace {

/** One key of a parameter file. */
struct Key {
    Key(const std::string& file_name, const std::string& section_name, const std::string& key)
        : section{section_name}, name{key}, file{file_name} {}
    std::string section, name, file;
};

/** Runs a call of the store with the key's names, `call(section, name, file)`; raises what is missing or refused.
 */
template <typename Call>
void with_key(const Key& key, Call call) {
    const Failure failure = attempt([&] { return call(key.section.c_str(), key.name.c_str(), key.file.c_str()); });
    if (failure.status != QUO_OK) throw py::key_error("[" + key.section + "] " + key.name + " of " + key.file);
}

std::string get_text(const std::string& file, const std::string& section, const std::string& name) {
    std::string text(256, '\0');
    for (;;) {
        with_key({file, section, name}, [&](const char* in, const char* key, const char* of) {
            return GetMyProfileString(in, key, text.data(), static_cast<int>(text.size()), of);
        });
        const std::size_t length = std::strlen(text.c_str());
        // A cut may end before a character's first byte.
        if (length + 8 < text.size() || text.size() > std::numeric_limits<int>::max() / 2)
            return text.substr(0, length);
        text.resize(2 * text.size());
    }
}

std::vector<double> get_numbers(const std::string& file, const std::string& section, const std::string& name,
                                int count) {
    std::vector<double> numbers(static_cast<std::size_t>(count > 0 ? count : 0));
    with_key({file, section, name}, [&](const char* in, const char* key, const char* of) {
        return GetProfileDoubleArray(in, key, numbers.data(), count, of);
    });
    return numbers;
}

void set_text(const std::string& file, const std::string& section, const std::string& name,
              const std::string& value) {
    with_key({file, section, name}, [&](const char* in, const char* key, const char* of) {
        return WriteMyProfileString(in, key, value.c_str(), of);
    });
}

void set_numbers(const std::string& file, const std::string& section, const std::string& name,
                 const std::vector<double>& values) {
    with_key({file, section, name}, [&](const char* in, const char* key, const char* of) {
        return WriteProfileDoubleArray(in, key, values.data(), static_cast<int>(values.size()), of);
    });
}

void set_integers(const std::string& file, const std::string& section, const std::string& name,
                  const std::vector<std::int64_t>& values) {
    with_key({file, section, name}, [&](const char* in, const char* key, const char* of) {
        return WriteMyProfileInt64Array(in, key, values.data(), static_cast<int>(values.size()), of);
    });
}

void save(const std::string& file) {
    Failure failure = attempt([&] { return SyncProfile(file.c_str()); });
    if (failure.status == QUO_OK) return;
    failure.status = QUO_WRITE_FAILED;
    raise(failure, "writing a parameter file");
}

}  // namespace

void bind_parameters(py::module_& module) {
    module.def("parameter_text", &get_text);
    module.def("parameter_numbers", &get_numbers);
    module.def("set_parameter_text", &set_text);
    module.def("set_parameter_numbers", &set_numbers);
    module.def("set_parameter_integers", &set_integers);
    module.def("delete_parameter",
               [](const std::string& file, const std::string& section, const std::string& name) {
                   DelProfileKey(section.c_str(), name.c_str(), file.c_str());
               });
    module.def("save_parameters", &save);
    module.def("forget_parameters", [](const std::string& file) { FreeProfile(file.c_str()); });
}

}  // namespace quo_python
