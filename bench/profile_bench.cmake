# SPDX-License-Identifier: Apache-2.0
quo_bench(profile SOURCES profile_bench.cpp COMPONENTS profile)
