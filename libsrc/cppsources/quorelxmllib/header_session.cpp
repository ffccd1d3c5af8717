#include "quorelxmllib/header_session.h"

#include <cerrno>
#include <exception>
#include <filesystem>
#include <system_error>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "quorelxmllib/header_document.h"
#include "sarutillib/bounded_text.h"

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

HeaderSession::HeaderSession(const char* file)
    : outer_{std::exchange(innermost, this)}, file_{text_or_empty(file)} {}

HeaderSession::~HeaderSession() { innermost = outer_; }

HeaderSession* HeaderSession::find(const char* file) noexcept {
    if (!file) return nullptr;
    const int error_before = errno;
    HeaderSession* session = innermost;
    try {
        while (session && !same_file(session->file_, file)) session = session->outer_;
    } catch (const std::exception&) {
        session = nullptr;
    }
    errno = error_before;
    return session;
}

HeaderSession* HeaderSession::owner(const std::shared_ptr<HeaderDocument>& document) noexcept {
    HeaderSession* session = document ? innermost : nullptr;
    while (session && session->document_ != document) session = session->outer_;
    return session;
}

std::shared_ptr<HeaderDocument> HeaderSession::document(int& status) {
    status = QUO_OK;
    if (!document_) {
        status = HeaderDocument::load(file_.c_str(), document_);
        if (status != QUO_NO_MEMORY && !(document_ && document_->is_header())) {
            document_ = HeaderDocument::create();
            status = document_ ? QUO_OK : QUO_NO_MEMORY;
        }
        CallFrame::drop_errno();
    }
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
    try {
        if (!document_->save(file_.c_str())) return frame.fail(QUO_REFUSED, "File writing failed!");
    } catch (const std::exception&) {
        return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    }
    CallFrame::drop_errno();
    changed_ = false;
    return frame.success();
}

bool HeaderSession::save(AtomicFile& file) {
    const bool saved = failed_ == QUO_OK && changed_ && document_->save(file);
    changed_ = changed_ && !saved;
    return saved;
}

}  // namespace quo
