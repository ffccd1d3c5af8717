#ifndef QUO_FIELD_TABLE_H
#define QUO_FIELD_TABLE_H

#include <algorithm>
#include <array>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <new>
#include <optional>
#include <span>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "profilelib/profile_look.h"
#include "quo_base/ckerr.h"
#include "quo_base/quorelxml_v2.h"
#include "sarutillib/checked_size.h"

namespace quo {

/** How a field takes part in the parameter-file fallback. */
enum class InProfile : std::uint8_t { kMandatory, kOptional, kAbsent };

/** One field of one object at one moment, whatever its class: what registering, copying and the parameter-file
 * fallback need. */
struct FieldValue {
    const char* name;  // element name
    const char* key;   // parameter-file key
    parElement::ParameterType type;
    void* pointer;       // null while an array is not allocated
    std::int32_t count;  // 0 while an array is not allocated
    double minimum, maximum;
    bool mandatory;
    InProfile in_profile;
    std::size_t room;  // bytes of a text
    parRule rule;
};

/** Way to the registry's protected operations for the field tables and the header sessions. */
struct RegistryAccess {
    static void add(GeneralSAR_BaseXML& object, const FieldValue& field);
    static void set_allocated(GeneralSAR_BaseXML& object, bool allocated);
    static void refresh(GeneralSAR_BaseXML& object);
    /** Whether an array of `count` values may be allocated for what the object is being read from. */
    static bool can_hold(const GeneralSAR_BaseXML& object, std::int64_t count);
    /** 4 or 7 when the object's last read of a header file failed because the file could not be read or for want
     * of memory, else 0: then its section is not missing, and no other form of the file may take its place. */
    static int unread(const GeneralSAR_BaseXML& object);
    /** Names the parameter file that is being read as the source of lengths; null ends it. */
    static void set_source(GeneralSAR_BaseXML& object, const char* file);
};

/** Reads the fields from one section of a parameter file, every key even after a failure. False when a mandatory
 * key failed. */
bool read_profile_fields(std::span<const FieldValue> fields, const char* section, const char* file);

/** Copies values of one type; `room` is that of a text. */
void copy_values(parElement::ParameterType type, std::int32_t count, std::size_t room, const void* from, void* to);
/** The registered element of this name if it holds values now, else null. */
const parElement* registered_array(const GeneralSAR_BaseXML& object, const char* name);

/** One row of a field table. */
template <typename Owner>
struct Field {
    const char* name = nullptr;
    const char* key = nullptr;
    parElement::ParameterType type = parElement::typeNone;
    double minimum = 0.0, maximum = 0.0;
    bool mandatory = true;
    InProfile in_profile = InProfile::kMandatory;
    std::size_t room = 0;
    parRule rule;
    const char *unit = "", *meaning = "";

    void* (*address)(Owner&) = nullptr;  // first value; null while an array is not allocated
    std::int32_t fixed_count = 0;        // 0: the length is a member
    std::int32_t (*length)(const Owner&) = nullptr;
    void (*set_length)(Owner&, std::int32_t) = nullptr;
    std::int32_t per_length = 0;  // values per unit of length; 0: no length is known
    bool (*allocate)(Owner&, std::size_t) = nullptr;
    void (*release)(Owner&) = nullptr;

