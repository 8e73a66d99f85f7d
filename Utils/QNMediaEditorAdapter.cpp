#define LOG_TAG "QNMediaEditorAdapter"
#include "QNMediaEditorAdapter.h"

#include <cstdlib>

#include <kestro/Kestro.h>
#include <log/log.h>
#include <media/stagefright/FLACWriter.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/QNM4AWriter.h>
#include <media/stagefright/QNWAVEWriter.h>
#include <media/stagefright/SupportResolution.h>

#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {

// The library's one load-time initialiser.
struct FlacQnswMimeInitializer {
    FlacQnswMimeInitializer() { MEDIAEDITOR_MIMETYPE_FLAC_QNSW = KVU_MEDIA_MIMETYPE_AUDIO_FLAC_QNSW; }
} gFlacQnswMimeInitializer;

enum : int { kFormatWave = 13, kFormatFlac = 14, kFormatM4a = 15 };

const char* const kSettingsSection = "NewFeatures";

bool nullWriter(const sp<MediaWriter>& writer) {
    if (writer != nullptr) return false;
    ALOGD("writer is null");
    return true;
}

// Calls the same device operation on whichever audio writer the output
// format names; other formats have no such item and succeed untouched.
template <typename Op>
status_t forAudioWriter(const sp<MediaWriter>& writer, int outputFormat, Op op) {
    switch (outputFormat) {
        case kFormatWave: return op(static_cast<QNWAVEWriter*>(writer.get()));
        case kFormatFlac: return op(static_cast<FLACWriter*>(writer.get()));
        case kFormatM4a: return op(static_cast<QNM4AWriter*>(writer.get()));
        default: return OK;
    }
}

KestroFeatureInfo* mediaFeatures() {
    Kestro* kestro = Kestro::getInstance();
    if (kestro == nullptr) {
        ALOGW("Fail to create kestroinstance");
        return nullptr;
    }
    KestroFeatureInfo* info = kestro->getFeatureInfo(2);
    if (info == nullptr) ALOGW("Fail to create kestroFeatureInfo");
    return info;
}

}  // namespace

sp<MediaWriter> Adapter::CreateWAVEWriter(int fd) { return new QNWAVEWriter(fd); }
sp<MediaWriter> Adapter::CreateFLACWriter(int fd) { return new FLACWriter(fd); }
sp<MediaWriter> Adapter::CreateM4AWriter(int fd) { return new QNM4AWriter(fd); }

status_t Adapter::SetLocation(sp<MediaWriter> writer, int latitude, int longitude) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    return static_cast<MPEG4Writer*>(writer.get())->setGeoData(latitude, longitude);
}

status_t Adapter::SetUuidData(sp<MediaWriter> writer, const uint8_t* data, int size) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    return static_cast<MPEG4Writer*>(writer.get())->setUuidData(data, size);
}

status_t Adapter::SetRecordingType(sp<MediaWriter> writer, String8 type) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    return static_cast<MPEG4Writer*>(writer.get())->setQNVideoFourCC(String8(type));
}

status_t Adapter::SetWaveform(sp<MediaWriter> writer, const uint8_t* data, int count) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    writer->setWaveform(data, count);
    return OK;
}

status_t Adapter::SetUserMessage(sp<MediaWriter> writer, int outputFormat, const uint8_t* message) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    return forAudioWriter(writer, outputFormat, [&](auto* w) { return w->setUserMessage(message); });
}

status_t Adapter::SetVRMeta(sp<MediaWriter> writer, int outputFormat, const uint8_t* text) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    if (outputFormat != kFormatWave && outputFormat != kFormatFlac && outputFormat != kFormatM4a) return OK;
    const String8 meta(reinterpret_cast<const char*>(text));
    return forAudioWriter(writer, outputFormat, [&](auto* w) { return w->setAudioRecodingMeta(0, meta); });
}

status_t Adapter::SetRecodingParams(sp<MediaWriter> writer, int outputFormat, const sp<AMessage>& params) {
    if (nullWriter(writer)) return ERROR_NOT_CONNECTED;
    return forAudioWriter(writer, outputFormat, [&](auto* w) { return w->setRecodingParams(params); });
}

status_t Adapter::SetOutputFormatFlag(sp<IMediaExtractor> extractor, uint32_t flag) {
    if (extractor == nullptr) {
        ALOGD("extractor is null");
        return ERROR_NOT_CONNECTED;
    }
    return extractor->setOutputFormatFlag(flag);
}

bool Adapter::GetBGMSyncFromKestro(int* offset) {
    if (offset == nullptr) return false;
    KestroFeatureInfo* info = mediaFeatures();
    if (info == nullptr) return false;
    const char* value = info->getFeatureValue(kSettingsSection, SETTING_MEDIAEDITOR_AUDIO_BGMSYNC);
    int result = 0;
    if (value != nullptr) {
        result = atoi(value);
        ALOGD("getDefaultBGMSyncOffset = %d", result);
    } else {
        ALOGD("can not find SETTING_MEDIAEDITOR_AUDIO_BGMSYNC");
    }
    *offset = result;
    return true;
}

bool Adapter::GetUseDitherTypeFromKestro(int* type) {
    if (type == nullptr) return false;
    KestroFeatureInfo* info = mediaFeatures();
    if (info == nullptr) return false;
    const char* value = info->getFeatureValue(kSettingsSection, SETTING_MEDIAEDITOR_USE_DITHER_TYPE);
    if (value == nullptr) return false;
    *type = atoi(value);
    ALOGD("get useDitherType = %d", *type);
    return true;
}

bool Adapter::IsSupportResolution(const char* a, const char* b, int c, int d, bool e) {
    return android::isSupportResolution(a, b, c, d, e);
}

}  // namespace qnmediaeditor
}  // namespace android
