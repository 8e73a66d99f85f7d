#include <gtest/gtest.h>

#include <kvucmm/FrameConverter.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/ColorUtils.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <random>
#include <vector>

#include "LogCapture.h"
#include "QNMediaEditorColorUtils.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

using Bytes = std::vector<uint8_t>;

struct Layout {
    int32_t format;
    int stride, sliceHeight;
};

// A frame of random samples, smooth enough that scaling keeps it recognisable.
Bytes makeFrame(const Layout& l, uint32_t seed) {
    std::mt19937 rng(seed);
    Bytes f(static_cast<size_t>(l.stride) * l.sliceHeight * 3 / 2 + 64);
    for (auto& b : f) b = static_cast<uint8_t>(rng());
    return f;
}

// The Y, U and V samples of pixel (x, y), read by the layout's definition.
void sampleAt(const Bytes& f, const Layout& l, int x, int y, int* Y, int* U, int* V) {
    const size_t ySize = static_cast<size_t>(l.stride) * l.sliceHeight;
    *Y = f[static_cast<size_t>(y) * l.stride + x];
    const int cx = x / 2, cy = y / 2;
    if (l.format == 21 || l.format == 39 || l.format == KVUCMM::kColorFormatNV21) {
        const size_t at = ySize + static_cast<size_t>(cy) * l.stride + 2 * cx;
        const bool vu = l.format == KVUCMM::kColorFormatNV21;
        *U = f[at + (vu ? 1 : 0)];
        *V = f[at + (vu ? 0 : 1)];
    } else {
        const int cs = (l.stride + 1) / 2;
        const size_t plane = static_cast<size_t>(cs) * ((l.sliceHeight + 1) / 2);
        const size_t at = ySize + static_cast<size_t>(cy) * cs + cx;
        const bool vu = l.format == KVUCMM::kColorFormatYV12;
        *U = f[at + (vu ? plane : 0)];
        *V = f[at + (vu ? 0 : plane)];
    }
}

struct Matrix {
    double kr, kb;
    bool full;
};

// Plain floating-point Y'CbCr to R'G'B', then 5:6:5 by truncation.
uint16_t refPixel(int Y, int U, int V, const Matrix& m) {
    const double y = m.full ? Y / 255.0 : (Y - 16) / 219.0;
    const double cb = m.full ? (U - 128) / 255.0 : (U - 128) / 224.0;
    const double cr = m.full ? (V - 128) / 255.0 : (V - 128) / 224.0;
    const double r = y + 2 * (1 - m.kr) * cr;
    const double b = y + 2 * (1 - m.kb) * cb;
    const double g = (y - m.kr * r - m.kb * b) / (1 - m.kr - m.kb);
    auto q = [](double v) { return static_cast<int>(std::lround(std::min(1.0, std::max(0.0, v)) * 255)); };
    return static_cast<uint16_t>(((q(r) >> 3) << 11) | ((q(g) >> 2) << 5) | (q(b) >> 3));
}

// Largest per-channel difference in 5:6:5 steps.
int channelDiff(uint16_t a, uint16_t b) {
    return std::max({std::abs((a >> 11) - (b >> 11)), std::abs(((a >> 5) & 63) - ((b >> 5) & 63)),
                     std::abs((a & 31) - (b & 31))});
}

sp<AMessage> decoderFormat(const Layout& l, int width, int height) {
    sp<AMessage> f = new AMessage;
    f->setInt32("width", width);
    f->setInt32("height", height);
    f->setInt32("stride", l.stride);
    f->setInt32("slice-height", l.sliceHeight);
    f->setInt32("color-format", l.format);
    return f;
}

// Converts through the wrapper into an exactly sized picture and checks every pixel.
void expectMatchesReference(const sp<AMessage>& format, const Layout& l, int left, int top, int right, int bottom,
                            const Matrix& m) {
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    cu->setOutputFormat(format);
    const Bytes frame = makeFrame(l, l.format + left);
    const int w = right - left + 1, h = bottom - top + 1;
    std::vector<uint16_t> out(static_cast<size_t>(w) * h);
    ASSERT_EQ(OK, cu->convert(frame.data(), reinterpret_cast<const uint8_t*>(out.data())));
    int worst = 0;
    for (int y = 0; y < h; ++y) {
        for (int x = 0; x < w; ++x) {
            int Y, U, V;
            sampleAt(frame, l, left + x, top + y, &Y, &U, &V);
            worst = std::max(worst, channelDiff(refPixel(Y, U, V, m), out[static_cast<size_t>(y) * w + x]));
        }
    }
    EXPECT_LE(worst, 1) << "format " << l.format << " crop " << left << "," << top;
}

const Matrix kBT601Limited{0.299, 0.114, false};

}  // namespace

