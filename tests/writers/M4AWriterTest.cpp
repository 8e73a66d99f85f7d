// The M4A writer: audio-only MP4 with the device's items.

#include <fcntl.h>
#include <unistd.h>

#include <gtest/gtest.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/QNM4AWriter.h>

#include "writers/MPEG4TestSupport.h"

using namespace android;
using namespace mp4test;

namespace {

sp<MetaData> aacFormat() {
    sp<MetaData> m = new MetaData;
    m->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_AAC);
    m->setInt32(kKeySampleRate, 44100);
    m->setInt32(kKeyChannelCount, 1);
    return m;
}

class M4AWriterTest : public ::testing::Test {
protected:
    void SetUp() override {
        mDir = tempDir();
        mPath = mDir + "/out.m4a";
        mFd = open(mPath.c_str(), O_CREAT | O_TRUNC | O_RDWR, 0644);
        ASSERT_GE(mFd, 0);
    }
    void TearDown() override { close(mFd); }
    std::string mDir, mPath;
    int mFd = -1;
};

TEST_F(M4AWriterTest, StoresItemsUnderItsBrand) {
    // Real AAC when ffmpeg can make it, so that the file is also decoded.
    std::vector<Pushed> samples;
    const bool real = haveTool("ffmpeg") && haveTool("ffprobe") &&
                      runCommand("ffmpeg -nostdin -v error -f lavfi -i sine=sample_rate=44100 -t 1 -c:a aac '" +
                                 mDir + "/src.m4a'") == 0;
    if (real) {
        samples = samplesOf(mDir + "/src.m4a", false, true);
    } else {
        samples.push_back({0, {0x12, 0x08}, 0, 0, false, true});
        for (int i = 0; i < 20; ++i) samples.push_back({0, std::vector<uint8_t>(100, uint8_t(i)), i * 23220, i * 23220, true, false});
    }
    sp<QNM4AWriter> w = new QNM4AWriter(mFd);
    sp<AMessage> params = new AMessage;
    params->setInt32("bookmark-size", 77);
    ASSERT_EQ(OK, w->setUserMessage(reinterpret_cast<const uint8_t*>("hello")));
    ASSERT_EQ(OK, w->setAudioRecodingMeta(0, String8("vr-mode")));
    ASSERT_EQ(OK, w->setRecodingParams(params));
    const uint8_t wave[] = {0, 1, 0, 2, 0, 3};
    const WriteResult r = writeThroughAdapters(w, {aacFormat()}, samples, nullptr, [&] {
        // Late items are refused; the waveform is taken until stop().
        EXPECT_EQ(INVALID_OPERATION, w->setUserMessage(reinterpret_cast<const uint8_t*>("late")));
        EXPECT_EQ(INVALID_OPERATION, w->setRecodingParams(params));
        w->setWaveform(wave, 3);
    });
    ASSERT_EQ(OK, r.start);
    ASSERT_EQ(OK, r.stop);

    const std::vector<uint8_t> file = readFile(mPath);
    EXPECT_EQ("M4A ", std::string(file.begin() + 8, file.begin() + 12));
    const auto udta = childBoxes(file, "moov/udta");
    EXPECT_EQ(std::vector<uint8_t>({'h', 'e', 'l', 'l', 'o'}), udta.at("umsg"));
    EXPECT_EQ(std::vector<uint8_t>({'v', 'r', '-', 'm', 'o', 'd', 'e'}), udta.at("rmod"));
    EXPECT_EQ(std::vector<uint8_t>({0, 0, 0, 0, 0, 0, 0, 77}), udta.at("bksz"));
    EXPECT_EQ(std::vector<uint8_t>(wave, wave + 6), udta.at("wafm"));
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(mPath.c_str()));
    ASSERT_NE(nullptr, extractor);
    sp<MetaData> meta = extractor->getMetaData();
    const char* text = nullptr;
    ASSERT_TRUE(meta->findCString('umsg', &text));
    EXPECT_STREQ("hello", text);
    ASSERT_TRUE(meta->findCString('rmod', &text));
    EXPECT_STREQ("vr-mode", text);
    int64_t bookmark = 0;
    ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt64('bkSz', &bookmark));
    EXPECT_EQ(77, bookmark);
    if (real) {
        std::string errors;
        EXPECT_TRUE(decodesCleanly(mPath, &errors)) << errors;
        EXPECT_EQ(samples.size() - 1, packets(mPath).size());
    }
}

TEST_F(M4AWriterTest, LargeBookmarkAndRefusals) {
    sp<QNM4AWriter> w = new QNM4AWriter(mFd);
    sp<MetaData> video = new MetaData;
    video->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_AVC);
    EXPECT_EQ(ERROR_UNSUPPORTED, w->addSource(new MediaAdapter(video)));
    EXPECT_EQ(BAD_VALUE, w->setUserMessage(nullptr));
    EXPECT_EQ(BAD_VALUE, w->setRecodingParams(nullptr));
    sp<AMessage> params = new AMessage;
    params->setInt64("bookmark-size", INT64_C(0x123456789A));
    ASSERT_EQ(OK, w->setRecodingParams(params));
    std::vector<Pushed> samples = {{0, {0x12, 0x08}, 0, 0, false, true}, {0, {0x21, 0x10, 0x04}, 0, 0, true, false}};
    ASSERT_EQ(OK, writeThroughAdapters(w, {aacFormat()}, samples).stop);
    const auto udta = childBoxes(readFile(mPath), "moov/udta");
    EXPECT_EQ(std::vector<uint8_t>({0, 0, 0, 0x12, 0x34, 0x56, 0x78, 0x9A}), udta.at("bksz"));
    EXPECT_EQ(0u, udta.count("umsg"));
    // The bookmark size comes back with the audio track.
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(mPath.c_str()));
    ASSERT_NE(nullptr, extractor);
    int64_t bookmark = 0;
    ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt64('bkSz', &bookmark));
    EXPECT_EQ(INT64_C(0x123456789A), bookmark);
}

}  // namespace
