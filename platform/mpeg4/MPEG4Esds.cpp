#include "mpeg4/MPEG4Esds.h"

namespace android {
namespace mpeg4 {

namespace {

constexpr uint8_t kESDescrTag = 0x03;
constexpr uint8_t kDecoderConfigDescrTag = 0x04;
constexpr uint8_t kDecSpecificInfoTag = 0x05;

// One descriptor: tag and expandable size (up to four 7-bit groups).
bool ReadDescriptor(ByteReader* r, uint8_t* tag, ByteReader* body) {
    if (!r->u8(tag)) return false;
    uint32_t size = 0;
    for (int i = 0; i < 4; ++i) {
        uint8_t b;
        if (!r->u8(&b)) return false;
        size = (size << 7) | (b & 0x7F);
        if (!(b & 0x80)) return r->sub(size, body);
    }
    return false;
}

bool FindDescriptor(ByteReader r, uint8_t wanted, ByteReader* body) {
    uint8_t tag;
    while (ReadDescriptor(&r, &tag, body)) {
        if (tag == wanted) return true;
    }
    return false;
}

class BitCursor {
public:
    BitCursor(const uint8_t* data, size_t size) : mData(data), mBits(size * 8) {}
    bool read(int n, uint32_t* v) {
        if (mPos + n > mBits) return false;
        uint32_t x = 0;
        for (int i = 0; i < n; ++i, ++mPos) x = (x << 1) | ((mData[mPos / 8] >> (7 - mPos % 8)) & 1);
        *v = x;
        return true;
    }

private:
    const uint8_t* mData;
    size_t mBits;
    size_t mPos = 0;
};

bool ReadSampleRate(BitCursor* bits, int32_t* rate) {
    static const int32_t kRates[] = {96000, 88200, 64000, 48000, 44100, 32000, 24000,
                                     22050, 16000, 12000, 11025, 8000,  7350};
    uint32_t index;
    if (!bits->read(4, &index)) return false;
    if (index == 0xF) {
        uint32_t explicitRate;
        if (!bits->read(24, &explicitRate)) return false;
        *rate = static_cast<int32_t>(explicitRate);
        return true;
    }
    if (index >= sizeof(kRates) / sizeof(kRates[0])) return false;
    *rate = kRates[index];
    return true;
}

}  // namespace

bool ParseEsds(ByteReader r, EsdsInfo* info) {
    uint8_t tag;
    ByteReader es(nullptr, 0);
    if (!ReadDescriptor(&r, &tag, &es) || tag != kESDescrTag) return false;
    uint16_t esId;
    uint8_t flags;
    if (!es.be16(&esId) || !es.u8(&flags)) return false;
    if ((flags & 0x80) && !es.skip(2)) return false;  // dependsOn_ES_ID
    if (flags & 0x40) {                                // URL
        uint8_t urlLength;
        if (!es.u8(&urlLength) || !es.skip(urlLength)) return false;
    }
    if ((flags & 0x20) && !es.skip(2)) return false;  // OCR_ES_Id

    ByteReader config(nullptr, 0);
    if (!FindDescriptor(es, kDecoderConfigDescrTag, &config)) return false;
    uint8_t streamType;
    uint32_t bufferSize;
    if (!config.u8(&info->objectType) || !config.u8(&streamType) || !config.be24(&bufferSize) ||
        !config.be32(&info->maxBitrate) || !config.be32(&info->avgBitrate)) {
        return false;
    }
    ByteReader specific(nullptr, 0);
    if (FindDescriptor(config, kDecSpecificInfoTag, &specific)) {
        info->specificInfo = specific.current();
        info->specificInfoSize = specific.size();
    }
    return true;
}

bool ParseAudioSpecificConfig(const uint8_t* data, size_t size, int32_t* objectType, int32_t* sampleRate,
                              int32_t* channels) {
    BitCursor bits(data, size);
    uint32_t aot, channelConfig;
    if (!bits.read(5, &aot)) return false;
    if (aot == 31) {
        uint32_t extension;
        if (!bits.read(6, &extension)) return false;
        aot = 32 + extension;
    }
    if (!ReadSampleRate(&bits, sampleRate) || !bits.read(4, &channelConfig)) return false;
    // Explicit SBR/PS signalling: the output runs at the extension rate.
    if (aot == 5 || aot == 29) {
        int32_t extensionRate;
        if (ReadSampleRate(&bits, &extensionRate)) *sampleRate = extensionRate;
    }
    static const int32_t kChannels[] = {0, 1, 2, 3, 4, 5, 6, 8};
    *objectType = static_cast<int32_t>(aot);
    *channels = channelConfig < 8 ? kChannels[channelConfig] : 0;
    return true;
}

}  // namespace mpeg4
}  // namespace android
