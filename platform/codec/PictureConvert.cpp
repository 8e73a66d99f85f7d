#include "codec/PictureConvert.h"

#include <algorithm>
#include <cstddef>
#include <cstring>

namespace android {

namespace {

class PlaneReader {
public:
    PlaneReader(const PlanarPicture& in, int plane, int width, int height)
        : mRow0(in.planes[plane]), mPitch(in.pitch[plane]), mWide(in.bitDepth > 8), mWidth(width), mHeight(height) {}

    // Coordinates past the plane repeat its last column or row.
    uint32_t at(int x, int y) const {
        x = std::min(x, mWidth - 1);
        y = std::min(y, mHeight - 1);
        const uint8_t* row = mRow0 + static_cast<ptrdiff_t>(y) * mPitch;
        return mWide ? uint32_t(row[2 * x]) | uint32_t(row[2 * x + 1]) << 8 : row[x];
    }

private:
    const uint8_t* mRow0;
    int mPitch;
    bool mWide;
    int mWidth, mHeight;
};

// A sum of `count` samples of `depth` bits as one 8-bit sample, rounded.
uint8_t To8(uint32_t sum, int count, int depth) {
    const uint32_t divisor = uint32_t(count) << (depth - 8);
    return static_cast<uint8_t>(std::min<uint32_t>(255, (sum + divisor / 2) / divisor));
}

void CopyLuma(const PlanarPicture& in, uint8_t* out, int outW, int outH) {
    const PlaneReader y(in, 0, in.width, in.height);
    for (int row = 0; row < outH; ++row) {
        uint8_t* dst = out + size_t(row) * outW;
        if (in.bitDepth == 8 && row < in.height) {
            memcpy(dst, in.planes[0] + static_cast<ptrdiff_t>(row) * in.pitch[0], in.width);
            if (outW > in.width) dst[outW - 1] = dst[in.width - 1];
            continue;
        }
        for (int x = 0; x < outW; ++x) dst[x] = To8(y.at(x, row), 1, in.bitDepth);
    }
}

void CopyChroma(const PlanarPicture& in, int plane, uint8_t* out, int outW, int outH) {
    if (in.planes[plane] == nullptr) {
        memset(out, 128, size_t(outW) * outH);
        return;
    }
    const int sx = in.chromaShiftX, sy = in.chromaShiftY;
    const int srcW = (in.width + sx) >> sx, srcH = (in.height + sy) >> sy;
    if (in.bitDepth == 8 && sx == 1 && sy == 1) {
        for (int row = 0; row < outH; ++row) {
            memcpy(out + size_t(row) * outW, in.planes[plane] + static_cast<ptrdiff_t>(row) * in.pitch[plane], outW);
        }
        return;
    }
    const PlaneReader c(in, plane, srcW, srcH);
    // Each 4:2:0 sample covers 2x2 luma samples: that many source samples
    // where the source is not subsampled.
    const int stepX = 1 << (1 - sx), stepY = 1 << (1 - sy);
    for (int row = 0; row < outH; ++row) {
        uint8_t* dst = out + size_t(row) * outW;
        for (int x = 0; x < outW; ++x) {
            uint32_t sum = 0;
            for (int dy = 0; dy < stepY; ++dy)
                for (int dx = 0; dx < stepX; ++dx) sum += c.at(x * stepX + dx, row * stepY + dy);
            dst[x] = To8(sum, stepX * stepY, in.bitDepth);
        }
    }
}

}  // namespace

void ToI420(const PlanarPicture& in, uint8_t* out) {
    const int w = EvenSize(in.width), h = EvenSize(in.height);
    CopyLuma(in, out, w, h);
    uint8_t* cb = out + size_t(w) * h;
    uint8_t* cr = cb + size_t(w / 2) * (h / 2);
    CopyChroma(in, 1, cb, w / 2, h / 2);
    CopyChroma(in, 2, cr, w / 2, h / 2);
}

}  // namespace android
