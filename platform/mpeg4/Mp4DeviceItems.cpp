#define LOG_TAG "MPEG4Writer"
#include "mpeg4/Mp4DeviceItems.h"

#include <cstdio>
#include <cstdlib>

#include "mpeg4/Mp4BoxWriter.h"

namespace android {

const uint8_t kMp4SphereViewUuid[16] = {'Q', 'N', 'E', 'D', '-', 'S', 'P', 'H',
                                        'E', 'R', 'E', 'V', 'I', 'E', 'W', '1'};

status_t Mp4DeviceItems::FormatLocation(int latitude, int longitude, std::string* out) {
    if (latitude < -900000 || latitude > 900000 || longitude < -1800000 || longitude > 1800000) {
        return BAD_VALUE;
    }
    char text[32];
    snprintf(text, sizeof(text), "%c%02d.%04d%c%03d.%04d/", latitude < 0 ? '-' : '+', abs(latitude) / 10000,
             abs(latitude) % 10000, longitude < 0 ? '-' : '+', abs(longitude) / 10000, abs(longitude) % 10000);
    *out = text;
    return OK;
}

void Mp4DeviceItems::writeUserData(Mp4BoxWriter& w) const {
    if (location.empty() && recordingType.empty() && waveform.empty() && userMessage.empty() &&
        recMode.empty() && !hasBookmarkSize) {
        return;
    }
    w.beginBox("udta");
    if (!location.empty()) {
        // QuickTime-style text item: 16-bit length, 16-bit language ('eng').
        w.beginBox("\xA9xyz");
        w.be16(static_cast<uint16_t>(location.size()));
        w.be16(0x15C7);
        w.bytes(location.data(), location.size());
        w.endBox();
    }
    if (!recordingType.empty()) w.leafBox("qnrt", recordingType.data(), recordingType.size());
    if (!waveform.empty()) w.leafBox("wafm", waveform.data(), waveform.size());
    if (!userMessage.empty()) w.leafBox("umsg", userMessage.data(), userMessage.size());
    if (!recMode.empty()) w.leafBox("rmod", recMode.data(), recMode.size());
    if (hasBookmarkSize) {
        w.beginBox("bksz");
        w.be64(static_cast<uint64_t>(bookmarkSize));
        w.endBox();
    }
    w.endBox();
}

void Mp4DeviceItems::writeUuidBox(Mp4BoxWriter& w) const {
    if (!hasUuid) return;
    w.beginBox("uuid");
    w.bytes(kMp4SphereViewUuid, sizeof(kMp4SphereViewUuid));
    w.bytes(uuidPayload);
    w.endBox();
}

}  // namespace android
