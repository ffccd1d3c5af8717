# SPDX-License-Identifier: Apache-2.0

# The verbs that need no product, and what they stand on.
if(TARGET quo)
    quo_fuzz(tool SOURCES tool_fuzz.cpp COMPONENTS debugIO)
    target_include_directories(tool_fuzz PRIVATE "${PROJECT_SOURCE_DIR}/tools/quo/text" "${PROJECT_SOURCE_DIR}/tools/quo/verbs"
        "${PROJECT_SOURCE_DIR}/examples")
    target_link_libraries(tool_fuzz PRIVATE quo_tool_text quo_command_line)
endif()
