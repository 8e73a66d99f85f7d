// The MP4 writer's table, timing and bitstream pieces, without files.

#include <gtest/gtest.h>

#include "mpeg4/Mp4BoxWriter.h"
#include "mpeg4/Mp4ConfigRecords.h"
#include "mpeg4/Mp4NalUnits.h"
#include "mpeg4/Mp4TrackTables.h"
#include "mpeg4/Mp4TrackTiming.h"

using namespace android;

namespace {

std::vector<uint32_t> words(const std::string& bytes, size_t from) {
    std::vector<uint32_t> out;
    for (size_t i = from; i + 4 <= bytes.size(); i += 4) {
        out.push_back((uint32_t(uint8_t(bytes[i])) << 24) | (uint32_t(uint8_t(bytes[i + 1])) << 16) |
                      (uint32_t(uint8_t(bytes[i + 2])) << 8) | uint8_t(bytes[i + 3]));
    }
    return out;
}

TEST(MPEG4WriterTiming, KeepsConsistentDecodingTimesAndShiftsOnlyThroughTheEdit) {
    // I P B B at 30 fps with the encoder's decoding times one frame early.
    const std::vector<int64_t> pts = {0, 100000, 33333, 66667};
    const std::vector<int64_t> dts = {-33333, 0, 33333, 66667};
    Mp4TrackTiming t;
    ASSERT_EQ(OK, t.compute(dts, pts, {90000, 1000000}, 33333));
    EXPECT_FALSE(t.rebuiltDecodingTimes);
    EXPECT_EQ(90000u, t.timescale);
    ASSERT_EQ(1u, t.stts.size());
    EXPECT_EQ(4u, t.stts[0].count);
    EXPECT_EQ(3000u, t.stts[0].value);
    // ctts = pts - dts; the first decoding time (-1 frame) is removed by the
    // edit's media time, so presentation starts at 0.
    ASSERT_EQ(3u, t.ctts.size());
    EXPECT_EQ(3000u, t.ctts[0].value);
    EXPECT_EQ(9000u, t.ctts[1].value);
    EXPECT_EQ(2u, t.ctts[2].count);
    EXPECT_TRUE(t.needsEdit);
    EXPECT_EQ(0, t.startUs);
    EXPECT_EQ(3000, t.mediaTime);
}

TEST(MPEG4WriterTiming, RebuildsDecodingTimesThatRunAheadOrRepeat) {
    const std::vector<int64_t> pts = {0, 100000, 33333, 66667, 200000, 133333, 166667};
    for (const std::vector<int64_t>& dts :
         {std::vector<int64_t>{0, 3333333, 6666666, 9999999, 13333332, 16666665, 19999998},  // runs ahead
          std::vector<int64_t>(7, 5000),                                                   // repeats
          pts}) {                                                                          // unordered
        Mp4TrackTiming t;
        ASSERT_EQ(OK, t.compute(dts, pts, {90000, 1000000}, 33333));
        EXPECT_TRUE(t.rebuiltDecodingTimes);
        // Every sample one frame apart in decoding order, offsets unsigned,
        // and the presentation still starts at 0 and lasts 7 frames.
        ASSERT_EQ(1u, t.stts.size());
        EXPECT_EQ(3000u, t.stts[0].value);
        int64_t decode = 0;
        for (const auto& run : t.ctts) {
            for (uint32_t k = 0; k < run.count; ++k, decode += 3000) {
                const int64_t presented = decode + run.value - t.mediaTime;
                EXPECT_GE(presented, 0);
            }
        }
        EXPECT_EQ(0, t.startUs);
        EXPECT_EQ(21000u, t.shownTicks);
    }
}

TEST(MPEG4WriterTiming, TimescaleEditsAndRounding) {
    {
        // Times off the 90 kHz grid keep microsecond precision.
        Mp4TrackTiming t;
        ASSERT_EQ(OK, t.compute({0, 33341, 66690}, {0, 33341, 66690}, {90000, 1000000}, 33333));
        EXPECT_EQ(1000000u, t.timescale);
        EXPECT_FALSE(t.needsEdit);
        EXPECT_TRUE(t.ctts.empty());
    }
    {
        // A late start gets an empty edit; pre-roll before 0 is hidden by
        // starting the media at presentation time 0.
        Mp4TrackTiming late, preroll;
        ASSERT_EQ(OK, late.compute({500000, 523220}, {500000, 523220}, {44100, 1000000}, 23220));
        EXPECT_EQ(44100u, late.timescale);
        EXPECT_TRUE(late.needsEdit);
        EXPECT_EQ(500000, late.startUs);
        EXPECT_EQ(0, late.mediaTime);
        ASSERT_EQ(OK, preroll.compute({-46440, -23220, 0, 23220}, {-46440, -23220, 0, 23220}, {44100}, 23220));
        EXPECT_EQ(0, preroll.startUs);
        EXPECT_EQ(2048, preroll.mediaTime);
        EXPECT_EQ(2048u, preroll.shownTicks);
        Mp4BoxWriter w;
        late.writeEdits(w, 1000);
        // edts, elst v0 with two entries: 500 ms empty, then the media from 0.
        EXPECT_EQ(std::vector<uint32_t>({48, 0x65647473, 40, 0x656c7374, 0, 2, 500, 0xFFFFFFFF, 0x10000, 46, 0,
                                         0x10000}),
                  words(w.data(), 0));
    }
    {
        // Two times that round to one tick still get distinct decoding times.
        Mp4TrackTiming t;
        ASSERT_EQ(OK, t.compute({0, 1, 2}, {0, 1, 2}, {1000}, 1000));
        EXPECT_EQ(1000u, t.timescale);
        for (const auto& r : t.stts) EXPECT_GT(r.value, 0u);
    }
    EXPECT_EQ(-2, Mp4UsToTicks(-23, 90000));
    // No overflow for times far beyond any recording.
    EXPECT_EQ(INT64_C(9000000000000000), Mp4UsToTicks(INT64_C(9000000000000000000), 1000));
    EXPECT_EQ(INT64_C(9000000000000000000), Mp4TicksToUs(INT64_C(810000000000000000), 90000));
}

TEST(MPEG4WriterTiming, BoundsShowExactlyWhatATrimAskedFor) {
    // 25 fps at 90 kHz, in decoding order. A trim ending at 100 ms keeps the
    // P-frame at 120 ms that the B-frames at 40 and 80 ms refer to.
    const std::vector<int64_t> ipbb = {0, 120000, 40000, 80000};
    struct Case {
        const char* what;
        std::vector<int64_t> pts;
        Mp4TrackBounds bounds;
        int64_t startUs;
        int64_t mediaTime;    // ticks of the track's time scale
        uint64_t shownTicks;
    };
    const Case cases[] = {
        {"no bounds: everything shown", ipbb, {}, 0, 0, 14400},
        {"end hides the reference after it", ipbb, {100000, false}, 0, 0, 9000},
        {"end past every sample changes nothing", ipbb, {400000, false}, 0, 0, 14400},
        {"a sample stored after the last one shown before the end: not a trim, shown whole",
         {0, 120000, 40000, 80000, 160000}, {100000, false}, 0, 0, 18000},
        {"a frame shown from before 0 is hidden, an empty edit up to the next",
         {-10000, 30000, 70000}, {-1, true}, 30000, 3600, 7200},
        {"without the start on a frame the first frame shows from 0", {-10000, 30000, 70000}, {}, 0, 900, 9900},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        std::vector<int64_t> dts(c.pts.size());
        for (size_t i = 0; i < dts.size(); ++i) dts[i] = c.pts.front() + int64_t(i) * 40000 - 40000;
        Mp4TrackTiming t;
        ASSERT_EQ(OK, t.compute(dts, c.pts, {90000}, 40000, c.bounds));
        EXPECT_EQ(c.startUs, t.startUs);
        EXPECT_EQ(c.mediaTime, t.mediaTime - 3600);  // less the one-frame decoding lead
        EXPECT_EQ(c.shownTicks, t.shownTicks);
    }

    // Audio off its sample grid (a cut 10 ms before a frame) is rounded to the
    // grid and hides the pre-roll by a whole number of samples.
    Mp4TrackTiming aac;
    const std::vector<int64_t> times = {-10000, 13220, 36440, 59660};
    ASSERT_EQ(OK, aac.compute(times, times, {44100}, 23220));
    EXPECT_EQ(44100u, aac.timescale);
    ASSERT_EQ(1u, aac.stts.size());
    EXPECT_EQ(1024u, aac.stts[0].value);
    EXPECT_EQ(441, aac.mediaTime);
}

TEST(MPEG4WriterTables, ChunksSizesSyncAndWideOffsets) {
    Mp4TrackTables t;
    // Two chunks of two samples, then a chunk of one beyond 4 GiB.
    t.addSample(100, 10, 0, 0, true, false);
    t.addSample(110, 10, 1000, 1000, false, true);
    t.addSample(500, 10, 2000, 2000, false, false);
    t.addSample(510, 10, 3000, 3000, true, true);
    t.addSample(UINT64_C(0x100000010), 7, 4000, 5000, false, false);
    Mp4BoxWriter w;
    t.writeChunks(w);
    EXPECT_EQ(std::vector<uint32_t>({40, 0x73747363, 0, 2, 1, 2, 1, 3, 1, 1,      // stsc
                                     40, 0x636f3634, 0, 3, 0, 100, 0, 500, 1, 16}),  // co64
              words(w.data(), 0));
    Mp4BoxWriter s;
    t.writeSyncSamples(s);
    t.writeSampleSizes(s);
    EXPECT_EQ(std::vector<uint32_t>({24, 0x73747373, 0, 2, 1, 4,  // stss
                                     40, 0x7374737a, 0, 0, 5, 10, 10, 10, 10, 7}),
              words(s.data(), 0));
    std::vector<int64_t> dts, pts;
    t.times(&dts, &pts);
    EXPECT_EQ(std::vector<int64_t>({0, 1000, 2000, 3000, 4000}), dts);
    EXPECT_EQ(std::vector<int64_t>({0, 1000, 2000, 3000, 5000}), pts);

    Mp4TrackTables allSync;
    allSync.addSample(0, 4, -5, -5, true, false);
    Mp4BoxWriter none;
    allSync.writeSyncSamples(none);
    EXPECT_EQ(0u, none.size());
}

TEST(MPEG4WriterTables, MdatHeaderSwitchesToLargeSize) {
    EXPECT_EQ(kMdatReserve, Mp4MdatPlaceholder().size());
    EXPECT_EQ(std::vector<uint32_t>({8, 0x66726565, 1008, 0x6d646174}), words(Mp4MdatHeader(1000), 0));
    const uint64_t big = UINT64_C(5000000000);
    EXPECT_EQ(std::vector<uint32_t>({1, 0x6d646174, uint32_t((big + 16) >> 32), uint32_t(big + 16)}),
              words(Mp4MdatHeader(big), 0));
}

TEST(MPEG4WriterNalUnits, AnnexBAndLengthPrefixedFraming) {
    const std::vector<uint8_t> annexB = {0, 0, 0, 1, 0x67, 1, 2, 0, 0, 1, 0x68, 3, 0, 0, 0, 0, 1, 0x65, 0, 0, 3, 1};
    std::vector<NalSpan> nals;
    ASSERT_TRUE(Mp4SplitAnnexB(annexB.data(), annexB.size(), &nals));
    ASSERT_EQ(3u, nals.size());
    EXPECT_EQ(3u, nals[0].size);
    EXPECT_EQ(2u, nals[1].size);  // trailing zeros before the next start code dropped
    EXPECT_EQ(5u, nals[2].size);  // emulation prevention bytes kept
    std::vector<uint8_t> out;
    ASSERT_TRUE(Mp4AppendLengthPrefixed(nals, 4, &out));
    EXPECT_TRUE(Mp4IsLengthPrefixed(out.data(), out.size(), 4));
    EXPECT_FALSE(Mp4IsLengthPrefixed(annexB.data(), annexB.size(), 4));
    // A one-byte end-of-sequence unit looks like a start code but tiles.
    const std::vector<uint8_t> eos = {0, 0, 0, 1, 0x0A};
    EXPECT_TRUE(Mp4IsLengthPrefixed(eos.data(), eos.size(), 4));
    std::vector<uint8_t> small;
    const std::vector<uint8_t> big(300, 0x41);
    EXPECT_FALSE(Mp4AppendLengthPrefixed({{big.data(), big.size()}}, 1, &small));
    EXPECT_FALSE(Mp4SplitAnnexB(big.data(), big.size(), &nals));
}

TEST(MPEG4WriterConfig, AudioSpecificConfig) {
    uint32_t rate = 0, channels = 0;
    const std::vector<uint8_t> asc = {0x12, 0x10};
    ASSERT_TRUE(Mp4ParseAsc(asc.data(), asc.size(), &rate, &channels));
    EXPECT_EQ(44100u, rate);
    EXPECT_EQ(2u, channels);
    EXPECT_FALSE(Mp4ParseAsc(asc.data(), 1, &rate, &channels));
    // Explicit 24-bit rate (index 15).
    const std::vector<uint8_t> explicitRate = {0x17, 0x80, 0x5D, 0xC0, 0x08};
    ASSERT_TRUE(Mp4ParseAsc(explicitRate.data(), explicitRate.size(), &rate, &channels));
    EXPECT_EQ(48000u, rate);
    EXPECT_EQ(1u, channels);
    EXPECT_EQ(asc, Mp4MakeAacLcConfig(44100, 2));
    EXPECT_TRUE(Mp4MakeAacLcConfig(44000, 2).empty());
}

TEST(MPEG4WriterConfig, RecordsNeedTheirParameterSets) {
    const std::vector<uint8_t> sps = {0x67, 0x42, 0xC0, 0x1E, 0x8C, 0x8D, 0x40};
    const std::vector<uint8_t> pps = {0x68, 0xCE, 0x3C, 0x80};
    EXPECT_TRUE(Mp4BuildAvcC({{sps.data(), sps.size()}}, {}).empty());
    EXPECT_TRUE(Mp4BuildHvcC({}, {{sps.data(), sps.size()}}, {{pps.data(), pps.size()}}).empty());
    const std::vector<uint8_t> avcc = Mp4BuildAvcC({{sps.data(), sps.size()}}, {{pps.data(), pps.size()}});
    EXPECT_EQ(4u, Mp4AvcCLengthSize(avcc.data(), avcc.size()));
    EXPECT_EQ(0u, Mp4AvcCLengthSize(avcc.data(), avcc.size() - 1));
}

}  // namespace
