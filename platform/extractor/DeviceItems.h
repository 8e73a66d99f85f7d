#ifndef PLATFORM_EXTRACTOR_DEVICE_ITEMS_H_
#define PLATFORM_EXTRACTOR_DEVICE_ITEMS_H_

#include <cstdint>
#include <string>
#include <vector>

#include <media/stagefright/MetaData.h>

namespace android {

// The device's items that the audio writers store beside the audio (RIFF
// chunks in WAVE, APPLICATION blocks in FLAC), gathered while parsing and
// published under the device keys.
class DeviceItems {
public:
    // Largest item kept; bigger ones are skipped, not allocated.
    static constexpr size_t kMaxItemSize = 16 * 1024 * 1024;

    // Whether `id` names one of the items.
    static bool IsItem(uint32_t id);
    // Takes the payload of item `id`; the bookmark size is 8 bytes in the
    // container's byte order. Answers false (and keeps nothing) when the
    // payload does not fit the item.
    bool take(uint32_t id, const uint8_t* data, size_t size, bool bigEndian);

    void publishFileItems(MetaData* meta) const;
    // The bookmark size travels with each audio track.
    void publishTrackItems(MetaData* meta) const;

private:
    bool mHasWaveForm = false;
    std::vector<uint8_t> mWaveForm;
    bool mHasUserMessage = false;
    std::string mUserMessage;
    bool mHasRecMode = false;
    std::string mRecMode;
    bool mHasBookmarkSize = false;
    int64_t mBookmarkSize = 0;
};

}  // namespace android

#endif
