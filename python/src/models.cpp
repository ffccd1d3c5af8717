// SPDX-License-Identifier: Apache-2.0
#include <pybind11/stl.h>

#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "arrays.h"
#include "errors.h"
#include "quo_base/Coregist.h"
#include "quo_base/SARpolynomials.h"
#include "quo_base/generalSAR_configuration.h"
#include "quo_base/roi.h"
#include "record.h"
#include "tools.h"

namespace quo_python {

namespace {

/** A header object that stands by itself. */
template <typename Object>
class Model {
public:
    /** Nothing stands below the object. */
    [[nodiscard]] std::optional<Record> record(const std::string& section) const {
        if (section.find('/') != std::string::npos) return std::nullopt;
        return Record{section, [object = object_] { return object.get(); }};
    }
    [[nodiscard]] Object& object() const { return *object_; }
    /** One that nobody changes while an array is worked on. */
    [[nodiscard]] std::unique_ptr<Object> snapshot() const {
        auto copy = std::make_unique<Object>();
        run_locked("copying an object", [&] { return object_->clone(copy.get()); });
        return copy;
    }
    /** As it was read from a file by `call(object)`. */
    template <typename Call>
    static Model read(const std::string& file, Call call) {
        Model model;
        run_on_file(file, [&] { return call(*model.object_); });
        return model;
    }
    /** Writes a copy by `call(object)`, whose status need not tell. */
    template <typename Call>
    void write(Call call) const {
        const auto copy = snapshot();
        Failure failure = attempt([&] { return call(*copy); });
        if (failure.status == QUO_OK && failure.entry.message[0] != '\0') failure.status = QUO_WRITE_FAILED;
        if (failure.status != QUO_OK) raise(failure, "writing an object");
    }

private:
    std::shared_ptr<Object> object_ = std::make_shared<Object>();
};

using Region = Model<ROI_Obj>;
using Polynomial = Model<poly>;
using Mapping = Model<Coregist>;

/** `call(x, y, to_x, to_y)` for every pair of numbers; not-a-number where it gives another status than 0. */
template <typename Call>
py::tuple each_pair(const Doubles& x, const Doubles& y, Call call) {
    if (x.size() != y.size()) throw py::value_error("arrays of different sizes");
    Doubles first{shape_of(x)}, second{shape_of(x)};
    const double *const from_x = x.data(), *const from_y = y.data();
    double *const to_x = first.mutable_data(), *const to_y = second.mutable_data();
    run("mapping points", [=, count = x.size()] {
        for (py::ssize_t i = 0; i < count; ++i)
            if (call(from_x[i], from_y[i], to_x + i, to_y + i) != QUO_OK)
                to_x[i] = to_y[i] = std::numeric_limits<double>::quiet_NaN();
        return int{QUO_OK};
    });
    return py::make_tuple(first, second);
}

Doubles value(const Polynomial& self, const Doubles& range_s, const Doubles& azimuth_s) {
    const auto polynomial = self.snapshot();
    const auto evaluate = [&polynomial](double range, double azimuth, double* to, double*) {
        return polynomial->EvaluatePoly(range, azimuth, to);
    };
    return each_pair(range_s, azimuth_s, evaluate)[0].cast<Doubles>();
}

/** Indices of times on one axis. */
Array<std::int32_t> indices(const Region& self, int (ROI_Obj::*index)(double) const, const Doubles& times) {
    const auto region = self.snapshot();
    Array<std::int32_t> made{shape_of(times)};
    const double* const from = times.data();
    std::int32_t* const to = made.mutable_data();
    run("finding samples", [&, count = times.size()] {
        for (py::ssize_t i = 0; i < count; ++i) to[i] = ((*region).*index)(from[i]);
        return int{QUO_OK};
    });
    return made;
}

void bind_region(py::module_& module) {
    const auto array = py::arg().noconvert();
    py::class_<Region>(module, "Region")
        .def(py::init<>())
        .def("record", &Region::record)
        .def_static("read",
                    [](const std::string& file, const std::string& section) {
                        return Region::read(
                            file, [&](ROI_Obj& roi) { return roi.read_roi(file.c_str(), section.c_str()); });
                    })
        .def("write",
             [](const Region& self, const std::string& file, const std::string& section) {
                 self.write([&](ROI_Obj& roi) { return roi.write_roi(file.c_str(), section.c_str()); });
             })
        .def("set_axes",
             [](const Region& self, double range_s, double range_step_s, int samples, double azimuth_s,
                double azimuth_step_s, int lines) {
                 (void)self.object().SetFastAxe(range_s, range_step_s, samples);
                 (void)self.object().SetSlowAxe(azimuth_s, azimuth_step_s, lines);
             })
        .def("intersect",
             [](const Region& self, const Region& other) {
                 Region shared;
                 ROI_Obj::IntersectROI(&self.object(), &other.object(), &shared.object());
                 return shared;
             })
        .def(
            "samples",
            [](const Region& self, const Doubles& times) { return indices(self, &ROI_Obj::GetFastIndex, times); },
            array)
        .def(
            "lines",
            [](const Region& self, const Doubles& times) { return indices(self, &ROI_Obj::GetSlowIndex, times); },
            array);
}

void bind_mapping(py::module_& module) {
    const auto array = py::arg().noconvert();
    const auto made = [](const Mapping& self, auto method, const Region& master, const Region& slave) {
        Mapping copy;
        run_locked("copying an object", [&] { return self.object().clone(&copy.object()); });
        run_locked("making the other form",
                   [&] { return (copy.object().*method)(&master.object(), &slave.object()); });
        return copy;
    };
    using FromRegions = int (Coregist::*)(const ROI_Obj*, const ROI_Obj*);
    py::class_<Mapping>(module, "Coregistration")
        .def(py::init<>())
        .def("record", &Mapping::record)
        .def_static("read",
                    [](const std::string& file) {
                        return Mapping::read(file,
                                             [&](Coregist& mapping) { return mapping.readpar(file.c_str()); });
                    })
        .def("write",
             [](const Mapping& self, const std::string& file) {
                 self.write([&](Coregist& mapping) { return mapping.writepar(file.c_str()); });
             })
        .def(
            "to_slave",
            [](const Mapping& self, const Doubles& range_s, const Doubles& azimuth_s) {
                const auto mapping = self.snapshot();
                return each_pair(range_s, azimuth_s,
                                 [&mapping](double range, double azimuth, double* to_range, double* to) {
                                     return mapping->evaluateSLtime(range, azimuth, to_range, to);
                                 });
            },
            array, array)
        .def(
            "to_master",
            [](const Mapping& self, const Doubles& range_s, const Doubles& azimuth_s) {
                const auto mapping = self.snapshot();
                (void)mapping->init();
                return each_pair(range_s, azimuth_s,
                                 [&mapping](double range, double azimuth, double* to_range, double* to) {
                                     return mapping->evaluateMAtime(range, azimuth, to_range, to);
                                 });
            },
            array, array)
        .def("with_samples",
             [made](const Mapping& self, const Region& master, const Region& slave) {
                 return made(self, static_cast<FromRegions>(&Coregist::Time2Samples), master, slave);
             })
        .def("with_times", [made](const Mapping& self, const Region& master, const Region& slave) {
            return made(self, &Coregist::ConvertPolys, master, slave);
        });
}

// --- Records of processors --------------------------------------------------------------------------------------

class Configuration {
public:
    explicit Configuration(const std::string& name) : record_{GeneralSAR_ConfigurationRecord::make(name)} {
        if (!record_) throw py::key_error("there is no record " + name);
    }
    static Configuration read(const std::string& name, const std::string& file, int channel) {
        Configuration made{name};
        run_on_file(file, [&] { return made.record_->readpar(file.c_str(), channel); });
        return made;
    }
    void write(const std::string& file, int channel) const {
        const Configuration copy{record_->section()};
        run_locked("copying a configuration", [&] { return record_->clone(copy.record_.get()); });
        run("writing a configuration", [&] { return copy.record_->writepar(file.c_str(), channel); });
    }
    [[nodiscard]] std::optional<Record> record(const std::string& section) const {
        if (section.find('/') != std::string::npos) return std::nullopt;
        return Record{section, [record = record_] { return record.get(); }};
    }
    [[nodiscard]] py::dict shared() const {
        py::dict values;
        for (int i = 0; i < GeneralSAR_BaseConfiguration::kSharedParameters; ++i) {
            const parElement element = record_->sharedParameter(i);
            values[element.name] = value_of(element);
        }
        return values;
    }

private:
    std::shared_ptr<GeneralSAR_ConfigurationRecord> record_;
};

/** The records of a file, and what does not fit: section, name, reason of each. */
py::tuple review(const std::string& file, int channel) {
    ConfigurationReview found;
    run_on_file(file, [&] { return reviewConfiguration(file.c_str(), channel, found); });
    py::list findings;
    for (const ConfigurationFinding& finding : found.findings)
        findings.append(py::make_tuple(finding.section, finding.name, finding.reason));
    return py::make_tuple(found.records, findings);
}

void bind_configuration(py::module_& module) {
    py::class_<Configuration>(module, "Configuration")
        .def(py::init<const std::string&>())
        .def_static("read", &Configuration::read)
        .def("write", &Configuration::write)
        .def("record", &Configuration::record)
        .def("shared", &Configuration::shared)
        .def_static("names", [] {
            const auto names = GeneralSAR_ConfigurationRecord::names();
            return std::vector<std::string>(names.begin(), names.end());
        });
    module.def("review", &review);
}

}  // namespace

void bind_models(py::module_& module) {
    const auto array = py::arg().noconvert();
    bind_region(module);
    bind_mapping(module);
    bind_configuration(module);
    py::class_<Polynomial>(module, "Polynomial")
        .def(py::init<>())
        .def("record", &Polynomial::record)
        .def_static("read",
                    [](const std::string& file, const std::string& name) {
                        return Polynomial::read(file, [&](poly& polynomial) {
                            return polynomial.readpar(file.c_str(), name.c_str());
                        });
                    })
        .def("write",
             [](const Polynomial& self, const std::string& file, const std::string& name) {
                 self.write([&](poly& polynomial) { return polynomial.writepar(file.c_str(), name.c_str()); });
             })
        .def("value", &value, array, array);
}

}  // namespace quo_python
