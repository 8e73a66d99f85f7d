// The MP3 extractor on files of two encoders with tags around them
// (tests/media/gen/mp3.sh), on damage, and seeking; decoded content is
// compared with ffmpeg's in the decoder test.

#include <gtest/gtest.h>

#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "extractors/AudioMediaFacts.h"
#include "mp3/MP3Extractor.h"

namespace {

using namespace android;
using audiotest::Fact;
using audiotest::FactInt;
using audiotest::MemorySource;
using audiotest::ReadFile;

struct Read {
    status_t end = OK;
    std::vector<int64_t> timesUs;
    std::vector<size_t> sizes;
};

Read ReadAll(const sp<IMediaSource>& track, const MediaSource::ReadOptions* first = nullptr) {
    Read r;
    if (track->start() != OK) return r;
    MediaBufferBase* buffer;
    while ((r.end = track->read(&buffer, first)) == OK) {
        first = nullptr;
        int64_t t = -1;
        buffer->meta_data().findInt64(kKeyTime, &t);
        r.timesUs.push_back(t);
        r.sizes.push_back(buffer->range_length());
        buffer->release();
    }
    track->stop();
    return r;
}

TEST(MP3Extractor, ReadsEveryFrameOfEachProducer) {
    // Frames per file: what ffprobe counts, less the end tags it takes for
    // frames; duration where ffprobe reads it from the stream alone.
    const struct {
        const char* file;
        size_t frames;
        bool ffprobeDuration;
    } kCases[] = {
        {"mp3/vbr_tags.mp3", 40, true},    // Xing and LAME frame, ID3v2 and ID3v1
        {"mp3/cbr_mpeg2.mp3", 33, true},   // no info frame
        {"mp3/mpeg25_ape.mp3", 16, false}, // APE tag then ID3v1
        {"mp3/gst_cbr.mp3", 28, true},     // GStreamer's encoder and tagger
    };
    for (const auto& c : kCases) {
        SCOPED_TRACE(c.file);
        const std::string name = std::string(c.file).substr(4);
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(audiotest::OpenMedia(c.file));
        ASSERT_NE(extractor, nullptr);
        ASSERT_EQ(extractor->countTracks(), 1u);
        sp<MetaData> meta = extractor->getTrackMetaData(0);
        const char* mime = nullptr;
        int32_t rate = 0, channels = 0;
        int64_t durationUs = 0;
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_MPEG);
        ASSERT_TRUE(meta->findInt32(kKeySampleRate, &rate) && meta->findInt32(kKeyChannelCount, &channels));
        EXPECT_EQ(rate, FactInt("mp3/" + name, "rate"));
        EXPECT_EQ(channels, FactInt("mp3/" + name, "channels"));
        const int64_t spf = rate >= 32000 ? 1152 : 576, frameUs = spf * 1000000 / rate;
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &durationUs));
        if (c.ffprobeDuration) EXPECT_NEAR(durationUs, FactInt("mp3/" + name, "duration_us"), frameUs);

        const Read r = ReadAll(extractor->getTrack(0));
        EXPECT_EQ(r.end, ERROR_END_OF_STREAM);
        ASSERT_EQ(r.timesUs.size(), c.frames);
        for (size_t i = 0; i < r.timesUs.size(); ++i) EXPECT_NEAR(r.timesUs[i], int64_t(i) * spf * 1000000 / rate, 1) << i;
    }
}

TEST(MP3Extractor, SeeksToTheFrameOfTheTime) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(audiotest::OpenMedia("mp3/vbr_tags.mp3"));
    ASSERT_NE(extractor, nullptr);
    for (const auto& c : {std::make_pair(int64_t(500000), int64_t(19)), std::make_pair(int64_t(0), int64_t(0)),
                          std::make_pair(int64_t(10000000), int64_t(-1))}) {
        MediaSource::ReadOptions seek;
        seek.setSeekTo(c.first, MediaSource::ReadOptions::SEEK_PREVIOUS_SYNC);
        const Read r = ReadAll(extractor->getTrack(0), &seek);
        if (c.second < 0) {
            EXPECT_TRUE(r.timesUs.empty());
        } else {
            ASSERT_FALSE(r.timesUs.empty());
            EXPECT_NEAR(r.timesUs[0], c.second * 1152 * 1000000 / 44100, 1);
            EXPECT_EQ(r.timesUs.size(), 40u - c.second);
        }
    }
}

TEST(MP3Extractor, DamageIsSkippedOrReported) {
    LogCapture log;
    const std::vector<uint8_t> clean = ReadFile("mp3/cbr_mpeg2.mp3");
    // Garbage over the header of the 5th frame: the frames after it are found again.
    size_t fifth = 0;
    for (int k = 0; k < 4; ++k) {
        MP3FrameHeader h;
        ASSERT_TRUE(ParseMP3FrameHeader(&clean[fifth], &h));
        fifth += h.frameBytes;
    }
    std::vector<uint8_t> garbled = clean;
    for (size_t i = 0; i < 4; ++i) garbled[fifth + i] = 0x11;
    // Cut inside a frame: reported at the end.
    const std::vector<uint8_t> cut(clean.begin(), clean.end() - 50);
    const struct {
        const char* what;
        std::vector<uint8_t> bytes;
        status_t end;
        size_t minFrames, maxFrames;
    } kCases[] = {
        {"garbled header", garbled, ERROR_END_OF_STREAM, 30, 32},
        {"cut short", cut, ERROR_MALFORMED, 31, 32},
    };
    for (const auto& c : kCases) {
        SCOPED_TRACE(c.what);
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(MemorySource(c.bytes));
        ASSERT_NE(extractor, nullptr);
        const Read r = ReadAll(extractor->getTrack(0));
        EXPECT_EQ(r.end, c.end);
        EXPECT_GE(r.timesUs.size(), c.minFrames);
        EXPECT_LE(r.timesUs.size(), c.maxFrames);
    }
    // Every prefix and single-byte change of a tagged file ends in a status.
    for (const char* file : {"mp3/vbr_tags.mp3", "mp3/mpeg25_ape.mp3"}) {
        audiotest::ExerciseHostileCopies(ReadFile(file), 256, 7, [](const sp<DataSource>& source) {
            return sp<IMediaExtractor>(MP3Extractor::Create(source));
        });
    }
    // Not MP3: other MPEG audio layers, a lone sync word, tags with nothing after.
    for (const std::vector<uint8_t>& bytes : {std::vector<uint8_t>{0xFF, 0xFD, 0x90, 0x00, 0, 0, 0, 0},
                                              std::vector<uint8_t>(clean.begin(), clean.begin() + 60),
                                              std::vector<uint8_t>{'I', 'D', '3', 3, 0, 0, 0, 0, 0, 0}}) {
        EXPECT_EQ(MP3Extractor::Create(MemorySource(bytes)), nullptr);
    }
}

}  // namespace
