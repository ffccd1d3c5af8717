// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_FIELDS_H
#define QUO_TESTS_SUPPORT_FIELDS_H

#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"
#include "support/escapes.h"

/** Header objects seen from outside: what their documentation promises, field by field, and the means to fill,
 * compare, print and damage them without knowing their class. */
namespace test {

inline std::string digits(char* text) { return text; }

/** Calls `use` with each value of an element: a reference to a number, the place of a text. */
template <typename Use>
void for_each_value(const parElement& element, Use use) {
    const auto all = [&](auto* values) {
        for (std::ptrdiff_t i = 0; i < element.count; ++i) use(values[i]);
    };
    char* const text = static_cast<char*>(element.pointer);
    switch (element.type) {
        case parElement::typeDouble:
            return all(static_cast<double*>(element.pointer));
        case parElement::typeFloat:
            return all(static_cast<float*>(element.pointer));
        case parElement::typeInt:
            return all(static_cast<std::int32_t*>(element.pointer));
        case parElement::typeString:
            return element.count == 1 ? all(&text) : all(static_cast<char* const*>(element.pointer));
        case parElement::typeNone:
            ADD_FAILURE() << element.name << " has no type";
    }
}

/** The values of one element, each as text that tells any two apart. */
inline std::vector<std::string> values_of(const parElement& element) {
    std::vector<std::string> values;
    for_each_value(element, [&](auto value) { values.push_back(digits(value)); });
    return values;
}

/** Gives every value of the object a number or text of its own. The numbers have few digits, so that "%.15g" keeps
 * them, and the same seed makes the same values. */
inline void fill_fields(const GeneralSAR_BaseXML& object, int seed = 1) {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement& element = *object.element(i);
        int number = 803457 + 7919 * seed + 37 * i;
        for_each_value(element, [&]<typename T>(T& value) {
            if constexpr (std::is_pointer_v<T>)
                std::snprintf(value, element.room, "%s", ("Value " + std::to_string(number) + " <& more").c_str());
            else
                value = static_cast<T>(number) / static_cast<T>(std::is_same_v<T, double>  ? 1000
                                                                : std::is_same_v<T, float> ? 7
                                                                                           : 1);
            ++number;
        });
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

/** A header file without one element. */
inline std::string without_element(std::string file, const std::string& name) {
    const auto start = file.find("<" + name + ">"), end = file.find("</" + name + ">");
    EXPECT_TRUE(start != file.npos && end != file.npos) << name;
    return file.erase(start, end + name.size() + 3 - start);
}

}  // namespace test

#endif
