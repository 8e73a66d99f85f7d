#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "LogCapture.h"
#include "QNMediaAudioConverter.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

using Bytes = std::vector<uint8_t>;

// Index of the first line with this message, or -1.
int indexOf(const LogCapture& logs, const std::string& message) {
    const auto lines = logs.lines();
    for (size_t i = 0; i < lines.size(); ++i) {
        if (lines[i].message == message) return static_cast<int>(i);
    }
    return -1;
}

int countPrefix(const LogCapture& logs, const std::string& prefix) {
    int n = 0;
    for (const auto& l : logs.lines()) n += l.message.rfind(prefix, 0) == 0;
    return n;
}

Bytes le16(const std::vector<int>& v) {
    Bytes b;
    for (int s : v) b.push_back(s & 0xFF), b.push_back((s >> 8) & 0xFF);
    return b;
}
std::vector<int> fromLe16(const Bytes& b, size_t n) {
    std::vector<int> v(n / 2);
    for (size_t i = 0; i < v.size(); ++i) v[i] = static_cast<int16_t>(b[2 * i] | (b[2 * i + 1] << 8));
    return v;
}
std::vector<int> fromLe24(const Bytes& b, size_t n) {
    std::vector<int> v(n / 3);
    for (size_t i = 0; i < v.size(); ++i) {
        v[i] = static_cast<int32_t>(static_cast<uint32_t>(b[3 * i] | (b[3 * i + 1] << 8) | (b[3 * i + 2] << 16)) << 8) >> 8;
    }
    return v;
}

// Converts with enough room for the answer; returns the output bytes.
Bytes run(const sp<QNMediaAudioConverter>& c, Bytes in) {
    unsigned char* out = c->allocateBuff(nullptr, static_cast<int>(in.size()), 1.0f);
    EXPECT_NE(nullptr, out);
    const int n = c->process(in.data(), out, static_cast<int>(in.size()));
    EXPECT_GE(n, 0);
    Bytes r(out, out + std::max(n, 0));
    c->freeBuff(out);
    return r;
}

}  // namespace

TEST(AudioConverterTest, FormatCodesAndInitCallsByWhatDiffers) {
    sp<QNMediaAudioConverter> c = new QNMediaAudioConverter;
    ASSERT_TRUE(c->isValid());
    EXPECT_EQ(1, c->getAudioFormat(8));
    EXPECT_EQ(2, c->getAudioFormat(16));
    EXPECT_EQ(3, c->getAudioFormat(24));
    EXPECT_EQ(4, c->getAudioFormat(32));
    for (int other : {0, 12, 20, 40}) EXPECT_EQ(2, c->getAudioFormat(other));

    LogCapture logs;
    EXPECT_TRUE(c->init(48000, 2, 16, 48000, 2, 16));
    EXPECT_TRUE(logs.contains("initAFC format=2 rate=48000 quality=0 channels=2"));
    EXPECT_EQ(0, countPrefix(logs, "setParamAFC"));

    logs.clear();
    EXPECT_TRUE(c->init(48000, 2, 16, 48000, 2, 24));
    EXPECT_EQ(1, countPrefix(logs, "setParamAFC"));
    EXPECT_TRUE(logs.contains("setParamAFC kind=2 format=3 rate=48000 channels=2"));

    logs.clear();
    EXPECT_TRUE(c->init(44100, 1, 16, 48000, 2, 12));  // 12 bits count as 16
    const int first = indexOf(logs, "setParamAFC kind=0 format=2 rate=48000 channels=2");
    const int second = indexOf(logs, "setParamAFC kind=1 format=2 rate=48000 channels=2");
    ASSERT_GE(first, 0);
    EXPECT_GT(second, first);
    EXPECT_EQ(2, countPrefix(logs, "setParamAFC"));

    c->freeBuff(nullptr);
    c.clear();
    const int deinit = indexOf(logs, "deinitAFC");
    ASSERT_GE(deinit, 0);
    EXPECT_GT(indexOf(logs, "~QNAudioFormatConverter"), deinit);
}

