# SPDX-License-Identifier: Apache-2.0

# The tool and the example programs as their users run them.
if(TARGET quo AND TARGET processor)
    quo_bench(threads SOURCES threads_bench.cpp COMPONENTS orbit)
    target_compile_definitions(threads_bench PRIVATE
        QUO_BENCH_TOOL="$<TARGET_FILE:quo>" QUO_BENCH_PROCESSOR="$<TARGET_FILE:processor>"
        QUO_BENCH_SIMULATOR="$<TARGET_FILE:echo_simulator>" QUO_BENCH_EXAMPLES="${PROJECT_SOURCE_DIR}/examples")
    add_dependencies(threads_bench quo processor echo_simulator)
endif()
