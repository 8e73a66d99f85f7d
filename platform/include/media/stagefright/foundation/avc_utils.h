#ifndef AVC_UTILS_H_
#define AVC_UTILS_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/foundation/ABitReader.h>

namespace android {

// Exp-Golomb codes, ITU-T H.264 clause 9.1. A code whose leading zeros run
// to 32 or past the end of the data is not a value: parseUE then gives 0 and
// the ...WithFallback forms their fallback. The reader is left at the end of
// the data when it ran out, so later reads fail the same way.
unsigned parseUE(ABitReader* br);
unsigned parseUEWithFallback(ABitReader* br, unsigned fallback);
int32_t parseSE(ABitReader* br);
int32_t parseSEWithFallback(ABitReader* br, int32_t fallback);

// The leading fields of an HEVC sequence parameter set (ITU-T H.265
// 7.3.2.2) up to the bit depths. Reads past the end give 0.
struct HEVCSPSInfo {
    uint8_t profileTierLevel[12];  // general profile, tier, flags and level_idc
    uint32_t maxSubLayersMinus1;
    uint32_t temporalIdNesting;
    uint32_t chromaFormatIdc;
    uint32_t width;  // pic_width_in_luma_samples
    uint32_t height;
    bool conformanceWindow;
    uint32_t confLeft, confRight, confTop, confBottom;
    uint32_t bitDepthLumaMinus8;
    uint32_t bitDepthChromaMinus8;
};
// payload: the unit after its two header bytes, emulation prevention included.
void parseHEVCSPS(const uint8_t* payload, size_t size, HEVCSPSInfo* info);

// Offset of the first 00 00 01 in data[0, size), or size when there is none.
// Uses vector instructions where the machine has them; the portable form
// gives the same answers everywhere.
size_t findStartCodePrefix(const uint8_t* data, size_t size);
size_t findStartCodePrefixPortable(const uint8_t* data, size_t size);

// Splits an Annex-B stream: on true *unit/*unitSize hold the next NAL unit
// (trailing zero bytes dropped) and *data/*size move past it. False when no
// unit remains. Bytes before the first start code are skipped.
bool nextAnnexBUnit(const uint8_t** data, size_t* size, const uint8_t** unit, size_t* unitSize);

}  // namespace android

#endif
