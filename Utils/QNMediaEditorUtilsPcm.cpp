// Packing 32-bit integer and float PCM into 24-bit packed PCM, in place.
#define LOG_TAG "QNMediaEditorUtils"
#include "QNMediaEditorUtils.h"

#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

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

int packFloatsFast(const float* in, uint8_t* out, int count) {
    int i = 0;
#if defined(__SSE2__)
    const __m128 scale = _mm_set1_ps(8388608.0f);
    const __m128 half = _mm_set1_ps(0.5f);
    const __m128 minusHalf = _mm_set1_ps(-0.5f);
    const __m128 minusOne = _mm_set1_ps(-1.0f);
    const __m128 top = _mm_set1_ps(kLargestBelowOne);
    const __m128i lowest = _mm_set1_epi32(-8388608);
    const __m128i highest = _mm_set1_epi32(8388607);
    alignas(16) int32_t v[4];
    for (; i + 4 <= count; i += 4) {
        const __m128 x = _mm_loadu_ps(in + i);
        const __m128 product = _mm_mul_ps(x, scale);
        __m128i whole = _mm_cvttps_epi32(product);
        const __m128 rest = _mm_sub_ps(product, _mm_cvtepi32_ps(whole));
        // Compare masks are -1 where true.
        whole = _mm_sub_epi32(whole, _mm_castps_si128(_mm_cmpge_ps(rest, half)));
        whole = _mm_add_epi32(whole, _mm_castps_si128(_mm_cmple_ps(rest, minusHalf)));
        const __m128i low = _mm_castps_si128(_mm_cmple_ps(x, minusOne));
        whole = _mm_or_si128(_mm_and_si128(low, lowest), _mm_andnot_si128(low, whole));
        const __m128i high = _mm_castps_si128(_mm_cmpge_ps(x, top));
        whole = _mm_or_si128(_mm_and_si128(high, highest), _mm_andnot_si128(high, whole));
        whole = _mm_andnot_si128(_mm_castps_si128(_mm_cmpunord_ps(x, x)), whole);
        _mm_store_si128(reinterpret_cast<__m128i*>(v), whole);
        store4x24(out + 3 * i, v[0], v[1], v[2], v[3]);
    }
#else
    for (; i + 4 <= count; i += 4) {
        const int32_t a = floatTo24(load(in + i)), b = floatTo24(load(in + i + 1));
        const int32_t c = floatTo24(load(in + i + 2)), d = floatTo24(load(in + i + 3));
        store4x24(out + 3 * i, a, b, c, d);
    }
#endif
    return i;
}

int packWordsFast(const uint32_t* in, uint8_t* out, int count) {
    int i = 0;
    for (; i + 4 <= count; i += 4) {
        uint64_t ab, cd;
        memcpy(&ab, in + i, 8);
        memcpy(&cd, in + i + 2, 8);
        // The top 24 bits of each word: bits 8-31 of a, 40-63 of ab, and so on.
        const uint64_t lo = ((ab >> 8) & 0xFFFFFF) | ((ab >> 40) << 24) | (((cd >> 8) & 0xFFFF) << 48);
        const uint32_t hi = static_cast<uint32_t>(((cd >> 24) & 0xFF) | ((cd >> 40) << 8));
        memcpy(out + 3 * i, &lo, 8);
        memcpy(out + 3 * i + 8, &hi, 4);
    }
    return i;
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
