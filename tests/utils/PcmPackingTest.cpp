#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>

#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

// The portable kernels, which machines with vector units do not reach
// through the public operations.
namespace android::qnmediaeditor::detail {
int packFloatsPortable(const float* in, uint8_t* out, int count);
int packWordsPortable(const uint32_t* in, uint8_t* out, int count);
}  // namespace android::qnmediaeditor::detail

namespace {

// The definition, written out plainly: clip, scale in single precision,
// round in double precision, halves away from zero.
int32_t referenceFloat(float x) {
    if (x <= -1.0f) return -8388608;
    if (x >= 0.99999988079071044921875f) return 8388607;
    if (std::isnan(x)) return 0;
    const double product = static_cast<double>(x * 8388608.0f);
    return static_cast<int32_t>(product > 0 ? product + 0.5 : product - 0.5);
}

Bytes referencePackFloats(const std::vector<float>& in) {
    Bytes out;
    for (float x : in) {
        const uint32_t v = static_cast<uint32_t>(referenceFloat(x));
        out.insert(out.end(), {uint8_t(v), uint8_t(v >> 8), uint8_t(v >> 16)});
    }
    return out;
}

Bytes referencePackWords(const std::vector<uint32_t>& in) {
    Bytes out;
    for (uint32_t w : in) out.insert(out.end(), {uint8_t(w >> 8), uint8_t(w >> 16), uint8_t(w >> 24)});
    return out;
}

float fromBits(uint32_t bits) {
    float f;
    memcpy(&f, &bits, 4);
    return f;
}

// Packs in place at a given misalignment and returns the packed bytes.
template <typename T>
Bytes packInPlace(const std::vector<T>& samples, size_t misalign) {
    Bytes storage(misalign + 4 * samples.size());
    memcpy(storage.data() + misalign, samples.data(), 4 * samples.size());
    T* in = reinterpret_cast<T*>(storage.data() + misalign);
    QNMediaEditorUtils::ConvertXto24packed(in, storage.data() + misalign, static_cast<int>(samples.size()), false);
    return Bytes(storage.begin() + misalign, storage.begin() + misalign + 3 * samples.size());
}

std::vector<float> interestingFloats() {
    std::vector<float> v = {0.0f, -0.0f, 0.5f, -0.5f, 1.0f, -1.0f, 2.0f, -2.0f,
                            std::numeric_limits<float>::infinity(), -std::numeric_limits<float>::infinity(),
                            std::numeric_limits<float>::quiet_NaN(), fromBits(0xFFC00001), fromBits(0x7F800001),
                            fromBits(0x3F7FFFFE), fromBits(0x3F7FFFFF), fromBits(0xBF7FFFFF), fromBits(0x00000001),
                            fromBits(0x80000001), 1e-30f, 3e38f, -3e38f};
    for (int k : {0, 1, 2, 3, 100, 4194303, 8388606}) {
        for (float sign : {1.0f, -1.0f}) {
            const float half = sign * (k + 0.5f) / 8388608.0f;  // exactly between two steps
            v.push_back(half);
            v.push_back(std::nextafter(half, 0.0f));
            v.push_back(std::nextafter(half, 2.0f * half));
        }
    }
    v.push_back(fromBits(0x33FFFFFF));  // 0.5 - 2^-25 after scaling: must round to 0
    return v;
}

}  // namespace

TEST(PcmPackingTest, FloatExamplesRoundAndClip) {
    const std::vector<float> in = {0.0f, 0.5f, -0.5f, 1.0f, -1.0f, 2.0f, std::numeric_limits<float>::quiet_NaN(),
                                   1.0f / 16777216.0f, -1.0f / 16777216.0f};
    const int32_t expected[] = {0, 4194304, -4194304, 8388607, -8388608, 8388607, 0, 1, -1};
    const Bytes packed = packInPlace(in, 0);
    for (size_t i = 0; i < in.size(); ++i) {
        const int32_t v = int32_t(uint32_t(packed[3 * i]) << 8 | uint32_t(packed[3 * i + 1]) << 16 |
                                  uint32_t(packed[3 * i + 2]) << 24) >> 8;
        EXPECT_EQ(expected[i], v) << i;
    }
    EXPECT_EQ((Bytes{0x00, 0x00, 0x40}), Bytes(packed.begin() + 3, packed.begin() + 6));
    EXPECT_EQ((Bytes{0x00, 0x00, 0xC0}), Bytes(packed.begin() + 6, packed.begin() + 9));
    EXPECT_EQ((Bytes{0xFF, 0xFF, 0xFF}), Bytes(packed.end() - 3, packed.end()));
}