    [[nodiscard]] constexpr bool is_array_of_any_length() const { return fixed_count == 0; }
    /** Values that the object's length member asks for; nothing when that is more than an int can count. */
    [[nodiscard]] std::optional<std::int32_t> wanted_count(const Owner& object) const {
        if (!is_array_of_any_length()) return fixed_count;
        return (Checked<std::int32_t>{std::max(length(object), 0)} * per_length).value();
    }
    [[nodiscard]] FieldValue at(Owner& object) const {
        void* pointer = address(object);
        const std::int32_t count = pointer ? wanted_count(object).value_or(0) : 0;
        return {name, key, type, pointer, count, minimum, maximum, mandatory, in_profile, room, rule};
    }
};

// --- the rules of a row ---------------------------------------------------------------------------------------

struct Bounds {
    double minimum, maximum;
};
/** The values that make sense; not enforced on reading. */
constexpr Bounds bounds(double minimum, double maximum) { return {minimum, maximum}; }

/** Which numbers make sense where a field is registered without bounds, or with other ones that older readers
 * rely on. */
constexpr parRule between(double lowest, double highest) {
    return {.bounded = true, .lowest = lowest, .highest = highest};
}
constexpr parRule at_least(double lowest) { return between(lowest, std::numeric_limits<double>::infinity()); }
constexpr parRule above(double limit) {
    parRule rule = at_least(limit);
    rule.above_lowest = true;
    return rule;
}
/** The only texts of a field, in an array that stays. */
constexpr parRule one_of(std::span<const std::string_view> texts) {
    return {.text = parRule::listedText, .texts = texts};
}
/** A text that says something, and one that is a date. */
inline constexpr parRule kFilled{.text = parRule::filledText};
inline constexpr parRule kDate{.text = parRule::dateText};

struct Note {
    const char *unit, *meaning;
};
/** What the value is, for generated documentation. */
constexpr Note note(const char* unit, const char* meaning) { return {unit, meaning}; }

struct Element {
    const char* name;
};
/** The element name, where it is not the member's own. */
constexpr Element element(const char* name) { return {name}; }

/** The length of an array of any length; see QUO_LENGTH. */
template <typename Owner>
struct Length {
    std::int32_t (*get)(const Owner&);
    void (*set)(Owner&, std::int32_t);
    std::int32_t per_length;
};
template <typename Owner, auto Member>
constexpr Length<Owner> length(std::int32_t per_length = 1) {
    return {[](const Owner& object) -> std::int32_t { return object.*Member; },
            [](Owner& object, std::int32_t value) { object.*Member = value; }, per_length};
}

enum class Presence : std::uint8_t { kOptional, kProfileOptional, kXmlOnly };
/** The field may be missing, in the XML section and in a parameter file. */
inline constexpr Presence kOptional = Presence::kOptional;
/** The field may be missing in a parameter file. */
inline constexpr Presence kProfileOptional = Presence::kProfileOptional;
/** Parameter files do not have the field. */
inline constexpr Presence kXmlOnly = Presence::kXmlOnly;

template <typename Owner>
constexpr void apply(Field<Owner>& field, const char* key) {
    field.key = key;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, Bounds rule) {
    field.minimum = rule.minimum;
    field.maximum = rule.maximum;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, parRule rule) {
    field.rule = rule;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, Note rule) {
    field.unit = rule.unit;
    field.meaning = rule.meaning;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, Element rule) {
    field.name = rule.name;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, Length<Owner> rule) {
    field.length = rule.get;
    field.set_length = rule.set;
    field.per_length = rule.per_length;
}
template <typename Owner>
constexpr void apply(Field<Owner>& field, Presence rule) {
    if (rule == Presence::kOptional) field.mandatory = false;
    if (rule == Presence::kXmlOnly)
        field.in_profile = InProfile::kAbsent;
    else if (field.in_profile != InProfile::kAbsent)
        field.in_profile = InProfile::kOptional;
}

// --- what follows from a member's type --------------------------------------------------------------------------

template <typename T>
constexpr parElement::ParameterType number_type() {
    if constexpr (std::same_as<T, double>) return parElement::typeDouble;
    if constexpr (std::same_as<T, float>) return parElement::typeFloat;
    static_assert(std::same_as<T, double> || std::same_as<T, float> || std::same_as<T, std::int32_t>,
                  "a field holds doubles, floats, 32-bit ints or text");
    return parElement::typeInt;
}

template <typename T>
T* data_of(T* array) {
    return array;
}
template <typename T>
T* data_of(std::unique_ptr<T[]>& array) {
    return array.get();
}
template <typename T>
T* data_of(std::vector<T>& array) {
    return array.empty() ? nullptr : array.data();
}

// Arrays of an object outlive the call that makes them, so they never come from the tracked allocator.
template <typename T>
bool allocate_array(std::unique_ptr<T[]>& array, std::size_t count) {
    array.reset(new (std::nothrow) T[count]());
    return array != nullptr;
}
template <typename T>
bool allocate_array(T*& array, std::size_t count) {
    delete[] array;
    array = new (std::nothrow) T[count]();
    return array != nullptr;
}
template <typename T>
bool allocate_array(std::vector<T>& array, std::size_t count) {
    try {
        array.assign(count, T{});
        return true;
    } catch (const std::bad_alloc&) {
        return false;
    }
}

template <typename T>
void release_array(std::unique_ptr<T[]>& array) {
    array.reset();
}
template <typename T>
void release_array(T*& array) {
    delete[] array;
    array = nullptr;
}
template <typename T>
void release_array(std::vector<T>& array) {
    array = {};
}

/** A row for `Member` of `Owner`; use QUO_FIELD. */
template <typename Owner, auto Member, typename... Rules>
constexpr Field<Owner> field(const char* name, Rules... rules) {
    using Value = std::remove_reference_t<decltype(std::declval<Owner&>().*Member)>;
    Field<Owner> row;
    row.name = row.key = name;
    if constexpr (std::is_array_v<Value>) {
        using Entry = std::remove_extent_t<Value>;
        row.address = [](Owner& object) -> void* { return object.*Member; };
        if constexpr (std::same_as<Entry, char>) {
            row.type = parElement::typeString;
            row.fixed_count = 1;
            row.room = std::extent_v<Value>;
        } else {
            row.type = number_type<Entry>();
            row.fixed_count = static_cast<std::int32_t>(std::extent_v<Value>);
        }
    } else if constexpr (std::is_arithmetic_v<Value>) {
        row.type = number_type<Value>();
        row.fixed_count = 1;
        row.address = [](Owner& object) -> void* { return &(object.*Member); };
    } else {
        using Entry = std::remove_pointer_t<decltype(data_of(std::declval<Value&>()))>;
        row.type = number_type<Entry>();
        row.address = [](Owner& object) -> void* { return data_of(object.*Member); };
        row.allocate = [](Owner& object, std::size_t count) { return allocate_array(object.*Member, count); };
        row.release = [](Owner& object) { release_array(object.*Member); };
    }
    (apply(row, rules), ...);
    return row;
}

/** The fields of a header object, listed once: registration, copying, buffers and the parameter-file fallback are
 * driven from this list.
 *
 *     using Obj = Pattern_Obj;
 *     constexpr quo::FieldTable kTable{
 *         "Pattern",
 *         QUO_FIELD(StartAngle),                                      // key and element name: the member's
 *         QUO_FIELD(fc_hz, "CarrierFrequency"),                       // another key in parameter files
 *         QUO_FIELD(Looks, quo::bounds(1, 1000), quo::kOptional),
 *         QUO_FIELD(Samples, QUO_LENGTH(nSamples, 3)),                // 3 * nSamples values, at a pointer,
 *         QUO_FIELD(nSamples),                                        // a unique_ptr or in a vector
 *     };
 */
template <typename Owner, std::size_t N>
class FieldTable {
public:
    template <std::same_as<Field<Owner>>... Fields>
    constexpr FieldTable(const char* section, Fields... fields) : section_{section}, fields_{fields...} {
        for (const Field<Owner>& field : fields_) {
            if (std::string_view{field.name}.size() >= sizeof(parElement::name)) throw "element name too long";
            if (field.is_array_of_any_length() && field.per_length < 1) throw "array without QUO_LENGTH";
        }
    }

