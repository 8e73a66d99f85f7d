#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <thread>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "QNMediaEditorDefs.h"
#include "muxer/MuxerTestSupport.h"
#include "writers/AudioWriterTestSupport.h"
#include "writers/MPEG4TestSupport.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace writertest;

namespace {

TEST(MuxerRoundTripTest, WaveFileKeepsTheSamplesAndTheDeviceItems) {
    ScratchFile file(".wav");
    const Bytes pcm = tone16(2, 4410);
    {
        sp<QNMediaMuxer> muxer = new QNMediaMuxer(file.fd, OUTPUT_FILE_FORMAT_WAVE);
        sp<AMessage> format = muxertest::trackFormat(MEDIA_MIMETYPE_AUDIO_RAW);
        format->setInt32("channel-count", 2);
        format->setInt32("sample-rate", 44100);
        format->setInt32("bits-per-sample", 16);
        ASSERT_EQ(0, muxer->addTrack(format));
        EXPECT_EQ(OK, muxer->setUserMessage(reinterpret_cast<const uint8_t*>("a note")));
        EXPECT_EQ(OK, muxer->setVRMeta(reinterpret_cast<const uint8_t*>("vr=1")));
        sp<AMessage> params = new AMessage;
        params->setInt64("bookmark-size", 1234);
        EXPECT_EQ(OK, muxer->setRecodingParams(params));
        sp<ABuffer> waveform = muxertest::sampleOf({0x01, 0x02, 0x7F, 0xFF});
        EXPECT_EQ(OK, muxer->writeWaveFormData(waveform, 2));
        ASSERT_EQ(OK, muxer->start());
        const size_t piece = 4 * 441;  // 10 ms
        for (size_t pos = 0; pos < pcm.size(); pos += piece) {
            const size_t n = std::min(piece, pcm.size() - pos);
            sp<ABuffer> sample = ABuffer::CreateAsCopy(pcm.data() + pos, n);
            ASSERT_EQ(OK, muxer->writeSampleData(0, sample, 0, int64_t(pos / 4) * 1000000 / 44100, 0));
        }
        ASSERT_EQ(OK, muxer->stop());
    }

    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(file.path().c_str()));
    ASSERT_NE(nullptr, extractor);
    sp<MetaData> meta = extractor->getMetaData();
    const char* s = nullptr;
    ASSERT_TRUE(meta->findCString(kEditorKeyUserMessage, &s));
    EXPECT_STREQ("a note", s);
    ASSERT_TRUE(meta->findCString(kEditorKeyRecMode, &s));
    EXPECT_STREQ("vr=1", s);
    uint32_t type;
    const void* data;
    size_t size;
    ASSERT_TRUE(meta->findData(kEditorKeyWaveForm, &type, &data, &size));
    EXPECT_EQ(4u, size);
    int64_t bookmark = 0;
    ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt64(kEditorKeyBookmarkSize, &bookmark));
    EXPECT_EQ(1234, bookmark);

    if (!haveTool("ffmpeg")) GTEST_SKIP() << "ffmpeg missing";
    std::string decoded;
    ASSERT_EQ(0, run("ffmpeg -v error -i " + file.path() + " -f s16le -", &decoded));
    EXPECT_TRUE(Bytes(decoded.begin(), decoded.end()) == pcm);
}

sp<AMessage> mp4Track(const char* mime, const char* k1, int32_t v1, const char* k2, int32_t v2) {
    sp<AMessage> f = muxertest::trackFormat(mime);
    f->setInt32(k1, v1);
    f->setInt32(k2, v2);
    return f;
}

