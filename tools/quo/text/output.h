// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_OUTPUT_H
#define QUO_TOOL_OUTPUT_H

#include <memory>
#include <string>
#include <string_view>

namespace quo {
class AtomicFile;
}

namespace tool {

/** Where a result goes: standard output for "-", else a file that appears under its name in one step.
 *
 * A file is written beside its final name and renamed by commit(); whatever happens before, an older file of that
 * name stays whole and the unfinished one is taken away. A name that is no regular file (a pipe, a device) is
 * written to directly. What a terminal on standard output would obey is shown (shown.h). Throws Failure where
 * writing fails, and Interrupted. */
class Output {
public:
    explicit Output(const std::string& name);
    ~Output();
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    void write(std::string_view text);
    /** Hands on what is still buffered, so that someone who watches sees it. */
    void flush();
    /** The result is complete. */
    void commit();

private:
    friend void commit_together(Output& first, Output& second);

    void put(std::string_view rest);
    [[noreturn]] void fail() const;
    void say_in_place() const;

    std::string name_;
    std::unique_ptr<quo::AtomicFile> file_;  // none where the output is written to directly
    int descriptor_ = -1;
    bool terminal_ = false;
    std::string pending_;
};

/** Two results that belong together are complete: both files appear, or none does. Throws Failure. */
void commit_together(Output& first, Output& second);

/** Writes a whole result in one step. Throws Failure. */
void write_output(const std::string& name, std::string_view text);

}  // namespace tool

#endif
