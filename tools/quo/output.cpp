#include "output.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>

#include "failure.h"
#include "interrupt.h"
#include "shown.h"

namespace tool {
namespace {

constexpr std::size_t kBlock = 1 << 16;

mode_t permissions_of_new_files() {
    const mode_t mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
}

}  // namespace

std::string resolved(const std::string& name) {
    struct stat about {};
    if (lstat(name.c_str(), &about) != 0 || !S_ISLNK(about.st_mode)) return name;
    char path[PATH_MAX];
    return realpath(name.c_str(), path) != nullptr ? path : name;
}

Output::Output(const std::string& name) : name_{name == "-" ? "standard output" : name} {
    struct stat about {};
    if (name == "-") {
        descriptor_ = STDOUT_FILENO;
        terminal_ = isatty(descriptor_) == 1;
    } else if (stat(name.c_str(), &about) == 0 && !S_ISREG(about.st_mode)) {
        descriptor_ = open(name.c_str(), O_WRONLY | O_CLOEXEC);
        if (descriptor_ < 0) fail();
    } else {
        target_ = resolved(name);  // so that a symbolic link keeps pointing at the replaced file
        open_unfinished();
    }
}

void Output::open_unfinished() {
    unfinished_ = target_ + ".XXXXXX";
    descriptor_ = mkostemp(unfinished_.data(), O_CLOEXEC);
    if (descriptor_ < 0) {
        unfinished_.clear();
        fail();
    }
}

Output::~Output() {
    if (descriptor_ > STDERR_FILENO) close(descriptor_);
    if (!unfinished_.empty()) unlink(unfinished_.c_str());
}

void Output::fail() const { throw Failure(name_ + ": " + system_cause()); }

void Output::write(std::string_view text) {
    throw_if_interrupted();
    if (terminal_)
        pending_ += shown_lines(text);  // tables pass on what stood in their input
    else
        pending_ += text;
    if (pending_.size() >= kBlock) flush();
}

void Output::flush() {
    std::string_view rest = pending_;
    while (!rest.empty()) {
        throw_if_interrupted();
        const ssize_t done = ::write(descriptor_, rest.data(), rest.size());
        if (done < 0 && errno != EINTR) fail();
        if (done > 0) rest.remove_prefix(static_cast<std::size_t>(done));
    }
    pending_.clear();
}

void Output::give_permissions() const {
    struct stat about {};
    const bool replaces = stat(target_.c_str(), &about) == 0;
    if (fchmod(descriptor_, replaces ? about.st_mode & 07777 : permissions_of_new_files()) != 0) fail();
}

void Output::commit() {
    flush();
    if (unfinished_.empty()) return;
    give_permissions();
    if (fsync(descriptor_) != 0 || rename(unfinished_.c_str(), target_.c_str()) != 0) fail();
    unfinished_.clear();
}

}  // namespace tool
