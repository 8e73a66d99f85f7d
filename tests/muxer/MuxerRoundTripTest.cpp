#include <gtest/gtest.h>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "QNMediaEditorDefs.h"
#include "muxer/MuxerTestSupport.h"
#include "writers/AudioWriterTestSupport.h"

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

}  // namespace
