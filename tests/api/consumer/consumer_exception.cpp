// SPDX-License-Identifier: Apache-2.0

// A C++ program against the installed package that hides its own symbols: exceptions of the library are caught by
// their type, and its own ones are known to the library.
#include <cstring>
#include <string>

#include "quo_base/generalSAR_configuration.h"

namespace {

// 0 when reading a missing file throws what is promised.
int read_missing(const std::string& file) {
    GeocodingConf record;
    try {
        record.readpar(file.c_str(), 1);
    } catch (const quorelException& failure) {
        const bool told = std::strcmp(failure.what(), "Cannot read specific configuration file") == 0;
        return told && failure.getLine() > 0 && std::strcmp(failure.getFunction(), "readConf") == 0 ? 0 : 1;
    } catch (...) {
        return 2;
    }
    return 3;
}

}  // namespace

int main(int, char** arguments) {
    if (const int failed = read_missing(std::string{arguments[1]} + "/missing.xml")) return failed;
    try {
        throw quorelException{17, "main", "consumer", "100%s own"};
    } catch (const quorelException& own) {
        quorelReport::addEntry(&own);
        return std::strcmp(own.what(), "100%s own") == 0 ? 0 : 4;
    }
}
