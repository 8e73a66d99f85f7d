#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>

#include "extractor/Sniffers.h"
#include "extractors/AudioMediaFacts.h"

using namespace android;
using namespace audiotest;

namespace {

typedef MediaTrack::ReadOptions O;

sp<IMediaSource> StartedTrack(const sp<IMediaExtractor>& extractor) {
    sp<IMediaSource> track = extractor->getTrack(0);
    return track != nullptr && track->start() == OK ? track : nullptr;
}

std::vector<Sample> ReadAfterSeek(const sp<IMediaSource>& track, int64_t timeUs, O::SeekMode mode, size_t n) {
    O options;
    options.setSeekTo(timeUs, mode);
    std::vector<Sample> samples;
    ReadSamples(track, &samples, n, &options);
    return samples;
}

}  // namespace

TEST(AMRExtractorTest, FramesMatchTheContainerFacts) {
    struct Case {
        const char* file;
        const char* mime;
        int32_t rate;
        size_t magic;
    };
    for (const Case& c : {Case{"nb.amr", MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 6},
                          Case{"wb.awb", MEDIA_MIMETYPE_AUDIO_AMR_WB, 16000, 9}}) {
        SCOPED_TRACE(c.file);
        sp<IMediaExtractor> extractor = CreateAMRExtractor(OpenMedia(c.file));
        ASSERT_NE(extractor, nullptr);
        sp<MetaData> file = extractor->getMetaData();
        const char* mime;
        ASSERT_TRUE(file->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_CONTAINER_AMR);
        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, c.mime);
        int32_t v;
        EXPECT_TRUE(meta->findInt32(kKeySampleRate, &v) && v == c.rate);
        EXPECT_TRUE(meta->findInt32(kKeyChannelCount, &v) && v == 1);
        EXPECT_TRUE(meta->findInt32(kKeyBitRate, &v) && v > 0);

        const std::vector<Packet> packets = Packets(c.file);
        ASSERT_FALSE(packets.empty());
        int64_t duration;
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &duration));
        EXPECT_EQ(duration, static_cast<int64_t>(packets.size()) * 20000);

        std::vector<Sample> samples;
        EXPECT_EQ(ReadSamples(StartedTrack(extractor), &samples), ERROR_END_OF_STREAM);
        ASSERT_EQ(samples.size(), packets.size());
        for (size_t i = 0; i < samples.size(); ++i) {
            ASSERT_EQ(samples[i].bytes.size(), packets[i].size) << i;
            ASSERT_EQ(samples[i].timeUs, packets[i].pts * 1000000 / c.rate) << i;
            ASSERT_EQ(samples[i].sync, 1);
        }
        const std::vector<uint8_t> bytes = ReadFile(c.file);
        EXPECT_EQ(Concat(samples), std::vector<uint8_t>(bytes.begin() + c.magic, bytes.end()));
    }
}

TEST(AMRExtractorTest, SeeksByFrameAcrossTheIndexStride) {
    // 150 frames: the sparse index holds frames 0, 50 and 100.
    const std::vector<uint8_t> nb = ReadFile("nb.amr");
    std::vector<uint8_t> bytes = nb;
    for (int i = 0; i < 2; ++i) bytes.insert(bytes.end(), nb.begin() + 6, nb.end());
    sp<IMediaExtractor> extractor = CreateAMRExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    sp<IMediaSource> track = StartedTrack(extractor);
    std::vector<Sample> all;
    ReadSamples(track, &all);
    ASSERT_EQ(all.size(), 150u);

    auto firstTime = [&](int64_t t, O::SeekMode mode) {
        std::vector<Sample> s = ReadAfterSeek(track, t, mode, 1);
        return s.empty() ? -1 : s[0].timeUs;
    };
    EXPECT_EQ(firstTime(2030000, O::SEEK_PREVIOUS_SYNC), 2020000);
    EXPECT_EQ(firstTime(2030000, O::SEEK_NEXT_SYNC), 2040000);
    EXPECT_EQ(firstTime(2030000, O::SEEK_CLOSEST_SYNC), 2020000);  // a tie keeps the earlier
    EXPECT_EQ(firstTime(2031000, O::SEEK_CLOSEST), 2040000);
    EXPECT_EQ(firstTime(1000000, O::SEEK_CLOSEST), 1000000);

    const std::vector<Sample> after = ReadAfterSeek(track, 2450000, O::SEEK_PREVIOUS_SYNC, 200);
    ASSERT_EQ(after.size(), 150u - 122u);
    for (size_t i = 0; i < after.size(); ++i) ASSERT_EQ(after[i].bytes, all[122 + i].bytes) << i;
    EXPECT_TRUE(ReadAfterSeek(track, 3000000, O::SEEK_NEXT_SYNC, 1).empty());
}

TEST(AMRExtractorTest, UndefinedFrameTypeEndsWithAnError) {
    std::vector<uint8_t> bytes = ReadFile("nb.amr");
    const size_t tenth = 6 + 10 * 13;  // every frame of this file is 13 bytes
    bytes[tenth] = 0x4C;              // frame type 9
    sp<IMediaExtractor> extractor = CreateAMRExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    std::vector<Sample> samples;
    EXPECT_EQ(ReadSamples(StartedTrack(extractor), &samples), ERROR_MALFORMED);
    EXPECT_EQ(samples.size(), 10u);
    // A truncated last frame is left out; the file ends there.
    bytes = ReadFile("wb.awb");
    bytes.resize(bytes.size() - 30);
    extractor = CreateAMRExtractor(MemorySource(bytes));
    ASSERT_NE(extractor, nullptr);
    samples.clear();
    EXPECT_EQ(ReadSamples(StartedTrack(extractor), &samples), ERROR_END_OF_STREAM);
    EXPECT_EQ(samples.size(), Packets("wb.awb").size() - 1);
}

TEST(AMRExtractorTest, SurvivesTruncationAndCorruption) {
    for (const char* file : {"nb.amr", "wb.awb"}) {
        ExerciseHostileCopies(ReadFile(file), 4096, 1, CreateAMRExtractor);
    }
    EXPECT_EQ(CreateAMRExtractor(MemorySource({'#', '!', 'A', 'M', 'R'})), nullptr);
    EXPECT_EQ(CreateAMRExtractor(MemorySource({'#', '!', 'A', 'M', 'R', '_', 'M', 'C', '1'})), nullptr);
}
