#include "wav/G711.h"

#include <array>

namespace android {

namespace {

// G.711 table 1 (A-law): even bits are inverted on the line; the sign bit
// set means positive. Decision values sit halfway inside each step.
constexpr int16_t DecodeALaw(uint8_t code) {
    const int a = code ^ 0x55;
    const int exponent = (a >> 4) & 7;
    const int mantissa = a & 0x0F;
    int magnitude = (mantissa << 4) + 8;
    if (exponent > 0) magnitude = (magnitude + 0x100) << (exponent - 1);
    return static_cast<int16_t>((a & 0x80) ? magnitude : -magnitude);
}

// G.711 table 2 (mu-law): all bits inverted on the line; the sign bit set
// means negative; segments are offset by the bias of 33 (132 here, scaled).
constexpr int16_t DecodeMuLaw(uint8_t code) {
    const int u = ~code & 0xFF;
    const int exponent = (u >> 4) & 7;
    const int mantissa = u & 0x0F;
    const int magnitude = (((mantissa << 3) + 0x84) << exponent) - 0x84;
    return static_cast<int16_t>((u & 0x80) ? -magnitude : magnitude);
}

struct Tables {
    std::array<int16_t, 256> aLaw{};
    std::array<int16_t, 256> muLaw{};
};

constexpr Tables MakeTables() {
    Tables t;
    for (int i = 0; i < 256; ++i) {
        t.aLaw[i] = DecodeALaw(static_cast<uint8_t>(i));
        t.muLaw[i] = DecodeMuLaw(static_cast<uint8_t>(i));
    }
    return t;
}

constexpr Tables kTables = MakeTables();

}  // namespace

int16_t ALawToLinear(uint8_t code) { return kTables.aLaw[code]; }
int16_t MuLawToLinear(uint8_t code) { return kTables.muLaw[code]; }

void ExpandG711(bool aLaw, const uint8_t* in, int16_t* out, size_t count) {
    const std::array<int16_t, 256>& table = aLaw ? kTables.aLaw : kTables.muLaw;
    for (size_t i = 0; i < count; ++i) out[i] = table[in[i]];
}

}  // namespace android
