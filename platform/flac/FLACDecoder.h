#ifndef PLATFORM_FLAC_FLAC_DECODER_H_
#define PLATFORM_FLAC_FLAC_DECODER_H_

#include <cstdint>

#include <FLAC/stream_decoder.h>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaBuffer.h>

#include "flac/FLACMetadata.h"

namespace android {

// libFLAC's stream decoder over a DataSource, giving one media buffer of
// interleaved little-endian PCM per frame: 16-bit for streams of up to 16
// bits, 24-bit packed up to 24 bits, 32-bit above; narrower samples are
// scaled up to fill the width.
class FLACDecoder {
public:
    FLACDecoder(const sp<DataSource>& source, const FlacStreamInfo& info);
    ~FLACDecoder();

    // Bits per output sample for a stream of `bitsPerSample`.
    static uint32_t OutputBits(uint32_t bitsPerSample);

    status_t init();
    // The next frame as PCM stamped with its time; ERROR_END_OF_STREAM at the
    // end, ERROR_MALFORMED for a frame the decoder reported as damaged.
    status_t decodeNext(MediaBuffer** buffer);
    // The next frame decoded starts at `sample`.
    status_t seek(uint64_t sample);

private:
    static FLAC__StreamDecoderReadStatus ReadCb(const FLAC__StreamDecoder*, FLAC__byte buffer[], size_t* bytes, void* me);
    static FLAC__StreamDecoderSeekStatus SeekCb(const FLAC__StreamDecoder*, FLAC__uint64 offset, void* me);
    static FLAC__StreamDecoderTellStatus TellCb(const FLAC__StreamDecoder*, FLAC__uint64* offset, void* me);
    static FLAC__StreamDecoderLengthStatus LengthCb(const FLAC__StreamDecoder*, FLAC__uint64* length, void* me);
    static FLAC__bool EofCb(const FLAC__StreamDecoder*, void* me);
    static FLAC__StreamDecoderWriteStatus WriteCb(const FLAC__StreamDecoder*, const FLAC__Frame* frame,
                                                  const FLAC__int32* const buffer[], void* me);
    static void MetadataCb(const FLAC__StreamDecoder*, const FLAC__StreamMetadata*, void*) {}
    static void ErrorCb(const FLAC__StreamDecoder*, FLAC__StreamDecoderErrorStatus status, void* me);

    FLAC__StreamDecoderWriteStatus write(const FLAC__Frame* frame, const FLAC__int32* const buffer[]);
    void dropPending();

    const sp<DataSource> mSource;
    const FlacStreamInfo mInfo;
    const uint32_t mOutputBits;
    off64_t mSize;
    off64_t mPosition;
    bool mReadFailed;
    bool mFrameDamaged;
    FLAC__StreamDecoder* mDecoder;
    MediaBuffer* mPending;

    FLACDecoder(const FLACDecoder&) = delete;
    FLACDecoder& operator=(const FLACDecoder&) = delete;
};

}  // namespace android

#endif