    [[nodiscard]] constexpr int size() const { return static_cast<int>(N); }
    [[nodiscard]] constexpr const char* section() const { return section_; }
    /** The row of an element, by its index; null beyond. */
    [[nodiscard]] constexpr const Field<Owner>* row(int index) const {
        return index >= 0 && index < size() ? &fields_[static_cast<std::size_t>(index)] : nullptr;
    }

    /** The whole of refreshParameters(): registers every field and sets the allocation flag. */
    void register_all(Owner& object) const {
        for (const Field<Owner>& field : fields_) RegistryAccess::add(object, field.at(object));
        RegistryAccess::set_allocated(object, true);
    }

    /** createBuffers() for the arrays of the table: a length above 0 that the source cannot hold is refused (1), a
     * failed allocation gives 7; neither leaves an array behind. */
    [[nodiscard]] int create_buffers(Owner& object) const {
        for (const Field<Owner>& field : fields_) {
            if (!field.is_array_of_any_length()) continue;
            const auto count = field.wanted_count(object);
            if (!count || !RegistryAccess::can_hold(object, *count)) return release(object, QUO_REFUSED);
            field.release(object);
            if (*count > 0 && !field.allocate(object, static_cast<std::size_t>(*count)))
                return release(object, QUO_NO_MEMORY);
        }
        RegistryAccess::refresh(object);
        RegistryAccess::set_allocated(object, true);
        return QUO_OK;
    }

    /** destroyBuffers() for the arrays of the table: released, their lengths 0, the allocation flag cleared. */
    int destroy_buffers(Owner& object) const {
        for (const Field<Owner>& field : fields_) {
            if (!field.is_array_of_any_length()) continue;
            field.release(object);
            field.set_length(object, 0);
        }
        RegistryAccess::refresh(object);
        RegistryAccess::set_allocated(object, false);
        return QUO_OK;
    }

