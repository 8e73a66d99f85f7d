#ifndef MPEG4_SAMPLE_TABLE_H_
#define MPEG4_SAMPLE_TABLE_H_

#include <cstdint>
#include <vector>

#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

namespace android {
namespace mpeg4 {

struct SampleInfo {
    uint64_t offset = 0;
    uint32_t size = 0;
    int64_t dts = 0;        // media timescale
    int32_t ctsOffset = 0;  // composition minus decoding time
    bool sync = false;
};

// One sample of a track fragment run, as its 'trun' and defaults give it.
struct FragmentSample {
    uint32_t size = 0;
    uint32_t duration = 0;
    int32_t ctsOffset = 0;
    bool sync = false;
};

// The sample tables of one track (ISO/IEC 14496-12, 8.6 and 8.7), kept in the
// compact form the file stores them in: what is held grows with the tables'
// size in the file, never with a count the file merely claims.
class SampleTable {
public:
    // Fragments add samples one by one; past this a track is refused rather
    // than held (ten hours of 48 kHz AAC is 1.7 million samples).
    static constexpr uint32_t kMaxSamples = 1u << 23;

    // Each takes the box payload and refuses one whose entries do not fit it.
    status_t setSampleSizes(uint32_t type, ByteReader payload);   // 'stsz' or 'stz2'
    status_t setChunkOffsets(uint32_t type, ByteReader payload);  // 'stco' or 'co64'
    status_t setSampleToChunk(ByteReader payload);
    status_t setTimeToSample(ByteReader payload);
    status_t setCompositionOffsets(ByteReader payload);
    status_t setSyncSamples(ByteReader payload);
    // Checks that the tables agree and indexes the runs; ERROR_MALFORMED when
    // a table is missing or cannot describe every sample.
    status_t finish();
    // Adds the samples of one track fragment run (ISO/IEC 14496-12, 8.8.8)
    // after a finished table: they lie back to back from `offset` and the
    // first is decoded at `dts`, or where the table ends when `dts` would go
    // back in time. ERROR_MALFORMED when times overflow or the track grows
    // past what is held in memory.
    status_t appendRun(uint64_t offset, int64_t dts, const std::vector<FragmentSample>& samples);

    uint32_t count() const { return mCount; }
    uint32_t sampleSize(uint32_t index) const;
    uint32_t maxSampleSize() const { return mMaxSize; }
    uint64_t totalBytes() const { return mTotalBytes; }
    // Decoding time just past the last sample.
    int64_t endDts() const { return mEndDts; }
    // Sync samples in order; every sample when the track has no sync table.
    uint32_t syncCount() const { return mHaveSyncTable ? uint32_t(mSyncSamples.size()) : mCount; }
    uint32_t syncSample(uint32_t k) const { return mHaveSyncTable ? mSyncSamples[k] : k; }
    // Position among the sync samples of the first one at or after `index`
    // (syncCount() when none), and the last sync sample at or before it.
    uint32_t syncPositionFrom(uint32_t index) const;
    uint32_t syncAtOrBefore(uint32_t index) const;
    // The first sample decoded at or after `dts`; count() when none.
    uint32_t firstAtOrAfterDts(int64_t dts) const;
    // Bounds of the composition offsets, 0 included.
    int32_t minCtsOffset() const { return mMinCtsOffset; }
    int32_t maxCtsOffset() const { return mMaxCtsOffset; }

private:
    friend class SampleCursor;

    // Runs start below count(), so 32 bits hold their first sample; a run
    // takes little more than the table entry it comes from.
    struct ChunkRun {
        uint32_t firstSample;
        uint32_t firstChunk;  // zero-based
        uint32_t chunkEnd;    // one past the run's last chunk
        uint32_t samplesPerChunk;
    };
    struct TimeRun {
        int64_t firstDts;
        uint32_t firstSample;
        uint32_t count;
        uint32_t delta;
    };
    struct OffsetRun {
        uint32_t firstSample;
        uint32_t count;
        int32_t offset;
    };

    uint64_t chunkOffset(uint32_t chunk) const;
    status_t indexTimes();
    status_t indexChunks();
    void widenForAppending();
    void appendTimes(uint32_t first, int64_t dts, const std::vector<FragmentSample>& samples);
    void appendOffsets(uint32_t first, const std::vector<FragmentSample>& samples);
    void appendSyncs(uint32_t first, const std::vector<FragmentSample>& samples);

    uint32_t mCount = 0;
    bool mHaveSizes = false;
    uint32_t mFixedSize = 0;
    uint32_t mSizeBits = 0;  // width of a table entry; 0 with a fixed size
    std::vector<uint8_t> mSizes;

    bool mHaveChunks = false;
    uint32_t mChunkCount = 0;
    uint32_t mChunkOffsetBytes = 4;
    std::vector<uint8_t> mChunkOffsets;

    bool mHaveSampleToChunk = false;
    std::vector<ChunkRun> mChunkRuns;
    bool mHaveTimes = false;
    std::vector<TimeRun> mTimeRuns;
    std::vector<OffsetRun> mOffsetRuns;
    bool mHaveSyncTable = false;
    std::vector<uint32_t> mSyncSamples;  // zero-based, ascending

    uint32_t mMaxSize = 0;
    uint64_t mTotalBytes = 0;
    int64_t mEndDts = 0;
    int64_t mLastDts = 0;
    int32_t mMinCtsOffset = 0;
    int32_t mMaxCtsOffset = 0;
};

// Walks a finished table: seek() to any sample, advance() to the next one in
// constant time.
class SampleCursor {
public:
    explicit SampleCursor(const SampleTable& table) : mTable(table) {}

    bool seek(uint32_t index);
    void advance();
    bool valid() const { return mIndex < mTable.count(); }
    uint32_t index() const { return mIndex; }
    const SampleInfo& info() const { return mInfo; }

private:
    void loadSync();

    const SampleTable& mTable;
    uint32_t mIndex = UINT32_MAX;
    size_t mTimeRun = 0;
    uint32_t mTimeInRun = 0;
    size_t mOffsetRun = 0;
    uint32_t mOffsetInRun = 0;
    size_t mChunkRun = 0;
    uint32_t mChunk = 0;
    uint32_t mInChunk = 0;
    size_t mSyncPos = 0;
    SampleInfo mInfo;
};

}  // namespace mpeg4
}  // namespace android

#endif
