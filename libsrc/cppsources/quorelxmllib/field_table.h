// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FIELD_TABLE_H
#define QUO_FIELD_TABLE_H

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

#include "diagnosticslib/call_frame.h"
#include "quo_base/quorelxml_v2.h"

namespace quo {

/** One function for each type of values, for parElement::withValues(). */
template <typename... Uses>
struct ForTypes : Uses... {
    using Uses::operator()...;
};
template <typename... Uses>
ForTypes(Uses...) -> ForTypes<Uses...>;

/** How a field takes part in the parameter-file fallback. */
enum class InProfile : std::uint8_t { kMandatory, kOptional, kAbsent };

/** What is done with an array member, whatever holds its values: a pointer, a unique_ptr or a vector. */
struct ArrayKind {
    /** The first value; null while there is none. */
    void* (*values)(void* member);
    /** Puts zeros in the place of what the array held, nothing for a count of 0. False, with an empty array, when
     * memory is short. */
    bool (*renew)(void* member, std::size_t count);
    /** Copies an array that knows its own length, as renew() does; null for the others. */
    bool (*assign)(void* member, const void* from);
};

/** What a parameter file calls one value of a whole number. */
struct NamedCode {
    std::string_view name;
    std::int32_t code;
};

/** One row: all that is known of a field. The owner is an object of the class that the row was made for. */
struct Field {
    const char *name = "", *key = "";  // of the element, and in parameter files
    parElement::ParameterType type = parElement::typeNone;
    std::int32_t count = 0;  // values; of an array of any length 0
    std::size_t room = parElement::kTextRoom;
    double minimum = 0.0, maximum = 0.0;
    bool mandatory = true;
    InProfile in_profile = InProfile::kMandatory;
    parRule rule;
    const char *unit = "", *meaning = "";
    std::span<const NamedCode> names;  // of a single int that parameter files tell by name; empty for numbers
    std::int32_t unnamed = 0;          // what another text, or none, stands for; below 0 it is a missing key

    void* (*member)(void* owner) = nullptr;
    const ArrayKind* array = nullptr;          // of an array of any length
    bool is_array = false, is_vector = false;  // the same, and whether it can be copied, for the compiler's checks
    std::int32_t* (*length)(void* owner) = nullptr;
    std::int32_t per_length = 0;  // values per unit of length; 0: no length is known
    std::int32_t most = 0;        // values that are believed, of an array that XML does not have; 0: XML has it

    /** Values that the length member asks for; nothing when that is more than an int can count. */
    [[nodiscard]] std::optional<std::int32_t> wanted_count(void* owner) const;
    /** The field of one object as it is now. */
    void describe(void* owner, parElement& element) const;
};

/** An object together with its table: what every record does with its fields is written here once. */
class Record {
public:
    Record(const char* section, std::span<const Field> fields, GeneralSAR_BaseXML& object, void* owner)
        : section_{section}, fields_{fields}, object_{object}, owner_{owner} {}

    /** The whole of refreshParameters(): registers every field and sets the allocation flag. */
    void register_all() const;
    /** createBuffers() for the arrays of the table: a length above 0 that the source cannot hold is refused (1), a
     * failed allocation gives 7; neither leaves an array behind. */
    [[nodiscard]] int create_buffers() const;
    /** The same with an entry for a failure, `implausible` for a refused length. */
    [[nodiscard]] int create_buffers(CallFrame& frame, const char* implausible) const;
    /** destroyBuffers() for the arrays of the table: released, their lengths 0, and the allocation flag cleared
     * where an element lost its values. */
    int destroy_buffers() const;
    /** Copies every field of another object of the class, the arrays made anew. 0; 7; or the status of
     * createBuffers(). */
    [[nodiscard]] int copy(const Record& from) const;
    /** Reads the XML section, else the parameter file. 0; 7 when the buffers found no memory; 1. */
    [[nodiscard]] int read(const char* file) const;
    /** Reads the fields from the parameter file: single values and arrays of fixed size, then createBuffers(),
     * then the arrays that it made. Every key is read, even after a failure. The file does not stay among the
     * parameter files in memory. `keys` take the place of the table's, one for each field.
     * @return 0; 1, with the pending errors cleared, when a mandatory key failed, and with nothing read when the
     * other form of the file was not found missing but could not be read. */
    int read_profile(const char* file, const char* section, std::span<const char* const> keys = {}) const;
    /** The same whatever became of the other form; whether no mandatory key failed. */
    bool read_whole_profile(const char* file, const char* section, std::span<const char* const> keys = {}) const;

