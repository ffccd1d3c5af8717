# SPDX-License-Identifier: Apache-2.0
find_library(FFTWF_LIBRARY NAMES fftw3f REQUIRED)
quo_bench(fft SOURCES fft_bench.cpp COMPONENTS signal LINK "${FFTWF_LIBRARY}" ${CMAKE_DL_LIBS})
target_compile_definitions(fft_bench PRIVATE QUO_BENCH_FFTW_MODULE="$<TARGET_FILE:quo_base_fftw>")
add_dependencies(fft_bench quo_base_fftw)
