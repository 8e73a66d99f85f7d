#include <gtest/gtest.h>

#include <media/MediaCodecBuffer.h>
#include <media/stagefright/FileSource.h>

#include "FakeMedia.h"
#include "LogCapture.h"
#include "QNMediaEditorDefs.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace wrappertest;

namespace {

class WrapperReadTest : public ::testing::Test {
protected:
    sp<FakeSource> addTrack(const char* mime, std::vector<Step> steps) {
        extractor->addTrack(mime, std::move(steps), &ledger);
        return extractor->sources.back();
    }
    void open() { ASSERT_EQ(OK, wrapper->setExtractorForTest(new BufferDataSource("x", 1), extractor)); }
    // Reads to the end: "track:time" of every sample, in delivery order.
    std::vector<std::string> drain() {
        std::vector<std::string> order;
        size_t track;
        int64_t timeUs;
        while (wrapper->getSampleTrackIndex(&track) == OK && wrapper->getSampleTime(&timeUs) == OK) {
            order.push_back(std::to_string(track) + ":" + std::to_string(timeUs));
            EXPECT_EQ(OK, wrapper->advance());
        }
        EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->advance());
        return order;
    }
    static std::vector<uint8_t> bytes(const sp<ABuffer>& b) { return {b->data(), b->data() + b->size()}; }

    BufferLedger ledger;  // outlives the wrapper
    LogCapture log;
    sp<FakeExtractor> extractor = new FakeExtractor;
    sp<TestWrapper> wrapper = new TestWrapper;
};

std::vector<Step> samplesAt(std::initializer_list<int64_t> times) {
    std::vector<Step> steps;
    for (int64_t t : times) steps.push_back(sample(t, {uint8_t(t)}));
    return steps;
}

}  // namespace

TEST_F(WrapperReadTest, NothingSelectedIsEndOfStream) {
    addTrack("audio/raw", samplesAt({0}));
    open();
    sp<ABuffer> out;
    int64_t t;
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->advance());
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->readSampleData(&out));
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->getSampleTime(&t));
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->seekTo(0));
}

TEST_F(WrapperReadTest, MergesByTimeEarlierSelectionWinsTiesAndIndexIsTheExtractors) {
    addTrack("video/avc", samplesAt({0, 40, 80}));
    addTrack("audio/raw", samplesAt({99}));
    addTrack("audio/mp4a-latm", samplesAt({0, 20, 40, 60}));
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(2));
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    EXPECT_EQ(-ERANGE, wrapper->selectTrack(3));
    EXPECT_EQ(-ERANGE, wrapper->unselectTrack(3));
    EXPECT_EQ((std::vector<std::string>{"2:0", "0:0", "2:20", "2:40", "0:40", "2:60", "0:80"}), drain());
    EXPECT_EQ(0, ledger.outstanding);
}

TEST_F(WrapperReadTest, SelectionIsIdempotentAndUnselectDropsThePendingSample) {
    sp<FakeSource> video = addTrack("video/avc", samplesAt({0, 40}));
    sp<FakeSource> audio = addTrack("audio/raw", samplesAt({10}));
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    EXPECT_EQ(1, video->starts);
    EXPECT_EQ(OK, wrapper->unselectTrack(1));  // never selected
    int64_t t;
    ASSERT_EQ(OK, wrapper->getSampleTime(&t));
    EXPECT_EQ(1, ledger.outstanding);
    EXPECT_EQ(OK, wrapper->unselectTrack(0));
    EXPECT_EQ(0, ledger.outstanding);
    EXPECT_EQ(1, video->stops);
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->getSampleTime(&t));
    EXPECT_EQ(0, audio->starts);
}

TEST_F(WrapperReadTest, SourceThatFailsToStartIsNotSelected) {
    sp<FakeSource> s = addTrack("audio/raw", samplesAt({0}));
    s->startResult = ERROR_IO;
    open();
    EXPECT_EQ(ERROR_IO, wrapper->selectTrack(0));
    int64_t t;
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->getSampleTime(&t));
    EXPECT_EQ(OK, wrapper->unselectTrack(0));
    EXPECT_EQ(0, s->stops);
}

