#ifndef MPEG4_USER_DATA_H_
#define MPEG4_USER_DATA_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ByteReader.h>

namespace android {
namespace mpeg4 {

// The device's items and the location in 'moov/udta'.
struct UserData {
    bool hasBookmarkSize = false;
    int64_t bookmarkSize = 0;  // goes to every audio track's metadata
};

// Publishes the items of a 'udta' payload in the file metadata.
void ParseUserData(const ByteReader& udta, MetaData* fileMeta, UserData* out);

// Whether a top-level 'uuid' box carries the sphere view data.
bool IsSphereViewUuid(const uint8_t userType[16]);
// Publishes the payload with one zero byte behind it (readers drop the last byte).
void SetSphereView(MetaData* fileMeta, const uint8_t* data, size_t size);

}  // namespace mpeg4
}  // namespace android

#endif
