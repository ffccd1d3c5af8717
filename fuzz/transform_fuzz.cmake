# SPDX-License-Identifier: Apache-2.0
quo_fuzz(transform SOURCES transform_fuzz.cpp COMPONENTS signal)
target_compile_definitions(transform_fuzz PRIVATE QUO_FUZZ_FFTW_MODULE="$<TARGET_FILE:quo_base_fftw>")
add_dependencies(transform_fuzz quo_base_fftw)
