// Edit lists of several segments: what each hands out, at what times, and
// how seeking finds its way across them.

#include <gtest/gtest.h>

#include <cstdlib>

#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "MPEG4TestFacts.h"
#include "MPEG4TestFile.h"
#include "MPEG4TestRead.h"

using namespace android;
using namespace mp4test;
using namespace mp4test::facts;

namespace {

typedef std::vector<std::pair<uint32_t, int32_t>> Edits;  // duration, media time (ms)

// Ten 10 ms samples (timescale 1000); video has a sync sample every third.
File TenSamples(const std::string& handler, const Edits& edits) {
    File f;
    Track t;
    t.handler = handler;
    t.sampleEntry = handler == "vide" ? AvcEntry(4) : AacEntry();
    for (int i = 0; i < 10; ++i) {
        Sample s;
        s.bytes = handler == "vide" ? NalSample({std::string("\x65", 1) + char('0' + i)}, 4) : std::string(4, char('0' + i));
        s.sync = handler != "vide" || i % 3 == 0;
        t.samples.push_back(s);
    }
    if (!edits.empty()) t.edts = EditList(edits);
    f.tracks.push_back(t);
    return f;
}

char SampleNumber(const Read& r) { return r.bytes.back(); }

TEST(MPEG4EditListTest, SegmentsPlayOneAfterAnother) {
    struct Case {
        const char* what;
        const char* handler;
        Edits edits;
        std::vector<std::pair<char, int64_t>> want;  // sample, time in ms
        int64_t durationMs;
    } const kCases[] = {
        {"two segments after a wait; each starts at its sync sample", "vide", {{20, -1}, {30, 40}, {20, 10}},
         {{'3', 10}, {'4', 20}, {'5', 30}, {'6', 40}, {'0', 40}, {'1', 50}, {'2', 60}}, 70},
        {"a trimmed start begins at the sync sample before it", "vide", {{50, 40}},
         {{'3', -10}, {'4', 0}, {'5', 10}, {'6', 20}, {'7', 30}, {'8', 40}}, 50},
        {"an open-ended last edit runs to the end", "vide", {{10, -1}, {0, 60}},
         {{'6', 10}, {'7', 20}, {'8', 30}, {'9', 40}}, 50},
        {"an edit past the media plays nothing", "vide", {{30, 200}}, {}, 30},
        {"audio keeps one sample before the one the edit starts in", "soun", {{30, 25}},
         {{'1', -15}, {'2', -5}, {'3', 5}, {'4', 15}, {'5', 25}}, 30},
        {"an empty edit after the media only adds time", "soun", {{20, 0}, {40, -1}}, {{'0', 0}, {'1', 10}}, 60},
    };
    for (const Case& c : kCases) {
        SCOPED_TRACE(c.what);
        File f = TenSamples(c.handler, c.edits);
        if (std::string(c.handler) == "soun") f.tracks[0].timescale = 1000;
        sp<IMediaExtractor> extractor = OpenBytes(Build(f));
        ASSERT_NE(nullptr, extractor);
        int64_t durationUs = 0;
        ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt64(kKeyDuration, &durationUs));
        EXPECT_EQ(c.durationMs * 1000, durationUs);
        const std::vector<Read> got = ReadTrack(extractor, 0);
        ASSERT_EQ(c.want.size(), got.size());
        for (size_t i = 0; i < got.size(); ++i) {
            EXPECT_EQ(c.want[i].first, SampleNumber(got[i])) << i;
            EXPECT_EQ(c.want[i].second * 1000, got[i].timeUs) << i;
            EXPECT_EQ(got[i].timeUs, got[i].decodingUs) << i;
        }
    }
}

TEST(MPEG4EditListTest, SeeksLandInTheSegmentThatPlaysTheTime) {
    File f = TenSamples("vide", {{20, -1}, {30, 40}, {20, 10}});
    sp<IMediaSource> source = OpenBytes(Build(f))->getTrack(0);
    ASSERT_EQ(OK, source->start());
    struct {
        int64_t ms;
        MediaTrack::ReadOptions::SeekMode mode;
        char first, second;
    } const kSeeks[] = {
        {25, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC, '3', '4'},
        {45, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC, '0', '1'},  // both segments have a sync sample at 40 ms
        {65, MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC, '0', '1'},
        {15, MediaTrack::ReadOptions::SEEK_NEXT_SYNC, '6', '0'},
    };
    for (const auto& s : kSeeks) {
        SCOPED_TRACE(s.ms);
        MediaTrack::ReadOptions options;
        options.setSeekTo(s.ms * 1000, s.mode);
        Read r;
        ASSERT_EQ(OK, ReadOne(source, &r, &options));
        EXPECT_EQ(s.first, SampleNumber(r));
        ASSERT_EQ(OK, ReadOne(source, &r));
        EXPECT_EQ(s.second, SampleNumber(r));
    }
}

