#ifndef MP4_TRACK_TABLES_H_
#define MP4_TRACK_TABLES_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace android {

class Mp4BoxWriter;

// What is kept of every sample written to the media data, compactly: sizes
// (4 bytes a sample), times as zig-zag varint deltas (a few bytes a
// sample), chunk offsets and lengths (one entry per chunk) and the sync
// sample numbers. Nothing here grows with the bytes of the media.
class Mp4TrackTables {
public:
    // A sample whose bytes begin at file offset `offset`. It opens a new
    // chunk unless `continuesChunk` (it directly follows this track's
    // previous sample in the file).
    void addSample(uint64_t offset, uint32_t size, int64_t dtsUs, int64_t ptsUs, bool sync,
                   bool continuesChunk);

    size_t sampleCount() const { return mSizes.size(); }
    uint64_t totalBytes() const { return mTotalBytes; }

    // Decoding and presentation times in microseconds, in decoding order.
    void times(std::vector<int64_t>* dtsUs, std::vector<int64_t>* ptsUs) const;

    // The sample-table boxes that do not depend on the time scale.
    void writeSyncSamples(Mp4BoxWriter& w) const;   // stss, omitted when all are sync
    void writeSampleSizes(Mp4BoxWriter& w) const;   // stsz
    void writeChunks(Mp4BoxWriter& w) const;        // stsc, then stco or co64

private:
    static void putVarint(std::vector<uint8_t>* out, int64_t value);

    std::vector<uint32_t> mSizes;
    std::vector<uint8_t> mTimeLog;  // per sample: dts - previous dts, pts - dts
    int64_t mLastDtsUs = 0;
    std::vector<uint32_t> mSyncSamples;  // 1-based
    std::vector<uint64_t> mChunkOffsets;
    std::vector<uint32_t> mChunkSamples;
    uint64_t mTotalBytes = 0;
};

}  // namespace android

#endif
