# SPDX-License-Identifier: Apache-2.0

# The reference one, whatever else is installed.
set(BLA_VENDOR Generic)
find_package(LAPACK REQUIRED)
find_package(Eigen3 REQUIRED)
quo_bench(matrix SOURCES matrix_bench.cpp COMPONENTS matrix LINK LAPACK::LAPACK Eigen3::Eigen)
