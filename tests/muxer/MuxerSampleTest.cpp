#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "QNMediaEditorDefs.h"
#include "muxer/MuxerTestSupport.h"

using namespace android;
using namespace muxertest;
using android::qnmediaeditor::kEditorKeyBitsPerSample;
using android::qnmediaeditor::OUTPUT_FILE_FORMAT_WAVE;
using android::qnmediaeditor::QNMediaMuxer;
using Access = android::qnmediaeditor::QNMediaMuxerTestAccess;

namespace {

// A muxer whose writer records everything. The descriptor is never used.
struct Fixture {
    explicit Fixture(int tracks, bool pull = false) : writer(new RecordingWriter(pull)) {
        muxer = new QNMediaMuxer(-1, OUTPUT_FILE_FORMAT_WAVE);
        Access::setWriter(muxer, writer);
        for (int i = 0; i < tracks; ++i) muxer->addTrack(trackFormat(MEDIA_MIMETYPE_VIDEO_AVC));
    }
    sp<RecordingWriter> writer;
    sp<QNMediaMuxer> muxer;
};

TEST(MuxerSampleTest, TracksAreIndexedInOrderAndCarryTheirFormat) {
    Fixture f(0);
    sp<AMessage> pcm = trackFormat(MEDIA_MIMETYPE_AUDIO_RAW);
    pcm->setInt32("bits-per-sample", 24);
    EXPECT_EQ(0, f.muxer->addTrack(pcm));
    EXPECT_EQ(1, f.muxer->addTrack(trackFormat(MEDIA_MIMETYPE_VIDEO_AVC)));
    f.writer->addResult = ERROR_UNSUPPORTED;
    EXPECT_EQ(-1, f.muxer->addTrack(trackFormat(MEDIA_MIMETYPE_VIDEO_AVC)));
    f.writer->addResult = OK;
    EXPECT_EQ(2, f.muxer->addTrack(trackFormat(MEDIA_MIMETYPE_VIDEO_AVC)));

    sp<MetaData> meta = f.writer->sources[0]->getFormat();
    const char* mime = nullptr;
    ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(MEDIA_MIMETYPE_AUDIO_RAW, mime);
    int32_t bits = 0;
    EXPECT_TRUE(meta->findInt32(kEditorKeyBitsPerSample, &bits));
    EXPECT_EQ(24, bits);
    EXPECT_FALSE(f.writer->sources[1]->getFormat()->findInt32(kEditorKeyBitsPerSample, &bits));
}

TEST(MuxerSampleTest, StartPassesTheFileMetaAndStaysStartedWhenTheWriterFails) {
    Fixture f(1);
    LogCapture log;
    EXPECT_EQ(OK, f.muxer->setOrientationHint(90));
    f.writer->startResult = ERROR_IO;
    EXPECT_EQ(ERROR_IO, f.muxer->start());
    EXPECT_EQ(QNMediaMuxer::STARTED, f.muxer->getMuxerState());
    ASSERT_NE(nullptr, f.writer->startParams);
    int32_t value = -1;
    EXPECT_TRUE(f.writer->startParams->findInt32(kKeyRealTimeRecording, &value));
    EXPECT_EQ(0, value);
    EXPECT_TRUE(f.writer->startParams->findInt32(kKeyRotation, &value));
    EXPECT_EQ(90, value);
    EXPECT_EQ(OK, f.muxer->writeSampleData(0, sampleOf({1}), 0, 5, 0));
}

TEST(MuxerSampleTest, SamplesCarryTimesFlagsAndOnlyTheirRange) {
    Fixture f(2);
    ASSERT_EQ(OK, f.muxer->start());
    EXPECT_EQ(OK, f.muxer->setVideoFPS(30));
    sp<ABuffer> cut = sampleOf({9, 8, 7, 6, 5, 4});
    cut->setRange(2, 3);
    const struct {
        int flag;
        sp<ABuffer> buffer;
        int64_t time, decodingTime;
        uint32_t flags;
        int32_t sync, config;
    } cases[] = {
        {1, cut, 1000, 1000, 3, 1, 1},
        {0, sampleOf({1}), 123, 123, 4, 0, 0},
        {1, sampleOf({2}), 50000, 3334333, 1, 1, 0},
        {1, sampleOf({3}), 70000, 6667666, 2, 0, 1},
    };
    for (const auto& c : cases) EXPECT_EQ(OK, f.muxer->writeSampleData(c.flag, c.buffer, 0, c.time, c.flags));
    for (const auto& c : cases) {
        const Sample s = f.writer->take(0);
        SCOPED_TRACE(c.time);
        EXPECT_EQ(c.time, s.timeUs);
        EXPECT_EQ(c.decodingTime, s.decodingTimeUs);
        EXPECT_EQ(c.sync, s.sync);
        EXPECT_EQ(c.config, s.codecConfig);
    }
    EXPECT_EQ(OK, f.muxer->writeSampleData(0, cut, 1, 0, 0));
    EXPECT_EQ((std::vector<uint8_t>{7, 6, 5}), f.writer->take(1).bytes);
}

TEST(MuxerSampleTest, WithoutAFrameRateFlaggedSamplesRepeatTheFirstNonZeroTime) {
    Fixture f(1);
    ASSERT_EQ(OK, f.muxer->start());
    for (int64_t t : {0, 500, 900}) EXPECT_EQ(OK, f.muxer->writeSampleData(1, sampleOf({1}), 0, t, 0));
    EXPECT_EQ(0, f.writer->take(0).decodingTimeUs);
    EXPECT_EQ(500, f.writer->take(0).decodingTimeUs);
    EXPECT_EQ(500, f.writer->take(0).decodingTimeUs);

    for (auto [fps, step] : {std::pair<int, int64_t>{25, 4000000}, {60, 1666666}, {7, 14285714}, {-3, -33333333},
                             {0, 0}}) {
        EXPECT_EQ(OK, f.muxer->setVideoFPS(fps));
        EXPECT_EQ(step, Access::step(f.muxer)) << fps;
    }
}

TEST(MuxerSampleTest, BadIndexesAndASecondStopAreRefused) {
    Fixture f(2);
    LogCapture log;
    ASSERT_EQ(OK, f.muxer->start());
    EXPECT_EQ(BAD_VALUE, f.muxer->writeSampleData(0, sampleOf({1}), 2, 0, 0));
    EXPECT_TRUE(refused(log, "WriteSampleData() get an invalid index 2"));
    EXPECT_EQ(BAD_VALUE, f.muxer->forceTrackStop(2));
    EXPECT_TRUE(refused(log, "forceTrackStop() get an invalid index 2"));

    EXPECT_EQ(OK, f.muxer->writeSampleData(0, sampleOf({1}), 1, 10, 0));
    EXPECT_EQ(OK, f.muxer->stop());
    EXPECT_EQ(1, f.writer->stops);
    EXPECT_EQ(10, f.writer->take(1).timeUs);  // pushed before the stop: still delivered
    EXPECT_EQ(-1, f.writer->take(1).timeUs);  // then the end of the track

    EXPECT_EQ(INVALID_OPERATION, f.muxer->stop());
    EXPECT_TRUE(refused(log, "stop() is called in invalid state 3"));
    EXPECT_EQ(INVALID_OPERATION, f.muxer->writeSampleData(0, sampleOf({1}), 0, 0, 0));
    EXPECT_TRUE(refused(log, "WriteSampleData() is called in invalid state 3"));
    EXPECT_EQ(1, f.writer->stops);
}

TEST(MuxerSampleTest, ForceTrackStopEndsOneTrackAndKeepsWhatWasPushed) {
    Fixture f(2);
    ASSERT_EQ(OK, f.muxer->start());
    for (int64_t t = 1; t <= 3; ++t) EXPECT_EQ(OK, f.muxer->writeSampleData(0, sampleOf({1}), 0, t, 0));
    EXPECT_EQ(OK, f.muxer->forceTrackStop(0));
    EXPECT_EQ(INVALID_OPERATION, f.muxer->writeSampleData(0, sampleOf({1}), 0, 4, 0));
    EXPECT_EQ(OK, f.muxer->writeSampleData(0, sampleOf({1}), 1, 5, 0));
    for (int64_t t = 1; t <= 3; ++t) EXPECT_EQ(t, f.writer->take(0).timeUs);
    EXPECT_EQ(-1, f.writer->take(0).timeUs);
    EXPECT_EQ(5, f.writer->take(1).timeUs);
    EXPECT_EQ(OK, f.muxer->stop());
}

TEST(MuxerSampleTest, WaveformCountIsKeptWithinTheBufferAndListenerIsPassedOn) {
    Fixture f(0);
    sp<ABuffer> waveform = sampleOf({0, 1, 0, 2, 0, 3});
    EXPECT_EQ(OK, f.muxer->writeWaveFormData(waveform, 3));
    EXPECT_EQ(3, f.writer->waveformCount);
    EXPECT_EQ(OK, f.muxer->writeWaveFormData(waveform, 1000));
    EXPECT_EQ(3, f.writer->waveformCount);
    EXPECT_EQ(OK, f.muxer->writeWaveFormData(waveform, -5));
    EXPECT_EQ(0, f.writer->waveformCount);
    sp<ABuffer> none;
    EXPECT_EQ(OK, f.muxer->writeWaveFormData(none, 3));

    struct Listener : public IMediaRecorderClient {
        void notify(int, int, int) override {}
    };
    sp<IMediaRecorderClient> listener = new Listener;
    f.muxer->setListener(listener);
    EXPECT_EQ(listener.get(), f.writer->listener().get());
}

}  // namespace
