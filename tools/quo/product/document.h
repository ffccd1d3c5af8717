// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_DOCUMENT_H
#define QUO_TOOL_DOCUMENT_H

#include <cstddef>
#include <string>
#include <vector>

#include "quo_base/quorelxml_v2.h"

namespace tool {

/** Throws Failure where a file is missing, or a folder or device. */
void require_regular_file(const std::string& file);

/** Throws Failure, with the cause, where a file is none that a header can be read from: missing, a folder or
 * device, not to be opened, or too large. */
void require_header_file(const std::string& file);

/** Throws Failure where a call of the library that answered `status` found no memory, or the system refused to
 * read the file. forget_system_error() comes before the call. */
void refuse_unread(const std::string& file, int status);

/** Throws Failure for a header that a call of the library answered `status` for: with the system's reason where
 * the file could not be read, which looks like an empty one otherwise, else with what is no XML in it, else with
 * `cause`. forget_system_error() comes before the call. */
[[noreturn]] void refuse_header(const std::string& file, int status, const std::string& cause);

/** A header document in memory: the fields of channel 1 as texts, by their path, such as
 * "SamplingConstants/prf_hz". A path that is no chain of names is found nowhere. */
class Document : private quorelxml {
public:
    static constexpr std::size_t kTextRoom = 1024;  ///< longest text, its end included

    /** Throws Failure where the file is no header document: writing would put a fresh one in its place. */
    explicit Document(const std::string& file);
    /** Whether a file is a header document. */
    static bool in(const std::string& file);

    [[nodiscard]] bool has_channel() const { return channelExists(kChannel); }
    [[nodiscard]] bool has(const std::string& path) const { return fieldExists(kChannel, path.c_str()); }
    /** How many elements bear that path. */
    [[nodiscard]] int count(const std::string& path) const { return countNodes(kChannel, path.c_str()); }
    /** Whether the values of a field stand in `val` children. */
    [[nodiscard]] bool is_array(const std::string& field) const { return count(field + "/val") > 0; }
    /** The values of a field. Throws Failure where it is missing. */
    std::vector<std::string> values(const std::string& field);
    /** Replaces the values of a field in its own form; a single value that becomes several takes that of numeric
     * arrays. Throws Failure. */
    void replace(const std::string& field, const std::vector<std::string>& values);
    /** Saves the document in one step. Throws Failure. */
    void save();

private:
    static constexpr int kChannel = 1;

    Document() = default;

    std::string file_;
};

/** Throws Failure unless the file is a header document, or, where `may_be_missing`, is not there: writing a
 * section would put a fresh document in the place of anything else. */
void require_document(const std::string& file, bool may_be_missing);

}  // namespace tool

#endif
