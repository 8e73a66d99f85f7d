// Track metadata of any keys, types and blobs converted to a format message
// and back.
#include <media/stagefright/MetaData.h>
#include <media/stagefright/Utils.h>

#include "FuzzInput.h"
#include "QNMediaEditorUtils.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {
// Keys that carry codec data or typed values in track metadata.
const uint32_t kKeys[] = {kKeyMIMEType, kKeyWidth, kKeyHeight, kKeyAVCC, kKeyHVCC, kKeyESDS,
                          kKeyVorbisInfo, kKeyVorbisBooks, kKeyFlacMetadata, kKeyChannelCount,
                          kKeySampleRate, kKeyDuration, kKeyBitRate, kKeyPcmEncoding, kKeyBitsPerSample,
                          kKeyRotation, kKeyMediaLanguage, kKeyCropRect, kKeyMaxInputSize, kKeyStride};
const char* const kMimes[] = {"video/avc", "video/hevc", "audio/mp4a-latm", "audio/vorbis", "audio/flac",
                              "audio/raw", "audio/3gpp"};
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    quietLogs();
    FuzzInput in(data, size);
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, kMimes[in.u8() % (sizeof(kMimes) / sizeof(kMimes[0]))]);
    for (int i = 0; i < 12; ++i) {
        const uint32_t key = kKeys[in.u8() % (sizeof(kKeys) / sizeof(kKeys[0]))];
        const uint8_t kind = in.u8() % 4;
        if (kind == 0) {
            meta->setInt32(key, static_cast<int32_t>(in.u32()));
        } else if (kind == 1) {
            meta->setInt64(key, (int64_t(in.u32()) << 32) | in.u32());
        } else {
            size_t got;
            const uint8_t* blob = in.take(in.u8() * 2, &got);
            meta->setData(key, kind == 2 ? in.u32() : 0, blob, got);
        }
    }
    sp<AMessage> format;
    if (QNMediaEditorUtils::ConvertMetaDataToMessage(meta, &format) == OK && format != nullptr) {
        sp<MetaData> back = new MetaData;
        convertMessageToMetaData(format, back);
    }
    return 0;
}
