#define LOG_TAG "FLACExtractor"
#include "flac/FLACMetadata.h"

#include <cstring>
#include <vector>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/ID3v2Tag.h"

namespace android {

namespace {

// Pictures and padding can be large, but not this many blocks.
constexpr int kMaxBlocks = 1024;

status_t ParseStreamInfo(const uint8_t* block, FLACMetadata* meta) {
    memcpy(meta->streamInfoBlock, block, FLACMetadata::kStreamInfoBlockSize);
    FlacStreamInfo* info = &meta->streamInfo;
    if (!FlacStreamInfo::parse(block + 4, FlacStreamInfo::kBodyBytes, info) || info->maxBlockSize < 16 ||
        info->minBlockSize > info->maxBlockSize || info->bitsPerSample < 4) {
        ALOGW("unusable STREAMINFO: blocks %u..%u, %u Hz, %u bits", info->minBlockSize, info->maxBlockSize,
              info->sampleRate, info->bitsPerSample);
        return ERROR_MALFORMED;
    }
    return OK;
}

}  // namespace

status_t ParseFLACMetadata(const sp<DataSource>& source, FLACMetadata* meta) {
    uint8_t magic[4];
    const off64_t start = SkipID3v2Tags(source, 0);
    if (!source->readExactly(start, magic, 4) || memcmp(magic, "fLaC", 4) != 0) return ERROR_MALFORMED;
    off64_t fileSize;
    if (source->getSize(&fileSize) != OK || fileSize < 0) fileSize = INT64_MAX;

    meta->streamOffset = start;
    off64_t offset = start + 4;
    bool last = false;
    for (int n = 0; !last; ++n) {
        uint8_t header[4];
        if (n == kMaxBlocks || !source->readExactly(offset, header, 4)) return ERROR_MALFORMED;
        last = (header[0] & 0x80) != 0;
        const uint8_t type = header[0] & 0x7F;
        const uint32_t length = (uint32_t(header[1]) << 16) | (uint32_t(header[2]) << 8) | header[3];
        const off64_t body = offset + 4;
        if (length > static_cast<uint64_t>(fileSize - body)) {
            ALOGW("metadata block of %u bytes runs past the file", length);
            return ERROR_MALFORMED;
        }
        if (n == 0) {
            // STREAMINFO comes first and nothing else does.
            uint8_t block[FLACMetadata::kStreamInfoBlockSize];
            if (type != kFlacStreamInfo || length != FlacStreamInfo::kBodyBytes ||
                !source->readExactly(offset, block, sizeof(block))) {
                ALOGW("no STREAMINFO block");
                return ERROR_MALFORMED;
            }
            const status_t err = ParseStreamInfo(block, meta);
            if (err != OK) return err;
        } else if (type == kFlacApplication && length >= 4 && length - 4 <= DeviceItems::kMaxItemSize) {
            std::vector<uint8_t> bytes(length);
            if (!source->readExactly(body, bytes.data(), length)) return ERROR_MALFORMED;
            const uint32_t id = (uint32_t(bytes[0]) << 24) | (uint32_t(bytes[1]) << 16) |
                                (uint32_t(bytes[2]) << 8) | bytes[3];
            if (DeviceItems::IsItem(id)) meta->items.take(id, bytes.data() + 4, length - 4, true);
        } else if (type == 127) {
            ALOGW("invalid metadata block type");
            return ERROR_MALFORMED;
        }
        offset = body + length;
    }
    meta->firstFrameOffset = offset;
    return OK;
}

}  // namespace android