TEST_F(WrapperReadTest, SourceFormatWithoutMimeTypeIsABrokenContract) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    addTrack("audio/raw", {})->format->remove(kKeyMIMEType);
    open();
    EXPECT_DEATH(wrapper->selectTrack(0), "CHECK\\(source->getFormat\\(\\)->findCString\\(kKeyMIMEType, &mime\\)\\) failed\\.");
}

TEST_F(WrapperReadTest, SeekRevivesEndedTracksAndPassesModeOnce) {
    sp<FakeSource> s = addTrack("video/avc", samplesAt({0, 40, 80}));
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    EXPECT_EQ(3u, drain().size());
    ASSERT_EQ(OK, wrapper->seekTo(40, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC));
    EXPECT_EQ((std::vector<int64_t>{40}), s->seeks);
    EXPECT_EQ(MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC, s->lastSeekMode);
    EXPECT_EQ((std::vector<std::string>{"0:40", "0:80"}), drain());
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->seekTo(1000));
    EXPECT_EQ(0, ledger.outstanding);
}

TEST_F(WrapperReadTest, CorruptNalIsRetried101TimesWithoutRepeatingTheSeek) {
    std::vector<Step> steps(101, failure(EDITOR_ERROR_CORRUPT_NAL));
    steps.push_back(sample(0));
    sp<FakeSource> s = addTrack("video/avc", steps);
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    EXPECT_EQ(OK, wrapper->seekTo(0));
    EXPECT_EQ(101, log.count("corrupt nal, retry"));
    EXPECT_EQ(102, s->reads);
    EXPECT_EQ(101, s->readsWithoutOptions);
    EXPECT_EQ(1u, s->seeks.size());
}

TEST_F(WrapperReadTest, ExhaustedRetriesEndTheTrackQuietlyOtherErrorsWarn) {
    std::vector<Step> corrupt(102, failure(EDITOR_ERROR_CORRUPT_NAL));
    corrupt.push_back(sample(0));
    sp<FakeSource> video = addTrack("video/avc", corrupt);
    addTrack("audio/raw", {sample(5), failure(ERROR_IO), sample(50)});
    addTrack("audio/raw", samplesAt({7, 8}));
    open();
    for (size_t i = 0; i < 3; ++i) ASSERT_EQ(OK, wrapper->selectTrack(i));
    EXPECT_EQ((std::vector<std::string>{"1:5", "2:7", "2:8"}), drain());
    EXPECT_EQ(102, video->reads);
    EXPECT_EQ(101, log.count("corrupt nal, retry"));
    EXPECT_EQ(1, log.count("read on track 1 failed with error -1004"));
    EXPECT_FALSE(log.containsAt(ANDROID_LOG_WARN, "read on track 0"));
    EXPECT_FALSE(log.containsAt(ANDROID_LOG_WARN, "read on track 2"));
}

TEST_F(WrapperReadTest, VorbisSamplesCarryTheValidSampleCount) {
    Step counted = sample(0, std::vector<uint8_t>(100, 0xAB));
    counted.hasValidSamples = true;
    counted.validSamples = 0x01020304;
    addTrack("AUDIO/VORBIS", {counted, sample(10, std::vector<uint8_t>(100, 0xCD))});
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));

    sp<ABuffer> small = new ABuffer(103);
    EXPECT_EQ(NO_MEMORY, wrapper->readSampleData(small));
    EXPECT_TRUE(log.contains("capacity(103) < samplesize(104)"));
    sp<ABuffer> out;
    ASSERT_EQ(OK, wrapper->readSampleData(&out));  // still pending
    ASSERT_EQ(104u, out->size());
    EXPECT_EQ(108u, out->capacity());
    EXPECT_EQ((std::vector<uint8_t>{0x04, 0x03, 0x02, 0x01}), std::vector<uint8_t>(out->data() + 100, out->data() + 104));

    ASSERT_EQ(OK, wrapper->advance());
    sp<ABuffer> exact = new ABuffer(104);
    ASSERT_EQ(OK, wrapper->readSampleData(exact));
    EXPECT_EQ(0xCD, exact->data()[99]);
    EXPECT_EQ((std::vector<uint8_t>{0xFF, 0xFF, 0xFF, 0xFF}), std::vector<uint8_t>(exact->data() + 100, exact->data() + 104));
}

