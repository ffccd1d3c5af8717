// SPDX-License-Identifier: Apache-2.0
#include "record.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <limits>
#include <span>
#include <type_traits>
#include <vector>

#include "arrays.h"
#include "errors.h"

namespace quo_python {

namespace {

// --- Values of elements -----------------------------------------------------------------------------------------

/** Headers may hold bytes that are no UTF-8; they come back as they were. */
constexpr const char* kBytes = "surrogateescape";

py::str text_of(const char* bytes) {
    PyObject* const text = PyUnicode_DecodeUTF8(bytes, static_cast<Py_ssize_t>(std::strlen(bytes)), kBytes);
    if (!text) throw py::error_already_set();
    return py::reinterpret_steal<py::str>(text);
}

std::string bytes_of(const py::handle& text, std::size_t room) {
    if (!py::isinstance<py::str>(text)) throw py::type_error("a text is needed");
    PyObject* const encoded = PyUnicode_AsEncodedString(text.ptr(), "utf-8", kBytes);
    if (!encoded) throw py::error_already_set();
    std::string bytes = py::reinterpret_steal<py::bytes>(encoded);
    if (bytes.size() >= room || bytes.find('\0') != std::string::npos)
        throw py::value_error("a text of at most " + std::to_string(room - 1) +
                              " bytes, none of them 0, is needed");
    return bytes;
}

double number_of(const py::handle& value) {
    const double number = PyFloat_AsDouble(value.ptr());
    if (number == -1.0 && PyErr_Occurred()) throw py::error_already_set();
    return number;
}

std::int32_t integer_of(const py::handle& value) {
    const auto index = py::reinterpret_steal<py::object>(PyNumber_Index(value.ptr()));
    if (!index) throw py::error_already_set();
    int overflow = 0;
    const long long number = PyLong_AsLongLongAndOverflow(index.ptr(), &overflow);
    using Limits = std::numeric_limits<std::int32_t>;
    if (overflow != 0 || number < Limits::min() || number > Limits::max())
        throw py::value_error("an integer beyond 32 bits");
    return static_cast<std::int32_t>(number);
}

template <typename T>
py::object numbers(const parElement& element, std::span<T> held) {
    if (element.scalar && held.size() == 1) return py::cast(held[0]);
    py::array_t<T> array{static_cast<py::ssize_t>(held.size()), held.data()};
    // A copy: what is changed in it would be lost without a word.
    array.attr("setflags")(py::arg("write") = false);
    return array;
}

py::object texts(const parElement& element, std::span<char* const> held) {
    if (!element.text_array) return text_of(held[0]);
    py::list list;
    for (const char* text : held) list.append(text_of(text));
    return list;
}

/** The items of a sequence that must have as many as the element. */
py::list items_of(const parElement& element, const py::handle& value) {
    const bool array = py::isinstance<py::array>(value);
    if (!array && !py::isinstance<py::sequence>(value)) throw py::type_error("a sequence is needed");
    py::object values = py::reinterpret_borrow<py::object>(value);
    if (array) values = values.attr("ravel")().attr("tolist")();
    py::list items(values);
    if (items.size() != static_cast<std::size_t>(std::max(element.count, 0)))
        throw py::value_error(std::to_string(element.count) + " values are needed, not " +
                              std::to_string(items.size()));
    return items;
}

/** Sets the numbers of an element; all of them are looked at before the first is set. */
template <typename T, typename Convert>
void set_numbers(const parElement& element, std::span<T> held, const py::handle& value, Convert convert) {
    std::vector<T> made;
    if (element.scalar && held.size() == 1) {
        made.push_back(static_cast<T>(convert(value)));
    } else {
        for (const py::handle& item : items_of(element, value)) made.push_back(static_cast<T>(convert(item)));
    }
    std::ranges::copy(made, held.begin());
}

void set_text(char* to, std::size_t room, const py::handle& value) {
    const std::string bytes = bytes_of(value, room);
    std::memcpy(to, bytes.c_str(), bytes.size() + 1);
}

void set_texts(const parElement& element, std::span<char* const> held, const py::handle& value) {
    if (!element.text_array) return set_text(held[0], element.room, value);
    std::size_t i = 0;
    for (const py::handle& item : items_of(element, value)) set_text(held[i++], element.room, item);
}

void set_value(const parElement& element, const py::handle& value) {
    element.withValues([&]<typename T>(std::span<T> held) {
        if constexpr (std::is_floating_point_v<T>)
            set_numbers(element, held, value, number_of);
        else if constexpr (std::is_integral_v<T>)
            set_numbers(element, held, value, integer_of);
        else
            set_texts(element, held, value);
    });
}

bool is_single(const parElement& element) { return element.scalar && !element.text_array; }

}  // namespace

// --- Record -----------------------------------------------------------------------------------------------------

py::object value_of(const parElement& element) {
    return element.withValues([&]<typename T>(std::span<T> held) -> py::object {
        if constexpr (std::is_arithmetic_v<T>)
            return numbers(element, held);
        else
            return texts(element, held);
    });
}

GeneralSAR_Base& Record::object() const {
    GeneralSAR_Base* const object = find_();
    if (!object) raise(QUO_REFUSED, (section_ + " is there no more").c_str());
    return *object;
}

const parElement& Record::element(const std::string& name) const {
    const GeneralSAR_Base& held = object();
    for (int i = 0; i < held.elementCount(); ++i)
        if (name == held.element(i)->name) return *held.element(i);
    throw py::key_error(section_ + " has no field " + name);
}

std::vector<std::string> Record::names() const {
    const GeneralSAR_Base& held = object();
    std::vector<std::string> names;
    names.reserve(static_cast<std::size_t>(held.elementCount()));
    for (int i = 0; i < held.elementCount(); ++i) names.emplace_back(held.element(i)->name);
    return names;
}

py::object Record::get(const std::string& name) const { return value_of(element(name)); }

py::tuple Record::describe(const std::string& name) const {
    const parElement& told = element(name);
    return py::make_tuple(told.unit, told.meaning, told.minimum, told.maximum);
}

py::dict Record::content() const {
    py::dict content;
    for (const std::string& name : names()) content[py::str(name)] = get(name);
    return content;
}

int Record::allocate() const { return allocate_ ? allocate_() : object().createBuffers(); }

void Record::update(const py::dict& values) {
    for (const auto& [name, value] : values) (void)element(py::cast<std::string>(name));
    const py::dict before = content();
    bool made_anew = false;
    try {
        made_anew = set_singles(values, before);
        if (made_anew) {
            run_locked("making arrays", [this] { return allocate(); });
            set_fitting_arrays(before);
        }
        for (const auto& [name, value] : values)
            if (const parElement& array = element(py::cast<std::string>(name)); !is_single(array))
                set_value(array, value);
    } catch (...) {
        (void)set_singles(before, before);
        if (made_anew && attempt_locked([this] { return allocate(); }).status != QUO_OK)
            (void)set_singles(before, before);  // lengths that make no arrays, as those of a new object
        set_fitting_arrays(before);
        throw;
    }
}

/** Sets the single values; whether an integer has changed, which may be a length. */
bool Record::set_singles(const py::dict& values, const py::dict& before) {
    bool changed = false;
    for (const auto& [name, value] : values) {
        const parElement& single = element(py::cast<std::string>(name));
        if (!is_single(single)) continue;
        set_value(single, value);
        changed = changed || (single.type == parElement::typeInt && !value_of(single).equal(before[name]));
    }
    return changed;
}

/** Sets the arrays that have as many values as those given. */
void Record::set_fitting_arrays(const py::dict& values) {
    for (const auto& [name, value] : values) {
        const parElement& array = element(py::cast<std::string>(name));
        if (!is_single(array) && py::len(value) == static_cast<std::size_t>(std::max(array.count, 0)))
            set_value(array, value);
    }
}

void bind_records(py::module_& module) {
    py::class_<Record>(module, "Record")
        .def_property_readonly("section", &Record::section)
        .def("names", &Record::names)
        .def("get", &Record::get)
        .def("update", &Record::update)
        .def("describe", &Record::describe);
}

}  // namespace quo_python
