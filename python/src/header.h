// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_HEADER_H
#define QUO_PYTHON_HEADER_H

#include <pybind11/pybind11.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "grid.h"
#include "orbit.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "record.h"

namespace quo_python {

/** A product's header in memory. It is changed under the interpreter's lock only; whatever runs without it runs on
 * copies. */
class Header : public std::enable_shared_from_this<Header> {
public:
    static std::shared_ptr<Header> read(const std::string& file);
    /** Replaces the sections in a file that the header holds. */
    void write(const std::string& file, bool exact) const;
    [[nodiscard]] std::shared_ptr<Header> clone() const;

    /** Sections that the header holds, with those below them, and those that it could hold. */
    [[nodiscard]] std::vector<std::string> sections();
    [[nodiscard]] static std::vector<std::string> known_sections();
    [[nodiscard]] std::optional<Record> record(const std::string& section);
    void enable(const std::string& section, bool present);

    [[nodiscard]] Orbit orbit() const;
    void set_orbit(const Orbit& orbit);
    [[nodiscard]] Grid grid() const;
    [[nodiscard]] bool grid_broken() const { return grid_broken_; }
    void set_grid_broken(bool broken) { grid_broken_ = broken; }
    /** Polynomials as they are now, for evaluation without the interpreter's lock. */
    [[nodiscard]] std::shared_ptr<const polySAR> polynomials() const;

private:
    [[nodiscard]] std::optional<GSObject> find(const std::string& section) const;
    GeneralSAR_Base& elements(GSObject object);
    std::optional<Record> polynomial(const std::string& section);
    std::optional<Record> corner(const std::string& section);
    int remake_polynomials();
    int copy_to(Header& other) const;
    int write_all(const std::string& file, bool exact);

    GeneralSAR all_;
    ImageGrid_Obj grid_;
    bool grid_listed_ = false;  // as a section of its own; else it is made of the region
    bool grid_broken_ = false;  // listed, but no grid: the region must not stand for it
};

void bind_header(py::module_& module);

}  // namespace quo_python

#endif
