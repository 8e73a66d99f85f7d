#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include <media/stagefright/FileSource.h>

#include "FakeMedia.h"
#include "WrapperMedia.h"

using namespace android;
using namespace wrappertest;

namespace {

// Consumes every sample on one thread while two others peek and ask formats
// and one toggles `toggleTrack` (if any), whose samples come after all others.
std::vector<Delivered> ConsumeUnderContention(const sp<QNMediaExtractorWrapper>& wrapper, ssize_t toggleTrack) {
    std::vector<Delivered> delivered;
    std::atomic<bool> done{false};
    std::vector<std::thread> others;
    if (toggleTrack >= 0) {
        others.emplace_back([&] {
            while (!done) {
                wrapper->selectTrack(toggleTrack);
                wrapper->unselectTrack(toggleTrack);
            }
        });
    }
    for (int i = 0; i < 2; ++i) {
        others.emplace_back([&] {
            while (!done) {
                int64_t t;
                size_t index;
                sp<MetaData> meta;
                sp<AMessage> format;
                wrapper->getSampleTime(&t);
                wrapper->getSampleTrackIndex(&index);
                wrapper->getSampleMeta(&meta);
                wrapper->readSampleData(sp<ABuffer>(new ABuffer(16)));
                wrapper->getTrackFormat(0, &format);
                wrapper->getTrackMeta(0, 0);
                wrapper->countTracks();
                wrapper->getTotalBitrate(&t);
            }
        });
    }
    Delivered d;
    while (TakeSample(wrapper, &d) && static_cast<ssize_t>(d.track) != toggleTrack) delivered.push_back(d);
    done = true;
    for (std::thread& t : others) t.join();
    return delivered;
}

std::vector<Step> numbered(uint8_t track, int count, int64_t stepUs, int64_t startUs = 0) {
    std::vector<Step> steps;
    for (int i = 0; i < count; ++i) {
        steps.push_back(sample(startUs + i * stepUs, {track, uint8_t(i & 0xFF), uint8_t(i >> 8)}));
    }
    return steps;
}

}  // namespace

TEST(WrapperConcurrencyTest, SharedWrapperDeliversEverySampleOnce) {
    BufferLedger ledger;
    sp<FakeExtractor> extractor = new FakeExtractor;
    const int kCounts[2] = {300, 470};
    extractor->addTrack("video/avc", numbered(0, kCounts[0], 33333), &ledger);
    extractor->addTrack("audio/mp4a-latm", numbered(1, kCounts[1], 21333), &ledger);
    extractor->addTrack("audio/raw", numbered(2, 1000, 1, int64_t(1) << 40), &ledger);
    sp<TestWrapper> wrapper = new TestWrapper;
    ASSERT_EQ(OK, wrapper->setExtractorForTest(new BufferDataSource("x", 1), extractor));
    ASSERT_EQ(OK, wrapper->selectTrack(1));
    ASSERT_EQ(OK, wrapper->selectTrack(0));

    int next[2] = {0, 0};
    for (const Delivered& d : ConsumeUnderContention(wrapper, 2)) {
        ASSERT_LT(d.track, 2u);
        ASSERT_EQ(next[d.track]++, d.bytes[1] | d.bytes[2] << 8) << "track " << d.track;
    }
    EXPECT_EQ(kCounts[0], next[0]);
    EXPECT_EQ(kCounts[1], next[1]);
    wrapper.clear();
    EXPECT_EQ(0, ledger.outstanding);
}

TEST(WrapperConcurrencyTest, SharedWrapperReadsARealFileOnce) {
    sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(std::string(ME_TEST_MEDIA_DIR) + "/mp4/avc_aac.mp4");
    ASSERT_NE(nullptr, wrapper);
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    ASSERT_EQ(OK, wrapper->selectTrack(1));
    ExpectDeliveredInOrder(MergeOrder(Mp4Packets("avc_aac.mp4"), {0, 1}), ConsumeUnderContention(wrapper, -1));
}