TEST(AudioConverterTest, SampleWidthsRoundAndSaturate) {
    sp<QNMediaAudioConverter> c = new QNMediaAudioConverter;
    const std::vector<int> s16 = {0, 1, -1, 32767, -32768, 1234, -4321};
    ASSERT_TRUE(c->init(48000, 1, 16, 48000, 1, 24));
    std::vector<int> want24;
    for (int s : s16) want24.push_back(s * 256);
    Bytes out = run(c, le16(s16));
    EXPECT_EQ(want24, fromLe24(out, out.size()));

    // 24 to 16: to the nearest step, the top saturating rather than wrapping.
    const std::vector<int> s24 = {0x7FFFFF, -0x800000, 0x180, 0x17F, -0x180, -0x181, 0x7FFF80};
    Bytes in24;
    for (int s : s24) in24.push_back(s & 0xFF), in24.push_back((s >> 8) & 0xFF), in24.push_back((s >> 16) & 0xFF);
    ASSERT_TRUE(c->init(48000, 1, 24, 48000, 1, 16));
    out = run(c, in24);
    std::vector<int> want16;
    for (int s : s24) want16.push_back(std::min(32767, static_cast<int>(std::floor(s / 256.0 + 0.5))));
    EXPECT_EQ(want16, fromLe16(out, out.size()));

    // 8-bit is unsigned around 128.
    ASSERT_TRUE(c->init(8000, 1, 8, 8000, 1, 16));
    out = run(c, {0, 128, 255, 1});
    EXPECT_EQ((std::vector<int>{-32768, 0, 32512, -32512}), fromLe16(out, out.size()));
}

TEST(AudioConverterTest, ChannelMixAndPartialFrames) {
    sp<QNMediaAudioConverter> c = new QNMediaAudioConverter;
    ASSERT_TRUE(c->init(48000, 2, 16, 48000, 1, 16));
    Bytes in = le16({100, 300, -32768, -32768, 32767, 32767, 5, -6});
    in.push_back(0x55);  // a stray byte is not a frame
    Bytes out = run(c, in);
    EXPECT_EQ((std::vector<int>{200, -32768, 32767, 0}), fromLe16(out, out.size()));  // -0.5 rounds up

    ASSERT_TRUE(c->init(48000, 1, 16, 48000, 2, 16));
    out = run(c, le16({7, -9}));
    EXPECT_EQ((std::vector<int>{7, 7, -9, -9}), fromLe16(out, out.size()));
}

TEST(AudioConverterTest, ResamplesASineToTheNewRate) {
    sp<QNMediaAudioConverter> c = new QNMediaAudioConverter;
    const int inRate = 44100, outRate = 48000, seconds = 1;
    ASSERT_TRUE(c->init(inRate, 2, 16, outRate, 2, 16));
    std::vector<int> pcm;
    for (int i = 0; i < inRate * seconds; ++i) {
        const int v = static_cast<int>(std::lround(16000 * std::sin(2 * M_PI * 1000.0 * i / inRate)));
        pcm.push_back(v);
        pcm.push_back(-v);
    }
    const Bytes in = le16(pcm);
    std::vector<int> got;
    const int chunk = 4096;  // several calls, as a stream arrives
    unsigned char* out = c->allocateBuff(nullptr, chunk, 1.0f);
    ASSERT_NE(nullptr, out);
    for (size_t pos = 0; pos <= in.size(); pos += chunk) {
        const int n = static_cast<int>(std::min<size_t>(chunk, in.size() - pos));
        const int made = c->process(n ? const_cast<uint8_t*>(in.data() + pos) : nullptr, out, n);
        ASSERT_GE(made, 0);
        const Bytes b(out, out + made);
        const auto v = fromLe16(b, b.size());
        got.insert(got.end(), v.begin(), v.end());
    }
    for (int made; (made = c->process(nullptr, out, 0)) > 0;) {
        const Bytes b(out, out + made);
        const auto v = fromLe16(b, b.size());
        got.insert(got.end(), v.begin(), v.end());
    }
    c->freeBuff(out);
    const int frames = static_cast<int>(got.size() / 2);
    EXPECT_NEAR(outRate * seconds, frames, 2);
    double worst = 0;
    for (int i = 200; i < frames - 200; ++i) {
        const double want = 16000 * std::sin(2 * M_PI * 1000.0 * i / outRate);
        worst = std::max(worst, std::fabs(got[2 * i] - want));
        ASSERT_NEAR(got[2 * i], -got[2 * i + 1], 1);
    }
    EXPECT_LT(worst, 8.0);  // well under -60 dB of the tone
}
