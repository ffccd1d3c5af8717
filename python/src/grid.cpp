// SPDX-License-Identifier: Apache-2.0
#include "grid.h"

#include "arrays.h"
#include "errors.h"

namespace quo_python {

Grid::Grid(const ImageGrid_Obj& grid) {
    run_locked("copying a pixel grid", [&] { return grid.clone(grid_.get()); });
}

namespace {

py::tuple times(const Grid& self, const Doubles& line, const Doubles& sample) {
    if (line.size() != sample.size()) throw py::value_error("arrays of different sizes");
    Doubles azimuth_s{shape_of(line)}, range_s{shape_of(line)};
    Array<std::int32_t> status{shape_of(line)};
    const ImagePixels pixels{static_cast<std::size_t>(line.size()), line.data(), sample.data()};
    const PixelTimes wanted{azimuth_s.mutable_data(), range_s.mutable_data(), status.mutable_data()};
    run("finding the times of pixels", [&] { return self.grid().pixelTimes(pixels, wanted); });
    return py::make_tuple(azimuth_s, range_s, status);
}

py::tuple pixels(const Grid& self, const Doubles& azimuth_s, const Doubles& range_s) {
    if (azimuth_s.size() != range_s.size()) throw py::value_error("arrays of different sizes");
    Doubles line{shape_of(azimuth_s)}, second_line{shape_of(azimuth_s)}, sample{shape_of(azimuth_s)};
    Array<std::int32_t> status{shape_of(azimuth_s)};
    const ImageTimes times{static_cast<std::size_t>(azimuth_s.size()), azimuth_s.data(), range_s.data()};
    const TimePixels wanted{line.mutable_data(), second_line.mutable_data(), sample.mutable_data(),
                            status.mutable_data()};
    run("finding the pixels of times", [&] { return self.grid().timePixels(times, wanted); });
    return py::make_tuple(line, second_line, sample, status);
}

}  // namespace

void bind_grid(py::module_& module) {
    py::class_<Grid>(module, "Grid")
        .def("times", &times, py::arg().noconvert(), py::arg().noconvert())
        .def("pixels", &pixels, py::arg().noconvert(), py::arg().noconvert())
        .def_property_readonly("bursts", [](const Grid& self) { return self.grid().Bursts; })
        .def_property_readonly("ground_range", [](const Grid& self) { return self.grid().GroundLists > 0; })
        .def_property_readonly("lines_at_one_time",
                               [](const Grid& self) { return self.grid().DelayShare == 0.0; });
}

}  // namespace quo_python
