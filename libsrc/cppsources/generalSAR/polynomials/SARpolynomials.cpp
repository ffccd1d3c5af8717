// SPDX-License-Identifier: Apache-2.0
#include "quo_base/SARpolynomials.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <charconv>
#include <cstddef>
#include <iterator>
#include <new>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <system_error>

#include "diagnosticslib/call_frame.h"
#include "profilelib/profile_look.h"
#include "quo_base/profile.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/file_io.h"

/** How long the lists of a set really are: a length is public and may have been raised. */
struct quo::PolynomialLists {
    static void note(polySAR& set, std::size_t index, const void* list, std::int32_t length) {
        polySAR::Made& made = set.made_[index];
        made.list = list;
        made.length = length;
        made.ordered = 0;
    }
    static std::int32_t held(const polySAR& set, std::size_t index, const void* list, std::int32_t length) {
        const polySAR::Made& made = set.made_[index];
        if (!list) return 0;
        return list == made.list ? std::min(length, made.length) : length;
    }
    /** Where it is kept how many first ones of a list are in order; null for a list put in place by hand. */
    static std::atomic<std::int32_t>* ordered(const polySAR& set, std::size_t index, const void* list) {
        const polySAR::Made& made = set.made_[index];
        return list == made.list ? &made.ordered : nullptr;
    }
};

namespace {

constexpr const char* kSource = "generalSAR";
constexpr const char* kSetSection = "PolySAR";
// No form of a polynomial in a file is shorter than this: a count that asks for more is not believed.
constexpr std::int64_t kShortestPolynomial = 40;

/** One polynomial, plain or extended. */
template <typename Obj>
constexpr quo::FieldTable kOne{kSetSection, QUO_FIELD(pol),
                               QUO_FIELD(trg0, quo::element("trg0_s"), quo::unit("s")),
                               QUO_FIELD(taz0, quo::element("taz0_s"), quo::unit("s"))};

namespace counts {
using Obj = polySAR;
constexpr quo::FieldTable kTable{kSetSection,       QUO_FIELD(ndc),       QUO_FIELD(nfr),    QUO_FIELD(nsl2gr),
                                 QUO_FIELD(ngr2sl), QUO_FIELD(nsl2theta), QUO_FIELD(nsl2phi)};
}  // namespace counts

std::string section_of(const char* name) { return std::string{kSetSection} + '/' + (name ? name : ""); }

// A polynomial in range alone: x^2, x^3 and x^4 follow the linear term, the azimuth terms are 0.
void set_pure_range(double (&pol)[7], const double (&a)[5]) {
    const double c[7] = {a[0], a[1], 0.0, 0.0, a[2], a[3], a[4]};
    std::ranges::copy(c, pol);
}

bool read_doubles(const char* section, const char* key, double* values, int count, const char* file) {
    return GetProfileDoubleArray(section, key, values, count, file) == QUO_OK;
}

/** What tells the six lists apart. */
struct Quantity {
    const char *file_name, *none;
    bool extrapolates;
    const char* keys[3];  // of the fields of one polynomial in a parameter file
};
constexpr Quantity kQuantities[] = {
    {"DopplerCentroid", "NO DC poly available", true, {"DCpoly", "DCpoly_rgt0", "DCpoly_azt0"}},
    // The files have a capital P in the range key alone.
    {"DopplerRate", "NO FR poly available", true, {"FRpoly", "FRPoly_rgt0", "FRpoly_azt0"}},
    {"SlantToGround", "NO SL2GR poly available", false, {"SL2GRpoly", "SL2GRpoly_rgt0", "SL2GRpoly_azt0"}},
    {"GroundToSlant", "NO GR2SL poly available", false, {"GR2SLpoly", "GR2SLpoly_rgt0", "GR2SLpoly_azt0"}},
    {"SlantToTheta",
     "NO SL2THETA poly available",
     false,
     {"SL2THETApoly", "SL2THETApoly_rgt0", "SL2THETApoly_azt0"}},
    {"SlantToPhi", "NO SL2PHI poly available", false, {"SL2PHIpoly", "SL2PHIpoly_rgt0", "SL2PHIpoly_azt0"}},
};

int read_poly(poly& object, const char* file, const char* name, const Quantity& quantity) {
    if (object.poly::readpar(file, name) == QUO_OK) return QUO_OK;
    return kOne<poly>.of(object).read_profile(file, name, quantity.keys);
}

double value_around(const double* c, double x, double y) {
    return c[0] + c[1] * x + c[2] * y + c[3] * x * y + x * x * (c[4] + x * (c[5] + x * c[6]));
}

/** One list, ordered by reference azimuth time. */
template <typename P>
class List {
public:
    List(const polySAR& set, std::size_t index, const std::unique_ptr<P[]>& list, std::int32_t count)
        : quantity_{kQuantities[index]},
          ordered_{quo::PolynomialLists::ordered(set, index, list.get())},
          p_{list.get(),
             static_cast<std::size_t>(std::max(quo::PolynomialLists::held(set, index, list.get(), count), 0))} {}

