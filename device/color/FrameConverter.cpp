#define LOG_TAG "KVUFrameConverter"

#include <kvucmm/FrameConverter.h>

#include <cmath>
#include <cstring>
#include <new>
#include <vector>

#include <libyuv/convert_argb.h>
#include <libyuv/planar_functions.h>
#include <libyuv/scale.h>
#include <log/log.h>

namespace KVUCMM {

namespace {

using android::ColorAspects;

constexpr int32_t kMaxDimension = 16384;

enum class Layout { kNone, kPlanarUV, kPlanarVU, kSemiUV, kSemiVU };

Layout layoutOf(int32_t format) {
    switch (format) {
        case kColorFormatYUV420Planar:
        case kColorFormatYUV420PackedPlanar: return Layout::kPlanarUV;
        case kColorFormatYV12: return Layout::kPlanarVU;
        case kColorFormatYUV420SemiPlanar:
        case kColorFormatYUV420PackedSemiPlanar: return Layout::kSemiUV;
        case kColorFormatNV21: return Layout::kSemiVU;
        default: return Layout::kNone;
    }
}

bool isSemiPlanar(Layout l) { return l == Layout::kSemiUV || l == Layout::kSemiVU; }

bool validPicture(const FrameParam& p) {
    return p.data != nullptr && p.width > 0 && p.height > 0 && p.width <= kMaxDimension &&
           p.height <= kMaxDimension && p.cropLeft >= 0 && p.cropTop >= 0 && p.cropLeft <= p.cropRight &&
           p.cropTop <= p.cropBottom && p.cropRight < p.width && p.cropBottom < p.height;
}

int32_t cropWidth(const FrameParam& p) { return p.cropRight - p.cropLeft + 1; }
int32_t cropHeight(const FrameParam& p) { return p.cropBottom - p.cropTop + 1; }

// The planes of a source picture.
struct Planes {
    const uint8_t* y;
    const uint8_t* u;   // planar
    const uint8_t* v;   // planar
    const uint8_t* uv;  // semi-planar, in the order of the layout
    int yStride;
    int cStride;
    Layout layout;
};

Planes planesOf(const FrameParam& src) {
    Planes p{};
    p.layout = layoutOf(src.colorFormat);
    p.y = src.data;
    p.yStride = src.width;
    const size_t ySize = static_cast<size_t>(src.width) * src.height;
    if (isSemiPlanar(p.layout)) {
        p.uv = src.data + ySize;
        p.cStride = src.width;
    } else {
        p.cStride = (src.width + 1) / 2;
        const size_t cSize = static_cast<size_t>(p.cStride) * ((src.height + 1) / 2);
        const uint8_t* first = src.data + ySize;
        const uint8_t* second = first + cSize;
        p.u = p.layout == Layout::kPlanarUV ? first : second;
        p.v = p.layout == Layout::kPlanarUV ? second : first;
    }
    return p;
}

// The YUV to RGB matrix of a source. libyuv's limited-range BT.709 and BT.2020
// tables saturate the blue coefficient (above 2), so those two go through the
// fixed-point kernel below instead.
struct Matrix {
    const libyuv::YuvConstants* table;  // null: use the kernel's coefficients
    int32_t yOffset, yGain, crv, cgu, cgv, cbu;  // in units of 1/2^14
};

constexpr int kFracBits = 14;

Matrix kernelMatrix(double kr, double kb, bool full) {
    const double one = 1 << kFracBits;
    const double yScale = full ? 1.0 : 255.0 / 219.0;
    const double cScale = full ? 1.0 : 255.0 / 224.0;
    const double kg = 1 - kr - kb;
    return Matrix{nullptr,
                  full ? 0 : 16,
                  static_cast<int32_t>(std::lround(yScale * one)),
                  static_cast<int32_t>(std::lround(2 * (1 - kr) * cScale * one)),
                  static_cast<int32_t>(std::lround(2 * kb * (1 - kb) / kg * cScale * one)),
                  static_cast<int32_t>(std::lround(2 * kr * (1 - kr) / kg * cScale * one)),
                  static_cast<int32_t>(std::lround(2 * (1 - kb) * cScale * one))};
}

Matrix tableMatrix(const libyuv::YuvConstants* table) {
    Matrix m{};
    m.table = table;
    return m;
}

Matrix matrixOf(const ColorAspects& a) {
    const bool full = a.mRange == ColorAspects::RangeFull;
    bool is709 = a.mMatrixCoeffs == ColorAspects::MatrixBT709_5;
    bool is2020 = a.mMatrixCoeffs == ColorAspects::MatrixBT2020 || a.mMatrixCoeffs == ColorAspects::MatrixBT2020Constant;
    if (a.mMatrixCoeffs == ColorAspects::MatrixUnspecified) {
        is709 = a.mPrimaries == ColorAspects::PrimariesBT709_5;
        is2020 = a.mPrimaries == ColorAspects::PrimariesBT2020;
    }
    if (is709) return full ? tableMatrix(&libyuv::kYuvF709Constants) : kernelMatrix(0.2126, 0.0722, false);
    if (is2020) return full ? tableMatrix(&libyuv::kYuvV2020Constants) : kernelMatrix(0.2627, 0.0593, false);
    return tableMatrix(full ? &libyuv::kYuvJPEGConstants : &libyuv::kYuvI601Constants);
}

inline uint8_t clampTo8(int32_t v) {
    v = (v + (1 << (kFracBits - 1))) >> kFracBits;
    return static_cast<uint8_t>(v < 0 ? 0 : v > 255 ? 255 : v);
}

// One row of 4:2:0 samples to RGB 5:6:5 with the kernel's coefficients.
void kernelRow(const uint8_t* y, const uint8_t* u, const uint8_t* v, uint8_t* out, int width, const Matrix& m) {
    for (int x = 0; x < width; ++x) {
        const int32_t l = (y[x] - m.yOffset) * m.yGain;
        const int32_t cb = u[x / 2] - 128, cr = v[x / 2] - 128;
        const uint8_t r = clampTo8(l + m.crv * cr);
        const uint8_t g = clampTo8(l - m.cgu * cb - m.cgv * cr);
        const uint8_t b = clampTo8(l + m.cbu * cb);
        const uint16_t px = static_cast<uint16_t>(((r >> 3) << 11) | ((g >> 2) << 5) | (b >> 3));
        out[2 * x] = px & 0xFF;
        out[2 * x + 1] = px >> 8;
    }
}

void rowToRgb(const uint8_t* y, const uint8_t* u, const uint8_t* v, uint8_t* out, int width, const Matrix& m) {
    if (m.table != nullptr) {
        libyuv::I420ToRGB565Matrix(y, 0, u, 0, v, 0, out, 0, m.table, width, 1);
    } else {
        kernelRow(y, u, v, out, width, m);
    }
}

struct Rect {
    int32_t left, top, right, bottom;
    int32_t width() const { return right - left + 1; }
    int32_t height() const { return bottom - top + 1; }
};

Rect cropOf(const FrameParam& p) { return Rect{p.cropLeft, p.cropTop, p.cropRight, p.cropBottom}; }

uint8_t* dstOrigin(const FrameParam& dst) {
    return const_cast<uint8_t*>(dst.data) + (static_cast<size_t>(dst.cropTop) * dst.width + dst.cropLeft) * 2;
}

// Row by row, for crops at odd offsets (whose chroma pairs start mid-pair), for
// NV21 and for the kernel's matrices: each row starts at the even column before the crop.
int convertRows(const Planes& p, const Rect& crop, const FrameParam& dst, const Matrix& m) {
    const int left = crop.left & ~1;
    const int rowPixels = crop.right - left + 1;
    const int chroma = (rowPixels + 1) / 2;
    const bool shifted = left != crop.left;
    std::vector<uint8_t> uRow, vRow, rgbRow;
    try {
        uRow.resize(chroma);
        vRow.resize(chroma);
        if (shifted) rgbRow.resize(static_cast<size_t>(rowPixels) * 2);
    } catch (const std::bad_alloc&) {
        return FrameConverter::kConvertNoMemory;
    }
    uint8_t* dstRow = dstOrigin(dst);
    const size_t dstStride = static_cast<size_t>(dst.width) * 2;
    for (int y = crop.top; y <= crop.bottom; ++y, dstRow += dstStride) {
        const uint8_t* yRow = p.y + static_cast<size_t>(y) * p.yStride + left;
        const size_t cOffset = static_cast<size_t>(y / 2) * p.cStride;
        const uint8_t* u;
        const uint8_t* v;
        if (isSemiPlanar(p.layout)) {
            const bool vu = p.layout == Layout::kSemiVU;
            libyuv::SplitUVPlane(p.uv + cOffset + left, 0, vu ? vRow.data() : uRow.data(), 0,
                                 vu ? uRow.data() : vRow.data(), 0, chroma, 1);
            u = uRow.data();
            v = vRow.data();
        } else {
            u = p.u + cOffset + left / 2;
            v = p.v + cOffset + left / 2;
        }
        uint8_t* out = shifted ? rgbRow.data() : dstRow;
        rowToRgb(yRow, u, v, out, rowPixels, m);
        if (shifted) memcpy(dstRow, rgbRow.data() + 2, static_cast<size_t>(crop.width()) * 2);
    }
    return 0;
}

int convertDirect(const Planes& p, const Rect& crop, const FrameParam& dst, const Matrix& m) {
    if ((crop.left & 1) || (crop.top & 1) || p.layout == Layout::kSemiVU || m.table == nullptr) {
        return convertRows(p, crop, dst, m);
    }
    const size_t yOffset = static_cast<size_t>(crop.top) * p.yStride + crop.left;
    const size_t cOffset = static_cast<size_t>(crop.top / 2) * p.cStride;
    const int dstStride = dst.width * 2;
    int r;
    if (p.layout == Layout::kSemiUV) {
        r = libyuv::NV12ToRGB565Matrix(p.y + yOffset, p.yStride, p.uv + cOffset + crop.left, p.cStride,
                                       dstOrigin(dst), dstStride, m.table, crop.width(), crop.height());
    } else {
        r = libyuv::I420ToRGB565Matrix(p.y + yOffset, p.yStride, p.u + cOffset + crop.left / 2, p.cStride,
                                       p.v + cOffset + crop.left / 2, p.cStride, dstOrigin(dst), dstStride, m.table,
                                       crop.width(), crop.height());
    }
    return r == 0 ? 0 : FrameConverter::kConvertRefused;
}

// Scales the source crop to the destination crop's size as I420, then converts that.
int convertScaled(const Planes& p, const Rect& crop, const FrameParam& dst, const Matrix& m) {
    const int dw = cropWidth(dst), dh = cropHeight(dst);
    const int cdw = (dw + 1) / 2, cdh = (dh + 1) / 2;
    const int cl = crop.left / 2, ct = crop.top / 2;
    const int ccw = crop.right / 2 - cl + 1, cch = crop.bottom / 2 - ct + 1;
    std::vector<uint8_t> ty, tu, tv, su, sv;
    try {
        ty.resize(static_cast<size_t>(dw) * dh);
        tu.resize(static_cast<size_t>(cdw) * cdh);
        tv.resize(tu.size());
        if (isSemiPlanar(p.layout)) {
            su.resize(static_cast<size_t>(ccw) * cch);
            sv.resize(su.size());
        }
    } catch (const std::bad_alloc&) {
        return FrameConverter::kConvertNoMemory;
    }
    libyuv::ScalePlane(p.y + static_cast<size_t>(crop.top) * p.yStride + crop.left, p.yStride, crop.width(),
                       crop.height(), ty.data(), dw, dw, dh, libyuv::kFilterBox);
    const size_t cOffset = static_cast<size_t>(ct) * p.cStride;
    const uint8_t* u;
    const uint8_t* v;
    int stride;
    if (isSemiPlanar(p.layout)) {
        const bool vu = p.layout == Layout::kSemiVU;
        libyuv::SplitUVPlane(p.uv + cOffset + 2 * cl, p.cStride, vu ? sv.data() : su.data(), ccw,
                             vu ? su.data() : sv.data(), ccw, ccw, cch);
        u = su.data();
        v = sv.data();
        stride = ccw;
    } else {
        u = p.u + cOffset + cl;
        v = p.v + cOffset + cl;
        stride = p.cStride;
    }
    libyuv::ScalePlane(u, stride, ccw, cch, tu.data(), cdw, cdw, cdh, libyuv::kFilterBox);
    libyuv::ScalePlane(v, stride, ccw, cch, tv.data(), cdw, cdw, cdh, libyuv::kFilterBox);
    Planes scaled{};
    scaled.y = ty.data();
    scaled.u = tu.data();
    scaled.v = tv.data();
    scaled.yStride = dw;
    scaled.cStride = cdw;
    scaled.layout = Layout::kPlanarUV;
    return convertDirect(scaled, Rect{0, 0, dw - 1, dh - 1}, dst, m);
}

}  // namespace

FrameConverter::FrameConverter() {}

FrameConverter::~FrameConverter() {}

int FrameConverter::getdstParam(FrameParam& src, FrameParam& dst) {
    dst.colorAspects = {ColorAspects::RangeFull, ColorAspects::PrimariesBT709_5, ColorAspects::TransferSRGB,
                        ColorAspects::MatrixBT709_5};
    return 0;
}

int FrameConverter::examine(FrameParam& src, FrameParam& dst) {
    if (!validPicture(src) || !validPicture(dst)) return kBadDescription;
    const Layout layout = layoutOf(src.colorFormat);
    if (layout == Layout::kNone || dst.colorFormat != kColorFormatRGB565) return kUnsupportedPair;
    // Interleaved chroma pairs need an even stride, or the last pair of a row runs into the next.
    if (isSemiPlanar(layout) && (src.width & 1)) return kBadDescription;
    const bool sameSize = cropWidth(src) == cropWidth(dst) && cropHeight(src) == cropHeight(dst);
    return sameSize ? kDirect : kScaled;
}

int FrameConverter::convert(FrameParam& src, FrameParam& dst) {
    const int how = examine(src, dst);
    if (how != kDirect && how != kScaled) return kConvertRefused;
    const Planes planes = planesOf(src);
    const Matrix m = matrixOf(src.colorAspects);
    return how == kDirect ? convertDirect(planes, cropOf(src), dst, m) : convertScaled(planes, cropOf(src), dst, m);
}

}  // namespace KVUCMM
