// Files built box by box: table layouts, NAL prefixes, edits and the
// device's items that encoders at hand do not produce.

#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "MPEG4TestFile.h"
#include "MPEG4TestRead.h"
#include "mpeg4/MPEG4SampleTable.h"

using namespace android;
using namespace mp4test;

namespace {

Track VideoTrack(int nalLengthSize, size_t count) {
    Track t;
    t.sampleEntry = AvcEntry(uint8_t(nalLengthSize));
    for (size_t i = 0; i < count; ++i) {
        Sample s;
        s.bytes = NalSample({std::string("\x65\x88", 2) + char('a' + i), "\x06\x05"}, nalLengthSize);
        s.sync = i % 3 == 0;
        t.samples.push_back(s);
    }
    return t;
}

TEST(MPEG4TablesTest, NalPrefixesOfEveryWidthBecomeStartCodes) {
    for (int width : {1, 2, 4}) {
        SCOPED_TRACE(width);
        File f;
        f.tracks.push_back(VideoTrack(width, 4));
        sp<IMediaExtractor> extractor = OpenBytes(Build(f));
        ASSERT_NE(nullptr, extractor);
        std::vector<Read> samples = ReadTrack(extractor, 0);
        ASSERT_EQ(4u, samples.size());
        int32_t maxInput = 0;
        ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt32(kKeyMaxInputSize, &maxInput));
        for (size_t i = 0; i < samples.size(); ++i) {
            const std::string want = std::string("\0\0\0\1\x65\x88", 6) + char('a' + i) + std::string("\0\0\0\1\x06\x05", 6);
            EXPECT_EQ(want, samples[i].bytes);
            EXPECT_LE(samples[i].bytes.size(), size_t(maxInput));
        }
    }
}

TEST(MPEG4TablesTest, NalLengthPastTheSampleFailsThatReadOnly) {
    for (int width : {2, 4}) {
        SCOPED_TRACE(width);
        File f;
        f.tracks.push_back(VideoTrack(width, 4));
        f.tracks[0].samples[1].bytes = BE(9, width) + "\x65\x88";     // claims more than it has
        f.tracks[0].samples[2].bytes = NalSample({"\x41\x9a"}, width) + '\0';  // cut inside a prefix
        sp<IMediaSource> source = OpenBytes(Build(f))->getTrack(0);
        ASSERT_EQ(OK, source->start());
        Read r;
        EXPECT_EQ(OK, ReadOne(source, &r));
        EXPECT_EQ(kCorruptNal, ReadOne(source, &r));
        EXPECT_EQ(kCorruptNal, ReadOne(source, &r));
        ASSERT_EQ(OK, ReadOne(source, &r));
        EXPECT_EQ(std::string("\0\0\0\1\x65\x88" "d", 7), r.bytes.substr(0, 7));
    }
}

TEST(MPEG4TablesTest, CompactSizesWideOffsetsAndNegativeCompositionOffsets) {
    File f;
    Track t = VideoTrack(4, 7);
    t.compactSizes = true;
    t.co64 = true;
    t.cttsVersion = 1;
    t.samplesPerChunk = 3;
    t.timescale = 100;
    const int32_t offsets[] = {0, 3, -1, 2, -2, 0, 1};
    for (size_t i = 0; i < t.samples.size(); ++i) {
        t.samples[i].duration = uint32_t(1 + i);
        t.samples[i].ctsOffset = offsets[i];
    }
    f.tracks.push_back(t);
    f.moovFirst = false;
    std::vector<Read> samples = ReadTrack(OpenBytes(Build(f)), 0);
    ASSERT_EQ(7u, samples.size());
    int64_t dts = 0;
    for (size_t i = 0; i < samples.size(); ++i) {
        SCOPED_TRACE(i);
        EXPECT_EQ(dts * 10000, samples[i].decodingUs);
        EXPECT_EQ((dts + offsets[i]) * 10000, samples[i].timeUs);
        EXPECT_EQ(t.samples[i].sync, samples[i].sync);
        EXPECT_EQ(t.samples[i].bytes.size(), samples[i].bytes.size());
        EXPECT_EQ(char('a' + i), samples[i].bytes[6]);
        dts += t.samples[i].duration;
    }
}

TEST(MPEG4TablesTest, EditsShiftPresentationAndDecodingTimes) {
    File f;
    Track t = VideoTrack(4, 3);
    // 500 ms of nothing, then the media from 20 ms on (movie timescale 1000).
    t.edts = EditList({{500, -1}, {25, 20}});
    f.tracks.push_back(t);
    sp<IMediaExtractor> extractor = OpenBytes(Build(f));
    std::vector<Read> samples = ReadTrack(extractor, 0);
    ASSERT_EQ(3u, samples.size());
    for (size_t i = 0; i < samples.size(); ++i) {
        EXPECT_EQ(480000 + int64_t(i) * 10000, samples[i].timeUs);
        EXPECT_EQ(samples[i].timeUs, samples[i].decodingUs);
    }
    int64_t durationUs = 0;
    ASSERT_TRUE(extractor->getTrackMetaData(0)->findInt64(kKeyDuration, &durationUs));
    EXPECT_EQ(525000, durationUs);
}

