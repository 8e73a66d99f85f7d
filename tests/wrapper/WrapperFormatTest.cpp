#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <media/stagefright/FileSource.h>

#include "FakeMedia.h"
#include "LogCapture.h"
#include "QNMediaEditorDefs.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace wrappertest;

namespace {

class WrapperFormatTest : public ::testing::Test {
protected:
    sp<MetaData> addTrack(const char* mime = "audio/mp4a-latm") { return extractor->addTrack(mime, {}, &ledger); }
    status_t open(size_t fileBytes = 7000) {
        return wrapper->setExtractorForTest(new BufferDataSource(std::string(fileBytes, 'x').data(), fileBytes),
                                            extractor);
    }
    sp<AMessage> format(size_t index, status_t expected = OK) {
        sp<AMessage> f;
        EXPECT_EQ(expected, wrapper->getTrackFormat(index, &f));
        return f;
    }

    BufferLedger ledger;
    sp<FakeExtractor> extractor = new FakeExtractor;
    sp<TestWrapper> wrapper = new TestWrapper;
    LogCapture log;
};

// 38-byte STREAMINFO block: header (last-block flag set) and a 34-byte body.
std::vector<uint8_t> streamInfo(uint16_t minBlock, uint16_t maxBlock) {
    std::vector<uint8_t> item(38);
    for (size_t i = 0; i < item.size(); ++i) item[i] = static_cast<uint8_t>(0x10 + i);
    item[0] = 0x80;
    item[1] = 0, item[2] = 0, item[3] = 34;
    item[4] = minBlock >> 8, item[5] = minBlock & 0xFF, item[6] = maxBlock >> 8, item[7] = maxBlock & 0xFF;
    return item;
}

}  // namespace

TEST_F(WrapperFormatTest, ClosedWrapperRefusesEverything) {
    sp<AMessage> f = new AMessage;
    EXPECT_EQ(0u, wrapper->countTracks());
    EXPECT_EQ(nullptr, wrapper->getTrackMeta(0, 0));
    EXPECT_EQ(BAD_VALUE, wrapper->getTrackFormat(0, &f));
    EXPECT_EQ(nullptr, f);
    f = new AMessage;
    EXPECT_EQ(BAD_VALUE, wrapper->getFileFormat(&f));
    EXPECT_EQ(nullptr, f);
    EXPECT_EQ(BAD_VALUE, wrapper->selectTrack(0));
    EXPECT_EQ(BAD_VALUE, wrapper->unselectTrack(0));
    EXPECT_EQ(BAD_VALUE, wrapper->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw));
    int64_t v;
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->getSampleTime(&v));
    EXPECT_FALSE(wrapper->getTotalBitrate(&v));
}

TEST_F(WrapperFormatTest, FailedOpenLeavesWrapperReusableAndSecondOpenIsRefused) {
    EXPECT_NE(OK, wrapper->setDataSource(-1, 0, 100));
    char path[] = "/tmp/wrapper-junk-XXXXXX";
    const int fd = mkstemp(path);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(64, write(fd, std::string(64, 'j').data(), 64));
    EXPECT_EQ(ERROR_UNSUPPORTED, wrapper->setDataSource(fd, 0, 64));
    close(fd);
    unlink(path);

    addTrack();
    ASSERT_EQ(OK, open());
    EXPECT_EQ(BAD_VALUE, wrapper->setExtractorForTest(nullptr, new FakeExtractor));
    EXPECT_EQ(1u, wrapper->countTracks());
}

TEST_F(WrapperFormatTest, BitrateSurveyFallsBackToFileSizeOverLongestDuration) {
    sp<MetaData> a = addTrack(), b = addTrack(), c = addTrack();
    a->setInt32(kKeyBitRate, 128000), b->setInt32(kKeyBitRate, 64000), c->setInt32(kKeyBitRate, 8000);
    a->setInt64(kKeyDuration, 5000000), b->setInt64(kKeyDuration, 7000000);
    ASSERT_EQ(OK, open());
    int64_t bitrate = 0;
    ASSERT_TRUE(wrapper->getTotalBitrate(&bitrate));
    EXPECT_EQ(200000, bitrate);

    // One track without a bitrate: 7000 bytes over the 7 s track.
    c->remove(kKeyBitRate);
    extractor->trackMeta.push_back(nullptr);  // a track without metadata is skipped
    wrapper = new TestWrapper;
    ASSERT_EQ(OK, open(7000));
    ASSERT_TRUE(wrapper->getTotalBitrate(&bitrate));
    EXPECT_EQ(8000, bitrate);
    EXPECT_TRUE(log.contains("no metadata for track 3"));
    EXPECT_TRUE(log.contains("track of type 'audio/mp4a-latm' does not publish bitrate"));

    // No duration, or a zero one: no rate.
    for (int64_t duration : {-1, 0}) {
        for (auto& m : extractor->trackMeta) {
            if (m == nullptr) continue;
            m->remove(kKeyDuration);
            if (duration == 0) m->setInt64(kKeyDuration, 0);
        }
        wrapper = new TestWrapper;
        ASSERT_EQ(OK, open());
        EXPECT_FALSE(wrapper->getTotalBitrate(&bitrate)) << duration;
    }
}

