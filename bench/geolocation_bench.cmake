# SPDX-License-Identifier: Apache-2.0
quo_bench(geolocation SOURCES geolocation_bench.cpp geolocation_floor_4.cpp geolocation_floor_8.cpp COMPONENTS orbit)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|AMD64)$")
    set_source_files_properties(geolocation_floor_4.cpp PROPERTIES COMPILE_OPTIONS -mavx2)
    set_source_files_properties(geolocation_floor_8.cpp PROPERTIES COMPILE_OPTIONS -mavx512f)
endif()
