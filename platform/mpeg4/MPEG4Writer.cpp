#define LOG_TAG "MPEG4Writer"
#include <media/stagefright/MPEG4Writer.h>

#include <atomic>
#include <mutex>
#include <system_error>
#include <thread>
#include <vector>

#include <log/log.h>
#include <media/MediaTrack.h>
#include <media/stagefright/ByteSink.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/Mp4BoxWriter.h"
#include "mpeg4/Mp4DeviceItems.h"
#include "mpeg4/Mp4MovieBoxes.h"
#include "mpeg4/Mp4TrackWriter.h"

namespace android {

struct MPEG4Writer::Impl {
    Impl(int fd, FileBrand brand)
        : fd(fd), m4a(brand == FileBrand::kM4a), sharedItems(m4a ? "QNM4AWriter" : "MPEG4Writer") {}

    struct Slot {
        sp<MediaSource> source;
        std::unique_ptr<Mp4TrackWriter> track;
        std::thread reader;
    };
    enum class State { kIdle, kStarted, kFailed, kStopped };

    status_t checkIdle(const char* what) const;
    status_t start(MetaData* params);
    status_t stop();
    void readLoop(size_t index);
    status_t finishFile();

    const int fd;
    const bool m4a;
    std::mutex stopLock;  // one stop() at a time; taken before `lock`
    std::mutex lock;      // everything below, and the file
    State state = State::kIdle;
    status_t result = OK;  // of start() when it failed, of stop() once stopped
    sp<FdSink> sink;
    std::vector<std::unique_ptr<Slot>> slots;
    Mp4DeviceItems items;
    WriterDeviceItems sharedItems;  // has its own lock
    int32_t rotation = 0;
    bool realTime = false;
    int64_t mdatStart = 0;
    size_t lastWriter = SIZE_MAX;
    status_t ioError = OK;
    std::atomic<size_t> running{0};
};

status_t MPEG4Writer::Impl::checkIdle(const char* what) const {
    if (state == State::kIdle) return OK;
    ALOGE("%s must be called before start()", what);
    return INVALID_OPERATION;
}

status_t MPEG4Writer::Impl::start(MetaData* params) {
    std::lock_guard<std::mutex> starting(stopLock);
    std::unique_lock<std::mutex> guard(lock);
    if (state != State::kIdle) {
        ALOGE("start() called twice");
        return INVALID_OPERATION;
    }
    if (params != nullptr) {
        int32_t v = 0;
        if (params->findInt32(kKeyRotation, &v)) {
            if (v == 0 || v == 90 || v == 180 || v == 270) {
                rotation = v;
            } else {
                ALOGW("rotation %d ignored", v);
            }
        }
        if (params->findInt32(kKeyRealTimeRecording, &v)) realTime = v != 0;
    }
    auto fail = [this](status_t err) {
        // No reader will run: end every source so that a producer pushing
        // into one is refused instead of waiting on a full queue.
        for (auto& slot : slots) slot->source->stop();
        state = State::kFailed;
        sharedItems.close();
        result = err;
        return err;
    };
    sink = new FdSink(fd, FdSink::kWriterBuffer);
    if (sink->initCheck() != OK) {
        ALOGE("no file descriptor to write to");
        return fail(BAD_VALUE);
    }
    Mp4BoxWriter header;
    Mp4WriteFileType(header, m4a);
    mdatStart = static_cast<int64_t>(header.size());
    const std::string placeholder = Mp4MdatPlaceholder();
    header.bytes(placeholder.data(), placeholder.size());
    // Written through at once, so that an output that takes nothing fails start().
    status_t headerError = header.writeTo(sink.get());
    if (headerError == OK) headerError = sink->flush();
    if (const status_t err = headerError) {
        ALOGE("cannot write the file header");
        return fail(err);
    }
    for (size_t i = 0; i < slots.size(); ++i) {
        const status_t err = slots[i]->source->start(nullptr);
        if (err != OK) {
            ALOGE("source of track %zu failed to start: %d", i, err);
            return fail(err);
        }
    }
    state = State::kStarted;
    sharedItems.seal();
    running = slots.size();
    guard.unlock();
    for (size_t i = 0; i < slots.size(); ++i) {
        try {
            slots[i]->reader = std::thread(&Impl::readLoop, this, i);
        } catch (const std::system_error&) {
            ALOGE("cannot start the reader of track %zu", i);
            for (auto& slot : slots) slot->source->stop();
            for (auto& slot : slots) {
                if (slot->reader.joinable()) slot->reader.join();
            }
            guard.lock();
            return fail(NO_MEMORY);
        }
    }
    return OK;
}

void MPEG4Writer::Impl::readLoop(size_t index) {
    Slot& slot = *slots[index];
    MediaTrack::ReadOptions options;
    for (;;) {
        MediaBufferBase* buffer = nullptr;
        const status_t err = slot.source->read(&buffer, &options);
        if (err != OK || buffer == nullptr) {
            if (buffer != nullptr) buffer->release();
            if (err != ERROR_END_OF_STREAM) ALOGW("track %zu ends on read status %d", index, err);
            break;
        }
        Mp4TrackWriter::Sample sample;
        if (slot.track->prepare(buffer, &sample)) {
            std::lock_guard<std::mutex> guard(lock);
            // After a write error the source is still drained, so that its
            // producer is never left blocked.
            if (ioError == OK) {
                const int64_t offset = sink->position();
                ioError = slot.track->store(*sink, sample);
                if (ioError == OK) {
                    slot.track->record(sample, static_cast<uint64_t>(offset), lastWriter == index);
                    lastWriter = index;
                } else {
                    ALOGE("writing the media data failed: %d", ioError);
                }
            }
        }
        buffer->release();
    }
    --running;
}

status_t MPEG4Writer::Impl::stop() {
    std::lock_guard<std::mutex> stopping(stopLock);
    {
        std::lock_guard<std::mutex> guard(lock);
        if (state == State::kIdle) {
            ALOGE("stop() without start()");
            return INVALID_OPERATION;
        }
        if (state != State::kStarted) return result;
    }
    // The readers end when their sources reach the end of the stream.
    for (auto& slot : slots) {
        if (slot->reader.joinable()) slot->reader.join();
    }
    for (auto& slot : slots) slot->source->stop();
    std::lock_guard<std::mutex> guard(lock);
    sharedItems.close();
    result = finishFile();
    state = State::kStopped;
    return result;
}

status_t MPEG4Writer::Impl::finishFile() {
    if (ioError != OK) return ioError;
    const uint64_t payload = static_cast<uint64_t>(sink->position() - mdatStart) - kMdatReserve;
    const std::string mdatHeader = Mp4MdatHeader(payload);
    if (const status_t err = sink->writeAt(mdatStart, mdatHeader.data(), mdatHeader.size())) return err;

    status_t trackError = OK;
    std::vector<const Mp4TrackWriter*> finished;
    for (size_t i = 0; i < slots.size(); ++i) {
        const status_t err = slots[i]->track->finish();
        if (err == OK) {
            finished.push_back(slots[i]->track.get());
        } else if (err == ERROR_END_OF_STREAM) {
            ALOGW("track %zu has no samples and is left out", i);
        } else {
            trackError = err;
        }
    }
    if (finished.empty()) ALOGW("no samples were written; the file holds no track");
    Mp4BoxWriter tail;
    Mp4WriteMovie(tail, finished, items, sharedItems.snapshot(), rotation);
    items.writeUuidBox(tail);
    if (const status_t err = tail.writeTo(sink.get())) {
        ALOGE("cannot write the movie box");
        return err;
    }
    if (trackError != OK) {
        // The tracks that could be finished still make a playable file.
        const status_t flushed = sink->flush();
        return flushed != OK ? flushed : trackError;
    }
    // The file is complete only once it is on the device, as for the other writers.
    return sink->sync();
}

MPEG4Writer::MPEG4Writer(int fd) : MPEG4Writer(fd, FileBrand::kMp4) {}

MPEG4Writer::MPEG4Writer(int fd, FileBrand brand) : mImpl(new Impl(fd, brand)) {}

MPEG4Writer::~MPEG4Writer() {
    bool started = false;
    {
        std::lock_guard<std::mutex> guard(mImpl->lock);
        started = mImpl->state == Impl::State::kStarted;
    }
    if (started) {
        // Nobody will end the sources now; end them so the file can be
        // finished with what they had.
        ALOGW("writer released without stop(); finishing the file");
        for (auto& slot : mImpl->slots) slot->source->stop();
        mImpl->stop();
    }
}

status_t MPEG4Writer::addSource(const sp<MediaSource>& source) {
    std::lock_guard<std::mutex> guard(mImpl->lock);
    if (source == nullptr) return BAD_VALUE;
    const status_t err = mImpl->checkIdle("addSource()");
    if (err != OK) return err;
    std::unique_ptr<Mp4TrackWriter> track = Mp4TrackWriter::Create(source->getFormat());
    if (track == nullptr) return ERROR_UNSUPPORTED;
    if (mImpl->m4a && track->isVideo()) {
        ALOGE("an M4A file holds audio only");
        return ERROR_UNSUPPORTED;
    }
    std::unique_ptr<Impl::Slot> slot(new Impl::Slot);
    slot->source = source;
    slot->track = std::move(track);
    mImpl->slots.push_back(std::move(slot));
    return OK;
}

status_t MPEG4Writer::start(MetaData* params) { return mImpl->start(params); }

status_t MPEG4Writer::stop() { return mImpl->stop(); }

status_t MPEG4Writer::pause() { return ERROR_UNSUPPORTED; }

bool MPEG4Writer::reachedEOS() { return mImpl->running == 0; }

void MPEG4Writer::setWaveform(const uint8_t* data, int count) { mImpl->sharedItems.setWaveform(data, count); }

WriterDeviceItems& MPEG4Writer::deviceItems() { return mImpl->sharedItems; }

status_t MPEG4Writer::setGeoData(int latitude, int longitude) {
    std::lock_guard<std::mutex> guard(mImpl->lock);
    const status_t err = mImpl->checkIdle("setGeoData()");
    if (err != OK) return err;
    if (Mp4DeviceItems::FormatLocation(latitude, longitude, &mImpl->items.location) != OK) {
        ALOGE("location %d, %d out of range", latitude, longitude);
        return BAD_VALUE;
    }
    return OK;
}

status_t MPEG4Writer::setUuidData(const uint8_t* data, int size) {
    std::lock_guard<std::mutex> guard(mImpl->lock);
    const status_t err = mImpl->checkIdle("setUuidData()");
    if (err != OK) return err;
    if (size < 0 || (data == nullptr && size > 0)) return BAD_VALUE;
    mImpl->items.hasUuid = true;
    mImpl->items.uuidPayload.assign(data, data + size);
    return OK;
}

status_t MPEG4Writer::setQNVideoFourCC(String8 fourcc) {
    std::lock_guard<std::mutex> guard(mImpl->lock);
    const status_t err = mImpl->checkIdle("setQNVideoFourCC()");
    if (err != OK) return err;
    mImpl->items.recordingType.assign(fourcc.string(), fourcc.length());
    return OK;
}

}  // namespace android
