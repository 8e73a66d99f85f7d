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

// A hostile file of tiny chunks must not keep the walk busy for long.
constexpr int kMaxChunks = 4096;
// A 32-bit size that stands for "see ds64", or for "unknown" in a file
// written to a pipe.
constexpr uint32_t kSizeUnknown = 0xFFFFFFFF;
// ds64 table entries looked at; writers put few if any there.
constexpr uint32_t kMaxDs64Entries = 16;

uint32_t FourCC(const uint8_t* p) {
    return (uint32_t(p[0]) << 24) | (uint32_t(p[1]) << 16) | (uint32_t(p[2]) << 8) | p[3];
}

// The 64-bit sizes of an RF64/BW64 file (EBU Tech 3306, ITU-R BS.2088).
struct Ds64 {
    bool present = false;
    uint64_t dataSize = 0;
    uint32_t ids[kMaxDs64Entries] = {};
    uint64_t sizes[kMaxDs64Entries] = {};
    uint32_t count = 0;

    bool sizeOf(uint32_t id, uint64_t* size) const {
        if (id == 'data') {
            *size = dataSize;
            return present;
        }
        for (uint32_t i = 0; i < count; ++i) {
            if (ids[i] == id) {
                *size = sizes[i];
                return true;
            }
        }
        return false;
    }
};

status_t ParseDs64(const sp<DataSource>& source, off64_t payload, uint32_t size, Ds64* out) {
    uint8_t body[28 + 12 * kMaxDs64Entries];
    const size_t n = size < sizeof(body) ? size : sizeof(body);
    ByteReader r(body, n);
    uint64_t riffSize, sampleCount;
    uint32_t entries;
    if (!source->readExactly(payload, body, n) || !r.le64(&riffSize) || !r.le64(&out->dataSize) ||
        !r.le64(&sampleCount) || !r.le32(&entries)) {
        ALOGW("ds64 chunk of %u bytes is too short", size);
        return ERROR_MALFORMED;
    }
    for (uint32_t i = 0; i < entries && out->count < kMaxDs64Entries; ++i) {
        uint8_t id[4];
        if (!r.read(id, 4) || !r.le64(&out->sizes[out->count])) break;
        out->ids[out->count++] = FourCC(id);
    }
    out->present = true;
    return OK;
}

}  // namespace

status_t ParseWAVHeader(const sp<DataSource>& source, WAVInfo* info) {
    uint8_t head[12];
    if (!source->readExactly(0, head, sizeof(head)) || memcmp(head + 8, "WAVE", 4) != 0) return ERROR_MALFORMED;
    const bool rf64 = memcmp(head, "RF64", 4) == 0 || memcmp(head, "BW64", 4) == 0;
    if (!rf64 && memcmp(head, "RIFF", 4) != 0) return ERROR_MALFORMED;
    off64_t fileSize;
    if (source->getSize(&fileSize) != OK || fileSize < 0) fileSize = INT64_MAX;

    Ds64 ds64;
    bool haveFmt = false, haveData = false;
    uint64_t dataSize = 0;
    off64_t offset = sizeof(head);
    for (int chunks = 0; chunks < kMaxChunks && fileSize - offset >= 8; ++chunks) {
        uint8_t chunk[8];
        if (!source->readExactly(offset, chunk, sizeof(chunk))) break;
        const uint32_t id = FourCC(chunk);
        const uint32_t size32 = chunk[4] | (chunk[5] << 8) | (chunk[6] << 16) | (uint32_t(chunk[7]) << 24);
        uint64_t size = size32;
        const off64_t payload = offset + 8;
        const uint64_t available = static_cast<uint64_t>(fileSize - payload);
        if (rf64 && chunks == 0) {
            // ds64 must come first (EBU Tech 3306, 3.2).
            if (id != 'ds64') {
                ALOGW("RF64 file without a ds64 chunk");
                return ERROR_MALFORMED;
            }
            const status_t err = ParseDs64(source, payload, size32, &ds64);
            if (err != OK) return err;
        } else if (size32 == kSizeUnknown && !ds64.sizeOf(id, &size)) {
            // Written to a pipe, or a ds64 without this chunk: it runs to the end.
            size = available;
        }
        if (id == 'fmt ' && !haveFmt) {
            uint8_t fmt[64];
            const size_t n = size < sizeof(fmt) ? static_cast<size_t>(size) : sizeof(fmt);
            if (available < n || !source->readExactly(payload, fmt, n)) return ERROR_MALFORMED;
            const status_t err = ParseWAVFormat(fmt, n, info);
            if (err != OK) return err;
            haveFmt = true;
        } else if (id == 'data' && !haveData) {
            haveData = true;
            info->dataOffset = payload;
            dataSize = size;
            if (dataSize > available) {
                // Recorders that stop abruptly leave a size larger than the file.
                ALOGW("data chunk of %llu bytes clamped to the %llu in the file", (unsigned long long)size,
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
        if (size > available) break;
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
    if (info.encoding == kWAVFormatFloat) return kAudioEncodingPcmFloat;
    switch (info.bitsPerSample) {
        case 8: return kAudioEncodingPcm8bit;
        case 16: return kAudioEncodingPcm16bit;
        case 24: return kAudioEncodingPcm24bitPacked;
        default: return kAudioEncodingPcm32bit;
    }
}

}  // namespace android
