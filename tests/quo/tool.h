#ifndef QUO_TESTS_QUO_TOOL_H
#define QUO_TESTS_QUO_TOOL_H

#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "support/diagnostics.h"
#include "support/geometry.h"

namespace test {

/** How a child process ended and what it wrote. */
struct Finished {
    int exit_status = -1;  // -1 where a signal ended it
    int signal = 0;
    std::string out, err;
    long peak_kib = 0;  // the most memory it held

    [[nodiscard]] std::vector<std::string> messages() const {
        std::vector<std::string> lines;
        std::istringstream stream{err};
        for (std::string line; std::getline(stream, line);) lines.push_back(line);
        return lines;
    }
};

/** A child process whose standard streams are files, the error stream another one where it is named. */
class Child {
public:
    Child(const std::string& program, std::vector<std::string> arguments, std::string_view input = "",
          const char* error_stream = nullptr)
        : errors_{error_stream != nullptr ? error_stream : folder_.file("err")} {
        write_text(folder_.file("in"), input);
        write_text(folder_.file("err"), "");
        start(program, std::move(arguments), folder_.file("in"));
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
    void start(const std::string& program, std::vector<std::string> arguments, const std::string& input) {
        arguments.insert(arguments.begin(), program);
        std::vector<char*> pointers;
        pointers.reserve(arguments.size() + 1);
        for (std::string& argument : arguments) pointers.push_back(argument.data());
        pointers.push_back(nullptr);
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_addopen(&actions, 0, input.c_str(), O_RDONLY, 0);
        constexpr int kNew = O_WRONLY | O_CREAT | O_TRUNC;
        posix_spawn_file_actions_addopen(&actions, 1, folder_.file("out").c_str(), kNew, 0600);
        posix_spawn_file_actions_addopen(&actions, 2, errors_.c_str(), kNew, 0600);
        const int status = posix_spawn(&id_, program.c_str(), &actions, nullptr, pointers.data(), environ);
        posix_spawn_file_actions_destroy(&actions);
        if (status != 0) throw std::runtime_error("cannot start " + program);
    }

    TemporaryFolder folder_;
    std::string errors_;
    pid_t id_ = -1;
};

inline Finished quo(const std::vector<std::string>& arguments, std::string_view input = "") {
    return Child{QUO_TOOL, arguments, input}.wait();
}

/** The bundled real scenes. */
inline const std::vector<std::string>& scenes() {
    static const std::vector<std::string> names{"s1a_iw1_slc_20220104_asc", "s1a_iw_grd_20201127_desc_sea",
                                                "uavsar_winnipeg_20120717_left"};
    return names;
}
inline std::string scene_file(const std::string& name, const char* ending = ".xml") {
    return std::string{QUO_TEST_DATA} + "/scenes/" + name + ending;
}

/** A table of comma-separated values without quotes, by column name. */
class Csv {
public:
    explicit Csv(const std::string& text) {
        std::istringstream stream{text};
        for (std::string line; std::getline(stream, line);) {
            if (line.starts_with('#')) continue;
            if (names_.empty()) {
                names_ = split(line);
            } else {
                rows_.push_back(split(line));
                if (rows_.back().size() != names_.size()) throw std::runtime_error("ragged row: " + line);
            }
        }
    }
    [[nodiscard]] std::size_t size() const { return rows_.size(); }
    [[nodiscard]] const std::vector<std::string>& names() const { return names_; }
    [[nodiscard]] const std::string& text(std::size_t row, const std::string& name) const {
        const auto found = std::find(names_.begin(), names_.end(), name);
        if (found == names_.end()) throw std::runtime_error("no column " + name);
        return rows_.at(row).at(static_cast<std::size_t>(found - names_.begin()));
    }
    [[nodiscard]] double number(std::size_t row, const std::string& name) const {
        const std::string& field = text(row, name);
        char* end = nullptr;
        const double value = std::strtod(field.c_str(), &end);
        if (field.empty() || *end != '\0') throw std::runtime_error(name + " is no number: " + field);
        return value;
    }
    [[nodiscard]] Vec3 vector(std::size_t row, const char* x, const char* y, const char* z) const {
        return {number(row, x), number(row, y), number(row, z)};
    }

private:
    static std::vector<std::string> split(const std::string& line) {
        std::vector<std::string> fields{""};
        for (const char c : line) {
            if (c == ',')
                fields.emplace_back();
            else
                fields.back() += c;
        }
        return fields;
    }

    std::vector<std::string> names_;
    std::vector<std::vector<std::string>> rows_;
};

/** What a header made for a test says. */
struct MadeHeader {
    double first_s = 1167930296.25, spacing_s = 10.0;
    int vectors = 9;
    std::string wavelength_m = "0.0555", look_direction = "1";  // empty: the section is left out
};

inline std::string text_of(double value) {
    char room[40];
    const auto [end, error] = std::to_chars(std::begin(room), std::end(room), value);
    return {room, end};
}

/** The XML header of an orbit that is known at every time. Time 0 of the orbit is the first state vector. */
inline std::string header_of(const CircularOrbit& orbit, const MadeHeader& about) {
    const auto section = [](const std::string& name, const std::string& content) {
        return "<" + name + ">" + content + "</" + name + ">";
    };
    std::string positions;
    std::string velocities;
    for (int i = 0; i < about.vectors; ++i) {
        const Platform platform = orbit.earth_fixed(i * about.spacing_s);
        for (const double value : platform.position.v) positions += section("val", text_of(value));
        for (const double value : platform.velocity.v) velocities += section("val", text_of(value));
    }
    std::string channel = section("StateVectorData", section("pSV_m", positions) + section("vSV_mOs", velocities) +
                                                         section("t0SV_s", text_of(about.first_s)) +
                                                         section("dtSV_s", text_of(about.spacing_s)) +
                                                         section("nSV_n", std::to_string(about.vectors)));
    if (!about.wavelength_m.empty()) {
        std::string sampling;
        for (const char* name :
             {"fc_hz", "frg_hz", "Brg_hz", "Trg_s", "prf_hz", "pri_s", "Baz_hz", "brf_hz", "bri_s"})
            sampling += section(name, "-999");
        channel += section("SamplingConstants", sampling + section("lambda_m", about.wavelength_m));
    }
    if (!about.look_direction.empty()) {
        std::string info;
        for (const char* name : {"OrbitNumber", "Track", "SenseDate", "SceneID", "Description",
                                 "AcquisitionStation", "ProcessingCenter", "ProcessingDate", "ProcessingSoftware",
                                 "OrbitConfiguration", "Polarization", "Swath", "Projection"})
            info += section(name, "NOT_AVAILABLE");
        for (const char* name :
             {"SceneHeading", "SWST_MIN", "SWST_MAX", "RO_REF", "RangeLooks", "ExternalCalibrationFactor"})
            info += section(name, "1");
        std::string bandwidths;
        for (int i = 0; i < 5; ++i) bandwidths += section("val", "0");
        info += section("RangeBandwidth", bandwidths);
        channel += section("DataSetInfo", info + section("LookDirection", about.look_direction));
    }
    return "<?xml version=\"1.0\"?><QuorelXmlDoc><NumberOfChannels>1</NumberOfChannels>" +
           section("Description", "made for a test") + "<Channel Number=\"1\">" + channel +
           "</Channel></QuorelXmlDoc>";
}

}  // namespace test

#endif
