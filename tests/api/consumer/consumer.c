// SPDX-License-Identifier: Apache-2.0
/* A C11 program against the installed package: plain functions of several components, and the trio family. */
#include <math.h>
#include <stdio.h>
#include <string.h>

#include "quo_base/ckerr.h"
#include "quo_base/gen_utils.h"
#include "quo_base/trio/trio.h"

int main(void) {
    char text[64];
    init_ckerr_locking();
    if (ascii2sec85("01-JAN-1986 00:00:00") != 31536000.0) return 1;
    if (sec852myascii(31536000.0, text) != 0 || strncmp(text, "01-JAN-1986", 11) != 0) return 2;
    trio_snprintf(text, sizeof text, "%d-%s", 17, "x");
    if (strcmp(text, "17-x") != 0) return 3;
    exit_ckerr();
    return 0;
}
