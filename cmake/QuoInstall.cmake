# SPDX-License-Identifier: Apache-2.0

# What is installed, in components: runtime (the library, the modules that it loads, and the licence), development
# (headers, CMake package, pkg-config file, documentation and examples), tools (the command-line tool, its manual pages
# and completion), python (the package for Debian's Python) and, only where it is asked for, wheel (the same with the
# library inside).
include(CMakePackageConfigHelpers)

install(TARGETS quo_base EXPORT quo_base_targets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT development)
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME development)
install(DIRECTORY "${PROJECT_SOURCE_DIR}/include/quo_base" DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
# The headers of the trio_* family, which the library exports.
install(FILES "${TRIO_INCLUDE_DIR}/trio.h" "${TRIO_INCLUDE_DIR}/triop.h" "${TRIO_INCLUDE_DIR}/triodef.h"
              "${TRIO_INCLUDE_DIR}/triostr.h" "${TRIO_INCLUDE_DIR}/trionan.h"
        DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/quo_base/trio)

# Beside each other as in the source tree, so that their links hold.
install(FILES "${PROJECT_SOURCE_DIR}/LICENSE" "${PROJECT_SOURCE_DIR}/NOTICE" DESTINATION ${CMAKE_INSTALL_DOCDIR}
        COMPONENT runtime)
quo_install_licences(${CMAKE_INSTALL_DOCDIR}/licences COMPONENT runtime)
install(FILES "${PROJECT_SOURCE_DIR}/README.md" "${PROJECT_SOURCE_DIR}/CHANGELOG.md" DESTINATION ${CMAKE_INSTALL_DOCDIR})
# What builds the examples within the project stays behind; examples/chain builds by itself.
install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples" DESTINATION ${CMAKE_INSTALL_DOCDIR}
        REGEX "/examples/(CMakeLists.txt|quoted.cmake)$|/__pycache__$" EXCLUDE)
install(DIRECTORY "${PROJECT_SOURCE_DIR}/docs" DESTINATION ${CMAKE_INSTALL_DOCDIR}
        FILES_MATCHING PATTERN "*.md" PATTERN "*.png" PATTERN "*.svg" PATTERN doxygen EXCLUDE)
# What the tool's and Python's users read comes with those, too.
install(FILES "${PROJECT_SOURCE_DIR}/docs/tools.md" "${PROJECT_SOURCE_DIR}/docs/tutorial.md"
        DESTINATION ${CMAKE_INSTALL_DOCDIR}/docs COMPONENT tools)
if(QUO_PYTHON)
    install(FILES "${PROJECT_SOURCE_DIR}/docs/python.md" "${PROJECT_SOURCE_DIR}/docs/scaling.md"
            DESTINATION ${CMAKE_INSTALL_DOCDIR}/docs COMPONENT python)
    install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples/python" DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT python
        PATTERN __pycache__ EXCLUDE)
endif()

set(config_dir ${CMAKE_INSTALL_LIBDIR}/cmake/quo_base)
install(EXPORT quo_base_targets FILE quo_base-targets.cmake NAMESPACE quo_base:: DESTINATION ${config_dir})
configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/quo_base-config.cmake.in"
    "${PROJECT_BINARY_DIR}/quo_base-config.cmake" INSTALL_DESTINATION ${config_dir})
write_basic_package_version_file("${PROJECT_BINARY_DIR}/quo_base-config-version.cmake" COMPATIBILITY SameMajorVersion)
install(FILES "${PROJECT_BINARY_DIR}/quo_base-config.cmake" "${PROJECT_BINARY_DIR}/quo_base-config-version.cmake"
        DESTINATION ${config_dir})

file(RELATIVE_PATH to_prefix "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
string(REGEX REPLACE "/$" "" to_prefix "${to_prefix}")
configure_file("${PROJECT_SOURCE_DIR}/cmake/quo_base.pc.in" "${PROJECT_BINARY_DIR}/quo_base.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/quo_base.pc" DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# Packages get their links when they are packed, each with the documents of the others beside it.
install(CODE "if(NOT CMAKE_INSTALL_COMPONENT)
    execute_process(COMMAND \"${PROJECT_SOURCE_DIR}/cmake/package_links.sh\" \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}\"
        \"${CMAKE_INSTALL_DOCDIR}\" COMMAND_ERROR_IS_FATAL ANY)
endif()")

include(QuoPackages)
