#ifndef QUO_TESTS_HEADER_FILES_H
#define QUO_TESTS_HEADER_FILES_H

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"

namespace test {

/** A document whose inner operations can be called. */
class OpenDocument : public quorelxml {
public:
    using quorelxml::channelExists;
    using quorelxml::clearField;
    using quorelxml::countNodes;
    using quorelxml::createChannel;
    using quorelxml::createField;
    using quorelxml::description;
    using quorelxml::fieldExists;
    using quorelxml::fieldHasCount;
    using quorelxml::fileName;
    using quorelxml::format;
    using quorelxml::getNode;
    using quorelxml::isRecognized;
    using quorelxml::loaded;
    using quorelxml::numberOfChannels;
    using quorelxml::quorelxml;
    using quorelxml::setFormat;
    using quorelxml::setXpathExpression;
};

/** A header file with this text inside channel 1. */
inline std::string header_text(std::string_view inside) {
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<QuorelXmlDoc>\n  <NumberOfChannels>1</NumberOfChannels>\n"
           "  <Description>A scene</Description>\n  <Channel Number=\"1\">\n" +
           std::string{inside} + "  </Channel>\n</QuorelXmlDoc>\n";
}

/** The names of a folder's entries: a failed save must leave nothing behind. */
inline std::vector<std::string> entries(const TemporaryFolder& folder) {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator{folder.path()})
        names.push_back(entry.path().filename().string());
    std::ranges::sort(names);
    return names;
}

}  // namespace test

#endif
