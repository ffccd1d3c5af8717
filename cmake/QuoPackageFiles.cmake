# SPDX-License-Identifier: Apache-2.0

# Run on the staged files before they are packed: what a Debian package holds beside the installed files.
find_program(GZIP gzip REQUIRED)
foreach(component IN LISTS CPACK_COMPONENTS_ALL)
    string(TOUPPER ${component} upper)
    set(stage "${CPACK_TEMPORARY_DIRECTORY}/${component}/usr")
    set(folder "${stage}/share/doc/${CPACK_DEBIAN_${upper}_PACKAGE_NAME}")
    file(MAKE_DIRECTORY "${folder}")
    # What is installed as the project's documents is the package's here, where the licence has a place of its own.
    file(GLOB documents "${stage}/share/doc/quo_base/*")
    list(REMOVE_ITEM documents "${stage}/share/doc/quo_base/LICENSE" "${stage}/share/doc/quo_base/licences")
    file(COPY ${documents} DESTINATION "${folder}")
    file(REMOVE_RECURSE "${stage}/share/doc/quo_base")
    file(COPY_FILE "${CMAKE_CURRENT_LIST_DIR}/debian/copyright" "${folder}/copyright")
    file(COPY "${CMAKE_CURRENT_LIST_DIR}/../CHANGELOG.md" DESTINATION "${folder}")
    execute_process(COMMAND "${CMAKE_CURRENT_LIST_DIR}/package_links.sh" "${stage}"
        "share/doc/${CPACK_DEBIAN_${upper}_PACKAGE_NAME}" COMMAND_ERROR_IS_FATAL ANY)
    string(TIMESTAMP date "%a, %d %b %Y 00:00:00 +0000" UTC)
    file(WRITE "${folder}/changelog" "quo-base (${CPACK_PACKAGE_VERSION}) unstable; urgency=medium

  * Changes are listed in CHANGELOG.md.

 -- ${CPACK_PACKAGE_CONTACT}  ${date}
")
    file(GLOB pages "${stage}/share/man/man1/*.1")
    execute_process(COMMAND "${GZIP}" -9nf "${folder}/changelog" ${pages} COMMAND_ERROR_IS_FATAL ANY)
endforeach()
# The system's loader finds the library by itself; only copies elsewhere need to be told where it is.
file(GLOB placed "${CPACK_TEMPORARY_DIRECTORY}/tools/usr/bin/quo"
    "${CPACK_TEMPORARY_DIRECTORY}/python/usr/lib/python3/dist-packages/quo_base/_core*.so")
foreach(file IN LISTS placed)
    file(RPATH_REMOVE FILE "${file}")
endforeach()
# Debian's zsh looks for what packages bring in a folder of its own.
set(zsh "${CPACK_TEMPORARY_DIRECTORY}/tools/usr/share/zsh")
file(RENAME "${zsh}/site-functions" "${zsh}/vendor-completions")
