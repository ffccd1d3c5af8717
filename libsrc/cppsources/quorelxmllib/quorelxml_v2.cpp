// SPDX-License-Identifier: Apache-2.0
#include "quo_base/quorelxml_v2.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <limits>
#include <string_view>
#include <utility>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_document.h"
#include "quorelxmllib/header_session.h"
#include "quorelxmllib/header_stream.h"
#include "quorelxmllib/legacy_list.h"
#include "quorelxmllib/xml_text.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/number_text.h"
#include "sarutillib/ground/quoted_xml.h"

using quo::CallFrame;
using quo::guarded;
using quo::HeaderDocument;
using quo::HeaderTree;
using quo::Node;

namespace {

constexpr const char* kSource = "quorelxml_v2";
constexpr const char* kNumberOfChannels = "NumberOfChannels";
constexpr const char* kDescription = "Description";
constexpr std::size_t kNameRoom = 512;
constexpr std::size_t kDescriptionRoom = 2048;
constexpr int kPrecision = 15;

std::atomic<bool> exact_numbers = false;

void print_missing(const char* what) noexcept {
    std::fprintf(stderr, "File not recognized: %s does not exist\n", what);
}

/** What a reader's report entries need. */
struct Reading {
    quo::SharedCall function;
    const char* type;
    int channel;
    const char* field;
};

void convert(const char* text, std::int32_t& value) noexcept { value = quo::scan_int32(text).value; }
void convert(const char* text, double& value) noexcept { value = quo::scan_double(text).value; }
void convert(const char* text, float& value) noexcept { value = static_cast<float>(quo::scan_double(text).value); }

/** Reads up to `count` values from the `val` children of an element; returns how many it had. */
template <typename T>
int read_children(const HeaderTree& tree, Node node, T* values, int count) {
    int read = 0;
    for (Node child = tree.first(node); child != Node::none && read < count; child = tree.next(child))
        if (tree.is_named(child, "val")) convert(quo::NodeText{tree, child}.c_str(), values[read++]);
    return read;
}

/** Reads a numeric field; false when no element bears its name. */
template <typename T>
bool read_numbers(const HeaderDocument& document, int channel, std::string_view field, T* values, int count) {
    Node first = Node::none;
    int read = 0;
    document.visit(channel, field, [&](Node node) {
        if (first == Node::none) first = node;
        if (count > 1) read += read_children(document.tree(), node, values + read, count - read);
        return count > 1 && read < count;
    });
    if (first == Node::none) return false;
    if (count == 1) convert(document.text(first).c_str(), *values);
    if (count > 1 && read == 0) quo::scan_list(document.text(first).c_str(), values, count);
    return true;
}

}  // namespace

// --- the document as a whole ------------------------------------------------------------------------------------

struct quorelxml::Mirror {
    /** Whether the document is a header, and if so what it says of itself. 0; 1 for another document, or none; 7,
     * which tells nothing of the document. */
    static int refresh(quorelxml& self) noexcept {
        if (!self.document_) return QUO_REFUSED;
        CallFrame frame{"quorelxml::isRecognized", kSource};
        const HeaderDocument& document = *self.document_;
        const Node number = document.find(kNumberOfChannels), description = document.find(kDescription);
        const bool has_number = number != Node::none, has_description = description != Node::none;
        if (self.debug_ && !has_number) print_missing("/QuorelXmlDoc/NumberOfChannels");
        if (self.debug_ && !has_description) print_missing("/QuorelXmlDoc/Description");
        return guarded(frame, [&] {
            if (has_number) self.number_of_channels_ = quo::scan_int32(document.text(number)).value;
            if (has_description) self.mirrorDescription(document.text(description));
            return has_number && has_description ? frame.success() : frame.silent(QUO_REFUSED);
        });
    }
    /** The same, with a fresh document in the place of another one. 0 or 7. */
    static int refresh_or_create(quorelxml& self) noexcept {
        const int status = refresh(self);
        return status == QUO_REFUSED ? self.createDocument() : status;
    }
};

quorelxml::quorelxml() noexcept = default;

quorelxml::quorelxml(const char* file_name) noexcept { (void)initXmlFile(file_name); }

quorelxml::~quorelxml() { (void)clean(); }

