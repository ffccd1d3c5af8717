# SPDX-License-Identifier: Apache-2.0

# The library is built from components, each an object library that links only what lies on its own floor or below.
# The shared library is linked from all of them; a unit test links the objects of its component and of everything
# below it, so that private helpers can be tested.

add_library(quo_flags INTERFACE)
target_compile_options(quo_flags INTERFACE
    -Wall -Wextra -Wpedantic -Wconversion -Wshadow -Wformat=2
    # Of which clang's counts every int that indexes a container of the standard library, and every pair of braces that
    # the language lets out.
    $<$<CXX_COMPILER_ID:Clang>:-Wno-sign-conversion -Wno-missing-braces>
    -fno-semantic-interposition
    # Results must not hang on which operations the compiler chose to fuse.
    -ffp-contract=off)
target_compile_definitions(quo_flags INTERFACE _FILE_OFFSET_BITS=64)
# Optimising what is written for the tests by more than this takes longer than running it, and under the sanitizers all
# of it does.
set(quo_quick_build -O1)
if(QUO_SANITIZE)
    set(quo_quick_build -O0)
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
        # The address of every access is checked by a call: written out in place, the same check takes longer to compile.
        list(APPEND quo_quick_build --param=asan-instrumentation-with-call-threshold=0)
    endif()
    # Frame pointers and line tables are enough for readable findings and keep the build small.
    set(quo_sanitize -fsanitize=$<IF:$<STREQUAL:${QUO_SANITIZE},thread>,thread,address$<COMMA>undefined>)
    list(APPEND quo_sanitize -fno-sanitize-recover=all -fno-omit-frame-pointer)
    if(CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
        # Its check of pointers counts the place 1 of an array that is not there, which nobody reads.
        list(APPEND quo_sanitize -fno-sanitize=pointer-overflow)
        if(NOT QUO_SANITIZE STREQUAL "thread")
            # By which the sources know the sanitizer, as GCC says it.
            target_compile_definitions(quo_flags INTERFACE __SANITIZE_ADDRESS__)
        endif()
    endif()
    target_compile_options(quo_flags INTERFACE ${quo_sanitize} -O1 -g1)
    target_link_options(quo_flags INTERFACE ${quo_sanitize})
    # Programs in C call what is written in C++, whose checks need its part of the sanitizers.
    set(CMAKE_C_LINK_EXECUTABLE "${CMAKE_CXX_LINK_EXECUTABLE}")
endif()
# What a target says of itself would stand before the options above, and lose; said in both places, it would be taken
# for a repetition and left out here.
target_compile_options(quo_flags INTERFACE $<TARGET_PROPERTY:QUO_LAST_OPTIONS>)
if(QUO_BUILD_FUZZ)
    # Every component tells the fuzzer which of its branches ran: without that it only tries inputs at random.
    target_compile_options(quo_flags INTERFACE -fsanitize=fuzzer-no-link)
endif()

# Compiles and analyses the sources of a target several at a time: what they include takes longer than they do. Those
# that are named have names of their own in common with others, and stay apart.
function(quo_compile_together target)
    if(QUO_UNITY)
        set_target_properties(${target} PROPERTIES UNITY_BUILD ON UNITY_BUILD_BATCH_SIZE 6
            UNITY_BUILD_CODE_BEFORE_INCLUDE "// NOLINTNEXTLINE(bugprone-suspicious-include)")
        set_source_files_properties(${ARGN} PROPERTIES SKIP_UNITY_BUILD_INCLUSION ON)
    endif()
endfunction()

# quo_component(name SOURCES ... [HEADERS public ...] [DEPENDS component ...] [LINK library ...]). Private headers are
# included by folder, "sarutillib/ground/file_io.h", and found for the component itself and all that it stands on: a
# folder for each component has a link to its sources. So an include up the house does not compile.
function(quo_component name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;HEADERS;DEPENDS;LINK")
    set(target quo_${name})
    file(RELATIVE_PATH folder "${PROJECT_SOURCE_DIR}" "${CMAKE_CURRENT_SOURCE_DIR}")
    string(REGEX REPLACE "^libsrc/[a-z]+/" "" room "${folder}")
    set(rooms "${PROJECT_BINARY_DIR}/rooms/${name}")
    cmake_path(GET room PARENT_PATH above)
    file(MAKE_DIRECTORY "${rooms}/${above}")
    file(CREATE_LINK "${CMAKE_CURRENT_SOURCE_DIR}" "${rooms}/${room}" SYMBOLIC)

    add_library(${target} OBJECT ${arg_SOURCES})
    target_compile_definitions(${target} PRIVATE QUO_BASE_BUILD)
    target_include_directories(${target} PUBLIC "${PROJECT_SOURCE_DIR}/include" "${rooms}")
    list(TRANSFORM arg_DEPENDS PREPEND quo_ OUTPUT_VARIABLE below)
    target_link_libraries(${target} PUBLIC ${below} PRIVATE quo_flags ${arg_LINK})
    set_target_properties(${target} PROPERTIES
        QUO_FOLDER "${folder}" QUO_HEADERS "${arg_HEADERS}" QUO_DEPENDS "${arg_DEPENDS}" QUO_LINK "${arg_LINK}")
    set_property(GLOBAL APPEND PROPERTY QUO_COMPONENTS ${name})
endfunction()

# Writes what scripts/check_includes.sh needs to know: a line a component, with its folder, its public headers and the
# components that it stands on.
function(quo_list_components file)
    get_property(components GLOBAL PROPERTY QUO_COMPONENTS)
    set(lines "")
    foreach(name IN LISTS components)
        get_target_property(folder quo_${name} QUO_FOLDER)
        get_target_property(headers quo_${name} QUO_HEADERS)
        quo_closure(below ${name})
        string(APPEND lines "${name}|${folder}|${headers}|${below}\n")
    endforeach()
    file(WRITE "${file}" "${lines}")
endfunction()

# Sets `out` to the named components and everything they stand on.
function(quo_closure out)
    set(open ${ARGN})
    set(closed "")
    while(open)
        list(POP_FRONT open name)
        if(NOT name IN_LIST closed)
            list(APPEND closed ${name})
            get_target_property(below quo_${name} QUO_DEPENDS)
            list(APPEND open ${below})
        endif()
    endwhile()
    set(${out} ${closed} PARENT_SCOPE)
endfunction()

function(quo_link_components target)
    quo_closure(names ${ARGN})
    foreach(name IN LISTS names)
        get_target_property(libraries quo_${name} QUO_LINK)
        target_link_libraries(${target} PRIVATE quo_${name} ${libraries})
    endforeach()
    target_link_libraries(${target} PRIVATE quo_flags)
endfunction()

# What every test includes is compiled once, by a program that is none.
function(quo_test_headers)
    if(NOT TARGET quo_test_headers)
        file(CONFIGURE OUTPUT "${PROJECT_BINARY_DIR}/no_test.cpp" CONTENT "int main() {}\n")
        add_executable(quo_test_headers "${PROJECT_BINARY_DIR}/no_test.cpp")
        target_compile_options(quo_test_headers PRIVATE -Wno-array-bounds $<$<CXX_COMPILER_ID:GNU>:-Wno-stringop-overflow>)
        set_target_properties(quo_test_headers PROPERTIES QUO_LAST_OPTIONS "${quo_quick_build}")
        target_link_libraries(quo_test_headers PRIVATE quo_flags GTest::gmock)
        target_precompile_headers(quo_test_headers PRIVATE "${PROJECT_SOURCE_DIR}/tests/support/prelude.h")
    endif()
endfunction()

# quo_test(name SOURCES ... COMPONENTS component ... [LINK library ...]): one test program; ctest runs every case in a
# process of its own, because the report, the frames and the profile cache are process-wide.
function(quo_test name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;COMPONENTS;LINK")
    set(target ${name}_test)
    add_executable(${target} ${arg_SOURCES})
    # The compiler forgets of precompiled headers that they are the system's, and warns of what it finds in them.
    target_compile_options(${target} PRIVATE -Wno-array-bounds $<$<CXX_COMPILER_ID:GNU>:-Wno-stringop-overflow>)
    set_target_properties(${target} PROPERTIES QUO_LAST_OPTIONS "${quo_quick_build}")
    quo_test_headers()
    target_precompile_headers(${target} REUSE_FROM quo_test_headers)
    target_include_directories(${target} PRIVATE "${PROJECT_SOURCE_DIR}/tests")
    target_compile_definitions(${target} PRIVATE QUO_TEST_DATA="${PROJECT_SOURCE_DIR}/tests/data")
    quo_link_components(${target} ${arg_COMPONENTS})
    target_link_libraries(${target} PRIVATE ${arg_LINK} GTest::gmock GTest::gtest_main)
    # Memory that is not there is a refusal, also where the sanitizers hand it out.
    gtest_discover_tests(
        ${target}
        TEST_PREFIX "${name}."
        DISCOVERY_TIMEOUT 120
        PROPERTIES TIMEOUT 300 ENVIRONMENT ASAN_OPTIONS=allocator_may_return_null=1
    )
endfunction()

# quo_bench(name SOURCES ... COMPONENTS component ... [LINK library ...]): one benchmark program.
function(quo_bench name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;COMPONENTS;LINK")
    set(target ${name}_bench)
    add_executable(${target} ${arg_SOURCES})
    target_include_directories(${target} PRIVATE "${PROJECT_SOURCE_DIR}/bench" "${PROJECT_SOURCE_DIR}/tests")
    target_compile_definitions(${target} PRIVATE QUO_TEST_DATA="${PROJECT_SOURCE_DIR}/tests/data")
    quo_link_components(${target} ${arg_COMPONENTS})
    target_link_libraries(${target} PRIVATE ${arg_LINK} benchmark::benchmark)
endfunction()

# quo_fuzz(name SOURCES ... COMPONENTS component ...): one libFuzzer target, seeded from fuzz/corpus/<name>, part of
# the target fuzz_targets, and a test that runs it for a few seconds; where no fuzzer is built, a test of its seeds alone.
function(quo_fuzz name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;COMPONENTS")
    set(target ${name}_fuzz)
    add_executable(${target} ${arg_SOURCES})
    quo_link_components(${target} ${arg_COMPONENTS})
    if(NOT QUO_BUILD_FUZZ)
        set_target_properties(${target} PROPERTIES QUO_LAST_OPTIONS "${quo_quick_build}")
        target_link_libraries(${target} PRIVATE quo_fuzz_seeds)
        add_test(NAME seeds.${name} COMMAND ${target} "${PROJECT_SOURCE_DIR}/fuzz/corpus/${name}")
        return()
    endif()
    target_link_options(${target} PRIVATE -fsanitize=fuzzer)
    add_dependencies(fuzz_targets ${target})
    add_test(NAME fuzz.${name} COMMAND "${PROJECT_SOURCE_DIR}/scripts/fuzz.sh" 0.06 "$<TARGET_FILE:${target}>")
endfunction()

function(quo_add_existing folder)
    if(EXISTS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/CMakeLists.txt")
        add_subdirectory(${folder})
    endif()
endfunction()

# The licences of others whose code is in what is installed.
function(quo_install_licences folder)
    install(FILES "${PROJECT_SOURCE_DIR}/cmake/debian/copyright" DESTINATION "${folder}" RENAME others.txt ${ARGN})
    install(FILES /usr/share/common-licenses/GPL-3 DESTINATION "${folder}" OPTIONAL ${ARGN})
endfunction()
