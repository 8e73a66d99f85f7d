#define LOG_TAG "PcmLayout"
#include "writer/PcmLayout.h"

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/DeviceKeys.h"

namespace android {

namespace {

bool sampleFromEncoding(int32_t encoding, PcmLayout::Sample* sample, int* bits) {
    switch (encoding) {
        case kAudioEncodingPcm8bit: *sample = PcmLayout::Sample::kUnsigned8; *bits = 8; return true;
        case kAudioEncodingPcm16bit: *sample = PcmLayout::Sample::kSigned16; *bits = 16; return true;
        case kAudioEncodingPcm24bitPacked: *sample = PcmLayout::Sample::kSigned24Packed; *bits = 24; return true;
        case kAudioEncodingPcm32bit: *sample = PcmLayout::Sample::kSigned32; *bits = 32; return true;
        case kAudioEncodingPcmFloat: *sample = PcmLayout::Sample::kFloat32; *bits = 32; return true;
        default: return false;
    }
}

bool sampleFromBits(int32_t bits, PcmLayout::Sample* sample) {
    switch (bits) {
        case 8: *sample = PcmLayout::Sample::kUnsigned8; return true;
        case 16: *sample = PcmLayout::Sample::kSigned16; return true;
        case 24: *sample = PcmLayout::Sample::kSigned24Packed; return true;
        case 32: *sample = PcmLayout::Sample::kSigned32; return true;
        default: return false;
    }
}

}  // namespace

status_t PcmLayout::fromMetaData(const sp<MetaData>& meta, const char* owner, PcmLayout* out) {
    if (meta == nullptr) return BAD_VALUE;
    PcmLayout layout;
    int32_t encoding, bits;
    if (meta->findInt32(kKeyPcmEncoding, &encoding)) {
        if (!sampleFromEncoding(encoding, &layout.sample, &layout.bitsPerSample)) {
            ALOGE("%s: unsupported PCM encoding %d", owner, encoding);
            return ERROR_UNSUPPORTED;
        }
    } else if (meta->findInt32(kKeyDeviceBitsPerSample, &bits) || meta->findInt32(kKeyBitsPerSample, &bits)) {
        if (!sampleFromBits(bits, &layout.sample)) {
            ALOGE("%s: unsupported bits per sample %d", owner, bits);
            return ERROR_UNSUPPORTED;
        }
        layout.bitsPerSample = bits;
    }
    if (!meta->findInt32(kKeyChannelCount, &layout.channels) || layout.channels < 1) {
        ALOGE("%s: missing or bad channel count", owner);
        return BAD_VALUE;
    }
    if (!meta->findInt32(kKeySampleRate, &layout.sampleRate) || layout.sampleRate < 1) {
        ALOGE("%s: missing or bad sample rate", owner);
        return BAD_VALUE;
    }
    *out = layout;
    return OK;
}

}  // namespace android
