#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include <media/stagefright/FileSource.h>

#include "FakeMedia.h"

using namespace android;
using namespace wrappertest;

namespace {

std::vector<Step> numbered(uint8_t track, int count, int64_t stepUs, int64_t startUs = 0) {
    std::vector<Step> steps;
    for (int i = 0; i < count; ++i) {
        steps.push_back(sample(startUs + i * stepUs, {track, uint8_t(i & 0xFF), uint8_t(i >> 8)}));
    }
    return steps;
}

}  // namespace

// One thread consumes; others peek, ask formats and toggle a track whose
// samples lie after all others. Every counted sample arrives once, in order.
TEST(WrapperConcurrencyTest, SharedWrapperDeliversEverySampleOnce) {
    BufferLedger ledger;
    sp<FakeExtractor> extractor = new FakeExtractor;
    const int kVideo = 300, kAudio = 470;
    extractor->addTrack("video/avc", numbered(0, kVideo, 33333), &ledger);
    extractor->addTrack("audio/mp4a-latm", numbered(1, kAudio, 21333), &ledger);
    extractor->addTrack("audio/raw", numbered(2, 1000, 1, int64_t(1) << 40), &ledger);
    sp<TestWrapper> wrapper = new TestWrapper;
    ASSERT_EQ(OK, wrapper->setExtractorForTest(new BufferDataSource("x", 1), extractor));
    ASSERT_EQ(OK, wrapper->selectTrack(1));
    ASSERT_EQ(OK, wrapper->selectTrack(0));

    std::atomic<bool> done{false};
    std::vector<int> next(2, 0);
    bool ordered = true;
    std::thread consumer([&] {
        for (;;) {
            sp<ABuffer> buffer;
            if (wrapper->readSampleData(&buffer) != OK || buffer->size() != 3 || buffer->data()[0] == 2) break;
            const int track = buffer->data()[0], seq = buffer->data()[1] | buffer->data()[2] << 8;
            ordered = ordered && seq == next[track];
            ++next[track];
            if (wrapper->advance() != OK) break;
        }
        done = true;
    });
    std::vector<std::thread> others;
    others.emplace_back([&] {
        while (!done) {
            wrapper->selectTrack(2);
            wrapper->unselectTrack(2);
        }
    });
    for (int i = 0; i < 2; ++i) {
        others.emplace_back([&] {
            while (!done) {
                int64_t t;
                size_t index;
                sp<MetaData> meta;
                sp<AMessage> format;
                sp<ABuffer> peek = new ABuffer(16);
                wrapper->getSampleTime(&t);
                wrapper->getSampleTrackIndex(&index);
                wrapper->getSampleMeta(&meta);
                wrapper->readSampleData(peek);
                wrapper->getTrackFormat(1, &format);
                wrapper->getTrackMeta(0, 0);
                wrapper->countTracks();
                wrapper->getTotalBitrate(&t);
            }
        });
    }
    consumer.join();
    for (std::thread& t : others) t.join();

    EXPECT_TRUE(ordered);
    EXPECT_EQ(kVideo, next[0]);
    EXPECT_EQ(kAudio, next[1]);
    wrapper.clear();
    EXPECT_EQ(0, ledger.outstanding);
}
