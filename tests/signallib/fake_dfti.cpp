// Stands in for libmkl_rt where the MKL engine is tested: the same calls, carried out by direct transforms in
// double precision. What is set is kept as MKL keeps it, and an odd sequence of calls is refused as MKL refuses
// it.
#include <cmath>
#include <complex>
#include <cstdarg>
#include <cstdlib>
#include <map>
#include <numbers>
#include <string_view>
#include <vector>

#define FAKE_API extern "C" __attribute__((visibility("default")))

namespace {

using Long = long;
enum { kOk = 0, kBadDescriptor = 3, kUnimplemented = 6 };
enum { kTransforms = 7, kStorage = 10, kPlacement = 11, kInStrides = 12, kOutStrides = 13 };
enum { kInDistance = 14, kOutDistance = 15, kFormat = 21, kThreads = 27 };
enum { kComplex = 32, kReal = 33, kSingle = 35, kComplexReal = 40, kInPlace = 43, kNotInPlace = 44, kPack = 55 };

struct Descriptor {
    bool real = false, committed = false;
    Long length = 0;
    std::map<int, Long> values{{kTransforms, 1}, {kPlacement, kInPlace}, {kInStrides, 1}, {kOutStrides, 1}};
};

int threading_layer = -1;
Long live = 0;

bool told_to_fail(std::string_view call) {
    const char* name = std::getenv("FAKE_DFTI_FAILS");
    return name && call == name;
}

using Vector = std::vector<std::complex<double>>;

Vector direct(const Vector& x, double sign) {
    const std::size_t n = x.size();
    Vector y(n);
    for (std::size_t k = 0; k < n; ++k)
        for (std::size_t j = 0; j < n; ++j)
            y[k] += x[j] * std::polar(1.0, sign * 2.0 * std::numbers::pi * static_cast<double>(j * k % n) /
                                               static_cast<double>(n));
    return y;
}

/** Samples, or a packed real spectrum, as complex numbers. */
Vector load(const Descriptor& d, const float* at, Long stride, bool forward) {
    const auto n = static_cast<std::size_t>(d.length);
    Vector x(n);
    const auto value = [&](std::size_t k) { return static_cast<double>(at[static_cast<Long>(k) * stride]); };
    for (std::size_t k = 0; k < n; ++k) {
        if (!d.real) {
            const float* sample = at + 2 * static_cast<Long>(k) * stride;
            x[k] = {sample[0], sample[1]};
        } else if (forward) {
            x[k] = value(k);
        } else if (const std::size_t bin = k <= n / 2 ? k : n - k; bin == 0) {
            x[k] = value(0);
        } else {
            x[k] = {value(2 * bin - 1), 2 * bin < n ? value(2 * bin) : 0.0};
            if (k > n / 2) x[k] = std::conj(x[k]);
        }
    }
    return x;
}

void store(const Descriptor& d, const Vector& y, float* at, Long stride, bool forward) {
    const auto n = static_cast<std::size_t>(d.length);
    for (std::size_t k = 0; k < n; ++k) {
        float* const to = at + (d.real ? 1 : 2) * static_cast<Long>(k) * stride;
        if (!d.real) {
            to[0] = static_cast<float>(y[k].real());
            to[1] = static_cast<float>(y[k].imag());
        } else if (!forward || k == 0) {
            *to = static_cast<float>(y[k].real());
        } else {
            const auto& bin = y[(k + 1) / 2];
            *to = static_cast<float>(k % 2 == 1 ? bin.real() : bin.imag());
        }
    }
}

Long compute(void* handle, void* in, void* out, bool forward) {
    auto& d = *static_cast<Descriptor*>(handle);
    if (!d.committed) return kBadDescriptor;
    auto& v = d.values;
    if (v[kPlacement] == kInPlace) out = in;
    const Long floats = d.real ? 1 : 2;
    for (Long t = 0; t < v[kTransforms]; ++t) {
        const float* from = static_cast<const float*>(in) + t * v[kInDistance] * floats;
        float* to = static_cast<float*>(out) + t * v[kOutDistance] * floats;
        store(d, direct(load(d, from, v[kInStrides], forward), forward ? -1.0 : 1.0), to, v[kOutStrides], forward);
    }
    return kOk;
}

}  // namespace

FAKE_API int MKL_Set_Threading_Layer(int layer) { return threading_layer = layer; }
FAKE_API int fake_threading_layer() { return threading_layer; }
FAKE_API long fake_live_descriptors() { return live; }

FAKE_API Long DftiCreateDescriptor(void** handle, int precision, int domain, Long dimensions, ...) {
    std::va_list more;
    va_start(more, dimensions);
    const Long length = va_arg(more, Long);
    va_end(more);
    if (precision != kSingle || (domain != kComplex && domain != kReal) || dimensions != 1 || length < 1 ||
        told_to_fail("create"))
        return kUnimplemented;
    auto* d = new Descriptor;
    d->real = domain == kReal;
    d->length = length;
    *handle = d;
    ++live;
    return kOk;
}

FAKE_API Long DftiSetValue(void* handle, int parameter, ...) {
    auto& d = *static_cast<Descriptor*>(handle);
    std::va_list more;
    va_start(more, parameter);
    switch (parameter) {
        case kTransforms:
        case kInDistance:
        case kOutDistance:
        case kThreads:
            d.values[parameter] = va_arg(more, Long);
            break;
        case kInStrides:
        case kOutStrides:
            d.values[parameter] = va_arg(more, Long*)[1];
            break;
        default:
            d.values[parameter] = va_arg(more, int);
    }
    va_end(more);
    return told_to_fail("set") && parameter == kOutStrides ? kUnimplemented : kOk;
}

FAKE_API Long DftiCommitDescriptor(void* handle) {
    auto& d = *static_cast<Descriptor*>(handle);
    auto& v = d.values;
    if (told_to_fail("commit") || v[kThreads] != 1) return kUnimplemented;
    if (d.real && (v[kStorage] != kComplexReal || v[kFormat] != kPack)) return kUnimplemented;
    if (v[kTransforms] > 1 && (v[kInDistance] < 1 || v[kOutDistance] < 1)) return kUnimplemented;
    d.committed = true;
    return kOk;
}

FAKE_API Long DftiComputeForward(void* handle, void* in, ...) {
    std::va_list more;
    va_start(more, in);
    const bool apart = static_cast<Descriptor*>(handle)->values[kPlacement] == kNotInPlace;
    void* out = apart ? va_arg(more, void*) : nullptr;
    va_end(more);
    return told_to_fail("compute") ? Long{kBadDescriptor} : compute(handle, in, out, true);
}

FAKE_API Long DftiComputeBackward(void* handle, void* in, ...) {
    std::va_list more;
    va_start(more, in);
    const bool apart = static_cast<Descriptor*>(handle)->values[kPlacement] == kNotInPlace;
    void* out = apart ? va_arg(more, void*) : nullptr;
    va_end(more);
    return told_to_fail("compute") ? Long{kBadDescriptor} : compute(handle, in, out, false);
}

FAKE_API Long DftiFreeDescriptor(void** handle) {
    delete static_cast<Descriptor*>(*handle);
    *handle = nullptr;
    --live;
    return kOk;
}
