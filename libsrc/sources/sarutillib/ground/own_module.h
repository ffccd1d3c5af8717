// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_OWN_MODULE_H
#define QUO_OWN_MODULE_H

#include <dlfcn.h>

#include <cstdlib>
#include <string>

namespace quo {

/** The value of an environment variable, null where it is not set or empty. Secure: a program with raised rights
 * does not load what its caller names. */
inline const char* setting(const char* name) noexcept {
    const char* const value = secure_getenv(name);
    return value && *value ? value : nullptr;
}

/** Folder of the library or program that holds this code, with a slash; empty where it cannot be told: a name
 * without a folder would be looked for wherever the process happens to work. */
inline std::string own_folder() {
    Dl_info info{};
    if (!dladdr(reinterpret_cast<const void*>(&own_folder), &info) || !info.dli_fname) return {};
    const std::string file = info.dli_fname;
    return file.substr(0, file.rfind('/') + 1);  // a name without a slash gives an empty one
}

/** What `use` makes of the function that a module exports; null where there is no such module. One of which
 * something comes stays loaded for good. */
template <typename Function, typename Use>
auto use_module(const std::string& file, const char* function, Use use) {
    void* const module = dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
    const auto entry = module ? reinterpret_cast<Function>(dlsym(module, function)) : nullptr;
    const auto made = entry ? use(entry) : nullptr;
    if (module && !made) dlclose(module);
    return made;
}

/** The same of a module of this library, which lies in the folder quo_base beside it or right beside it. */
template <typename Function, typename Use>
auto use_own_module(const std::string& file, const char* function, Use use) {
    const std::string folder = own_folder();
    if (folder.empty()) return decltype(use(Function{})){};
    const auto made = use_module<Function>(folder + "quo_base/" + file, function, use);
    return made ? made : use_module<Function>(folder + file, function, use);
}

}  // namespace quo

#endif
