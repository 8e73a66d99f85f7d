#ifndef QNEDIT_PNG_H
#define QNEDIT_PNG_H

#include <cstdint>
#include <string>
#include <vector>

namespace qnedit {

// 8-bit RGB pixels, rows top to bottom.
struct RgbImage {
    int width = 0;
    int height = 0;
    std::vector<uint8_t> pixels;  // width * height * 3

    RgbImage(int w, int h, uint8_t fill = 0) : width(w), height(h), pixels(size_t(w) * h * 3, fill) {}
    void set(int x, int y, uint8_t r, uint8_t g, uint8_t b) {
        if (x < 0 || y < 0 || x >= width || y >= height) return;
        uint8_t* p = &pixels[(size_t(y) * width + x) * 3];
        p[0] = r;
        p[1] = g;
        p[2] = b;
    }
};

// Writes the image to an open descriptor; false (with errno-free message in
// *error) on failure.
bool writePng(int fd, const RgbImage& image, std::string* error);

// RGB 5:6:5 little-endian pixels to 8-bit RGB, each channel's top bits
// repeated into its low bits so that full scale stays full scale.
RgbImage rgb565ToImage(const uint8_t* data, int width, int height);

}  // namespace qnedit

#endif
