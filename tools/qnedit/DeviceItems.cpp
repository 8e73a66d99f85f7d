#include "DeviceItems.h"

#include <cmath>
#include <cstdlib>
#include <cstring>

#include <media/stagefright/MetaData.h>
#include <utils/String8.h>

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

namespace {
constexpr int64_t kWaveformIntervalUs = 20000;

bool parseSignedDecimal(const char** p, double* out) {
    if (**p != '+' && **p != '-') return false;
    char* end = nullptr;
    *out = strtod(*p, &end);
    if (end == *p) return false;
    *p = end;
    return true;
}
}  // namespace

bool parseIso6709(const std::string& text, int* latitude, int* longitude) {
    const char* p = text.c_str();
    double lat, lon;
    if (!parseSignedDecimal(&p, &lat) || !parseSignedDecimal(&p, &lon)) return false;
    if (std::fabs(lat) > 90.0 || std::fabs(lon) > 180.0) return false;
    *latitude = static_cast<int>(std::lround(lat * 10000.0));
    *longitude = static_cast<int>(std::lround(lon * 10000.0));
    return true;
}

sp<ABuffer> cutWaveform(const sp<ABuffer>& waveform, int64_t startUs, int64_t endUs, int* count) {
    *count = 0;
    if (waveform == nullptr) return nullptr;
    const int64_t total = static_cast<int64_t>(waveform->size() / 2);
    int64_t first = startUs > 0 ? startUs / kWaveformIntervalUs : 0;
    int64_t last = endUs >= 0 ? (endUs + kWaveformIntervalUs - 1) / kWaveformIntervalUs : total;
    if (last > total) last = total;
    if (first >= last) return nullptr;
    sp<ABuffer> out = ABuffer::CreateAsCopy(waveform->data() + first * 2, static_cast<size_t>((last - first) * 2));
    if (out != nullptr) *count = static_cast<int>(last - first);
    return out;
}

void copyDeviceItems(const Input& in, QNMediaMuxer& muxer, int outputFormat, int64_t startUs, int64_t endUs) {
    for (size_t i = 0; i < in.trackCount(); ++i) {
        int32_t rotation;
        if (Input::isVideo(in.trackFormat(i)) && in.trackFormat(i)->findInt32("rotation-degrees", &rotation) &&
            rotation != 0) {
            muxer.setOrientationHint(rotation);
        }
    }
    const sp<AMessage>& f = in.fileFormat();
    if (outputFormat == OUTPUT_FILE_FORMAT_MPEG_4) {
        const char* location;
        int lat, lon;
        if (in.platformFileMeta() != nullptr && in.platformFileMeta()->findCString(kKeyLocation, &location) &&
            parseIso6709(location, &lat, &lon)) {
            muxer.setLocation(lat, lon);
        }
        sp<ABuffer> uuid;
        if (f->findBuffer("uuid-data", &uuid) && uuid != nullptr && uuid->size() > 0) {
            muxer.setUuidData(uuid->data(), static_cast<int>(uuid->size()));
        }
        AString type;
        if (f->findString("recording-type", &type)) muxer.setRecordingType(String8(type.c_str()));
    }
    AString text;
    if (f->findString("qn-usermessage", &text)) muxer.setUserMessage(reinterpret_cast<const uint8_t*>(text.c_str()));
    if (f->findString("qn-vrmeta", &text)) muxer.setVRMeta(reinterpret_cast<const uint8_t*>(text.c_str()));
    for (size_t i = 0; i < in.trackCount(); ++i) {
        int32_t bookmark;
        if (in.trackFormat(i)->findInt32("AM-bookmarksize", &bookmark)) {
            sp<AMessage> params = new AMessage;
            params->setInt64("bookmark-size", bookmark);
            muxer.setRecodingParams(params);
            break;
        }
    }
    sp<ABuffer> waveform;
    if (f->findBuffer("AM-waveform1", &waveform)) {
        int count = 0;
        sp<ABuffer> cut = cutWaveform(waveform, startUs, endUs, &count);
        if (cut != nullptr) muxer.writeWaveFormData(cut, count);
    }
}

}  // namespace qnedit
