#ifndef QUO_EXAMPLES_PRODUCT_H
#define QUO_EXAMPLES_PRODUCT_H

#include <cerrno>
#include <filesystem>
#include <string>

#include "quo_base/generalSAR.h"
#include "session.h"

namespace example {

/** Makes a product header anew from the objects that the product has; throws Failure. */
inline void write_product(GeneralSAR& product, const std::string& header) {
    std::error_code failure;
    std::filesystem::remove(header, failure);
    errno = 0;  // what that left would count as an error of the next function of the library
    quorelxml::setExactNumbers(true);  // 15 digits would cost the azimuth times their last microsecond
    product.GSwrite(header.c_str());   // 0 whatever happens
    if (!std::filesystem::exists(header, failure)) throw Failure{header + ": cannot be written", QUO_NOT_OPENED};
}

}  // namespace example

#endif
