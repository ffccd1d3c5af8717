// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <new>
#include <span>
#include <string_view>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "quo_base/quorelxml_v2.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_document.h"
#include "quorelxmllib/header_session.h"
#include "quorelxmllib/xml_text.h"
#include "sarutillib/ground/bounded_text.h"

using quo::CallFrame;
using quo::ForTypes;
using quo::guarded;
using quo::HeaderSession;

namespace {

constexpr const char* kSource = "quorelxml_v2";
constexpr const char* kNoMemory = "Memory allocation failure";
constexpr std::size_t kNameRoom = 512;

/** Whether an element's status fails the whole read: one that found no memory is not known to be missing. */
bool fails_read(const parElement& element, int status) {
    return status == QUO_NO_MEMORY || (status != QUO_OK && element.mandatory);
}

}  // namespace

// --- the element ------------------------------------------------------------------------------------------------

int parElement::setElement(const char* element_name, void* values, ParameterType value_type,
                           std::int32_t value_count, double lowest, double highest, bool is_mandatory) noexcept {
    quo::copy_bounded(name, quo::text_or_empty(element_name));
    pointer = values;
    type = value_type;
    count = value_count;
    minimum = lowest;
    maximum = highest;
    mandatory = is_mandatory;
    text_array = value_type == typeString && value_count != 1;
    if (!registered) scalar = value_count == 1;
    return QUO_OK;
}

// --- the table --------------------------------------------------------------------------------------------------

GeneralSAR_BaseXML::GeneralSAR_BaseXML() noexcept = default;

GeneralSAR_BaseXML::~GeneralSAR_BaseXML() {
    (void)destroyElementsVector();
    allocated_ = false;
    (void)document_.clean();
}

int GeneralSAR_BaseXML::createBuffers() { return QUO_OK; }

int GeneralSAR_BaseXML::destroyBuffers() { return QUO_OK; }

void GeneralSAR_BaseXML::refreshParameters() {}

int GeneralSAR_BaseXML::setParamListAlloc(bool owned) noexcept {
    list_owned_ = owned;
    return QUO_OK;
}

bool GeneralSAR_BaseXML::isBufferAllocated() const noexcept { return allocated_; }

int GeneralSAR_BaseXML::setAllocationFlag(bool allocated) noexcept {
    allocated_ = allocated;
    return QUO_OK;
}

int GeneralSAR_BaseXML::elementCount() const noexcept { return element_count_; }

const parElement* GeneralSAR_BaseXML::element(int index) const noexcept {
    return index >= 0 && index < element_count_ ? elements_ + index : nullptr;
}

void GeneralSAR_BaseXML::setExactNumbers(bool exact) noexcept { document_.useExactNumbers(exact); }

int GeneralSAR_BaseXML::createElementsVector(int count) {
    CallFrame frame{"GeneralSAR_BaseXML::createElementsVector", kSource};
    (void)destroyElementsVector();  // a class between this one and the object's own may have made a table already
    if (count < 0) return frame.fail(QUO_REFUSED, "Negative number of elements");
    elements_ = new (std::nothrow) parElement[static_cast<std::size_t>(count)];
    table_refused_ = !elements_;
    if (!elements_) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    element_count_ = count;
    allocated_ = true;
    refreshParameters();
    for (int i = 0; i < element_count_; ++i) elements_[i].registered = true;
    return frame.success();
}

int GeneralSAR_BaseXML::destroyElementsVector() noexcept {
    if (list_owned_) delete[] elements_;
    elements_ = nullptr;
    element_count_ = 0;
    cursor_ = 0;
    return QUO_OK;
}

int GeneralSAR_BaseXML::addElement(const char* name, void* values, parElement::ParameterType type, int count,
                                   double minimum, double maximum, bool mandatory) {
    if (cursor_ >= element_count_) {
        freeall_ckerr();
        return QUO_REFUSED;
    }
    elements_[cursor_].setElement(name, values, type, count, minimum, maximum, mandatory);
    cursor_ = (cursor_ + 1) % element_count_;
    return QUO_OK;
}

int GeneralSAR_BaseXML::addElementDouble(const char* name, double* values, int count, double minimum,
                                         double maximum, bool mandatory) {
    return addElement(name, values, parElement::typeDouble, count, minimum, maximum, mandatory);
}

int GeneralSAR_BaseXML::addElementFloat(const char* name, float* values, int count, float minimum, float maximum,
                                        bool mandatory) {
    return addElement(name, values, parElement::typeFloat, count, static_cast<double>(minimum),
                      static_cast<double>(maximum), mandatory);
}

int GeneralSAR_BaseXML::addElementInt(const char* name, std::int32_t* values, int count, int minimum, int maximum,
                                      bool mandatory) {
    return addElement(name, values, parElement::typeInt, count, minimum, maximum, mandatory);
}

int GeneralSAR_BaseXML::addElementString(const char* name, char* text, bool mandatory) {
    return addElementText(name, text, parElement::kTextRoom, mandatory);
}

