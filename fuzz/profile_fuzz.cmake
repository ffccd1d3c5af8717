# SPDX-License-Identifier: Apache-2.0
quo_fuzz(profile SOURCES profile_fuzz.cpp COMPONENTS profile)
