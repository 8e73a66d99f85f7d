#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

#include "LogCapture.h"
#include "QNMediaAudioEffect.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

using Bytes = std::vector<uint8_t>;

Bytes le16(const std::vector<int>& v) {
    Bytes b;
    for (int s : v) b.push_back(s & 0xFF), b.push_back((s >> 8) & 0xFF);
    return b;
}
std::vector<int> fromLe16(const Bytes& b) {
    std::vector<int> v(b.size() / 2);
    for (size_t i = 0; i < v.size(); ++i) v[i] = static_cast<int16_t>(b[2 * i] | (b[2 * i + 1] << 8));
    return v;
}

sp<QNMediaAudioEffect> mixer(int mainGain, int auxGain, int outGain, int type) {
    sp<QNMediaAudioEffect> e = new QNMediaAudioEffect;
    e->setParamAudioInfo(16, 48000, 2);
    e->setParamAuxInfo(16, 48000, 2);
    e->setParamChainType(mainGain, auxGain, outGain, type);
    return e;
}

std::vector<int> mix(const sp<QNMediaAudioEffect>& e, const std::vector<int>& main) {
    Bytes in = le16(main), out(in.size());
    EXPECT_EQ(static_cast<int>(in.size()), e->processEffectChain(in.data(), out.data(), static_cast<int>(in.size())));
    return fromLe16(out);
}

int saturate(double v) { return static_cast<int>(std::max(-32768.0, std::min(32767.0, std::round(v)))); }

std::vector<int> randomPcm(size_t n, uint32_t seed) {
    std::mt19937 rng(seed);
    std::vector<int> v(n);
    for (auto& s : v) s = static_cast<int>(rng() % 65536) - 32768;
    return v;
}

}  // namespace

TEST(AudioEffectTest, GainsAndMixerTypesAreKeptInRange) {
    sp<QNMediaAudioEffect> e = new QNMediaAudioEffect;
    ASSERT_TRUE(e->isValid());
    EXPECT_EQ(QNEffectChainManager::kBadValue, -22);
    EXPECT_EQ(KVU_EFFECTCHAIN_RING_FULL, QNMediaAudioEffect::kRingBufferNokFull);
    EXPECT_EQ(60, e->checkGainRange(75));
    EXPECT_EQ(-60, e->checkGainRange(-100));
    EXPECT_EQ(59, e->checkGainRange(59));
    EXPECT_EQ(-60, e->checkGainRange(-60));
    LogCapture logs;
    EXPECT_EQ(5, e->getMixerControlType(5));
    EXPECT_TRUE(logs.lines().empty());
    EXPECT_EQ(4, e->getMixerControlType(6));
    EXPECT_TRUE(logs.contains("unsupported mixer type 6"));
    EXPECT_EQ(4, e->getMixerControlType(-1));
    EXPECT_TRUE(logs.contains("unsupported mixer type -1"));

    logs.clear();
    e->setParamAudioInfo(24, 44100, 1);
    EXPECT_TRUE(logs.contains("setParamAudioInfo format=3 rate=44100 layout=1 channels=1"));
    e->setParamAuxInfo(7, 8000, 2);
    EXPECT_TRUE(logs.contains("setParamAuxInfo format=2 rate=8000 layout=1 channels=2"));
    e->setParamChainType(70, -70, 0, 9);
    EXPECT_TRUE(logs.contains("unsupported mixer type 9"));
    EXPECT_TRUE(logs.contains("setParamChainType type=3 aux=1 gains=60,-60,0 ring=128 mixer=4"));

    e->freeBuff(nullptr);
    e.clear();
    int deinit = -1, destroyed = -1;
    const auto lines = logs.lines();
    for (size_t i = 0; i < lines.size(); ++i) {
        if (lines[i].message == "deinit") deinit = static_cast<int>(i);
        if (lines[i].message == "~QNEffectChainManager") destroyed = static_cast<int>(i);
    }
    ASSERT_GE(deinit, 0);
    EXPECT_GT(destroyed, deinit);
}

