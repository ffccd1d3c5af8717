# Installs into a fresh prefix and builds and runs small outside projects against it, with find_package and with
# pkg-config.
function(run)
    execute_process(COMMAND ${ARGV} RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE out)
    if(result)
        message(FATAL_ERROR "${ARGV}\n${out}")
    endif()
endfunction()

file(REMOVE_RECURSE "${WORK}")
set(prefix "${WORK}/prefix")
run(${CMAKE_COMMAND} --install "${BUILD}" --prefix "${prefix}")

run(${CMAKE_COMMAND} -S "${SOURCE}" -B "${WORK}/build" -G Ninja -D CMAKE_BUILD_TYPE=Release
    "-DCMAKE_PREFIX_PATH=${prefix}" -D CMAKE_CXX_COMPILER=${CXX} -D CMAKE_C_COMPILER=${C})
run(${CMAKE_COMMAND} --build "${WORK}/build")
foreach(program IN ITEMS consumer_cpp consumer_exception consumer_c)
    run("${WORK}/build/${program}" "${WORK}")
endforeach()

# Each of the four wrong calls must be an error of its own.
set(ENV{LC_ALL} C)
execute_process(COMMAND ${CXX} -std=c++20 -fsyntax-only -Werror=format "-I${prefix}/include"
    "${SOURCE}/wrong_formats.cpp" ERROR_VARIABLE errors)
string(REGEX MATCHALL "wrong_formats.cpp:[0-9]+:[0-9]+: error: " found "${errors}")
list(LENGTH found count)
if(NOT count EQUAL 4)
    message(FATAL_ERROR "Wrong formats are not noticed:\n${errors}")
endif()

file(GLOB_RECURSE pc "${prefix}/*/quo_base.pc")
get_filename_component(pc_dir "${pc}" DIRECTORY)
set(ENV{PKG_CONFIG_PATH} "${pc_dir}")
# The file names the configured prefix; a package that was moved is told so.
execute_process(COMMAND pkg-config --define-variable=prefix=${prefix} --cflags --libs quo_base
    RESULT_VARIABLE result OUTPUT_VARIABLE flags OUTPUT_STRIP_TRAILING_WHITESPACE)
if(result)
    message(FATAL_ERROR "pkg-config does not know quo_base")
endif()
separate_arguments(flags)
get_filename_component(lib_dir "${pc_dir}" DIRECTORY)
run(${C} -std=c11 "${SOURCE}/consumer.c" -o "${WORK}/consumer_pc" ${flags} "-Wl,-rpath,${lib_dir}")
run("${WORK}/consumer_pc" "${WORK}")
