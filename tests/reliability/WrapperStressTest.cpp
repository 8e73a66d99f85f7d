// One wrapper per sample file shared by several consumers at once, with a
// looker asking formats beside them: every sample is consumed exactly once,
// and whatever a consumer copies out is one whole sample of the file.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <mutex>
#include <set>
#include <thread>
#include <vector>

#include <media/MediaCodecBuffer.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "QNMediaEditorDefs.h"
#include "QNMediaExtractorWrapper.h"
#include "reliability/ReliabilitySupport.h"
#include "reliability/ThreadSupport.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace reliability;

namespace {

sp<QNMediaExtractorWrapper> openAll(const SampleFile& f, bool flacRaw) {
    const int fd = open(f.path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) return nullptr;
    sp<QNMediaExtractorWrapper> w = new QNMediaExtractorWrapper;
    const status_t err = w->setDataSource(fd, 0, int64_t(f.bytes.size()));
    close(fd);
    if (err != OK) return nullptr;
    if (flacRaw) {
        w->setFlacRaw(true);
        w->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw);
    }
    for (size_t i = 0; i < w->countTracks(); ++i) {
        sp<AMessage> format;
        w->getTrackFormat(i, &format);  // marks 32-bit PCM for re-packing, as the editor does
        if (w->selectTrack(i) != OK) return nullptr;
    }
    return w;
}

Bytes bytesOf(const sp<ABuffer>& b) { return Bytes(b->data(), b->data() + b->size()); }

// The samples a single reader gets, as byte strings.
std::multiset<Bytes> readAlone(const SampleFile& f, bool flacRaw) {
    std::multiset<Bytes> out;
    sp<QNMediaExtractorWrapper> w = openAll(f, flacRaw);
    sp<ABuffer> b;
    while (w != nullptr && w->readSampleData(&b) == OK) {
        out.insert(bytesOf(b));
        if (w->advance() != OK) break;
    }
    return out;
}

struct SharedRun {
    int advanced = 0;
    std::vector<Bytes> copies;
};

// Three consumers, each with its own read form, and one looker.
SharedRun readShared(const SampleFile& f, bool flacRaw) {
    SharedRun run;
    sp<QNMediaExtractorWrapper> w = openAll(f, flacRaw);
    if (w == nullptr) return run;
    std::atomic<int> advanced{0};
    std::atomic<bool> done{false};
    std::mutex lock;
    auto keep = [&](Bytes b) {
        std::lock_guard<std::mutex> guard(lock);
        run.copies.push_back(std::move(b));
    };
    runWithin(kThreadTestLimit, f.name.c_str(), [&] {
        std::vector<std::thread> consumers;
        for (int k = 0; k < 3; ++k) {
            consumers.emplace_back([&, k] {
                sp<ABuffer> own = new ABuffer(1 << 20);
                sp<MediaCodecBuffer> codec = new MediaCodecBuffer(new AMessage, new ABuffer(1 << 20));
                for (;;) {
                    sp<ABuffer> fresh;
                    status_t err;
                    if (k == 0) {
                        err = w->readSampleData(&fresh);
                        if (err == OK) keep(bytesOf(fresh));
                    } else if (k == 1) {
                        err = w->readSampleData(own);
                        if (err == OK) keep(bytesOf(own));
                    } else {
                        err = w->readSampleData(codec);
                        if (err == OK) keep(Bytes(codec->data(), codec->data() + codec->size()));
                    }
                    if (err != OK || w->advance() != OK) return;
                    ++advanced;
                }
            });
        }
        std::thread looker([&] {
            while (!done) {
                sp<AMessage> format;
                sp<MetaData> meta;
                int64_t t;
                size_t track;
                w->getFileFormat(&format);
                w->getTrackFormat(0, &format);
                w->getTrackMeta(0, 0);
                w->getSampleMeta(&meta);
                w->getSampleTrackIndex(&track);
                w->getSampleTime(&t);
                w->getTotalBitrate(&t);
                w->countTracks();
            }
        });
        for (auto& t : consumers) t.join();
        done = true;
        looker.join();
    });
    run.advanced = advanced;
    return run;
}

TEST(WrapperStressTest, ConsumersSharingAWrapperTakeEverySampleOnce) {
    QuietLogs quiet;
    for (const SampleFile& f : sampleFiles()) {
        for (bool flacRaw : {false, true}) {
            if (flacRaw && !f.flac) continue;
            SCOPED_TRACE(f.name + (flacRaw ? " (raw frames)" : ""));
            const std::multiset<Bytes> alone = readAlone(f, flacRaw);
            ASSERT_FALSE(alone.empty());
            const SharedRun shared = readShared(f, flacRaw);
            EXPECT_EQ(int(alone.size()), shared.advanced);
            for (const Bytes& copy : shared.copies) {
                ASSERT_TRUE(alone.count(copy) > 0) << "a copy of " << copy.size() << " bytes is no sample";
            }
        }
    }
}

}  // namespace
