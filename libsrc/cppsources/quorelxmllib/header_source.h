// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_SOURCE_H
#define QUO_HEADER_SOURCE_H

#include <libxml/parser.h>
#include <libxml/xmlerror.h>

#include <cstdint>
#include <string>
#include <string_view>

#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/file_io.h"

namespace quo {

/** How header files are parsed: without blanks between elements, network or entities. */
constexpr int kHeaderOptions = XML_PARSE_NOBLANKS | XML_PARSE_COMPACT | XML_PARSE_NONET;

/** While it lives, libxml2 prints nothing on this thread, and a lack of memory is noted, which later errors hide.
 */
class XmlErrors {
public:
    XmlErrors() noexcept {
        // By one thread, before others ask libxml2 for anything; what that prints where memory ends is caught,
        // too.
        static const bool ready = (take_over(), xmlInitParser(), give_back(), true);
        (void)ready;
        take_over();
    }
    ~XmlErrors() { give_back(); }
    XmlErrors(const XmlErrors&) = delete;
    XmlErrors& operator=(const XmlErrors&) = delete;

    [[nodiscard]] bool out_of_memory() const noexcept { return out_of_memory_; }
    /** The first error, "line 17: ..."; empty where there was none. */
    [[nodiscard]] std::string first() const {
        return line_ > 0 ? "line " + std::to_string(line_) + ": " + message_ : "";
    }

private:
    void take_over() noexcept {
        handler_ = xmlStructuredError;
        context_ = xmlStructuredErrorContext;
        xmlSetStructuredErrorFunc(this, [](void* self, xmlError* error) {
            auto& errors = *static_cast<XmlErrors*>(self);
            if (error->code == XML_ERR_NO_MEMORY) errors.out_of_memory_ = true;
            if (errors.line_ == 0) errors.note(*error);
        });
    }
    void give_back() noexcept { xmlSetStructuredErrorFunc(context_, handler_); }

    void note(const xmlError& error) noexcept {
        const std::string_view text = error.message ? error.message : "";
        copy_bounded(message_, text.substr(0, text.find('\n')));
        line_ = error.line;
    }

    xmlStructuredErrorFunc handler_ = nullptr;
    void* context_ = nullptr;
    bool out_of_memory_ = false;
    int line_ = 0;
    char message_[256] = "";
};

/** A header file as libxml2 reads it. */
class HeaderSource {
public:
    /** 0; 1 when there is no file; 4 when it is there but cannot be opened, 7 when it is too large: errno tells.
     */
    int open(const char* file) noexcept;
    /** Starts from the first byte again; false where the file, such as a pipe, gives its bytes only once. */
    bool rewind() noexcept;
    /** libxml2's read call; `source` is the HeaderSource. */
    static int read(void* source, char* buffer, int length) noexcept;

    /** How reading went so far: 0, or 4 or 7 with errno set. */
    [[nodiscard]] int status() const noexcept;
    /** Bytes read so far, since the start. */
    [[nodiscard]] std::int64_t bytes() const noexcept { return bytes_; }

private:
    Descriptor file_;
    std::int64_t bytes_ = 0;
    int error_ = 0;  // the first failure
};

}  // namespace quo

#endif
