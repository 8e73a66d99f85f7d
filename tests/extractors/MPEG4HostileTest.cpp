// Truncated, corrupted and lying files: the extractor refuses them or fails
// the affected reads, and never reads or allocates beyond what the file holds.

#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "MPEG4TestFile.h"
#include "MPEG4TestRead.h"

using namespace android;
using namespace mp4test;

namespace {

// Opens the bytes and reads every track to its end; answers whether the file
// was accepted. Reads are capped so a corrupt index cannot make this slow.
bool OpenAndDrain(const std::string& bytes, size_t* bytesRead = nullptr) {
    LogCapture quiet;
    sp<IMediaExtractor> extractor = OpenBytes(bytes);
    if (extractor == nullptr) return false;
    EXPECT_GT(extractor->countTracks(), 0u);
    size_t total = 0;
    for (size_t i = 0; i < extractor->countTracks(); ++i) {
        sp<IMediaSource> source = extractor->getTrack(i);
        EXPECT_NE(nullptr, source->getFormat());
        EXPECT_EQ(OK, source->start());
        Read r;
        for (int n = 0; n < 2000; ++n) {
            const status_t err = ReadOne(source, &r);
            if (err == ERROR_END_OF_STREAM) break;
            if (err == OK) total += r.bytes.size();
        }
        source->stop();
    }
    if (bytesRead != nullptr) *bytesRead = total;
    return true;
}

uint32_t Be32At(const std::string& s, size_t at) {
    return (uint32_t(uint8_t(s[at])) << 24) | (uint32_t(uint8_t(s[at + 1])) << 16) |
           (uint32_t(uint8_t(s[at + 2])) << 8) | uint8_t(s[at + 3]);
}

void Put32(std::string* s, size_t at, uint32_t v) { s->replace(at, 4, BE32(v)); }

TEST(MPEG4HostileTest, TruncatedFilesAreRefusedOrFailTheirReads) {
    const std::string whole = ReadFile(MediaPath("avc_aac_faststart.mp4"));
    const size_t moov = FindBox(whole, "moov");
    ASSERT_NE(std::string::npos, moov);
    const size_t moovEnd = moov + Be32At(whole, moov);
    size_t fullBytes = 0;
    ASSERT_TRUE(OpenAndDrain(whole, &fullBytes));
    for (size_t n = 0; n < whole.size(); n += n < moovEnd + 64 ? 1 : 97) {
        SCOPED_TRACE(n);
        size_t got = 0;
        const bool opened = OpenAndDrain(whole.substr(0, n), &got);
        EXPECT_EQ(n >= moovEnd, opened);
        EXPECT_LE(got, n);
    }

    // With the index at the end, any cut loses it.
    const std::string tail = ReadFile(MediaPath("avc_aac.mp4"));
    for (size_t n = 0; n < tail.size(); n += 13) EXPECT_FALSE(OpenAndDrain(tail.substr(0, n))) << n;
}

TEST(MPEG4HostileTest, CorruptIndexBytesNeverCrash) {
    const std::string whole = ReadFile(MediaPath("avc_aac_faststart.mp4"));
    const size_t moov = FindBox(whole, "moov");
    const size_t moovEnd = moov + Be32At(whole, moov);
    for (size_t at = moov; at < moovEnd; ++at) {
        for (uint8_t value : {uint8_t(whole[at] ^ 0xFF), uint8_t(0), uint8_t(whole[at] + 1)}) {
            std::string bad = whole;
            bad[at] = char(value);
            OpenAndDrain(bad);
        }
    }
}

File SmallFile() {
    File f;
    Track t;
    t.sampleEntry = AvcEntry(4);
    for (int i = 0; i < 6; ++i) t.samples.push_back({NalSample({"\x65\x88\x80"}, 4), 10, 0, i == 0});
    f.tracks.push_back(t);
    return f;
}

// Where the entry count (or first field) of a table box sits.
size_t FieldOf(const std::string& file, const std::string& box, size_t fieldIndex) {
    const size_t at = FindBox(file, box);
    EXPECT_NE(std::string::npos, at) << box;
    return at + 12 + 4 * fieldIndex;
}

TEST(MPEG4HostileTest, CountsBeyondTheirBoxAreRefused) {
    const std::string good = Build(SmallFile());
    ASSERT_TRUE(OpenAndDrain(good));
    const struct {
        const char* box;
        size_t field;
    } kCounts[] = {{"stts", 0}, {"ctts", 0}, {"stss", 0}, {"stsc", 0}, {"stsz", 1}, {"stco", 0}};
    for (const auto& c : kCounts) {
        for (uint32_t count : {0xFFFFFFFFu, 0x40000000u, 1000u}) {
            SCOPED_TRACE(testing::Message() << c.box << " " << count);
            std::string bad = good;
            Put32(&bad, FieldOf(bad, c.box, c.field), count);
            EXPECT_EQ(nullptr, OpenBytes(bad));
        }
    }
    // A constant sample size with a huge count: nothing is allocated per
    // sample, and the chunks cannot hold that many.
    std::string fixed = good;
    Put32(&fixed, FieldOf(fixed, "stsz", 0), 1000);
    Put32(&fixed, FieldOf(fixed, "stsz", 1), 0xFFFFFFFF);
    EXPECT_EQ(nullptr, OpenBytes(fixed));
}

TEST(MPEG4HostileTest, SamplesOutsideTheFileFailTheirRead) {
    File f = SmallFile();
    f.tracks[0].samplesPerChunk = 1;
    std::string bad = Build(f);
    Put32(&bad, FieldOf(bad, "stco", 2), 0xFFFFFF00);   // second chunk
    Put32(&bad, FieldOf(bad, "stsz", 2 + 3), 0x100000);  // fourth sample: 1 MB in a tiny file
    sp<IMediaSource> source = OpenBytes(bad)->getTrack(0);
    ASSERT_EQ(OK, source->start());
    const status_t kExpected[] = {OK, ERROR_MALFORMED, OK, ERROR_MALFORMED, OK, OK, ERROR_END_OF_STREAM};
    for (status_t want : kExpected) {
        Read r;
        EXPECT_EQ(want, ReadOne(source, &r));
    }
}

TEST(MPEG4HostileTest, ImpossibleHeadersAreRefused) {
    const std::string good = Build(SmallFile());
    std::string bad = good;
    Put32(&bad, FieldOf(bad, "mdhd", 2), 0);  // timescale
    EXPECT_EQ(nullptr, OpenBytes(bad));

    bad = good;
    Put32(&bad, FieldOf(bad, "stsz", 2), 0x7FFFFFFF);  // a 2 GB sample
    EXPECT_EQ(nullptr, OpenBytes(bad));

    bad = good;
    Put32(&bad, FindBox(bad, "moov"), 0x7FFFFFF0);  // index larger than the file
    EXPECT_EQ(nullptr, OpenBytes(bad));

    bad = good;
    Put32(&bad, FindBox(bad, "trak"), 3);  // size smaller than a header
    EXPECT_EQ(nullptr, OpenBytes(bad));

    bad = good;
    const size_t avcc = FindBox(bad, "avcC");
    bad[avcc + 8] = 2;  // unknown record version
    EXPECT_EQ(nullptr, OpenBytes(bad));
}

TEST(MPEG4HostileTest, NonFilesAreNotSniffed) {
    for (const std::string& bytes :
         {std::string(), std::string("\0\0\0\x08", 4), std::string(4096, '\0'), std::string("RIFF\0\0\0\0WAVE", 12),
          Box("free", std::string(100, 'x')) + Box("free", "")}) {
        sp<DataSource> source = new BufferDataSource(bytes.data(), bytes.size());
        EXPECT_EQ(nullptr, CreateMPEG4Extractor(source));
    }
    std::string manyBoxes;
    for (int i = 0; i < 5000; ++i) manyBoxes += Box("free", "");
    EXPECT_EQ(nullptr, OpenBytes(manyBoxes + Build(SmallFile())));
    // A box with a 64-bit size in front is walked over like any other; the
    // chunk offsets do not know about it, so only the index is checked.
    EXPECT_NE(nullptr, OpenBytes(BE32(1) + "free" + BE64(20) + "abcd" + Build(SmallFile())));
}

}  // namespace