TEST_F(WrapperFormatTest, TrackFormatAndMetaAskWithTheirFlags) {
    addTrack();
    ASSERT_EQ(OK, open());
    EXPECT_EQ(nullptr, format(1, -ERANGE));
    EXPECT_EQ(nullptr, wrapper->getTrackMeta(1, 0));
    EXPECT_EQ(extractor->trackMeta[0], wrapper->getTrackMeta(0, 0));
    EXPECT_EQ(1u, extractor->lastMetaFlags);
    sp<AMessage> f = format(0);
    ASSERT_NE(nullptr, f);
    EXPECT_EQ(0u, extractor->lastMetaFlags);
    AString mime;
    EXPECT_TRUE(f->findString("mime", &mime));
    EXPECT_STREQ("audio/mp4a-latm", mime.c_str());
}

TEST_F(WrapperFormatTest, BookmarkSizeIsPublishedOnlyWithinBounds) {
    sp<MetaData> meta = addTrack();
    ASSERT_EQ(OK, open());
    struct { int64_t size; bool kept; const char* line; } cases[] = {
        {1000000, true, "has bookmarksize 1000000"},
        {1000001, false, "weird bookmark size 1000001"},
        {-1, false, "weird bookmark size -1"},
    };
    for (const auto& c : cases) {
        meta->setInt64(kEditorKeyBookmarkSize, c.size);
        sp<AMessage> f = format(0);
        int32_t size = 0;
        EXPECT_EQ(c.kept, f->findInt32("AM-bookmarksize", &size)) << c.size;
        if (c.kept) EXPECT_EQ(c.size, size);
        EXPECT_TRUE(log.contains(c.line)) << c.line;
    }
}

TEST_F(WrapperFormatTest, PcmRewriteStaysOffTheExtractorsMetadata) {
    sp<MetaData> meta = addTrack("audio/raw");
    meta->setInt32(kEditorKeyBitsPerSample, 32);
    meta->setInt32(kEditorKeyPcmEncoding, kEditorAudioEncodingPcmFloat);
    ASSERT_EQ(OK, open());
    format(0);
    format(0);  // asked again, the track is still recognised as 32-bit
    int32_t bits = 0;
    EXPECT_TRUE(wrapper->getTrackMeta(0, 0)->findInt32(kEditorKeyBitsPerSample, &bits));
    EXPECT_EQ(32, bits);
}

TEST_F(WrapperFormatTest, FlacCodecDataFromFixedBlockSizeStreamInfo) {
    sp<MetaData> meta = addTrack("audio/flac");
    const std::vector<uint8_t> item = streamInfo(4096, 4096);
    meta->setData('FRAW', 0, item.data(), item.size());
    ASSERT_EQ(OK, open());
    EXPECT_FALSE(format(0)->contains("csd-0"));  // only in raw mode

    wrapper->setFlacRaw(true);
    sp<AMessage> f = format(0);
    sp<ABuffer> csd;
    ASSERT_TRUE(f->findBuffer("csd-0", &csd));
    ASSERT_EQ(42u, csd->size());
    EXPECT_EQ(0, memcmp(csd->data(), "fLaC", 4));
    EXPECT_EQ(0x00, csd->data()[4]);
    EXPECT_EQ(0, memcmp(csd->data() + 5, item.data() + 1, 37));
    int32_t trim = 0, isCsd = 0;
    int64_t timeUs = -1;
    EXPECT_TRUE(f->findInt32("editor-flactrim", &trim) && trim == 1);
    EXPECT_TRUE(csd->meta()->findInt32("csd", &isCsd) && isCsd == 1);
    EXPECT_TRUE(csd->meta()->findInt64("timeUs", &timeUs) && timeUs == 0);
}

