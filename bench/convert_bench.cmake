# SPDX-License-Identifier: Apache-2.0

# The tool as its users run it, beside the system's own.
if(TARGET quo)
    quo_bench(convert SOURCES convert_bench.cpp COMPONENTS datafile)
    target_compile_definitions(convert_bench PRIVATE QUO_BENCH_TOOL="$<TARGET_FILE:quo>")
    add_dependencies(convert_bench quo)
endif()
