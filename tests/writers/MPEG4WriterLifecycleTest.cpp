// MP4 writer life cycle: refusals, missing or empty input, descriptors that
// cannot be written, independent and bounded readers.

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <future>

#include <gtest/gtest.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "writers/MPEG4TestSupport.h"

using namespace android;
using namespace mp4test;

namespace {

sp<MetaData> format(const char* mime) {
    sp<MetaData> m = new MetaData;
    m->setCString(kKeyMIMEType, mime);
    m->setInt32(kKeySampleRate, 8000);
    m->setInt32(kKeyChannelCount, 1);
    return m;
}

Pushed amrFrame(int i) {
    std::vector<uint8_t> frame(32, uint8_t(i));
    frame[0] = (7 << 3) | 0x04;
    return {0, frame, i * 20000, i * 20000, true, false};
}

uint32_t be32(const std::vector<uint8_t>& b, size_t at) {
    return (uint32_t(b.at(at)) << 24) | (b.at(at + 1) << 16) | (b.at(at + 2) << 8) | b.at(at + 3);
}

int countTracks(const std::vector<uint8_t>& file) {
    int n = 0;
    for (size_t pos = 0; pos + 4 <= file.size(); ++pos) n += !memcmp(&file[pos], "trak", 4);
    return n;
}

class MPEG4WriterLifecycle : public ::testing::Test {
protected:
    void SetUp() override {
        mPath = tempDir() + "/out.mp4";
        mFd = open(mPath.c_str(), O_CREAT | O_TRUNC | O_RDWR, 0644);
        ASSERT_GE(mFd, 0);
    }
    void TearDown() override {
        if (mFd >= 0) close(mFd);
    }
    std::string mPath;
    int mFd = -1;
};

TEST_F(MPEG4WriterLifecycle, RefusesWrongOrderAndBadArguments) {
    sp<MPEG4Writer> w = new MPEG4Writer(mFd);
    EXPECT_EQ(INVALID_OPERATION, w->stop());
    EXPECT_EQ(BAD_VALUE, w->addSource(nullptr));
    EXPECT_EQ(ERROR_UNSUPPORTED, w->addSource(new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_VORBIS))));
    EXPECT_EQ(ERROR_UNSUPPORTED, w->addSource(new MediaAdapter(new MetaData)));
    EXPECT_EQ(BAD_VALUE, w->setGeoData(900001, 0));
    EXPECT_EQ(BAD_VALUE, w->setGeoData(0, -1800001));
    EXPECT_EQ(BAD_VALUE, w->setUuidData(nullptr, 3));
    EXPECT_EQ(ERROR_UNSUPPORTED, w->pause());

    EXPECT_EQ(OK, w->start());
    EXPECT_EQ(INVALID_OPERATION, w->start());
    EXPECT_EQ(INVALID_OPERATION, w->addSource(new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_AMR_NB))));
    EXPECT_EQ(INVALID_OPERATION, w->setGeoData(0, 0));
    EXPECT_EQ(INVALID_OPERATION, w->setUuidData(nullptr, 0));
    EXPECT_EQ(INVALID_OPERATION, w->setQNVideoFourCC(String8("slow")));
    EXPECT_EQ(OK, w->stop());
    EXPECT_EQ(OK, w->stop());

    // No track at all: still a complete file.
    const auto top = childBoxes(readFile(mPath), "");
    EXPECT_EQ(1u, top.count("ftyp"));
    EXPECT_EQ(1u, top.count("mdat"));
    EXPECT_EQ(1u, top.count("moov"));
}

TEST_F(MPEG4WriterLifecycle, EmptyTracksSamplesAndMissingConfig) {
    {
        // A video track that never got a sample is left out; empty samples
        // and samples of a track's config are not stored as media.
        sp<MPEG4Writer> w = new MPEG4Writer(mFd);
        std::vector<Pushed> samples = {amrFrame(0), {0, {}, 20000, 20000, true, false}, amrFrame(2), amrFrame(3)};
        const WriteResult r = writeThroughAdapters(w, {format(MEDIA_MIMETYPE_AUDIO_AMR_NB), format(MEDIA_MIMETYPE_VIDEO_AVC)},
                                                   samples);
        EXPECT_EQ(OK, r.stop);
        const std::vector<uint8_t> file = readFile(mPath);
        EXPECT_EQ(1, countTracks(file));
        const auto stbl = childBoxes(file, "moov/trak/mdia/minf/stbl");
        EXPECT_EQ(3u, be32(stbl.at("stsz"), 8));
    }
    {
        // Video without parameter sets cannot be described: a clear status,
        // and the other track is still complete.
        ASSERT_EQ(0, ftruncate(mFd, 0));
        ASSERT_EQ(0, lseek(mFd, 0, SEEK_SET));
        sp<MPEG4Writer> w = new MPEG4Writer(mFd);
        std::vector<Pushed> samples = {amrFrame(0), {1, {0, 0, 0, 1, 0x65, 0x88, 0x84}, 0, 0, true, false}, amrFrame(1)};
        const WriteResult r = writeThroughAdapters(w, {format(MEDIA_MIMETYPE_AUDIO_AMR_NB), format(MEDIA_MIMETYPE_VIDEO_AVC)},
                                                   samples);
        EXPECT_EQ(ERROR_MALFORMED, r.stop);
        EXPECT_EQ(1, countTracks(readFile(mPath)));
        if (haveTool("ffprobe")) {
            Flat f;
            ASSERT_TRUE(probe(mPath, "-show_streams", &f));
            EXPECT_EQ("amr_nb", f["streams.stream.0.codec_name"]);
        }
    }
}

