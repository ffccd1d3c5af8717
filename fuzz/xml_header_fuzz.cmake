# SPDX-License-Identifier: Apache-2.0
quo_fuzz(xml_header SOURCES xml_header_fuzz.cpp COMPONENTS quorelxml)
