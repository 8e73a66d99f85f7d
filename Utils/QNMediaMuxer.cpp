#define LOG_TAG "QNMediaMuxer"
#include "QNMediaMuxer.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/AMRWriter.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/Utils.h>

#include "QNMediaEditorAdapter.h"
#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {

sp<MediaWriter> createWriter(int fd, OutputFileFormat format) {
    switch (format) {
        case OUTPUT_FILE_FORMAT_MPEG_4: return new MPEG4Writer(fd);
        case OUTPUT_FILE_FORMAT_AMR_A:
        case OUTPUT_FILE_FORMAT_AMR_B: return new AMRWriter(fd);
        case OUTPUT_FILE_FORMAT_WAVE: return Adapter::CreateWAVEWriter(fd);
        case OUTPUT_FILE_FORMAT_FLAC: return Adapter::CreateFLACWriter(fd);
        case OUTPUT_FILE_FORMAT_M4A: return Adapter::CreateM4AWriter(fd);
    }
    return nullptr;
}

}  // namespace

QNMediaMuxer::QNMediaMuxer(int fd, OutputFileFormat format)
    : mFormat(format), mNextDecodingTimeUs(0), mExpectedTimeScale(0), mState(UNINITIALIZED) {
    mWriter = createWriter(fd, format);
    if (mWriter != nullptr) {
        mFileMeta = new MetaData;
        mState = INITIALIZED;
    }
}

QNMediaMuxer::~QNMediaMuxer() {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    mFileMeta.clear();
    mWriter.clear();
    std::lock_guard<std::mutex> tracksLock(mTrackListLock);
    mTrackList.clear();
}

status_t QNMediaMuxer::checkFileSetter(const char* operation, bool mp4Only) const {
    // The state is reported before the output format.
    if (mState != INITIALIZED) {
        ALOGE("%s() must be called before start().", operation);
        return INVALID_OPERATION;
    }
    if (mp4Only && mFormat != OUTPUT_FILE_FORMAT_MPEG_4) {
        ALOGE("%s() is only supported for .mp4 output.", operation);
        return INVALID_OPERATION;
    }
    return OK;
}

int32_t QNMediaMuxer::addTrack(const sp<AMessage>& format) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (format == nullptr) {
        ALOGE("addTrack() get a null format");
        return BAD_VALUE;
    }
    if (mState != INITIALIZED) {
        ALOGE("addTrack() must be called after constructor and before start().");
        return INVALID_OPERATION;
    }

    sp<MetaData> trackMeta = new MetaData;
    convertMessageToMetaData(format, trackMeta);
    int32_t bitsPerSample;
    if (format->findInt32("bits-per-sample", &bitsPerSample)) {
        trackMeta->setInt32(kEditorKeyBitsPerSample, bitsPerSample);
    }

    sp<MediaAdapter> adapter = new MediaAdapter(trackMeta);
    if (mWriter->addSource(adapter) != OK) return -1;

    std::lock_guard<std::mutex> tracksLock(mTrackListLock);
    return static_cast<int32_t>(mTrackList.add(adapter));
}

status_t QNMediaMuxer::setOrientationHint(int degrees) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setOrientationHint", false)) return err;
    if (degrees != 0 && degrees != 90 && degrees != 180 && degrees != 270) {
        ALOGE("setOrientationHint() get invalid degrees");
        return BAD_VALUE;
    }
    mFileMeta->setInt32(kKeyRotation, degrees);
    return OK;
}

status_t QNMediaMuxer::setLocation(int latitude, int longitude) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setLocation", true)) return err;
    ALOGV("Setting location: latitude = %d, longitude = %d", latitude, longitude);
    return Adapter::SetLocation(mWriter, latitude, longitude);
}

status_t QNMediaMuxer::setUuidData(const uint8_t* data, int size) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setUuidData", true)) return err;
    ALOGV("Setting UUID : data Size = %d", size);
    return Adapter::SetUuidData(mWriter, data, size);
}

status_t QNMediaMuxer::setRecordingType(String8 type) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setRecordingType", true)) return err;
    ALOGV("setRecordingType : data = %s", type.c_str());
    return Adapter::SetRecordingType(mWriter, String8(type));
}

status_t QNMediaMuxer::setUserMessage(const uint8_t* message) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setUserMessage", false)) return err;
    return Adapter::SetUserMessage(mWriter, mFormat, message);
}

status_t QNMediaMuxer::setVRMeta(const uint8_t* text) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setVRMeta", false)) return err;
    return Adapter::SetVRMeta(mWriter, mFormat, text);
}

status_t QNMediaMuxer::setRecodingParams(const sp<AMessage>& params) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (const status_t err = checkFileSetter("setRecodingParams", false)) return err;
    return Adapter::SetRecodingParams(mWriter, mFormat, params);
}