    [[nodiscard]] const Quantity& quantity() const { return quantity_; }
    [[nodiscard]] bool empty() const { return p_.empty(); }

    /** The first at or after the azimuth time, else the last. */
    [[nodiscard]] const P& selected(double azimuth) const {
        return p_[std::min(first_at_or_after(azimuth), p_.size() - 1)];
    }
    /** Index of the earlier of the two around the azimuth time. */
    [[nodiscard]] std::size_t earlier(double azimuth) const {
        const std::size_t next = first_at_or_after(azimuth);
        if (next == 0) return 0;
        return azimuth >= p_.back().taz0 ? p_.size() - 1 : std::min(next, p_.size()) - 1;
    }
    [[nodiscard]] double interpolated(double range, double azimuth) const {
        double c[7];
        coefficients(azimuth, c);
        const P& origin = p_[earlier(azimuth)];
        return value_around(c, range - origin.trg0, azimuth - origin.taz0);
    }
    void coefficients(double azimuth, double* c) const {
        if (p_.size() == 1) return copy(p_[0], c);
        if (azimuth < p_.front().taz0) {
            return quantity_.extrapolates ? blend(0, weight(0, 1, azimuth), c) : copy(p_.front(), c);
        }
        if (azimuth > p_.back().taz0) return beyond(azimuth, c);
        const std::size_t k = std::min(earlier(azimuth), p_.size() - 2);
        blend(k, weight(k, k + 1, azimuth), c);
    }

private:
    // A time that compares with nothing is after everything.
    [[nodiscard]] std::size_t first_at_or_after(double azimuth) const {
        constexpr std::size_t kLong = 32;
        std::size_t i = p_.size() < kLong ? 0 : ordered();
        if (i > 0 && azimuth <= p_[i - 1].taz0) return first_in_order(azimuth, i - 1);
        while (i < p_.size() && !(azimuth <= p_[i].taz0)) ++i;
        return i;
    }
    /** How many first ones do not decrease in time, where that can be kept. */
    [[nodiscard]] std::size_t ordered() const {
        if (!ordered_) return 0;
        auto known = static_cast<std::size_t>(ordered_->load(std::memory_order_relaxed));
        if (known == 0) {
            for (known = 1; known < p_.size() && p_[known - 1].taz0 <= p_[known].taz0;) ++known;
            ordered_->store(static_cast<std::int32_t>(known), std::memory_order_relaxed);
        }
        return std::min(known, p_.size());
    }
    /** The same among those in order, `after` being one at or after the time. Times are mostly evenly spaced. */
    [[nodiscard]] std::size_t first_in_order(double azimuth, std::size_t after) const {
        constexpr int kGuesses = 4;
        if (azimuth <= p_[0].taz0) return 0;
        std::size_t before = 0;
        for (int probe = 0; after - before > 1; ++probe) {
            const double width = static_cast<double>(after - before);
            const double part = weight(before, after, azimuth);
            const double place = probe < kGuesses && part >= 0.0 && part <= 1.0 ? part * width : 0.5 * width;
            const std::size_t i = before + static_cast<std::size_t>(std::clamp(place, 1.0, width - 1.0));
            (azimuth <= p_[i].taz0 ? after : before) = i;
        }
        return after;
    }
    /** What part of the time from one to another has gone by. */
    [[nodiscard]] double weight(std::size_t from, std::size_t to, double azimuth) const {
        return (azimuth - p_[from].taz0) / (p_[to].taz0 - p_[from].taz0);
    }
    static void copy(const P& from, double* c) { std::ranges::copy(from.pol, c); }
    void blend(std::size_t k, double w, double* c) const {
        for (std::size_t i = 0; i < 7; ++i) c[i] = (1.0 - w) * p_[k].pol[i] + w * p_[k + 1].pol[i];
    }
    void beyond(double azimuth, double* c) const {
        if (!quantity_.extrapolates) return copy(p_.back(), c);
        const P &last = p_.back(), &before = p_[p_.size() - 2];
        const double w = (azimuth - last.taz0) / (last.taz0 - before.taz0);
        for (std::size_t i = 0; i < 7; ++i) c[i] = (1.0 + w) * last.pol[i] - w * before.pol[i];
    }

