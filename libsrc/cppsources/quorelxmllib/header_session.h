// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_SESSION_H
#define QUO_HEADER_SESSION_H

#include <memory>
#include <optional>
#include <string>

#include "quo_base/api.h"

namespace quo {

class AtomicFile;
class CallFrame;
class HeaderDocument;

/** Reports that a header file is there but was not loaded: what the system says of it (errno), then an entry with
 * the file's name. Returns `status`. */
int fail_unread(CallFrame& frame, int status, const char* file) noexcept;

/** Keeps one header file in memory while a whole product is read or written: header objects that are read from or
 * written to this file while the session lives share its document. The file is parsed once, at first use, and
 * saved at most once, by commit(); the bytes on the disk are those of writing object by object. Sessions nest; the
 * innermost one for a file serves it. */
class HeaderSession {
public:
    explicit HeaderSession(const char* file);
    /** The same, beginning with the content of another file in place of the file's own. */
    HeaderSession(const char* file, const char* content);
    ~HeaderSession();
    HeaderSession(const HeaderSession&) = delete;
    HeaderSession& operator=(const HeaderSession&) = delete;

    /** Saves what the objects have written; with nothing written the file is not touched. What is not committed is
     * dropped with the session.
     * @return 0; 1 when the file cannot be saved or could not be read; the status of a write that left the
     * document incomplete, which is then not saved. The old file stays whole. */
    [[nodiscard]] int commit() noexcept;
    /** Saves what the objects have written into a file that the caller makes new together with another: then there
     * is nothing left to commit. Reports nothing; where it answers false, errno may tell why. */
    [[nodiscard]] bool save(AtomicFile& file);

    /** The innermost session for a file, or null. Throws std::bad_alloc: an object that missed its session would
     * be saved by itself. */
    static HeaderSession* find(const char* file);
    /** The session that a document belongs to, or null. */
    static HeaderSession* owner(const std::shared_ptr<HeaderDocument>& document) noexcept;

    /** Lets no open session of this thread commit any more, which then gives `status`: for what failed before it
     * could be told to whose file it belongs, and for an object that could not be read, whose content is not what
     * the file has. */
    static void fail_all(int status) noexcept;
    /** How often that was said. */
    [[nodiscard]] int failures() const noexcept { return failures_; }
    /** The status of the latest failure. */
    [[nodiscard]] int failed() const noexcept { return failed_; }

    /** The file's document, parsed at the first call; null, and 7 in `status`, when it does not fit into memory. A
     * missing or foreign file gives a fresh document, and one that cannot be read a document that only stands in.
     */
    std::shared_ptr<HeaderDocument> document(int& status);
    /** Notes that an object was written, with its status. */
    void note_write(int status) noexcept;

private:
    std::string file_, content_;
    HeaderSession* outer_;
    std::shared_ptr<HeaderDocument> document_;
    int failed_ = QUO_OK, failures_ = 0;
    bool changed_ = false;
};

/** The session for a file: the one that is open already, else one of its own. For objects of several sections,
 * which are read and written by themselves or with a whole product. */
class JoinedSession {
public:
    explicit JoinedSession(const char* file) : session_{HeaderSession::find(file)} {
        if (!session_) session_ = &own_.emplace(file);
    }
    /** Saves what was written, unless that is left to the session that was open already. */
    [[nodiscard]] int commit() { return own_ ? own_->commit() : QUO_OK; }
    /** See HeaderSession::save; of a session that was open already everything that was written into it so far. */
    [[nodiscard]] bool save(AtomicFile& file) { return session_->save(file); }
    /** See HeaderSession::failures. */
    [[nodiscard]] int failures() const noexcept { return session_->failures(); }
    [[nodiscard]] int failed() const noexcept { return session_->failed(); }

private:
    HeaderSession* session_;
    std::optional<HeaderSession> own_;
};

}  // namespace quo

#endif
