#ifndef QN_MEDIA_EXTRACTOR_WRAPPER_H
#define QN_MEDIA_EXTRACTOR_WRAPPER_H

#include <cstdint>
#include <mutex>
#include <sys/types.h>

#include <media/IMediaExtractor.h>
#include <media/IMediaSource.h>
#include <media/MediaCodecBuffer.h>
#include <media/MediaTrack.h>
#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>
#include <utils/Vector.h>

namespace android {
namespace qnmediaeditor {

// Demuxer over one file: the track table, track and file formats, and the
// samples of the selected tracks merged in time order, one sample read ahead
// per track. Every operation but setOutputFormatFlag, setFlacRaw and
// getTotalBitrate holds mLock for its whole run, reads from the track
// sources included.
//
// Choices made where the behaviour was open:
// - getTotalBitrate answers false when the longest track duration is 0.
// - selectTrack answers the status of a track source that fails to start and
//   adds no entry; a source whose stop() fails is logged and dropped.
// - readSampleData copies into the caller's buffer from its base, so the
//   range (0, sample size) it sets always covers the copied bytes, whatever
//   range offset the buffer came with.
// - getTrackFormat works on its own copy of the track metadata, so the 24-bit
//   rewrite and the cleared FLAC header byte never reach the extractor's.
class QNMediaExtractorWrapper : public RefBase {
public:
    typedef MediaTrack::ReadOptions::SeekMode SeekMode;

    QNMediaExtractorWrapper();

    status_t setDataSource(int fd, int64_t offset, int64_t length);
    size_t countTracks() const;
    status_t getTrackFormat(size_t index, sp<AMessage>* format);
    // The extractor's own object, asked with kIncludeExtensiveMetaData.
    sp<MetaData> getTrackMeta(size_t index, uint32_t flags) const;

    status_t getFileFormat(sp<AMessage>* format) const;
    // Adds "csd-0" (a FLAC stream header) and "editor-flactrim" built from the
    // raw STREAMINFO block in `meta`; false for anything but fixed block sizes.
    bool makeFlacCSD(sp<MetaData> meta, sp<AMessage>* format) const;
    status_t setOutputFormatFlag(uint32_t flag);
    status_t setFlacRaw(bool raw);

    status_t selectTrack(size_t index);
    status_t unselectTrack(size_t index);
    status_t seekTo(int64_t timeUs, SeekMode mode = MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC);
    status_t advance();
    status_t readSampleData(const sp<ABuffer>& buffer);
    status_t readSampleData(sp<ABuffer>* buffer);
    status_t readSampleData(const sp<MediaCodecBuffer>& buffer);
    status_t getSampleTrackIndex(size_t* trackIndex);
    status_t getSampleTime(int64_t* sampleTimeUs);
    status_t getSampleMeta(sp<MetaData>* sampleMeta);
    bool getTotalBitrate(int64_t* bitrate) const;

protected:
    virtual ~QNMediaExtractorWrapper();

    // Test seam: opens over a given source and extractor exactly as
    // setDataSource does once it has sniffed the file.
    status_t setExtractorForTest(const sp<DataSource>& source, const sp<IMediaExtractor>& extractor);

private:
    struct TrackInfo {
        sp<IMediaSource> mSource;
        size_t mTrackIndex = 0;
        status_t mFinalResult = OK;
        MediaBufferBase* mSample = nullptr;  // owned by the element kept in the vector
        int64_t mSampleTimeUs = -1;
        uint32_t mTrackFlags = 0;
    };

    enum { kIsVorbis = 1 };

    mutable std::mutex mLock;
    sp<DataSource> mDataSource;
    sp<IMediaExtractor> mExtractor;
    Vector<TrackInfo> mSelectedTracks;
    int64_t mTotalBitrate;
    int64_t mDurationUs;
    bool mFlacRaw;
    int32_t mConvertTrackIndex;
    int32_t mConvertPcmEncoding;

    // The two forms that fill a caller's buffer; takes mLock.
    template <typename Buffer>
    status_t readIntoCallerBuffer(const sp<Buffer>& buffer, bool warnWhenSmall);

    // These run with mLock held by their caller.
    status_t attachLocked(const sp<DataSource>& source, const sp<IMediaExtractor>& extractor);
    void updateDurationAndBitrate();
    void releaseTrackSamples();
    ssize_t fetchTrackSamples(int64_t seekTimeUs = -1,
                              SeekMode mode = MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC);
    // Copies the pending sample to `dst` (at least its size), appends the
    // Vorbis trailer and answers the bytes written.
    size_t copySample(const TrackInfo& info, uint8_t* dst) const;
    size_t sampleSize(const TrackInfo& info) const;
    // Copies the pending sample into `buffer` with the range (0, its size),
    // re-packed when the track is marked.
    template <typename Buffer>
    void deliverSample(const TrackInfo& info, const sp<Buffer>& buffer);
    bool isConvertTrack(const TrackInfo& info) const;

    QNMediaExtractorWrapper(const QNMediaExtractorWrapper&) = delete;
    QNMediaExtractorWrapper& operator=(const QNMediaExtractorWrapper&) = delete;
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
