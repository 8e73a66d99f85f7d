#ifndef PLATFORM_EXTRACTOR_DEVICE_KEYS_H_
#define PLATFORM_EXTRACTOR_DEVICE_KEYS_H_

#include <cstdint>

namespace android {

// Metadata keys of the device's own items. The editor library exports the
// same codes under its kEditorKey* names; the platform cannot include the
// library's headers, so the values are repeated here and must stay equal.
enum : uint32_t {
    kKeyDeviceWaveForm = 'wafm',       // data: big-endian 16-bit values
    kKeyDeviceUserMessage = 'umsg',    // cstring
    kKeyDeviceRecMode = 'rmod',        // cstring
    kKeyDeviceBookmarkSize = 'bkSz',   // int64, audio track metadata
    kKeyDeviceBitsPerSample = 'bPsp',  // int32, bits per PCM sample
    kKeyFlacStreamInfoRaw = 'FRAW',    // data: STREAMINFO block with its header
    kKeyDeviceVideoRecordType = 'vrty',  // cstring
    kKeyDeviceSphereView = 'svdt',       // data
    kKeyDeviceWaveForm2 = 'waf2',        // data: big-endian 16-bit values
};

}  // namespace android

#endif