    /** Copies every field of `from` into `to`, whose arrays are made anew. 0, or the status of its
     * createBuffers(). */
    int copy(const Owner& from, Owner& to) const {
        if (&from == &to) return QUO_OK;
        auto& source = const_cast<Owner&>(from);  // only read: the rows hand out one kind of pointer
        if (has_arrays()) to.destroyBuffers();
        for (const Field<Owner>& field : fields_)
            if (!field.is_array_of_any_length())
                copy_values(field.type, field.fixed_count, field.room, field.address(source), field.address(to));
        if (has_allocated(from)) {
            if (const int status = to.createBuffers()) return status;
            copy_arrays(from, to);
        }
        RegistryAccess::refresh(to);
        return QUO_OK;
    }

    /** Reads the fields from the parameter file: single values and arrays of fixed size, then createBuffers(),
     * then the arrays that it made. Every key is read, even after a failure. The file does not stay among the
     * parameter files in memory.
     * @return 0; 1, with the pending errors cleared, when a mandatory key failed, and with nothing read when the
     * other form of the file was not found missing but could not be read. */
    int read_profile(Owner& object, const char* file) const { return read_profile(object, file, section_); }
    int read_profile(Owner& object, const char* file, const char* section) const {
        if (RegistryAccess::unread(object) == QUO_OK && read_profile_fully(object, file, section)) return QUO_OK;
        freeall_ckerr();
        return QUO_REFUSED;
    }

private:
    bool read_profile_fully(Owner& object, const char* file, const char* section) const {
        const ProfileLook look{file};
        const bool complete = read_profile_part(object, file, section, false);
        if (!has_arrays()) return complete;
        RegistryAccess::set_source(object, file);
        const bool arrays = object.createBuffers() == QUO_OK && read_profile_part(object, file, section, true);
        RegistryAccess::set_source(object, nullptr);
        return arrays && complete;
    }
    [[nodiscard]] int release(Owner& object, int status) const {
        destroy_buffers(object);
        return status;
    }
    [[nodiscard]] constexpr bool has_arrays() const {
        return std::ranges::any_of(fields_, &Field<Owner>::is_array_of_any_length);
    }
    [[nodiscard]] bool has_allocated(const Owner& object) const {
        return std::ranges::any_of(fields_, [&](const Field<Owner>& field) {
            return field.is_array_of_any_length() && registered_array(object, field.name);
        });
    }
    // Arrays are copied as they are registered: a length member may have been changed since they were allocated.
    void copy_arrays(const Owner& from, Owner& to) const {
        for (const Field<Owner>& field : fields_) {
            if (!field.is_array_of_any_length()) continue;
            const parElement *source = registered_array(from, field.name),
                             *target = registered_array(to, field.name);
            if (source && target && source->count == target->count)
                copy_values(field.type, source->count, 0, source->pointer, target->pointer);
        }
    }
    bool read_profile_part(Owner& object, const char* file, const char* section, bool arrays) const {
        std::array<FieldValue, N> part;
        std::size_t used = 0;
        for (const Field<Owner>& field : fields_)
            if (field.is_array_of_any_length() == arrays) part[used++] = field.at(object);
        return read_profile_fields(std::span{part}.first(used), section, file);
    }

    const char* section_;
    std::array<Field<Owner>, N> fields_;
};

template <typename Owner, typename... Rest>
FieldTable(const char*, Field<Owner>, Rest...) -> FieldTable<Owner, 1 + sizeof...(Rest)>;

}  // namespace quo

/** A row for a member of `Obj`, the class that the file's `using Obj = ...` names. After the member: the
 * parameter-file key where it differs, and rules (quo::bounds, quo::element, quo::kOptional,
 * quo::kProfileOptional, quo::kXmlOnly, QUO_LENGTH; for checks alone quo::between, quo::at_least, quo::above,
 * quo::one_of, quo::kFilled, quo::kDate). */
#define QUO_FIELD(member, ...) quo::field<Obj, &Obj::member>(#member __VA_OPT__(, ) __VA_ARGS__)
/** Rule of an array member: its length is an int32_t member of `Obj`, times an optional number of values each. */
#define QUO_LENGTH(member, ...) quo::length<Obj, &Obj::member>(__VA_ARGS__)

#endif
