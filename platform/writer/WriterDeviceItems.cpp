#define LOG_TAG "WriterDeviceItems"
#include "writer/WriterDeviceItems.h"

#include <cstring>

#include <log/log.h>

namespace android {

namespace {
const char kBookmarkSizeKey[] = "bookmark-size";
}  // namespace

status_t WriterDeviceItems::checkOpen(const char* what) const {
    if (!mSealed) return OK;
    ALOGE("%s: %s after start", mOwner, what);
    return INVALID_OPERATION;
}

status_t WriterDeviceItems::setUserMessage(const uint8_t* message) {
    if (message == nullptr) return BAD_VALUE;
    std::lock_guard<std::mutex> lock(mLock);
    const status_t err = checkOpen("setUserMessage");
    if (err != OK) return err;
    mItems.userMessage.assign(reinterpret_cast<const char*>(message));
    mItems.hasUserMessage = true;
    return OK;
}

status_t WriterDeviceItems::setRecMode(int kind, const String8& text) {
    std::lock_guard<std::mutex> lock(mLock);
    const status_t err = checkOpen("setAudioRecodingMeta");
    if (err != OK) return err;
    ALOGV("%s: recording meta kind %d", mOwner, kind);
    mItems.recMode = text.std_string();
    mItems.hasRecMode = true;
    return OK;
}

status_t WriterDeviceItems::setRecordingParams(const sp<AMessage>& params) {
    if (params == nullptr) return BAD_VALUE;
    std::lock_guard<std::mutex> lock(mLock);
    const status_t err = checkOpen("setRecodingParams");
    if (err != OK) return err;
    int64_t size64;
    int32_t size32;
    if (params->findInt64(kBookmarkSizeKey, &size64)) {
        mItems.bookmarkSize = size64;
        mItems.hasBookmarkSize = true;
    } else if (params->findInt32(kBookmarkSizeKey, &size32)) {
        mItems.bookmarkSize = size32;
        mItems.hasBookmarkSize = true;
    }
    return OK;
}

void WriterDeviceItems::setWaveform(const uint8_t* data, int count) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mClosed) {
        ALOGW("%s: waveform after the file was finished, ignored", mOwner);
        return;
    }
    if (data == nullptr || count <= 0) {
        mItems.waveform.clear();
        mItems.hasWaveform = false;
        return;
    }
    const size_t bytes = 2 * static_cast<size_t>(count);
    mItems.waveform.assign(data, data + bytes);
    mItems.hasWaveform = true;
}

void WriterDeviceItems::seal() {
    std::lock_guard<std::mutex> lock(mLock);
    mSealed = true;
}

void WriterDeviceItems::close() {
    std::lock_guard<std::mutex> lock(mLock);
    mSealed = true;
    mClosed = true;
}

WriterDeviceItems::Snapshot WriterDeviceItems::snapshot() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mItems;
}

}  // namespace android