TEST(PcmPackingTest, FloatPathMatchesTheReferenceBitForBit) {
    std::vector<float> in = interestingFloats();
    std::mt19937 rng(1234);
    std::uniform_real_distribution<float> near(-1.1f, 1.1f);
    for (int i = 0; i < 200000; ++i) in.push_back(near(rng));
    for (int i = 0; i < 200000; ++i) in.push_back(fromBits(rng()));
    for (int i = 0; i < 50000; ++i) {  // near the rounding boundaries
        const float half = (static_cast<int32_t>(rng() % 16777216) - 8388608 + 0.5f) / 8388608.0f;
        in.push_back(std::nextafter(half, (i & 1) ? 2.0f : -2.0f));
    }
    const Bytes expected = referencePackFloats(in);
    for (size_t misalign : {0, 1, 3}) EXPECT_EQ(expected, packInPlace(in, misalign)) << misalign;
    Bytes portable(3 * in.size());
    const int done = detail::packFloatsPortable(in.data(), portable.data(), static_cast<int>(in.size()));
    ASSERT_EQ(in.size() / 4 * 4, size_t(done));
    EXPECT_EQ(Bytes(expected.begin(), expected.begin() + 3 * done), Bytes(portable.begin(), portable.begin() + 3 * done));
    // Every count up to a few vector groups, into an exactly sized output:
    // tails are handled and nothing is written past the end.
    for (size_t n = 1; n <= 40; ++n) {
        const std::vector<float> part(in.begin() + 10, in.begin() + 10 + n);
        std::vector<uint8_t> out(3 * n);
        QNMediaEditorUtils::ConvertXto24packed(const_cast<float*>(part.data()), out.data(), static_cast<int>(n), false);
        EXPECT_EQ(referencePackFloats(part), out) << n;
        EXPECT_EQ(referencePackFloats(part), packInPlace(part, 0)) << n;
    }
}

TEST(PcmPackingTest, IntegerWordsKeepTheirTopBytes) {
    EXPECT_EQ((Bytes{0x56, 0x34, 0x12, 0x00, 0x00, 0x80, 0xFF, 0xFF, 0x7F}),
              packInPlace(std::vector<uint32_t>{0x12345678, 0x80000000, 0x7FFFFFFF}, 0));
    std::vector<uint32_t> in;
    std::mt19937 rng(99);
    for (int i = 0; i < 100003; ++i) in.push_back(rng());
    const Bytes expected = referencePackWords(in);
    for (size_t misalign : {0, 2}) EXPECT_EQ(expected, packInPlace(in, misalign));
    Bytes portable(3 * in.size());
    const int done = detail::packWordsPortable(in.data(), portable.data(), static_cast<int>(in.size()));
    EXPECT_EQ(Bytes(expected.begin(), expected.begin() + 3 * done), Bytes(portable.begin(), portable.begin() + 3 * done));

    // Separate output, and the other byte order.
    uint32_t words[2] = {0x12345678, 0xA1B2C3D4};
    uint8_t out[6] = {};
    QNMediaEditorUtils::ConvertXto24packed(words, out, 2, true);
    EXPECT_EQ((Bytes{0x12, 0x34, 0x56, 0xA1, 0xB2, 0xC3}), Bytes(out, out + 6));
    QNMediaEditorUtils::ConvertXto24packed(words, out, 0, false);  // nothing to do
    QNMediaEditorUtils::ConvertXto24packed(words, out, -5, false);
    EXPECT_EQ(0x12, out[0]);
}

