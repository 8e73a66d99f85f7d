#define LOG_TAG "AMRExtractor"
#include "amr/AMRFrameIndex.h"

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "amr/AMRFrames.h"

namespace android {

AMRFrameIndex::AMRFrameIndex(bool isWide, off64_t firstFrame)
    : mIsWide(isWide), mFirstFrame(firstFrame), mFrameCount(0), mFrameBytes(0), mEndStatus(ERROR_END_OF_STREAM) {}

status_t AMRFrameIndex::build(const sp<DataSource>& source) {
    std::vector<uint8_t> block(64 * 1024);
    off64_t blockStart = mFirstFrame;
    size_t blockLength = 0;
    off64_t offset = mFirstFrame;
    for (;;) {
        // Keep the next frame (header and body) inside the block.
        if (offset + static_cast<off64_t>(kAMRMaxFrameSize) > blockStart + static_cast<off64_t>(blockLength)) {
            const ssize_t n = source->readAt(offset, block.data(), block.size());
            if (n < 0) return static_cast<status_t>(n);
            blockStart = offset;
            blockLength = static_cast<size_t>(n);
        }
        const size_t at = static_cast<size_t>(offset - blockStart);
        if (at >= blockLength) break;  // end of the file
        const size_t size = AMRFrameSize(mIsWide, block[at]);
        if (size == 0) {
            ALOGW("undefined frame type in header 0x%02x at %lld", block[at], (long long)offset);
            mEndStatus = ERROR_MALFORMED;
            break;
        }
        if (size > blockLength - at) {
            ALOGW("last frame is truncated");
            break;
        }
        if (mFrameCount % kStride == 0) mOffsets.push_back(offset);
        ++mFrameCount;
        mFrameBytes += size;
        offset += static_cast<off64_t>(size);
    }
    return OK;
}

status_t AMRFrameIndex::offsetOf(const sp<DataSource>& source, uint64_t index, off64_t* offset) const {
    if (index >= mFrameCount) return ERROR_OUT_OF_RANGE;
    off64_t at = mOffsets[index / kStride];
    uint64_t skip = index % kStride;
    if (skip == 0) {
        *offset = at;
        return OK;
    }
    uint8_t block[kStride * kAMRMaxFrameSize];
    const ssize_t n = source->readAt(at, block, sizeof(block));
    if (n < 0) return static_cast<status_t>(n);
    size_t pos = 0;
    for (; skip > 0; --skip) {
        if (pos >= static_cast<size_t>(n)) return ERROR_MALFORMED;  // the file changed under us
        const size_t size = AMRFrameSize(mIsWide, block[pos]);
        if (size == 0) return ERROR_MALFORMED;
        pos += size;
    }
    *offset = at + static_cast<off64_t>(pos);
    return OK;
}

}  // namespace android
