#define LOG_TAG "WAVExtractor"
#include "wav/WAVHeader.h"

#include <cstring>
#include <vector>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ByteReader.h>

namespace android {

namespace {

constexpr uint16_t kFormatPcm = 1;
constexpr uint16_t kFormatFloat = 3;
constexpr uint16_t kFormatExtensible = 0xFFFE;
constexpr uint32_t kMaxChannels = 32;
constexpr uint32_t kMaxSampleRate = 1000000;
// A hostile file of tiny chunks must not keep the walk busy for long.
constexpr int kMaxChunks = 4096;

// Bytes 2..15 of the KSDATAFORMAT_SUBTYPE_PCM / _IEEE_FLOAT GUIDs; bytes 0..1
// carry the format tag.
const uint8_t kSubFormatTail[14] = {0x00, 0x00, 0x00, 0x00, 0x10, 0x00, 0x80,
                                    0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71};

uint32_t FourCC(const uint8_t* p) {
    return (uint32_t(p[0]) << 24) | (uint32_t(p[1]) << 16) | (uint32_t(p[2]) << 8) | p[3];
}

status_t ParseFmt(const uint8_t* data, size_t size, WAVInfo* info) {
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
            return ERROR_UNSUPPORTED;
        }
        tag = static_cast<uint16_t>(guid[0] | (guid[1] << 8));
        info->channelMask = mask;
    }
    const bool pcm = tag == kFormatPcm && (bits == 8 || bits == 16 || bits == 24 || bits == 32);
    const bool flt = tag == kFormatFloat && bits == 32;
    if (!pcm && !flt) {
        ALOGW("unsupported format %u with %u bits", tag, bits);
        return ERROR_UNSUPPORTED;
    }
    if (channels == 0 || channels > kMaxChannels || rate == 0 || rate > kMaxSampleRate) {
        ALOGW("unsupported layout: %u channels at %u Hz", channels, rate);
        return ERROR_UNSUPPORTED;
    }
    const uint32_t frameSize = uint32_t(channels) * bits / 8;
    if (blockAlign != frameSize) {
        ALOGW("block align %u does not match %u channels of %u bits", blockAlign, channels, bits);
        return ERROR_MALFORMED;
    }
    info->isFloat = flt;
    info->channels = channels;
    info->sampleRate = rate;
    info->bitsPerSample = bits;
    info->frameSize = frameSize;
    return OK;
}

}  // namespace

status_t ParseWAVHeader(const sp<DataSource>& source, WAVInfo* info) {
    uint8_t head[12];
    if (!source->readExactly(0, head, sizeof(head)) || memcmp(head, "RIFF", 4) != 0 ||
        memcmp(head + 8, "WAVE", 4) != 0) {
        return ERROR_MALFORMED;
    }
    off64_t fileSize;
    if (source->getSize(&fileSize) != OK || fileSize < 0) fileSize = INT64_MAX;

    bool haveFmt = false, haveData = false;
    uint64_t dataSize = 0;
    off64_t offset = sizeof(head);
    for (int chunks = 0; chunks < kMaxChunks && fileSize - offset >= 8; ++chunks) {
        uint8_t chunk[8];
        if (!source->readExactly(offset, chunk, sizeof(chunk))) break;
        const uint32_t id = FourCC(chunk);
        const uint32_t size = chunk[4] | (chunk[5] << 8) | (chunk[6] << 16) | (uint32_t(chunk[7]) << 24);
        const off64_t payload = offset + 8;
        const uint64_t available = static_cast<uint64_t>(fileSize - payload);
        if (id == 'fmt ' && !haveFmt) {
            uint8_t fmt[64];
            const size_t n = size < sizeof(fmt) ? size : sizeof(fmt);
            if (available < n || !source->readExactly(payload, fmt, n)) return ERROR_MALFORMED;
            const status_t err = ParseFmt(fmt, n, info);
            if (err != OK) return err;
            haveFmt = true;
        } else if (id == 'data' && !haveData) {
            haveData = true;
            info->dataOffset = payload;
            dataSize = size;
            if (dataSize > available) {
                // Recorders that stop abruptly leave a size larger than the file.
                ALOGW("data chunk of %u bytes clamped to the %llu in the file", size,
                      (unsigned long long)available);
                dataSize = available;
                break;
            }
        } else if (DeviceItems::IsItem(id) && size <= available && size <= DeviceItems::kMaxItemSize) {
            std::vector<uint8_t> bytes(size);
            if (!source->readExactly(payload, bytes.data(), size)) break;
            info->items.take(id, bytes.data(), size, false);
        }
        // RIFF chunks are padded to an even size.
        const uint64_t next = static_cast<uint64_t>(payload) + size + (size & 1);
        if (next > static_cast<uint64_t>(fileSize)) break;
        offset = static_cast<off64_t>(next);
    }
    if (!haveFmt || !haveData) {
        ALOGW("no %s chunk", haveFmt ? "data" : "fmt");
        return ERROR_MALFORMED;
    }
    info->frameCount = dataSize / info->frameSize;
    return OK;
}

int32_t WAVPcmEncoding(const WAVInfo& info) {
    if (info.isFloat) return kAudioEncodingPcmFloat;
    switch (info.bitsPerSample) {
        case 8: return kAudioEncodingPcm8bit;
        case 16: return kAudioEncodingPcm16bit;
        case 24: return kAudioEncodingPcm24bitPacked;
        default: return kAudioEncodingPcm32bit;
    }
}

}  // namespace android
