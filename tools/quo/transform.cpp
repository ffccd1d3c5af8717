#include "transform.h"

#include <string>
#include <string_view>

#include "failure.h"

namespace tool {

void require_transform(int status) {
    if (status == QUO_OK) return;
    if (std::string_view{fft_engine_name()} == "none")
        throw Failure(
            "no FFT engine can be loaded: put libquo_base_fftw.so into quo_base/ beside the library, or install "
            "MKL");
    throw Failure("the transform cannot be had, status " + std::to_string(status));
}

Transform::Transform(int n, int m, int along_rows, int down_columns) {
    require_transform(fft_makep_c(&plan_, n, n, m, m, along_rows, down_columns, 1));
}

void Transform::run(fcomplex* image) const { require_transform(pfft_c(&plan_, image, image)); }

}  // namespace tool
