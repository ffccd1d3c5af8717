# SPDX-License-Identifier: Apache-2.0

# Builds the chain's programs against an installed package, as a user would, and asks one for its help.
include("${CMAKE_CURRENT_LIST_DIR}/../support/run.cmake")

file(REMOVE_RECURSE "${WORK}")
run(${CMAKE_COMMAND} --install "${BUILD}" --prefix "${WORK}/prefix")
run("${CMAKE_CURRENT_LIST_DIR}/../api/links.sh" "${WORK}/prefix/share/doc")
# Optimising them would take longer than the rest.
run(${CMAKE_COMMAND} -S "${SOURCE}" -B "${WORK}/build" -G Ninja "-DCMAKE_PREFIX_PATH=${WORK}/prefix"
    -D CMAKE_BUILD_TYPE=Debug
    -D CMAKE_CXX_COMPILER=${CXX} "-DCMAKE_CXX_COMPILER_LAUNCHER=${LAUNCHER}")
run(${CMAKE_COMMAND} --build "${WORK}/build" --target processor)
run("${WORK}/build/processor" --help)
