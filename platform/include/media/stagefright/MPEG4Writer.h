#ifndef MPEG4_WRITER_H_
#define MPEG4_WRITER_H_

#include <memory>

#include <media/stagefright/MediaWriter.h>
#include <utils/String8.h>

namespace android {

class WriterDeviceItems;

// ISO base media file writer (mp4): ftyp, streamed mdat, moov at the end.
//
// Tracks: H.264 (avc1/avcC), HEVC (hvc1/hvcC), AAC (mp4a/esds), AMR
// (samr, sawb). One reader thread per source pulls its buffers (with read
// options, so a MediaAdapter may wait for pushes) and appends the samples to
// the media data as they come; only the sample tables stay in memory.
// stop() waits until every source has reached its end of stream, then
// writes the tables: nothing a source delivered is lost, and the file is
// complete when stop() returns. start(params) reads kKeyRotation (the video
// track header's matrix) and kKeyRealTimeRecording from the file metadata.
//
// The device's items, set before start() (INVALID_OPERATION after it,
// except the waveform, taken until stop()):
//
//   item (setter)                      where                 stored as
//   location (setGeoData)              moov/udta/\xA9xyz     16-bit length, 16-bit language,
//                                                            "+DD.DDDD+DDD.DDDD/" (ISO 6709)
//   sphere view (setUuidData)          top-level 'uuid'      extended type "QNED-SPHEREVIEW1",
//                                      after moov            then the bytes as given
//   recording type (setQNVideoFourCC)  moov/udta/qnrt        the text, no terminator
//   waveform (setWaveform)             moov/udta/wafm        2 * count bytes as given
//   M4A only (QNM4AWriter):
//   user message (setUserMessage)      moov/udta/umsg        the text, no terminator
//   VR metadata (setAudioRecodingMeta) moov/udta/rmod        the text, no terminator
//   bookmark size (setRecodingParams,  moov/udta/bksz        8-byte big-endian int64
//     "bookmark-size" int32 or int64)
//
// The extractor publishes them in the file metadata (location as
// kKeyLocation; the sphere view as kEditorKeySphereView with one zero byte
// appended), the bookmark size in the metadata of every audio track.
class MPEG4Writer : public MediaWriter {
public:
    explicit MPEG4Writer(int fd);

    status_t addSource(const sp<MediaSource>& source) override;
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    status_t pause() override;
    bool reachedEOS() override;
    void setWaveform(const uint8_t* data, int count) override;

    // Device extensions. Location in units of 1e-4 degrees.
    status_t setGeoData(int latitude, int longitude);
    status_t setUuidData(const uint8_t* data, int size);
    status_t setQNVideoFourCC(String8 fourcc);

protected:
    ~MPEG4Writer() override;

    enum class FileBrand { kMp4, kM4a };
    MPEG4Writer(int fd, FileBrand brand);
    // The items shared with the audio writers (waveform, user message, VR
    // metadata, bookmark size).
    WriterDeviceItems& deviceItems();

    struct Impl;
    std::unique_ptr<Impl> mImpl;
};

}  // namespace android

#endif
