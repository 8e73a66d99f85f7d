#include <gtest/gtest.h>

#include <cstring>

#include <media/stagefright/MediaDefs.h>

#include "extractor/Sniffers.h"
#include "extractors/AudioMediaFacts.h"

using namespace android;
using namespace audiotest;

namespace {

typedef MediaTrack::ReadOptions O;

std::vector<Sample> ReadTrack(const std::string& file, status_t* end = nullptr, const O* first = nullptr,
                              size_t limit = 1000000) {
    std::vector<Sample> samples;
    sp<IMediaExtractor> extractor = CreateOggExtractor(OpenMedia(file));
    if (extractor == nullptr) return samples;
    sp<IMediaSource> track = extractor->getTrack(0);
    if (track->start() != OK) return samples;
    const status_t err = ReadSamples(track, &samples, limit, first);
    if (end != nullptr) *end = err;
    return samples;
}

std::vector<Sample> ReadAfterSeek(const std::string& file, int64_t timeUs, O::SeekMode mode, size_t limit = 1) {
    O options;
    options.setSeekTo(timeUs, mode);
    return ReadTrack(file, nullptr, &options, limit);
}

}  // namespace

TEST(OggExtractorTest, PacketsCarryGranuleTimesAndValidCounts) {
    for (const char* file : {"stereo.ogg", "mono.ogg"}) {
        SCOPED_TRACE(file);
        sp<IMediaExtractor> extractor = CreateOggExtractor(OpenMedia(file));
        ASSERT_NE(extractor, nullptr);
        sp<MetaData> fileMeta = extractor->getMetaData(), meta = extractor->getTrackMetaData(0, 0);
        const char* mime;
        ASSERT_TRUE(fileMeta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_CONTAINER_OGG);
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_VORBIS);
        int32_t rate, channels, bitrate;
        ASSERT_TRUE(meta->findInt32(kKeySampleRate, &rate));
        ASSERT_TRUE(meta->findInt32(kKeyChannelCount, &channels));
        EXPECT_EQ(channels, std::string(file) == "mono.ogg" ? 1 : 2);
        EXPECT_TRUE(meta->findInt32(kKeyBitRate, &bitrate) && bitrate > 0);
        uint32_t type;
        const void* data;
        size_t size;
        ASSERT_TRUE(meta->findData(kKeyVorbisInfo, &type, &data, &size));
        EXPECT_EQ(size, 30u);
        EXPECT_EQ(memcmp(data, "\x01vorbis", 7), 0);
        ASSERT_TRUE(meta->findData(kKeyVorbisBooks, &type, &data, &size));
        EXPECT_EQ(memcmp(data, "\x05vorbis", 7), 0);
        const int64_t frames = FactInt(file, "frames");
        int64_t duration;
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &duration));
        EXPECT_EQ(duration, frames * 1000000 / rate);

        status_t end;
        const std::vector<Sample> samples = ReadTrack(file, &end);
        EXPECT_EQ(end, ERROR_END_OF_STREAM);
        const std::vector<Packet> packets = Packets(file);
        ASSERT_EQ(samples.size(), packets.size());
        // The first packet only primes the decoder; ffprobe gives it a
        // nominal duration, so times are compared from the second on.
        EXPECT_EQ(samples[0].timeUs, 0);
        EXPECT_EQ(samples[0].valid, 0);
        int64_t kept = 0;
        for (size_t i = 0; i < samples.size(); ++i) {
            ASSERT_EQ(samples[i].bytes.size(), packets[i].size) << i;
            ASSERT_TRUE(samples[i].hasValid) << i;
            ASSERT_EQ(samples[i].sync, 1);
            kept += samples[i].valid;
            if (i == 0) continue;
            ASSERT_EQ(samples[i].timeUs, (packets[i].pts - packets[1].pts) * 1000000 / rate) << i;
            if (i + 1 < samples.size()) ASSERT_EQ(samples[i].valid, packets[i].duration) << i;
        }
        // The final granule position trims the last packet.
        EXPECT_EQ(kept, frames);
    }
}

