// SPDX-License-Identifier: Apache-2.0
/* The plain functions are C functions: they serve C programs, and every language that can load a C library. */
#include <stdio.h>

#include "quo_base/gen_utils.h"

int main(void) {
    const double seconds = ascii2sec85("27-NOV-2020 11:13:57.5");
    char text[DATE_TEXT_LENGTH + 1];
    if (sec852myascii(seconds + 86400.0, text) != 0) return 1;
    printf("%.1f s since 1985; a day later it is %s\n", seconds, text);
    return 0;
}
