#ifndef TESTS_MUXER_TEST_SUPPORT_H
#define TESTS_MUXER_TEST_SUPPORT_H

// A writer that records what the muxer gives it, and access to the muxer's
// insides so that the buffers it pushes can be looked at.

#include <cstring>
#include <mutex>
#include <thread>
#include <vector>

#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaWriter.h>

#include "LogCapture.h"
#include "QNMediaMuxer.h"

namespace android {
namespace qnmediaeditor {

class QNMediaMuxerTestAccess {
public:
    static sp<MediaWriter> writer(const sp<QNMediaMuxer>& m) { return m->mWriter; }
    // Only before addTrack; never for MP4 output, whose setters cast the writer.
    static void setWriter(const sp<QNMediaMuxer>& m, const sp<MediaWriter>& w) { m->mWriter = w; }
    static sp<MetaData> fileMeta(const sp<QNMediaMuxer>& m) { return m->mFileMeta; }
    static sp<MediaAdapter> track(const sp<QNMediaMuxer>& m, size_t i) { return m->mTrackList[i]; }
    static int64_t step(const sp<QNMediaMuxer>& m) { return m->mExpectedTimeScale.load(); }
};

}  // namespace qnmediaeditor
}  // namespace android

namespace muxertest {

using namespace android;

// What a writer saw of one buffer.
struct Sample {
    size_t track;
    int64_t timeUs = -1, decodingTimeUs = -1;
    int32_t sync = 0, codecConfig = 0;
    std::vector<uint8_t> bytes;
};

inline Sample describe(size_t track, MediaBufferBase* b) {
    Sample s{track};
    b->meta_data().findInt64(kKeyTime, &s.timeUs);
    b->meta_data().findInt64(kKeyDecodingTime, &s.decodingTimeUs);
    b->meta_data().findInt32(kKeyIsSyncFrame, &s.sync);
    b->meta_data().findInt32(kKeyIsCodecConfig, &s.codecConfig);
    const uint8_t* p = static_cast<const uint8_t*>(b->data()) + b->range_offset();
    s.bytes.assign(p, p + b->range_length());
    return s;
}

// Records sources, start parameters, waveform and listener. With `pull` set,
// start() runs one reader thread per source, as a real writer does.
class RecordingWriter : public MediaWriter {
public:
    explicit RecordingWriter(bool pull = false) : mPull(pull) {}

    status_t addSource(const sp<MediaSource>& source) override {
        if (addResult != OK) return addResult;
        sources.push_back(source);
        return OK;
    }
    bool reachedEOS() override { return true; }
    status_t start(MetaData* params) override {
        if (params != nullptr) startParams = new MetaData(*params);
        for (size_t i = 0; mPull && i < sources.size(); ++i) {
            mThreads.emplace_back([this, i] {
                for (;;) {
                    MediaBufferBase* b = nullptr;
                    MediaTrack::ReadOptions options;
                    if (sources[i]->read(&b, &options) != OK) return;
                    if (i == slowTrack) std::this_thread::sleep_for(std::chrono::microseconds(20));
                    record(describe(i, b));
                    b->release();
                }
            });
        }
        return startResult;
    }
    status_t stop() override {
        ++stops;
        join();
        return OK;
    }
    status_t pause() override { return OK; }
    void setWaveform(const uint8_t* data, int count) override { waveformCount = count; }
    sp<IMediaRecorderClient> listener() const { return mListener; }

    // Takes one pushed buffer of a track, as a writer would.
    Sample take(size_t track) {
        MediaBufferBase* b = nullptr;
        MediaTrack::ReadOptions options;
        if (sources[track]->read(&b, &options) != OK) return Sample{track};
        Sample s = describe(track, b);
        b->release();
        return s;
    }
    std::vector<Sample> seen() {
        std::lock_guard<std::mutex> lock(mLock);
        return mSeen;
    }

    status_t addResult = OK, startResult = OK;
    size_t slowTrack = SIZE_MAX;
    std::vector<sp<MediaSource>> sources;
    sp<MetaData> startParams;
    int stops = 0, waveformCount = -1;

protected:
    ~RecordingWriter() override {
        for (auto& s : sources) s->stop();
        join();
    }

private:
    void record(Sample s) {
        std::lock_guard<std::mutex> lock(mLock);
        mSeen.push_back(std::move(s));
    }
    void join() {
        for (auto& t : mThreads) t.join();
        mThreads.clear();
    }

    const bool mPull;
    std::vector<std::thread> mThreads;
    std::mutex mLock;
    std::vector<Sample> mSeen;
};

inline sp<ABuffer> sampleOf(std::initializer_list<uint8_t> bytes) {
    sp<ABuffer> b = new ABuffer(bytes.size());
    memcpy(b->data(), bytes.begin(), bytes.size());
    return b;
}

inline sp<AMessage> trackFormat(const char* mime) {
    sp<AMessage> f = new AMessage;
    f->setString("mime", mime);
    return f;
}

// Exactly one error line with this text under the muxer's tag.
inline bool refused(const LogCapture& log, const std::string& message) {
    int n = 0;
    for (const auto& l : log.lines()) {
        if (l.message == message) n += (l.priority == ANDROID_LOG_ERROR && l.tag == "QNMediaMuxer") ? 1 : 100;
    }
    return n == 1;
}

}  // namespace muxertest

#endif