int quorelxml::setDebug(bool debug) noexcept {
    debug_ = debug;
    return QUO_OK;
}

void quorelxml::setExactNumbers(bool exact) noexcept { exact_numbers = exact; }

void quorelxml::useExactNumbers(bool exact) noexcept {
    exactness_ = exact ? Exactness::kExact : Exactness::kRounded;
}

int quorelxml::storeFileName(const char* file_name) noexcept {
    CallFrame frame{"quorelxml::storeFileName", kSource};
    return guarded(frame, [&] {
        file_name_.clear();
        const std::string_view name = quo::text_or_empty(file_name);
        if (name.size() >= kNameRoom) return frame.fail(QUO_REFUSED, "File name too long");
        file_name_ = name;
        return frame.success();
    });
}

int quorelxml::initXmlFile(const char* file_name) noexcept {
    CallFrame frame{"quorelxml::initXmlFile", kSource};
    (void)clean();
    const int stored = storeFileName(file_name);
    (void)parse();
    if (const int status = Mirror::refresh_or_create(*this)) {
        document_.reset();
        return frame.callee(status);
    }
    return stored ? frame.callee(stored) : frame.success();
}

int quorelxml::parse() noexcept {
    CallFrame frame{"quorelxml::parse", kSource};
    return guarded(frame, [&] {
        document_.reset();
        irreplaceable_ = true;  // also when the next line throws
        const int status = HeaderDocument::load(file_name_.c_str(), document_);
        irreplaceable_ = status == QUO_NO_MEMORY;
        unreadable_ = status == QUO_READ_FAILED;
        if (irreplaceable_ || unreadable_) return quo::fail_unread(frame, status, file_name_.c_str());
        CallFrame::drop_errno();  // a missing file is no error here
        return status ? frame.silent(status) : frame.success();
    });
}

bool quorelxml::isRecognized() noexcept { return Mirror::refresh(*this) == QUO_OK; }

void quorelxml::mirrorDescription(std::string_view text) {
    char cut[kDescriptionRoom];
    description_.assign(cut, quo::copy_bounded(cut, text));
}

int quorelxml::createDocument() noexcept {
    CallFrame frame{"quorelxml::createDocument", kSource};
    return guarded(frame, [&] {
        if (irreplaceable_) return frame.fail(QUO_NO_MEMORY, "Header file does not fit into memory");
        document_ = HeaderDocument::create(unreadable_);
        CallFrame::drop_errno();
        number_of_channels_ = 0;
        mirrorDescription(document_->text(document_->find(kDescription)));
        return frame.success();
    });
}

int quorelxml::clean() noexcept {
    document_.reset();
    irreplaceable_ = unreadable_ = false;
    return QUO_OK;
}

int quorelxml::flush() noexcept {
    CallFrame frame{"quorelxml::flush", kSource};
    return guarded(frame, [&] {
        if (!document_) return frame.fail(QUO_REFUSED, "No header document to write");
        if (!document_->save(file_name_.c_str())) return frame.fail(QUO_REFUSED, "File writing failed!");
        CallFrame::drop_errno();
        return frame.success();
    });
}

int quorelxml::write() noexcept {
    CallFrame frame{"quorelxml::write", kSource};
    const int status = flush();
    return status ? frame.callee(status) : frame.success();
}

int quorelxml::setDescription(const char* file_name, const char* text) noexcept {
    CallFrame frame{"quorelxml::setDescription", kSource};
    if (const int status = initXmlFile(file_name)) {
        document_.reset();
        return frame.callee(status);
    }
    const int status = guarded(frame, [&] {
        const auto content = quo::xml_text(quo::text_or_empty(text));
        if (!content) return frame.fail(QUO_REFUSED, "Text cannot be stored in XML");
        document_->set_text(document_->find(kDescription), *content);
        mirrorDescription(*content);
        const int written = write();
        return written ? frame.callee(written) : frame.success();
    });
    (void)clean();
    return status;
}

