// What extractors say of a track from its index alone (sample and sync-sample
// counts, where a file cut short stops) against what reading the track gives.

#include <gtest/gtest.h>

#include <filesystem>

#include <media/stagefright/MediaExtractorFactory.h>

#include "extractor/SeekPolicy.h"
#include "extractor/Sniffers.h"
#include "extractors/AudioMediaFacts.h"
#include "flac/FLACExtractor.h"

using namespace android;
using namespace audiotest;

namespace {

struct Counted {
    int64_t samples = 0, syncs = 0;
    int64_t lastDecodingUs = -1;  // of the last sample read
    status_t end = OK;
};

Counted ReadCounting(const sp<IMediaExtractor>& extractor, size_t track) {
    Counted c;
    sp<IMediaSource> source = extractor->getTrack(track);
    if (source == nullptr || (c.end = source->start()) != OK) return c;
    MediaBufferBase* buffer;
    while ((c.end = source->read(&buffer)) == OK) {
        int32_t sync = 0;
        ++c.samples;
        if (buffer->meta_data().findInt32(kKeyIsSyncFrame, &sync) && sync) ++c.syncs;
        if (!buffer->meta_data().findInt64(kKeyDecodingTime, &c.lastDecodingUs)) {
            buffer->meta_data().findInt64(kKeyTime, &c.lastDecodingUs);
        }
        buffer->release();
    }
    source->stop();
    return c;
}

int64_t Key(const sp<MetaData>& meta, uint32_t key) {
    int64_t v = -1;
    return meta != nullptr && meta->findInt64(key, &v) ? v : -1;
}

std::vector<std::string> FilesIn(const std::string& dir, std::initializer_list<const char*> extensions) {
    std::vector<std::string> files;
    for (const auto& e : std::filesystem::directory_iterator(std::string(ME_TEST_MEDIA_DIR) + "/" + dir)) {
        for (const char* ext : extensions) {
            if (e.path().extension() == ext) files.push_back(dir + "/" + e.path().filename().string());
        }
    }
    std::sort(files.begin(), files.end());
    return files;
}

// Every track's counts against a read of it; `needCounts` when the format
// always has them.
void ExpectCountsMatchReads(const sp<IMediaExtractor>& extractor, bool needCounts) {
    for (size_t t = 0; t < extractor->countTracks(); ++t) {
        SCOPED_TRACE("track " + std::to_string(t));
        sp<MetaData> meta = extractor->getTrackMetaData(t, 0);
        const int64_t samples = Key(meta, kKeySampleCount), syncs = Key(meta, kKeySyncSampleCount);
        EXPECT_EQ(Key(meta, kKeyTruncatedAtUs), -1);
        if (samples < 0) {
            EXPECT_FALSE(needCounts);
            continue;
        }
        const Counted read = ReadCounting(extractor, t);
        EXPECT_EQ(read.end, ERROR_END_OF_STREAM);
        EXPECT_EQ(samples, read.samples);
        EXPECT_EQ(syncs, read.syncs);
    }
}

}  // namespace

TEST(IndexFactsTest, CountsAreWhatReadingTheTrackGives) {
    std::vector<std::string> files = FilesIn("mp4", {".mp4", ".m4a", ".mov", ".3gp"});
    for (const std::string& f : FilesIn("audio", {".flac", ".wav"})) files.push_back(f);
    ASSERT_GT(files.size(), 15u);
    for (const std::string& file : files) {
        SCOPED_TRACE(file);
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(OpenMedia(file));
        if (extractor == nullptr) continue;  // files kept to be refused
        // FLAC of one block size, every MP4 and WAVE; vbs.flac would need its frames read.
        const bool flac = file.size() > 5 && file.compare(file.size() - 5, 5, ".flac") == 0;
        ExpectCountsMatchReads(extractor, file != "audio/vbs.flac");
        if (flac) {
            extractor->setOutputFormatFlag(FLACExtractor::kFlacRawOutput);
            ExpectCountsMatchReads(extractor, file != "audio/vbs.flac");
        }
    }
}