TEST(MPEG4TablesTest, WithoutSyncTableEverySampleIsSync) {
    File f;
    Track t = VideoTrack(4, 5);
    t.syncTable = false;
    f.tracks.push_back(t);
    for (const Read& r : ReadTrack(OpenBytes(Build(f)), 0)) EXPECT_TRUE(r.sync);
}

TEST(MPEG4TablesTest, RotationComesFromTheTrackMatrix) {
    const struct {
        int32_t a, b, c, d;
        int32_t degrees;
    } kCases[] = {{0, 0x10000, -0x10000, 0, 90}, {-0x10000, 0, 0, -0x10000, 180}, {0, -0x10000, 0x10000, 0, 270},
                  {0x10000, 0, 0, 0x10000, 0}};
    for (const auto& c : kCases) {
        File f;
        Track t = VideoTrack(4, 1);
        t.matrix[0] = c.a;
        t.matrix[1] = c.b;
        t.matrix[2] = c.c;
        t.matrix[3] = c.d;
        f.tracks.push_back(t);
        int32_t rotation = 0;
        OpenBytes(Build(f))->getTrackMetaData(0)->findInt32(kKeyRotation, &rotation);
        EXPECT_EQ(c.degrees, rotation);
    }
}

File AudioVideoFile() {
    File f;
    f.tracks.push_back(VideoTrack(4, 2));
    Track audio;
    audio.handler = "soun";
    audio.sampleEntry = AacEntry(96000);
    audio.timescale = 44100;
    for (int i = 0; i < 3; ++i) audio.samples.push_back({std::string(20 + i, 'x'), 1024, 0, true});
    f.tracks.push_back(audio);
    return f;
}

TEST(MPEG4TablesTest, DeviceItemsArePublishedUnderTheEditorKeys) {
    File f = AudioVideoFile();
    f.udta = Box("\xA9xyz", BE16(18) + BE16(0x15C7) + "+35.6812+139.7671/") + Box("qnrt", "slow") +
             Box("wafm", std::string("\x00\x01\x7f\xff", 4)) + Box("waf2", "\x01\x02") + Box("umsg", "hello") +
             Box("rmod", "vr180") + Box("bksz", BE64(4096)) + BE32(0);
    f.trailing = Box("uuid", "QNED-SPHEREVIEW1" + std::string("\x01\x02\x03", 3));
    sp<IMediaExtractor> extractor = OpenBytes(Build(f));
    ASSERT_NE(nullptr, extractor);
    sp<MetaData> meta = extractor->getMetaData();
    const char* text = nullptr;
    ASSERT_TRUE(meta->findCString(kKeyLocation, &text));
    EXPECT_STREQ("+35.6812+139.7671/", text);
    ASSERT_TRUE(meta->findCString('vrty', &text));
    EXPECT_STREQ("slow", text);
    ASSERT_TRUE(meta->findCString('umsg', &text));
    EXPECT_STREQ("hello", text);
    ASSERT_TRUE(meta->findCString('rmod', &text));
    EXPECT_STREQ("vr180", text);
    uint32_t type;
    const void* data;
    size_t size;
    ASSERT_TRUE(meta->findData('wafm', &type, &data, &size));
    EXPECT_EQ(std::string("\x00\x01\x7f\xff", 4), std::string(static_cast<const char*>(data), size));
    ASSERT_TRUE(meta->findData('waf2', &type, &data, &size));
    EXPECT_EQ("\x01\x02", std::string(static_cast<const char*>(data), size));
    ASSERT_TRUE(meta->findData('svdt', &type, &data, &size));
    EXPECT_EQ(std::string("\x01\x02\x03\x00", 4), std::string(static_cast<const char*>(data), size));

    int64_t bookmark = 0;
    EXPECT_FALSE(extractor->getTrackMetaData(0)->findInt64('bkSz', &bookmark));
    ASSERT_TRUE(extractor->getTrackMetaData(1)->findInt64('bkSz', &bookmark));
    EXPECT_EQ(4096, bookmark);
    int32_t bitrate = 0;
    ASSERT_TRUE(extractor->getTrackMetaData(1)->findInt32(kKeyBitRate, &bitrate));
    EXPECT_EQ(96000, bitrate);
}