TEST_F(WrapperReadTest, CopiesTheSampleRangeIntoBuffersWhateverTheirOffset) {
    Step s = sample(0, {1, 2, 3, 4, 5, 6});
    s.rangeOffset = 3;
    addTrack("video/avc", {s});
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    const std::vector<uint8_t> expected{1, 2, 3, 4, 5, 6};

    // A caller's buffer with a range offset still gets the whole sample, at
    // its base, with the range covering exactly it.
    sp<ABuffer> offsetBuffer = new ABuffer(8);
    offsetBuffer->setRange(5, 3);
    ASSERT_EQ(OK, wrapper->readSampleData(offsetBuffer));
    EXPECT_EQ(0u, offsetBuffer->offset());
    EXPECT_EQ(expected, bytes(offsetBuffer));
    sp<ABuffer> again = new ABuffer(6);
    ASSERT_EQ(OK, wrapper->readSampleData(again));
    EXPECT_EQ(expected, bytes(again));

    sp<ABuffer> backing = new ABuffer(8);
    sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, backing);
    codec->setRange(4, 2);
    ASSERT_EQ(OK, wrapper->readSampleData(codec));
    EXPECT_EQ(0u, codec->offset());
    EXPECT_EQ(expected, std::vector<uint8_t>(codec->data(), codec->data() + codec->size()));
    sp<MediaCodecBuffer> tiny = new MediaCodecBuffer(new AMessage, new ABuffer(5));
    EXPECT_EQ(NO_MEMORY, wrapper->readSampleData(tiny));

    sp<MetaData> meta;
    ASSERT_EQ(OK, wrapper->getSampleMeta(&meta));
    int64_t t = -1;
    EXPECT_TRUE(meta->findInt64(kKeyTime, &t) && t == 0);
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->readSampleData(static_cast<sp<ABuffer>*>(nullptr)));
}

TEST_F(WrapperReadTest, MarkedPcmTrackIsPackedTo24BitsOnRead) {
    std::vector<uint8_t> words(4096);
    for (size_t i = 0; i < words.size(); ++i) words[i] = static_cast<uint8_t>(i);
    for (int i = 0; i < 2; ++i) {
        sp<MetaData> meta = extractor->addTrack("audio/raw", {sample(0, words)}, &ledger);
        meta->setInt32(kEditorKeyBitsPerSample, 32);
        meta->setInt32(kEditorKeyPcmEncoding, kEditorAudioEncodingPcm32bit);
    }
    open();
    sp<AMessage> f;
    ASSERT_EQ(OK, wrapper->getTrackFormat(0, &f));
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    sp<ABuffer> out;
    ASSERT_EQ(OK, wrapper->readSampleData(&out));
    ASSERT_EQ(3072u, out->size());
    EXPECT_EQ((std::vector<uint8_t>{1, 2, 3, 5, 6, 7}), std::vector<uint8_t>(out->data(), out->data() + 6));

    // The mark moves to the track asked last.
    ASSERT_EQ(OK, wrapper->getTrackFormat(1, &f));
    sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, new ABuffer(4096));
    ASSERT_EQ(OK, wrapper->readSampleData(codec));
    EXPECT_EQ(4096u, codec->size());
    ASSERT_EQ(OK, wrapper->unselectTrack(0));
    ASSERT_EQ(OK, wrapper->selectTrack(1));
    ASSERT_EQ(OK, wrapper->readSampleData(codec));
    EXPECT_EQ(3072u, codec->size());
}

TEST_F(WrapperReadTest, DestructionGivesBackSamplesAndSurvivesAFailingStop) {
    sp<FakeSource> a = addTrack("video/avc", samplesAt({0}));
    sp<FakeSource> b = addTrack("audio/raw", samplesAt({0}));
    b->stopResult = ERROR_IO;
    open();
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    ASSERT_EQ(OK, wrapper->selectTrack(1));
    ASSERT_EQ(OK, wrapper->seekTo(0));
    EXPECT_EQ(2, ledger.outstanding);
    wrapper.clear();
    EXPECT_EQ(0, ledger.outstanding);
    EXPECT_EQ(1, a->stops);
    EXPECT_EQ(1, b->stops);
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_ERROR, "stopping track 1 failed"));
}
