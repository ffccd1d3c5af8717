// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FUZZ_BYTES_H
#define QUO_FUZZ_BYTES_H

/* The bytes of a fuzzer, taken piece by piece, and files of them. */

#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <string_view>

namespace property {

inline void require(bool holds, const char* what) {
    if (!holds) throw std::logic_error{what};
}

/** Bytes to take from; zeros where there are none left. */
class Bytes {
public:
    explicit Bytes(std::string_view all) : rest_{all} {}

    [[nodiscard]] std::string_view rest() const { return rest_; }
    [[nodiscard]] bool empty() const { return rest_.empty(); }
    std::string_view take(std::size_t count) {
        const std::string_view taken = rest_.substr(0, count);
        rest_.remove_prefix(taken.size());
        return taken;
    }
    /** Up to the first such character, which is left out. */
    std::string_view take_until(char end) {
        const std::string_view taken = take(std::min(rest_.find(end), rest_.size()));
        take(1);
        return taken;
    }
    template <typename T>
    T number() {
        T value{};
        const std::string_view taken = take(sizeof value);
        std::memcpy(&value, taken.data(), taken.size());
        return value;
    }
    /** From `least` to `most`. */
    int between(int least, int most) { return least + number<std::uint16_t>() % (most - least + 1); }

private:
    std::string_view rest_;
};

/** A file in memory, under a name of this process. Other files that begin with its name go with it as well. */
class MemoryFile {
public:
    explicit MemoryFile(std::string_view content, const char* name)
        : name_{std::string{"/dev/shm/quo_"} + name + std::to_string(getpid())} {
        write(content);
    }
    ~MemoryFile() {
        for (const char* const ending : {"", ".hdr", ".par"}) unlink((name_ + ending).c_str());
    }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;

    void write(std::string_view content, const char* ending = "") const {
        std::ofstream{name_ + ending, std::ios::binary} << content;
    }
    [[nodiscard]] const char* name() const { return name_.c_str(); }
    [[nodiscard]] std::string content() const {
        std::ifstream stream{name_, std::ios::binary};
        return {std::istreambuf_iterator<char>{stream}, {}};
    }

private:
    std::string name_;
};

}  // namespace property

#endif
