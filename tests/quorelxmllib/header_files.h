// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_HEADER_FILES_H
#define QUO_TESTS_HEADER_FILES_H

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

/** A text with its first `from` replaced. */
inline std::string replaced(std::string text, std::string_view from, std::string_view to) {
    const auto place = text.find(from);
    EXPECT_NE(place, text.npos) << from;
    return text.replace(place, from.size(), to);
}

}  // namespace test

#endif
