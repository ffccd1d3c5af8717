// SPDX-License-Identifier: Apache-2.0
#include "transform.h"

#include <string>

#include "failure.h"

namespace tool {

void require_transform(int status) {
    if (status == QUO_OK) return;
    const std::string cause = fft_engine_error();
    throw Failure(cause.empty() ? "the transform cannot be had, status " + std::to_string(status) : cause);
}

Transform::Transform(int n, int m, int along_rows, int down_columns) {
    require_transform(fft_makep_c(&plan_, n, n, m, m, along_rows, down_columns, 1));
}

void Transform::run(fcomplex* image) const { require_transform(pfft_c(&plan_, image, image)); }

}  // namespace tool
