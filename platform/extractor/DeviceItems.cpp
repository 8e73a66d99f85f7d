#define LOG_TAG "DeviceItems"
#include "extractor/DeviceItems.h"

#include <log/log.h>
#include <media/stagefright/foundation/ByteReader.h>

#include "extractor/DeviceKeys.h"

namespace android {

namespace {
// Text items end at their first NUL; writers may pad with them.
std::string TextOf(const uint8_t* data, size_t size) {
    size_t n = 0;
    while (n < size && data[n] != 0) ++n;
    return std::string(reinterpret_cast<const char*>(data), n);
}
}  // namespace

bool DeviceItems::IsItem(uint32_t id) {
    return id == 'wafm' || id == 'umsg' || id == 'rmod' || id == 'bksz';
}

bool DeviceItems::take(uint32_t id, const uint8_t* data, size_t size, bool bigEndian) {
    if (size > kMaxItemSize) {
        ALOGW("device item of %zu bytes skipped", size);
        return false;
    }
    switch (id) {
        case 'wafm':
            mWaveForm.assign(data, data + size);
            mHasWaveForm = true;
            return true;
        case 'umsg':
            mUserMessage = TextOf(data, size);
            mHasUserMessage = true;
            return true;
        case 'rmod':
            mRecMode = TextOf(data, size);
            mHasRecMode = true;
            return true;
        case 'bksz': {
            ByteReader reader(data, size);
            uint64_t value;
            if (size != 8 || !(bigEndian ? reader.be64(&value) : reader.le64(&value))) {
                ALOGW("bookmark size item of %zu bytes ignored", size);
                return false;
            }
            mBookmarkSize = static_cast<int64_t>(value);
            mHasBookmarkSize = true;
            return true;
        }
        default:
            return false;
    }
}

void DeviceItems::publishFileItems(MetaData* meta) const {
    if (mHasWaveForm) meta->setData(kKeyDeviceWaveForm, 0, mWaveForm.data(), mWaveForm.size());
    if (mHasUserMessage) meta->setCString(kKeyDeviceUserMessage, mUserMessage.c_str());
    if (mHasRecMode) meta->setCString(kKeyDeviceRecMode, mRecMode.c_str());
}

void DeviceItems::publishTrackItems(MetaData* meta) const {
    if (mHasBookmarkSize) meta->setInt64(kKeyDeviceBookmarkSize, mBookmarkSize);
}

}  // namespace android
