# SPDX-License-Identifier: Apache-2.0

# The verbs that need no product, and what they stand on.
if(NOT TARGET quo_command_line)
    add_subdirectory("${PROJECT_SOURCE_DIR}/examples/common" command_line)
endif()
quo_fuzz(tool
    SOURCES tool_fuzz.cpp "${tool}/verbs/debug_dump.cpp" "${tool}/verbs/time.cpp" "${tool}/text/date.cpp" ${tool_text}
    COMPONENTS debugIO)
target_include_directories(tool_fuzz PRIVATE "${tool}/text" "${tool}/verbs" "${PROJECT_SOURCE_DIR}/examples")
target_link_libraries(tool_fuzz PRIVATE quo_command_line)
