// SPDX-License-Identifier: Apache-2.0

// Transforms by DFTI, looked up in libmkl_rt at run time.
#include <dlfcn.h>

#include <array>
#include <map>
#include <mutex>
#include <new>
#include <type_traits>
#include <utility>

#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"

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
    kComplexReal = 40,
    kInPlace = 43,
    kNotInPlace = 44,
    kPackFormat = 55
};
constexpr int kSequential = 1;

/** The functions in use. The dots belong to the types: callers of a variadic function announce how many vector
 * registers hold arguments, and the library relies on it. */
struct Dfti {
    MklLong (*create)(Descriptor*, int domain, MklLong length);
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

    /** 0, or what DFTI answered. */
    [[nodiscard]] MklLong commit() {
        const bool real = geometry_.domain == FftDomain::Real;
        if (const MklLong status =
                dfti_.create(&descriptor_, real ? kReal : kComplex, MklLong{geometry_.length})) {
            descriptor_ = nullptr;
            return status;
        }
        // Older versions do not know the limit; the layer is sequential anyhow unless the host chose another
        // first.
        dfti_.set(descriptor_, kThreadLimit, MklLong{1});
        MklLong status = real ? set_packed() : 0;
        if (status == 0) status = set_layout();
        return status == 0 ? dfti_.commit(descriptor_) : status;
    }

    bool run(const float* in, float* out, FftFailure& why) noexcept override {
        auto* const compute = geometry_.forward ? dfti_.forward : dfti_.backward;
        void* const from = const_cast<float*>(in);  // written where it is `out`, read only otherwise
        why.code =
            geometry_.in_place ? compute(descriptor_, from) : compute(descriptor_, from, static_cast<void*>(out));
        return why.code == 0;
    }

private:
    /** The first answer that is not 0, or 0. */
    template <typename... Values>
    [[nodiscard]] MklLong set_all(std::pair<Parameter, Values>... settings) const {
        MklLong status = 0;
        (void)(((status = dfti_.set(descriptor_, settings.first, settings.second)) == 0) && ...);
        return status;
    }
    [[nodiscard]] MklLong set_packed() const {
        return set_all(std::pair{kConjugateEvenStorage, int{kComplexReal}},
                       std::pair{kPackedFormat, int{kPackFormat}});
    }
    [[nodiscard]] MklLong set_layout() const {
        std::array<MklLong, 2> strides{0, static_cast<MklLong>(geometry_.stride)};
        const auto distance = static_cast<MklLong>(geometry_.distance);
        return set_all(std::pair{kPlacement, int{geometry_.in_place ? kInPlace : kNotInPlace}},
                       std::pair{kNumberOfTransforms, MklLong{geometry_.count}},
                       std::pair{kInputStrides, strides.data()}, std::pair{kOutputStrides, strides.data()},
                       std::pair{kInputDistance, distance}, std::pair{kOutputDistance, distance});
    }

    const Dfti& dfti_;
    FftGeometry geometry_;
    Descriptor descriptor_ = nullptr;
};

/** The tables and buffers of a long transform whose length has great prime factors, and as much again. */
MemoryNeed most_memory(const FftGeometry& geometry) {
    constexpr std::size_t kTimesLength = 10;
    const std::size_t bytes = kTimesLength * 2 * sizeof(float) * static_cast<std::size_t>(geometry.length);
    return {bytes, bytes};
}

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
        return find("DftiCreateDescriptor_s_1d", dfti_.create) && find("DftiSetValue", dfti_.set) &&
               find("DftiCommitDescriptor", dfti_.commit) && find("DftiComputeForward", dfti_.forward) &&
               find("DftiComputeBackward", dfti_.backward) && find("DftiFreeDescriptor", dfti_.free);
    }

    [[nodiscard]] const char* name() const noexcept override { return "mkl"; }
    [[nodiscard]] bool takes_real() const noexcept override { return true; }
    // Other columns it blocks better by itself: in long ones whose rows lie whole pages apart it meets but a few
    // lines of the cache.
    [[nodiscard]] bool wants_tile(const FftGeometry& columns) const noexcept override {
        constexpr std::ptrdiff_t kLongColumn = 4096, kPageSamples = 4096 / (2 * sizeof(float));
        return columns.length >= kLongColumn && columns.stride % kPageSamples == 0;
    }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry, FftFailure& why) noexcept override {
        // MKL answers when memory is short, but not where the system promises more than it has.
        const MemoryNeed need = most_memory(geometry);
        std::unique_ptr<MklBatch> batch{has_room(need) ? new (std::nothrow) MklBatch{dfti_, geometry} : nullptr};
        why.bytes = batch ? 0 : need.touched;
        if (!batch || (why.code = batch->commit()) != 0) return nullptr;
        return batch;
    }

private:
    Dfti dfti_{};
};

FftEngine* open_mkl(const char* file) {
    // One for each library, never unloaded: plans may outlive every other object.
    static auto& engines = *new std::map<void*, MklEngine>;
    static std::mutex opening;
    const std::lock_guard guard{opening};
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
