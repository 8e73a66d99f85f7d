// The fast FLAC checksums against their bit-at-a-time references.
#include <cstdint>
#include <random>
#include <vector>

#include <gtest/gtest.h>
#include <media/stagefright/FLACCrc.h>

namespace android {
namespace {

TEST(FLACCrcTest, KnownValuesAndAFrameThatCarriesItsSumChecksToZero) {
    const uint8_t digits[] = {'1', '2', '3', '4', '5', '6', '7', '8', '9'};
    EXPECT_EQ(0xFEE8, FLACCrc16(digits, sizeof(digits)));
    EXPECT_EQ(0xF4, FLACCrc8(digits, sizeof(digits)));
    EXPECT_EQ(0, FLACCrc16(nullptr, 0));
    EXPECT_EQ(0, FLACCrc8(nullptr, 0));
    std::vector<uint8_t> frame(1000, 0x5A);
    const uint16_t sum = FLACCrc16(frame.data(), frame.size());
    frame.push_back(uint8_t(sum >> 8));
    frame.push_back(uint8_t(sum));
    EXPECT_EQ(0, FLACCrc16(frame.data(), frame.size()));
}

TEST(FLACCrcTest, FastSumsMatchTheReferenceBitForBit) {
    std::mt19937 rng(15);
    std::vector<uint8_t> random(70000);
    for (auto& b : random) b = uint8_t(rng());
    std::vector<uint8_t> ones(70000, 0xFF), zeros(70000, 0);
    for (const std::vector<uint8_t>* bytes : {&random, &ones, &zeros}) {
        // Every length and alignment around the 16-byte steps and the point
        // where the two runs start, then long ones.
        std::vector<size_t> lengths;
        for (size_t n = 0; n <= 300; ++n) lengths.push_back(n);
        for (size_t n : {1023u, 1024u, 1025u, 14000u, 65535u, 69984u}) lengths.push_back(n);
        for (size_t offset = 0; offset < 16; ++offset) {
            for (size_t n : lengths) {
                const uint8_t* p = bytes->data() + offset;
                const uint16_t expected = FLACCrc16Reference(p, n);
                ASSERT_EQ(expected, FLACCrc16(p, n)) << offset << " " << n;
                ASSERT_EQ(expected, FLACCrc16Table(0, p, n)) << offset << " " << n;
                if (n <= 300) ASSERT_EQ(FLACCrc8Reference(p, n), FLACCrc8(p, n)) << offset << " " << n;
            }
        }
    }
    // Continuing over any split, or byte by byte, gives the sum of the whole.
    const uint16_t whole = FLACCrc16Reference(random.data(), 5000);
    for (size_t split : {0u, 1u, 15u, 16u, 17u, 130u, 2500u, 4936u, 4999u, 5000u}) {
        EXPECT_EQ(whole, FLACCrc16Continue(FLACCrc16(random.data(), split), random.data() + split, 5000 - split));
        EXPECT_EQ(whole, FLACCrc16Table(FLACCrc16Table(0, random.data(), split), random.data() + split, 5000 - split));
    }
    uint16_t stepped = 0;
    for (size_t i = 0; i < 5000; ++i) stepped = FLACCrc16Update(stepped, random[i]);
    EXPECT_EQ(whole, stepped);
}

}  // namespace
}  // namespace android