    const Quantity& quantity_;
    std::atomic<std::int32_t>* ordered_;
    std::span<const P> p_;
};

/** Calls `see(index, list, count)` with the members of a set that hold the six lists and their lengths, in their
 * order, until it returns a status other than 0. */
template <typename See>
int each_list(See see) {
    using Set = polySAR;
    int status = QUO_OK;
    static_cast<void>(
        (status = see(0U, &Set::DC, &Set::ndc)) || (status = see(1U, &Set::FR, &Set::nfr)) ||
        (status = see(2U, &Set::SL2GR, &Set::nsl2gr)) || (status = see(3U, &Set::GR2SL, &Set::ngr2sl)) ||
        (status = see(4U, &Set::SL2THETA, &Set::nsl2theta)) || (status = see(5U, &Set::SL2PHI, &Set::nsl2phi)));
    return status;
}

using Counts = std::array<std::int32_t, std::size(kQuantities)>;

/** How many polynomials the lists really hold. */
Counts counts_of(const polySAR& set) {
    Counts counts;
    each_list([&](std::size_t index, auto list, auto count) {
        counts[index] = quo::PolynomialLists::held(set, index, (set.*list).get(), set.*count);
        return QUO_OK;
    });
    return counts;
}

/** Makes lists of so many polynomials; false, with some of them made, when memory is short. */
bool make_lists(polySAR& set, const Counts& wanted) {
    return each_list([&](std::size_t index, auto list, auto count) {
               const std::int32_t n = std::max(wanted[index], 0);
               const bool made = quo::renew_array(set.*list, static_cast<std::size_t>(n));
               set.*count = made ? n : 0;
               quo::PolynomialLists::note(set, index, (set.*list).get(), set.*count);
               return made ? QUO_OK : QUO_NO_MEMORY;
           }) == QUO_OK;
}

/** The name in a header of the i-th polynomial of a list. */
std::string name_in_header(std::size_t list, std::int32_t i) {
    return std::string{kQuantities[list].file_name} + '-' + std::to_string(i);
}

/** Calls `use(polynomial, name)` for every polynomial with its name in a header, until it returns a status other
 * than 0. */
template <typename Use>
int each_polynomial(polySAR& set, Use use) {
    return each_list([&](std::size_t index, auto list, auto count) {
        for (std::int32_t i = 0; i < set.*count; ++i) {
            const std::string name = name_in_header(index, i);
            if (const int status = use((set.*list)[static_cast<std::size_t>(i)], name.c_str())) return status;
        }
        return 0;
    });
}

/** One call of a quantity: `use(list)` gives its status. */
template <typename P, typename Use>
int with_list(const quo::SharedCall& function, const List<P>& list, Use use) {
    quo::CallFrame frame{function, kSource};
    if (list.empty()) return frame.fail(QUO_NUMERIC, list.quantity().none);
    const int status = use(list);
    return status ? frame.callee(status) : frame.success();
}

bool file_can_hold(const polySAR& set, const char* file) {
    const auto bytes = quo::file_length(file);
    quo::Checked<std::int64_t> total = 0;
    const int negative = each_list([&](std::size_t, auto, auto count) {
        total += quo::Checked<std::int64_t>{set.*count} * kShortestPolynomial;
        return set.*count < 0 ? 1 : 0;
    });
    return !negative && bytes && total.value() && *total.value() <= *bytes;
}

}  // namespace

QUO_RECORD(poly, kOne<poly>)
int poly::clone(poly* to) const { return kOne<poly>.copy(*this, *to); }
int poly::EvaluatePoly(double rangeTime, double azimuthTime, double* value) const {
    *value = value_around(pol, rangeTime - trg0, azimuthTime - taz0);
    return QUO_OK;
}
int poly::writepar(const char* file, const char* name) {
    return writeAuxiliaryFile(file, 1, section_of(name).c_str());
}
int poly::readpar(const char* file, const char* name) {
    return readAuxiliaryFile(file, 1, section_of(name).c_str()) ? QUO_OK : QUO_REFUSED;
}

