// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_QUO_TOOL_H
#define QUO_TESTS_QUO_TOOL_H

#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "support/diagnostics.h"

namespace test {

/** How a child process ended and what it wrote. */
struct Finished {
    int exit_status = -1;  // -1 where a signal ended it
    int signal = 0;
    std::string out, err;
    long peak_kib = 0;  // the most memory it held
};

/** A child process whose standard streams are files, the error stream another one where it is named. */
class Child {
public:
    Child(const std::string& program, std::vector<std::string> arguments, std::string_view input = "",
          const char* error_stream = nullptr) {
        write_text(folder_.file("in"), input);
        write_text(folder_.file("err"), "");
        start(program, std::move(arguments), error_stream ? error_stream : folder_.file("err"));
    }
    Finished wait() {
        int status = 0;
        struct rusage used {};
        if (wait4(id_, &status, 0, &used) != id_) throw std::runtime_error("the child is lost");
        Finished finished{.out = read_text(folder_.file("out")),
                          .err = read_text(folder_.file("err")),
                          .peak_kib = used.ru_maxrss};
        if (WIFEXITED(status)) finished.exit_status = WEXITSTATUS(status);
        if (WIFSIGNALED(status)) finished.signal = WTERMSIG(status);
        return finished;
    }
    [[nodiscard]] pid_t id() const { return id_; }

private:
    void start(const std::string& program, std::vector<std::string> arguments, const std::string& errors) {
        arguments.insert(arguments.begin(), program);
        std::vector<char*> pointers;
        pointers.reserve(arguments.size() + 1);
        for (std::string& argument : arguments) pointers.push_back(argument.data());
        pointers.push_back(nullptr);
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        constexpr int kNew = O_WRONLY | O_CREAT | O_TRUNC;
        posix_spawn_file_actions_addopen(&actions, 0, folder_.file("in").c_str(), O_RDONLY, 0);
        posix_spawn_file_actions_addopen(&actions, 1, folder_.file("out").c_str(), kNew, 0600);
        posix_spawn_file_actions_addopen(&actions, 2, errors.c_str(), kNew, 0600);
        const int status = posix_spawn(&id_, program.c_str(), &actions, nullptr, pointers.data(), environ);
        posix_spawn_file_actions_destroy(&actions);
        if (status != 0) throw std::runtime_error("cannot start " + program);
    }

    TemporaryFolder folder_;
    pid_t id_ = -1;
};

inline Finished quo(const std::vector<std::string>& arguments, std::string_view input = "") {
    return Child{QUO_TOOL, arguments, input}.wait();
}

inline std::string scene_file(const std::string& name) { return QUO_TEST_DATA "/scenes/" + name; }

/** The values of a table's rows, as many as are numbers, behind the line of column names. */
inline std::vector<std::vector<double>> numbers_in(const std::string& table) {
    std::vector<std::vector<double>> rows;
    std::istringstream lines{table};
    bool named = false;
    for (std::string line; std::getline(lines, line);) {
        if (line.starts_with('#') || !std::exchange(named, true)) continue;
        std::istringstream fields{line};
        auto& row = rows.emplace_back();
        for (std::string field; std::getline(fields, field, ',');)
            row.push_back(std::strtod(field.c_str(), nullptr));
    }
    return rows;
}

}  // namespace test

#endif
