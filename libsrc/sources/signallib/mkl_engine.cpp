// Transforms by DFTI, looked up in libmkl_rt at run time.
#include <dlfcn.h>

#include <array>
#include <map>
#include <new>
#include <type_traits>

#include "signallib/fft_engine.h"

namespace quo {
namespace {

// DFTI's integer is a long with 64-bit addresses, whichever integer layer the library works in.
using MklLong = long;
using Descriptor = void*;

// Parameters and values of DFTI, by their numbers in its C interface.
enum Parameter : int {
    kNumberOfTransforms = 7,
    kConjugateEvenStorage = 10,
    kPlacement = 11,
    kInputStrides = 12,
    kOutputStrides = 13,
    kInputDistance = 14,
    kOutputDistance = 15,
    kPackedFormat = 21,
    kThreadLimit = 27
};
enum Value : int {
    kComplex = 32,
    kReal = 33,
    kSingle = 35,
    kComplexReal = 40,
    kInPlace = 43,
    kNotInPlace = 44,
    kPackFormat = 55
};
constexpr int kSequential = 1;

/** The functions in use. The dots belong to the types: callers of a variadic function announce how many vector
 * registers hold arguments, and the library relies on it. */
struct Dfti {
    MklLong (*create)(Descriptor*, int precision, int domain, MklLong dimensions, ...);
    MklLong (*set)(Descriptor, int parameter, ...);
    MklLong (*commit)(Descriptor);
    MklLong (*forward)(Descriptor, void*, ...);
    MklLong (*backward)(Descriptor, void*, ...);
    MklLong (*free)(Descriptor*);
};

class MklBatch final : public FftBatch {
public:
    MklBatch(const Dfti& dfti, const FftGeometry& geometry) : dfti_{dfti}, geometry_{geometry} {}
    ~MklBatch() override {
        if (descriptor_) dfti_.free(&descriptor_);
    }

    [[nodiscard]] bool commit() {
        const bool real = geometry_.domain == FftDomain::Real;
        if (dfti_.create(&descriptor_, kSingle, real ? kReal : kComplex, 1L, MklLong{geometry_.length}) != 0) {
            descriptor_ = nullptr;
            return false;
        }
        // Older versions do not know the limit; the layer is sequential anyhow unless the host chose another
        // first.
        dfti_.set(descriptor_, kThreadLimit, MklLong{1});
        return (!real || set_packed()) && set_layout() && dfti_.commit(descriptor_) == 0;
    }

    bool run(const float* in, float* out) noexcept override {
        auto* const compute = geometry_.forward ? dfti_.forward : dfti_.backward;
        void* const from = const_cast<float*>(in);  // written where it is `out`, read only otherwise
        return (geometry_.in_place ? compute(descriptor_, from)
                                   : compute(descriptor_, from, static_cast<void*>(out))) == 0;
    }

private:
    [[nodiscard]] bool set_packed() const {
        return dfti_.set(descriptor_, kConjugateEvenStorage, kComplexReal) == 0 &&
               dfti_.set(descriptor_, kPackedFormat, kPackFormat) == 0;
    }
    [[nodiscard]] bool set_layout() const {
        std::array<MklLong, 2> strides{0, static_cast<MklLong>(geometry_.stride)};
        const auto distance = static_cast<MklLong>(geometry_.distance);
        return dfti_.set(descriptor_, kPlacement, geometry_.in_place ? kInPlace : kNotInPlace) == 0 &&
               dfti_.set(descriptor_, kNumberOfTransforms, MklLong{geometry_.count}) == 0 &&
               dfti_.set(descriptor_, kInputStrides, strides.data()) == 0 &&
               dfti_.set(descriptor_, kOutputStrides, strides.data()) == 0 &&
               dfti_.set(descriptor_, kInputDistance, distance) == 0 &&
               dfti_.set(descriptor_, kOutputDistance, distance) == 0;
    }

    const Dfti& dfti_;
    FftGeometry geometry_;
    Descriptor descriptor_ = nullptr;
};

class MklEngine final : public FftEngine {
public:
    [[nodiscard]] bool bind(void* library) {
        const auto find = [library](const char* name, auto& function) {
            function = reinterpret_cast<std::remove_reference_t<decltype(function)>>(dlsym(library, name));
            return function != nullptr;
        };
        int (*set_threading_layer)(int) = nullptr;
        // Before DFTI is first called: the library must start no threads.
        if (find("MKL_Set_Threading_Layer", set_threading_layer)) set_threading_layer(kSequential);
        return find("DftiCreateDescriptor", dfti_.create) && find("DftiSetValue", dfti_.set) &&
               find("DftiCommitDescriptor", dfti_.commit) && find("DftiComputeForward", dfti_.forward) &&
               find("DftiComputeBackward", dfti_.backward) && find("DftiFreeDescriptor", dfti_.free);
    }

    [[nodiscard]] const char* name() const noexcept override { return "mkl"; }
    // Shorter columns it blocks better by itself.
    [[nodiscard]] int tiled_from() const noexcept override { return 4096; }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry) noexcept override {
        std::unique_ptr<MklBatch> batch{new (std::nothrow) MklBatch{dfti_, geometry}};
        if (!batch || !batch->commit()) return nullptr;
        return batch;
    }

private:
    Dfti dfti_{};
};

FftEngine* open_mkl(const char* file) {
    // One for each library, never unloaded: plans may outlive every other object.
    static auto& engines = *new std::map<void*, MklEngine>;
    void* library = dlopen(file, RTLD_NOW | RTLD_LOCAL);
    if (!library) return nullptr;
    const auto [entry, fresh] = engines.try_emplace(library);
    if (fresh && entry->second.bind(library)) return &entry->second;
    dlclose(library);
    if (!fresh) return &entry->second;
    engines.erase(entry);
    return nullptr;
}

}  // namespace

FftEngine* load_mkl_engine(const char* file) noexcept try {
    if (file) return open_mkl(file);
    for (const char* name : {"libmkl_rt.so", "libmkl_rt.so.1", "libmkl_rt.so.2"})
        if (FftEngine* engine = open_mkl(name)) return engine;
    return nullptr;
} catch (...) {
    return nullptr;  // out of memory
}

}  // namespace quo
