#include <gtest/gtest.h>

#include <cstring>

#include <media/stagefright/MediaDefs.h>

#include "extractor/DeviceKeys.h"
#include "extractor/Sniffers.h"
#include "extractors/AudioMediaFacts.h"

using namespace android;
using namespace audiotest;

namespace {

struct WavCase {
    const char* file;
    int32_t encoding;
};

const WavCase kWavCases[] = {
    {"u8_mono.wav", 3},      {"s16_stereo.wav", 2}, {"s24_mono.wav", 100},
    {"s32_stereo.wav", 101}, {"f32_mono.wav", 4},   {"s24_ext_6ch.wav", 100},
};

size_t DataOffset(const std::vector<uint8_t>& bytes) {
    for (size_t i = 12; i + 8 <= bytes.size(); ++i) {
        if (memcmp(&bytes[i], "data", 4) == 0) return i + 8;
    }
    return 0;
}

int64_t FirstTimeAfterSeek(const sp<IMediaSource>& track, int64_t timeUs, MediaTrack::ReadOptions::SeekMode mode) {
    MediaTrack::ReadOptions options;
    options.setSeekTo(timeUs, mode);
    std::vector<Sample> samples;
    ReadSamples(track, &samples, 1, &options);
    return samples.empty() ? -1 : samples[0].timeUs;
}

}  // namespace

TEST(WAVExtractorTest, DeliversTheDataChunkInWholeFramesWithFormatKeys) {
    for (const WavCase& c : kWavCases) {
        SCOPED_TRACE(c.file);
        sp<IMediaExtractor> extractor = CreateWAVExtractor(OpenMedia(c.file));
        ASSERT_NE(extractor, nullptr);
        const char* mime;
        sp<MetaData> fileMeta = extractor->getMetaData();
        ASSERT_TRUE(fileMeta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_CONTAINER_WAV);
        ASSERT_EQ(extractor->countTracks(), 1u);

        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        const int32_t rate = FactInt(c.file, "rate"), channels = FactInt(c.file, "channels");
        const int32_t bits = FactInt(c.file, "bits");
        const int64_t frames = FactInt(c.file, "frames");
        int32_t v;
        int64_t duration;
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_RAW);
        EXPECT_TRUE(meta->findInt32(kKeySampleRate, &v) && v == rate);
        EXPECT_TRUE(meta->findInt32(kKeyChannelCount, &v) && v == channels);
        EXPECT_TRUE(meta->findInt32(kKeyBitsPerSample, &v) && v == bits);
        EXPECT_TRUE(meta->findInt32(kKeyDeviceBitsPerSample, &v) && v == bits);
        EXPECT_TRUE(meta->findInt32(kKeyPcmEncoding, &v) && v == c.encoding);
        EXPECT_TRUE(meta->findInt32(kKeyBitRate, &v) && v == rate * channels * bits);
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &duration));
        EXPECT_EQ(duration, frames * 1000000 / rate);
        int32_t maxInput;
        ASSERT_TRUE(meta->findInt32(kKeyMaxInputSize, &maxInput));

        sp<IMediaSource> track = extractor->getTrack(0);
        ASSERT_EQ(track->start(), OK);
        std::vector<Sample> samples;
        EXPECT_EQ(ReadSamples(track, &samples), ERROR_END_OF_STREAM);
        const size_t frameSize = channels * bits / 8;
        int64_t frame = 0;
        for (const Sample& s : samples) {
            ASSERT_EQ(s.bytes.size() % frameSize, 0u);
            ASSERT_LE(s.bytes.size(), static_cast<size_t>(maxInput));
            ASSERT_EQ(s.timeUs, frame * 1000000 / rate);
            ASSERT_EQ(s.sync, 1);
            frame += s.bytes.size() / frameSize;
        }
        EXPECT_EQ(frame, frames);
        EXPECT_GE(samples[0].bytes.size(), std::min<size_t>(4096 - frameSize, frames * frameSize));
        EXPECT_EQ(Hex64(Fnv(Concat(samples))), Fact(c.file, "pcm_fnv"));
        EXPECT_EQ(track->stop(), OK);
    }
}

TEST(WAVExtractorTest, SeekModesRoundToFrames) {
    sp<IMediaExtractor> extractor = CreateWAVExtractor(OpenMedia("s16_stereo.wav"));
    ASSERT_NE(extractor, nullptr);
    sp<IMediaSource> track = extractor->getTrack(0);
    ASSERT_EQ(track->start(), OK);
    typedef MediaTrack::ReadOptions O;
    // 1000 us at 22050 Hz is frame 22.05: frame 22 starts at 997 us, 23 at 1043 us.
    EXPECT_EQ(FirstTimeAfterSeek(track, 1000, O::SEEK_PREVIOUS_SYNC), 997);
    EXPECT_EQ(FirstTimeAfterSeek(track, 1000, O::SEEK_NEXT_SYNC), 1043);
    EXPECT_EQ(FirstTimeAfterSeek(track, 1000, O::SEEK_CLOSEST_SYNC), 997);
    EXPECT_EQ(FirstTimeAfterSeek(track, 1040, O::SEEK_CLOSEST), 1043);
    EXPECT_EQ(FirstTimeAfterSeek(track, 0, O::SEEK_NEXT_SYNC), 0);

    // The bytes after a seek are the frames at that place of the data chunk.
    const std::vector<uint8_t> file = ReadFile("s16_stereo.wav");
    MediaTrack::ReadOptions options;
    options.setSeekTo(250000, O::SEEK_PREVIOUS_SYNC);
    std::vector<Sample> samples;
    ASSERT_EQ(ReadSamples(track, &samples, 1, &options), OK);
    const size_t at = DataOffset(file) + 5512 * 4;  // frame 5512.5 rounded down
    ASSERT_EQ(samples[0].timeUs, 5512LL * 1000000 / 22050);
    EXPECT_TRUE(std::equal(samples[0].bytes.begin(), samples[0].bytes.end(), file.begin() + at));

    options.setSeekTo(10000000, O::SEEK_CLOSEST);
    samples.clear();
    EXPECT_EQ(ReadSamples(track, &samples, 1, &options), ERROR_END_OF_STREAM);
    EXPECT_TRUE(samples.empty());
}

