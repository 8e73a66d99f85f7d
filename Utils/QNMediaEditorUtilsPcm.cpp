// Packing 32-bit integer and float PCM into 24-bit packed PCM, in place.
#define LOG_TAG "QNMediaEditorUtils"
#include "QNMediaEditorUtils.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/CpuFeatures.h>

#if ME_X86_KERNELS
#include <immintrin.h>
#endif

#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {

#if defined(__BYTE_ORDER__) && __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
constexpr bool kLittleEndian = true;
#else
constexpr bool kLittleEndian = false;
#endif

// 1 - 2^-23, the largest float whose product with 2^23 still fits 24 bits
// after rounding.
constexpr float kLargestBelowOne = 0.99999988079071044921875f;

// Rounds x * 2^23 to nearest, halves away from zero, with clipping; NaN
// gives 0. Inside the clip range the product is exact and below 2^23, so
// its truncation and remainder are exact too: the same result as adding
// +-0.5 in double precision and truncating.
inline int32_t floatTo24(float x) {
    if (x <= -1.0f) return -8388608;
    if (x >= kLargestBelowOne) return 8388607;
    if (x != x) return 0;
    const float product = x * 8388608.0f;
    const int32_t whole = static_cast<int32_t>(product);
    const float rest = product - static_cast<float>(whole);
    return whole + (rest >= 0.5f) - (rest <= -0.5f);
}

// flag false: least significant byte first; true: most significant first.
inline void store24(uint8_t* out, uint32_t v, bool flag) {
    out[flag ? 2 : 0] = static_cast<uint8_t>(v);
    out[1] = static_cast<uint8_t>(v >> 8);
    out[flag ? 0 : 2] = static_cast<uint8_t>(v >> 16);
}

// Unaligned-safe loads: buffer ranges may start anywhere.
template <typename T>
inline T load(const T* p) {
    T v;
    memcpy(&v, p, sizeof(v));
    return v;
}

// Four 24-bit values (in the low bits of each) to 12 bytes, least
// significant byte first. Reads of the next group happen before this store,
// and the output never passes the input, so in-place packing is safe.
inline void store4x24(uint8_t* out, uint32_t a, uint32_t b, uint32_t c, uint32_t d) {
    const uint64_t lo = (uint64_t(a) & 0xFFFFFF) | (uint64_t(b & 0xFFFFFF) << 24) | (uint64_t(c & 0xFFFF) << 48);
    const uint32_t hi = ((c >> 16) & 0xFF) | (d << 8);
    memcpy(out, &lo, 8);
    memcpy(out + 8, &hi, 4);
}

#if ME_X86_KERNELS
// Eight samples at a time: all 32 input bytes are loaded before the 24
// output bytes are stored, so in-place packing is safe. Each 128-bit lane
// holds 12 packed bytes and 4 spare ones. While another group follows, the
// lanes are stored as 16 bytes each and the next group overwrites the 4
// spare bytes (which land before any unread input); the last group stores
// exactly 24 bytes so that nothing is written past the output.
ME_TARGET_AVX2 inline void store24Overlapping(uint8_t* out, __m256i packed) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out), _mm256_castsi256_si128(packed));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 12), _mm256_extracti128_si256(packed, 1));
}

ME_TARGET_AVX2 inline void store24Exact(uint8_t* out, __m256i packed) {
    alignas(32) uint8_t lanes[32];
    _mm256_store_si256(reinterpret_cast<__m256i*>(lanes), packed);
    memcpy(out, lanes, 12);
    memcpy(out + 12, lanes + 16, 12);
}

// Per 128-bit lane: bytes 0-2 of each 32-bit value, or bytes 1-3.
ME_TARGET_AVX2 inline __m256i laneShuffle(int first) {
    const char f = static_cast<char>(first);
    return _mm256_setr_epi8(f, f + 1, f + 2, f + 4, f + 5, f + 6, f + 8, f + 9, f + 10, f + 12, f + 13, f + 14, -1, -1,
                            -1, -1, f, f + 1, f + 2, f + 4, f + 5, f + 6, f + 8, f + 9, f + 10, f + 12, f + 13, f + 14,
                            -1, -1, -1, -1);
}