int polyDC::readparold(const char* file, const char* section) {
    const quo::ProfileLook look{file};
    std::int32_t n = 0;
    double range = trg0, azimuth = taz0, a5[5], a7[7];
    bool found = GetMyProfileIntArray(section, "DopCenPol_nCoeff", &n, 1, file) == QUO_OK;
    found = read_doubles(section, "DopCenRgRefTimes", &range, 1, file) && found;
    found = read_doubles(section, "DopCenAzRefSec85Times", &azimuth, 1, file) && found;
    trg0 = range;
    taz0 = azimuth;
    if (n == 5) {
        if (!read_doubles(section, "DopCenRangeCoeffs", a5, 5, file)) return QUO_REFUSED;
        set_pure_range(pol, a5);
    } else if (n == 7) {
        if (!read_doubles(section, "DopCenRangeCoeffs", a7, 7, file)) return QUO_REFUSED;
        std::ranges::copy(a7, pol);
    }
    return found ? QUO_OK : QUO_REFUSED;
}

int polyFR::readparold(const char* file, const char* section, int n) {
    const quo::ProfileLook look{file};
    double a3[3], a5[5], a7[7];
    if (n == 5 && read_doubles(section, "AzimuthCoeff", a5, 5, file)) {
        set_pure_range(pol, a5);
        return QUO_OK;
    }
    if (n == 3 && read_doubles(section, "AzimuthCoeff", a3, 3, file)) {
        pol[0] = a3[0];
        pol[1] = a3[1];
        pol[3] = a3[2];  // the third one is that of x y
        return QUO_OK;
    }
    if (n == 7 && read_doubles(section, "DopRatRangeCoeff", a7, 7, file)) {
        std::ranges::copy(a7, pol);
        return QUO_OK;
    }
    return QUO_REFUSED;
}

QUO_RECORD(extended_poly, kOne<extended_poly>)
int extended_poly::clone(extended_poly* to) const { return kOne<extended_poly>.copy(*this, *to); }
int extended_poly::EvaluatePoly(double rangeTime, double azimuthTime, double* value) const {
    const double x = rangeTime - trg0, y = azimuthTime - taz0;
    const double* e = pol;
    *value = e[0] + e[1] * x + (e[2] + (e[3] + e[5]) * x + e[7] * x * x) * y + (e[4] + e[6] * x) * y * y +
             x * x * x * (e[8] + x * (e[9] + x * e[10])) + y * y * y * (e[11] + y * (e[12] + y * e[13]));
    return QUO_OK;
}

QUO_RECORD(polySAR, counts::kTable)

const poly* polySAR::polynomial(std::string_view name) const noexcept {
    const std::size_t dash = std::min(name.rfind('-'), name.size());
    const std::string_view quantity = name.substr(0, dash), number = name.substr(std::min(dash + 1, name.size()));
    std::int32_t wanted = -1;
    const auto [end, error] = std::from_chars(number.data(), number.data() + number.size(), wanted);
    const bool padded = number.size() > 1 && number.front() == '0';
    if (error != std::errc{} || end != number.data() + number.size() || wanted < 0 || padded) return nullptr;
    const poly* found = nullptr;
    each_list([&](std::size_t index, auto list, auto count) {
        if (quantity == kQuantities[index].file_name &&
            wanted < quo::PolynomialLists::held(*this, index, (this->*list).get(), this->*count))
            found = &(this->*list)[static_cast<std::size_t>(wanted)];
        return QUO_OK;
    });
    return found;
}

std::vector<std::string> polySAR::names() const {
    std::vector<std::string> names;
    const Counts counts = counts_of(*this);
    for (std::size_t list = 0; list < counts.size(); ++list)
        for (std::int32_t i = 0; i < counts[list]; ++i) names.push_back(name_in_header(list, i));
    return names;
}

int polySAR::CreatePolys(int dc, int fr, int sl2gr, int gr2sl, int sl2theta, int sl2phi) {
    quo::CallFrame frame{"polySAR::CreatePolys", kSource};
    if (make_lists(*this, {dc, fr, sl2gr, gr2sl, sl2theta, sl2phi})) return frame.success();
    DestroyPolys();
    return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
}
int polySAR::CreatePolys(int dc, int fr) { return CreatePolys(dc, fr, 0, 0, 0, 0); }

int polySAR::DestroyPolys() {
    return each_list([this](std::size_t index, auto list, auto count) {
        (this->*list).reset();
        this->*count = 0;
        quo::PolynomialLists::note(*this, index, nullptr, 0);  // the next list may stand at the same place
        return QUO_OK;
    });
}

