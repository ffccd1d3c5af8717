#ifndef QUO_TESTS_SUPPORT_FIELDS_H
#define QUO_TESTS_SUPPORT_FIELDS_H

#include <gtest/gtest.h>

#include <cerrno>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "quo_base/quorelxml_v2.h"

/** Header objects seen from outside: what their documentation promises, field by field, and the means to fill,
 * compare, print and damage them without knowing their class. */
namespace test {

/** The shortest text that tells a number from any other of its type. */
template <typename Number>
std::string digits(Number value) {
    char buffer[40];
    return {buffer, std::to_chars(buffer, std::end(buffer), value).ptr};
}

/** The values of one element, each as text that tells any two apart. */
inline std::vector<std::string> values_of(const parElement& element) {
    std::vector<std::string> values;
    for (std::ptrdiff_t i = 0; i < element.count; ++i) {
        switch (element.type) {
            case parElement::typeDouble:
                values.push_back(digits(static_cast<const double*>(element.pointer)[i]));
                break;
            case parElement::typeFloat:
                values.push_back(digits(static_cast<const float*>(element.pointer)[i]));
                break;
            case parElement::typeInt:
                values.push_back(std::to_string(static_cast<const std::int32_t*>(element.pointer)[i]));
                break;
            case parElement::typeString:
                values.emplace_back(element.count == 1 ? static_cast<const char*>(element.pointer)
                                                       : static_cast<char* const*>(element.pointer)[i]);
                break;
            case parElement::typeNone:
                values.emplace_back("no type");
                break;
        }
    }
    return values;
}

/** Gives every value of the object a number or text of its own. The numbers have few digits, so that "%.15g" keeps
 * them, and the same seed makes the same values. */
inline void fill_fields(const GeneralSAR_BaseXML& object, int seed = 1) {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement& element = *object.element(i);
        for (int k = 0; k < element.count; ++k) {
            const int number = 803457 + 7919 * seed + 37 * i + k;
            const std::string words = "Value " + std::to_string(number) + " <& more";
            switch (element.type) {
                case parElement::typeDouble:
                    static_cast<double*>(element.pointer)[k] = number / 1000.0;
                    break;
                case parElement::typeFloat:
                    static_cast<float*>(element.pointer)[k] = static_cast<float>(number) / 7.0F;
                    break;
                case parElement::typeInt:
                    static_cast<std::int32_t*>(element.pointer)[k] = number;
                    break;
                case parElement::typeString: {
                    char* to = element.count == 1 ? static_cast<char*>(element.pointer)
                                                  : static_cast<char**>(element.pointer)[k];
                    std::snprintf(to, element.room, "%s", words.c_str());
                    break;
                }
                case parElement::typeNone:
                    ADD_FAILURE() << element.name << " has no type";
                    break;
            }
        }
    }
}

/** Names of the elements in which two objects of one class differ. */
inline std::vector<std::string> differing_fields(const GeneralSAR_BaseXML& a, const GeneralSAR_BaseXML& b) {
    EXPECT_EQ(a.elementCount(), b.elementCount());
    std::vector<std::string> names;
    for (int i = 0; i < a.elementCount(); ++i)
        if (values_of(*a.element(i)) != values_of(*b.element(i))) names.emplace_back(a.element(i)->name);
    return names;
}

/** Names of all elements, in the order of registration. */
inline std::vector<std::string> field_names(const GeneralSAR_BaseXML& object) {
    std::vector<std::string> names;
    names.reserve(static_cast<std::size_t>(object.elementCount()));
    for (int i = 0; i < object.elementCount(); ++i) names.emplace_back(object.element(i)->name);
    return names;
}

/** The lines of a table of the test data, each cut at the separator into at most `columns` texts. */
inline std::vector<std::vector<std::string>> read_table(const std::string& name, char separator = ',',
                                                        std::size_t columns = 100) {
    std::ifstream file{QUO_TEST_DATA + ("/" + name)};
    EXPECT_TRUE(file) << name;
    std::vector<std::vector<std::string>> rows;
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with('#')) continue;
        std::vector<std::string>& row = rows.emplace_back();
        for (auto end = line.find(separator); end != line.npos && row.size() + 1 < columns;
             end = line.find(separator)) {
            row.push_back(line.substr(0, end));
            line.erase(0, end + 1);
        }
        row.push_back(line);
    }
    errno = 0;
    return rows;
}

/** What is promised of a field. */
struct ListedField {
    std::string key;          ///< in parameter files; "-" where it is not read from them, empty where none is read
    bool mandatory;           ///< in parameter files
    std::string description;  ///< see described()
};

/** The listed fields of a class, in order. */
inline std::vector<ListedField> listed_fields(const std::string& name) {
    std::vector<ListedField> fields;
    for (const auto& row : read_table("objects/fields.csv", ',', 4))
        if (row[0] == name) fields.push_back({row[1], row[2] == "mandatory", row[3]});
    return fields;
}

/** Which values of an element make sense: "]0 inf]", "filled", "listed A|B". */
inline std::string described(const parRule& rule) {
    constexpr const char* kTexts[] = {"", "filled", "listed", "date"};
    std::string text = kTexts[rule.text];
    if (rule.bounded)
        text += (rule.above_lowest ? "]" : "[") + digits(rule.lowest) + " " + digits(rule.highest) + "]";
    for (const std::string_view word : rule.texts) text.append("|").append(word);
    return text;
}

/** An element as it stands in a new object: "name,type,count,minimum,maximum,presence,default,rule". */
inline std::string described(const parElement& element) {
    constexpr const char* kTypes[] = {"double", "float", "int", "text", "none"};
    std::string text = element.name + std::string{","} + kTypes[element.type];
    if (element.type == parElement::typeString) text += "[" + std::to_string(element.room) + "]";
    text += "," + std::to_string(element.count) + "," + digits(element.minimum) + "," + digits(element.maximum) +
            (element.mandatory ? ",mandatory," : ",optional,");
    for (std::string separator; const std::string& value : values_of(element))
        text += std::exchange(separator, " ") + value;
    return text + "," + described(element.rule);
}

/** One element of a header file as written, tags included; empty when there is none. */
inline std::string element_text(const std::string& file, const std::string& name) {
    const auto start = file.find("<" + name + ">"), end = file.find("</" + name + ">");
    return start == file.npos || end == file.npos ? "" : file.substr(start, end + name.size() + 3 - start);
}

/** A header file without one element. */
inline std::string without_element(std::string file, const std::string& name) {
    const std::string element = element_text(file, name);
    EXPECT_NE(element, "") << name;
    return file.erase(file.find(element), element.size());
}

/** Names of an element's children, in the order of the file. */
inline std::vector<std::string> child_names(const std::string& file, const std::string& parent) {
    const std::string inside = element_text(file, parent);
    std::vector<std::string> names;
    int depth = 0;
    for (auto tag = inside.find('<'); tag != inside.npos; tag = inside.find('<', tag + 1)) {
        const auto end = inside.find('>', tag);
        if (inside[tag + 1] == '/') {
            --depth;
            continue;
        }
        if (depth == 1) names.push_back(inside.substr(tag + 1, inside.find_first_of(" />", tag + 1) - tag - 1));
        if (inside[end - 1] != '/') ++depth;
    }
    return names;
}

}  // namespace test

#endif
