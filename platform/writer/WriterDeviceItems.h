#ifndef WRITER_DEVICE_ITEMS_H_
#define WRITER_DEVICE_ITEMS_H_

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>
#include <utils/String8.h>

namespace android {

// The device's own file items that the audio writers store, as their setters
// receive them. Text is kept without a terminator.
//
// The text items and the bookmark size are fixed when the writer starts
// (seal()); setters after that answer INVALID_OPERATION. The waveform is
// computed while the samples are written, so it is taken until the file is
// finished (close()); later ones are ignored with a warning.
class WriterDeviceItems {
public:
    struct Snapshot {
        std::vector<uint8_t> waveform;  // 2 * count bytes, big-endian values
        bool hasWaveform = false;
        std::string userMessage;
        bool hasUserMessage = false;
        std::string recMode;
        bool hasRecMode = false;
        int64_t bookmarkSize = 0;
        bool hasBookmarkSize = false;
    };

    explicit WriterDeviceItems(const char* owner) : mOwner(owner) {}

    // Zero-terminated text; null is BAD_VALUE.
    status_t setUserMessage(const uint8_t* message);
    // `kind` is not used: every caller passes 0 for the VR metadata text.
    status_t setRecMode(int kind, const String8& text);
    // "bookmark-size", int32 or int64; other keys are ignored.
    status_t setRecordingParams(const sp<AMessage>& params);
    // Copies 2 * count bytes; a count of 0 or below clears it.
    void setWaveform(const uint8_t* data, int count);

    void seal();
    void close();
    Snapshot snapshot() const;

private:
    status_t checkOpen(const char* what) const;

    const char* const mOwner;
    mutable std::mutex mLock;
    Snapshot mItems;
    bool mSealed = false;
    bool mClosed = false;
};

}  // namespace android

#endif
