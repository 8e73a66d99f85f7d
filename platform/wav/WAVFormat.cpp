#define LOG_TAG "WAVExtractor"
#include "wav/WAVFormat.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ByteReader.h>

#include "wav/WAVHeader.h"

namespace android {

namespace {

constexpr uint16_t kFormatExtensible = 0xFFFE;
constexpr uint32_t kMaxChannels = 32;
constexpr uint32_t kMaxSampleRate = 1000000;

// Bytes 2..15 of the KSDATAFORMAT_SUBTYPE_* GUIDs that wrap a format tag;
// bytes 0..1 carry the tag.
const uint8_t kSubFormatTail[14] = {0x00, 0x00, 0x00, 0x00, 0x10, 0x00, 0x80,
                                    0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71};

// Names for the encodings users meet most, so that a refusal says what the
// file holds (RFC 2361 lists the registered tags).
const char* EncodingName(uint16_t tag) {
    switch (tag) {
        case 0x0002: return "MS ADPCM";
        case 0x0011: return "IMA ADPCM";
        case 0x0022: return "TrueSpeech";
        case 0x0031: return "GSM 6.10";
        case 0x0040: return "G.721 ADPCM";
        case 0x0050: return "MPEG audio";
        case 0x0055: return "MP3";
        case 0x0092: return "AC-3";
        case 0x00FF: case 0x1610: return "AAC";
        case 0x2000: return "AC-3";
        case 0x2001: return "DTS";
        default: return nullptr;
    }
}

status_t RefuseEncoding(uint16_t tag, uint16_t bits) {
    const char* name = EncodingName(tag);
    if (tag == kWAVFormatPcm || tag == kWAVFormatFloat || tag == kWAVFormatALaw || tag == kWAVFormatMuLaw) {
        setRefusalReason("WAVE %s of %u bits is not supported",
                         tag == kWAVFormatPcm ? "PCM" : tag == kWAVFormatFloat ? "float" : "G.711", bits);
    } else if (name != nullptr) {
        setRefusalReason("WAVE encoding %u (%s) is not supported", tag, name);
    } else {
        setRefusalReason("WAVE encoding %u is not supported", tag);
    }
    ALOGW("unsupported format %u with %u bits", tag, bits);
    return ERROR_UNSUPPORTED;
}

}  // namespace

status_t ParseWAVFormat(const uint8_t* data, size_t size, WAVInfo* info) {
    ByteReader r(data, size);
    uint16_t tag, channels, blockAlign, bits;
    uint32_t rate, byteRate;
    if (!r.le16(&tag) || !r.le16(&channels) || !r.le32(&rate) || !r.le32(&byteRate) ||
        !r.le16(&blockAlign) || !r.le16(&bits)) {
        ALOGW("fmt chunk of %zu bytes is too short", size);
        return ERROR_MALFORMED;
    }
    if (tag == kFormatExtensible) {
        uint16_t cbSize, validBits;
        uint32_t mask;
        uint8_t guid[16];
        if (!r.le16(&cbSize) || cbSize < 22 || !r.le16(&validBits) || !r.le32(&mask) ||
            !r.read(guid, sizeof(guid))) {
            ALOGW("WAVE_FORMAT_EXTENSIBLE without its extension");
            return ERROR_MALFORMED;
        }
        if (memcmp(guid + 2, kSubFormatTail, sizeof(kSubFormatTail)) != 0) {
            ALOGW("unsupported sub-format");
            setRefusalReason("WAVE sub-format %02x%02x%02x%02x-... is not supported", guid[3], guid[2], guid[1],
                             guid[0]);
            return ERROR_UNSUPPORTED;
        }
        tag = static_cast<uint16_t>(guid[0] | (guid[1] << 8));
        info->channelMask = mask;
    }
    const bool pcm = tag == kWAVFormatPcm && (bits == 8 || bits == 16 || bits == 24 || bits == 32);
    const bool flt = tag == kWAVFormatFloat && bits == 32;
    const bool g711 = (tag == kWAVFormatALaw || tag == kWAVFormatMuLaw) && bits == 8;
    if (!pcm && !flt && !g711) return RefuseEncoding(tag, bits);
    if (channels == 0 || channels > kMaxChannels || rate == 0 || rate > kMaxSampleRate) {
        ALOGW("unsupported layout: %u channels at %u Hz", channels, rate);
        setRefusalReason("WAVE with %u channels at %u Hz is not supported", channels, rate);
        return ERROR_UNSUPPORTED;
    }
    const uint32_t frameSize = uint32_t(channels) * bits / 8;
    if (blockAlign != frameSize) {
        ALOGW("block align %u does not match %u channels of %u bits", blockAlign, channels, bits);
        return ERROR_MALFORMED;
    }
    info->encoding = tag;
    info->channels = channels;
    info->sampleRate = rate;
    // G.711 is expanded on read: the track carries 16-bit PCM.
    info->bitsPerSample = g711 ? 16 : bits;
    info->frameSize = frameSize;
    return OK;
}

}  // namespace android
