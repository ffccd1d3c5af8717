// SPDX-License-Identifier: Apache-2.0

// Opens a report, and asks for a product that is not there.
#include "quo_base/ckerr.h"
#include "quo_base/product.h"

int main() {
    init_ckerr_locking();                    // the stack of running calls: without it nothing is written
    init_report("report.txt", "places", 1);  // its name, a title for its banner, and the level
    quo_product* product = nullptr;
    const int status = quo_product_open("missing.hdr", nullptr, &product);
    exit_report();
    exit_ckerr();  // lists blocks that were not given back, if there are any
    return status == 0 ? quo_product_close(product) : 1;
}