int quorelxmlPi::initXmlFile(const char* file_name, const char* stylesheet) noexcept {
    CallFrame frame{"quorelxmlPi::initXmlFile", kSource};
    if (const int status = quorelxml::initXmlFile(file_name)) return frame.callee(status);
    return guarded(frame, [&] {
        const auto path = quo::xml_text(quo::text_or_empty(stylesheet));
        if (!path) return frame.fail(QUO_REFUSED, "Text cannot be stored in XML");
        const std::string content = R"(type="text/xsl" href=")" + quo::quoted_xml(*path) + '"';
        const int inserted = insertInstruction("xml-stylesheet", content.c_str());
        return inserted ? frame.callee(inserted) : frame.success();
    });
}

int quorelxml::insertInstruction(const char* name, const char* content) noexcept {
    CallFrame frame{"quorelxml::insertInstruction", kSource};
    if (!document_) return frame.fail(QUO_REFUSED, "No header document");
    return guarded(frame, [&] {
        document_->insert_instruction(name, content);
        return frame.success();
    });
}

std::string quorelxml::xmlDefect(const char* file_name) {
    std::shared_ptr<HeaderDocument> document;
    std::string defect;
    (void)HeaderDocument::load(file_name, document, &defect);
    CallFrame::drop_errno();
    return defect;
}

// --- looking up -------------------------------------------------------------------------------------------------

int quorelxml::setXpathExpression(int channel, std::string& expression) {
    expression = R"(/QuorelXmlDoc/Channel[@Number=")";
    expression += quo::format_int(channel);
    expression += R"("])";
    return QUO_OK;
}

int quorelxml::setXpathExpression(int channel, const char* field, std::string& expression) {
    setXpathExpression(channel, expression);
    const std::string_view path = quo::text_or_empty(field);
    if (!path.empty()) (expression += '/') += path;
    return QUO_OK;
}

void quorelxml::printMissing(int channel, const char* field) const {
    if (!debug_) return;
    std::string expression;
    setXpathExpression(channel, field, expression);
    print_missing(expression.c_str());
}

void* quorelxml::getNode(int channel, const char* field) const { return getNode(channel, field, 0); }

void* quorelxml::getNode(int channel, const char* field, int index) const {
    Node found = Node::none;
    bool any = false;
    if (document_ && index >= 0)
        document_->visit(channel, quo::text_or_empty(field), [&](Node node) {
            any = true;
            if (index-- == 0) found = node;
            return found == Node::none;
        });
    if (!any) printMissing(channel, field);
    return found == Node::none ? nullptr : const_cast<void*>(document_->tree().address(found));
}

int quorelxml::countNodes(int channel, const char* field) const {
    int count = 0;
    if (document_)
        document_->visit(channel, quo::text_or_empty(field), [&](Node) {
            ++count;
            return count < std::numeric_limits<int>::max();
        });
    return count;
}

bool quorelxml::channelExists(int channel) const { return document_ && getNode(channel, ""); }

bool quorelxml::fieldExists(int channel, const char* field) const {
    return document_ && document_->first(channel, quo::text_or_empty(field)) != Node::none;
}

bool quorelxml::fieldHasCount(int channel, const char* field, int count) const {
    return document_ && countNodes(channel, field) >= count;
}

// --- changing the tree ------------------------------------------------------------------------------------------

int quorelxml::createChannel(int channel) noexcept {
    CallFrame frame{"quorelxml::createChannel", kSource};
    return guarded(frame, [&] {
        if (const int status = Mirror::refresh_or_create(*this)) return frame.callee(status);
        if (document_->first(channel, "") != Node::none) return frame.success();
        // A file's count is not to be trusted to leave room for one more.
        if (number_of_channels_ < std::numeric_limits<std::int32_t>::max()) ++number_of_channels_;
        document_->append_channel(channel);
        document_->set_text(document_->find(kNumberOfChannels), quo::format_int(number_of_channels_));
        return frame.success();
    });
}

int quorelxml::createField(int channel, const char* field) noexcept {
    CallFrame frame{"quorelxml::createField", kSource};
    return guarded(frame, [&] {
        const std::string_view path = quo::text_or_empty(field);
        if (!path.empty() && !quo::is_field_path(path)) return frame.fail(QUO_REFUSED, "Bad field name");
        if (const int status = createChannel(channel)) return frame.callee(status);
        (void)document_->ensure(channel, path);
        return frame.success();
    });
}