TEST(AudioEffectTest, DefaultMixSaturatesInsteadOfWrapping) {
    sp<QNMediaAudioEffect> e = mixer(0, 0, 0, 4);
    std::vector<int> aux = {32000, -32000, 10, -10, 1000, 2000};
    Bytes auxBytes = le16(aux);
    ASSERT_EQ(static_cast<int>(auxBytes.size()), e->writeAux(auxBytes.data(), static_cast<int>(auxBytes.size())));
    // Three frames with aux, then one without: the main passes alone.
    EXPECT_EQ((std::vector<int>{32767, -32768, 32767, -32768, 1500, 1500, 77, -77}),
              mix(e, {32000, -32000, 32767, -32768, 500, -500, 77, -77}));
}

TEST(AudioEffectTest, MatchesAReferenceMixForEveryType) {
    const std::vector<int> main = randomPcm(2 * 2000, 1), aux = randomPcm(2 * 2000, 2);
    const double duck = std::pow(10.0, -12 / 20.0);
    for (int type = 0; type <= 5; ++type) {
        const int gm = -6, ga = 3, go = -1;
        sp<QNMediaAudioEffect> e = mixer(gm, ga, go, type);
        Bytes auxBytes = le16(aux);
        ASSERT_GT(e->writeAux(auxBytes.data(), 1500 * 4), 0);  // aux for 1500 of 2000 frames
        const std::vector<int> got = mix(e, main);
        const double m = std::pow(10.0, gm / 20.0), a = std::pow(10.0, ga / 20.0), o = std::pow(10.0, go / 20.0);
        for (size_t i = 0; i < main.size(); ++i) {
            const bool has = i < 1500 * 2;
            const double x = main[i] * m, y = has ? aux[i] * a : 0.0;
            double want;
            switch (type) {
                case 0: want = x; break;
                case 1: want = y; break;
                case 2: want = (x + y) / 2; break;
                case 3: want = has ? y : x; break;
                case 5: want = x * (has ? duck : 1.0) + y; break;
                default: want = x + y; break;
            }
            ASSERT_NEAR(saturate(want * o), got[i], 1) << "type " << type << " at " << i;
        }
    }
}

TEST(AudioEffectTest, RingBufferRefusesWhenFullAndDrainsThroughTheChain) {
    sp<QNMediaAudioEffect> e = mixer(0, 0, 0, 1);
    // 128 blocks of 1024 frames; writes of 16384 frames fit seven times, not eight
    // (each write also reserves the converter's slack).
    std::vector<int> block(2 * 16384);
    for (size_t i = 0; i < block.size(); ++i) block[i] = static_cast<int>(i % 1000);
    Bytes bytes = le16(block);
    const int size = static_cast<int>(bytes.size());
    int accepted = 0;
    while (e->writeAux(bytes.data(), size) == size) ++accepted;
    EXPECT_EQ(7, accepted);
    EXPECT_EQ(QNMediaAudioEffect::kRingBufferNokFull, e->writeAux(bytes.data(), size));

    const std::vector<int> silence(block.size(), 0);
    EXPECT_EQ(block, mix(e, silence));  // aux only: the first write comes back
    EXPECT_EQ(size, e->writeAux(bytes.data(), size));

    // Larger than the whole ring: refused outright.
    Bytes huge(4 * 140000, 0);
    EXPECT_EQ(-22, e->writeAux(huge.data(), static_cast<int>(huge.size())));
}

TEST(AudioEffectTest, AuxInAnotherFormatIsBroughtToTheMainOne) {
    sp<QNMediaAudioEffect> e = new QNMediaAudioEffect;
    e->setParamAudioInfo(16, 48000, 2);
    e->setParamAuxInfo(8, 48000, 1);
    e->setParamChainType(0, 0, 0, 1);
    Bytes aux = {128, 192, 64, 255};
    ASSERT_EQ(4, e->writeAux(aux.data(), 4));
    EXPECT_EQ((std::vector<int>{0, 0, 16384, 16384, -16384, -16384, 32512, 32512}), mix(e, std::vector<int>(8, 0)));

    unsigned char* buf = e->allocateBuff(nullptr, 4096, 2);
    ASSERT_NE(nullptr, buf);
    buf[8191] = 1;
    e->freeBuff(buf);
    EXPECT_EQ(nullptr, e->allocateBuff(nullptr, -1, 1));
}
