// The AAC encoder through our own decoder: the decoded audio lands where the
// PCM was (priming dropped), as long as it, and close to it.

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include <media/stagefright/AacEncoderSource.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "codec/DecodedAudio.h"

namespace codectest {
namespace {

// PCM handed out in buffers of an awkward length (not a multiple of 1024).
class PcmSource : public MediaSource {
public:
    PcmSource(std::vector<int16_t> pcm, int32_t rate, int32_t channels, int32_t bits = 16)
        : mPcm(std::move(pcm)), mFormat(new MetaData) {
        mFormat->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
        mFormat->setInt32(kKeySampleRate, rate);
        mFormat->setInt32(kKeyChannelCount, channels);
        mFormat->setInt32(kKeyBitsPerSample, bits);
        mStep = 1500 * channels;
    }
    status_t start(MetaData*) override { return OK; }
    status_t stop() override { return OK; }
    sp<MetaData> getFormat() override { return mFormat; }
    status_t read(MediaBufferBase** buffer, const ReadOptions*) override {
        if (mAt >= mPcm.size()) return ERROR_END_OF_STREAM;
        const size_t n = std::min(mStep, mPcm.size() - mAt);
        MediaBuffer* b = new MediaBuffer(n * 2);
        b->add_ref();
        memcpy(b->data(), mPcm.data() + mAt, n * 2);
        mAt += n;
        *buffer = b;
        return OK;
    }

private:
    std::vector<int16_t> mPcm;
    sp<MetaData> mFormat;
    size_t mStep = 0, mAt = 0;
};

// A gliding tone with a changing loudness: no two lags look alike.
std::vector<int16_t> Signal(size_t frames, int32_t rate, int32_t channels) {
    std::vector<int16_t> pcm(frames * channels);
    double phase = 0;
    for (size_t i = 0; i < frames; ++i) {
        const double t = double(i) / rate;
        phase += 2 * M_PI * (200 + 1500 * t) / rate;
        const double level = 9000 * (1.2 + std::sin(2 * M_PI * 3 * t));
        for (int32_t c = 0; c < channels; ++c) pcm[i * channels + c] = int16_t(level * std::sin(phase + c));
    }
    return pcm;
}

// The lag (in frames, of the first channel) where `b` best matches `a`.
int BestLag(const std::vector<int16_t>& a, const std::vector<int16_t>& b, int channels, int range) {
    const size_t frames = std::min(a.size(), b.size()) / channels;
    int best = 0;
    double bestSum = -1e300;
    for (int lag = -range; lag <= range; ++lag) {
        double sum = 0;
        for (size_t i = range; i + range < frames; ++i) sum += double(a[i * channels]) * b[(i + lag) * channels];
        if (sum > bestSum) bestSum = sum, best = lag;
    }
    return best;
}

double SnrDb(const std::vector<int16_t>& a, const std::vector<int16_t>& b) {
    double signal = 0, noise = 0;
    for (size_t i = 0; i < std::min(a.size(), b.size()); ++i) {
        signal += double(a[i]) * a[i];
        noise += (double(a[i]) - b[i]) * (double(a[i]) - b[i]);
    }
    return 10 * std::log10(signal / std::max(noise, 1.0));
}

TEST(AacEncoderSource, DecodesInPlaceAndInLength) {
    const struct {
        int32_t rate, channels;
        size_t frames;
    } kCases[] = {{44100, 2, 44100 + 333}, {48000, 1, 30000}, {16000, 1, 16000}, {8000, 2, 700}};
    for (const auto& c : kCases) {
        SCOPED_TRACE(std::to_string(c.rate) + " Hz, " + std::to_string(c.channels) + " ch");
        const std::vector<int16_t> pcm = Signal(c.frames, c.rate, c.channels);
        sp<AacEncoderSource> encoder = AacEncoderSource::Create(new PcmSource(pcm, c.rate, c.channels));
        ASSERT_NE(encoder, nullptr);
        const sp<MetaData> format = encoder->getFormat();
        int32_t delay = -1;
        EXPECT_TRUE(format->findInt32(kKeyEncoderDelay, &delay));
        EXPECT_GT(delay, 0);
        const Decoded d = DecodeAll(encoder);
        EXPECT_EQ(d.status, ERROR_END_OF_STREAM);
        EXPECT_EQ(d.rate, c.rate);
        EXPECT_EQ(d.channels, c.channels);
        ASSERT_FALSE(d.timesUs.empty());
        EXPECT_EQ(d.timesUs.front(), 0);
        // Whole access units: the padding at the end is less than one.
        const size_t frames = d.pcm.size() / c.channels;
        EXPECT_GE(frames, c.frames);
        EXPECT_LT(frames, c.frames + 1024);
        if (c.frames >= 8000) {
            EXPECT_EQ(BestLag(pcm, d.pcm, c.channels, c.rate / 1000 * 5), 0);
            EXPECT_GT(SnrDb(pcm, d.pcm), 12.0);
        }
    }
}

TEST(AacEncoderSource, RefusesWhatAacCannotCarry) {
    LogCapture log;
    const struct {
        int32_t rate, channels, bits;
    } kCases[] = {{7000, 1, 16}, {44100, 3, 16}, {44100, 2, 24}, {0, 2, 16}};
    for (const auto& c : kCases) {
        EXPECT_EQ(AacEncoderSource::Create(new PcmSource({}, c.rate, c.channels, c.bits)), nullptr)
            << c.rate << " Hz " << c.channels << " ch " << c.bits << " bit";
    }
}

TEST(AacEncoderSource, EmptyPcmEndsAtOnce) {
    sp<AacEncoderSource> encoder = AacEncoderSource::Create(new PcmSource({}, 44100, 2));
    ASSERT_NE(encoder, nullptr);
    ASSERT_EQ(encoder->start(), OK);
    MediaBufferBase* b = nullptr;
    EXPECT_EQ(encoder->read(&b), ERROR_END_OF_STREAM);
    EXPECT_EQ(b, nullptr);
    encoder->stop();
}

}  // namespace
}  // namespace codectest
