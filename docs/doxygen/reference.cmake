# SPDX-License-Identifier: Apache-2.0

# Builds the reference documentation. Fails on anything that Doxygen finds wrong or undocumented, and on an example
# that the documentation leaves out.
# cmake -D DOXYGEN=... -D DOXYFILE=... -D EXAMPLES=folder -P reference.cmake
file(READ "${CMAKE_CURRENT_LIST_DIR}/examples.dox" pages)
file(GLOB_RECURSE sources RELATIVE "${EXAMPLES}"
    "${EXAMPLES}/*.c" "${EXAMPLES}/*.cpp" "${EXAMPLES}/*.h" "${EXAMPLES}/*.csv" "${EXAMPLES}/*.xml")
set(missing "")
foreach(source IN LISTS sources)
    string(REGEX MATCH "@(example|include) ${source}[ \n]" found "${pages}")
    if(NOT found)
        list(APPEND missing "${source}")
    endif()
endforeach()
if(missing OR NOT sources)
    message(FATAL_ERROR "Not in ${CMAKE_CURRENT_LIST_DIR}/examples.dox: ${missing}")
endif()
execute_process(COMMAND "${DOXYGEN}" "${DOXYFILE}" RESULT_VARIABLE status)
if(NOT status EQUAL 0)
    message(FATAL_ERROR "Doxygen found what is listed above (${status}).")
endif()
