// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_INPUT_H
#define QUO_TOOL_INPUT_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tool {

/** Text lines of a file, or of standard input for "-". Throws Failure where the input cannot be opened or read, is
 * a folder, or holds a line longer than 1 MiB, and Interrupted. */
class LineReader {
public:
    explicit LineReader(const std::string& name);
    ~LineReader();
    LineReader(const LineReader&) = delete;
    LineReader& operator=(const LineReader&) = delete;

    /** The next line, without line feed and carriage return; false at the end. The last line may lack its line
     * feed. */
    bool next(std::string& line);
    /** The next lines as they stand, so many at most, or fewer where these take 4 MiB, whatever pieces the input
     * comes in; nothing at the end. line_number() is then that of the last. */
    std::string next_lines(std::size_t most);

    /** How the input is named in messages. */
    const std::string& name() const { return name_; }
    /** Number of the line that was given last, from 1. */
    std::int64_t line_number() const { return line_number_; }
    /** Bytes read so far, and of the whole input where it is a regular file (else 0). */
    std::int64_t bytes_read() const { return bytes_read_; }
    std::int64_t bytes_in_all() const { return bytes_in_all_; }

private:
    /** Returns once there is something to read, or nothing more will come. */
    void wait_for_input() const;
    /** Bytes that were put to `to`; 0 at the end. */
    std::size_t read_some(char* to, std::size_t room);
    bool refill();
    void require_length(std::size_t length) const;

    std::string name_;
    int descriptor_;
    bool owned_;
    std::vector<char> block_;
    std::size_t begin_ = 0, end_ = 0;  // what of the block is still to be given out
    std::int64_t line_number_ = 0, bytes_read_ = 0, bytes_in_all_ = 0;
};

}  // namespace tool

#endif
