#ifndef FUZZ_METADATA_TARGET_H
#define FUZZ_METADATA_TARGET_H

// Format conversion both ways over any bytes: track metadata of any keys,
// types and blobs to a message and back, and a message with any codec data
// (csd-0, csd-1) to metadata and back.
#include <media/stagefright/MetaData.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "FuzzInput.h"
#include "QNMediaEditorUtils.h"

namespace fuzztargets {
namespace detail {
using namespace android;
using namespace android::qnmediaeditor;

// Keys that carry codec data or typed values in track metadata.
inline const uint32_t kKeys[] = {kKeyMIMEType, kKeyWidth, kKeyHeight, kKeyAVCC, kKeyHVCC, kKeyESDS,
                                 kKeyVorbisInfo, kKeyVorbisBooks, kKeyFlacMetadata, kKeyChannelCount,
                                 kKeySampleRate, kKeyDuration, kKeyBitRate, kKeyPcmEncoding, kKeyBitsPerSample,
                                 kKeyRotation, kKeyMediaLanguage, kKeyCropRect, kKeyMaxInputSize, kKeyStride};
inline const char* const kMimes[] = {"video/avc", "video/hevc", "audio/mp4a-latm", "audio/vorbis",
                                     "audio/flac", "audio/raw", "audio/3gpp", "video/mp4v-es"};
constexpr size_t kMimeCount = sizeof(kMimes) / sizeof(kMimes[0]);

inline void metaToMessageAndBack(FuzzInput& in) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, kMimes[in.u8() % kMimeCount]);
    const int entries = in.u8() % 12;
    for (int i = 0; i < entries; ++i) {
        const uint32_t key = kKeys[in.u8() % (sizeof(kKeys) / sizeof(kKeys[0]))];
        const uint8_t kind = in.u8() % 5;
        if (kind == 0) {
            meta->setInt32(key, static_cast<int32_t>(in.u32()));
        } else if (kind == 1) {
            const uint64_t high = in.u32();
            meta->setInt64(key, static_cast<int64_t>((high << 32) | in.u32()));
        } else if (kind == 2) {
            const int32_t l = in.u32(), t = in.u32(), r = in.u32(), b = in.u32();
            meta->setRect(key, l, t, r, b);
        } else {
            size_t got;
            const uint8_t* blob = in.take(in.u8() * 2, &got);
            const uint32_t type = kind == 3 ? in.u32() : 0;
            meta->setData(key, type, blob, got);
        }
    }
    sp<AMessage> format;
    if (QNMediaEditorUtils::ConvertMetaDataToMessage(meta, &format) == OK && format != nullptr) {
        sp<MetaData> back = new MetaData;
        convertMessageToMetaData(format, back);
    }
}

inline void messageToMetaAndBack(FuzzInput& in) {
    sp<AMessage> format = new AMessage;
    format->setString("mime", kMimes[in.u8() % kMimeCount]);
    format->setInt32("bitrate", static_cast<int32_t>(in.u32()));
    format->setInt32("max-bitrate", static_cast<int32_t>(in.u32()));
    const char* const names[] = {"csd-0", "csd-1", "hdr-static-info"};
    for (const char* name : names) {
        const size_t want = in.u8() | (size_t(in.u8()) << 8);
        size_t got;
        const uint8_t* bytes = in.take(want, &got);
        if (got > 0) format->setBuffer(name, ABuffer::CreateAsCopy(bytes, got));
    }
    sp<MetaData> meta = new MetaData;
    convertMessageToMetaData(format, meta);
    sp<AMessage> back;
    QNMediaEditorUtils::ConvertMetaDataToMessage(meta, &back);
}
}  // namespace detail


inline void fuzzMetadata(const uint8_t* data, size_t size) {
    FuzzInput in(data, size);
    if (in.u8() & 1) {
        detail::messageToMetaAndBack(in);
    } else {
        detail::metaToMessageAndBack(in);
    }
}

}  // namespace fuzztargets

#endif
