#ifndef MP4_DEVICE_ITEMS_H_
#define MP4_DEVICE_ITEMS_H_

#include <cstdint>
#include <string>
#include <vector>

#include <utils/Errors.h>

namespace android {

class Mp4BoxWriter;

// The device's file-level items, stored where the header of MPEG4Writer
// lists them.
struct Mp4DeviceItems {
    std::string location;       // ISO 6709, empty when not set
    bool hasUuid = false;
    std::vector<uint8_t> uuidPayload;
    std::string recordingType;  // 'qnrt'
    std::vector<uint8_t> waveform;
    std::string userMessage;    // 'umsg'
    std::string recMode;        // 'rmod'
    bool hasBookmarkSize = false;
    int64_t bookmarkSize = 0;

    // "+DD.DDDD+DDD.DDDD/" from 1e-4 degree units; BAD_VALUE out of range.
    static status_t FormatLocation(int latitude, int longitude, std::string* out);

    // moov/udta with every item that is set; nothing when none is.
    void writeUserData(Mp4BoxWriter& w) const;
    // The top-level 'uuid' box, when set.
    void writeUuidBox(Mp4BoxWriter& w) const;
};

// Extended type of the sphere-view 'uuid' box: "QNED-SPHEREVIEW1".
extern const uint8_t kMp4SphereViewUuid[16];

}  // namespace android

#endif
