#include "quorelxmllib/field_table.h"

#include <cstring>

#include "quo_base/profile.h"

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

void copy_values(parElement::ParameterType type, std::int32_t count, std::size_t room, const void* from,
                 void* to) {
    const std::size_t bytes = static_cast<std::size_t>(count) * value_size(type, room);
    if (bytes > 0) std::memcpy(to, from, bytes);
}

const parElement* registered_array(const GeneralSAR_BaseXML& object, const char* name) {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement* element = object.element(i);
        if (std::string_view{element->name} == name) return element->count > 0 ? element : nullptr;
    }
    return nullptr;
}

}  // namespace quo
