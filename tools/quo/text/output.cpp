// SPDX-License-Identifier: Apache-2.0
#include "output.h"

#include <fcntl.h>
#include <strings.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>

#include "failure.h"
#include "interrupt.h"
#include "sarutillib/ground/file_io.h"
#include "shown.h"

namespace tool {
namespace {

constexpr std::size_t kMostPending = 1 << 16;

}  // namespace

Output::Output(const std::string& name) : name_{name == "-" ? "standard output" : name} {
    struct stat about {};
    if (name == "-") {
        descriptor_ = STDOUT_FILENO;
        terminal_ = isatty(descriptor_) == 1;
    } else if (stat(name.c_str(), &about) == 0 && !S_ISREG(about.st_mode)) {
        descriptor_ = open(name.c_str(), O_WRONLY | O_CLOEXEC);
        if (descriptor_ < 0) fail();
    } else {
        file_ = std::make_unique<quo::AtomicFile>(name.c_str());
        if (!file_->good()) fail();
    }
}

Output::~Output() {
    if (descriptor_ > STDERR_FILENO) close(descriptor_);
}

void Output::fail() const { throw Failure(name_ + ": " + system_cause()); }

void Output::write(std::string_view text) {
    throw_if_interrupted();
    if (terminal_) {
        pending_ += shown_lines(text);  // tables pass on what stood in their input
    } else if (text.size() < kMostPending) {
        pending_ += text;
    } else {
        flush();
        put(text);
    }
    if (pending_.size() >= kMostPending) flush();
}

void Output::flush() {
    put(pending_);
    pending_.clear();
}

void Output::put(std::string_view rest) {
    throw_if_interrupted();
    if (file_) {
        if (!file_->write(rest)) fail();
        return;
    }
    while (!rest.empty()) {
        throw_if_interrupted();
        const ssize_t done = ::write(descriptor_, rest.data(), rest.size());
        if (done < 0 && errno != EINTR) fail();
        if (done > 0) rest.remove_prefix(static_cast<std::size_t>(done));
    }
}

void Output::commit() {
    flush();
    if (!file_) return;
    if (!file_->commit()) fail();
    say_in_place();
}

void Output::say_in_place() const {
    if (file_->in_place()) complain(name_ + ": written in place, no other file can be put there");
}

void commit_together(Output& first, Output& second) {
    first.flush();
    second.flush();
    if (!first.file_ || !second.file_) {  // what is written to directly has arrived
        first.commit();
        second.commit();
        return;
    }
    if (!quo::commit_pair(*first.file_, *second.file_))
        throw Failure(first.name_ + ", " + second.name_ + ": cannot be written together: " + system_cause());
    first.say_in_place();
    second.say_in_place();
}

void require_png_name(const std::string& name) {
    const std::string ending = std::filesystem::path{name}.extension();
    if (!ending.empty() && strcasecmp(ending.c_str(), ".png") != 0)
        throw WrongUse(name + ": pictures are written as PNG, whose names end with .png");
}

void write_output(const std::string& name, std::string_view text) {
    Output output{name};
    output.write(text);
    output.commit();
}

}  // namespace tool
