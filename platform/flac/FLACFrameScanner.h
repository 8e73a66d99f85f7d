#ifndef PLATFORM_FLAC_FLAC_FRAME_SCANNER_H_
#define PLATFORM_FLAC_FLAC_FRAME_SCANNER_H_

#include <cstdint>
#include <vector>

#include <media/stagefright/DataSource.h>

#include "flac/FlacFrameHeader.h"
#include "flac/FLACMetadata.h"

namespace android {

struct FLACFrame {
    off64_t offset = 0;
    size_t size = 0;
    uint64_t firstSample = 0;
    uint32_t blockSize = 0;
};

// Finds whole frames in the frame area of a FLAC file. A frame starts at a
// header that parses (sync code, no reserved values, CRC-8, agreement with
// STREAMINFO) and ends where its CRC-16 matches and the next such header,
// continuing its numbering, begins, or at the end of the stream. So a sync
// pattern inside frame data is never taken for a frame. Holds at most one
// frame's worth of bytes.
class FLACFrameScanner {
public:
    FLACFrameScanner(const sp<DataSource>& source, const FlacStreamInfo& info, off64_t firstFrame);

    // The first whole frame that starts at or after `from`: ERROR_END_OF_STREAM
    // when none is left, a read error as it came.
    status_t findFrame(off64_t from, FLACFrame* frame);
    // Copies the frame's bytes (frame.size of them) to `out`.
    status_t copyFrame(const FLACFrame& frame, uint8_t* out);

    off64_t firstFrameOffset() const { return mFirstFrame; }
    off64_t endOffset() const { return mEnd; }
    // Largest frame the scanner accepts, for buffer sizes.
    size_t maxFrameSize() const;

private:
    // Bytes [offset, offset + length), fewer at the end of the file; null on
    // a read error.
    const uint8_t* window(off64_t offset, size_t length, size_t* available);
    // A well-formed header that agrees with STREAMINFO; anything else is a
    // sync pattern inside frame data.
    bool parseHeader(const uint8_t* data, size_t size, FlacFrameHeader* header) const;
    bool headerAt(off64_t offset, FlacFrameHeader* header);
    // Sets frame->size; false when no end is found within the frame limit.
    bool findEnd(const FlacFrameHeader& header, FLACFrame* frame);
    // findEnd over window bytes p[*k, stop) where only an end before a sync
    // code or at the end of the file can count; *crc covers p[0, *k) and both
    // are carried on when no end is found.
    bool fastEnd(const FlacFrameHeader& header, const uint8_t* p, size_t available, size_t stop, FLACFrame* frame,
                 uint16_t* crc, size_t* k);
    uint64_t firstSampleOf(const FlacFrameHeader& header) const;
    bool follows(const FlacFrameHeader& current, const FlacFrameHeader& next) const;
    size_t frameLimit(uint32_t blockSize) const;

    const sp<DataSource> mSource;
    const FlacStreamInfo mInfo;
    const off64_t mFirstFrame;
    off64_t mEnd;
    status_t mReadError;
    size_t mBudget;  // bytes findEnd may still checksum in this findFrame
    std::vector<uint8_t> mWindow;
    off64_t mWindowStart;
};

}  // namespace android

#endif
