#include <media/stagefright/PcmConvert.h>

#include <cmath>
#include <cstring>

namespace android {

namespace {

int16_t FromFloat(double v) {
    const long r = std::lrint(v * 32768.0);
    return static_cast<int16_t>(r > 32767 ? 32767 : r < -32768 ? -32768 : r);
}

int16_t Sample(PcmSampleType type, const uint8_t* p) {
    switch (type) {
        case PcmSampleType::kU8:
            return static_cast<int16_t>((int(*p) - 128) * 256);
        case PcmSampleType::kS16: {
            int16_t v;
            memcpy(&v, p, sizeof(v));
            return v;
        }
        case PcmSampleType::kS24:
            return static_cast<int16_t>(p[1] | (p[2] << 8));
        case PcmSampleType::kS32: {
            int32_t v;
            memcpy(&v, p, sizeof(v));
            return static_cast<int16_t>(v >> 16);
        }
        case PcmSampleType::kFloat: {
            float v;
            memcpy(&v, p, sizeof(v));
            // Single precision, as the reference multiplies.
            const long r = std::lrintf(v * 32768.0f);
            return static_cast<int16_t>(r > 32767 ? 32767 : r < -32768 ? -32768 : r);
        }
        case PcmSampleType::kDouble: {
            double v;
            memcpy(&v, p, sizeof(v));
            return FromFloat(v);
        }
    }
    return 0;
}

size_t BytesOf(PcmSampleType type) {
    switch (type) {
        case PcmSampleType::kU8: return 1;
        case PcmSampleType::kS16: return 2;
        case PcmSampleType::kS24: return 3;
        case PcmSampleType::kS32:
        case PcmSampleType::kFloat: return 4;
        case PcmSampleType::kDouble: return 8;
    }
    return 1;
}

}  // namespace

void AppendPcm16(PcmSampleType type, bool planar, const uint8_t* const* planes, size_t frames,
                 size_t channels, std::vector<int16_t>* out) {
    const size_t bytes = BytesOf(type);
    const size_t base = out->size();
    out->resize(base + frames * channels);
    int16_t* dst = out->data() + base;
    for (size_t i = 0; i < frames; ++i) {
        for (size_t c = 0; c < channels; ++c) {
            const uint8_t* p = planar ? planes[c] + i * bytes : planes[0] + (i * channels + c) * bytes;
            *dst++ = Sample(type, p);
        }
    }
}

}  // namespace android
