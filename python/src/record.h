// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_RECORD_H
#define QUO_PYTHON_RECORD_H

#include <pybind11/pybind11.h>

#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "quo_base/quorelxml_v2.h"

namespace quo_python {

namespace py = pybind11;

/** A header object seen as names and values, as its own table of elements tells them. */
class Record {
public:
    using Find = std::function<GeneralSAR_Base*()>;
    using Allocate = std::function<int()>;

    /** @param section   where the object stands in headers
     *  @param find      gives the object, or null where it is no more; keeps its owner alive
     *  @param allocate  makes arrays for the lengths that the object tells; its own createBuffers() unless given
     */
    Record(std::string section, Find find, Allocate allocate = {})
        : section_{std::move(section)}, find_{std::move(find)}, allocate_{std::move(allocate)} {}

    [[nodiscard]] const std::string& section() const { return section_; }
    [[nodiscard]] std::vector<std::string> names() const;
    [[nodiscard]] py::object get(const std::string& name) const;
    /** Sets some values, all of them or none. Single numbers first, then arrays are made for the lengths that they
     * tell, those of another length anew and filled with zeros, and then the arrays given. */
    void update(const py::dict& values);
    /** What the table tells of an element: unit, meaning, lowest, highest. */
    [[nodiscard]] py::tuple describe(const std::string& name) const;
    [[nodiscard]] GeneralSAR_Base& object() const;

private:
    [[nodiscard]] const parElement& element(const std::string& name) const;
    [[nodiscard]] py::dict content() const;
    bool set_singles(const py::dict& values, const py::dict& before);
    void set_fitting_arrays(const py::dict& values);
    int allocate() const;

    std::string section_;
    Find find_;
    Allocate allocate_;
};

/** Values of an element: a number, a text, an array that cannot be written, or a list of texts. */
py::object value_of(const parElement& element);

void bind_records(py::module_& module);

}  // namespace quo_python

#endif
