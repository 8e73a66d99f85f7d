#ifndef PLATFORM_WAV_G711_H_
#define PLATFORM_WAV_G711_H_

#include <cstddef>
#include <cstdint>

namespace android {

// ITU-T G.711 expansion to 16-bit linear PCM, exactly as the tables of the
// recommendation give it (A-law: 13 significant bits, mu-law: 14).
int16_t ALawToLinear(uint8_t code);
int16_t MuLawToLinear(uint8_t code);

// Expands `count` codes at `in` to 16-bit samples at `out` (host order). The
// input may sit in the upper half of the output: each code is read before
// the sample written over it.
void ExpandG711(bool aLaw, const uint8_t* in, int16_t* out, size_t count);

}  // namespace android

#endif