status_t QNMediaMuxer::start() {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (mState != INITIALIZED) {
        ALOGE("start() is called in invalid state %d", mState.load());
        return INVALID_OPERATION;
    }
    mState = STARTED;
    mFileMeta->setInt32(kKeyRealTimeRecording, false);
    return mWriter->start(mFileMeta.get());
}

status_t QNMediaMuxer::stop() {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (mState != STARTED) {
        ALOGE("stop() is called in invalid state %d", mState.load());
        return INVALID_OPERATION;
    }
    mState = STOPPED;
    for (size_t i = 0; i < mTrackList.size(); ++i) {
        if (mTrackList[i]->stop() != OK) return INVALID_OPERATION;
    }
    return mWriter->stop();
}

status_t QNMediaMuxer::writeSampleData(int decodingTimeFlag, const sp<ABuffer>& buffer, uint32_t trackIndex,
                                       int64_t timeUs, uint32_t flags) {
    std::lock_guard<std::mutex> lock(mMuxerLock);
    if (buffer == nullptr) {
        ALOGE("WriteSampleData() get an NULL buffer.");
        return BAD_VALUE;
    }
    if (mState != STARTED) {
        ALOGE("WriteSampleData() is called in invalid state %d", mState.load());
        return INVALID_OPERATION;
    }
    if (trackIndex >= mTrackList.size()) {
        ALOGE("WriteSampleData() get an invalid index %zu", static_cast<size_t>(trackIndex));
        return BAD_VALUE;
    }

    MediaBuffer* mediaBuffer = new MediaBuffer(buffer);
    mediaBuffer->add_ref();  // the adapter takes this reference over
    // The wrapper already starts at the sample's offset, so its own range is
    // the sample's size from 0.
    mediaBuffer->set_range(0, buffer->size());

    MetaDataBase& meta = mediaBuffer->meta_data();
    meta.setInt64(kKeyTime, timeUs);
    if (decodingTimeFlag) {
        if (mNextDecodingTimeUs == 0) mNextDecodingTimeUs = timeUs;
        meta.setInt64(kKeyDecodingTime, mNextDecodingTimeUs);
        mNextDecodingTimeUs += mExpectedTimeScale.load();
    } else {
        meta.setInt64(kKeyDecodingTime, timeUs);
    }
    if (flags & 1) meta.setInt32(kKeyIsSyncFrame, 1);
    if (flags & 2) meta.setInt32(kKeyIsCodecConfig, 1);

    // Held across the push: a full track queue holds every other locked call
    // back until the writer catches up or the track is force-stopped.
    return mTrackList[trackIndex]->pushBuffer(mediaBuffer);
}

status_t QNMediaMuxer::setVideoFPS(int fps) {
    // The step is 1e8 / fps in 32-bit arithmetic, widened afterwards.
    const int32_t step = fps == 0 ? 0 : static_cast<int32_t>(100000000 / fps);
    mExpectedTimeScale = step;
    ALOGV("FrameRate(%d): ExpectedTimeScale [%lld]", fps, static_cast<long long>(step));
    return OK;
}

status_t QNMediaMuxer::writeWaveFormData(sp<ABuffer>& waveform, int sampleCount) {
    if (waveform == nullptr) {
        ALOGD("writeWaveFormData() get a null buffer");
        return OK;
    }
    ALOGV("writeWaveFormData size=%d, sample=%d", static_cast<int>(waveform->size()), sampleCount);
    // The writer reads two bytes per value: never let it past the buffer.
    const int fits = static_cast<int>(std::min<size_t>(waveform->size() / 2, INT32_MAX));
    const int count = std::max(0, std::min(sampleCount, fits));
    if (count != sampleCount) ALOGW("writeWaveFormData() count %d exceeds the buffer, using %d", sampleCount, count);
    Adapter::SetWaveform(mWriter, waveform->data(), count);
    return OK;
}

void QNMediaMuxer::setListener(const sp<IMediaRecorderClient>& listener) {
    ALOGV("setListener");
    // An unsupported format has no writer to tell.
    if (mWriter != nullptr) mWriter->setListener(listener);
}

sp<MediaAdapter> QNMediaMuxer::trackAt(uint32_t index) {
    std::lock_guard<std::mutex> lock(mTrackListLock);
    return index < mTrackList.size() ? mTrackList[index] : nullptr;
}

status_t QNMediaMuxer::forceTrackStop(uint32_t trackIndex) {
    const sp<MediaAdapter> track = trackAt(trackIndex);
    if (track == nullptr) {
        ALOGE("forceTrackStop() get an invalid index %zu", static_cast<size_t>(trackIndex));
        return BAD_VALUE;
    }
    // Without options the adapter neither waits nor takes a queued sample:
    // everything pushed so far still reaches the writer after stop().
    MediaBufferBase* buffer = nullptr;
    if (track->read(&buffer) == OK && buffer != nullptr) buffer->release();
    return track->stop();
}

}  // namespace qnmediaeditor
}  // namespace android