TEST(MPEG4EditListTest, EditsAtAnotherRateAreRefused) {
    File f = TenSamples("vide", {});
    LogCapture logs;
    // Half speed; a dwell (rate 0) is refused the same way.
    for (uint32_t rate : {0x8000u, 0u}) {
        f.tracks[0].edts = Box("edts", FullBox("elst", 0, 0, BE32(1) + BE32(100) + BE32(0) + BE32(rate)));
        clearRefusalReason();
        EXPECT_EQ(nullptr, OpenBytes(Build(f)));
        EXPECT_EQ("MP4 edit list with a media rate other than 1 is not supported", peekRefusalReason());
    }
    // An empty edit's rate is not looked at.
    f.tracks[0].edts = Box("edts", FullBox("elst", 0, 0, BE32(2) + BE32(10) + BE32(0xFFFFFFFF) + BE32(0) + BE32(100) +
                                                         BE32(0) + BE32(0x10000)));
    EXPECT_NE(nullptr, OpenBytes(Build(f)));
}

// The file cut by mp4_edit_list.py from avc_aac.mp4: 0.25 s of nothing, then
// 0.4 s from 0.4 s and 0.3 s from 1.2 s, checked against the source's facts.
TEST(MPEG4EditListTest, AFileCutBySegmentsPlaysEachPieceWhole) {
    struct Piece {
        int64_t mediaUs, durationUs, startUs;
    } const kPieces[] = {{400000, 400000, 250000}, {1200000, 300000, 650000}};
    const Facts facts = LoadFacts("avc_aac.mp4");
    ASSERT_EQ(2u, facts.streams.size());
    sp<DataSource> file = new FileSource(MediaPath("edits_segments.mp4").c_str());
    sp<IMediaExtractor> extractor = CreateMPEG4Extractor(file);
    ASSERT_NE(nullptr, extractor);
    for (size_t track = 0; track < 2; ++track) {
        SCOPED_TRACE(track);
        const std::vector<Packet>& packets = facts.streams[track].packets;
        int64_t durationUs = 0;
        ASSERT_TRUE(extractor->getTrackMetaData(track)->findInt64(kKeyDuration, &durationUs));
        EXPECT_EQ(950000, durationUs);
        const std::vector<Read> out = ReadTrack(extractor, track);
        size_t pos = 0;
        for (const Piece& piece : kPieces) {
            SCOPED_TRACE(piece.mediaUs);
            const int64_t shift = piece.startUs - piece.mediaUs;
            auto matches = [&](size_t i, const Read& r) {
                return packets[i].size == r.bytes.size() && std::llabs(packets[i].pts + shift - r.timeUs) <= 2 &&
                       std::llabs(packets[i].dts + shift - r.decodingUs) <= 2;
            };
            // The run of source samples this segment hands out, in decoding order.
            ASSERT_LT(pos, out.size());
            size_t first = 0;
            while (first < packets.size() && !matches(first, out[pos])) ++first;
            ASSERT_LT(first, packets.size());
            size_t end = first;
            while (end < packets.size() && pos < out.size() && matches(end, out[pos])) ++end, ++pos;
            EXPECT_TRUE(packets[first].key);
            size_t firstShown = SIZE_MAX, lastKey = 0;
            for (size_t i = 0; i < packets.size(); ++i) {
                const bool shown = packets[i].pts >= piece.mediaUs && packets[i].pts < piece.mediaUs + piece.durationUs;
                if (shown) EXPECT_TRUE(i >= first && i < end) << "sample " << i << " is presented but missing";
                if (shown && firstShown == SIZE_MAX) firstShown = i;
                if (packets[i].key && firstShown == SIZE_MAX) lastKey = i;
            }
            // Nothing earlier than decoding needs, nothing decoded after the piece.
            EXPECT_GE(first + 1, lastKey);
            for (size_t i = first; i < end; ++i) EXPECT_LT(packets[i].dts, piece.mediaUs + piece.durationUs) << i;
        }
        EXPECT_EQ(out.size(), pos);
    }
}

}  // namespace
