#include <cmath>
#include <nlohmann/json.hpp>
#include <optional>

#include "commands.h"
#include "date.h"
#include "failure.h"
#include "number.h"
#include "output.h"
#include "scene.h"
#include "shown.h"

namespace tool {
namespace {

struct OrbitOptions {
    std::string header;
    std::vector<std::string> at;
    std::optional<double> every_s;
    bool json = false;
};

/** The platform at one time. */
struct StateVector {
    double time_s, position_m[3], velocity_m_s[3];

    const char* direction() const { return velocity_m_s[2] > 0.0 ? "ascending" : "descending"; }
    std::string date() const { return date_text(time_s).value_or("-"); }
};

/** The times from the first state vector to the last, `step_s` apart. */
void append_steps(std::vector<double>& times, const Scene& scene, double step_s) {
    constexpr double kMostSteps = 1e7;
    constexpr double kLeeway =
        1e-9;  // of a step: the last vector is one of the times where the step divides the span
    const std::string option = "--every " + exact(step_s) + ": ";
    if (!(step_s > 0.0 && std::isfinite(step_s)))
        throw WrongUse(option + "the step must be a number of seconds above 0");
    const double steps = (scene.last_time() - scene.first_time()) / step_s;
    if (steps > kMostSteps)
        throw WrongUse(option + "that makes " + rough(steps) + " steps, at most " + exact(kMostSteps) +
                       " are shown");
    const auto last = static_cast<std::int64_t>(steps + kLeeway);
    for (std::int64_t i = 0; i <= last; ++i) times.push_back(scene.first_time() + static_cast<double>(i) * step_s);
}

/** The times that the options ask for. Those outside the state vectors, where the orbit would be extrapolated, are
 * left out with a message; `outside` counts them. */
std::vector<double> times_asked_for(const OrbitOptions& options, const Scene& scene, int& outside) {
    std::vector<double> times;
    for (const std::string& text : options.at) {
        const double time_s = seconds_of(text);
        if (scene.covers(time_s)) {
            times.push_back(time_s);
            continue;
        }
        ++outside;
        complain(scene.name() + ": " + text + " lies outside the state vectors, " + exact(scene.first_time()) +
                 " to " + exact(scene.last_time()));
    }
    if (options.every_s) append_steps(times, scene, *options.every_s);
    return times;
}

std::vector<StateVector> state_vectors(Scene& scene, const std::vector<double>& times) {
    std::vector<StateVector> list;
    for (const double time_s : times) {
        StateVector vector{.time_s = time_s, .position_m = {}, .velocity_m_s = {}};
        int status = scene.orbit().SVGetPos(time_s, vector.position_m);
        if (status == 0) status = scene.orbit().SVGetVel(time_s, vector.velocity_m_s);
        if (status != 0)
            throw Failure(scene.name() + ": no position at " + exact(time_s) + ", status " + status_text(status));
        list.push_back(vector);
    }
    return list;
}

nlohmann::ordered_json as_json(Scene& scene, const std::vector<std::string>& findings,
                               const std::vector<StateVector>& vectors) {
    const auto time = [](double time_s) {
        return nlohmann::ordered_json{{"seconds", time_s}, {"date", date_text(time_s).value_or("-")}};
    };
    const GeneralSAROrbit& orbit = scene.orbit();
    nlohmann::ordered_json facts{{"header", scene.name()},
                                 {"state_vectors", orbit.nSV_n},
                                 {"spacing_s", orbit.dtSV_s},
                                 {"first", time(scene.first_time())},
                                 {"last", time(scene.last_time())},
                                 {"direction", orbit.isAscending() ? "ascending" : "descending"},
                                 {"wavelength_m", nullptr},
                                 {"look_side", nullptr},
                                 {"model_error_m", orbit.orbitFitError()},
                                 {"findings", findings}};
    if (scene.wavelength_m()) facts["wavelength_m"] = *scene.wavelength_m();
    if (scene.look_sign()) facts["look_side"] = *scene.look_sign() < 0 ? "left" : "right";
    for (const StateVector& vector : vectors)
        facts["at"].push_back({{"seconds", vector.time_s},
                               {"date", vector.date()},
                               {"direction", vector.direction()},
                               {"position_m", vector.position_m},
                               {"velocity_m_s", vector.velocity_m_s}});
    return facts;
}

/** One "name   value" line per fact. */
std::string as_text(Scene& scene, const std::vector<std::string>& findings) {
    const GeneralSAROrbit& orbit = scene.orbit();
    const auto time = [](double time_s) { return exact(time_s) + " s  " + date_text(time_s).value_or("-"); };
    std::vector<std::pair<std::string, std::string>> facts{
        {"header", shown(scene.name())},
        {"state vectors", std::to_string(orbit.nSV_n) + ", " + exact(orbit.dtSV_s) + " s apart"},
        {"first", time(scene.first_time())},
        {"last", time(scene.last_time())},
        {"direction", orbit.isAscending() ? "ascending" : "descending"},
        {"wavelength", scene.wavelength_m() ? exact(*scene.wavelength_m()) + " m" : "not in the header"},
        {"look side", !scene.look_sign()       ? "not in the header"
                      : *scene.look_sign() < 0 ? "left"
                                               : "right"},
        {"model error", fixed(orbit.orbitFitError() * 1e3, 4) + " mm (estimate)"},
    };
    if (findings.empty()) facts.emplace_back("findings", "none");
    for (const std::string& finding : findings) facts.emplace_back("finding", finding);

    constexpr std::size_t kWidth = 15;
    std::string text;
    for (const auto& [name, value] : facts) text += column(name, kWidth) + value + "\n";
    return text;
}

/** The same as comments, for a table that follows. */
std::string as_comments(const std::string& text) {
    std::string comments = "# ";
    for (const char c : text.substr(0, text.size() - 1))
        comments += c == '\n' ? std::string{"\n# "} : std::string{c};
    return comments + "\n";
}

std::string as_row(const StateVector& vector) {
    std::string row = exact(vector.time_s) + "," + vector.date() + "," + vector.direction();
    for (const double value : vector.position_m) row += "," + exact(value);
    for (const double value : vector.velocity_m_s) row += "," + exact(value);
    return row + "\n";
}

int show_orbit(const OrbitOptions& options) {
    Scene scene{options.header, Scene::Vectors::kAsTheyAre};
    int outside = 0;
    const auto vectors = state_vectors(scene, times_asked_for(options, scene, outside));
    const auto findings = scene.findings();

    if (options.json) {
        print_json(as_json(scene, findings, vectors));
    } else if (vectors.empty()) {
        print(as_text(scene, findings));
    } else {
        Output output{"-"};
        output.write(shown_lines(as_comments(as_text(scene, findings))));
        output.write("azimuth_time_s,date,direction,x_m,y_m,z_m,vx_m_s,vy_m_s,vz_m_s\n");
        for (const StateVector& vector : vectors) output.write(as_row(vector));
        output.commit();
    }
    return outside == 0 && findings.empty() ? kFine : kFindings;
}

}  // namespace

void add_orbit(CLI::App& app, Job& job) {
    const auto [command, options] = add_verb(
        app, job, "orbit",
        "Shows a header's orbit, what is wrong with it, and position and velocity at chosen times", show_orbit);
    command->add_option("HEADER", options.header, "Product header with the orbit")->required();
    CLI::Option* at = command->add_option("--at", options.at, "Time: seconds since 1985, or a date text");
    command->add_option("--every", options.every_s, "From the first state vector to the last, in steps of seconds")
        ->excludes(at);
    command->add_flag("--json", options.json, "Print JSON");
}

}  // namespace tool
