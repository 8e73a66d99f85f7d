#include <media/stagefright/foundation/avc_utils.h>

#include <cstring>

#include <media/stagefright/foundation/CpuFeatures.h>

#if ME_X86_KERNELS
#include <immintrin.h>
#endif

namespace android {

namespace {

bool parseUEGraceful(ABitReader* br, uint32_t* out) {
    size_t zeros = 0;
    for (;;) {
        uint32_t bit;
        if (!br->getBitsGraceful(1, &bit)) return false;
        if (bit != 0) break;
        // 2^32 - 1 + b does not fit; such codes do not occur in valid streams.
        if (++zeros == 32) return false;
    }
    uint32_t suffix = 0;
    if (zeros > 0 && !br->getBitsGraceful(zeros, &suffix)) return false;
    *out = ((1u << zeros) - 1) + suffix;
    return true;
}

}  // namespace

unsigned parseUE(ABitReader* br) { return parseUEWithFallback(br, 0); }

unsigned parseUEWithFallback(ABitReader* br, unsigned fallback) {
    uint32_t value;
    return parseUEGraceful(br, &value) ? value : fallback;
}

int32_t parseSE(ABitReader* br) { return parseSEWithFallback(br, 0); }

int32_t parseSEWithFallback(ABitReader* br, int32_t fallback) {
    uint32_t code;
    if (!parseUEGraceful(br, &code)) return fallback;
    // 1, -1, 2, -2, ... for codes 1, 2, 3, 4, ...; the largest code (2^32 - 2)
    // maps to -(2^31 - 1), so the magnitude always fits.
    const int32_t magnitude = static_cast<int32_t>((code >> 1) + (code & 1));
    return (code & 1) ? magnitude : -magnitude;
}

void parseHEVCSPS(const uint8_t* payload, size_t size, HEVCSPSInfo* info) {
    NALBitReader br(payload, size);
    br.skipBits(4);  // sps_video_parameter_set_id
    info->maxSubLayersMinus1 = br.getBitsWithFallback(3, 0);
    info->temporalIdNesting = br.getBitsWithFallback(1, 0);
    for (uint8_t& b : info->profileTierLevel) b = static_cast<uint8_t>(br.getBitsWithFallback(8, 0));
    const uint32_t m = info->maxSubLayersMinus1;
    bool profilePresent[8] = {}, levelPresent[8] = {};
    if (m > 0) {
        for (uint32_t j = 0; j < m; ++j) {
            profilePresent[j] = br.getBitsWithFallback(1, 0) != 0;
            levelPresent[j] = br.getBitsWithFallback(1, 0) != 0;
        }
        br.skipBits(16 - 2 * m);  // reserved_zero_2bits up to eight sub-layers
        for (uint32_t j = 0; j < m; ++j) {
            if (profilePresent[j]) br.skipBits(88);
            if (levelPresent[j]) br.skipBits(8);
        }
    }
    parseUEWithFallback(&br, 0);  // sps_seq_parameter_set_id
    info->chromaFormatIdc = parseUEWithFallback(&br, 0);
    if ((info->chromaFormatIdc & 0xFF) == 3) br.skipBits(1);  // separate_colour_plane_flag
    info->width = parseUEWithFallback(&br, 0);
    info->height = parseUEWithFallback(&br, 0);
    info->conformanceWindow = br.getBitsWithFallback(1, 0) != 0;
    info->confLeft = info->confRight = info->confTop = info->confBottom = 0;
    if (info->conformanceWindow) {
        info->confLeft = parseUEWithFallback(&br, 0);
        info->confRight = parseUEWithFallback(&br, 0);
        info->confTop = parseUEWithFallback(&br, 0);
        info->confBottom = parseUEWithFallback(&br, 0);
    }
    info->bitDepthLumaMinus8 = parseUEWithFallback(&br, 0);
    info->bitDepthChromaMinus8 = parseUEWithFallback(&br, 0);
}

size_t findStartCodePrefixPortable(const uint8_t* data, size_t size) {
    if (size < 3) return size;
    // 0x01 is rare in coded slices, so looking for it first lets memchr do
    // almost all of the work.
    const uint8_t* p = data + 2;
    const uint8_t* const end = data + size;
    while (p < end) {
        p = static_cast<const uint8_t*>(memchr(p, 0x01, end - p));
        if (p == nullptr) return size;
        if (p[-1] == 0 && p[-2] == 0) return (p - 2) - data;
        ++p;
    }
    return size;
}

#if ME_X86_KERNELS
namespace {

// 32 positions at a time: bytes i, i+1 and i+2 compared at once. memchr
// hopping from one 0x01 to the next pays a call per 256 bytes of slice data.
ME_TARGET_AVX2 size_t findStartCodePrefixAvx2(const uint8_t* data, size_t size) {
    const __m256i zero = _mm256_setzero_si256();
    const __m256i one = _mm256_set1_epi8(1);
    size_t i = 0;
    for (; i + 34 <= size; i += 32) {
        const __m256i a = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(data + i));
        const __m256i b = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(data + i + 1));
        const __m256i c = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(data + i + 2));
        const __m256i hit = _mm256_and_si256(_mm256_and_si256(_mm256_cmpeq_epi8(a, zero), _mm256_cmpeq_epi8(b, zero)),
                                             _mm256_cmpeq_epi8(c, one));
        const uint32_t mask = static_cast<uint32_t>(_mm256_movemask_epi8(hit));
        if (mask != 0) return i + __builtin_ctz(mask);
    }
    const size_t rest = findStartCodePrefixPortable(data + i, size - i);
    return i + rest;
}

}  // namespace
#endif

size_t findStartCodePrefix(const uint8_t* data, size_t size) {
#if ME_X86_KERNELS
    if (cpuHasAvx2()) return findStartCodePrefixAvx2(data, size);
#endif
    return findStartCodePrefixPortable(data, size);
}

bool nextAnnexBUnit(const uint8_t** data, size_t* size, const uint8_t** unit, size_t* unitSize) {
    const uint8_t* p = *data;
    size_t n = *size;
    for (;;) {
        const size_t prefix = findStartCodePrefix(p, n);
        if (prefix == n) {
            *data = p + n;
            *size = 0;
            return false;
        }
        const size_t begin = prefix + 3;
        const size_t end = begin + findStartCodePrefix(p + begin, n - begin);
        size_t last = end;
        while (last > begin && p[last - 1] == 0) --last;
        const uint8_t* const found = p + begin;
        p += end;
        n -= end;
        if (last > begin) {
            *unit = found;
            *unitSize = last - begin;
            *data = p;
            *size = n;
            return true;
        }
    }
}

}  // namespace android
