// SPDX-License-Identifier: Apache-2.0
/* A C11 program that knows the library by its file name only, as other languages load it. */
#include <dlfcn.h>
#include <string.h>

int main(int count, char** arguments) {
    (void)count;
    void* library = dlopen(arguments[1], RTLD_NOW | RTLD_LOCAL);
    if (!library) return 1;
    double (*ascii2sec85)(const char*);
    int (*trio_snprintf)(char*, size_t, const char*, ...);
    *(void**)&ascii2sec85 = dlsym(library, "ascii2sec85");
    *(void**)&trio_snprintf = dlsym(library, "trio_snprintf");
    if (!ascii2sec85 || !trio_snprintf) return 2;
    if (ascii2sec85("01-JAN-1986 00:00:00") != 31536000.0) return 3;
    char text[16];
    trio_snprintf(text, sizeof text, "%d-%s", 17, "x");
    if (strcmp(text, "17-x") != 0) return 4;
    return dlclose(library);
}
