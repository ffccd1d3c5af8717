# SPDX-License-Identifier: Apache-2.0

# Fails on every name of interface_names.txt that its header does not declare, or that the library does not export.
# cmake -D HEADERS=folder -D LIBRARY=file -D NM=program -P interface_names.cmake
cmake_minimum_required(VERSION 3.25)
execute_process(COMMAND "${NM}" -D --defined-only --format=posix "${LIBRARY}"
    OUTPUT_VARIABLE symbols COMMAND_ERROR_IS_FATAL ANY)
string(REGEX MATCHALL "[A-Za-z_][A-Za-z0-9_]*" exported "${symbols}")

file(STRINGS "${CMAKE_CURRENT_LIST_DIR}/interface_names.txt" table REGEX "^[^#]")
set(missing "")
set(header "")
foreach(row IN LISTS table)
    string(REPLACE " " ";" row "${row}")
    list(GET row 1 name)
    if(NOT header IN_LIST row)
        list(GET row 0 header)
        file(READ "${HEADERS}/${header}" text)
        string(REGEX REPLACE "/\\*[^*]*\\*+([^/*][^*]*\\*+)*/|//[^\n]*|\"[^\"\n]*\"" " " text "${text}")
        string(REGEX MATCHALL "[A-Za-z_][A-Za-z0-9_]*" words "${text}")
    endif()
    if(NOT name IN_LIST words)
        string(APPEND missing "\n  ${header} does not declare ${name}")
    endif()
    if("exported" IN_LIST row AND NOT name IN_LIST exported)
        string(APPEND missing "\n  the library does not export ${name}")
    endif()
endforeach()
if(missing OR NOT table)
    message(FATAL_ERROR "Missing from the interface:${missing}")
endif()
