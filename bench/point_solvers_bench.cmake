# SPDX-License-Identifier: Apache-2.0
quo_bench(point_solvers SOURCES point_solvers_bench.cpp COMPONENTS point_solvers)