TEST(ColorAspectsTest, PlatformCodesMapToCodecAspects) {
    ColorAspects a{};
    EXPECT_EQ(OK, ColorUtils::convertPlatformColorAspectsToCodecAspects(2, 2, 3, a));
    EXPECT_EQ(ColorAspects::RangeLimited, a.mRange);
    EXPECT_EQ(ColorAspects::PrimariesBT601_6_625, a.mPrimaries);
    EXPECT_EQ(ColorAspects::TransferSMPTE170M, a.mTransfer);
    EXPECT_EQ(ColorAspects::MatrixBT601_6, a.mMatrixCoeffs);
    EXPECT_EQ(OK, ColorUtils::convertPlatformColorAspectsToCodecAspects(1, 1, 2, a));
    EXPECT_EQ(ColorAspects::RangeFull, a.mRange);
    EXPECT_EQ(ColorAspects::MatrixBT709_5, a.mMatrixCoeffs);
    EXPECT_EQ(ColorAspects::TransferSRGB, a.mTransfer);
    EXPECT_EQ(BAD_VALUE, ColorUtils::convertPlatformColorAspectsToCodecAspects(7, 6, 99, a));
    EXPECT_EQ(ColorAspects::RangeUnspecified, a.mRange);
    EXPECT_EQ(ColorAspects::MatrixBT2020, a.mMatrixCoeffs);

    HDRStaticInfo info{};
    info.sType1.mR = {35400, 14600};
    info.sType1.mMaxContentLightLevel = 1000;
    info.sType1.mMaxFrameAverageLightLevel = 400;
    sp<AMessage> f = new AMessage;
    HDRStaticInfo back{};
    EXPECT_FALSE(ColorUtils::getHDRStaticInfoFromFormat(f, &back));
    ColorUtils::setHDRStaticInfoIntoFormat(info, f);
    ASSERT_TRUE(ColorUtils::getHDRStaticInfoFromFormat(f, &back));
    EXPECT_EQ(35400, back.sType1.mR.x);
    EXPECT_EQ(400, back.sType1.mMaxFrameAverageLightLevel);
    f->setBuffer("hdr-static-info", new ABuffer(24));
    EXPECT_FALSE(ColorUtils::getHDRStaticInfoFromFormat(f, &back));
}

TEST(ColorConverterTest, UnconfiguredRefuses) {
    LogCapture logs;
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    uint8_t px[4] = {};
    EXPECT_EQ(ERROR_UNSUPPORTED, cu->convert(px, px));
    EXPECT_TRUE(logs.contains("invalid", "QNMediaEditorColorUtils"));
}

TEST(ColorConverterTest, EveryLayoutMatchesTheScalarReference) {
    for (int32_t format : {19, 20, 21, 39, static_cast<int32_t>(KVUCMM::kColorFormatNV21),
                           static_cast<int32_t>(KVUCMM::kColorFormatYV12)}) {
        const Layout l{format, 96, 72};
        // Whole picture, no "crop": width x height from the format, rows from stride and slice height.
        expectMatchesReference(decoderFormat(l, 90, 70), l, 0, 0, 89, 69, kBT601Limited);
        // Crops at odd and even offsets, odd sizes.
        for (auto c : {std::array<int, 4>{3, 5, 80, 60}, std::array<int, 4>{2, 4, 94, 70},
                       std::array<int, 4>{1, 1, 1, 1}}) {
            sp<AMessage> f = decoderFormat(l, 96, 72);
            f->setRect("crop", c[0], c[1], c[2], c[3]);
            expectMatchesReference(f, l, c[0], c[1], c[2], c[3], kBT601Limited);
        }
    }
}

TEST(ColorConverterTest, MatrixAndRangeFollowTheColourKeys) {
    const Layout l{21, 64, 48};
    struct Case { int standard, range; Matrix m; };
    const Case cases[] = {{1, 2, {0.2126, 0.0722, false}}, {1, 1, {0.2126, 0.0722, true}},
                          {6, 2, {0.2627, 0.0593, false}}, {6, 1, {0.2627, 0.0593, true}},
                          {4, 1, {0.299, 0.114, true}},    {2, 2, kBT601Limited}};
    for (const Case& c : cases) {
        sp<AMessage> f = decoderFormat(l, 64, 48);
        f->setInt32("color-standard", c.standard);
        f->setInt32("color-range", c.range);
        SCOPED_TRACE(c.standard * 10 + c.range);
        expectMatchesReference(f, l, 0, 0, 63, 47, c.m);
    }
    // HDR static metadata changes the destination's description, not the picture.
    sp<AMessage> hdr = decoderFormat(l, 64, 48);
    HDRStaticInfo info{};
    ColorUtils::setHDRStaticInfoIntoFormat(info, hdr);
    expectMatchesReference(hdr, l, 0, 0, 63, 47, kBT601Limited);
}

