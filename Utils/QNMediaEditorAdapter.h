#ifndef QN_MEDIA_EDITOR_ADAPTER_H
#define QN_MEDIA_EDITOR_ADAPTER_H

#include <cstdint>

#include <media/IMediaExtractor.h>
#include <media/stagefright/MediaWriter.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/String8.h>

namespace android {
namespace qnmediaeditor {

// The bridge to the device's writers, extractor extension and settings store.
// Stateless; every function may be called from any thread.
class Adapter {
public:
    static sp<MediaWriter> CreateWAVEWriter(int fd);
    static sp<MediaWriter> CreateFLACWriter(int fd);
    static sp<MediaWriter> CreateM4AWriter(int fd);

    // MP4 only: the caller lets only output format 2 through.
    static status_t SetLocation(sp<MediaWriter> writer, int latitude, int longitude);
    static status_t SetUuidData(sp<MediaWriter> writer, const uint8_t* data, int size);
    static status_t SetRecordingType(sp<MediaWriter> writer, String8 type);
    static status_t SetWaveform(sp<MediaWriter> writer, const uint8_t* data, int count);

    // By output format: 13 WAVE, 14 FLAC, 15 M4A; any other format is a no-op.
    static status_t SetUserMessage(sp<MediaWriter> writer, int outputFormat, const uint8_t* message);
    static status_t SetVRMeta(sp<MediaWriter> writer, int outputFormat, const uint8_t* text);
    static status_t SetRecodingParams(sp<MediaWriter> writer, int outputFormat, const sp<AMessage>& params);

    static status_t SetOutputFormatFlag(sp<IMediaExtractor> extractor, uint32_t flag);

    static bool GetBGMSyncFromKestro(int* offset);
    static bool GetUseDitherTypeFromKestro(int* type);
    static bool IsSupportResolution(const char* a, const char* b, int c, int d, bool e);
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
