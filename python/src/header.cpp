// SPDX-License-Identifier: Apache-2.0
#include "header.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <string_view>
#include <utility>

#include "arrays.h"
#include "errors.h"
#include "quo_base/derived_raster.h"
#include "quo_base/product.h"

namespace quo_python {

namespace {

constexpr const char* kReading = "reading a product header";

struct Corner {
    const char* name;
    geopoint geoCoords_Obj::*point;
};
constexpr Corner kCorners[] = {
    {"NorthWest", &geoCoords_Obj::NorthWest}, {"NorthEast", &geoCoords_Obj::NorthEast},
    {"SouthWest", &geoCoords_Obj::SouthWest}, {"SouthEast", &geoCoords_Obj::SouthEast},
    {"Center", &geoCoords_Obj::Center},
};

const char* section_of(const GeneralSAR_BaseXML& object) {
    const parElement* const first = object.element(0);
    return first ? first->section : "";
}

const char* grid_section() {
    static const ImageGrid_Obj grid;
    return section_of(grid);
}

/** "NAME" of "SECTION/NAME"; empty for a path of another section. */
std::string below(const std::string& path, std::string_view section) {
    const bool inside = path.starts_with(section) && path.size() > section.size() && path[section.size()] == '/';
    return inside ? path.substr(section.size() + 1) : std::string{};
}

/** The state vectors stand for the orbit model, which has the same section; the data file for none. */
constexpr bool has_record(int object) { return object != gsDataFile && object != gsOrbit; }

/** Names of the sections of a container that `wanted` takes. */
template <typename Wanted>
std::vector<std::string> sections_of(const GeneralSAR& all, Wanted wanted) {
    std::vector<std::string> sections;
    for (int i = 0; i < GeneralSAR::kObjects; ++i)
        if (const auto object = static_cast<GSObject>(i); has_record(i) && wanted(object))
            sections.emplace_back(section_of(*all.GSelements(object)));
    return sections;
}

/** Status of putting an object's texts into a document in memory, which XML may have no form for. */
int put_texts(quorelxml& document, const GeneralSAR_Base& object) {
    for (int i = 0; i < object.elementCount(); ++i) {
        const parElement& element = *object.element(i);
        if (element.type != parElement::typeString || element.count < 1) continue;
        const auto* const single = static_cast<const char*>(element.pointer);
        const char* const* const texts = element.text_array ? static_cast<char**>(element.pointer) : &single;
        if (const int status = document.writeString(1, "Texts", texts, element.count)) return status;
    }
    return QUO_OK;
}

}  // namespace

// --- Files ------------------------------------------------------------------------------------------------------

namespace {

/** Raises what opening a product says of a file that nothing was read from: no such file, or where it is no XML.
 */
[[noreturn]] void refuse_file(const std::string& file) {
    run(kReading, [&] {
        quo_product* product = nullptr;
        const int status = quo_product_open(file.c_str(), nullptr, &product);
        if (product) (void)quo_product_close(product);
        return status;
    });
    raise(QUO_REFUSED, "the file holds no object of a product");
}

}  // namespace

std::shared_ptr<Header> Header::read(const std::string& file) {
    auto header = std::make_shared<Header>();
    const Failure failure = attempt([&] {
        if (const int status = header->all_.GSread(file.c_str())) return status;
        header->all_.GSdisable(gsDataFile);
        header->all_.GSdisable(gsOrbit);
        const int grid = header->grid_.readhdr(file.c_str());
        header->grid_listed_ = grid == QUO_OK;
        header->grid_broken_ = grid != QUO_OK && grid != QUO_REFUSED;
        return int{QUO_OK};
    });
    if (failure.status == QUO_REFUSED) refuse_file(file);
    if (failure.status != QUO_OK) raise(failure, kReading);
    if (header->sections().empty()) refuse_file(file);
    return header;
}

void Header::write(const std::string& file, bool exact) const {
    const auto copy = clone();
    const Failure failure = attempt([&] { return copy->write_all(file, exact); });
    // The container answers 0 in any case; what went wrong it reports.
    if (failure.status != QUO_OK) raise(failure, "writing a product header");
    if (failure.entry.message[0] == '\0') return;
    Failure told = failure;
    told.status = QUO_WRITE_FAILED;
    raise(told, "writing a product header");
}

int Header::write_all(const std::string& file, bool exact) {
    quorelxml texts{file.c_str()};
    for (const std::string& section : sections()) {
        GeneralSAR_Base& object = record(section)->object();
        if (put_texts(texts, object) != QUO_OK)
            return QUO_WRITE_FAILED;  // sections before this one would be saved
        object.setExactNumbers(exact);
    }
    const int status = all_.GSwrite(file.c_str());
    return status == QUO_OK && grid_listed_ ? grid_.writehdr(file.c_str()) : status;
}

std::shared_ptr<Header> Header::clone() const {
    auto copy = std::make_shared<Header>();
    run_locked("copying a product header", [&] { return copy_to(*copy); });
    return copy;
}

int Header::copy_to(Header& other) const {
    other.grid_listed_ = grid_listed_;
    other.grid_broken_ = grid_broken_;
    // Copying takes nothing from the objects but what it copies; the library's signature does not say so.
    if (const int status = const_cast<GeneralSAR&>(all_).GSclone(&other.all_)) return status;
    return grid_.clone(&other.grid_);
}

// --- Sections ---------------------------------------------------------------------------------------------------

std::vector<std::string> Header::sections() {
    std::vector<std::string> sections =
        sections_of(all_, [this](GSObject object) { return all_.GSexists(object); });
    if (all_.GSexists(gsPolySAR))
        for (const std::string& name : all_.polynomials.names())
            sections.push_back(section_of(all_.polynomials) + ('/' + name));
    if (all_.GSexists(gsGeoCoords))
        for (const Corner& corner : kCorners)
            sections.push_back(section_of(all_.geoCoords) + ('/' + std::string{corner.name}));
    if (grid_listed_) sections.emplace_back(grid_section());
    return sections;
}

std::vector<std::string> Header::known_sections() {
    static const GeneralSAR all;
    std::vector<std::string> sections = sections_of(all, [](GSObject) { return true; });
    sections.emplace_back(grid_section());
    return sections;
}

std::optional<GSObject> Header::find(const std::string& section) const {
    for (int i = 0; i < GeneralSAR::kObjects; ++i) {
        const auto object = static_cast<GSObject>(i);
        if (has_record(i) && section == section_of(*all_.GSelements(object))) return object;
    }
    return std::nullopt;
}

GeneralSAR_Base& Header::elements(GSObject object) {
    return object == gsRoi ? static_cast<GeneralSAR_Base&>(all_.roi.Roi) : *all_.GSget(object);
}

std::optional<Record> Header::record(const std::string& section) {
    const auto self = shared_from_this();
    if (grid_listed_ && section == grid_section()) return Record{section, [self] { return &self->grid_; }};
    const auto object = find(section);
    if (!object)
        return below(section, section_of(all_.polynomials)).empty() ? corner(section) : polynomial(section);
    if (!all_.GSexists(*object)) return std::nullopt;
    Record::Allocate allocate;
    if (*object == gsPolySAR) allocate = [self] { return self->remake_polynomials(); };
    return Record{section, [self, object] { return &self->elements(*object); }, std::move(allocate)};
}

std::optional<Record> Header::polynomial(const std::string& section) {
    const std::string name = below(section, section_of(all_.polynomials));
    if (!all_.GSexists(gsPolySAR) || !all_.polynomials.polynomial(name)) return std::nullopt;
    // Found anew by every call: lists that are made anew leave none of the old ones.
    return Record{
        section, [self = shared_from_this(), name] {
            return static_cast<GeneralSAR_Base*>(const_cast<poly*>(self->all_.polynomials.polynomial(name)));
        }};
}

std::optional<Record> Header::corner(const std::string& section) {
    const std::string name = below(section, section_of(all_.geoCoords));
    const auto* const found = std::find_if(std::begin(kCorners), std::end(kCorners),
                                           [&](const Corner& corner) { return name == corner.name; });
    if (!all_.GSexists(gsGeoCoords) || found == std::end(kCorners)) return std::nullopt;
    return Record{section, [self = shared_from_this(), point = found->point] {
                      return static_cast<GeneralSAR_Base*>(&(self->all_.geoCoords.*point));
                  }};
}

/** Lists as long as the counts tell; polynomials that stood in the old ones keep their values. */
int Header::remake_polynomials() {
    polySAR& set = all_.polynomials;
    const int counts[] = {set.ndc, set.nfr, set.nsl2gr, set.ngr2sl, set.nsl2theta, set.nsl2phi};
    if (*std::min_element(std::begin(counts), std::end(counts)) < 0) return QUO_REFUSED;
    polySAR before;
    if (const int status = set.clone(&before)) return status;
    if (const int status = set.CreatePolys(counts[0], counts[1], counts[2], counts[3], counts[4], counts[5]))
        return status;
    for (const std::string& name : set.names())
        if (const poly* const old = before.polynomial(name))
            (void)old->clone(const_cast<poly*>(set.polynomial(name)));
    return QUO_OK;
}

void Header::enable(const std::string& section, bool present) {
    if (section == grid_section()) {
        grid_listed_ = present;
        grid_broken_ = false;
        return;
    }
    const auto object = find(section);
    if (!object) throw py::key_error("products have no section " + section);
    (void)(present ? all_.GSenable(*object) : all_.GSdisable(*object));
}

// --- What is asked of a header ----------------------------------------------------------------------------------

Orbit Header::orbit() const {
    if (!all_.GSexists(gsStateVectors)) raise(QUO_REFUSED, "the product has no orbit");
    const SAROrbitStateVectors_Obj& vectors = all_.stateVectors;
    const bool wavelength = all_.GSexists(gsSamplingConstants) && all_.samplingConstants.lambda_m > 0.0;
    return Orbit::make(
        {vectors.t0SV_s, vectors.dtSV_s, vectors.nSV_n, vectors.pSV_m, vectors.vSV_mOs},
        wavelength ? std::optional{all_.samplingConstants.lambda_m} : std::nullopt,
        all_.GSexists(gsDataSetInfo) ? std::optional{all_.dataSetInfo.LookDirection} : std::nullopt);
}

void Header::set_orbit(const Orbit& orbit) {
    const StateVectors from = orbit.vectors();
    SAROrbitStateVectors_Obj& to = all_.stateVectors;
    run_locked("taking over an orbit", [&] { return to.SVCreate(from.first_s, from.spacing_s, from.count); });
    const auto numbers = 3 * static_cast<std::size_t>(from.count);
    std::copy_n(from.positions_m, numbers, to.pSV_m);
    std::copy_n(from.velocities_m_s, numbers, to.vSV_mOs);
    all_.GSenable(gsStateVectors);
}

Grid Header::grid() const {
    if (grid_listed_) return Grid{grid_};
    ImageGrid_Obj made;
    if (grid_broken_ || attempt_locked([&] { return region_image_grid(all_, made); }).status != QUO_OK)
        raise(QUO_REFUSED, "the product has no pixel grid");
    return Grid{made};
}

std::shared_ptr<const polySAR> Header::polynomials() const {
    auto copy = std::make_shared<polySAR>();
    if (all_.GSexists(gsPolySAR))
        run_locked("copying polynomials", [&] { return all_.polynomials.clone(copy.get()); });
    return copy;
}

// --- Evaluation of polynomials ----------------------------------------------------------------------------------

namespace {

using Evaluation = int (polySAR::*)(double, double, double*) const;
struct Quantity {
    std::string_view name;
    Evaluation selected, interpolated;
};
constexpr Quantity kQuantities[] = {
    {"DC", &polySAR::EvaluateDC, &polySAR::EvaluateDCinterp},
    {"FR", &polySAR::EvaluateFR, &polySAR::EvaluateFRinterp},
    {"SL2GR", &polySAR::EvaluateSL2GR, &polySAR::EvaluateSL2GRinterp},
    {"GR2SL", &polySAR::EvaluateGR2SL, &polySAR::EvaluateGR2SLinterp},
    {"SL2THETA", &polySAR::EvaluateSL2THETA, &polySAR::EvaluateSL2THETAinterp},
    {"SL2PHI", &polySAR::EvaluateSL2PHI, &polySAR::EvaluateSL2PHIinterp},
};

Doubles evaluate(const Header& header, const std::string& quantity, bool interpolate, const Doubles& range_s,
                 const Doubles& azimuth_s) {
    const auto* const found = std::find_if(std::begin(kQuantities), std::end(kQuantities),
                                           [&](const Quantity& each) { return each.name == quantity; });
    if (found == std::end(kQuantities)) throw py::value_error("there is no quantity " + quantity);
    if (range_s.size() != azimuth_s.size()) throw py::value_error("arrays of different sizes");
    Doubles values{shape_of(range_s)};
    const double *const range = range_s.data(), *const azimuth = azimuth_s.data();
    double* const to = values.mutable_data();
    const auto set = header.polynomials();
    const Evaluation value = interpolate ? found->interpolated : found->selected;
    run("evaluating a polynomial", [&, count = values.size()] {
        for (py::ssize_t i = 0; i < count; ++i)
            if (const int status = ((*set).*value)(range[i], azimuth[i], to + i)) return status;
        return int{QUO_OK};
    });
    return values;
}

}  // namespace

void bind_header(py::module_& module) {
    py::class_<Header, std::shared_ptr<Header>>(module, "Header")
        .def(py::init<>())
        .def_static("read", &Header::read)
        .def("write", &Header::write)
        .def("clone", &Header::clone)
        .def("sections", &Header::sections)
        .def_static("known_sections", &Header::known_sections)
        .def("record", &Header::record)
        .def("enable", &Header::enable)
        .def("orbit", &Header::orbit)
        .def("set_orbit", &Header::set_orbit)
        .def("grid", &Header::grid)
        .def_property("grid_broken", &Header::grid_broken, &Header::set_grid_broken)
        .def("evaluate", &evaluate, py::arg(), py::arg(), py::arg().noconvert(), py::arg().noconvert());
}

}  // namespace quo_python
