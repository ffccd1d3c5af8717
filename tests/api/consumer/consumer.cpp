// SPDX-License-Identifier: Apache-2.0

// A C++ program against the installed package: writes a header object and reads it back.
#include <string>

#include "quo_base/acquisition.h"

int main(int, char** arguments) {
    const std::string file = std::string{arguments[1]} + "/product.xml";
    SamplingConstants_Obj written;
    written.prf_hz = 1717.3;
    if (written.writehdr(file.c_str()) != 0) return 1;
    SamplingConstants_Obj read;
    if (read.readhdr(file.c_str()) != 0) return 2;
    return read.prf_hz == 1717.3 ? 0 : 3;
}
