#include <gtest/gtest.h>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include <cstring>
#include <random>
#include <vector>

#include "LogCapture.h"
#include "QNMediaAudioWaveForm.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

using Bytes = std::vector<uint8_t>;

sp<AMessage> pcmFormat(int channels, int bits, int rate, int interview = -1) {
    sp<AMessage> f = new AMessage;
    f->setInt32("channel-count", channels);
    f->setInt32("bits-per-sample", bits);
    f->setInt32("sample-rate", rate);
    if (interview >= 0) f->setInt32("AM-interview", interview);
    return f;
}

sp<QNMediaAudioWaveForm> building(int channels, int bits, int rate, int interview = -1) {
    sp<QNMediaAudioWaveForm> w = new QNMediaAudioWaveForm;
    sp<AMessage> f = pcmFormat(channels, bits, rate, interview);
    w->init(f);
    return w;
}

void feed(const sp<QNMediaAudioWaveForm>& w, const uint8_t* p, size_t n) {
    sp<ABuffer> b = ABuffer::CreateAsCopy(p, n);  // exact size: over-reads are caught
    ASSERT_EQ(OK, w->addSample(b));
}

Bytes pcm16(const std::vector<int16_t>& s) {
    Bytes b(s.size() * 2);
    memcpy(b.data(), s.data(), b.size());
    return b;
}

std::vector<uint16_t> valuesOf(const sp<QNMediaAudioWaveForm>& w) {
    sp<ABuffer> buf;
    int count = 0;
    if (w->getSamples(&buf, &count) != OK) return {};
    EXPECT_EQ(static_cast<size_t>(2 * count), buf->size());
    std::vector<uint16_t> v(count);
    for (int i = 0; i < count; ++i) v[i] = static_cast<uint16_t>((buf->data()[2 * i] << 8) | buf->data()[2 * i + 1]);
    return v;
}

// The waveform worked out frame by frame from the description of the values.
std::vector<uint16_t> reference(const Bytes& pcm, int channels, int bytesPerSample, int rate, bool interview) {
    const int frameBytes = channels * bytesPerSample;
    const int perValue = rate / 50;
    std::vector<uint16_t> out;
    int left = 0, right = 0, mono = 0, inInterval = 0;
    auto top16 = [&](size_t off) {
        if (bytesPerSample == 2) return static_cast<int>(static_cast<int16_t>(pcm[off] | (pcm[off + 1] << 8)));
        return static_cast<int>(static_cast<int16_t>(pcm[off + 1] | (pcm[off + 2] << 8)));
    };
    // -32768 (or -128 for the top byte) does not count as a magnitude.
    auto mag = [](int v, int most) { return v == -most ? 0 : (v < 0 ? -v : v); };
    for (size_t f = 0; f + frameBytes <= pcm.size(); f += frameBytes) {
        if (channels == 1) {
            mono = std::max(mono, mag(top16(f), 32768));
        } else if (bytesPerSample == 2) {
            left = std::max(left, mag(top16(f), 32768) >> 8);
            right = std::max(right, mag(top16(f + 2), 32768) >> 8);
        } else {
            left = std::max(left, mag(static_cast<int8_t>(pcm[f + 2]), 128));
            right = std::max(right, mag(static_cast<int8_t>(pcm[f + 5]), 128));
        }
        if (++inInterval == perValue) {
            if (channels == 1) out.push_back(mono);
            else if (interview) out.push_back((left << 8) | right);
            else out.push_back((left + right) * 128);
            left = right = mono = inInterval = 0;
        }
    }
    return out;
}

Bytes noise(size_t bytes, uint32_t seed) {
    std::mt19937 rng(seed);
    Bytes b(bytes);
    for (auto& x : b) x = static_cast<uint8_t>(rng());
    // Some extremes that wrap.
    for (size_t i = 1; i + 1 < b.size(); i += 997) b[i] = 0x80, b[i - 1] = 0x00;
    return b;
}

}  // namespace

TEST(AudioWaveFormTest, IntervalFollowsSampleRate) {
    LogCapture logs;
    sp<QNMediaAudioWaveForm> w = building(1, 16, 44100);
    EXPECT_TRUE(w->isValid());
    EXPECT_TRUE(logs.contains("make waveform frameinterval = 881"));
    EXPECT_FALSE(logs.contains("The interval-count is weird"));
    std::vector<int16_t> s(882 * 3 - 1, 5);
    const Bytes b = pcm16(s);
    feed(w, b.data(), b.size());
    EXPECT_EQ(2u, valuesOf(w).size());  // the third interval is one frame short

    logs.clear();
    sp<QNMediaAudioWaveForm> odd = building(1, 16, 11025);
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_WARN, "The interval-count is weird"));
    EXPECT_TRUE(logs.contains("make waveform frameinterval = 219"));
}