// A file cut inside its media data: the track whose samples run past the end
// says so, at the decoding time of the first sample a read cannot give.
TEST(IndexFactsTest, Mp4CutShortSaysWhereEachTrackStops) {
    const std::vector<uint8_t> whole = ReadFile("mp4/avc_aac_faststart.mp4");
    ASSERT_FALSE(whole.empty());
    for (size_t percent : {35, 60, 90, 99}) {
        SCOPED_TRACE(percent);
        const std::vector<uint8_t> cut(whole.begin(), whole.begin() + whole.size() * percent / 100);
        sp<IMediaExtractor> extractor = CreateMPEG4Extractor(MemorySource(cut));
        ASSERT_NE(extractor, nullptr);
        int stopped = 0;
        for (size_t t = 0; t < extractor->countTracks(); ++t) {
            const int64_t at = Key(extractor->getTrackMetaData(t, 0), kKeyTruncatedAtUs);
            const Counted read = ReadCounting(extractor, t);
            EXPECT_EQ(at >= 0, read.end != ERROR_END_OF_STREAM) << "track " << t;
            if (at < 0) continue;
            ++stopped;
            EXPECT_LT(read.lastDecodingUs, at) << "track " << t;
        }
        EXPECT_GT(stopped, 0);
    }
}

TEST(IndexFactsTest, FlacEndIsFoundFromTheTail) {
    const std::vector<uint8_t> whole = ReadFile("b4096.flac");
    const std::vector<Packet> frames = Packets("b4096.flac");
    ASSERT_GE(frames.size(), 2u);
    const size_t lastFrame = frames.back().size;
    const int64_t lastStartUs = TicksToUs(frames.back().pts, 44100);
    const int64_t wholeUs = TicksToUs(44100, 44100);

    std::vector<uint8_t> tagged = whole;
    std::vector<uint8_t> tag(128, ' ');
    memcpy(tag.data(), "TAG", 3);
    tagged.insert(tagged.end(), tag.begin(), tag.end());
    // STREAMINFO without a total: the 36 bits after the sample format.
    std::vector<uint8_t> noTotal = whole;
    noTotal[8 + 13] &= 0xF0;
    std::fill(noTotal.begin() + 8 + 14, noTotal.begin() + 8 + 18, 0);
    // Past a bounded tail the end is not looked for: taken as whole.
    std::vector<uint8_t> trailer = whole;
    trailer.resize(whole.size() + 17 * 1024 * 1024);
    const size_t firstFrame = static_cast<size_t>(FactInt("b4096.flac", "frame_offset"));

    const struct {
        const char* name;
        std::vector<uint8_t> bytes;
        int64_t truncatedAtUs;  // -1: whole
    } kCases[] = {
        {"whole", whole, -1},
        {"ID3v1 tag after the frames", tagged, -1},
        {"no total in STREAMINFO", noTotal, -1},
        {"cut inside the last frame", {whole.begin(), whole.end() - lastFrame / 2}, lastStartUs},
        {"cut before the last frame", {whole.begin(), whole.end() - lastFrame}, lastStartUs},
        {"no whole frame", {whole.begin(), whole.begin() + firstFrame + 100}, 0},
        {"a long trailer", trailer, -1},
    };
    for (const auto& c : kCases) {
        SCOPED_TRACE(c.name);
        sp<IMediaExtractor> extractor = CreateFLACExtractor(MemorySource(c.bytes));
        ASSERT_NE(extractor, nullptr);
        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        EXPECT_EQ(Key(meta, kKeyDuration), wholeUs);
        EXPECT_EQ(Key(meta, kKeySampleCount), int64_t(frames.size()));
        EXPECT_EQ(Key(meta, kKeyTruncatedAtUs), c.truncatedAtUs);
    }
}