TEST_F(WrapperFormatTest, FlacCodecDataRefusalsLeaveFormatUntouched) {
    sp<MetaData> meta = addTrack("audio/flac");
    ASSERT_EQ(OK, open());
    wrapper->setFlacRaw(true);
    const std::vector<uint8_t> variable = streamInfo(1152, 4608), zeroMin = streamInfo(0, 4096);
    struct { std::vector<uint8_t> item; const char* line; } cases[] = {
        {{}, "streaminfo failed  size=0,  minBlockSize=0, maxBlockSize=0 "},
        {std::vector<uint8_t>(8, 0x10), "streaminfo failed  size=8,  minBlockSize=0, maxBlockSize=0 "},
        {zeroMin, "streaminfo failed  size=38,  minBlockSize=0, maxBlockSize=4096 "},
        {variable, "streaminfo failed  size=38,  minBlockSize=1152, maxBlockSize=4608 "},
    };
    for (const auto& c : cases) {
        meta->remove('FRAW');
        if (!c.item.empty()) meta->setData('FRAW', 0, c.item.data(), c.item.size());
        log.clear();
        sp<AMessage> f = format(0);
        ASSERT_NE(nullptr, f);
        EXPECT_FALSE(f->contains("csd-0"));
        EXPECT_FALSE(f->contains("editor-flactrim"));
        EXPECT_TRUE(log.contains(c.line)) << c.line;
        EXPECT_TRUE(log.contains("not support flac raw format"));
    }
    sp<AMessage> none;
    EXPECT_FALSE(wrapper->makeFlacCSD(meta, &none));
    EXPECT_TRUE(log.contains("makeFlacCSD format == null"));
}

TEST_F(WrapperFormatTest, FileFormatCopiesEditorItems) {
    addTrack();
    ASSERT_EQ(OK, open());
    sp<AMessage> f;
    ASSERT_EQ(OK, wrapper->getFileFormat(&f));
    EXPECT_EQ(1u, f->countEntries());  // only "mime"

    sp<MetaData> m = extractor->fileMeta;
    const uint8_t sphere[5] = {1, 2, 3, 4, 0}, wave[4] = {0, 1, 0, 2}, pssh[3] = {9, 8, 7};
    m->setData(kKeyPssh, 0, pssh, 3);
    m->setCString(kEditorKeyVideoRecordType, "slow");
    m->setData(kEditorKeySphereView, 0, sphere, 5);
    m->setData(kEditorKeyWaveForm, 0, wave, 4);
    m->setData(kEditorKeyWaveForm2, 0, wave, 2);
    m->setCString(kEditorKeyUserMessage, "hello");
    m->setCString(kEditorKeyRecMode, "vr180");
    ASSERT_EQ(OK, wrapper->getFileFormat(&f));
    sp<ABuffer> b;
    AString s;
    ASSERT_TRUE(f->findBuffer("uuid-data", &b));
    EXPECT_EQ(std::vector<uint8_t>(sphere, sphere + 4), std::vector<uint8_t>(b->data(), b->data() + b->size()));
    ASSERT_TRUE(f->findBuffer("AM-waveform1", &b));
    EXPECT_EQ(4u, b->size());
    ASSERT_TRUE(f->findBuffer("AM-waveform2", &b));
    EXPECT_EQ(2u, b->size());
    ASSERT_TRUE(f->findBuffer("pssh", &b));
    EXPECT_EQ(3u, b->size());
    EXPECT_TRUE(f->findString("recording-type", &s) && s == "slow");
    EXPECT_TRUE(f->findString("qn-usermessage", &s) && s == "hello");
    EXPECT_TRUE(f->findString("qn-vrmeta", &s) && s == "vr180");
    EXPECT_TRUE(log.contains("vrmeta vr180"));

    m->setData(kEditorKeySphereView, 0, sphere, 1);
    ASSERT_EQ(OK, wrapper->getFileFormat(&f));
    EXPECT_FALSE(f->contains("uuid-data"));
}

TEST_F(WrapperFormatTest, OutputFormatFlagReachesExtractor) {
    addTrack();
    ASSERT_EQ(OK, open());
    extractor->outputFlagResult = ERROR_UNSUPPORTED;
    EXPECT_EQ(ERROR_UNSUPPORTED, wrapper->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw));
    EXPECT_EQ(5u, extractor->lastOutputFlag);
}
