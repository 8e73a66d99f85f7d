#include <gtest/gtest.h>

#include <media/stagefright/foundation/ABitReader.h>
#include <media/stagefright/foundation/avc_utils.h>

#include <random>
#include <vector>

using namespace android;

TEST(BitReaderTest, ReadsMostSignificantBitFirstAcrossBytes) {
    const uint8_t bytes[] = {0xA5, 0x0F, 0xF0, 0x12, 0x34};
    ABitReader br(bytes, sizeof(bytes));
    EXPECT_EQ(0u, br.getBits(0));
    EXPECT_EQ(1u, br.getBits(1));
    EXPECT_EQ(0x25u, br.getBits(7));
    EXPECT_EQ(0x0FF0u, br.getBits(16));
    EXPECT_EQ(bytes + 3, br.data());
    EXPECT_EQ(16u, br.numBitsLeft());
    EXPECT_EQ(1u, br.getBits(4));
    EXPECT_EQ(bytes + 3, br.data());  // the partly read byte
    EXPECT_EQ(0x234u, br.getBits(12));
    EXPECT_EQ(0u, br.numBitsLeft());
    EXPECT_FALSE(br.overRead());

    ABitReader whole(bytes, sizeof(bytes));
    whole.skipBits(8);
    EXPECT_EQ(0x0FF01234u, whole.getBits(32));
}

TEST(BitReaderTest, ReadsPastTheEndStopThereWithoutAborting) {
    const uint8_t bytes[] = {0xFF};
    ABitReader br(bytes, 1);
    EXPECT_EQ(0x7F8u, br.getBits(11));  // 8 real bits, then 3 zero bits
    EXPECT_TRUE(br.overRead());
    EXPECT_EQ(0u, br.numBitsLeft());
    EXPECT_EQ(0u, br.getBits(32));

    ABitReader graceful(bytes, 1);
    uint32_t out = 99;
    EXPECT_FALSE(graceful.getBitsGraceful(9, &out));
    EXPECT_EQ(99u, out);
    EXPECT_EQ(7u, graceful.getBitsWithFallback(1, 7));  // the short read used the data up

    ABitReader skipping(bytes, 1);
    EXPECT_TRUE(skipping.skipBits(3));
    EXPECT_FALSE(skipping.skipBits(100));
    EXPECT_EQ(0u, skipping.numBitsLeft());
    EXPECT_EQ(5u, skipping.getBitsWithFallback(1, 5));

    ABitReader wide(bytes, 1);
    EXPECT_FALSE(wide.getBitsGraceful(33, &out));
    EXPECT_EQ(8u, wide.numBitsLeft());  // refused without reading

    ABitReader empty(nullptr, 10);
    EXPECT_EQ(0u, empty.numBitsLeft());
    EXPECT_EQ(4u, empty.getBitsWithFallback(2, 4));
}

TEST(BitReaderTest, NalReaderDropsEmulationPreventionBytes) {
    // 00 00 03 01: the 03 is dropped; 00 00 03 03 drops only the first 03
    // (the zero run starts again); a 03 after a single zero stays.
    const uint8_t bytes[] = {0x00, 0x00, 0x03, 0x01, 0x00, 0x00, 0x03, 0x03, 0x00, 0x03};
    NALBitReader nal(bytes, sizeof(bytes));
    EXPECT_TRUE(nal.atLeastNumBitsLeft(64));
    EXPECT_FALSE(nal.atLeastNumBitsLeft(65));
    EXPECT_EQ(64u, nal.numBitsLeft());
    EXPECT_EQ(0x000001u, nal.getBits(24));
    EXPECT_EQ(0x0000u, nal.getBits(16));
    EXPECT_EQ(24u, nal.numBitsLeft());
    EXPECT_EQ(0x030003u, nal.getBits(24));
    EXPECT_EQ(0u, nal.numBitsLeft());

    ABitReader plain(bytes, sizeof(bytes));
    EXPECT_EQ(80u, plain.numBitsLeft());
    EXPECT_EQ(0x000003u, plain.getBits(24));

    // Skipping counts payload bits, not input bytes.
    NALBitReader skipping(bytes, sizeof(bytes));
    EXPECT_TRUE(skipping.skipBits(24));
    EXPECT_EQ(0u, skipping.getBits(16));
}

