#include "Png.h"

#include <csetjmp>
#include <cstdio>
#include <png.h>
#include <unistd.h>

namespace qnedit {

namespace {
struct FdWriter {
    int fd;
    bool failed;
};

void writeCallback(png_structp png, png_bytep data, png_size_t length) {
    FdWriter* w = static_cast<FdWriter*>(png_get_io_ptr(png));
    while (length > 0 && !w->failed) {
        const ssize_t n = write(w->fd, data, length);
        if (n <= 0) {
            w->failed = true;
            break;
        }
        data += n;
        length -= static_cast<size_t>(n);
    }
}

void flushCallback(png_structp) {}
}  // namespace

bool writePng(int fd, const RgbImage& image, std::string* error) {
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    if (png == nullptr) {
        *error = "out of memory";
        return false;
    }
    png_infop info = png_create_info_struct(png);
    FdWriter writer{fd, false};
    if (info == nullptr || setjmp(png_jmpbuf(png))) {
        png_destroy_write_struct(&png, &info);
        *error = "cannot encode the picture";
        return false;
    }
    png_set_write_fn(png, &writer, writeCallback, flushCallback);
    png_set_IHDR(png, info, image.width, image.height, 8, PNG_COLOR_TYPE_RGB, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_write_info(png, info);
    for (int y = 0; y < image.height; ++y) {
        png_write_row(png, const_cast<png_bytep>(&image.pixels[size_t(y) * image.width * 3]));
    }
    png_write_end(png, nullptr);
    png_destroy_write_struct(&png, &info);
    if (writer.failed) {
        *error = "write failed";
        return false;
    }
    return true;
}

RgbImage rgb565ToImage(const uint8_t* data, int width, int height) {
    RgbImage image(width, height);
    for (size_t i = 0; i < size_t(width) * height; ++i) {
        const uint16_t v = static_cast<uint16_t>(data[2 * i] | (data[2 * i + 1] << 8));
        const uint8_t r5 = v >> 11, g6 = (v >> 5) & 0x3F, b5 = v & 0x1F;
        image.pixels[3 * i] = static_cast<uint8_t>((r5 << 3) | (r5 >> 2));
        image.pixels[3 * i + 1] = static_cast<uint8_t>((g6 << 2) | (g6 >> 4));
        image.pixels[3 * i + 2] = static_cast<uint8_t>((b5 << 3) | (b5 >> 2));
    }
    return image;
}

}  // namespace qnedit