    /** 4 or 7 when the object's last read of a header file failed because the file could not be read or for want
     * of memory, else 0: then its section is not missing, and no other form of the file may take its place. */
    static int unread(const GeneralSAR_BaseXML& object) { return object.unread_; }

private:
    [[nodiscard]] bool has_arrays() const;
    [[nodiscard]] const parElement* allocated(std::size_t row) const;
    void copy_values(const Record& from, std::size_t row) const;
    bool read_keys(const char* file, const char* section, std::span<const char* const> keys, bool arrays) const;

    const char* section_;
    std::span<const Field> fields_;
    GeneralSAR_BaseXML& object_;
    void* owner_;
};

/** Copies the values of an element to another one of the same type, count and room. */
void copy_values(const parElement& from, const parElement& to);

// --- the rules of a row ---------------------------------------------------------------------------------------

/** The values that make sense; not enforced on reading. */
constexpr auto bounds(double minimum, double maximum) {
    return [=](Field& field) {
        field.minimum = minimum;
        field.maximum = maximum;
    };
}

constexpr auto checked_by(parRule rule) {
    return [=](Field& field) { field.rule = rule; };
}
/** Which numbers make sense where a field is registered without bounds, or with other ones that older readers
 * rely on. */
constexpr auto between(double lowest, double highest) {
    return checked_by({.bounded = true, .lowest = lowest, .highest = highest});
}
constexpr auto at_least(double lowest) { return between(lowest, std::numeric_limits<double>::infinity()); }
constexpr auto above(double limit) {
    return checked_by({.bounded = true,
                       .above_lowest = true,
                       .lowest = limit,
                       .highest = std::numeric_limits<double>::infinity()});
}
/** The only texts of a field, in an array that stays. */
constexpr auto one_of(std::span<const std::string_view> texts) {
    return checked_by({.text = parRule::listedText, .texts = texts});
}
/** A text that says something, and one that is a date. */
inline constexpr auto kFilled = checked_by({.text = parRule::filledText});
inline constexpr auto kDate = checked_by({.text = parRule::dateText});

/** Parameter files tell the value, a single int, by one of the names, in an array that stays. Another text stands
 * for `otherwise`; below 0, it counts as missing. */
constexpr auto named(std::span<const NamedCode> names, std::int32_t otherwise) {
    return [=](Field& field) {
        field.names = names;
        field.unnamed = otherwise;
    };
}
/** The unit of the values. */
constexpr auto unit(const char* unit) {
    return [=](Field& field) { field.unit = unit; };
}
/** The same with what the value is, for generated documentation. */
constexpr auto note(const char* unit, const char* meaning) {
    return [=](Field& field) {
        field.unit = unit;
        field.meaning = meaning;
    };
}
/** The element name, where it is not the member's own. */
constexpr auto element(const char* name) {
    return [=](Field& field) { field.name = name; };
}

/** The field may be missing in a parameter file. */
inline constexpr auto kProfileOptional = [](Field& field) { field.in_profile = InProfile::kOptional; };
/** The field may be missing, in the XML section and in a parameter file. */
inline constexpr auto kOptional = [](Field& field) {
    field.mandatory = false;
    field.in_profile = InProfile::kOptional;
};
/** Parameter files do not have the field. */
inline constexpr auto kXmlOnly = [](Field& field) { field.in_profile = InProfile::kAbsent; };
/** The XML section does not have the array, which a file cannot make longer than `most`; last rows only. */
constexpr auto profile_only(std::int32_t most) {
    return [=](Field& field) { field.most = most; };
}
/** Nor does a parameter file. */
constexpr auto in_memory_only(std::int32_t most) {
    return [=](Field& field) {
        field.most = most;
        field.in_profile = InProfile::kAbsent;
    };
}

/** The length of an array of any length; see QUO_LENGTH. */
template <typename Owner, auto Member>
constexpr auto length(std::int32_t per_length = 1) {
    return [=](Field& field) {
        field.length = [](void* owner) -> std::int32_t* { return &(static_cast<Owner*>(owner)->*Member); };
        field.per_length = per_length;
    };
}

// --- what follows from a member's type --------------------------------------------------------------------------

template <typename T>
constexpr parElement::ParameterType type_of() {
    if constexpr (std::same_as<T, char>) return parElement::typeString;
    if constexpr (std::same_as<T, double>) return parElement::typeDouble;
    if constexpr (std::same_as<T, float>) return parElement::typeFloat;
    static_assert(std::same_as<T, char> || std::floating_point<T> || std::same_as<T, std::int32_t>,
                  "a field holds doubles, floats, 32-bit ints or text");
    return parElement::typeInt;
}

// Arrays of an object outlive the call that makes them, so they never come from the tracked allocator.
template <typename T>
bool renew_array(T*& array, std::size_t count) {
    delete[] std::exchange(array, nullptr);
    if (count > 0) array = new (std::nothrow) T[count]();
    return array || count == 0;
}
template <typename T>
bool renew_array(std::unique_ptr<T[]>& array, std::size_t count) {
    T* values = array.release();
    const bool made = renew_array(values, count);
    array.reset(values);
    return made;
}
template <typename T>
bool copy_array(std::vector<T>& array, const std::vector<T>& from) {
    try {
        array = from;
        return true;
    } catch (const std::bad_alloc&) {
        return false;
    }
}
template <typename T>
bool renew_array(std::vector<T>& array, std::size_t count) {
    array = {};
    try {
        array.resize(count);
        return true;
    } catch (const std::bad_alloc&) {
        return false;
    }
}

template <typename T>
T* values_of(T*& array) {
    return array;
}
template <typename T>
T* values_of(std::unique_ptr<T[]>& array) {
    return array.get();
}
template <typename T>
T* values_of(std::vector<T>& array) {
    return array.empty() ? nullptr : array.data();
}

template <typename Member>
inline constexpr ArrayKind kArrayKind{
    [](void* member) -> void* { return values_of(*static_cast<Member*>(member)); },
    [](void* member, std::size_t count) { return renew_array(*static_cast<Member*>(member), count); },
    [] {
        bool (*assign)(void*, const void*) = nullptr;
        if constexpr (requires(Member & to, const Member& from) { copy_array(to, from); })
            assign = [](void* member, const void* from) {
                return copy_array(*static_cast<Member*>(member), *static_cast<const Member*>(from));
            };
        return assign;
    }()};

/** A row of the table of `Owner`. */
template <typename Owner>
struct Row : Field {};

/** A row for `Member` of `Owner`; use QUO_FIELD. */
template <typename Owner, auto Member, typename... Rules>
constexpr Row<Owner> field(const char* name, Rules... rules) {
    using Value = std::remove_reference_t<decltype(std::declval<Owner&>().*Member)>;
    using Entry = std::remove_extent_t<Value>;
    Row<Owner> row;
    row.name = row.key = name;
    row.member = [](void* owner) -> void* { return &(static_cast<Owner*>(owner)->*Member); };
    if constexpr (std::is_arithmetic_v<Entry>) {
        row.type = type_of<Entry>();
        row.count = std::is_array_v<Value> && !std::same_as<Entry, char> ? int{std::extent_v<Value>} : 1;
        if constexpr (std::same_as<Entry, char>) row.room = std::extent_v<Value>;
    } else {
        row.type = type_of<std::remove_pointer_t<decltype(values_of(std::declval<Value&>()))>>();
        row.array = &kArrayKind<Value>;
        row.is_array = true;
        row.is_vector = requires(Value & to, const Value& from) { copy_array(to, from); };
    }
    [[maybe_unused]] const auto apply = [&row](auto rule) {
        if constexpr (std::convertible_to<decltype(rule), const char*>)
            row.key = rule;
        else
            rule(row);
    };
    (apply(rules), ...);
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
    template <std::same_as<Row<Owner>>... Rows>
    constexpr FieldTable(const char* section, Rows... rows) : section_{section}, fields_{rows...} {
        for (const Field& field : fields_) {
            if (std::string_view{field.name}.size() >= sizeof(parElement::name)) throw "element name too long";
            if (field.is_array && field.per_length < 1) throw "array without QUO_LENGTH";
            if (field.most > 0 && !field.is_vector) throw "no vector, and not in XML";
            if (field.most == 0 && size_++ != &field - fields_.data()) throw "element behind one that XML lacks";
        }
    }

    /** Number of elements. */
    [[nodiscard]] constexpr int size() const { return size_; }
    [[nodiscard]] constexpr const char* section() const { return section_; }
    /** The row of an element, by its index; null beyond. */
    [[nodiscard]] constexpr const Field* row(int index) const {
        return index >= 0 && index < size() ? &fields_[static_cast<std::size_t>(index)] : nullptr;
    }

    /** The object as a record; what follows is short for its operations. */
    [[nodiscard]] Record of(Owner& object) const { return of(object, object); }
    /** The same where the fields are members of another object than the registered one. */
    [[nodiscard]] Record of(GeneralSAR_BaseXML& object, Owner& owner) const {
        return {section_, fields_, object, &owner};
    }
    void register_all(Owner& object) const { of(object).register_all(); }
    [[nodiscard]] int create_buffers(Owner& object) const { return of(object).create_buffers(); }
    int destroy_buffers(Owner& object) const { return of(object).destroy_buffers(); }
    int copy(const Owner& from, Owner& to) const {
        return of(to).copy(of(const_cast<Owner&>(from)));  // only read: the rows hand out one kind of pointer
    }
    int read(Owner& object, const char* file) const { return of(object).read(file); }
    int read_profile(Owner& object, const char* file) const { return of(object).read_profile(file, section_); }

private:
    const char* section_;
    int size_ = 0;
    std::array<Field, N> fields_;
};

template <typename Owner, typename... Rest>
FieldTable(const char*, Row<Owner>, Rest...) -> FieldTable<Owner, 1 + sizeof...(Rest)>;

}  // namespace quo

