// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_QUO_PICTURE_READER_H
#define QUO_TESTS_QUO_PICTURE_READER_H

#include <png.h>

#include <stdexcept>
#include <string>
#include <vector>

namespace test {

/** A picture as libpng's own reader sees it: one value a pixel where it is grey, three where it has colours. */
struct SeenPicture {
    explicit SeenPicture(const std::string& name) {
        png_image image{};
        image.version = PNG_IMAGE_VERSION;
        if (png_image_begin_read_from_file(&image, name.c_str()) == 0) throw std::runtime_error{image.message};
        width = static_cast<int>(image.width);
        height = static_cast<int>(image.height);
        channels = static_cast<int>(PNG_IMAGE_PIXEL_CHANNELS(image.format));
        values.resize(PNG_IMAGE_SIZE(image));
        png_image_finish_read(&image, nullptr, values.data(), 0, nullptr);
    }
    [[nodiscard]] int at(int column, int row, int channel = 0) const {
        return values.at(static_cast<std::size_t>((row * width + column) * channels + channel));
    }

    int width = 0, height = 0, channels = 0;
    std::vector<unsigned char> values;
};

}  // namespace test

#endif
