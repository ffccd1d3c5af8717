# SPDX-License-Identifier: Apache-2.0
quo_bench(xml_header SOURCES xml_header_bench.cpp COMPONENTS quorelxml)