TEST(OggExtractorTest, SeeksHonourTheModes) {
    const std::vector<Sample> all = ReadTrack("mono.ogg");
    ASSERT_GT(all.size(), 100u);
    auto indexOf = [&](const Sample& s) {
        for (size_t i = 0; i < all.size(); ++i) {
            if (all[i].timeUs == s.timeUs && all[i].bytes == s.bytes) return static_cast<int>(i);
        }
        return -1;
    };
    for (int64_t target : {10000LL, 700000LL, 1500000LL, 2345678LL}) {
        SCOPED_TRACE(target);
        const std::vector<Sample> prev = ReadAfterSeek("mono.ogg", target, O::SEEK_PREVIOUS_SYNC);
        ASSERT_EQ(prev.size(), 1u);
        const int i = indexOf(prev[0]);
        ASSERT_GT(i, 0);
        EXPECT_LE(all[i].timeUs, target);
        EXPECT_GT(all[i + 1].timeUs, target);
        EXPECT_EQ(prev[0].valid, all[i].valid);

        const std::vector<Sample> next = ReadAfterSeek("mono.ogg", target, O::SEEK_NEXT_SYNC);
        ASSERT_EQ(next.size(), 1u);
        EXPECT_EQ(indexOf(next[0]), all[i].timeUs == target ? i : i + 1);

        const std::vector<Sample> closest = ReadAfterSeek("mono.ogg", target, O::SEEK_CLOSEST);
        ASSERT_EQ(closest.size(), 1u);
        const bool later = all[i + 1].timeUs - target < target - all[i].timeUs;
        EXPECT_EQ(indexOf(closest[0]), later ? i + 1 : i);

        // Reading on after a seek continues in order.
        const std::vector<Sample> run = ReadAfterSeek("mono.ogg", target, O::SEEK_PREVIOUS_SYNC, 20);
        for (size_t k = 0; k < run.size(); ++k) EXPECT_EQ(indexOf(run[k]), i + static_cast<int>(k));
    }
    // Back to the start: the priming packet comes first again.
    const std::vector<Sample> start = ReadAfterSeek("mono.ogg", 0, O::SEEK_CLOSEST_SYNC);
    ASSERT_EQ(start.size(), 1u);
    EXPECT_EQ(start[0].bytes, all[0].bytes);
    EXPECT_TRUE(ReadAfterSeek("mono.ogg", 10000000, O::SEEK_PREVIOUS_SYNC).empty());
}

TEST(OggExtractorTest, DamagedPagesAreSkippedNotPassedOn) {
    const std::vector<Sample> all = ReadTrack("mono.ogg");
    std::vector<uint8_t> bytes = ReadFile("mono.ogg");
    bytes[bytes.size() / 2] ^= 0x01;  // one page fails its CRC
    sp<IMediaExtractor> extractor = CreateOggExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    sp<IMediaSource> track = extractor->getTrack(0);
    ASSERT_EQ(track->start(), OK);
    std::vector<Sample> got;
    EXPECT_EQ(ReadSamples(track, &got), ERROR_END_OF_STREAM);
    ASSERT_LT(got.size(), all.size());
    // Every packet handed out is the one the intact file has at that time.
    size_t j = 0;
    for (const Sample& s : got) {
        while (j < all.size() && (all[j].timeUs != s.timeUs || all[j].bytes != s.bytes)) ++j;
        ASSERT_LT(j, all.size()) << s.timeUs;
        EXPECT_EQ(s.valid, all[j].valid);
        ++j;
    }
}

TEST(OggExtractorTest, SurvivesTruncationAndCorruption) {
    ExerciseHostileCopies(ReadFile("stereo.ogg"), 4200, 97, CreateOggExtractor);
    ExerciseHostileCopies(ReadFile("mono.ogg"), 200, 331, CreateOggExtractor);
    // Not Vorbis: an Ogg page whose first packet is something else.
    std::vector<uint8_t> bytes = ReadFile("mono.ogg");
    bytes[28 + 1] = 'X';
    EXPECT_EQ(SniffOgg(MemorySource(bytes)), 0.0f);
    EXPECT_EQ(CreateOggExtractor(MemorySource(bytes)), nullptr);
}
