// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_QUOTED_XML_H
#define QUO_QUOTED_XML_H

#include <algorithm>
#include <string>
#include <string_view>
#include <utility>

namespace quo {

/** The text as it may stand in an XML document, within an element or between double quotes. */
inline std::string quoted_xml(std::string_view text) {
    using Entity = std::pair<char, std::string_view>;
    constexpr Entity kEntities[] = {{'&', "&amp;"}, {'<', "&lt;"}, {'>', "&gt;"}, {'"', "&quot;"}};
    std::string quoted;
    for (const char c : text) {
        const auto* const entity = std::ranges::find(kEntities, c, &Entity::first);
        quoted += entity == std::end(kEntities) ? std::string_view{&c, 1} : entity->second;
    }
    return quoted;
}

}  // namespace quo

#endif
