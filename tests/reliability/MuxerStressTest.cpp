// A real MP4 muxer fed from two threads while a third forces one track to
// stop: nothing either thread had accepted before the stop is missing from
// the file, nothing refused is in it, and the whole run ends in bounded time.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <atomic>
#include <thread>
#include <vector>

#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "QNMediaExtractorWrapper.h"
#include "QNMediaMuxer.h"
#include "reliability/ReliabilitySupport.h"
#include "reliability/ThreadSupport.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace reliability;

namespace {

struct Sample {
    int64_t timeUs;
    Bytes bytes;
};

sp<QNMediaExtractorWrapper> openFd(int fd) {
    const off_t size = lseek(fd, 0, SEEK_END);
    sp<QNMediaExtractorWrapper> w = new QNMediaExtractorWrapper;
    return size > 0 && w->setDataSource(fd, 0, size) == OK ? w : nullptr;
}

// Every sample of each track of the file, in order.
std::vector<std::vector<Sample>> samplesPerTrack(const sp<QNMediaExtractorWrapper>& w) {
    std::vector<std::vector<Sample>> tracks(w->countTracks());
    for (size_t i = 0; i < tracks.size(); ++i) w->selectTrack(i);
    sp<ABuffer> b;
    size_t track;
    int64_t t;
    while (w->getSampleTrackIndex(&track) == OK && w->getSampleTime(&t) == OK && w->readSampleData(&b) == OK) {
        tracks[track].push_back({t, Bytes(b->data(), b->data() + b->size())});
        w->advance();
    }
    return tracks;
}

// The AAC track of the test media, repeated so that the race has room; times
// start at 0 and run on across the repetitions.
std::vector<Sample> audioSamples(sp<AMessage>* format) {
    const int fd = open((std::string(ME_TEST_MEDIA_DIR) + "/mp4/aac.m4a").c_str(), O_RDONLY | O_CLOEXEC);
    sp<QNMediaExtractorWrapper> w = fd >= 0 ? openFd(fd) : nullptr;
    if (fd >= 0) close(fd);
    if (w == nullptr || w->getTrackFormat(0, format) != OK) return {};
    const std::vector<Sample> once = samplesPerTrack(w)[0];
    std::vector<Sample> out;
    const int64_t first = once.front().timeUs, span = once.back().timeUs - first + 21333;
    for (int rep = 0; rep < 8; ++rep) {
        for (const Sample& s : once) out.push_back({s.timeUs - first + rep * span, s.bytes});
    }
    return out;
}

TEST(MuxerStressTest, ForcedStopDuringTwoWritersKeepsEveryAcceptedSampleInTheFile) {
    QuietLogs quiet;
    sp<AMessage> format;
    const std::vector<Sample> samples = audioSamples(&format);
    ASSERT_FALSE(samples.empty());

    // The stop lands at a different point of the stream in each round.
    const int stopAfter[] = {1, 10, 60, 200, 400, 575};
    for (int round = 0; round < 6; ++round) {
        SCOPED_TRACE("round " + std::to_string(round));
        const uint32_t stopped = round % 2;
        const int fd = memfd_create("muxed", MFD_CLOEXEC);
        ASSERT_GE(fd, 0);
        sp<QNMediaMuxer> muxer = new QNMediaMuxer(fd, OUTPUT_FILE_FORMAT_MPEG_4);
        ASSERT_EQ(0, muxer->addTrack(format));
        ASSERT_EQ(1, muxer->addTrack(format));
        ASSERT_EQ(OK, muxer->start());

        std::vector<status_t> results[2];
        std::atomic<int> written[2] = {{0}, {0}};
        status_t forced = UNKNOWN_ERROR, stopResult = UNKNOWN_ERROR;
        runWithin(kThreadTestLimit, "muxer stress", [&] {
            auto produce = [&](uint32_t track) {
                for (const Sample& s : samples) {
                    sp<ABuffer> b = ABuffer::CreateAsCopy(s.bytes.data(), s.bytes.size());
                    results[track].push_back(muxer->writeSampleData(0, b, track, s.timeUs, 1));
                    ++written[track];
                }
            };
            std::thread a(produce, 0), b(produce, 1);
            std::thread stopper([&] {
                while (written[stopped] < stopAfter[round]) std::this_thread::yield();
                forced = muxer->forceTrackStop(stopped);
            });
            a.join();
            b.join();
            stopper.join();
            stopResult = muxer->stop();
        });
        EXPECT_EQ(OK, forced);
        EXPECT_EQ(OK, stopResult);
        muxer.clear();

        sp<QNMediaExtractorWrapper> back = openFd(fd);
        close(fd);
        ASSERT_NE(nullptr, back);
        const std::vector<std::vector<Sample>> stored = samplesPerTrack(back);
        ASSERT_EQ(2u, stored.size());
        for (uint32_t track = 0; track < 2; ++track) {
            // Refusals start at the stop and never end; what came before is kept.
            size_t accepted = 0;
            while (accepted < results[track].size() && results[track][accepted] == OK) ++accepted;
            for (size_t i = accepted; i < results[track].size(); ++i) {
                ASSERT_EQ(INVALID_OPERATION, results[track][i]) << "track " << track << " sample " << i;
            }
            if (track != stopped) EXPECT_EQ(samples.size(), accepted) << "the running track was refused";
            ASSERT_EQ(accepted, stored[track].size()) << "track " << track;
            for (size_t i = 0; i < accepted; ++i) {
                ASSERT_EQ(samples[i].bytes, stored[track][i].bytes) << "track " << track << " sample " << i;
            }
        }
    }
}

}  // namespace