int quorelxml::createField(int channel, const char* field, int count) noexcept {
    CallFrame frame{"quorelxml::createField", kSource};
    return guarded(frame, [&] {
        if (const int status = createField(channel, field)) return frame.callee(status);
        if (count < 2) return frame.success();
        const std::string_view path = quo::text_or_empty(field);
        const auto slash = path.rfind('/');
        const bool top = slash == std::string_view::npos;
        const Node parent = document_->first(channel, top ? std::string_view{} : path.substr(0, slash));
        for (int present = countNodes(channel, field); present < count; ++present)
            document_->append(parent, top ? path : path.substr(slash + 1));
        return frame.success();
    });
}

int quorelxml::clearField(int channel, const char* field) noexcept {
    CallFrame frame{"quorelxml::clearField", kSource};
    return guarded(frame, [&] {
        if (document_) document_->remove_all(channel, quo::text_or_empty(field));
        if (document_) document_->tidy();
        return frame.success();
    });
}

int quorelxml::setFormat(int count, int type) {
    format_ = quo::list_format(count, type);
    return format_.empty() ? QUO_REFUSED : QUO_OK;
}

// --- reading ----------------------------------------------------------------------------------------------------

/** What the typed readers and writers share. */
struct quorelxml::Values {
    /** Tells the report, in debug mode, that a field is not there. */
    static int missing(const quorelxml& self, const Reading& reading) {
        if (!self.debug_) return QUO_REFUSED;
        char message[2 * kNameRoom + 64];
        quo::format_bounded(message, sizeof message, "Cannot read %s '%s' in channel %d, from XML file %s",
                            reading.type, reading.field, reading.channel, self.file_name_.c_str());
        quo_add_report(message, QUO_WARNING, reading.function.line, reading.function.function, kSource);
        return QUO_REFUSED;
    }

    template <typename T>
    static int read(const quorelxml& self, const Reading& reading, T* values, int count) noexcept {
        CallFrame frame{reading.function, kSource};
        if (!reading.field || (!values && count > 0)) return frame.fail(QUO_REFUSED, "Null argument");
        return guarded(frame, [&] {
            const HeaderDocument* document = self.document_.get();
            if (!document || !read_numbers(*document, reading.channel, reading.field, values, count))
                return frame.silent(missing(self, reading));
            CallFrame::drop_errno();
            return frame.success();
        });
    }

    /** Sets the texts of a field's elements, which are made where they are missing. `text_of(i)` is the i-th. */
    template <typename TextOf>
    static int write(quorelxml& self, quo::CallerFrame frame, int channel, const char* path, int count,
                     TextOf text_of) {
        if (count < 1) return frame.success();
        if (!quo::is_field_path(path)) return frame.fail(QUO_REFUSED, "Bad field name");
        const auto wanted = static_cast<std::size_t>(count);
        if (self.document_) self.document_->tidy();
        std::vector<Node> nodes;
        if (self.document_) nodes = self.document_->all(channel, path, wanted);
        if (nodes.size() < wanted) {
            if (const int status = self.createField(channel, path, count)) return frame.callee(status);
            nodes = self.document_->all(channel, path, wanted);
        }
        for (std::size_t i = 0; i < wanted; ++i) {
            self.document_->set_text(nodes[i], text_of(i));
            if (count > 1) self.document_->set_number(nodes[i], "N", static_cast<std::int64_t>(i) + 1);
        }
        self.document_->count_written(count);
        CallFrame::drop_errno();
        return frame.success();
    }
    template <typename T, typename Format>
    static int write_numbers(quorelxml& self, const quo::SharedCall& function, int channel, const char* field,
                             const T* values, int count, Format format) noexcept {
        CallFrame frame{function, kSource};
        if (!field || (!values && count > 0)) return frame.fail(QUO_REFUSED, "Null argument");
        return guarded(frame, [&] {
            const std::string path = count < 2 ? field : std::string{field} + "/val";
            return write(self, frame, channel, path.c_str(), count,
                         [&](std::size_t i) { return format(values[i]); });
        });
    }

    static quo::NumberText number_text(const quorelxml& self, double value) noexcept {
        const bool exact =
            self.exactness_ == Exactness::kDefault ? exact_numbers.load() : self.exactness_ == Exactness::kExact;
        return exact ? quo::format_exact(value) : quo::format_general(value, kPrecision);
    }
};

