# SPDX-License-Identifier: Apache-2.0

# Packs what was built into Debian packages, unpacks them into a fresh root, and builds and runs small outside
# projects against that: with find_package, with pkg-config, and loading the library at run time.
include("${CMAKE_CURRENT_LIST_DIR}/../support/run.cmake")

file(REMOVE_RECURSE "${WORK}")
file(MAKE_DIRECTORY "${WORK}")
set(ENV{LC_ALL} C)
run(${CPACK} -G DEB --config "${BUILD}/CPackConfig.cmake" -B "${WORK}/packages")
file(GLOB packages "${WORK}/packages/*.deb")
list(LENGTH packages count)
if(NOT count EQUAL EXPECTED)
    message(FATAL_ERROR "${EXPECTED} packages expected: ${packages}")
endif()
run(lintian --allow-root --fail-on error ${packages})
set(root "${WORK}/root")
foreach(package IN LISTS packages)
    run(dpkg-deb -x "${package}" "${root}")
endforeach()
set(prefix "${root}/usr")
foreach(document IN ITEMS libquo-base1/NOTICE libquo-base1/CHANGELOG.md quo-tools/CHANGELOG.md
        libquo-base-dev/docs/geolocation.md libquo-base-dev/examples/ground_point.cpp quo-tools/docs/tools.md)
    if(NOT EXISTS "${prefix}/share/doc/${document}")
        message(FATAL_ERROR "No package has the document ${document}")
    endif()
endforeach()
run("${CMAKE_CURRENT_LIST_DIR}/links.sh" "${prefix}/share/doc")
file(GLOB_RECURSE module "${prefix}/libquo_base_fftw.so")
file(STRINGS "${module}" licence REGEX "This module contains FFTW.*GNU General Public License, version 3")
if(NOT licence)
    message(FATAL_ERROR "${module} does not tell its licence")
endif()

run(${CMAKE_COMMAND} -S "${SOURCE}" -B "${WORK}/build" -G Ninja -D CMAKE_BUILD_TYPE=Release
    "-DCMAKE_PREFIX_PATH=${prefix}" -D CMAKE_CXX_COMPILER=${CXX} -D CMAKE_C_COMPILER=${C})
run(${CMAKE_COMMAND} --build "${WORK}/build")
foreach(program IN ITEMS consumer_cpp consumer_exception consumer_c)
    run("${WORK}/build/${program}" "${WORK}")
endforeach()

# Each of the four wrong calls must be an error of its own.
execute_process(COMMAND ${CXX} -std=c++20 -fsyntax-only -Werror=format "-I${prefix}/include"
    "${SOURCE}/wrong_formats.cpp" ERROR_VARIABLE errors)
string(REGEX MATCHALL "wrong_formats.cpp:[0-9]+:[0-9]+: error: " found "${errors}")
list(LENGTH found count)
if(NOT count EQUAL 4)
    message(FATAL_ERROR "Wrong formats are not noticed:\n${errors}")
endif()

file(GLOB_RECURSE pc "${prefix}/*/quo_base.pc")
get_filename_component(pc_dir "${pc}" DIRECTORY)
get_filename_component(lib_dir "${pc_dir}" DIRECTORY)
set(ENV{PKG_CONFIG_PATH} "${pc_dir}")
execute_process(COMMAND pkg-config --cflags --libs quo_base
    RESULT_VARIABLE result OUTPUT_VARIABLE flags OUTPUT_STRIP_TRAILING_WHITESPACE)
if(result)
    message(FATAL_ERROR "pkg-config does not know quo_base")
endif()
separate_arguments(flags)
run(${C} -std=c11 "${SOURCE}/consumer.c" -o "${WORK}/consumer_c" ${flags} "-Wl,-rpath,${lib_dir}")
run("${WORK}/consumer_c" "${WORK}")
run(${CXX} -std=c++20 "${SOURCE}/consumer.cpp" -o "${WORK}/consumer_cpp" ${flags} "-Wl,-rpath,${lib_dir}")
run("${WORK}/consumer_cpp" "${WORK}")
run(${C} -std=c11 "${SOURCE}/consumer_loaded.c" -o "${WORK}/consumer_loaded" -ldl)
run("${WORK}/consumer_loaded" "${lib_dir}/libquo_base.so.1")

# The packaged tool finds the packaged library by the loader's path alone, and brings a page for each verb.
set(ENV{LD_LIBRARY_PATH} "${lib_dir}")
run("${prefix}/bin/quo" time 31536000)
execute_process(COMMAND "${prefix}/bin/quo" --help OUTPUT_VARIABLE help)
string(REGEX MATCH "Subcommands:\n(.*)\n\n" verbs "${help}")
string(REGEX MATCHALL "  [a-z][a-z-]* " verbs "${verbs}")
list(LENGTH verbs count)
file(GLOB pages "${prefix}/share/man/man1/quo-*.1.gz")
list(LENGTH pages page_count)
if(count LESS 15 OR NOT page_count EQUAL count)
    message(FATAL_ERROR "${page_count} manual pages for ${count} verbs")
endif()

find_program(ZSH zsh)
if(ZSH)
    execute_process(COMMAND "${ZSH}" -fc "fpath=(${prefix}/share/zsh/vendor-completions $fpath)
autoload -Uz compinit && compinit -D -u && print $_comps[quo] && autoload -Uz +X _quo" OUTPUT_VARIABLE completes)
    if(NOT completes STREQUAL "_quo\n")
        message(FATAL_ERROR "zsh knows no completion of quo: ${completes}")
    endif()
endif()

# So does the package for Debian's Python, which is there with what tells that it is.
if(EXPECTED EQUAL 4)
    set(ENV{PYTHONPATH} "${prefix}/lib/python3/dist-packages")
    set(ENV{PYTHONSAFEPATH} 1)
    run(/usr/bin/python3 -c "import importlib.metadata, quo_base
assert '${prefix}/' in quo_base.__file__ and importlib.metadata.version('quo_base')")
endif()
