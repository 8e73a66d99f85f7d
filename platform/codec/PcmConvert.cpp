#include <media/stagefright/PcmConvert.h>

#include <cmath>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace android {

namespace {

int16_t Clip16(long r) { return static_cast<int16_t>(r > 32767 ? 32767 : r < -32768 ? -32768 : r); }

// Round to nearest even, as lrintf does in the default rounding mode, without
// a library call per sample (decoders hand out float: this is the hot loop).
long RoundFloat(float v) {
#if defined(__SSE2__)
    return _mm_cvtss_si32(_mm_set_ss(v));
#else
    return std::lrintf(v);
#endif
}

int16_t FromU8(const uint8_t* p) { return static_cast<int16_t>((int(*p) - 128) * 256); }
int16_t FromS16(const uint8_t* p) {
    int16_t v;
    memcpy(&v, p, sizeof(v));
    return v;
}
int16_t FromS24(const uint8_t* p) { return static_cast<int16_t>(p[1] | (p[2] << 8)); }
int16_t FromS32(const uint8_t* p) {
    int32_t v;
    memcpy(&v, p, sizeof(v));
    return static_cast<int16_t>(v >> 16);
}
int16_t FromFloat(const uint8_t* p) {
    float v;
    memcpy(&v, p, sizeof(v));
    // Single precision, as the reference multiplies. NaN converts to the
    // integer minimum, which the clip keeps in range.
    return Clip16(RoundFloat(v * 32768.0f));
}
int16_t FromDouble(const uint8_t* p) {
    double v;
    memcpy(&v, p, sizeof(v));
    return Clip16(std::lrint(v * 32768.0));
}

// One loop per sample type, so the type is not decided per sample.
template <int16_t (*Sample)(const uint8_t*), size_t kBytes>
void Convert(bool planar, const uint8_t* const* planes, size_t frames, size_t channels, int16_t* dst) {
    if (!planar) {
        const uint8_t* p = planes[0];
        for (size_t n = 0; n < frames * channels; ++n) dst[n] = Sample(p + n * kBytes);
        return;
    }
    for (size_t c = 0; c < channels; ++c) {
        const uint8_t* p = planes[c];
        for (size_t i = 0; i < frames; ++i) dst[i * channels + c] = Sample(p + i * kBytes);
    }
}

}  // namespace

void AppendPcm16(PcmSampleType type, bool planar, const uint8_t* const* planes, size_t frames,
                 size_t channels, std::vector<int16_t>* out) {
    const size_t base = out->size();
    out->resize(base + frames * channels);
    int16_t* dst = out->data() + base;
    switch (type) {
        case PcmSampleType::kU8: return Convert<FromU8, 1>(planar, planes, frames, channels, dst);
        case PcmSampleType::kS16: return Convert<FromS16, 2>(planar, planes, frames, channels, dst);
        case PcmSampleType::kS24: return Convert<FromS24, 3>(planar, planes, frames, channels, dst);
        case PcmSampleType::kS32: return Convert<FromS32, 4>(planar, planes, frames, channels, dst);
        case PcmSampleType::kFloat: return Convert<FromFloat, 4>(planar, planes, frames, channels, dst);
        case PcmSampleType::kDouble: return Convert<FromDouble, 8>(planar, planes, frames, channels, dst);
    }
}

}  // namespace android