int quorelxml::readInt(int channel, const char* field, std::int32_t* values, int count) noexcept {
    return Values::read(*this, {"quorelxml::readInt", "int", channel, field}, values, count);
}
int quorelxml::readFloat(int channel, const char* field, float* values, int count) noexcept {
    return Values::read(*this, {"quorelxml::readFloat", "float", channel, field}, values, count);
}
int quorelxml::readDouble(int channel, const char* field, double* values, int count) noexcept {
    return Values::read(*this, {"quorelxml::readDouble", "double", channel, field}, values, count);
}

int quorelxml::readString(int channel, const char* field, char* const* values, int count) noexcept {
    return readString(channel, field, values, count, std::numeric_limits<std::size_t>::max());
}

int quorelxml::readString(int channel, const char* field, char* const* values, int count,
                          std::size_t room) noexcept {
    constexpr const char* kFunction = "quorelxml::readString";
    CallFrame frame{kFunction, kSource};
    if (!field || (!values && count > 0)) return frame.fail(QUO_REFUSED, "Null argument");
    return guarded(frame, [&] {
        const auto wanted = static_cast<std::size_t>(std::max(count, 0));
        std::vector<Node> nodes;
        if (document_) nodes = document_->all(channel, field, wanted);
        if (!document_ || nodes.size() < wanted)
            return frame.silent(Values::missing(*this, {kFunction, "string", channel, field}));
        for (std::size_t i = 0; i < wanted; ++i) quo::copy_bounded(values[i], room, document_->text(nodes[i]));
        return frame.success();
    });
}

int quorelxml::readTexts(int channel, const char* field,
                         const std::function<void(std::string_view)>& see) noexcept {
    CallFrame frame{"quorelxml::readTexts", kSource};
    if (!field) return frame.fail(QUO_REFUSED, "Null argument");
    return guarded(frame, [&] {
        if (document_)
            document_->visit(channel, field, [&](Node node) {
                see(document_->text(node));
                return true;
            });
        return frame.success();
    });
}

int quorelxml::readTexts(const char* file_name, int channel, const char* field,
                         const std::function<void(std::string_view)>& see) noexcept {
    CallFrame frame{"quorelxml::readTexts", kSource};
    if (!file_name || !field) return frame.fail(QUO_REFUSED, "Null argument");
    return guarded(frame, [&] {
        const int status = quo::stream_texts(file_name, channel, field, see);
        if (status == QUO_READ_FAILED || status == QUO_NO_MEMORY)
            return quo::fail_unread(frame, status, file_name);
        CallFrame::drop_errno();
        return status ? frame.silent(status) : frame.success();
    });
}

// --- writing ----------------------------------------------------------------------------------------------------

int quorelxml::writeInt(int channel, const char* field, const std::int32_t* values, int count) noexcept {
    return Values::write_numbers(*this, "quorelxml::writeInt", channel, field, values, count,
                                 [](std::int32_t value) { return quo::format_int(value); });
}
int quorelxml::writeFloat(int channel, const char* field, const float* values, int count) noexcept {
    return Values::write_numbers(
        *this, "quorelxml::writeFloat", channel, field, values, count,
        [this](float value) { return Values::number_text(*this, static_cast<double>(value)); });
}
int quorelxml::writeDouble(int channel, const char* field, const double* values, int count) noexcept {
    return Values::write_numbers(*this, "quorelxml::writeDouble", channel, field, values, count,
                                 [this](double value) { return Values::number_text(*this, value); });
}

int quorelxml::writeString(int channel, const char* field, const char* const* values, int count) noexcept {
    CallFrame frame{"quorelxml::writeString", kSource};
    if (!field || (!values && count > 0)) return frame.fail(QUO_REFUSED, "Null argument");
    return guarded(frame, [&] {
        std::vector<std::string> texts;
        for (int i = 0; i < count; ++i) {
            auto text = quo::xml_text(quo::text_or_empty(values[i]));
            if (!text) return frame.fail(QUO_REFUSED, "Text cannot be stored in XML");
            texts.push_back(std::move(*text));
        }
        return Values::write(*this, frame, channel, field, count,
                             [&](std::size_t i) { return std::string_view{texts[i]}; });
    });
}