TEST(AudioWaveFormTest, ExampleValues) {
    sp<QNMediaAudioWaveForm> mono = building(1, 16, 150);  // three frames per value
    Bytes b = pcm16({100, -300, 200, -32768, 0, 0, 7, -7, 1});
    feed(mono, b.data(), b.size());
    sp<ABuffer> buf;
    int count = 0;
    ASSERT_EQ(OK, mono->getSamples(&buf, &count));
    ASSERT_EQ(3, count);
    EXPECT_EQ(0x01, buf->data()[0]);
    EXPECT_EQ(0x2C, buf->data()[1]);
    EXPECT_EQ(0, buf->data()[2] | buf->data()[3]);  // -32768 does not count
    EXPECT_EQ(7, buf->data()[5]);

    b = pcm16({0x4000, 0x100, -0x1000, 0x2000});
    sp<QNMediaAudioWaveForm> mixed = building(2, 16, 100);
    feed(mixed, b.data(), b.size());
    EXPECT_EQ(std::vector<uint16_t>{0x3000}, valuesOf(mixed));
    sp<QNMediaAudioWaveForm> apart = building(2, 16, 100, 1);
    feed(apart, b.data(), b.size());
    EXPECT_EQ(std::vector<uint16_t>{0x4020}, valuesOf(apart));

    const Bytes s24 = {0x00, 0x80, 0x12, 0x00, 0x00, 0x00};
    sp<QNMediaAudioWaveForm> w24 = building(1, 24, 100);
    feed(w24, s24.data(), s24.size());
    EXPECT_EQ(std::vector<uint16_t>{0x1280}, valuesOf(w24));
}

TEST(AudioWaveFormTest, MatchesFrameByFrameReferenceHoweverTheBuffersAreCut) {
    struct Case { int channels, bits, rate, interview; };
    const Case cases[] = {{1, 16, 8000, 0}, {2, 16, 44100, 0}, {2, 16, 48000, 1},
                          {1, 24, 48000, 0}, {2, 24, 44100, 0}, {2, 24, 32000, 1}};
    for (const Case& c : cases) {
        const int frameBytes = c.channels * c.bits / 8;
        const Bytes pcm = noise(static_cast<size_t>(frameBytes) * (c.rate / 50) * 23 + frameBytes * 7, c.rate + c.bits);
        const std::vector<uint16_t> want = reference(pcm, c.channels, c.bits / 8, c.rate, c.interview);
        ASSERT_EQ(23u, want.size());

        sp<QNMediaAudioWaveForm> whole = building(c.channels, c.bits, c.rate, c.interview);
        feed(whole, pcm.data(), pcm.size());
        EXPECT_EQ(want, valuesOf(whole)) << c.channels << "x" << c.bits;

        std::mt19937 rng(c.rate);
        sp<QNMediaAudioWaveForm> pieces = building(c.channels, c.bits, c.rate, c.interview);
        for (size_t pos = 0; pos < pcm.size();) {
            const size_t frames = rng() % 700;  // zero-length buffers included
            const size_t n = std::min(pcm.size() - pos, frames * frameBytes);
            feed(pieces, pcm.data() + pos, n);
            pos += n;
        }
        EXPECT_EQ(want, valuesOf(pieces)) << c.channels << "x" << c.bits;
    }
}

TEST(AudioWaveFormTest, PartialTrailingFramesAreIgnoredWithoutOverRead) {
    const Bytes pcm = noise(4 * 882 * 3, 9);
    sp<QNMediaAudioWaveForm> w = building(2, 16, 44100);
    // 2 x 1000 frames plus 2, 1 and 3 stray bytes.
    for (size_t extra : {2u, 1u, 3u}) {
        std::vector<uint8_t> chunk(pcm.begin(), pcm.begin() + 4000 + extra);
        feed(w, chunk.data(), chunk.size());
    }
    const Bytes whole(pcm.begin(), pcm.begin() + 4000);
    Bytes thrice;
    for (int i = 0; i < 3; ++i) thrice.insert(thrice.end(), whole.begin(), whole.end());
    EXPECT_EQ(reference(thrice, 2, 2, 44100, false), valuesOf(w));

    sp<QNMediaAudioWaveForm> w24 = building(2, 24, 44100);
    const Bytes five(pcm.begin(), pcm.begin() + 5);
    feed(w24, five.data(), five.size());  // less than one frame
    sp<ABuffer> empty = new ABuffer(0);
    EXPECT_EQ(OK, w24->addSample(empty));
}