// floatTo24 on eight lanes. NaN is zeroed and the clip done by clamping the
// input: -1 and 1 - 2^-23 scale exactly to the two limits.
ME_TARGET_AVX2 inline __m256i floatsTo24(const float* in) {
    const __m256 x = _mm256_loadu_ps(in);
    const __m256 clean = _mm256_and_ps(x, _mm256_cmp_ps(x, x, _CMP_ORD_Q));
    const __m256 clamped =
        _mm256_max_ps(_mm256_min_ps(clean, _mm256_set1_ps(kLargestBelowOne)), _mm256_set1_ps(-1.0f));
    const __m256 product = _mm256_mul_ps(clamped, _mm256_set1_ps(8388608.0f));
    const __m256i whole = _mm256_cvttps_epi32(product);
    const __m256 rest = _mm256_sub_ps(product, _mm256_cvtepi32_ps(whole));
    // Compare masks are -1 where true.
    const __m256i up = _mm256_castps_si256(_mm256_cmp_ps(rest, _mm256_set1_ps(0.5f), _CMP_GE_OQ));
    const __m256i down = _mm256_castps_si256(_mm256_cmp_ps(rest, _mm256_set1_ps(-0.5f), _CMP_LE_OQ));
    return _mm256_add_epi32(_mm256_sub_epi32(whole, up), down);
}

ME_TARGET_AVX2 int packFloatsAvx2(const float* in, uint8_t* out, int count) {
    const __m256i shuffle = laneShuffle(0);
    int i = 0;
    for (; i + 16 <= count; i += 8) store24Overlapping(out + 3 * i, _mm256_shuffle_epi8(floatsTo24(in + i), shuffle));
    for (; i + 8 <= count; i += 8) store24Exact(out + 3 * i, _mm256_shuffle_epi8(floatsTo24(in + i), shuffle));
    return i;
}

ME_TARGET_AVX2 inline __m256i load8(const uint32_t* in) {
    return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(in));
}

ME_TARGET_AVX2 int packWordsAvx2(const uint32_t* in, uint8_t* out, int count) {
    const __m256i shuffle = laneShuffle(1);
    int i = 0;
    for (; i + 16 <= count; i += 8) store24Overlapping(out + 3 * i, _mm256_shuffle_epi8(load8(in + i), shuffle));
    for (; i + 8 <= count; i += 8) store24Exact(out + 3 * i, _mm256_shuffle_epi8(load8(in + i), shuffle));
    return i;
}
#endif

}  // namespace

// The portable fast paths, four samples per step; outside the anonymous
// namespace so that tests can hold them against the plain definition on
// machines that would otherwise take the vector kernels.
namespace detail {

int packFloatsPortable(const float* in, uint8_t* out, int count) {
    int i = 0;
    for (; i + 4 <= count; i += 4) {
        const int32_t a = floatTo24(load(in + i)), b = floatTo24(load(in + i + 1));
        const int32_t c = floatTo24(load(in + i + 2)), d = floatTo24(load(in + i + 3));
        store4x24(out + 3 * i, a, b, c, d);
    }
    return i;
}

int packWordsPortable(const uint32_t* in, uint8_t* out, int count) {
    int i = 0;
    for (; i + 4 <= count; i += 4) {
        const uint32_t a = load(in + i), b = load(in + i + 1), c = load(in + i + 2), d = load(in + i + 3);
        store4x24(out + 3 * i, a >> 8, b >> 8, c >> 8, d >> 8);
    }
    return i;
}

}  // namespace detail

