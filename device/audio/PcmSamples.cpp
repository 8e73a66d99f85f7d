#include "audio/PcmSamples.h"

#include <cstring>

namespace qnaudio {

namespace {

// Round a left-justified value to `bits` significant bits, saturating.
inline int32_t roundTo(int32_t v, int bits) {
    const int shift = 32 - bits;
    const int64_t r = (static_cast<int64_t>(v) + (int64_t{1} << (shift - 1))) >> shift;
    const int64_t hi = (int64_t{1} << (bits - 1)) - 1;
    return static_cast<int32_t>(r > hi ? hi : r);
}

}  // namespace

int bytesPerSample(int format) {
    switch (format) {
        case kFormatU8: return 1;
        case kFormatS16: return 2;
        case kFormatS24Packed: return 3;
        case kFormatS32: return 4;
        default: return 0;
    }
}

void decodeSamples(const uint8_t* in, int format, size_t count, int32_t* out) {
    switch (format) {
        case kFormatU8:
            for (size_t i = 0; i < count; ++i) out[i] = static_cast<int32_t>(static_cast<uint32_t>(in[i] ^ 0x80) << 24);
            break;
        case kFormatS16:
            for (size_t i = 0; i < count; ++i) {
                out[i] = static_cast<int32_t>(static_cast<uint32_t>(in[2 * i] | (in[2 * i + 1] << 8)) << 16);
            }
            break;
        case kFormatS24Packed:
            for (size_t i = 0; i < count; ++i) {
                const uint8_t* p = in + 3 * i;
                out[i] = static_cast<int32_t>((static_cast<uint32_t>(p[0]) << 8) | (static_cast<uint32_t>(p[1]) << 16) |
                                              (static_cast<uint32_t>(p[2]) << 24));
            }
            break;
        case kFormatS32:
            memcpy(out, in, count * 4);
            break;
        default:
            memset(out, 0, count * 4);
            break;
    }
}

void encodeSamples(const int32_t* in, int format, size_t count, uint8_t* out) {
    switch (format) {
        case kFormatU8:
            for (size_t i = 0; i < count; ++i) out[i] = static_cast<uint8_t>(roundTo(in[i], 8) + 128);
            break;
        case kFormatS16:
            for (size_t i = 0; i < count; ++i) {
                const uint32_t v = static_cast<uint32_t>(roundTo(in[i], 16));
                out[2 * i] = v & 0xFF;
                out[2 * i + 1] = (v >> 8) & 0xFF;
            }
            break;
        case kFormatS24Packed:
            for (size_t i = 0; i < count; ++i) {
                const uint32_t v = static_cast<uint32_t>(roundTo(in[i], 24));
                out[3 * i] = v & 0xFF;
                out[3 * i + 1] = (v >> 8) & 0xFF;
                out[3 * i + 2] = (v >> 16) & 0xFF;
            }
            break;
        case kFormatS32:
            memcpy(out, in, count * 4);
            break;
        default:
            break;
    }
}

bool canRemap(int inChannels, int outChannels) {
    if (inChannels < 1 || outChannels < 1) return false;
    return inChannels == outChannels || (inChannels <= 2 && outChannels <= 2);
}

void remapChannels(const int32_t* in, int inChannels, int32_t* out, int outChannels, size_t frames) {
    if (inChannels == outChannels) {
        if (in != out) memmove(out, in, frames * inChannels * sizeof(int32_t));
    } else if (inChannels == 1) {
        // Backwards, so the stereo frames may overwrite the mono ones in place.
        for (size_t i = frames; i-- > 0;) out[2 * i] = out[2 * i + 1] = in[i];
    } else {
        for (size_t i = 0; i < frames; ++i) {
            out[i] = static_cast<int32_t>((static_cast<int64_t>(in[2 * i]) + in[2 * i + 1]) >> 1);
        }
    }
}

int32_t saturateToS32(double v) {
    const double scaled = v * 2147483648.0;
    if (scaled >= 2147483647.0) return INT32_MAX;
    if (scaled <= -2147483648.0) return INT32_MIN;
    return static_cast<int32_t>(scaled < 0 ? scaled - 0.5 : scaled + 0.5);
}

}  // namespace qnaudio
