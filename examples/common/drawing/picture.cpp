// SPDX-License-Identifier: Apache-2.0
#include "picture.h"

#include <png.h>

#include <csetjmp>
#include <new>

namespace drawing {
namespace {

/** What libpng's writing calls share. */
class PngWriter {
public:
    PngWriter()
        : png_{png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, give_up, nullptr)},
          info_{png_ ? png_create_info_struct(png_) : nullptr} {
        if (!info_) {
            png_destroy_write_struct(&png_, nullptr);
            throw std::bad_alloc{};
        }
        png_set_write_fn(png_, this, append, nullptr);
    }
    ~PngWriter() { png_destroy_write_struct(&png_, &info_); }
    PngWriter(const PngWriter&) = delete;
    PngWriter& operator=(const PngWriter&) = delete;

    /** False when libpng gave up. Its errors jump back here, over nothing that needs to be destroyed. */
    bool encode(const Picture& picture) {
        if (setjmp(png_jmpbuf(png_))) return false;  // NOLINT(cert-err52-cpp): libpng's way of failing
        png_set_IHDR(png_, info_, static_cast<png_uint_32>(picture.width),
                     static_cast<png_uint_32>(picture.height), 8,
                     picture.channels == 1 ? PNG_COLOR_TYPE_GRAY : PNG_COLOR_TYPE_RGB, PNG_INTERLACE_NONE,
                     PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
        png_write_info(png_, info_);
        for (std::size_t row = 0; row < picture.height; ++row) {
            png_write_row(png_, picture.values.data() + row * picture.width * picture.channels);
        }
        png_write_end(png_, info_);
        return true;
    }
    [[nodiscard]] const std::string& bytes() const { return bytes_; }

private:
    /** In place of libpng's own, which prints. */
    [[noreturn]] static void give_up(png_structp png, png_const_charp /*why*/) { png_longjmp(png, 1); }
    static void append(png_structp png, png_bytep data, std::size_t size) {
        static_cast<PngWriter*>(png_get_io_ptr(png))->bytes_.append(reinterpret_cast<const char*>(data), size);
    }

    png_structp png_;
    png_infop info_;
    std::string bytes_;
};

}  // namespace

std::string png_of(const Picture& picture) {
    PngWriter writer;
    if (!writer.encode(picture)) throw std::bad_alloc{};  // all else that libpng refuses cannot occur
    return writer.bytes();
}

}  // namespace drawing
