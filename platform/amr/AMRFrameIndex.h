#ifndef PLATFORM_AMR_AMR_FRAME_INDEX_H_
#define PLATFORM_AMR_AMR_FRAME_INDEX_H_

#include <cstdint>
#include <vector>

#include <media/stagefright/DataSource.h>
#include <utils/RefBase.h>

namespace android {

// Where the frames of an AMR storage file are: their count and the offset of
// every kStride-th frame, so that a seek walks at most kStride - 1 headers.
// Built by one pass over the file in large reads; shared by the tracks.
class AMRFrameIndex : public RefBase {
public:
    static constexpr uint64_t kStride = 50;  // one second of frames

    AMRFrameIndex(bool isWide, off64_t firstFrame);
    // Walks the frames up to the end of the file, a truncated last frame or
    // an undefined frame type. Fails only on a read error.
    status_t build(const sp<DataSource>& source);

    bool isWide() const { return mIsWide; }
    uint64_t frameCount() const { return mFrameCount; }
    uint64_t frameBytes() const { return mFrameBytes; }
    // What a read past the last frame answers: end of stream, or
    // ERROR_MALFORMED when the walk stopped at an undefined frame type.
    status_t endStatus() const { return mEndStatus; }
    // Offset of frame `index` (below frameCount()).
    status_t offsetOf(const sp<DataSource>& source, uint64_t index, off64_t* offset) const;

private:
    const bool mIsWide;
    const off64_t mFirstFrame;
    uint64_t mFrameCount;
    uint64_t mFrameBytes;
    status_t mEndStatus;
    std::vector<off64_t> mOffsets;
};

}  // namespace android

#endif