TEST(MuxerRoundTripTest, Mp4WrittenFromTwoThreadsKeepsEverySampleAndTheFileItems) {
    if (!haveTool("ffmpeg") || !haveTool("ffprobe")) GTEST_SKIP() << "ffmpeg tools missing";
    const std::string src = mp4test::tempDir() + "/src.mp4";
    ASSERT_EQ(0, mp4test::runCommand("ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=160x120:rate=30 "
                                     "-f lavfi -i sine=frequency=440:sample_rate=44100 -t 4 -pix_fmt yuv420p "
                                     "-c:v libx264 -bf 0 -g 10 -c:a aac -b:a 64k '" + src + "'"));
    const std::vector<mp4test::Pushed> samples = mp4test::samplesOf(src, /*annexB=*/true, /*configBuffers=*/true);
    const uint8_t sphere[] = {5, 6, 7};

    ScratchFile out(".mp4");
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(out.fd, OUTPUT_FILE_FORMAT_MPEG_4);
    ASSERT_EQ(0, muxer->addTrack(mp4Track(MEDIA_MIMETYPE_VIDEO_AVC, "width", 160, "height", 120)));
    ASSERT_EQ(1, muxer->addTrack(mp4Track(MEDIA_MIMETYPE_AUDIO_AAC, "sample-rate", 44100, "channel-count", 1)));
    EXPECT_EQ(OK, muxer->setOrientationHint(90));
    EXPECT_EQ(OK, muxer->setLocation(375000, -1222000));
    EXPECT_EQ(OK, muxer->setUuidData(sphere, sizeof(sphere)));
    EXPECT_EQ(OK, muxer->setRecordingType(String8("slow")));
    ASSERT_EQ(OK, muxer->start());

    // Each track from its own thread, the audio well ahead: more audio than a
    // track queue holds arrives before any video, and the writer has to keep
    // taking it rather than wait for video that is queued behind the lock.
    auto writeTrack = [&](size_t track) {
        for (const mp4test::Pushed& p : samples) {
            if (p.track != track) continue;
            sp<ABuffer> b = ABuffer::CreateAsCopy(p.bytes.data(), p.bytes.size());
            const uint32_t flags = (p.sync ? 1 : 0) | (p.config ? 2 : 0);
            if (muxer->writeSampleData(0, b, uint32_t(track), p.ptsUs, flags) != OK) return false;
        }
        return true;
    };
    auto done = std::async(std::launch::async, [&] {
        auto audio = std::async(std::launch::async, writeTrack, 1);
        std::this_thread::sleep_for(std::chrono::milliseconds(300));
        const bool video = writeTrack(0);
        return video && audio.get() && muxer->stop() == OK;
    });
    if (done.wait_for(std::chrono::seconds(60)) != std::future_status::ready) {
        fprintf(stderr, "muxer or writer deadlocked\n");
        abort();
    }
    ASSERT_TRUE(done.get());

    const std::vector<mp4test::Packet> expected = mp4test::packets(src), got = mp4test::packets(out.path());
    ASSERT_EQ(expected.size(), got.size());
    std::map<int, std::vector<std::pair<int64_t, size_t>>> in, stored;
    for (const auto& p : expected) in[p.stream].push_back({p.ptsUs, p.size});
    for (const auto& p : got) stored[p.stream].push_back({p.ptsUs, p.size});
    EXPECT_EQ(in, stored);
    std::string errors;
    EXPECT_TRUE(mp4test::decodesCleanly(out.path(), &errors)) << errors;
    mp4test::Flat f;
    ASSERT_TRUE(mp4test::probe(out.path(), "-show_streams -show_format", &f));
    EXPECT_EQ("-90", f["streams.stream.0.side_data_list.side_data.0.rotation"]);
    EXPECT_EQ("+37.5000-122.2000/", f["format.tags.location"]);

    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(out.path().c_str()));
    ASSERT_NE(nullptr, extractor);
    const char* type = nullptr;
    ASSERT_TRUE(extractor->getMetaData()->findCString(kEditorKeyVideoRecordType, &type));
    EXPECT_STREQ("slow", type);
    uint32_t blobType;
    const void* data;
    size_t size;
    ASSERT_TRUE(extractor->getMetaData()->findData(kEditorKeySphereView, &blobType, &data, &size));
    const uint8_t withTerminator[] = {5, 6, 7, 0};
    ASSERT_EQ(sizeof(withTerminator), size);
    EXPECT_EQ(0, memcmp(withTerminator, data, size));
}

}  // namespace