TEST(ExpGolombTest, DecodesCodesAndSignedMapping) {
    // ue: 1 -> 0, 010 -> 1, 011 -> 2, 00100 -> 3, 0001000 -> 7
    // bits: 1 010 011 00100 0001000 = 1010 0110 0100 0001 000(0 pad)
    const uint8_t bytes[] = {0xA6, 0x41, 0x00};
    ABitReader br(bytes, sizeof(bytes));
    EXPECT_EQ(0u, parseUE(&br));
    EXPECT_EQ(1u, parseUE(&br));
    EXPECT_EQ(2u, parseUE(&br));
    EXPECT_EQ(3u, parseUE(&br));
    EXPECT_EQ(7u, parseUE(&br));

    ABitReader se(bytes, sizeof(bytes));
    EXPECT_EQ(0, parseSEWithFallback(&se, 9));
    EXPECT_EQ(1, parseSEWithFallback(&se, 9));
    EXPECT_EQ(-1, parseSEWithFallback(&se, 9));
    EXPECT_EQ(2, parseSEWithFallback(&se, 9));
    EXPECT_EQ(4, parseSEWithFallback(&se, 9));
}

TEST(ExpGolombTest, TruncatedOrOverlongCodesEndWithTheFallback) {
    const uint8_t zeros[8] = {};
    ABitReader br(zeros, sizeof(zeros));
    EXPECT_EQ(0u, parseUE(&br));  // 32 leading zeros: no value, terminates
    ABitReader fallback(zeros, 3);
    EXPECT_EQ(77u, parseUEWithFallback(&fallback, 77));
    EXPECT_EQ(0u, fallback.numBitsLeft());
    EXPECT_EQ(-5, parseSEWithFallback(&fallback, -5));

    // Prefix complete, suffix cut: 8 zeros, a one, then 7 of the 8 bits.
    const uint8_t cut[] = {0x00, 0x80};
    ABitReader suffix(cut, sizeof(cut));
    EXPECT_EQ(42u, parseUEWithFallback(&suffix, 42));

    // The largest code that fits: 31 zeros, a one, 31 ones.
    const uint8_t big[] = {0x00, 0x00, 0x00, 0x01, 0xFF, 0xFF, 0xFF, 0xFE};
    ABitReader top(big, sizeof(big));
    EXPECT_EQ(0xFFFFFFFEu, parseUE(&top));
    ABitReader topSigned(big, sizeof(big));
    EXPECT_EQ(-0x7FFFFFFF, parseSEWithFallback(&topSigned, 0));
}

TEST(AnnexBSplitTest, FindsStartCodesAndSplitsUnits) {
    const std::vector<uint8_t> s = {0xAA, 0x00, 0x00, 0x01, 0x67, 0x00, 0x01, 0x00, 0x00,
                                    0x00, 0x01, 0x68, 0xCE, 0x00, 0x00, 0x01, 0x00, 0x00, 0x01, 0x65};
    EXPECT_EQ(1u, findStartCodePrefix(s.data(), s.size()));
    EXPECT_EQ(2u, findStartCodePrefix(s.data(), 2));
    const uint8_t one[] = {0x01, 0x00, 0x01};
    EXPECT_EQ(3u, findStartCodePrefix(one, 3));

    const uint8_t* p = s.data();
    size_t n = s.size();
    const uint8_t* unit;
    size_t size;
    std::vector<std::vector<uint8_t>> units;
    while (nextAnnexBUnit(&p, &n, &unit, &size)) units.emplace_back(unit, unit + size);
    ASSERT_EQ(3u, units.size());  // the empty unit between adjacent start codes is skipped
    EXPECT_EQ((std::vector<uint8_t>{0x67, 0x00, 0x01}), units[0]);
    EXPECT_EQ((std::vector<uint8_t>{0x68, 0xCE}), units[1]);
    EXPECT_EQ((std::vector<uint8_t>{0x65}), units[2]);
    EXPECT_EQ(0u, n);
}

TEST(AnnexBSplitTest, StartCodeSearchAgreesWithAPlainScanEverywhere) {
    auto plain = [](const uint8_t* p, size_t n) {
        for (size_t i = 0; i + 3 <= n; ++i) {
            if (p[i] == 0 && p[i + 1] == 0 && p[i + 2] == 1) return i;
        }
        return n;
    };
    std::mt19937 rng(5);
    for (int round = 0; round < 4000; ++round) {
        std::vector<uint8_t> b(rng() % 100);
        for (uint8_t& x : b) x = rng() % 4 == 0 ? 0 : static_cast<uint8_t>(rng() % 8 == 0 ? 1 : 0x80 | rng());
        if (!b.empty() && round % 2 == 0) {  // plant one start code anywhere, maybe cut at the end
            const size_t at = rng() % b.size();
            for (size_t k = 0; k < 3 && at + k < b.size(); ++k) b[at + k] = k == 2 ? 1 : 0;
        }
        // Exactly sized heap copies: a read past the end is caught.
        const std::vector<uint8_t> copy = b;
        for (size_t from = 0; from <= std::min<size_t>(copy.size(), 3); ++from) {
            const size_t expected = plain(copy.data() + from, copy.size() - from);
            EXPECT_EQ(expected, findStartCodePrefix(copy.data() + from, copy.size() - from));
            EXPECT_EQ(expected, findStartCodePrefixPortable(copy.data() + from, copy.size() - from));
        }
    }
}
