// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/field_table.h"

#include <algorithm>
#include <cstring>

#include "profilelib/profile_look.h"
#include "quo_base/ckerr.h"
#include "quo_base/profile.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

namespace quo {
namespace {

bool read_key(const parElement& to, const char* key, const char* section, const char* file) {
    return QUO_OK ==
           to.withValues(ForTypes{
               [&](std::span<double> v) { return GetProfileDoubleArray(section, key, v.data(), to.count, file); },
               [&](std::span<float> v) { return GetMyProfileFloatArray(section, key, v.data(), to.count, file); },
               [&](std::span<std::int32_t> v) {
                   return GetMyProfileIntArray(section, key, v.data(), to.count, file);
               },
               [&](std::span<char* const> v) {
                   return GetMyProfileString(section, key, v[0], static_cast<int>(to.room), file);
               }});
}

bool read_name(const Field& field, std::int32_t& code, const char* key, const char* section, const char* file) {
    char text[parElement::kTextRoom] = "";
    const bool there = !GetMyProfileString(section, key, text, sizeof text, file);
    const auto found = std::ranges::find(field.names, text, &NamedCode::name);
    code = found == field.names.end() ? field.unnamed : found->code;
    return there && code >= 0;
}

bool is_keyed_array(const Field& field) { return field.array && field.in_profile != InProfile::kAbsent; }

}  // namespace

void copy_values(const parElement& from, const parElement& to) {
    const std::size_t bytes =
        from.withValues(ForTypes{[](auto values) { return values.size_bytes(); },
                                 [&](std::span<char* const> texts) { return texts.size() * from.room; }});
    if (bytes > 0 && from.pointer != to.pointer) std::memcpy(to.pointer, from.pointer, bytes);
}

std::optional<std::int32_t> Field::wanted_count(void* owner) const {
    return array ? (Checked<std::int32_t>{std::max(*length(owner), 0)} * per_length).value() : count;
}

void Field::describe(void* owner, parElement& element) const {
    void* const values = array ? array->values(member(owner)) : member(owner);
    element.setElement(name, values, type, values ? wanted_count(owner).value_or(0) : 0, minimum, maximum,
                       mandatory);
    element.room = room;
    element.rule = rule;
    element.unit = unit;
    element.meaning = meaning;
}

void Record::register_all() const {
    for (const Field& field : fields_) {
        if (field.most > 0 || object_.cursor_ >= object_.element_count_) continue;
        parElement& element = object_.elements_[object_.cursor_];
        element.section = section_;
        field.describe(owner_, element);
        object_.cursor_ = (object_.cursor_ + 1) % object_.element_count_;
    }
    object_.allocated_ = true;
}

bool Record::has_arrays() const { return std::ranges::any_of(fields_, &Field::array); }

/** The element of a row if it holds values now, as they were when it was registered: a length member may have been
 * changed since they were allocated. */
const parElement* Record::allocated(std::size_t row) const {
    const parElement* element = object_.element(static_cast<int>(row));
    return element && element->count > 0 ? element : nullptr;
}

int Record::create_buffers() const {
    for (const Field& field : fields_) {
        if (!field.array) continue;
        const auto count = field.wanted_count(owner_);
        const bool plausible = count && (field.most > 0 ? *count <= field.most : object_.sourceCanHold(*count));
        const int status = !plausible ? QUO_REFUSED
                           : field.array->renew(field.member(owner_), static_cast<std::size_t>(*count))
                               ? QUO_OK
                               : QUO_NO_MEMORY;
        if (status != QUO_OK) {
            destroy_buffers();
            return status;
        }
    }
    object_.refreshParameters();
    object_.allocated_ = true;
    return QUO_OK;
}

int Record::create_buffers(CallFrame& frame, const char* implausible) const {
    const int status = create_buffers();
    if (status == QUO_OK) return frame.success();
    return frame.fail(status, status == QUO_NO_MEMORY ? "Memory allocation failure" : implausible);
}

int Record::destroy_buffers() const {
    bool registered = false;
    for (const Field& field : fields_) {
        if (!field.array) continue;
        field.array->renew(field.member(owner_), 0);
        *field.length(owner_) = 0;
        registered = registered || field.most == 0;
    }
    object_.refreshParameters();
    if (registered) object_.allocated_ = false;
    return QUO_OK;
}

void Record::copy_values(const Record& from, std::size_t row) const {
    parElement source, target;
    fields_[row].describe(from.owner_, source);
    fields_[row].describe(owner_, target);
    quo::copy_values(source, target);
}

int Record::copy(const Record& from) const {
    if (&from.object_ == &object_) return QUO_OK;
    const bool unlisted = object_.table_refused_ || from.object_.table_refused_;
    if (unlisted && has_arrays()) return QUO_NO_MEMORY;  // they are found by the list
    if (has_arrays()) object_.destroyBuffers();
    bool allocates = false;
    for (std::size_t i = 0; i < fields_.size(); ++i) {
        if (!fields_[i].array) copy_values(from, i);
        if (fields_[i].array && fields_[i].most == 0) allocates = allocates || from.allocated(i);
    }
    if (allocates)
        if (const int status = object_.createBuffers()) return status;
    for (std::size_t i = 0; i < fields_.size(); ++i) {
        const Field& field = fields_[i];
        if (!field.array) continue;
        if (field.most > 0 && !field.array->assign(field.member(owner_), field.member(from.owner_)))
            return QUO_NO_MEMORY;
        const parElement *source = from.allocated(i), *target = allocated(i);
        if (source && target && source->count == target->count) quo::copy_values(*source, *target);
    }
    object_.refreshParameters();
    return QUO_OK;
}

int Record::read(const char* file) const {
    if (object_.readAuxiliaryFile(file, 1, section_)) return QUO_OK;
    const int status = object_.out_of_buffers_ ? QUO_NO_MEMORY : read_profile(file, section_);
    return object_.out_of_buffers_ ? QUO_NO_MEMORY : status;
}

int Record::read_profile(const char* file, const char* section, std::span<const char* const> keys) const {
    if (object_.unread_ == QUO_OK && read_whole_profile(file, section, keys)) return QUO_OK;
    freeall_ckerr();
    return QUO_REFUSED;
}

bool Record::read_whole_profile(const char* file, const char* section, std::span<const char* const> keys) const {
    const ProfileLook look{file};
    const bool complete = read_keys(file, section, keys, false);
    if (std::ranges::none_of(fields_, is_keyed_array)) return complete;
    object_.source_length_ = file ? file_length(file).value_or(0) : -1;
    CallFrame::drop_errno();
    const int created = object_.createBuffers();
    object_.out_of_buffers_ = created == QUO_NO_MEMORY;
    const bool arrays = created == QUO_OK && read_keys(file, section, keys, true);
    object_.source_length_ = -1;
    CallFrame::drop_errno();
    return arrays && complete;
}

bool Record::read_keys(const char* file, const char* section, std::span<const char* const> keys,
                       bool arrays) const {
    bool complete = true;
    for (std::size_t i = 0; i < fields_.size(); ++i) {
        const Field& field = fields_[i];
        parElement to;
        field.describe(owner_, to);
        if ((field.array != nullptr) != arrays || field.in_profile == InProfile::kAbsent || to.count < 1) continue;
        const char* const key = keys.empty() ? field.key : keys[i];
        const bool read = field.names.empty()
                              ? read_key(to, key, section, file)
                              : read_name(field, *static_cast<std::int32_t*>(to.pointer), key, section, file);
        if (!read && field.in_profile == InProfile::kMandatory) complete = false;
    }
    return complete;
}

}  // namespace quo
