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

// Offset of the first 00 00 01 in data[0, size), or size when there is none.
size_t findStartCodePrefix(const uint8_t* data, size_t size);

// Splits an Annex-B stream: on true *unit/*unitSize hold the next NAL unit
// (trailing zero bytes dropped) and *data/*size move past it. False when no
// unit remains. Bytes before the first start code are skipped.
bool nextAnnexBUnit(const uint8_t** data, size_t* size, const uint8_t** unit, size_t* unitSize);

}  // namespace android

#endif
