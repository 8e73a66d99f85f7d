#ifndef TESTS_WRAPPER_FAKE_MEDIA_H
#define TESTS_WRAPPER_FAKE_MEDIA_H

#include <atomic>
#include <cstring>
#include <vector>

#include <media/IMediaExtractor.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

#include "QNMediaExtractorWrapper.h"

namespace wrappertest {

using namespace android;

// Counts the samples handed out and not yet given back.
struct BufferLedger : public MediaBufferObserver {
    std::atomic<int> outstanding{0};
    void signalBufferReturned(MediaBufferBase* buffer) override {
        --outstanding;
        buffer->setObserver(nullptr);
        buffer->release();
    }
};

// One scripted read: a failure status, or a sample.
struct Step {
    status_t status = OK;
    int64_t timeUs = 0;
    std::vector<uint8_t> bytes;
    bool hasValidSamples = false;
    int32_t validSamples = 0;
    size_t rangeOffset = 0;  // leading bytes of the buffer outside its range
};

inline Step sample(int64_t timeUs, std::vector<uint8_t> bytes = {1, 2, 3}) {
    Step s;
    s.timeUs = timeUs;
    s.bytes = std::move(bytes);
    return s;
}
inline Step failure(status_t status) {
    Step s;
    s.status = status;
    return s;
}

// Plays its script; a seek moves to the first step at or after the time
// (failures count as time 0).
class FakeSource : public MediaSource {
public:
    FakeSource(const char* mime, std::vector<Step> steps, BufferLedger* ledger)
        : format(new MetaData), mSteps(std::move(steps)), mLedger(ledger) {
        format->setCString(kKeyMIMEType, mime);
    }
    status_t start(MetaData*) override { ++starts; return startResult; }
    status_t stop() override { ++stops; return stopResult; }
    // A fresh copy each time, as sources in another process hand out.
    sp<MetaData> getFormat() override { return new MetaData(*format); }
    status_t read(MediaBufferBase** out, const ReadOptions* options) override {
        *out = nullptr;
        ++reads;
        if (options == nullptr) ++readsWithoutOptions;
        int64_t seekUs;
        ReadOptions::SeekMode mode;
        if (options != nullptr && options->getSeekTo(&seekUs, &mode)) {
            seeks.push_back(seekUs);
            lastSeekMode = mode;
            for (mPos = 0; mPos < mSteps.size(); ++mPos) {
                if (mSteps[mPos].timeUs >= seekUs) break;
            }
        }
        if (mPos >= mSteps.size()) return ERROR_END_OF_STREAM;
        const Step& s = mSteps[mPos++];
        if (s.status != OK) return s.status;
        MediaBuffer* b = new MediaBuffer(s.rangeOffset + s.bytes.size());
        if (!s.bytes.empty()) memcpy(static_cast<uint8_t*>(b->data()) + s.rangeOffset, s.bytes.data(), s.bytes.size());
        b->set_range(s.rangeOffset, s.bytes.size());
        b->meta_data().setInt64(kKeyTime, s.timeUs);
        if (s.hasValidSamples) b->meta_data().setInt32(kKeyValidSamples, s.validSamples);
        b->setObserver(mLedger);
        ++mLedger->outstanding;
        *out = b;
        return OK;
    }

    status_t startResult = OK, stopResult = OK;
    int starts = 0, stops = 0, reads = 0, readsWithoutOptions = 0;
    std::vector<int64_t> seeks;
    ReadOptions::SeekMode lastSeekMode = ReadOptions::SEEK_CLOSEST_SYNC;
    sp<MetaData> format;

private:
    std::vector<Step> mSteps;
    size_t mPos = 0;
    BufferLedger* mLedger;
};

class FakeExtractor : public IMediaExtractor {
public:
    FakeExtractor() : fileMeta(new MetaData) { fileMeta->setCString(kKeyMIMEType, "video/mp4"); }
    // A track whose metadata carries the MIME type (and whatever the test adds).
    sp<MetaData> addTrack(const char* mime, std::vector<Step> steps, BufferLedger* ledger) {
        sp<MetaData> meta = new MetaData;
        meta->setCString(kKeyMIMEType, mime);
        trackMeta.push_back(meta);
        sources.push_back(new FakeSource(mime, std::move(steps), ledger));
        return meta;
    }
    size_t countTracks() override { return trackMeta.size(); }
    sp<IMediaSource> getTrack(size_t i) override { return i < sources.size() ? sources[i] : nullptr; }
    sp<MetaData> getTrackMetaData(size_t i, uint32_t flags) override {
        lastMetaFlags = flags;
        return i < trackMeta.size() ? trackMeta[i] : nullptr;
    }
    sp<MetaData> getMetaData() override { return fileMeta; }
    uint32_t flags() const override { return 0; }
    const char* name() override { return "fake"; }
    status_t setOutputFormatFlag(uint32_t flag) override { lastOutputFlag = flag; return outputFlagResult; }

    std::vector<sp<MetaData>> trackMeta;
    std::vector<sp<FakeSource>> sources;
    sp<MetaData> fileMeta;
    uint32_t lastMetaFlags = 99, lastOutputFlag = 0;
    status_t outputFlagResult = OK;
};

class TestWrapper : public qnmediaeditor::QNMediaExtractorWrapper {
public:
    using QNMediaExtractorWrapper::setExtractorForTest;
};

}  // namespace wrappertest

#endif