/** A row for a member of `Obj`, the class that the file's `using Obj = ...` names. After the member: the
 * parameter-file key where it differs, and rules (quo::bounds, quo::element, quo::note, quo::kOptional,
 * quo::kProfileOptional, quo::kXmlOnly, quo::profile_only, quo::in_memory_only, QUO_LENGTH; for checks alone
 * quo::between, quo::at_least, quo::above, quo::one_of, quo::kFilled, quo::kDate). */
#define QUO_FIELD(member, ...) quo::field<Obj, &Obj::member>(#member __VA_OPT__(, ) __VA_ARGS__)
/** Rule of an array member: its length is an int32_t member of `Obj`, times an optional number of values each. */
#define QUO_LENGTH(member, ...) quo::length<Obj, &Obj::member>(__VA_ARGS__)

/** What a class with a table defines: how it is made and registered, and where a header holds it as one section,
 * how it is copied, read and written too. */
#define QUO_RECORD(Class, table)                             \
    Class::Class() { createElementsVector((table).size()); } \
    void Class::refreshParameters() { (table).register_all(*this); }
#define QUO_HEADER_RECORD(Class, table)                                        \
    QUO_RECORD(Class, table)                                                   \
    /* NOLINTNEXTLINE(bugprone-macro-parentheses): a type takes none */        \
    int Class::clone(Class* to) const { return (table).copy(*this, *to); }     \
    int Class::readhdr(const char* file) { return (table).read(*this, file); } \
    int Class::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, (table).section()); }

#endif