TEST(MPEG4TablesTest, OtherTracksAreLeftOutAndAFileOfNoneIsRefused) {
    File f = AudioVideoFile();
    f.tracks[0].handler = "text";
    sp<IMediaExtractor> extractor = OpenBytes(Build(f));
    ASSERT_NE(nullptr, extractor);
    ASSERT_EQ(1u, extractor->countTracks());
    const char* mime = nullptr;
    ASSERT_TRUE(extractor->getTrackMetaData(0)->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(MEDIA_MIMETYPE_AUDIO_AAC, mime);
    EXPECT_EQ(nullptr, extractor->getTrack(1));
    EXPECT_EQ(nullptr, extractor->getTrackMetaData(1));

    f.tracks[1].sampleEntry = AudioEntry("Opus", 2, 48000, "");
    EXPECT_EQ(nullptr, OpenBytes(Build(f)));
}

// The cursor's step-by-step walk and its direct seek must agree everywhere,
// across chunk runs that skip chunks without samples.
TEST(MPEG4TablesTest, CursorSeekAgreesWithStepping) {
    using mpeg4::SampleCursor;
    using mpeg4::SampleTable;
    const uint32_t kSamples = 23;
    std::string sizes, stts, ctts, stss;
    for (uint32_t i = 0; i < kSamples; ++i) sizes += BE32(100 + i);
    stts = BE32(3) + BE32(3) + BE32(5) + BE32(7) + BE32(4) + BE32(1) + BE32(9);  // covers 11 of 23
    ctts = BE32(2) + BE32(4) + BE32(2) + BE32(6) + BE32(uint32_t(-1));
    stss = BE32(3) + BE32(1) + BE32(9) + BE32(40);
    // Chunks 1-2 hold 3 samples, 3-4 none, 5 two, 6 onwards one each.
    std::string stsc = BE32(4) + BE32(1) + BE32(3) + BE32(1) + BE32(3) + BE32(0) + BE32(1) + BE32(5) + BE32(2) +
                       BE32(1) + BE32(6) + BE32(1) + BE32(1);
    std::string stco = BE32(30);
    for (uint32_t c = 0; c < 30; ++c) stco += BE32(10000 * (c + 1));
    auto reader = [](const std::string& s) { return ByteReader(reinterpret_cast<const uint8_t*>(s.data()), s.size()); };
    const std::string fullBox(4, '\0');
    const std::string stszBox = fullBox + BE32(0) + BE32(kSamples) + sizes, sttsBox = fullBox + stts,
                      cttsBox = fullBox + ctts, stssBox = fullBox + stss, stscBox = fullBox + stsc,
                      stcoBox = fullBox + stco;
    SampleTable table;
    ASSERT_EQ(OK, table.setSampleSizes('stsz', reader(stszBox)));
    ASSERT_EQ(OK, table.setTimeToSample(reader(sttsBox)));
    ASSERT_EQ(OK, table.setCompositionOffsets(reader(cttsBox)));
    ASSERT_EQ(OK, table.setSyncSamples(reader(stssBox)));
    ASSERT_EQ(OK, table.setSampleToChunk(reader(stscBox)));
    ASSERT_EQ(OK, table.setChunkOffsets('stco', reader(stcoBox)));
    ASSERT_EQ(OK, table.finish());
    ASSERT_EQ(2u, table.syncCount());

    SampleCursor walk(table), jump(table);
    ASSERT_TRUE(walk.seek(0));
    for (uint32_t i = 0; i < kSamples; ++i, walk.advance()) {
        SCOPED_TRACE(i);
        ASSERT_TRUE(walk.valid());
        ASSERT_TRUE(jump.seek(i));
        EXPECT_EQ(jump.info().offset, walk.info().offset);
        EXPECT_EQ(100 + i, walk.info().size);
        EXPECT_EQ(jump.info().dts, walk.info().dts);
        EXPECT_EQ(jump.info().ctsOffset, walk.info().ctsOffset);
        EXPECT_EQ(i == 0 || i == 8, walk.info().sync);
    }
    EXPECT_FALSE(walk.valid());
    // Spot checks against the layout worked out by hand.
    ASSERT_TRUE(jump.seek(4));
    EXPECT_EQ(20000u + 103, jump.info().offset);
    EXPECT_EQ(19, jump.info().dts);
    EXPECT_EQ(-1, jump.info().ctsOffset);
    ASSERT_TRUE(jump.seek(7));
    EXPECT_EQ(50000u + 106, jump.info().offset);
    ASSERT_TRUE(jump.seek(22));
    EXPECT_EQ(200000u, jump.info().offset);
    EXPECT_EQ(151, jump.info().dts);
    EXPECT_EQ(151 + 9, table.endDts());
    EXPECT_FALSE(jump.seek(kSamples));
}

}  // namespace