TEST(AudioWaveFormTest, ValueLimitAndLowRates) {
    LogCapture logs;
    sp<QNMediaAudioWaveForm> w = building(1, 16, 100);
    const Bytes quiet(2 * 2 * QNMediaAudioWaveForm::kMaxWaveFormCount, 0);
    feed(w, quiet.data(), quiet.size());
    sp<ABuffer> buf;
    int count = 0;
    EXPECT_EQ(QNMediaAudioWaveForm::kError, w->getSamples(&buf, &count));
    EXPECT_TRUE(logs.contains("invalid mWaveFormCount = 359997"));
    EXPECT_TRUE(w->isValid());
    feed(w, quiet.data(), 4);
    EXPECT_TRUE(logs.contains("too many data, ignore"));
    EXPECT_FALSE(w->isValid());
    logs.clear();
    EXPECT_EQ(QNMediaAudioWaveForm::kError, w->getSamples(&buf, &count));
    EXPECT_TRUE(logs.contains("invalid"));

    for (int rate : {99, 49, 0}) {
        sp<QNMediaAudioWaveForm> slow = building(1, 16, rate);
        EXPECT_TRUE(slow->isValid());
        feed(slow, quiet.data(), 20000);
        EXPECT_EQ(QNMediaAudioWaveForm::kError, slow->getSamples(&buf, &count));
    }
}

TEST(AudioWaveFormTest, ExistingWaveFormAndRefusedFormats) {
    LogCapture logs;
    sp<AMessage> f = pcmFormat(6, 8, 44100);
    const Bytes given = {1, 2, 3, 4, 5, 6, 7};
    f->setBuffer("AM-waveform", ABuffer::CreateAsCopy(given.data(), given.size()));
    f->setInt32("AM-not-encode", 1);
    sp<QNMediaAudioWaveForm> w = new QNMediaAudioWaveForm;
    EXPECT_EQ(OK, w->init(f));
    EXPECT_TRUE(logs.contains("use exist waveform"));
    EXPECT_FALSE(w->isValid());
    sp<ABuffer> s = ABuffer::CreateAsCopy(given.data(), 4);
    EXPECT_EQ(QNMediaAudioWaveForm::kError, w->addSample(s));
    EXPECT_TRUE(logs.contains("not supported format"));
    EXPECT_EQ((std::vector<uint16_t>{0x0102, 0x0304, 0x0506}), valuesOf(w));
    w->cancel();
    sp<ABuffer> buf;
    int count = 0;
    EXPECT_EQ(QNMediaAudioWaveForm::kError, w->getSamples(&buf, &count));

    struct Case { int channels, bits; };
    for (const Case& c : {Case{1, 8}, Case{2, 32}, Case{3, 16}, Case{0, 16}}) {
        logs.clear();
        sp<QNMediaAudioWaveForm> no = building(c.channels, c.bits, 48000);
        EXPECT_FALSE(no->isValid());
        EXPECT_TRUE(logs.contains("not use waveform"));
        EXPECT_EQ(QNMediaAudioWaveForm::kError, no->addSample(s));
    }

    logs.clear();
    sp<AMessage> notEncode = pcmFormat(2, 16, 48000);
    notEncode->setInt32("AM-not-encode", 1);
    sp<QNMediaAudioWaveForm> ne = new QNMediaAudioWaveForm;
    ne->init(notEncode);
    EXPECT_FALSE(ne->isValid());
    EXPECT_TRUE(logs.contains("not use encoder"));

    sp<AMessage> missing = new AMessage;
    missing->setInt32("channel-count", 2);
    sp<QNMediaAudioWaveForm> m = new QNMediaAudioWaveForm;
    logs.clear();
    m->init(missing);
    EXPECT_TRUE(logs.contains("not use waveform"));
    sp<AMessage> none;
    m->init(none);
    EXPECT_FALSE(m->isValid());
}
