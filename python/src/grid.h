// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_GRID_H
#define QUO_PYTHON_GRID_H

#include <pybind11/pybind11.h>

#include <memory>

#include "quo_base/image_grid.h"

namespace quo_python {

namespace py = pybind11;

/** The pixel grid of an image, which nobody changes. */
class Grid {
public:
    explicit Grid(const ImageGrid_Obj& grid);
    [[nodiscard]] const ImageGrid_Obj& grid() const { return *grid_; }

private:
    std::shared_ptr<ImageGrid_Obj> grid_ = std::make_shared<ImageGrid_Obj>();
};

void bind_grid(py::module_& module);

}  // namespace quo_python

#endif
