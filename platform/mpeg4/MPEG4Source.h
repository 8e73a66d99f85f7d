#ifndef MPEG4_SOURCE_H_
#define MPEG4_SOURCE_H_

#include <memory>
#include <mutex>
#include <vector>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaSource.h>

#include "mpeg4/MPEG4Track.h"

namespace android {

// The samples of one MP4 track, read from the file one at a time: memory
// per read is the sample's size (twice that when NAL prefixes shorter than a
// start code make the sample grow).
class MPEG4Source : public MediaSource {
public:
    MPEG4Source(const sp<DataSource>& source, const std::shared_ptr<const mpeg4::Track>& track, off64_t fileSize);

    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    // Seeks honour the four sync modes; SEEK_CLOSEST starts at the sync
    // sample before the time and marks the first buffer with kKeyTargetTime.
    status_t read(MediaBufferBase** buffer, const MediaTrack::ReadOptions* options = nullptr) override;

protected:
    ~MPEG4Source() override = default;

private:
    void seekLocked(int64_t timeUs, MediaTrack::ReadOptions::SeekMode mode);
    int64_t syncTimeUs(uint32_t k);
    status_t readSampleLocked(const mpeg4::SampleInfo& sample, MediaBufferBase** buffer);

    std::mutex mLock;
    const sp<DataSource> mDataSource;
    const std::shared_ptr<const mpeg4::Track> mTrack;
    const off64_t mFileSize;
    mpeg4::SampleCursor mCursor;
    int64_t mTargetTimeUs = -1;
    std::vector<uint8_t> mScratch;
};

}  // namespace android

#endif
