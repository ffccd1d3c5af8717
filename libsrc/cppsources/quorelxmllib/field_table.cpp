#include "quorelxmllib/field_table.h"

#include <cstring>

#include "quo_base/profile.h"
#include "sarutillib/bounded_text.h"
#include "sarutillib/file_io.h"

namespace quo {
namespace {

std::size_t value_size(parElement::ParameterType type, std::size_t room) {
    switch (type) {
        case parElement::typeDouble:
            return sizeof(double);
        case parElement::typeFloat:
            return sizeof(float);
        case parElement::typeInt:
            return sizeof(std::int32_t);
        case parElement::typeString:
            return room;
        case parElement::typeNone:
            break;
    }
    return 0;
}

bool read_profile_field(const FieldValue& field, const char* section, const char* file) {
    switch (field.type) {
        case parElement::typeDouble:
            return GetProfileDoubleArray(section, field.key, static_cast<double*>(field.pointer), field.count,
                                         file) == QUO_OK;
        case parElement::typeFloat:
            return GetMyProfileFloatArray(section, field.key, static_cast<float*>(field.pointer), field.count,
                                          file) == QUO_OK;
        case parElement::typeInt:
            return GetMyProfileIntArray(section, field.key, static_cast<std::int32_t*>(field.pointer), field.count,
                                        file) == QUO_OK;
        case parElement::typeString:
            return GetMyProfileString(section, field.key, static_cast<char*>(field.pointer),
                                      static_cast<int>(field.room), file) == QUO_OK;
        case parElement::typeNone:
            break;
    }
    return false;
}

bool same_text(const void* a, const void* b) {
    return text_or_empty(static_cast<const char*>(a)) == text_or_empty(static_cast<const char*>(b));
}

bool same_texts(const parElement& a, const parElement& b) {
    if (!a.text_array) return same_text(a.pointer, b.pointer);
    return std::equal(static_cast<char* const*>(a.pointer), static_cast<char* const*>(a.pointer) + a.count,
                      static_cast<char* const*>(b.pointer), same_text);
}

bool same_values(const parElement& a, const parElement& b) {
    if (a.type != b.type || a.count != b.count) return false;
    if (a.count == 0) return true;
    if (a.type == parElement::typeString) return same_texts(a, b);
    return std::memcmp(a.pointer, b.pointer, static_cast<std::size_t>(a.count) * value_size(a.type, 0)) == 0;
}

}  // namespace

bool read_profile_fields(std::span<const FieldValue> fields, const char* section, const char* file) {
    bool complete = true;
    for (const FieldValue& field : fields) {
        if (field.in_profile == InProfile::kAbsent || field.count < 1) continue;
        const bool read = read_profile_field(field, section, file);
        if (!read && field.in_profile == InProfile::kMandatory) complete = false;
    }
    return complete;
}

template <typename Values>
static void copy_bytes(const Values& from, const Values& to) {
    const std::size_t bytes = static_cast<std::size_t>(from.count) * value_size(from.type, from.room);
    if (bytes > 0) std::memcpy(to.pointer, from.pointer, bytes);
}

void copy_values(const FieldValue& from, const FieldValue& to) { copy_bytes(from, to); }

void copy_values(const parElement& from, const parElement& to) { copy_bytes(from, to); }

const parElement* registered_array(const GeneralSAR_BaseXML& object, const char* name) {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement* element = object.element(i);
        if (std::string_view{element->name} == name) return element->count > 0 ? element : nullptr;
    }
    return nullptr;
}

const char* first_difference(const GeneralSAR_BaseXML& a, const GeneralSAR_BaseXML& b) {
    for (int i = 0; i < std::max(a.elementCount(), b.elementCount()); ++i) {
        const parElement *left = a.element(i), *right = b.element(i);
        if (!left || !right) return (left ? left : right)->name;
        if (!same_values(*left, *right)) return left->name;
    }
    return nullptr;
}

}  // namespace quo
