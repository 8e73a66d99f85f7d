#include <media/stagefright/FLACCrc.h>

#include <cstring>

#include <media/stagefright/foundation/CpuFeatures.h>

#if ME_X86_KERNELS
#include <immintrin.h>
#endif

namespace android {

namespace {

constexpr uint16_t kPoly16 = 0x8005;
constexpr uint8_t kPoly8 = 0x07;
constexpr size_t kSlices = 16;

constexpr uint16_t step16(uint16_t crc) { return static_cast<uint16_t>((crc & 0x8000) ? (crc << 1) ^ kPoly16 : crc << 1); }
constexpr uint8_t step8(uint8_t crc) { return static_cast<uint8_t>((crc & 0x80) ? (crc << 1) ^ kPoly8 : crc << 1); }

// t[k][x]: the CRC-16 of byte x followed by k zero bytes; t[0] is the byte table.
struct Crc16Slices {
    uint16_t t[kSlices][256];
};
constexpr Crc16Slices makeCrc16Slices() {
    Crc16Slices s{};
    for (unsigned x = 0; x < 256; ++x) {
        uint16_t crc = static_cast<uint16_t>(x << 8);
        for (int bit = 0; bit < 8; ++bit) crc = step16(crc);
        s.t[0][x] = crc;
    }
    for (size_t k = 1; k < kSlices; ++k) {
        for (unsigned x = 0; x < 256; ++x) {
            const uint16_t prev = s.t[k - 1][x];
            s.t[k][x] = static_cast<uint16_t>((prev << 8) ^ s.t[0][prev >> 8]);
        }
    }
    return s;
}
constexpr Crc16Slices kCrc16 = makeCrc16Slices();

struct Crc8Table {
    uint8_t t[256];
};
constexpr Crc8Table makeCrc8Table() {
    Crc8Table table{};
    for (unsigned x = 0; x < 256; ++x) {
        uint8_t crc = static_cast<uint8_t>(x);
        for (int bit = 0; bit < 8; ++bit) crc = step8(crc);
        table.t[x] = crc;
    }
    return table;
}
constexpr Crc8Table kCrc8 = makeCrc8Table();

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "slice bytes are taken from little-endian words");

inline uint16_t byteStep(uint16_t crc, uint8_t byte) {
    return static_cast<uint16_t>((crc << 8) ^ kCrc16.t[0][(crc >> 8) ^ byte]);
}

inline uint16_t sliceStep(uint16_t crc, const uint8_t* p) {
    uint64_t w0, w1;
    memcpy(&w0, p, 8);
    memcpy(&w1, p + 8, 8);
    const auto& T = kCrc16.t;
    auto b = [](uint64_t w, int k) { return static_cast<unsigned>((w >> (8 * k)) & 0xFF); };
    return T[15][b(w0, 0) ^ (crc >> 8)] ^ T[14][b(w0, 1) ^ (crc & 0xFF)] ^ T[13][b(w0, 2)] ^ T[12][b(w0, 3)] ^
           T[11][b(w0, 4)] ^ T[10][b(w0, 5)] ^ T[9][b(w0, 6)] ^ T[8][b(w0, 7)] ^ T[7][b(w1, 0)] ^
           T[6][b(w1, 1)] ^ T[5][b(w1, 2)] ^ T[4][b(w1, 3)] ^ T[3][b(w1, 4)] ^ T[2][b(w1, 5)] ^ T[1][b(w1, 6)] ^
           T[0][b(w1, 7)];
}

uint16_t sliced(uint16_t crc, const uint8_t* p, size_t size) {
    for (; size >= kSlices; size -= kSlices, p += kSlices) crc = sliceStep(crc, p);
    for (; size > 0; --size) crc = byteStep(crc, *p++);
    return crc;
}

// Polynomial product modulo the CRC-16 generator.
constexpr uint16_t mulMod(uint16_t a, uint16_t b) {
    uint16_t r = 0;
    for (int i = 15; i >= 0; --i) {
        r = step16(r);
        if ((b >> i) & 1) r ^= a;
    }
    return r;
}
struct Crc16Powers {
    uint16_t t[64];  // x^(8 * 2^k) mod P
};
constexpr Crc16Powers makeCrc16Powers() {
    Crc16Powers p{};
    p.t[0] = 0x0100;
    for (int k = 1; k < 64; ++k) p.t[k] = mulMod(p.t[k - 1], p.t[k - 1]);
    return p;
}
constexpr Crc16Powers kPowers = makeCrc16Powers();

// The CRC of crc's message followed by n zero bytes.
uint16_t shiftCrc(uint16_t crc, uint64_t n) {
    uint16_t power = 1;
    for (int k = 0; n != 0; ++k, n >>= 1) {
        if (n & 1) power = mulMod(power, kPowers.t[k]);
    }
    return mulMod(crc, power);
}

// x^n mod P.
constexpr uint16_t xPowMod(unsigned n) {
    uint16_t r = 1;
    for (unsigned i = 0; i < n; ++i) r = step16(r);
    return r;
}

#if ME_X86_KERNELS
// Carry-less multiplication folds 16 bytes at a time: a 128-bit block X of
// the message, its first byte highest, counts as X(x) and is carried past
// the next 128 bits as Xhi * (x^192 mod P) + Xlo * (x^128 mod P), a product
// of at most 80 bits that stays congruent modulo P. The last fold is reduced
// by the table: the table CRC of the 16 bytes of A is A(x) * x^16 mod P.
constexpr uint64_t kFold192 = xPowMod(192);
constexpr uint64_t kFold128 = xPowMod(128);
// Four blocks in flight, each carried past the other three: 512 bits.
constexpr uint64_t kFold576 = xPowMod(576);
constexpr uint64_t kFold512 = xPowMod(512);

bool cpuHasClmul() {
    static const bool has = [] {
        __builtin_cpu_init();
        return __builtin_cpu_supports("pclmul") && __builtin_cpu_supports("ssse3");
    }();
    return has;
}

#define ME_TARGET_CLMUL __attribute__((target("pclmul,ssse3")))

// 16 message bytes, the first one highest.
ME_TARGET_CLMUL inline __m128i loadBlock(const uint8_t* at) {
    const __m128i reverse = _mm_set_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
    return _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(at)), reverse);
}