// The operations of one quantity: the list, and the names that its frames carry.
#define QUO_POLY_OPERATIONS(KIND, index, count)                                                                \
    int poly##KIND::readpar(const char* file, const char* name) {                                              \
        return read_poly(*this, file, name, kQuantities[index]);                                               \
    }                                                                                                          \
    int polySAR::Evaluate##KIND(double r, double a, double* value) const {                                     \
        return with_list("polySAR::Evaluate" #KIND, List{*this, index, KIND, count},                           \
                         [=](const auto& list) { return list.selected(a).EvaluatePoly(r, a, value); });        \
    }                                                                                                          \
    double polySAR::Evaluate##KIND(double r, double a) const {                                                 \
        double value = 0.0;                                                                                    \
        Evaluate##KIND(r, a, &value);                                                                          \
        return value;                                                                                          \
    }                                                                                                          \
    int polySAR::Evaluate##KIND##interp(double r, double a, double* value) const {                             \
        return with_list("polySAR::Evaluate" #KIND "interp", List{*this, index, KIND, count},                  \
                         [=](const auto& list) {                                                               \
                             *value = list.interpolated(r, a);                                                 \
                             return QUO_OK;                                                                    \
                         });                                                                                   \
    }                                                                                                          \
    double polySAR::Evaluate##KIND##interp(double r, double a) const {                                         \
        double value = 0.0;                                                                                    \
        Evaluate##KIND##interp(r, a, &value);                                                                  \
        return value;                                                                                          \
    }                                                                                                          \
    int polySAR::get##KIND##poly(double a, double* c) const {                                                  \
        return with_list("polySAR::get" #KIND "poly", List{*this, index, KIND, count}, [=](const auto& list) { \
            list.coefficients(a, c);                                                                           \
            return QUO_OK;                                                                                     \
        });                                                                                                    \
    }                                                                                                          \
    int polySAR::get##KIND##num(double a, int* number) const {                                                 \
        return with_list("polySAR::get" #KIND "num", List{*this, index, KIND, count}, [=](const auto& list) {  \
            *number = static_cast<int>(list.earlier(a));                                                       \
            return QUO_OK;                                                                                     \
        });                                                                                                    \
    }
QUO_POLY_OPERATIONS(DC, 0, ndc)
QUO_POLY_OPERATIONS(FR, 1, nfr)
QUO_POLY_OPERATIONS(SL2GR, 2, nsl2gr)
QUO_POLY_OPERATIONS(GR2SL, 3, ngr2sl)
QUO_POLY_OPERATIONS(SL2THETA, 4, nsl2theta)
QUO_POLY_OPERATIONS(SL2PHI, 5, nsl2phi)
#undef QUO_POLY_OPERATIONS

int polySAR::writehdr(const char* file) {
    quo::CallFrame frame{"polySAR::writehdr", kSource};
    return quo::guarded(frame, [&] {
        quo::JoinedSession session{file};
        const Counts counts = counts_of(*this);
        each_list([&](std::size_t index, auto, auto count) {
            this->*count = counts[index];
            return QUO_OK;
        });
        if (const int status = writeAuxiliaryFile(file, 1, kSetSection)) return frame.callee(status);
        const int status =
            each_polynomial(*this, [file](auto& each, const char* name) { return each.writepar(file, name); });
        if (status != QUO_OK) return frame.callee(status);
        return quo::pass_on(frame, session.commit());
    });
}

int polySAR::readhdr(const char* file) {
    quo::CallFrame frame{"polySAR::readhdr", kSource};
    return quo::guarded(frame, [&] {
        const quo::JoinedSession session{file};
        const quo::ProfileLook look{file};
        DestroyPolys();
        if (counts::kTable.read(*this, file) != QUO_OK) {
            DestroyPolys();
            return frame.silent(QUO_REFUSED);
        }
        if (!file_can_hold(*this, file)) {
            DestroyPolys();
            return frame.fail(QUO_REFUSED, "More polynomials than the file can hold");
        }
        if (const int status = CreatePolys(ndc, nfr, nsl2gr, ngr2sl, nsl2theta, nsl2phi))
            return frame.callee(status);
        const int status =
            each_polynomial(*this, [file](auto& each, const char* name) { return each.readpar(file, name); });
        return quo::pass_on(frame, status);
    });
}

int polySAR::clone(polySAR* to) const {
    quo::CallFrame frame{"polySAR::clone", kSource};
    if (to == this) return frame.success();
    const Counts counts = counts_of(*this);
    if (const int status = to->CreatePolys(counts[0], counts[1], counts[2], counts[3], counts[4], counts[5]))
        return frame.callee(status);
    each_list([&](std::size_t, auto list, auto count) {
        for (std::size_t i = 0; i < static_cast<std::size_t>(to->*count); ++i)
            (this->*list)[i].clone(&(to->*list)[i]);
        return QUO_OK;
    });
    return frame.success();
}
