#define LOG_TAG "MPEG4Writer"
#include "mpeg4/Mp4DeviceItems.h"

#include <cstdio>
#include <cstdlib>

#include "mpeg4/Mp4BoxWriter.h"

namespace android {

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

void Mp4DeviceItems::writeUserData(Mp4BoxWriter& w, const WriterDeviceItems::Snapshot& shared) const {
    const bool any = !location.empty() || !recordingType.empty() || shared.hasWaveform || shared.hasUserMessage ||
                     shared.hasRecMode || shared.hasBookmarkSize;
    if (!any) return;
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
    if (shared.hasWaveform) w.leafBox("wafm", shared.waveform.data(), shared.waveform.size());
    if (shared.hasUserMessage) w.leafBox("umsg", shared.userMessage.data(), shared.userMessage.size());
    if (shared.hasRecMode) w.leafBox("rmod", shared.recMode.data(), shared.recMode.size());
    if (shared.hasBookmarkSize) {
        w.beginBox("bksz");
        w.be64(static_cast<uint64_t>(shared.bookmarkSize));
        w.endBox();
    }
    w.endBox();
}

void Mp4DeviceItems::writeUuidBox(Mp4BoxWriter& w) const {
    if (!hasUuid) return;
    w.beginBox("uuid");
    static const char kSphereView[16] = {'Q', 'N', 'E', 'D', '-', 'S', 'P', 'H',
                                         'E', 'R', 'E', 'V', 'I', 'E', 'W', '1'};
    w.bytes(kSphereView, sizeof(kSphereView));
    w.bytes(uuidPayload);
    w.endBox();
}

}  // namespace android
