#ifndef MPEG4_USER_DATA_H_
#define MPEG4_USER_DATA_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ByteReader.h>

#include "extractor/DeviceItems.h"

namespace android {
namespace mpeg4 {

// Publishes the location and the device's items of a 'moov/udta' payload in
// the file metadata; the items that travel with audio tracks stay in `items`.
void ParseUserData(const ByteReader& udta, MetaData* fileMeta, DeviceItems* items);

// Whether a top-level 'uuid' box carries the sphere view data.
bool IsSphereViewUuid(const uint8_t userType[16]);
// Publishes the payload with one zero byte behind it (readers drop the last byte).
void SetSphereView(MetaData* fileMeta, const uint8_t* data, size_t size);

}  // namespace mpeg4
}  // namespace android

#endif
