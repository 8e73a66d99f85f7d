#ifndef PCM_LAYOUT_H_
#define PCM_LAYOUT_H_

#include <cstddef>

#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>

namespace android {

// How the bytes of a raw audio track's buffers are laid out: interleaved,
// little-endian sample frames.
struct PcmLayout {
    enum class Sample { kUnsigned8, kSigned16, kSigned24Packed, kSigned32, kFloat32 };

    Sample sample = Sample::kSigned16;
    int bitsPerSample = 16;
    int channels = 0;
    int sampleRate = 0;

    size_t bytesPerSample() const { return static_cast<size_t>(bitsPerSample) / 8; }
    size_t frameBytes() const { return bytesPerSample() * static_cast<size_t>(channels); }
    bool isFloat() const { return sample == Sample::kFloat32; }

    // The sample type comes from kKeyPcmEncoding when present (it names the
    // byte layout), else from the bits per sample ('bPsp', then 'sbit'; 24
    // means packed), else 16-bit. 'bPsp' is where the editor's muxer keeps a
    // track format's "bits-per-sample". Channel count and sample rate are required.
    // OK, or BAD_VALUE / ERROR_UNSUPPORTED with a log line under `owner`.
    static status_t fromMetaData(const sp<MetaData>& meta, const char* owner, PcmLayout* out);
};

}  // namespace android

#endif