int GeneralSAR_BaseXML::addElementText(const char* name, char* text, std::size_t room, bool mandatory) {
    const int slot = cursor_;
    const int status = addElement(name, text, parElement::typeString, 1, 0.0, 0.0, mandatory);
    if (status == QUO_OK) elements_[slot].room = room;
    return status;
}

int GeneralSAR_BaseXML::addElementString(const char* name, char** texts, int count, bool mandatory) {
    const int slot = cursor_;
    const int status = addElement(name, texts, parElement::typeString, count, 0.0, 0.0, mandatory);
    if (status == QUO_OK) elements_[slot].text_array = true;
    return status;
}

bool GeneralSAR_BaseXML::sourceCanHold(std::int64_t count) const noexcept {
    if (count < 0) return false;
    // Every value takes a digit and a separator at least.
    if (source_length_ >= 0) return count <= source_length_ / 2 + 1;
    return !document_.document_ || document_.document_->can_hold(count);
}

// --- the header file --------------------------------------------------------------------------------------------

int GeneralSAR_BaseXML::setAuxiliaryFile(const char* file, int channel, const char* section) noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::setAuxiliaryFile", kSource};
    return guarded(frame, [&] {
        (void)unsetAuxiliaryFile();
        const std::string_view name = quo::text_or_empty(section);
        if (name.empty() || name.size() >= kNameRoom) return frame.fail(QUO_REFUSED, "Bad section name");
        section_ = name;
        if (const int status = attach(file)) return frame.callee(status);
        channel_ = channel;
        return frame.success();
    });
}

int GeneralSAR_BaseXML::attach(const char* file) {
    HeaderSession* session = HeaderSession::find(file);
    if (!session) return document_.initXmlFile(file);
    if (const int status = document_.storeFileName(file)) return status;
    int status = QUO_OK;
    document_.document_ = session->document(status);
    if (status == QUO_OK) (void)document_.isRecognized();
    return status;
}

int GeneralSAR_BaseXML::unsetAuxiliaryFile() noexcept {
    (void)document_.storeFileName("");
    (void)document_.clean();
    channel_ = 0;
    return QUO_OK;
}

int GeneralSAR_BaseXML::cleanAuxiliaryFile() noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::cleanAuxiliaryFile", kSource};
    const int status = section_.empty() ? QUO_OK : document_.clearField(channel_, section_.c_str());
    return status ? frame.callee(status) : frame.success();
}

bool GeneralSAR_BaseXML::checkAuxiliaryFile() const noexcept { return true; }

bool GeneralSAR_BaseXML::checkAuxiliaryFile(const char*, int, const char*) const noexcept { return true; }

bool GeneralSAR_BaseXML::getConfigurationFile(const char* file, int channel, const char* section,
                                              char* text) noexcept {
    return getConfigurationFile(file, channel, section, text, kNameRoom);
}

bool GeneralSAR_BaseXML::getConfigurationFile(const char* file, int channel, const char* section, char* text,
                                              std::size_t room) noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::getConfigurationFile", kSource};
    const int status = guarded(frame, [&] {
        if (const int refused = setAuxiliaryFile(file, channel, section)) return frame.callee(refused);
        const std::string field = section_ + "/ConfigurationFile";
        const int missing = document_.readString(channel, field.c_str(), &text, 1, room);
        return missing ? frame.silent(missing) : frame.success();
    });
    (void)unsetAuxiliaryFile();
    return status == QUO_OK;
}

// --- writing ----------------------------------------------------------------------------------------------------

bool GeneralSAR_BaseXML::textsCanBeStored() const {
    const auto can_be_stored = [](const char* text) {
        return quo::xml_text(quo::text_or_empty(text)).has_value();
    };
    return std::ranges::all_of(elements(), [&](const parElement& element) {
        return element.withValues(
            ForTypes{[](auto) { return true; },
                     [&](std::span<char* const> texts) { return std::ranges::all_of(texts, can_be_stored); }});
    });
}

int GeneralSAR_BaseXML::writeElement(const parElement& element) {
    const std::string path = section_ + '/' + element.name;
    const char* const field = path.c_str();
    const int n = element.count;
    return element.withValues(
        ForTypes{[&](std::span<double> v) { return document_.writeDouble(channel_, field, v.data(), n); },
                 [&](std::span<float> v) { return document_.writeFloat(channel_, field, v.data(), n); },
                 [&](std::span<std::int32_t> v) { return document_.writeInt(channel_, field, v.data(), n); },
                 [&](std::span<char* const> v) { return document_.writeString(channel_, field, v.data(), n); }});
}

int GeneralSAR_BaseXML::writeSection() {
    if (const int status = cleanAuxiliaryFile()) return status;
    for (const parElement& element : elements())
        if (element.count > 0)
            if (const int status = writeElement(element)) return status;
    return QUO_OK;
}