namespace {

int packFloatsFast(const float* in, uint8_t* out, int count) {
#if ME_X86_KERNELS
    if (cpuHasAvx2()) return packFloatsAvx2(in, out, count);
#endif
    return detail::packFloatsPortable(in, out, count);
}

int packWordsFast(const uint32_t* in, uint8_t* out, int count) {
#if ME_X86_KERNELS
    if (cpuHasAvx2()) return packWordsAvx2(in, out, count);
#endif
    return detail::packWordsPortable(in, out, count);
}

template <typename Buffer>
status_t packInPlace(Buffer* buffer, int encoding) {
    if (encoding != kEditorAudioEncodingPcm32bit && encoding != kEditorAudioEncodingPcmFloat) {
        ALOGW("not support type %d", encoding);
        return ERROR_UNSUPPORTED;
    }
    if (buffer == nullptr) return ERROR_UNSUPPORTED;
    uint8_t* const base = buffer->base();
    uint8_t* const data = buffer->data();
    const size_t samples = buffer->size() / 4;
    buffer->setRange(0, 3 * samples);
    // The packed bytes go where the new range starts, the start of the
    // memory, even when the old range began further in; the output then
    // still never passes the input.
    constexpr size_t kChunk = size_t(1) << 28;  // the overloads count in int
    for (size_t done = 0; done < samples;) {
        const size_t chunk = samples - done < kChunk ? samples - done : kChunk;
        uint8_t* in = data + 4 * done;
        uint8_t* out = base + 3 * done;
        if (encoding == kEditorAudioEncodingPcmFloat) {
            QNMediaEditorUtils::ConvertXto24packed(reinterpret_cast<float*>(in), out, static_cast<int>(chunk), false);
        } else {
            QNMediaEditorUtils::ConvertXto24packed(reinterpret_cast<unsigned int*>(in), out,
                                                   static_cast<int>(chunk), false);
        }
        done += chunk;
    }
    return OK;
}

}  // namespace

status_t QNMediaEditorUtils::ConvertXto24packed(float* in, uint8_t* out, int count, bool flag) {
    if (count <= 0 || in == nullptr || out == nullptr) return OK;
    int i = 0;
    if (!flag && kLittleEndian) i = packFloatsFast(in, out, count);
    for (; i < count; ++i) store24(out + 3 * i, static_cast<uint32_t>(floatTo24(load(in + i))), flag);
    return OK;
}

status_t QNMediaEditorUtils::ConvertXto24packed(unsigned int* in, uint8_t* out, int count, bool flag) {
    if (count <= 0 || in == nullptr || out == nullptr) return OK;
    int i = 0;
    if (!flag && kLittleEndian) i = packWordsFast(in, out, count);
    for (; i < count; ++i) store24(out + 3 * i, load(in + i) >> 8, flag);
    return OK;
}

status_t QNMediaEditorUtils::ConvertXto24packed(const sp<ABuffer>& buffer, int encoding) {
    return packInPlace(buffer.get(), encoding);
}

status_t QNMediaEditorUtils::ConvertXto24packed(const sp<MediaCodecBuffer>& buffer, int encoding) {
    return packInPlace(buffer.get(), encoding);
}

bool QNMediaEditorUtils::IsNeedConvert32To24(sp<MetaData>& meta, int* pcmType) {
    if (pcmType == nullptr) {
        ALOGD("pcm type is null");
        return false;
    }
    int32_t bits = 0, encoding = 0;
    if (meta == nullptr || !meta->findInt32(kEditorKeyBitsPerSample, &bits) || bits != 32) return false;
    if (!meta->findInt32(kEditorKeyPcmEncoding, &encoding) ||
        (encoding != kEditorAudioEncodingPcmFloat && encoding != kEditorAudioEncodingPcm32bit)) {
        return false;
    }
    ALOGD("pcmencoding %d", encoding);
    meta->setInt32(kEditorKeyPcmEncoding, kEditorAudioEncodingPcm24bitPacked);
    meta->setInt32(kEditorKeySampleBits, 24);
    meta->setInt32(kEditorKeyBitsPerSample, 24);
    *pcmType = encoding;
    return true;
}

}  // namespace qnmediaeditor
}  // namespace android
