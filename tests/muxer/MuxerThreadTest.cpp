#include <gtest/gtest.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <future>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "muxer/MuxerTestSupport.h"

using namespace android;
using namespace muxertest;
using namespace std::chrono_literals;
using android::qnmediaeditor::OUTPUT_FILE_FORMAT_WAVE;
using android::qnmediaeditor::QNMediaMuxer;
using Access = android::qnmediaeditor::QNMediaMuxerTestAccess;

namespace {

TEST(MuxerConcurrencyTest, ForcedStopDuringTwoWritersLosesNothingPushedBeforeIt) {
    constexpr int kSamples = 3000;
    sp<RecordingWriter> writer = new RecordingWriter(/*pull=*/true);
    writer->slowTrack = 0;  // its queue fills, so its pushes block under the muxer lock
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(-1, OUTPUT_FILE_FORMAT_WAVE);
    Access::setWriter(muxer, writer);
    ASSERT_EQ(0, muxer->addTrack(trackFormat(MEDIA_MIMETYPE_AUDIO_RAW)));
    ASSERT_EQ(1, muxer->addTrack(trackFormat(MEDIA_MIMETYPE_AUDIO_RAW)));
    ASSERT_EQ(OK, muxer->start());

    std::vector<status_t> results[2];
    auto scenario = std::async(std::launch::async, [&] {
        auto produce = [&](uint32_t track) {
            for (int i = 0; i < kSamples; ++i) {
                results[track].push_back(muxer->writeSampleData(0, sampleOf({uint8_t(i)}), track, i, 0));
            }
        };
        std::thread a(produce, 0), b(produce, 1);
        std::this_thread::sleep_for(10ms);
        const status_t forced = muxer->forceTrackStop(0);
        a.join();
        b.join();
        return forced == OK ? muxer->stop() : forced;
    });
    if (scenario.wait_for(60s) != std::future_status::ready) {
        fprintf(stderr, "muxer deadlocked\n");
        abort();  // the threads cannot be unstuck
    }
    EXPECT_EQ(OK, scenario.get());

    std::vector<int64_t> delivered[2];
    for (const Sample& s : writer->seen()) delivered[s.track].push_back(s.timeUs);
    for (int track = 0; track < 2; ++track) {
        std::vector<int64_t> accepted;
        for (int i = 0; i < kSamples; ++i) {
            if (results[track][i] == OK) {
                accepted.push_back(i);
            } else {
                EXPECT_EQ(INVALID_OPERATION, results[track][i]);
            }
        }
        EXPECT_EQ(accepted, delivered[track]) << "track " << track;
    }
    EXPECT_EQ(size_t(kSamples), delivered[1].size());
    // Once refused, a stopped track refuses everything after.
    auto firstRefused = std::find(results[0].begin(), results[0].end(), INVALID_OPERATION);
    EXPECT_TRUE(std::all_of(firstRefused, results[0].end(), [](status_t r) { return r == INVALID_OPERATION; }));
}

}  // namespace