// x carried past the bits that `by` stands for, plus the next block.
ME_TARGET_CLMUL inline __m128i carry(__m128i x, __m128i by, __m128i next) {
    return _mm_xor_si128(_mm_xor_si128(_mm_clmulepi64_si128(x, by, 0x11), _mm_clmulepi64_si128(x, by, 0x00)), next);
}

ME_TARGET_CLMUL uint16_t folded(uint16_t crc, const uint8_t* p, size_t size) {
    const __m128i reverse = _mm_set_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
    const __m128i fold = _mm_set_epi64x(static_cast<long long>(kFold192), static_cast<long long>(kFold128));
    // The running CRC enters as the message's first two bytes: continuing
    // from crc over M is the CRC from 0 over M with crc added to its start.
    __m128i acc = _mm_xor_si128(loadBlock(p), _mm_slli_si128(_mm_cvtsi32_si128(crc), 14));
    if (size >= 128) {
        // Four independent runs hide the multiplier's latency.
        const __m128i fold4 = _mm_set_epi64x(static_cast<long long>(kFold576), static_cast<long long>(kFold512));
        __m128i a1 = loadBlock(p + 16), a2 = loadBlock(p + 32), a3 = loadBlock(p + 48);
        p += 64;
        size -= 64;
        for (; size >= 64; size -= 64, p += 64) {
            acc = carry(acc, fold4, loadBlock(p));
            a1 = carry(a1, fold4, loadBlock(p + 16));
            a2 = carry(a2, fold4, loadBlock(p + 32));
            a3 = carry(a3, fold4, loadBlock(p + 48));
        }
        acc = carry(carry(carry(acc, fold, a1), fold, a2), fold, a3);
    } else {
        p += 16;
        size -= 16;
    }
    for (; size >= 16; size -= 16, p += 16) acc = carry(acc, fold, loadBlock(p));
    alignas(16) uint8_t last[16];
    _mm_store_si128(reinterpret_cast<__m128i*>(last), _mm_shuffle_epi8(acc, reverse));
    return sliced(sliced(0, last, 16), p, size);
}
#endif

}  // namespace

uint16_t FLACCrc16Update(uint16_t crc, uint8_t byte) { return byteStep(crc, byte); }

uint16_t FLACCrc16Continue(uint16_t crc, const uint8_t* p, size_t size) {
#if ME_X86_KERNELS
    if (size >= 64 && cpuHasClmul()) return folded(crc, p, size);
#endif
    return FLACCrc16Table(crc, p, size);
}

uint16_t FLACCrc16Table(uint16_t crc, const uint8_t* p, size_t size) {
    // Two halves run as independent sums so that their look-ups overlap,
    // joined by crc(A B) = crc(A) * x^(8|B|) + crc(B) (no initial value or final XOR).
    const size_t half = (size / 2) & ~(kSlices - 1);
    if (half < 4 * kSlices) return sliced(crc, p, size);
    uint16_t a = crc, b = 0;
    for (size_t i = 0; i < half; i += kSlices) {
        a = sliceStep(a, p + i);
        b = sliceStep(b, p + half + i);
    }
    b = sliced(b, p + 2 * half, size - 2 * half);
    return static_cast<uint16_t>(shiftCrc(a, size - half) ^ b);
}

uint16_t FLACCrc16(const uint8_t* data, size_t size) { return FLACCrc16Continue(0, data, size); }

uint8_t FLACCrc8(const uint8_t* data, size_t size) {
    uint8_t crc = 0;
    for (size_t i = 0; i < size; ++i) crc = kCrc8.t[crc ^ data[i]];
    return crc;
}

uint16_t FLACCrc16Reference(const uint8_t* data, size_t size) {
    uint16_t crc = 0;
    for (size_t i = 0; i < size; ++i) {
        crc ^= static_cast<uint16_t>(data[i] << 8);
        for (int bit = 0; bit < 8; ++bit) crc = step16(crc);
    }
    return crc;
}

uint8_t FLACCrc8Reference(const uint8_t* data, size_t size) {
    uint8_t crc = 0;
    for (size_t i = 0; i < size; ++i) {
        crc ^= data[i];
        for (int bit = 0; bit < 8; ++bit) crc = step8(crc);
    }
    return crc;
}

}  // namespace android
