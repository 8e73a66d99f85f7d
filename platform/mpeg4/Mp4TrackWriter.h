#ifndef MP4_TRACK_WRITER_H_
#define MP4_TRACK_WRITER_H_

#include <cstdint>
#include <memory>
#include <vector>

#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>

#include "mpeg4/Mp4NalUnits.h"
#include "mpeg4/Mp4TrackTables.h"
#include "mpeg4/Mp4TrackTiming.h"

namespace android {

class ByteSink;
class Mp4BoxWriter;

// One track of the file: turns the buffers of its source into stored
// samples (codec configuration kept aside, Annex-B turned into
// length-prefixed NAL units) and writes its 'trak' at the end.
//
// prepare() runs on the track's reader thread only; record() under the
// writer's file lock; finish() and writeTrak() after the reader has ended.
class Mp4TrackWriter {
public:
    enum class Codec { kAvc, kHevc, kAac, kAmrNb, kAmrWb };

    // Null, with a log line, for a format this writer cannot store.
    static std::unique_ptr<Mp4TrackWriter> Create(const sp<MetaData>& format);

    bool isVideo() const { return mCodec == Codec::kAvc || mCodec == Codec::kHevc; }
    Codec codec() const { return mCodec; }

    struct Sample {
        // Stored as given, unless `nals` is set: then the units, each behind
        // its length, make up the `size` bytes.
        const uint8_t* data = nullptr;
        const std::vector<NalSpan>* nals = nullptr;
        size_t size = 0;
        int64_t dtsUs = 0;
        int64_t ptsUs = 0;
        bool sync = false;
    };
    // True with the bytes to store; false for a buffer that is not media
    // (codec configuration, no bytes, no time). The bytes stay valid until
    // the next call or until the buffer is released.
    bool prepare(MediaBufferBase* buffer, Sample* out);
    // Appends the sample's stored bytes: Annex-B units go to the sink behind
    // their lengths without an intermediate copy.
    status_t store(ByteSink& sink, const Sample& sample) const;
    void record(const Sample& sample, uint64_t offset, bool continuesChunk);

    size_t sampleCount() const { return mTables.sampleCount(); }
    // Timing and codec configuration; an error when the track cannot be
    // described (it is then left out of the file).
    status_t finish();
    void writeTrak(Mp4BoxWriter& w, uint32_t trackId, uint32_t movieTimescale, int32_t rotation,
                   uint32_t creationTime) const;
    const Mp4TrackTiming& timing() const { return mTiming; }

private:
    explicit Mp4TrackWriter(Codec codec, const sp<MetaData>& format);

    void takeConfigBuffer(const uint8_t* data, size_t size);
    void collectParameterSets(const std::vector<NalSpan>& nals);
    void toLengthPrefixed(const uint8_t* data, size_t size, Sample* out);
    std::vector<uint8_t> buildConfig() const;
    void writeSampleEntry(Mp4BoxWriter& w) const;
    int64_t defaultDurationUs() const;

    const Codec mCodec;
    int32_t mWidth = 0;
    int32_t mHeight = 0;
    uint32_t mSampleRate = 0;
    uint32_t mChannels = 0;
    int32_t mFrameRate = 0;
    int64_t mEndUs = -1;             // where the presentation stops, when given

    std::vector<uint8_t> mRecord;    // avcC/hvcC record or AAC AudioSpecificConfig
    size_t mLengthSize = 4;          // NAL length size of the stored samples
    bool mConfigFromBuffers = false;
    // Annex-B parameter sets seen (VPS, SPS, PPS), for building the record.
    std::vector<std::vector<uint8_t>> mParameterSets[3];
    uint16_t mAmrModes = 0;
    bool mWarnedFraming = false;

    std::vector<NalSpan> mNals;

    Mp4TrackTables mTables;
    Mp4TrackTiming mTiming;
    std::vector<uint8_t> mFinalConfig;
};

}  // namespace android

#endif