TEST(ColorConverterTest, CallerLayoutKeepsItsPictureSizeAndScales) {
    const Layout l{19, 128, 96};
    Bytes frame(static_cast<size_t>(l.stride) * l.sliceHeight * 3 / 2);
    std::fill(frame.begin(), frame.begin() + l.stride * l.sliceHeight, 120);
    std::fill(frame.begin() + l.stride * l.sliceHeight, frame.end(), 90);
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    sp<AMessage> f = new AMessage;
    f->setInt32("color-format", 19);
    // The rectangle says 120 x 80; the picture is 100 x 50 all the same.
    cu->setOutputFormat(f, 128, 96, 0, 0, 119, 79, 100, 50);
    std::vector<uint16_t> out(100 * 50 + 1, 0xBEEF);
    ASSERT_EQ(OK, cu->convert(frame.data(), reinterpret_cast<const uint8_t*>(out.data())));
    const uint16_t want = refPixel(120, 90, 90, kBT601Limited);
    for (size_t i = 0; i < 100 * 50; ++i) ASSERT_LE(channelDiff(want, out[i]), 1) << i;
    EXPECT_EQ(0xBEEF, out[100 * 50]);  // not a pixel more
}

TEST(ColorConverterTest, InconsistentLayoutsAreRefusedNotRead) {
    struct Case { int32_t format; int stride, slice, l, t, r, b, w, h; };
    const Case cases[] = {
        {21, 64, 48, 0, 0, 64, 47, 65, 48},     // crop right beyond the stride
        {21, 64, 48, 0, 0, 63, 48, 64, 49},     // crop bottom beyond the slice height
        {21, 63, 48, 0, 0, 62, 47, 63, 48},     // interleaved chroma with an odd stride
        {19, 64, 48, 10, 0, 5, 47, 0, 48},      // inverted rectangle
        {19, 64, 48, -2, 0, 20, 20, 23, 21},    // negative offset
        {19, 0, 48, 0, 0, 0, 0, 1, 1},          // no stride
        {19, 64, 48, 0, 0, 63, 47, 0, 48},      // empty picture
        {19, 64, 48, 0, 0, 63, 47, -5, 48},     // negative picture
        {0x7F000789, 64, 48, 0, 0, 63, 47, 64, 48},  // unknown colour format
        {6, 64, 48, 0, 0, 63, 47, 64, 48},      // RGB source
    };
    Bytes frame(64 * 48 * 2, 0);
    std::vector<uint16_t> out(64 * 48);
    for (const Case& c : cases) {
        sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
        sp<AMessage> f = new AMessage;
        f->setInt32("color-format", c.format);
        cu->setOutputFormat(f, c.stride, c.slice, c.l, c.t, c.r, c.b, c.w, c.h);
        EXPECT_EQ(ERROR_UNSUPPORTED, cu->convert(frame.data(), reinterpret_cast<const uint8_t*>(out.data())))
            << c.format << " " << c.stride << " " << c.l;
    }
    // A null picture.
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    cu->setOutputFormat(decoderFormat(Layout{21, 64, 48}, 64, 48));
    EXPECT_EQ(ERROR_UNSUPPORTED, cu->convert(nullptr, reinterpret_cast<const uint8_t*>(out.data())));
}

TEST(ColorConverterDeathTest, MissingRequiredKeysStopWithTheirLine) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const char* keys[] = {"width", "height", "stride", "slice-height", "color-format"};
    const char* expect[] = {
        "QNMediaEditorColorUtils:81 CHECK\\(mOutputFormat->findInt32\\(\"width\", &width\\)\\) failed\\.",
        "QNMediaEditorColorUtils:82 CHECK\\(mOutputFormat->findInt32\\(\"height\", &height\\)\\) failed\\.",
        "QNMediaEditorColorUtils:83 CHECK\\(mOutputFormat->findInt32\\(\"stride\", &mStride\\)\\) failed\\.",
        "QNMediaEditorColorUtils:84 CHECK\\(mOutputFormat->findInt32\\(\"slice-height\", "
        "&mSlice_height\\)\\) failed\\.",
        "QNMediaEditorColorUtils:92 CHECK\\(mOutputFormat->findInt32\\(\"color-format\", &mSrcFormat\\)\\) "
        "failed\\.",
    };
    for (int i = 0; i < 5; ++i) {
        sp<AMessage> f = decoderFormat(Layout{21, 64, 48}, 64, 48);
        f->removeEntry(keys[i]);
        sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
        EXPECT_DEATH(cu->setOutputFormat(f), std::string("frameworks/av/services/mediaeditorservice/Utils/") + expect[i]);
    }
    sp<QNMediaEditorColorUtils> cu = new QNMediaEditorColorUtils;
    sp<AMessage> empty = new AMessage;
    EXPECT_DEATH(cu->setOutputFormat(empty, 64, 48, 0, 0, 63, 47, 64, 48),
                 "QNMediaEditorColorUtils:132 CHECK\\(mOutputFormat->findInt32\\(\"color-format\", &mSrcFormat\\)\\)");
}
