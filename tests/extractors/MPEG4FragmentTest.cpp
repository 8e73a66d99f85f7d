// Fragmented files built box by box in every layout the writers at hand do
// not all produce: each must read exactly as the same samples in a plain file.

#include <gtest/gtest.h>

#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "MPEG4TestFile.h"
#include "MPEG4TestRead.h"

using namespace android;
using namespace mp4test;

namespace {

// A video track with B-frame-like composition offsets (negative ones for a
// signed table) and an audio track with fewer, larger samples.
File TwoTracks(bool negativeOffsets, bool uniform) {
    File f;
    Track video;
    video.sampleEntry = AvcEntry(4);
    video.cttsVersion = negativeOffsets ? 1 : 0;
    for (int i = 0; i < 7; ++i) {
        Sample s;
        s.bytes = NalSample({std::string("\x65\x88", 2) + char('a' + i) + std::string(uniform ? 0 : i, 'x')}, 4);
        s.sync = i % 2 == 0;
        s.duration = uniform ? 10 : 10 + i;
        s.ctsOffset = uniform ? 0 : (negativeOffsets ? -10 * (i % 2) : 20 * (i % 2));
        video.samples.push_back(s);
    }
    Track audio;
    audio.handler = "soun";
    audio.sampleEntry = AacEntry();
    audio.timescale = 44100;
    for (int i = 0; i < 5; ++i) {
        Sample s;
        s.bytes = std::string(uniform ? 9 : 9 + i, char('A' + i));
        s.duration = 1024;
        audio.samples.push_back(s);
    }
    f.tracks = {video, audio};
    return f;
}

void ExpectSameReads(const std::vector<Read>& want, const std::vector<Read>& got) {
    ASSERT_EQ(want.size(), got.size());
    for (size_t i = 0; i < want.size(); ++i) {
        SCOPED_TRACE(i);
        EXPECT_EQ(want[i].bytes, got[i].bytes);
        EXPECT_EQ(want[i].timeUs, got[i].timeUs);
        EXPECT_EQ(want[i].decodingUs, got[i].decodingUs);
        EXPECT_EQ(want[i].sync, got[i].sync);
    }
}

TEST(MPEG4FragmentTest, EveryOffsetBaseAndRunLayoutReadsAsThePlainFile) {
    struct Case {
        Fragmenting::Base base;
        uint8_t trunVersion;
        bool defaultsOnly;
        size_t perFragment;
    } const kCases[] = {
        {Fragmenting::kFirstAtMoof, 0, false, 2},       {Fragmenting::kExplicit, 0, false, 3},
        {Fragmenting::kDefaultBaseIsMoof, 0, false, 1}, {Fragmenting::kFirstAtMoof, 1, false, 3},
        {Fragmenting::kDefaultBaseIsMoof, 1, false, 7}, {Fragmenting::kExplicit, 0, true, 2},
        {Fragmenting::kFirstAtMoof, 0, true, 1},
    };
    for (const Case& c : kCases) {
        SCOPED_TRACE(testing::Message() << "base " << c.base << " trun v" << int(c.trunVersion) << " defaults "
                                        << c.defaultsOnly << " per fragment " << c.perFragment);
        File f = TwoTracks(c.trunVersion == 1, c.defaultsOnly);
        if (c.defaultsOnly) {
            // Only the first sample of each fragment is a sync sample.
            for (Track& t : f.tracks) {
                for (size_t i = 0; i < t.samples.size(); ++i) t.samples[i].sync = i % c.perFragment == 0;
            }
        }
        Fragmenting how;
        how.base = c.base;
        how.trunVersion = c.trunVersion;
        how.defaultsOnly = c.defaultsOnly;
        how.samplesPerFragment = c.perFragment;
        sp<IMediaExtractor> plain = OpenBytes(Build(f));
        sp<IMediaExtractor> fragmented = OpenBytes(BuildFragmented(f, how));
        ASSERT_NE(nullptr, plain);
        ASSERT_NE(nullptr, fragmented);
        ASSERT_EQ(2u, fragmented->countTracks());
        for (size_t i = 0; i < 2; ++i) {
            SCOPED_TRACE(i);
            ExpectSameReads(ReadTrack(plain, i), ReadTrack(fragmented, i));
            int64_t plainUs = 0, fragmentedUs = 0;
            plain->getTrackMetaData(i)->findInt64(kKeyDuration, &plainUs);
            fragmented->getTrackMetaData(i)->findInt64(kKeyDuration, &fragmentedUs);
            EXPECT_EQ(plainUs, fragmentedUs);
        }
    }
}

TEST(MPEG4FragmentTest, DecodeTimesOfFragmentsAreHonouredAcrossGaps) {
    const File f = TwoTracks(false, false);
    Fragmenting how;
    how.tfdtGap = 1000;  // each fragment starts 1000 ticks later than the last ended
    how.samplesPerFragment = 3;
    const std::vector<Read> plain = ReadTrack(OpenBytes(Build(f)), 0);
    const std::vector<Read> gapped = ReadTrack(OpenBytes(BuildFragmented(f, how)), 0);
    ASSERT_EQ(plain.size(), gapped.size());
    for (size_t i = 0; i < plain.size(); ++i) {
        const int64_t gapUs = int64_t(i / 3) * 1000000;  // timescale 1000
        EXPECT_EQ(plain[i].timeUs + gapUs, gapped[i].timeUs) << i;
        EXPECT_EQ(plain[i].decodingUs + gapUs, gapped[i].decodingUs) << i;
    }
}

TEST(MPEG4FragmentTest, IndexesAndRandomAccessBoxesAreWalkedOver) {
    const File f = TwoTracks(false, false);
    Fragmenting how;
    how.afterMoov = FullBox("sidx", 0, 0, std::string(24, '\0')) + Box("styp", "msdh");
    const std::string trailer = Box("mfra", FullBox("tfra", 0, 0, BE32(1) + BE32(0) + BE32(0)) +
                                                FullBox("mfro", 0, 0, BE32(8 + 20 + 16)));
    sp<IMediaExtractor> extractor = OpenBytes(BuildFragmented(f, how) + trailer);
    ASSERT_NE(nullptr, extractor);
    ExpectSameReads(ReadTrack(OpenBytes(Build(f)), 0), ReadTrack(extractor, 0));
}

TEST(MPEG4FragmentTest, AFileCutShortKeepsTheSamplesItHolds) {
    const File f = TwoTracks(false, false);
    Fragmenting how;
    how.samplesPerFragment = 3;
    const std::string whole = BuildFragmented(f, how);
    const size_t lastMdat = whole.rfind("mdat") - 4;
    const std::vector<Read> all = ReadTrack(OpenBytes(whole), 0);
    LogCapture quiet;
    // Inside the last fragment's media data, and inside its 'moof'.
    for (size_t cut : {whole.size() - 3, lastMdat - 10}) {
        SCOPED_TRACE(cut);
        sp<IMediaExtractor> extractor = OpenBytes(whole.substr(0, cut));
        ASSERT_NE(nullptr, extractor);
        const std::vector<Read> got = ReadTrack(extractor, 0);
        ASSERT_LT(got.size(), all.size());
        ASSERT_GE(got.size(), 6u);
        for (size_t i = 0; i < got.size(); ++i) EXPECT_EQ(all[i].bytes, got[i].bytes);
    }
}

TEST(MPEG4FragmentTest, DamagedFragmentsRefuseTheFile) {
    const File f = TwoTracks(false, false);
    const std::string good = BuildFragmented(f, Fragmenting());
    const size_t trun = FindBox(good, "trun");
    LogCapture logs;
    struct Damage {
        const char* what;
        size_t at;
        uint32_t value;
    } const kDamage[] = {
        {"sample count beyond the box", trun + 12, 0x40000000},
        {"data offset before the file", trun + 16, 0x80000000},
        {"run larger than its track fragment", trun, 0x7000},
    };
    for (const Damage& d : kDamage) {
        SCOPED_TRACE(d.what);
        std::string bad = good;
        bad.replace(d.at, 4, BE32(d.value));
        clearRefusalReason();
        EXPECT_EQ(nullptr, OpenBytes(bad));
        EXPECT_EQ(0u, peekRefusalReason().find("damaged MP4 fragment at byte ")) << peekRefusalReason();
    }
    // Samples wholly from defaults claim no bytes of the box: the file bounds them.
    Fragmenting defaults;
    defaults.defaultsOnly = true;
    File uniform = TwoTracks(false, true);
    std::string bad = BuildFragmented(uniform, defaults);
    bad.replace(FindBox(bad, "trun") + 12, 4, BE32(0xFFFFFFF0));
    EXPECT_EQ(nullptr, OpenBytes(bad));
}

TEST(MPEG4FragmentTest, FragmentsOfTracksNotHandedOutAreSkipped) {
    File f = TwoTracks(false, false);
    f.tracks[0].handler = "text";  // not read, but its data comes first in each fragment
    sp<IMediaExtractor> extractor = OpenBytes(BuildFragmented(f, Fragmenting()));
    ASSERT_NE(nullptr, extractor);
    ASSERT_EQ(1u, extractor->countTracks());
    const std::vector<Read> got = ReadTrack(extractor, 0);
    ASSERT_EQ(f.tracks[1].samples.size(), got.size());
    for (size_t i = 0; i < got.size(); ++i) EXPECT_EQ(f.tracks[1].samples[i].bytes, got[i].bytes);
}

}  // namespace
