// SPDX-License-Identifier: Apache-2.0
#include "quo_base/debugIO.h"

#include <array>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <optional>

#include "diagnosticslib/call_frame.h"
#include "diagnosticslib/errno_kept.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

namespace {

constexpr const char* kSource = "debugIO";
constexpr std::array<std::size_t, 6> kElementSizes{4, 8, 8, 16, 2, 1};

std::optional<std::size_t> dump_size(int type, int first, int second) {
    if (debug_element_size(type) == 0 || first < 0 || second < 0) return std::nullopt;
    return (quo::Checked<std::size_t>{debug_element_size(type)} * first * second).value();
}

bool write_whole(std::FILE* stream, const void* data, std::size_t size) {
    return size == 0 || std::fwrite(data, 1, size, stream) == size;
}

constexpr std::size_t kLineRoom = 512;

/** A line to the parent process, in one piece whatever other threads send. */
void send_line(const char* line) { std::fputs(line, stderr); }

// "%f" whatever the locale, cut to the room that the longest float needs.
void send_progress(float value) {
    char digits[64], line[kLineRoom];
    const auto end = std::to_chars(digits, digits + sizeof digits - 1, value, std::chars_format::fixed, 6);
    *end.ptr = '\0';
    quo::format_bounded(line, sizeof line, "SET_WAITBAR: %s \n", digits);
    send_line(line);
}

}  // namespace

extern "C" {

size_t debug_element_size(int type) noexcept {
    return type >= 0 && static_cast<std::size_t>(type) < kElementSizes.size()
               ? kElementSizes[static_cast<std::size_t>(type)]
               : 0;
}

int write_debug(const char* file_name, const void* data, int type, int first, int second) noexcept {
    quo::CallFrame frame{"write_debug()", kSource};
    const auto size = dump_size(type, first, second);
    if (!size || !file_name || (*size > 0 && !data)) {
        return frame.fail(QUO_REFUSED, "No element type, dimension or data for a dump");
    }
    const quo::Stream stream{std::fopen(file_name, "wb")};
    if (!stream) return frame.fail(QUO_NOT_OPENED, "File not opened!");

    const std::int32_t words[3] = {type, first, second};
    if (!write_whole(stream.get(), words, sizeof words) || !write_whole(stream.get(), data, *size) ||
        std::fflush(stream.get()) != 0) {
        return frame.fail(QUO_WRITE_FAILED, "File writing failed!");
    }
    return frame.success();
}

int waitbar_open(const char* title) noexcept {
    const quo::ErrnoKept kept;  // nobody has to listen
    std::fputs("USE_WAITBAR\n", stderr);
    char line[kLineRoom];
    quo::format_bounded(line, sizeof line, "SET_TITLE: %.499s\n", title ? title : "");
    send_line(line);
    std::fflush(stderr);
    return QUO_OK;
}

int waitbar_update(float value) noexcept {
    const quo::ErrnoKept kept;  // nobody has to listen
    send_progress(value);
    std::fflush(stderr);
    return QUO_OK;
}

int waitbar_close() noexcept {
    const quo::ErrnoKept kept;  // nobody has to listen
    send_line("CLOSE_WAITBAR\n");
    return QUO_OK;
}

}  // extern "C"