int GeneralSAR_BaseXML::writeAuxiliaryFile() noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::writeAuxiliaryFile", kSource};
    if (table_refused_) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    return guarded(frame, [&] {
        HeaderSession* session = HeaderSession::owner(document_.document_);
        // A document that other objects share keeps the old section when this object cannot be written.
        if (!session && !allocated_) (void)cleanAuxiliaryFile();
        if (!allocated_) return frame.fail(QUO_REFUSED, "Buffers not allocated");
        if (!textsCanBeStored()) return frame.fail(QUO_REFUSED, "Text cannot be stored in XML");

        const int written = writeSection();
        if (session) session->note_write(written);
        const int status = written || session ? written : document_.write();
        return status ? frame.callee(status) : frame.success();
    });
}

int GeneralSAR_BaseXML::writeAuxiliaryFile(const char* file, int channel, const char* section) noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::writeAuxiliaryFile", kSource};
    int status = setAuxiliaryFile(file, channel, section);
    if (status == QUO_OK) status = writeAuxiliaryFile();
    (void)unsetAuxiliaryFile();
    // Without this object the file of a session would be neither the old one nor the new one.
    if (status == QUO_NO_MEMORY) HeaderSession::fail_all(status);
    return status ? frame.callee(status) : frame.success();
}

// --- reading ----------------------------------------------------------------------------------------------------

int GeneralSAR_BaseXML::readElement(const parElement& element, int count) {
    const std::string path = section_ + '/' + element.name;
    const char* const field = path.c_str();
    return element.withValues(
        ForTypes{[&](std::span<double> v) { return document_.readDouble(channel_, field, v.data(), count); },
                 [&](std::span<float> v) { return document_.readFloat(channel_, field, v.data(), count); },
                 [&](std::span<std::int32_t> v) { return document_.readInt(channel_, field, v.data(), count); },
                 [&](std::span<char* const> v) {
                     return document_.readString(channel_, field, v.data(), count, element.room);
                 }});
}

int GeneralSAR_BaseXML::readScalars(bool& lengths_changed) {
    for (const parElement& element : elements()) {
        if (!element.scalar || element.type == parElement::typeString) continue;
        const auto* length =
            element.type == parElement::typeInt ? static_cast<const std::int32_t*>(element.pointer) : nullptr;
        const std::int32_t before = length ? *length : 0;
        const int status = readElement(element, 1);
        lengths_changed = lengths_changed || (length && *length != before);
        if (fails_read(element, status)) return status;
    }
    return QUO_OK;
}

bool GeneralSAR_BaseXML::hasArrays() const noexcept {
    return std::ranges::any_of(elements(),
                               [](const auto& element) { return !element.scalar && element.count > 0; });
}

int GeneralSAR_BaseXML::readEverything() {
    for (const parElement& element : elements()) {
        const int status = element.count > 0 ? readElement(element, element.count) : QUO_OK;
        if (fails_read(element, status)) return status;
    }
    return QUO_OK;
}

int GeneralSAR_BaseXML::readSection() {
    bool lengths_changed = false;
    const int scalars = readScalars(lengths_changed);
    // Also after a failure: a length that was read must never stand beside an array of another length.
    const bool create = scalars == QUO_OK || (lengths_changed && hasArrays());
    const int created = create ? createBuffers() : QUO_OK;
    out_of_buffers_ = created == QUO_NO_MEMORY;
    if (created != QUO_OK) (void)destroyBuffers();
    if (scalars != QUO_OK) return scalars;
    if (created != QUO_OK) return out_of_buffers_ ? QUO_NO_MEMORY : QUO_REFUSED;
    return allocated_ ? readEverything() : QUO_REFUSED;
}

int GeneralSAR_BaseXML::readAuxiliaryFile() noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::readAuxiliaryFile", kSource};
    if (table_refused_) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    // A document that stands in lacks every section; the file, which could not be read, may have them all.
    if (document_.document_ && document_.document_->stands_in()) return frame.silent(QUO_READ_FAILED);
    return guarded(frame, [&] {
        const int status = readSection();
        return status ? frame.silent(status) : frame.success();
    });
}

bool GeneralSAR_BaseXML::readAuxiliaryFile(const char* file, int channel, const char* section) noexcept {
    CallFrame frame{"GeneralSAR_BaseXML::readAuxiliaryFile", kSource};
    out_of_buffers_ = false;
    int status = setAuxiliaryFile(file, channel, section);
    if (status == QUO_OK) status = readAuxiliaryFile();
    (void)unsetAuxiliaryFile();
    unread_ = status == QUO_READ_FAILED || status == QUO_NO_MEMORY ? status : QUO_OK;
    // What a session writes after this would not be what its file has.
    if (unread_ != QUO_OK) HeaderSession::fail_all(unread_);
    return (status ? frame.silent(status) : frame.success()) == QUO_OK;
}

// --- the base of the header objects -----------------------------------------------------------------------------

GeneralSAR_Base::~GeneralSAR_Base() = default;

int GeneralSAR_Base::createBuffers() { return QUO_OK; }

int GeneralSAR_Base::destroyBuffers() { return QUO_OK; }

void GeneralSAR_Base::refreshParameters() {}

int GeneralSAR_Base::writehdr() { return QUO_OK; }

int GeneralSAR_Base::writehdr(const char*) { return QUO_OK; }

int GeneralSAR_Base::readhdr(const char*) { return QUO_OK; }
