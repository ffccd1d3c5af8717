// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/processor_level.h"

#include <algorithm>
#include <cstdlib>
#include <string_view>

#include "sarutillib/ground/bounded_text.h"

namespace quo {
namespace {

ProcessorLevel own_level() noexcept {
#if defined(__x86_64__)
    __builtin_cpu_init();  // a kernel may be asked for before the constructors have run that do this
    if (!__builtin_cpu_supports("avx2") || !__builtin_cpu_supports("fma")) return ProcessorLevel::kBase;
    if (__builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw") &&
        __builtin_cpu_supports("avx512dq") && __builtin_cpu_supports("avx512vl"))
        return ProcessorLevel::kAvx512;
    return ProcessorLevel::kAvx2;
#else
    return ProcessorLevel::kBase;
#endif
}

}  // namespace

ProcessorLevel lowered_level(ProcessorLevel own, const char* name) noexcept {
    constexpr std::string_view kNames[] = {"sse2", "avx2", "avx512"};  // in the order of the levels
    const auto* const named = std::ranges::find(kNames, text_or_empty(name));
    if (named == std::end(kNames)) return own;
    return std::min(own, static_cast<ProcessorLevel>(named - kNames));
}

ProcessorLevel processor_level() noexcept {
    static const ProcessorLevel level = lowered_level(own_level(), std::getenv("QUO_CPU"));
    return level;
}

}  // namespace quo
