// SPDX-License-Identifier: Apache-2.0

// Does not compile with -Werror=format: each call lacks its argument, and the compiler knows the methods' formats.
#include "quo_base/quorelReport.h"

void report_wrongly(quorelReport& report) {
    quorelReport::addEntry(QUO_ERROR, 17, "file", "function", "%s");
    report.addEntry("%d");
    report.addEntry(QUO_ERROR, "%g");
    report.addLog("%s");
}
