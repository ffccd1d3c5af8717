// SPDX-License-Identifier: Apache-2.0
#include "missions/mission_xml.h"

#include <libxml/parser.h>
#include <libxml/tree.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <limits>
#include <system_error>

#include "quorelxmllib/header_source.h"
#include "sarutillib/ground/file_io.h"
#include "sarutillib/ground/number_text.h"

namespace quo {
namespace {

/** The text in nodes and below them. libxml2's own function gives an empty or a cut text when memory runs out. */
std::string text_in(const xmlNode* node) {
    std::string text;
    for (; node; node = node->next) {
        if ((node->type == XML_TEXT_NODE || node->type == XML_CDATA_SECTION_NODE) && node->content)
            text += reinterpret_cast<const char*>(node->content);
        else if (node->type == XML_ELEMENT_NODE)
            text += text_in(node->children);
    }
    return text;
}

_xmlNode* child(_xmlNode* node, std::string_view name) {
    for (_xmlNode* at = node->children; at; at = at->next)
        if (at->type == XML_ELEMENT_NODE && name == reinterpret_cast<const char*>(at->name)) return at;
    return nullptr;
}

_xmlNode* node_at(_xmlNode* node, std::string_view path) {
    while (node && !path.empty()) {
        const auto slash = std::min(path.find('/'), path.size());
        node = child(node, path.substr(0, slash));
        path.remove_prefix(std::min(slash + 1, path.size()));
    }
    return node;
}

std::optional<double> number_of(std::string_view text) {
    if (text.starts_with('+')) text.remove_prefix(1);
    double value = 0.0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc{} || end != text.data() + text.size() || !std::isfinite(value)) return std::nullopt;
    return value;
}

}  // namespace

void refuse_opening(const std::string& file) {
    const std::string cause = errno != 0 ? std::generic_category().message(errno) : "not a regular file";
    throw MissionRefusal{QUO_NOT_OPENED, file + ": " + cause};
}

MissionXml::MissionXml(const std::string& file) : name_{file}, document_{nullptr} {
    errno = 0;
    const auto bytes = file_length(file.c_str());
    if (!bytes) refuse_opening(file);
    if (*bytes > kMostBytes) throw MissionRefusal{QUO_REFUSED, file + ": is too long for a product's description"};
    // By its bytes: a name would be read as an address, and what is compressed would be unpacked without a bound.
    const auto text = read_file(file.c_str(), kMostBytes);
    if (!text) throw MissionRefusal{errno == ENOMEM ? QUO_NO_MEMORY : QUO_READ_FAILED, file + ": cannot be read"};
    const XmlErrors errors;
    xmlDoc* const document = xmlReadMemory(text->data(), static_cast<int>(text->size()), nullptr, nullptr,
                                           kHeaderOptions | XML_PARSE_NOCDATA);
    errno = 0;
    document_ = document;
    if (errors.out_of_memory() || !document || !xmlDocGetRootElement(document) || document->intSubset) {
        xmlFreeDoc(document);
        throw MissionRefusal{errors.out_of_memory() ? QUO_NO_MEMORY : QUO_REFUSED,
                             file + ": is no XML file that can be read"};
    }
}

MissionXml::~MissionXml() { xmlFreeDoc(static_cast<xmlDoc*>(document_)); }

MissionXml::Element MissionXml::root() const {
    return {xmlDocGetRootElement(static_cast<xmlDoc*>(document_)), this};
}

std::optional<MissionXml::Element> MissionXml::Element::find(std::string_view path) const {
    _xmlNode* const node = node_at(node_, path);
    return node ? std::optional{Element{node, file_}} : std::nullopt;
}

std::vector<MissionXml::Element> MissionXml::Element::list(std::string_view path, std::string_view name) const {
    std::vector<Element> elements;
    const _xmlNode* const above = node_at(node_, path);
    for (_xmlNode* at = above ? above->children : nullptr; at; at = at->next)
        if (at->type == XML_ELEMENT_NODE && name == reinterpret_cast<const char*>(at->name))
            elements.emplace_back(at, file_);
    return elements;
}

std::string MissionXml::Element::text() const { return std::string{trimmed(text_in(node_->children))}; }
std::string MissionXml::Element::attribute(const char* name) const {
    const xmlAttr* const found = xmlHasProp(node_, reinterpret_cast<const xmlChar*>(name));
    return found ? std::string{trimmed(text_in(found->children))} : std::string{};
}

void MissionXml::Element::refuse(const std::string& why, int status) const {
    throw MissionRefusal{status, file_->name() + ": line " + std::to_string(xmlGetLineNo(node_)) + ": " + why};
}

MissionXml::Element MissionXml::Element::at(std::string_view path) const {
    if (const auto element = find(path)) return *element;
    refuse("no element " + std::string{path} + " in " + reinterpret_cast<const char*>(node_->name));
}

std::string MissionXml::Element::text(std::string_view path) const { return at(path).text(); }

double MissionXml::Element::number(std::string_view path) const {
    const Element element = at(path);
    const std::string text = element.text();
    if (const auto value = number_of(text)) return *value;
    element.refuse(std::string{path} + " is \"" + text + "\", not a number");
}

std::int32_t MissionXml::Element::integer(std::string_view path) const {
    const double value = number(path);
    if (value != std::floor(value) || std::abs(value) > std::numeric_limits<std::int32_t>::max())
        at(path).refuse(std::string{path} + " is no whole number");
    return static_cast<std::int32_t>(value);
}

SplitTime MissionXml::Element::time(std::string_view path) const {
    const Element element = at(path);
    const std::string text = element.text();
    if (const auto time = split_time(text)) return *time;
    element.refuse(std::string{path} + " is \"" + text + "\", not a time");
}

std::vector<double> MissionXml::Element::numbers(std::string_view path) const {
    const Element element = at(path);
    const std::string text = element.text();
    std::vector<double> values;
    for (std::string_view rest = trimmed(text); !rest.empty(); rest = trimmed(rest)) {
        const auto end = std::min(rest.find_first_of(" \t\r\n"), rest.size());
        const auto value = number_of(rest.substr(0, end));
        if (!value) element.refuse(std::string{path} + " holds what is not a number");
        values.push_back(*value);
        rest.remove_prefix(end);
    }
    return values;
}

bool MissionXml::Element::truth(std::string_view path) const {
    const auto element = find(path);
    return element && element->text() == "true";
}

}  // namespace quo
