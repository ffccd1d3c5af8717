// SPDX-License-Identifier: Apache-2.0
#include <cmath>
#include <optional>

#include "commands.h"
#include "date.h"
#include "facts.h"
#include "output.h"
#include "scene.h"

namespace tool {
namespace {

using Json = nlohmann::ordered_json;

constexpr std::size_t kWidth = 15;  // of the names

struct OrbitOptions {
    std::string header;
    std::vector<std::string> at;
    std::optional<double> every_s;
    bool json = false, iso = false;

    DateForm form() const { return iso ? DateForm::kIso : DateForm::kHeader; }
};

std::string date(double time_s, DateForm form) { return date_text(time_s, form).value_or("-"); }

/** The platform at one time. */
struct StateVector {
    double time_s, position_m[3], velocity_m_s[3];

    const char* direction() const { return velocity_m_s[2] > 0.0 ? "ascending" : "descending"; }
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
        const auto shown = [&](double t_s) { return options.iso ? iso_or_number(t_s) : exact(t_s); };
        complain(scene.name() + ": " + text + " lies outside the state vectors, " + shown(scene.first_time()) +
                 " to " + shown(scene.last_time()));
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

Facts facts_of(Scene& scene, const std::vector<std::string>& findings, DateForm form) {
    const GeneralSAROrbit& orbit = scene.orbit();
    const auto wavelength_m = scene.wavelength_m();
    const char* side = !scene.look_sign() ? nullptr : *scene.look_sign() < 0 ? "left" : "right";
    Facts facts;
    const auto add_time = [&](const char* name, double time_s) {
        const std::string text = date(time_s, form);
        facts.add(name, name, exact(time_s) + " s  " + text, {{"seconds", time_s}, {"date", text}});
    };
    facts.add_text("header", "header", scene.name());
    facts.add("state vectors", "state_vectors",
              std::to_string(orbit.nSV_n) + ", " + exact(orbit.dtSV_s) + " s apart", orbit.nSV_n);
    facts.add(nullptr, "spacing_s", "", orbit.dtSV_s);
    add_time("first", scene.first_time());
    add_time("last", scene.last_time());
    facts.add_text("direction", "direction", orbit.isAscending() ? "ascending" : "descending");
    facts.add("wavelength", "wavelength_m", wavelength_m ? exact(*wavelength_m) + " m" : "not in the header",
              wavelength_m ? Json(*wavelength_m) : Json());
    facts.add("look side", "look_side", side ? side : "not in the header", side ? Json(side) : Json());
    const double error_m = orbit.orbitFitError();
    facts.add("model error", "model_error_m", fixed(error_m * 1e3, 4) + " mm (estimate)", error_m);
    if (findings.empty()) facts.add("findings", nullptr, "none", {});
    for (const std::string& finding : findings) facts.add("finding", nullptr, finding, {});
    facts.add(nullptr, "findings", "", findings);
    return facts;
}

Json as_json(const StateVector& vector, DateForm form) {
    return {{"seconds", vector.time_s},
            {"date", date(vector.time_s, form)},
            {"direction", vector.direction()},
            {"position_m", vector.position_m},
            {"velocity_m_s", vector.velocity_m_s}};
}

/** The same as comments, for a table that follows. */
std::string as_comments(const std::string& text) {
    std::string comments = "# ";
    for (const char c : text.substr(0, text.size() - 1))
        comments += c == '\n' ? std::string{"\n# "} : std::string{c};
    return comments + "\n";
}

std::string as_row(const StateVector& vector, DateForm form) {
    std::string row = exact(vector.time_s) + "," + date(vector.time_s, form) + "," + vector.direction();
    for (const double value : vector.position_m) row += "," + exact(value);
    for (const double value : vector.velocity_m_s) row += "," + exact(value);
    return row + "\n";
}

int show_orbit(const OrbitOptions& options) {
    Scene scene{options.header, Scene::Vectors::kAsTheyAre};
    int outside = 0;
    const auto vectors = state_vectors(scene, times_asked_for(options, scene, outside));
    const auto findings = scene.findings();

    const Facts facts = facts_of(scene, findings, options.form());
    if (options.json) {
        Json json = facts.json();
        for (const StateVector& vector : vectors) json["at"].push_back(as_json(vector, options.form()));
        print_json(json);
    } else if (vectors.empty()) {
        print(facts.text(kWidth));
    } else {
        Output output{"-"};
        output.write(shown_lines(as_comments(facts.text(kWidth))));
        output.write("azimuth_time_s,date,direction,x_m,y_m,z_m,vx_m_s,vy_m_s,vz_m_s\n");
        for (const StateVector& vector : vectors) output.write(as_row(vector, options.form()));
        output.commit();
    }
    return outside == 0 && findings.empty() ? kFine : kFindings;
}

}  // namespace

void add_orbit(Command& program) {
    auto [command, options] = add_verb(
        program, "orbit",
        "Shows a header's orbit, what is wrong with it, and position and velocity at chosen times", show_orbit);
    command.needs("HEADER", options.header, "Product header with the orbit");
    command.takes("--at", options.at, "Time: seconds since 1985, or a date");
    command.takes("--every", options.every_s, "From the first state vector to the last, in steps of seconds",
                  {.excludes = "--at"});
    command.flag("--iso", options.iso, "Write dates as ISO 8601");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
