#include "flac/FLACCrc.h"

namespace android {

namespace {

struct Tables {
    uint16_t crc16[256];
    Tables() {
        for (unsigned i = 0; i < 256; ++i) {
            unsigned c16 = i << 8;
            for (int bit = 0; bit < 8; ++bit) c16 = (c16 & 0x8000) ? ((c16 << 1) ^ 0x8005) : (c16 << 1);
            crc16[i] = static_cast<uint16_t>(c16);
        }
    }
};

const Tables& tables() {
    static const Tables t;
    return t;
}

}  // namespace

uint16_t FLACCrc16Update(uint16_t crc, uint8_t byte) {
    return static_cast<uint16_t>((crc << 8) ^ tables().crc16[(crc >> 8) ^ byte]);
}

uint16_t FLACCrc16(const uint8_t* data, size_t size) {
    const Tables& t = tables();
    uint16_t crc = 0;
    for (size_t i = 0; i < size; ++i) crc = static_cast<uint16_t>((crc << 8) ^ t.crc16[(crc >> 8) ^ data[i]]);
    return crc;
}

}  // namespace android
