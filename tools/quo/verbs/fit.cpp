// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/api.h"
#include "sarutillib/ground/residuals.h"
#include "table.h"

namespace tool {
namespace {

struct FitOptions {
    int degree = 0;
    std::string input = "-", x, y;
    bool json = false;
};

constexpr int kHighestDegree = 20;
constexpr std::size_t kMostPoints = 10'000'000;

struct Pairs {
    std::vector<double> x, y;
    std::string x_name, y_name, input;
};

Pairs read_points(const FitOptions& options) {
    Table table{options.input};
    if (table.columns().size() < 2) throw Failure(table.place_of_names() + ": needs two columns");
    const std::size_t xy[] = {options.x.empty() ? 0 : table.need(options.x),
                              options.y.empty() ? 1 : table.need(options.y)};
    Pairs points{.x = {},
                 .y = {},
                 .x_name = table.columns()[xy[0]],
                 .y_name = table.columns()[xy[1]],
                 .input = table.input().name()};
    while (table.next()) {
        const std::vector<double> numbers = table.numbers(xy);
        if (points.x.size() == kMostPoints) throw Failure(table.place() + ": more than ten million points");
        points.x.push_back(numbers[0]);
        points.y.push_back(numbers[1]);
    }
    return points;
}

/** A polynomial in u = (x - centre) / scale, which runs from -1 to 1 over the points. */
struct Fit {
    double centre = 0.0, scale = 1.0;
    std::vector<double> coefficients;  // ascending
    LsqSummary summary{};
    quo::Residuals residuals;

    int degree() const { return static_cast<int>(coefficients.size()) - 1; }
    double at(double x) const { return polval(coefficients.data(), degree(), (x - centre) / scale); }
};

Fit fit_points(const Pairs& points, int degree) {
    Fit fit;
    const auto [least, most] = std::minmax_element(points.x.begin(), points.x.end());
    fit.centre = 0.5 * *least + 0.5 * *most;
    if (*most > *least) fit.scale = 0.5 * *most - 0.5 * *least;
    const auto terms = static_cast<std::size_t>(degree) + 1;
    std::vector<double> design;
    design.reserve(points.x.size() * terms);
    for (const double x : points.x) {
        double power = 1.0;
        for (std::size_t k = 0; k < terms; ++k, power *= (x - fit.centre) / fit.scale) design.push_back(power);
    }
    fit.coefficients.resize(terms);
    const int status = lsq_fit(design.data(), static_cast<int>(points.x.size()), static_cast<int>(terms),
                               points.y.data(), fit.coefficients.data(), &fit.summary);
    if (status != QUO_OK)
        throw Failure(points.input + ": the points cannot be fitted, status " + status_text(status));
    for (std::size_t k = 0; k < points.x.size(); ++k) fit.residuals.add(points.y[k] - fit.at(points.x[k]));
    return fit;
}

/** The coefficients in x itself, by Horner's rule on polynomials. They lose digits where the points are far from
 * x = 0 compared with their extent. */
std::vector<double> in_powers_of_x(const Fit& fit) {
    std::vector<double> powers(fit.coefficients.size(), 0.0);
    for (std::size_t k = fit.coefficients.size(); k-- > 0;) {
        for (std::size_t i = powers.size(); i-- > 1;)
            powers[i] = (powers[i - 1] - fit.centre * powers[i]) / fit.scale;
        powers[0] = fit.coefficients[k] - fit.centre / fit.scale * powers[0];
    }
    return powers;
}

std::string as_text(const Pairs& points, const Fit& fit) {
    std::string text = "# " + points.y_name + " over " + points.x_name + ", " + std::to_string(points.x.size()) +
                       " points, degree " + std::to_string(fit.degree()) + "\n# u = (" + points.x_name + " - " +
                       exact(fit.centre) + ") / " + exact(fit.scale) + "\n# rank " +
                       std::to_string(fit.summary.rank) + " of " + std::to_string(fit.coefficients.size()) +
                       ", condition " + rough(fit.summary.condition) + "\n# residual norm " +
                       rough(fit.summary.residual_norm) + ", rms " + rough(fit.residuals.rms()) + ", largest " +
                       rough(fit.residuals.largest()) + "\npower,coefficient_of_u,coefficient_of_x\n";
    const std::vector<double> powers = in_powers_of_x(fit);
    for (std::size_t k = 0; k < powers.size(); ++k)
        text += std::to_string(k) + "," + exact(fit.coefficients[k]) + "," + exact(powers[k]) + "\n";
    return text;
}

nlohmann::ordered_json as_json(const Pairs& points, const Fit& fit) {
    return {{"x", points.x_name},
            {"y", points.y_name},
            {"points", points.x.size()},
            {"degree", fit.degree()},
            {"centre", fit.centre},
            {"scale", fit.scale},
            {"coefficients_of_u", fit.coefficients},
            {"coefficients_of_x", in_powers_of_x(fit)},
            {"rank", fit.summary.rank},
            {"condition", fit.summary.condition},
            {"residual_norm", fit.summary.residual_norm},
            {"residual_rms", fit.residuals.rms()},
            {"residual_largest", fit.residuals.largest()}};
}

int fit_table(const FitOptions& options) {
    const Pairs points = read_points(options);
    if (points.x.size() < static_cast<std::size_t>(options.degree) + 1)
        throw Failure(points.input + ": " + std::to_string(points.x.size()) + " points do not determine degree " +
                      std::to_string(options.degree));
    const Fit fit = fit_points(points, options.degree);
    options.json ? print_json(as_json(points, fit)) : print(as_text(points, fit));
    if (fit.summary.rank > options.degree) return kFine;
    complain(points.input + ": the points determine only " + std::to_string(fit.summary.rank) + " of " +
             std::to_string(options.degree + 1) + " coefficients; the others are 0");
    return kFindings;
}

}  // namespace

void add_fit(Command& program) {
    auto [command, options] = add_verb(program, "fit", "Fits a polynomial to points by least squares", fit_table);
    command.details(
        "Reads comma-separated values with a line of column names. The fit runs in "
        "u = (x - centre) / scale, which goes\n"
        "from -1 to 1 over the points; the coefficients are given for u and for x itself.\n");
    command.needs("--degree", options.degree, "Degree of the polynomial", {.within = {{0, kHighestDegree}}});
    command.takes("--input", options.input, "Table to read, - for standard input", {.shows_default = true});
    command.takes("--x", options.x, "Column of the abscissa, else the first");
    command.takes("--y", options.y, "Column of the ordinate, else the second");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
