#ifndef FLAC_PCM_ENCODER_H_
#define FLAC_PCM_ENCODER_H_

#include <cstddef>
#include <cstdint>
#include <vector>

#include <media/stagefright/ByteSink.h>
#include <utils/Errors.h>

#include "flac/FlacStreamHeader.h"
#include "writer/PcmLayout.h"

#include <FLAC/stream_encoder.h>

namespace android {

// Encodes interleaved PCM (8, 16 or 24-bit packed) into FLAC frames that go
// straight to a sink. The encoder's own stream header is not written: the
// caller writes its header and takes the final STREAMINFO from finish().
class FlacPcmEncoder {
public:
    FlacPcmEncoder() = default;
    ~FlacPcmEncoder();

    static bool supports(const PcmLayout& layout);
    status_t init(const PcmLayout& layout, ByteSink* sink);
    // Whole frames are encoded; a partial frame waits for the next call.
    status_t encode(const uint8_t* data, size_t size);
    // Flushes and reports what the stream holds (MD5 included).
    status_t finish(FlacStreamInfo* info);
    // STREAMINFO as known before the first frame.
    FlacStreamInfo initialInfo() const;

private:
    static FLAC__StreamEncoderWriteStatus writeCallback(const FLAC__StreamEncoder*, const FLAC__byte buffer[],
                                                        size_t bytes, uint32_t samples, uint32_t frame, void* client);
    static void metadataCallback(const FLAC__StreamEncoder*, const FLAC__StreamMetadata* metadata, void* client);
    void convert(const uint8_t* data, size_t frames);

    FLAC__StreamEncoder* mEncoder = nullptr;
    ByteSink* mSink = nullptr;
    PcmLayout mLayout;
    status_t mWriteError = OK;
    std::vector<uint8_t> mCarry;       // a partial frame between calls
    std::vector<int32_t> mSamples;     // one buffer, widened for the encoder
    FlacStreamInfo mFinal;
    bool mHaveFinal = false;
};

}  // namespace android

#endif
