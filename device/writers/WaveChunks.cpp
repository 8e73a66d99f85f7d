#include "writers/WaveChunks.h"

#include <cstring>

namespace android {

namespace {

constexpr uint16_t kFormatPcm = 0x0001;
constexpr uint16_t kFormatExtensible = 0xFFFE;
// KSDATAFORMAT_SUBTYPE_PCM and _IEEE_FLOAT differ only in the first byte.
constexpr uint8_t kSubFormatTail[14] = {0x00, 0x00, 0x00, 0x00, 0x10, 0x00, 0x80,
                                        0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71};
constexpr uint16_t kSubFormatPcm = 0x0001;
constexpr uint16_t kSubFormatFloat = 0x0003;

void putLE16(std::vector<uint8_t>* out, uint16_t v) {
    out->push_back(uint8_t(v));
    out->push_back(uint8_t(v >> 8));
}

void putLE32(std::vector<uint8_t>* out, uint32_t v) {
    for (int i = 0; i < 4; ++i) out->push_back(uint8_t(v >> (8 * i)));
}

void putFourcc(std::vector<uint8_t>* out, const char* fourcc) { out->insert(out->end(), fourcc, fourcc + 4); }

// Speaker positions of the usual layouts; others are left unassigned.
uint32_t defaultChannelMask(int channels) {
    switch (channels) {
        case 1: return 0x4;    // front centre
        case 2: return 0x3;    // front left, right
        case 3: return 0x7;    // + front centre
        case 4: return 0x33;   // front and back pairs
        case 5: return 0x37;   // + front centre
        case 6: return 0x3F;   // 5.1
        case 7: return 0x70F;  // 6.1
        case 8: return 0x63F;  // 7.1
        default: return 0;
    }
}

}  // namespace

bool WaveChunks::needsExtensible(const PcmLayout& layout) {
    return layout.channels > 2 || layout.bitsPerSample > 16 || layout.isFloat();
}

WaveChunks::Header WaveChunks::buildHeader(const PcmLayout& layout) {
    Header h;
    std::vector<uint8_t>& b = h.bytes;
    const bool extensible = needsExtensible(layout);
    const uint16_t blockAlign = static_cast<uint16_t>(layout.frameBytes());
    putFourcc(&b, "RIFF");
    putLE32(&b, 0);
    putFourcc(&b, "WAVE");
    putFourcc(&b, "fmt ");
    putLE32(&b, extensible ? 40 : 16);
    putLE16(&b, extensible ? kFormatExtensible : kFormatPcm);
    putLE16(&b, static_cast<uint16_t>(layout.channels));
    putLE32(&b, static_cast<uint32_t>(layout.sampleRate));
    putLE32(&b, static_cast<uint32_t>(layout.sampleRate) * blockAlign);
    putLE16(&b, blockAlign);
    putLE16(&b, static_cast<uint16_t>(layout.bitsPerSample));
    if (extensible) {
        putLE16(&b, 22);
        putLE16(&b, static_cast<uint16_t>(layout.bitsPerSample));
        putLE32(&b, defaultChannelMask(layout.channels));
        putLE16(&b, layout.isFloat() ? kSubFormatFloat : kSubFormatPcm);
        b.insert(b.end(), kSubFormatTail, kSubFormatTail + sizeof(kSubFormatTail));
    }
    if (layout.isFloat()) {
        // Required for every format other than plain PCM: the frame count.
        putFourcc(&b, "fact");
        putLE32(&b, 4);
        h.factFramesOffset = b.size();
        putLE32(&b, 0);
    }
    putFourcc(&b, "data");
    h.dataSizeOffset = b.size();
    putLE32(&b, 0);
    return h;
}

uint64_t WaveChunks::maxDataBytes(size_t headerBytes, uint64_t trailerBytes, size_t frameBytes) {
    const uint64_t riffLimit = 0xFFFFFFFFull;
    // RIFF size = everything after its own 8 bytes, the data pad byte included.
    const uint64_t fixed = (headerBytes - 8) + trailerBytes + 1;
    if (fixed >= riffLimit || frameBytes == 0) return 0;
    const uint64_t room = riffLimit - fixed;
    return room - room % frameBytes;
}

void WaveChunks::appendChunk(std::vector<uint8_t>* out, const char* fourcc, const void* data, size_t size) {
    putFourcc(out, fourcc);
    putLE32(out, static_cast<uint32_t>(size));
    const uint8_t* p = static_cast<const uint8_t*>(data);
    out->insert(out->end(), p, p + size);
    if (size & 1) out->push_back(0);
}

}  // namespace android