TEST(WAVExtractorTest, PublishesTheDeviceChunks) {
    sp<IMediaExtractor> extractor = CreateWAVExtractor(OpenMedia("items.wav"));
    ASSERT_NE(extractor, nullptr);
    sp<MetaData> file = extractor->getMetaData();
    uint32_t type;
    const void* data;
    size_t size;
    ASSERT_TRUE(file->findData(kKeyDeviceWaveForm, &type, &data, &size));
    EXPECT_EQ(std::vector<uint8_t>(static_cast<const uint8_t*>(data), static_cast<const uint8_t*>(data) + size),
              (std::vector<uint8_t>{0x00, 0x01, 0xFF, 0xFE, 0x7F, 0xFF}));
    const char* text;
    ASSERT_TRUE(file->findCString(kKeyDeviceUserMessage, &text));
    EXPECT_STREQ(text, "hello-device");
    ASSERT_TRUE(file->findCString(kKeyDeviceRecMode, &text));
    EXPECT_STREQ(text, "vr180");
    int64_t bookmark;
    ASSERT_TRUE(extractor->getTrackMetaData(0, 0)->findInt64(kKeyDeviceBookmarkSize, &bookmark));
    EXPECT_EQ(bookmark, 4660);
    // The chunks after the data are not audio.
    sp<IMediaSource> track = extractor->getTrack(0);
    ASSERT_EQ(track->start(), OK);
    std::vector<Sample> samples;
    ReadSamples(track, &samples);
    EXPECT_EQ(Hex64(Fnv(Concat(samples))), Fact("items.wav", "pcm_fnv"));
}

TEST(WAVExtractorTest, DataSizeBeyondTheFileIsClampedToWholeFrames) {
    std::vector<uint8_t> bytes = ReadFile("s16_stereo.wav");
    const size_t data = DataOffset(bytes);
    bytes.resize(data + 1001);  // 250 frames and one stray byte; the header still says more
    sp<IMediaExtractor> extractor = CreateWAVExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    int64_t duration;
    ASSERT_TRUE(extractor->getTrackMetaData(0, 0)->findInt64(kKeyDuration, &duration));
    EXPECT_EQ(duration, 250LL * 1000000 / 22050);
    sp<IMediaSource> track = extractor->getTrack(0);
    ASSERT_EQ(track->start(), OK);
    std::vector<Sample> samples;
    EXPECT_EQ(ReadSamples(track, &samples), ERROR_END_OF_STREAM);
    EXPECT_EQ(Concat(samples), std::vector<uint8_t>(bytes.begin() + data, bytes.begin() + data + 1000));
}

TEST(WAVExtractorTest, RefusesFormatsItCannotDeliver) {
    const std::vector<uint8_t> good = ReadFile("s16_stereo.wav");
    auto patched = [&](size_t at, std::vector<uint8_t> value) {
        std::vector<uint8_t> copy = good;
        std::copy(value.begin(), value.end(), copy.begin() + at);
        return CreateWAVExtractor(MemorySource(copy));
    };
    EXPECT_NE(patched(0, {'R'}), nullptr);
    EXPECT_EQ(patched(20, {0x02, 0x00}), nullptr);  // ADPCM
    EXPECT_EQ(patched(34, {12, 0}), nullptr);       // 12-bit samples
    EXPECT_EQ(patched(32, {3, 0}), nullptr);        // block align that is not a frame
    EXPECT_EQ(patched(22, {0, 0}), nullptr);        // no channels
    EXPECT_EQ(patched(36, {'x'}), nullptr);         // no data chunk
    EXPECT_EQ(patched(8, {'A'}), nullptr);          // not WAVE
}

TEST(WAVExtractorTest, SurvivesTruncationAndCorruption) {
    ExerciseHostileCopies(ReadFile("u8_mono.wav"), 8192, 1, CreateWAVExtractor);  // every prefix and byte
    for (const char* file : {"s24_ext_6ch.wav", "items.wav"}) {
        ExerciseHostileCopies(ReadFile(file), 128, 997, CreateWAVExtractor);
    }
    // The chunk walk stops on a chunk size that runs past the file.
    std::vector<uint8_t> bytes = ReadFile("items.wav");
    const size_t data = DataOffset(bytes);
    const uint32_t dataSize = 11025 * 4;
    bytes[data + dataSize + 4] = 0xFF;  // wafm size becomes huge
    bytes[data + dataSize + 5] = 0xFF;
    bytes[data + dataSize + 6] = 0xFF;
    bytes[data + dataSize + 7] = 0x7F;
    sp<IMediaExtractor> extractor = CreateWAVExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    uint32_t type;
    const void* p;
    size_t size;
    EXPECT_FALSE(extractor->getMetaData()->findData(kKeyDeviceWaveForm, &type, &p, &size));
}
