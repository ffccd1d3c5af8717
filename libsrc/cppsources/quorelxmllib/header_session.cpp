// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_session.h"

#include <cerrno>
#include <filesystem>
#include <system_error>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "quo_base/quorelxml_v2.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_document.h"
#include "sarutillib/ground/bounded_text.h"

namespace quo {
namespace {

constexpr const char* kSource = "quorelxml_v2";

// The one open session: header objects find it by the file name alone, because most of them are read and written
// through other objects that know nothing of sessions.
thread_local HeaderSession* innermost = nullptr;

bool same_file(const std::string& a, const char* b) {
    if (a == b) return true;
    std::error_code failed;
    const auto first = std::filesystem::weakly_canonical(a, failed);
    if (failed) return false;
    const auto second = std::filesystem::weakly_canonical(b, failed);
    return !failed && first == second;
}

}  // namespace

HeaderSession::HeaderSession(const char* file) : HeaderSession{file, file} {}
HeaderSession::HeaderSession(const char* file, const char* content)
    : file_{text_or_empty(file)}, content_{text_or_empty(content)}, outer_{innermost} {
    innermost = this;  // not before the name is stored, which may throw
}

HeaderSession::~HeaderSession() { innermost = outer_; }

int fail_unread(CallFrame& frame, int status, const char* file) noexcept {
    static_assert(quorelxml::kMostFileBytes == 1LL << 30);
    const bool refused = errno == ENOTSUP;
    const char* reason = refused ? "declares entities or elements, or nests deeper than 256 elements"
                         : status == QUO_READ_FAILED ? "cannot be read"
                         : errno == EFBIG            ? "is larger than 1 GiB"
                                                     : "does not fit into memory";
    if (refused) CallFrame::drop_errno();
    frame.check_errno();
    char message[1024];
    format_bounded(message, sizeof message, "Header file %s %s", file, reason);
    return frame.fail(status, message);
}

HeaderSession* HeaderSession::find(const char* file) {
    if (!file) return nullptr;
    const int error_before = errno;
    HeaderSession* session = innermost;
    while (session && !same_file(session->file_, file)) session = session->outer_;
    errno = error_before;
    return session;
}

void HeaderSession::fail_all(int status) noexcept {
    for (HeaderSession* session = innermost; session; session = session->outer_) {
        session->note_write(status);
        ++session->failures_;
    }
}

HeaderSession* HeaderSession::owner(const std::shared_ptr<HeaderDocument>& document) noexcept {
    HeaderSession* session = document ? innermost : nullptr;
    while (session && session->document_ != document) session = session->outer_;
    return session;
}

std::shared_ptr<HeaderDocument> HeaderSession::document(int& status) {
    status = QUO_OK;
    if (document_) return document_;
    CallFrame frame{"HeaderSession::document", kSource};
    const int loaded = HeaderDocument::load_or_create(content_.c_str(), document_);
    if (loaded != QUO_OK) {
        status = fail_unread(frame, loaded, content_.c_str());
        if (document_) status = QUO_OK;  // it stands in; saving it fails
        return document_;
    }
    CallFrame::drop_errno();
    (void)frame.success();
    return document_;
}

void HeaderSession::note_write(int status) noexcept {
    changed_ = true;
    if (status != QUO_OK) failed_ = status;
}

int HeaderSession::commit() noexcept {
    CallFrame frame{"HeaderSession::commit", kSource};
    if (failed_ != QUO_OK) return frame.callee(failed_);
    if (!changed_) return frame.success();
    return guarded(frame, [&] {
        if (!document_->save(file_.c_str()))
            return frame.fail(QUO_REFUSED, (file_ + ": File writing failed!").c_str());
        CallFrame::drop_errno();
        changed_ = false;
        return frame.success();
    });
}

bool HeaderSession::save(AtomicFile& file) {
    const bool saved = failed_ == QUO_OK && changed_ && document_->save(file);
    changed_ = changed_ && !saved;
    return saved;
}

}  // namespace quo
