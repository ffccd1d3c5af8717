// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ELEMENT_PATH_H
#define QUO_ELEMENT_PATH_H

#include <string_view>

#include "quo_base/quorelxml_v2.h"

namespace quo {

/** The element of an object that stands at a path in headers, such as "SamplingConstants/prf_hz"; null for another
 * path. */
inline const parElement* element_at(const GeneralSAR_Base& object, std::string_view path) noexcept {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement* const element = object.element(i);
        const std::string_view section = element->section, name = element->name;
        if (path.size() == section.size() + 1 + name.size() && path.starts_with(section) &&
            path[section.size()] == '/' && path.ends_with(name))
            return element;
    }
    return nullptr;
}

}  // namespace quo

#endif
