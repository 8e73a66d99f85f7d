#include <gtest/gtest.h>

#include <media/stagefright/AMRWriter.h>
#include <media/stagefright/FLACWriter.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/QNM4AWriter.h>
#include <media/stagefright/QNWAVEWriter.h>

#include "muxer/MuxerTestSupport.h"
#include "writers/AudioWriterTestSupport.h"

using namespace android;
using namespace muxertest;
using android::qnmediaeditor::OutputFileFormat;
using android::qnmediaeditor::QNMediaMuxer;
using Access = android::qnmediaeditor::QNMediaMuxerTestAccess;
using writertest::ScratchFile;

namespace {

sp<QNMediaMuxer> muxerFor(const ScratchFile& file, int format) {
    return new QNMediaMuxer(file.fd, static_cast<OutputFileFormat>(format));
}

TEST(MuxerStateTest, UnsupportedFormatsRefuseEveryStatefulCall) {
    for (int format : {3, 0, 10, 16, -1}) {
        SCOPED_TRACE(format);
        ScratchFile file;
        LogCapture log;
        sp<QNMediaMuxer> muxer = muxerFor(file, format);
        EXPECT_EQ(QNMediaMuxer::UNINITIALIZED, muxer->getMuxerState());
        EXPECT_TRUE(log.lines().empty());

        EXPECT_EQ(INVALID_OPERATION, muxer->addTrack(trackFormat(MEDIA_MIMETYPE_AUDIO_RAW)));
        EXPECT_TRUE(refused(log, "addTrack() must be called after constructor and before start()."));
        EXPECT_EQ(INVALID_OPERATION, muxer->start());
        EXPECT_TRUE(refused(log, "start() is called in invalid state 0"));
        EXPECT_EQ(INVALID_OPERATION, muxer->stop());
        EXPECT_TRUE(refused(log, "stop() is called in invalid state 0"));
        EXPECT_EQ(INVALID_OPERATION, muxer->writeSampleData(0, sampleOf({1}), 0, 0, 0));
        EXPECT_TRUE(refused(log, "WriteSampleData() is called in invalid state 0"));
        EXPECT_EQ(INVALID_OPERATION, muxer->setLocation(1, 2));
        EXPECT_TRUE(refused(log, "setLocation() must be called before start()."));
        EXPECT_EQ(INVALID_OPERATION, muxer->setUserMessage(reinterpret_cast<const uint8_t*>("m")));
        EXPECT_TRUE(refused(log, "setUserMessage() must be called before start()."));
        EXPECT_EQ(BAD_VALUE, muxer->forceTrackStop(0));
        EXPECT_TRUE(refused(log, "forceTrackStop() get an invalid index 0"));

        // No writer to take these: they must not fail or crash.
        muxer->setListener(nullptr);
        sp<ABuffer> waveform = sampleOf({0, 1, 0, 2});
        EXPECT_EQ(OK, muxer->writeWaveFormData(waveform, 2));
        EXPECT_EQ(OK, muxer->setVideoFPS(30));
    }
}

TEST(MuxerStateTest, EachFormatGetsItsWriter) {
    ScratchFile file;
    auto writerOf = [&](int format) {
        sp<QNMediaMuxer> muxer = muxerFor(file, format);
        EXPECT_EQ(QNMediaMuxer::INITIALIZED, muxer->getMuxerState());
        return Access::writer(muxer);
    };
    sp<MediaWriter> mp4 = writerOf(2);
    EXPECT_NE(nullptr, dynamic_cast<MPEG4Writer*>(mp4.get()));
    EXPECT_EQ(nullptr, dynamic_cast<QNM4AWriter*>(mp4.get()));
    EXPECT_NE(nullptr, dynamic_cast<AMRWriter*>(writerOf(11).get()));
    EXPECT_NE(nullptr, dynamic_cast<AMRWriter*>(writerOf(12).get()));
    EXPECT_NE(nullptr, dynamic_cast<QNWAVEWriter*>(writerOf(13).get()));
    EXPECT_NE(nullptr, dynamic_cast<FLACWriter*>(writerOf(14).get()));
    EXPECT_NE(nullptr, dynamic_cast<QNM4AWriter*>(writerOf(15).get()));
}

TEST(MuxerStateTest, FileSettersCheckTheStateBeforeTheFormat) {
    ScratchFile file;
    LogCapture log;
    sp<QNMediaMuxer> flac = muxerFor(file, 14);
    const uint8_t uuid[] = {1, 2, 3};
    EXPECT_EQ(INVALID_OPERATION, flac->setLocation(1, 2));
    EXPECT_TRUE(refused(log, "setLocation() is only supported for .mp4 output."));
    EXPECT_EQ(INVALID_OPERATION, flac->setUuidData(uuid, 3));
    EXPECT_TRUE(refused(log, "setUuidData() is only supported for .mp4 output."));
    EXPECT_EQ(INVALID_OPERATION, flac->setRecordingType(String8("slow")));
    EXPECT_TRUE(refused(log, "setRecordingType() is only supported for .mp4 output."));

    EXPECT_EQ(BAD_VALUE, flac->setOrientationHint(45));
    EXPECT_TRUE(refused(log, "setOrientationHint() get invalid degrees"));
    EXPECT_EQ(OK, flac->setOrientationHint(270));
    int32_t rotation = 0;
    EXPECT_TRUE(Access::fileMeta(flac)->findInt32(kKeyRotation, &rotation));
    EXPECT_EQ(270, rotation);

    sp<QNMediaMuxer> mp4 = muxerFor(file, 2);
    EXPECT_EQ(OK, mp4->setUserMessage(reinterpret_cast<const uint8_t*>("not stored in mp4")));
    EXPECT_EQ(OK, mp4->setVRMeta(reinterpret_cast<const uint8_t*>("vr")));
    EXPECT_EQ(OK, mp4->setRecodingParams(new AMessage));
    mp4->start();  // the state moves on whatever the writer answers
    EXPECT_EQ(QNMediaMuxer::STARTED, mp4->getMuxerState());
    log.clear();
    EXPECT_EQ(INVALID_OPERATION, mp4->setLocation(1, 2));
    EXPECT_TRUE(refused(log, "setLocation() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->setUuidData(uuid, 3));
    EXPECT_TRUE(refused(log, "setUuidData() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->setRecordingType(String8("slow")));
    EXPECT_TRUE(refused(log, "setRecordingType() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->setOrientationHint(90));
    EXPECT_TRUE(refused(log, "setOrientationHint() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->setVRMeta(reinterpret_cast<const uint8_t*>("vr")));
    EXPECT_TRUE(refused(log, "setVRMeta() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->setRecodingParams(new AMessage));
    EXPECT_TRUE(refused(log, "setRecodingParams() must be called before start()."));
    EXPECT_EQ(INVALID_OPERATION, mp4->addTrack(trackFormat(MEDIA_MIMETYPE_VIDEO_AVC)));
    EXPECT_EQ(INVALID_OPERATION, mp4->start());
    EXPECT_TRUE(refused(log, "start() is called in invalid state 2"));
}

TEST(MuxerStateTest, ANullArgumentIsReportedBeforeTheState) {
    ScratchFile file;
    LogCapture log;
    sp<QNMediaMuxer> unsupported = muxerFor(file, 3);
    EXPECT_EQ(BAD_VALUE, unsupported->addTrack(nullptr));
    sp<QNMediaMuxer> muxer = muxerFor(file, 13);
    EXPECT_EQ(BAD_VALUE, muxer->addTrack(nullptr));
    EXPECT_EQ(2, log.count("addTrack() get a null format"));
    EXPECT_EQ(BAD_VALUE, muxer->writeSampleData(0, nullptr, 0, 0, 0));
    EXPECT_TRUE(refused(log, "WriteSampleData() get an NULL buffer."));
}

}  // namespace
