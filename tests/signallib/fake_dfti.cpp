// SPDX-License-Identifier: Apache-2.0

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
enum { kComplex = 32, kReal = 33, kComplexReal = 40, kInPlace = 43, kNotInPlace = 44, kPack = 55 };

struct Descriptor {
    bool real = false, committed = false;
    Long length = 0;
    std::map<int, Long> values{{kTransforms, 1}, {kPlacement, kInPlace}, {kInStrides, 1}, {kOutStrides, 1}};
};

int threading_layer = -1;
int live = 0;

bool told_to_fail(std::string_view call) {
    const char* name = std::getenv("FAKE_DFTI_FAILS");
    return name && call == name;
}

using Vector = std::vector<std::complex<double>>;

/** Of a packed real spectrum, number k is the real or imaginary part of bin (k + 1) / 2. */
double& packed(Vector& spectrum, std::size_t k) {
    return reinterpret_cast<double(&)[2]>(spectrum[(k + 1) / 2])[k % 2 == 1 || k == 0 ? 0 : 1];
}

/** One transform of `d`, by the defining sum. */
void transform(Descriptor& d, const float* in, float* out, double sign) {
    const auto n = static_cast<std::size_t>(d.length);
    const Long parts = d.real ? 1 : 2;
    const bool packs = d.real && sign < 0.0, unpacks = d.real && sign > 0.0;
    Vector x(n), y(n);
    for (std::size_t k = 0; k < n; ++k) {
        const float* const sample = in + static_cast<Long>(k) * d.values[kInStrides] * parts;
        if (unpacks) packed(x, k) = *sample;
        if (!unpacks) x[k] = {sample[0], d.real ? 0.0F : sample[1]};
    }
    for (std::size_t k = n / 2 + 1; k < n && unpacks; ++k) x[k] = std::conj(x[n - k]);
    for (std::size_t k = 0; k < n * n; ++k)
        y[k / n] +=
            x[k % n] * std::polar(1.0, sign * 2.0 * std::numbers::pi * static_cast<double>(k / n * (k % n) % n) /
                                           static_cast<double>(n));
    for (std::size_t k = 0; k < n; ++k) {
        float* const sample = out + static_cast<Long>(k) * d.values[kOutStrides] * parts;
        sample[0] = static_cast<float>(packs ? packed(y, k) : y[k].real());
        if (!d.real) sample[1] = static_cast<float>(y[k].imag());
    }
}

/** The output follows the input unless both are one. */
Long compute(void* handle, void* in, std::va_list more, double sign) {
    auto& d = *static_cast<Descriptor*>(handle);
    if (told_to_fail("compute") || !d.committed) return kBadDescriptor;
    void* const out = d.values[kPlacement] == kNotInPlace ? va_arg(more, void*) : in;
    for (Long t = 0, parts = d.real ? 1 : 2; t < d.values[kTransforms]; ++t)
        transform(d, static_cast<const float*>(in) + t * d.values[kInDistance] * parts,
                  static_cast<float*>(out) + t * d.values[kOutDistance] * parts, sign);
    return kOk;
}

}  // namespace

FAKE_API int MKL_Set_Threading_Layer(int layer) { return threading_layer = layer; }
FAKE_API int fake_threading_layer() { return threading_layer; }
FAKE_API int fake_live_descriptors() { return live; }

FAKE_API Long DftiCreateDescriptor_s_1d(void** handle, int domain, Long length) {
    if ((domain != kComplex && domain != kReal) || length < 1 || told_to_fail("create")) return kUnimplemented;
    *handle = new Descriptor{.real = domain == kReal, .length = length};
    ++live;
    return kOk;
}

FAKE_API Long DftiSetValue(void* handle, int parameter, ...) {
    std::va_list more;
    va_start(more, parameter);
    Long& value = static_cast<Descriptor*>(handle)->values[parameter];
    const bool strides = parameter == kInStrides || parameter == kOutStrides;
    const bool is_long =
        parameter == kTransforms || parameter == kInDistance || parameter == kOutDistance || parameter == kThreads;
    value = strides ? va_arg(more, Long*)[1] : is_long ? va_arg(more, Long) : va_arg(more, int);
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

#define FAKE_COMPUTE(name, sign)                             \
    FAKE_API Long name(void* handle, void* in, ...) {        \
        std::va_list more;                                   \
        va_start(more, in);                                  \
        const Long status = compute(handle, in, more, sign); \
        va_end(more);                                        \
        return status;                                       \
    }
FAKE_COMPUTE(DftiComputeForward, -1.0)
FAKE_COMPUTE(DftiComputeBackward, 1.0)

FAKE_API Long DftiFreeDescriptor(void** handle) {
    delete static_cast<Descriptor*>(*handle);
    *handle = nullptr;
    --live;
    return kOk;
}