TEST(PcmPackingTest, BuffersArePackedInPlaceAndTheirRangeShrinks) {
    std::vector<uint32_t> words = {0x12345678, 0x80000000};
    Bytes bytes(10, 0xEE);
    memcpy(bytes.data(), words.data(), 8);
    sp<ABuffer> buffer = bufferOf(bytes);
    ASSERT_EQ(OK, QNMediaEditorUtils::ConvertXto24packed(buffer, kEditorAudioEncodingPcm32bit));
    EXPECT_EQ(0u, buffer->offset());
    EXPECT_EQ((Bytes{0x56, 0x34, 0x12, 0x00, 0x00, 0x80}), bytesOf(buffer));

    const float floats[2] = {0.5f, -0.5f};
    sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, ABuffer::CreateAsCopy(floats, 8));
    ASSERT_EQ(OK, QNMediaEditorUtils::ConvertXto24packed(codec, kEditorAudioEncodingPcmFloat));
    EXPECT_EQ(6u, codec->size());
    EXPECT_EQ((Bytes{0x00, 0x00, 0x40, 0x00, 0x00, 0xC0}), Bytes(codec->data(), codec->data() + 6));

    // A range that starts further in still yields a range over the packed bytes.
    sp<ABuffer> offsetBuffer = bufferOf({0xEE, 0xEE, 0xEE, 0x78, 0x56, 0x34, 0x12, 0x00, 0x00, 0x00, 0x80});
    offsetBuffer->setRange(3, 8);
    ASSERT_EQ(OK, QNMediaEditorUtils::ConvertXto24packed(offsetBuffer, kEditorAudioEncodingPcm32bit));
    EXPECT_EQ((Bytes{0x56, 0x34, 0x12, 0x00, 0x00, 0x80}), bytesOf(offsetBuffer));

    LogCapture log;
    sp<ABuffer> pcm16 = bufferOf(bytes);
    EXPECT_EQ(ERROR_UNSUPPORTED, QNMediaEditorUtils::ConvertXto24packed(pcm16, kEditorAudioEncodingPcm16bit));
    EXPECT_TRUE(log.contains("not support type 2"));
    EXPECT_EQ(bytes, bytesOf(pcm16));
}

TEST(PcmPackingTest, OnlyThirtyTwoBitTracksAreMarkedForPacking) {
    auto meta = [](int32_t bits, int32_t encoding) {
        sp<MetaData> m = new MetaData;
        m->setInt32(kEditorKeyBitsPerSample, bits);
        if (encoding != 0) m->setInt32(kEditorKeyPcmEncoding, encoding);
        return m;
    };
    int type = -1;
    sp<MetaData> m = meta(32, kEditorAudioEncodingPcmFloat);
    {
        LogCapture log;
        ASSERT_TRUE(QNMediaEditorUtils::IsNeedConvert32To24(m, &type));
        EXPECT_TRUE(log.contains("pcmencoding 4"));
    }
    EXPECT_EQ(4, type);
    int32_t v = 0;
    EXPECT_TRUE(m->findInt32(kEditorKeyPcmEncoding, &v) && v == kEditorAudioEncodingPcm24bitPacked);
    EXPECT_TRUE(m->findInt32(kEditorKeySampleBits, &v) && v == 24);
    EXPECT_TRUE(m->findInt32(kEditorKeyBitsPerSample, &v) && v == 24);

    m = meta(32, kEditorAudioEncodingPcm32bit);
    EXPECT_TRUE(QNMediaEditorUtils::IsNeedConvert32To24(m, &type));
    EXPECT_EQ(101, type);

    for (sp<MetaData> unchanged : {meta(24, kEditorAudioEncodingPcmFloat), meta(32, 0),
                                   meta(32, kEditorAudioEncodingPcm16bit)}) {
        const String8 before = unchanged->toString();
        type = -1;
        EXPECT_FALSE(QNMediaEditorUtils::IsNeedConvert32To24(unchanged, &type));
        EXPECT_EQ(-1, type);
        EXPECT_EQ(before, unchanged->toString());
    }
    LogCapture log;
    EXPECT_FALSE(QNMediaEditorUtils::IsNeedConvert32To24(m, nullptr));
    EXPECT_TRUE(log.contains("pcm type is null"));
}
