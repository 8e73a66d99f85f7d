#ifndef QN_MEDIA_MUXER_H
#define QN_MEDIA_MUXER_H

#include <atomic>
#include <cstdint>
#include <mutex>

#include <media/IMediaRecorderClient.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaWriter.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/RefBase.h>
#include <utils/String8.h>
#include <utils/Vector.h>

namespace android {
namespace qnmediaeditor {

// The output formats the editor service passes; the muxer writes six of them.
// Fixed underlying type: a caller may hand in any int, and a value outside the
// list must be refused, not be undefined.
enum OutputFileFormat : int32_t {
    OUTPUT_FILE_FORMAT_MPEG_4 = 2,
    OUTPUT_FILE_FORMAT_AMR_A = 11,
    OUTPUT_FILE_FORMAT_AMR_B = 12,
    OUTPUT_FILE_FORMAT_WAVE = 13,
    OUTPUT_FILE_FORMAT_FLAC = 14,
    OUTPUT_FILE_FORMAT_M4A = 15,
};

class QNMediaMuxerTestAccess;

// Writes one file from compressed samples handed in one at a time with their
// track index. Each track is a MediaAdapter that the writer pulls from.
// File-level settings are accepted only before start(); one muxer, one file.
class QNMediaMuxer : public RefBase {
public:
    enum State {
        UNINITIALIZED = 0,
        INITIALIZED = 1,
        STARTED = 2,
        STOPPED = 3,
    };

    // The writer gets the descriptor; the muxer never closes it. Any format
    // outside the six leaves the muxer UNINITIALIZED.
    QNMediaMuxer(int fd, OutputFileFormat format);

    int32_t getMuxerState() const { return mState.load(); }

    // The new track's index, or a negative status (-1: the writer refused it).
    int32_t addTrack(const sp<AMessage>& format);
    status_t setOrientationHint(int degrees);

    // MP4 output only.
    status_t setLocation(int latitude, int longitude);
    status_t setUuidData(const uint8_t* data, int size);
    status_t setRecordingType(String8 type);

    // Stored by the WAVE, FLAC and M4A writers; a no-op for the others.
    status_t setUserMessage(const uint8_t* message);
    status_t setVRMeta(const uint8_t* text);
    status_t setRecodingParams(const sp<AMessage>& params);

    status_t start();
    status_t stop();

    // flags: 1 sync frame, 2 codec config. A non-zero decodingTimeFlag makes
    // the decoding time come from the frame-rate counter (setVideoFPS).
    status_t writeSampleData(int decodingTimeFlag, const sp<ABuffer>& buffer, uint32_t trackIndex,
                             int64_t timeUs, uint32_t flags);

    status_t setVideoFPS(int fps);
    // `sampleCount` 16-bit values from the buffer's data.
    status_t writeWaveFormData(sp<ABuffer>& waveform, int sampleCount);
    void setListener(const sp<IMediaRecorderClient>& listener);

    // Ends one track early; may run while another thread is blocked in
    // writeSampleData.
    status_t forceTrackStop(uint32_t trackIndex);

protected:
    ~QNMediaMuxer() override;

private:
    friend class QNMediaMuxerTestAccess;

    // Refuses a file-level setter outside INITIALIZED, or off MP4 when mp4Only.
    status_t checkFileSetter(const char* operation, bool mp4Only) const;
    sp<MediaAdapter> trackAt(uint32_t index);

    const OutputFileFormat mFormat;
    sp<MediaWriter> mWriter;
    Vector<sp<MediaAdapter>> mTrackList;
    sp<MetaData> mFileMeta;
    int64_t mNextDecodingTimeUs;
    // Written by setVideoFPS() without the lock.
    std::atomic<int64_t> mExpectedTimeScale;
    std::mutex mMuxerLock;
    // Read by getMuxerState() without the lock.
    std::atomic<int32_t> mState;

    // Guards only the growth of mTrackList against forceTrackStop(), which
    // must not wait for the muxer lock. Never held while calling out.
    std::mutex mTrackListLock;

    QNMediaMuxer(const QNMediaMuxer&) = delete;
    QNMediaMuxer& operator=(const QNMediaMuxer&) = delete;
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
