#ifndef PLATFORM_FLAC_FLAC_METADATA_H_
#define PLATFORM_FLAC_FLAC_METADATA_H_

#include <cstdint>

#include <media/stagefright/DataSource.h>

#include "extractor/DeviceItems.h"
#include "flac/FlacStreamHeader.h"

namespace android {

struct FLACMetadata {
    // The STREAMINFO block exactly as stored: 4-byte header, 34-byte body.
    static constexpr size_t kStreamInfoBlockSize = 4 + FlacStreamInfo::kBodyBytes;
    uint8_t streamInfoBlock[kStreamInfoBlockSize] = {};
    FlacStreamInfo streamInfo;
    DeviceItems items;
    off64_t streamOffset = 0;  // where "fLaC" is: after any ID3v2 tags
    off64_t firstFrameOffset = 0;
};

// Reads "fLaC" (after any ID3v2 tags) and the metadata blocks up to the
// first frame. ERROR_MALFORMED for a stream that is not FLAC or whose
// STREAMINFO is unusable.
status_t ParseFLACMetadata(const sp<DataSource>& source, FLACMetadata* meta);

}  // namespace android

#endif
