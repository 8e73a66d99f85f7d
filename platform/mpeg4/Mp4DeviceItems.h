#ifndef MP4_DEVICE_ITEMS_H_
#define MP4_DEVICE_ITEMS_H_

#include <cstdint>
#include <string>
#include <vector>

#include <utils/Errors.h>

#include "writer/WriterDeviceItems.h"

namespace android {

class Mp4BoxWriter;

// The device's file-level items that only the MP4 writer stores; those it
// shares with the audio writers are kept in a WriterDeviceItems. Where each
// goes is listed in the header of MPEG4Writer.
struct Mp4DeviceItems {
    std::string location;       // ISO 6709, empty when not set
    bool hasUuid = false;
    std::vector<uint8_t> uuidPayload;
    std::string recordingType;  // 'qnrt'

    // "+DD.DDDD+DDD.DDDD/" from 1e-4 degree units; BAD_VALUE out of range.
    static status_t FormatLocation(int latitude, int longitude, std::string* out);

    // moov/udta with every item that is set; nothing when none is.
    void writeUserData(Mp4BoxWriter& w, const WriterDeviceItems::Snapshot& shared) const;
    // The top-level 'uuid' box, when set.
    void writeUuidBox(Mp4BoxWriter& w) const;
};

}  // namespace android

#endif