TEST_F(MPEG4WriterLifecycle, DescriptorsThatCannotBeWritten) {
    {
        const int readOnly = open(mPath.c_str(), O_RDONLY);
        sp<MPEG4Writer> w = new MPEG4Writer(readOnly);
        EXPECT_EQ(OK, w->addSource(new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_AMR_NB))));
        EXPECT_EQ(-EBADF, w->start());
        EXPECT_EQ(-EBADF, w->stop());
        close(readOnly);
    }
    {
        sp<MPEG4Writer> w = new MPEG4Writer(-1);
        EXPECT_EQ(BAD_VALUE, w->start());
    }
    {
        // The descriptor goes away mid-recording: the source is still
        // drained, and stop() reports the failure.
        const int fd = open(mPath.c_str(), O_RDWR);
        sp<MPEG4Writer> w = new MPEG4Writer(fd);
        std::vector<Pushed> samples;
        for (int i = 0; i < 200; ++i) samples.push_back(amrFrame(i));
        const WriteResult r =
            writeThroughAdapters(w, {format(MEDIA_MIMETYPE_AUDIO_AMR_NB)}, samples, nullptr, [fd] { close(fd); });
        EXPECT_EQ(OK, r.start);
        EXPECT_EQ(-EBADF, r.stop);
    }
}

// Hands out `count` buffers of `size` bytes, counting those not yet given back.
class CountingSource : public MediaSource, public MediaBufferObserver {
public:
    CountingSource(size_t count, size_t size) : mCount(count), mSize(size) {}
    status_t start(MetaData*) override { return OK; }
    status_t stop() override { return OK; }
    sp<MetaData> getFormat() override { return format(MEDIA_MIMETYPE_AUDIO_AMR_NB); }
    status_t read(MediaBufferBase** out, const ReadOptions* options) override {
        *out = nullptr;
        if (options == nullptr) return WOULD_BLOCK;
        if (mNext == mCount) return ERROR_END_OF_STREAM;
        MediaBuffer* b = new MediaBuffer(mSize);
        memset(b->data(), 0x3C, mSize);
        b->meta_data().setInt64(kKeyTime, int64_t(mNext++) * 20000);
        b->setObserver(this);
        b->add_ref();
        mMaxOutstanding = std::max(mMaxOutstanding.load(), ++mOutstanding);
        *out = b;
        return OK;
    }
    void signalBufferReturned(MediaBufferBase* b) override {
        --mOutstanding;
        b->setObserver(nullptr);
        b->release();
    }
    std::atomic<int> mOutstanding{0}, mMaxOutstanding{0};

private:
    const size_t mCount, mSize;
    size_t mNext = 0;
};

TEST_F(MPEG4WriterLifecycle, ReadersAreIndependentAndKeepNoSampleBytes) {
    // Every buffer is given back before the next read: the writer holds no
    // sample bytes, however many it writes.
    sp<CountingSource> counting = new CountingSource(300, 64 * 1024);
    sp<MediaAdapter> idle = new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_AMR_NB));
    sp<MediaAdapter> busy = new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_AMR_NB));
    sp<MPEG4Writer> w = new MPEG4Writer(mFd);
    ASSERT_EQ(OK, w->addSource(counting));
    ASSERT_EQ(OK, w->addSource(idle));
    ASSERT_EQ(OK, w->addSource(busy));
    ASSERT_EQ(OK, w->start());
    // Far more than the adapter holds, while another track has nothing: a
    // reader waiting on the idle track must not hold this one up.
    auto pushing = std::async(std::launch::async, [&] {
        for (int i = 0; i < 500; ++i) {
            MediaBuffer* b = new MediaBuffer(32);
            memset(b->data(), 0x3C, 32);
            b->meta_data().setInt64(kKeyTime, i * 20000);
            b->add_ref();
            busy->pushBuffer(b);
        }
    });
    ASSERT_EQ(std::future_status::ready, pushing.wait_for(std::chrono::seconds(30)));
    idle->stop();
    busy->stop();
    EXPECT_EQ(OK, w->stop());
    EXPECT_LE(counting->mMaxOutstanding.load(), 1);
    EXPECT_EQ(0, counting->mOutstanding.load());
    EXPECT_EQ(2, countTracks(readFile(mPath)));
}

TEST_F(MPEG4WriterLifecycle, ReleasedWithoutStopStillFinishesTheFile) {
    {
        sp<MPEG4Writer> w = new MPEG4Writer(mFd);
        sp<MediaAdapter> a = new MediaAdapter(format(MEDIA_MIMETYPE_AUDIO_AMR_NB));
        ASSERT_EQ(OK, w->addSource(a));
        ASSERT_EQ(OK, w->start());
        for (int i = 0; i < 5; ++i) {
            const Pushed p = amrFrame(i);
            MediaBuffer* b = new MediaBuffer(p.bytes.size());
            memcpy(b->data(), p.bytes.data(), p.bytes.size());
            b->meta_data().setInt64(kKeyTime, p.ptsUs);
            b->add_ref();
            a->pushBuffer(b);
        }
    }
    const auto stbl = childBoxes(readFile(mPath), "moov/trak/mdia/minf/stbl");
    ASSERT_EQ(1u, stbl.count("stsz"));
    EXPECT_EQ(5u, be32(stbl.at("stsz"), 8));
}

}  // namespace
