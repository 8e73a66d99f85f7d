#ifndef MPEG4_SOURCE_H_
#define MPEG4_SOURCE_H_

#include <memory>
#include <vector>

#include <media/stagefright/DataSource.h>

#include "extractor/TrackSource.h"
#include "mpeg4/MPEG4Track.h"

namespace android {

// The samples of one MP4 track, read in the order its edit list plays them.
// The data source shares its reads with the buffers it hands out, so memory
// is the source's read-ahead plus what readers hold (twice a sample when NAL
// prefixes shorter than a start code make it grow).
class MPEG4Source : public TrackSource {
public:
    // The media editor's status for a sample with a broken NAL unit; it skips
    // to the next sample. The editor exports the same value.
    static constexpr status_t kErrorCorruptNal = -1099;

    MPEG4Source(const sp<DataSource>& source, const std::shared_ptr<const mpeg4::Track>& track, off64_t fileSize);

protected:
    ~MPEG4Source() override = default;

    status_t onStart() override;
    // SEEK_CLOSEST starts at the sync sample before the time and marks the
    // first buffer with kKeyTargetTime.
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    // The sync samples of all segments in play order, numbered from 0.
    uint64_t syncCount() const { return mSyncBase.back(); }
    void syncAt(uint64_t position, size_t* segment, uint32_t* sample) const;
    int64_t syncTimeUs(uint64_t position) const;
    void startSegment(size_t segment, uint32_t sample);
    status_t readSample(const mpeg4::SampleInfo& sample, int64_t timeUs, MediaBuffer** buffer);

    const sp<DataSource> mDataSource;
    const std::shared_ptr<const mpeg4::Track> mTrack;
    const off64_t mFileSize;
    // Sync positions before each segment, and their total at the end.
    std::vector<uint64_t> mSyncBase;
    size_t mSegment = 0;
    mpeg4::SampleCursor mCursor;
    int64_t mTargetTimeUs = -1;
};

}  // namespace android

#endif
