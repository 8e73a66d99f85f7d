#include "flac/FlacFrameHeader.h"

#include <media/stagefright/FLACCrc.h>

namespace android {

namespace {

constexpr uint32_t kSampleRates[12] = {0, 88200, 176400, 192000, 8000, 16000,
                                       22050, 24000, 32000, 44100, 48000, 96000};
// Sample size code 3 is reserved.
constexpr int kSampleBits[8] = {0, 8, 12, -1, 16, 20, 24, 32};

// The UTF-8-like coded number: up to 6 bytes for frame numbers (31 bits),
// 7 for sample numbers (36 bits).
bool readCodedNumber(const uint8_t* p, size_t size, bool allow36, uint64_t* value, size_t* length) {
    if (size == 0) return false;
    const uint8_t lead = p[0];
    size_t extra;
    uint64_t v;
    if (lead < 0x80) {
        extra = 0;
        v = lead;
    } else if ((lead & 0xE0) == 0xC0) {
        extra = 1;
        v = lead & 0x1F;
    } else if ((lead & 0xF0) == 0xE0) {
        extra = 2;
        v = lead & 0x0F;
    } else if ((lead & 0xF8) == 0xF0) {
        extra = 3;
        v = lead & 0x07;
    } else if ((lead & 0xFC) == 0xF8) {
        extra = 4;
        v = lead & 0x03;
    } else if ((lead & 0xFE) == 0xFC) {
        extra = 5;
        v = lead & 0x01;
    } else if (lead == 0xFE && allow36) {
        extra = 6;
        v = 0;
    } else {
        return false;
    }
    if (extra + 1 > size) return false;
    for (size_t i = 1; i <= extra; ++i) {
        if ((p[i] & 0xC0) != 0x80) return false;
        v = (v << 6) | (p[i] & 0x3F);
    }
    *value = v;
    *length = extra + 1;
    return true;
}

}  // namespace

uint8_t flacCrc8(const uint8_t* data, size_t size) { return FLACCrc8(data, size); }

bool FlacFrameHeader::parse(const uint8_t* p, size_t size, FlacFrameHeader* out) {
    // Sync code 0b11111111111110, a reserved 0 bit, the blocking strategy.
    if (size < 6 || p[0] != 0xFF || (p[1] & 0xFE) != 0xF8) return false;
    FlacFrameHeader h;
    h.variableBlockSize = (p[1] & 1) != 0;
    const unsigned blockCode = p[2] >> 4, rateCode = p[2] & 0x0F;
    const unsigned channelCode = p[3] >> 4, sizeCode = (p[3] >> 1) & 0x07;
    if (blockCode == 0 || rateCode == 15 || channelCode > 10 || kSampleBits[sizeCode] < 0 || (p[3] & 1) != 0) {
        return false;
    }
    size_t numberBytes;
    if (!readCodedNumber(p + 4, size - 4, h.variableBlockSize, &h.number, &numberBytes)) return false;
    size_t pos = 4 + numberBytes;

    const size_t blockTrailer = blockCode == 6 ? 1 : blockCode == 7 ? 2 : 0;
    const size_t rateTrailer = rateCode == 12 ? 1 : (rateCode == 13 || rateCode == 14) ? 2 : 0;
    if (pos + blockTrailer + rateTrailer + 1 > size) return false;
    if (blockCode == 1) {
        h.blockSize = 192;
    } else if (blockCode <= 5) {
        h.blockSize = 576u << (blockCode - 2);
    } else if (blockCode == 6) {
        h.blockSize = p[pos] + 1u;
    } else if (blockCode == 7) {
        h.blockSize = ((uint32_t(p[pos]) << 8) | p[pos + 1]) + 1u;
    } else {
        h.blockSize = 256u << (blockCode - 8);
    }
    pos += blockTrailer;
    if (rateCode < 12) {
        h.sampleRate = kSampleRates[rateCode];
    } else if (rateCode == 12) {
        h.sampleRate = p[pos] * 1000u;
    } else {
        const uint32_t v = (uint32_t(p[pos]) << 8) | p[pos + 1];
        h.sampleRate = rateCode == 13 ? v : v * 10u;
    }
    pos += rateTrailer;
    h.channels = channelCode < 8 ? channelCode + 1 : 2;
    h.bitsPerSample = static_cast<uint32_t>(kSampleBits[sizeCode]);
    if (flacCrc8(p, pos) != p[pos]) return false;
    h.headerBytes = pos + 1;
    *out = h;
    return true;
}

}  // namespace android
