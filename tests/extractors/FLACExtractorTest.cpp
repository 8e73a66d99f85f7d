#include <gtest/gtest.h>

#include <cstring>
#include <set>

#include <media/stagefright/MediaDefs.h>

#include "extractor/DeviceKeys.h"
#include "extractor/Sniffers.h"
#include "LogCapture.h"
#include "extractors/AudioMediaFacts.h"
#include "wrapper/WrapperMedia.h"

using namespace android;
using namespace audiotest;

namespace {

typedef MediaTrack::ReadOptions O;
// vbs.flac has variable block sizes (sync code 0xFFF9, coded sample numbers).
const char* const kFlacFiles[] = {"b4096.flac", "b1152.flac", "s24.flac", "items.flac", "vbs.flac"};

sp<IMediaExtractor> Open(const std::string& file, uint32_t flag = 0) {
    sp<IMediaExtractor> extractor = CreateFLACExtractor(OpenMedia(file));
    if (extractor != nullptr && flag != 0) extractor->setOutputFormatFlag(flag);
    return extractor;
}

std::vector<Sample> ReadTrack(const sp<IMediaExtractor>& extractor, status_t* end = nullptr,
                              const O* first = nullptr, size_t limit = 1000000) {
    std::vector<Sample> samples;
    sp<IMediaSource> track = extractor->getTrack(0);
    if (track == nullptr || track->start() != OK) return samples;
    const status_t err = ReadSamples(track, &samples, limit, first);
    if (end != nullptr) *end = err;
    return samples;
}

std::vector<uint8_t> DataOf(const sp<MetaData>& meta, uint32_t key) {
    uint32_t type;
    const void* data;
    size_t size;
    if (!meta->findData(key, &type, &data, &size)) return {};
    return std::vector<uint8_t>(static_cast<const uint8_t*>(data), static_cast<const uint8_t*>(data) + size);
}

}  // namespace

TEST(FLACExtractorTest, DecodesToThePcmOfTheReferenceDecoder) {
    for (const char* file : kFlacFiles) {
        SCOPED_TRACE(file);
        sp<IMediaExtractor> extractor = Open(file);
        ASSERT_NE(extractor, nullptr);
        const int32_t rate = FactInt(file, "rate"), bits = FactInt(file, "bits");
        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        const char* mime;
        int32_t v;
        int64_t duration;
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_RAW);
        EXPECT_TRUE(meta->findInt32(kKeySampleRate, &v) && v == rate);
        EXPECT_TRUE(meta->findInt32(kKeyChannelCount, &v) && v == FactInt(file, "channels"));
        EXPECT_TRUE(meta->findInt32(kKeyBitsPerSample, &v) && v == bits);
        EXPECT_TRUE(meta->findInt32(kKeyDeviceBitsPerSample, &v) && v == bits);
        EXPECT_TRUE(meta->findInt32(kKeyPcmEncoding, &v) && v == (bits == 16 ? 2 : 100));
        EXPECT_TRUE(meta->findInt32(kKeyBitRate, &v) && v > 0);
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &duration));
        EXPECT_EQ(duration, FactInt(file, "frames") * 1000000 / rate);

        // STREAMINFO as stored, and as the only block behind "fLaC".
        const std::vector<uint8_t> bytes = ReadFile(file);
        const std::vector<uint8_t> raw = DataOf(meta, kKeyFlacStreamInfoRaw);
        EXPECT_EQ(raw, std::vector<uint8_t>(bytes.begin() + 4, bytes.begin() + 42));
        std::vector<uint8_t> header(bytes.begin(), bytes.begin() + 42);
        header[4] |= 0x80;
        EXPECT_EQ(DataOf(meta, kKeyFlacMetadata), header);

        status_t end;
        const std::vector<Sample> samples = ReadTrack(extractor, &end);
        EXPECT_EQ(end, ERROR_END_OF_STREAM);
        EXPECT_EQ(Hex64(Fnv(Concat(samples))), Fact(file, "pcm_fnv"));
        const std::vector<Packet> packets = Packets(file);
        ASSERT_EQ(samples.size(), packets.size());
        const size_t frameBytes = FactInt(file, "channels") * bits / 8;
        for (size_t i = 0; i < samples.size(); ++i) {
            ASSERT_EQ(samples[i].timeUs, packets[i].pts * 1000000 / rate) << i;
            ASSERT_EQ(samples[i].bytes.size(), packets[i].duration * frameBytes) << i;
        }
    }
}

TEST(FLACExtractorTest, RawOutputHandsOutTheStoredFramesOneBySample) {
    for (const char* file : kFlacFiles) {
        SCOPED_TRACE(file);
        sp<IMediaExtractor> extractor = Open(file, 5);
        ASSERT_NE(extractor, nullptr);
        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        const char* mime;
        int32_t maxInput;
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_FLAC);
        ASSERT_TRUE(meta->findInt32(kKeyMaxInputSize, &maxInput));

        status_t end;
        const std::vector<Sample> samples = ReadTrack(extractor, &end);
        EXPECT_EQ(end, ERROR_END_OF_STREAM);
        const std::vector<Packet> packets = Packets(file);
        ASSERT_EQ(samples.size(), packets.size());
        const int64_t rate = FactInt(file, "rate");
        for (size_t i = 0; i < samples.size(); ++i) {
            ASSERT_EQ(samples[i].bytes.size(), packets[i].size) << i;
            ASSERT_LE(samples[i].bytes.size(), static_cast<size_t>(maxInput));
            ASSERT_EQ(samples[i].timeUs, packets[i].pts * 1000000 / rate) << i;
            ASSERT_EQ(samples[i].sync, 1);
        }
        const std::vector<uint8_t> bytes = ReadFile(file);
        const size_t frames = FactInt(file, "frame_offset");
        EXPECT_EQ(Concat(samples), std::vector<uint8_t>(bytes.begin() + frames, bytes.end()));
    }
}

TEST(FLACExtractorTest, SyncPatternsInsideFramesDoNotSplitThem) {
    // The noisy test signal puts sync patterns inside frame data; make sure
    // the files really exercise that.
    size_t inside = 0;
    for (const char* file : kFlacFiles) {
        for (const Sample& s : ReadTrack(Open(file, 5))) {
            for (size_t i = 1; i + 1 < s.bytes.size(); ++i) {
                if (s.bytes[i] == 0xFF && (s.bytes[i + 1] & 0xFE) == 0xF8) ++inside;
            }
        }
    }
    EXPECT_GT(inside, 0u);
}

TEST(FLACExtractorTest, OutputFlagOnlyAffectsTracksObtainedAfterIt) {
    sp<IMediaExtractor> extractor = Open("b1152.flac");
    sp<IMediaSource> pcm = extractor->getTrack(0);
    extractor->setOutputFormatFlag(1);  // raw audio is PCM too
    const char* mime;
    sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
    ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_RAW);
    extractor->setOutputFormatFlag(5);
    sp<IMediaSource> raw = extractor->getTrack(0);
    sp<MetaData> pcmFormat = pcm->getFormat(), rawFormat = raw->getFormat();
    ASSERT_TRUE(pcmFormat->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_RAW);
    ASSERT_TRUE(rawFormat->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(mime, MEDIA_MIMETYPE_AUDIO_FLAC);
}

TEST(FLACExtractorTest, SeeksInBothOutputForms) {
    const std::vector<Packet> packets = Packets("b1152.flac");
    const std::vector<Sample> frames = ReadTrack(Open("b1152.flac", 5));
    ASSERT_EQ(frames.size(), packets.size());
    // Frame 7 starts at sample 8064 (365714 us), frame 8 at 9216 (417959 us).
    auto rawSeek = [&](int64_t t, O::SeekMode mode) {
        O options;
        options.setSeekTo(t, mode);
        const std::vector<Sample> s = ReadTrack(Open("b1152.flac", 5), nullptr, &options, 1);
        return s.empty() ? std::vector<uint8_t>() : s[0].bytes;
    };
    EXPECT_EQ(rawSeek(380000, O::SEEK_PREVIOUS_SYNC), frames[7].bytes);
    EXPECT_EQ(rawSeek(380000, O::SEEK_NEXT_SYNC), frames[8].bytes);
    EXPECT_EQ(rawSeek(380000, O::SEEK_CLOSEST_SYNC), frames[7].bytes);
    EXPECT_EQ(rawSeek(400000, O::SEEK_CLOSEST), frames[8].bytes);
    EXPECT_EQ(rawSeek(365714, O::SEEK_NEXT_SYNC), frames[7].bytes);
    EXPECT_EQ(rawSeek(0, O::SEEK_NEXT_SYNC), frames[0].bytes);
    EXPECT_EQ(rawSeek(frames.back().timeUs + 1, O::SEEK_PREVIOUS_SYNC), frames.back().bytes);
    EXPECT_TRUE(rawSeek(5000000, O::SEEK_PREVIOUS_SYNC).empty());

    // PCM starts at the sample the mode picks, with the bytes of a full decode.
    const std::vector<uint8_t> pcm = Concat(ReadTrack(Open("b1152.flac")));
    for (int64_t t : {0LL, 380000LL, 417959LL, 999000LL}) {
        O options;
        options.setSeekTo(t, O::SEEK_PREVIOUS_SYNC);
        const std::vector<Sample> s = ReadTrack(Open("b1152.flac"), nullptr, &options, 2);
        ASSERT_FALSE(s.empty()) << t;
        const int64_t sample = t * 22050 / 1000000;
        EXPECT_EQ(s[0].timeUs, sample * 1000000 / 22050) << t;
        ASSERT_LE((sample + 1) * 2, static_cast<int64_t>(pcm.size()));
        EXPECT_TRUE(std::equal(s[0].bytes.begin(), s[0].bytes.end(), pcm.begin() + sample * 2)) << t;
    }
}

TEST(FLACExtractorTest, VariableBlockSizesSeekBySampleNumber) {
    const std::vector<Packet> packets = Packets("vbs.flac");
    const std::vector<Sample> frames = ReadTrack(Open("vbs.flac", 5));
    ASSERT_EQ(frames.size(), packets.size());
    std::set<int64_t> sizes;
    for (size_t i = 0; i < frames.size(); ++i) {
        ASSERT_GE(frames[i].bytes.size(), 2u);
        EXPECT_EQ(0xF9, frames[i].bytes[1]) << i;
        sizes.insert(packets[i].duration);
    }
    EXPECT_GE(sizes.size(), 10u);  // the file really mixes block sizes

    // Seeking to the middle of each frame: the raw form lands on that frame,
    // the PCM form on the very sample, with the bytes of a full decode.
    const std::vector<uint8_t> pcm = Concat(ReadTrack(Open("vbs.flac")));
    const size_t frameBytes = 4;
    for (size_t i = 0; i < packets.size(); ++i) {
        const int64_t t = (packets[i].pts + packets[i].duration / 2) * 1000000 / 44100;
        O options;
        options.setSeekTo(t, O::SEEK_PREVIOUS_SYNC);
        const std::vector<Sample> raw = ReadTrack(Open("vbs.flac", 5), nullptr, &options, 1);
        ASSERT_EQ(raw.size(), 1u) << i;
        EXPECT_EQ(raw[0].bytes, frames[i].bytes) << i;
        EXPECT_EQ(raw[0].timeUs, frames[i].timeUs) << i;

        const std::vector<Sample> decoded = ReadTrack(Open("vbs.flac"), nullptr, &options, 1);
        ASSERT_EQ(decoded.size(), 1u) << i;
        const int64_t sample = t * 44100 / 1000000;
        EXPECT_EQ(decoded[0].timeUs, sample * 1000000 / 44100) << i;
        ASSERT_LE(sample * frameBytes + decoded[0].bytes.size(), pcm.size()) << i;
        EXPECT_TRUE(std::equal(decoded[0].bytes.begin(), decoded[0].bytes.end(), pcm.begin() + sample * frameBytes)) << i;
    }
}

TEST(FLACExtractorTest, VariableBlockSizesAreNotOfferedForLosslessTrim) {
    // Renumbering frames needs one block size; these frames are still read.
    LogCapture log;
    sp<wrappertest::QNMediaExtractorWrapper> wrapper = wrappertest::OpenWrapper(MediaPath("vbs.flac"));
    ASSERT_NE(wrapper, nullptr);
    ASSERT_EQ(OK, wrapper->setOutputFormatFlag(5));
    ASSERT_EQ(OK, wrapper->setFlacRaw(true));
    sp<AMessage> format;
    ASSERT_EQ(OK, wrapper->getTrackFormat(0, &format));
    int32_t trim = 0;
    EXPECT_FALSE(format->findInt32("editor-flactrim", &trim));
    EXPECT_TRUE(log.contains("not support flac raw format"));

    ASSERT_EQ(OK, wrapper->selectTrack(0));
    const std::vector<wrappertest::Delivered> frames = wrappertest::ReadAll(wrapper);
    const std::vector<Packet> packets = Packets("vbs.flac");
    ASSERT_EQ(frames.size(), packets.size());
    for (size_t i = 0; i < frames.size(); ++i) EXPECT_EQ(frames[i].timeUs, packets[i].pts * 1000000 / 44100) << i;
}

TEST(FLACExtractorTest, PublishesTheDeviceBlocks) {
    sp<IMediaExtractor> extractor = Open("items.flac");
    ASSERT_NE(extractor, nullptr);
    sp<MetaData> file = extractor->getMetaData();
    EXPECT_EQ(DataOf(file, kKeyDeviceWaveForm), (std::vector<uint8_t>{0x00, 0x01, 0xFF, 0xFE, 0x7F, 0xFF}));
    const char* text;
    ASSERT_TRUE(file->findCString(kKeyDeviceUserMessage, &text));
    EXPECT_STREQ(text, "hello-device");
    ASSERT_TRUE(file->findCString(kKeyDeviceRecMode, &text));
    EXPECT_STREQ(text, "vr180");
    ASSERT_TRUE(file->findCString(kKeyMIMEType, &text));
    EXPECT_STREQ(text, MEDIA_MIMETYPE_CONTAINER_FLAC);
    int64_t bookmark;
    ASSERT_TRUE(extractor->getTrackMetaData(0, 0)->findInt64(kKeyDeviceBookmarkSize, &bookmark));
    EXPECT_EQ(bookmark, 4660);
}

TEST(FLACExtractorTest, RawFramesSurviveTrailingTagsAndDamagedFrames) {
    const std::vector<Sample> frames = ReadTrack(Open("b1152.flac", 5));
    std::vector<uint8_t> bytes = ReadFile("b1152.flac");
    // A tag after the last frame: the last frame still comes out whole.
    std::vector<uint8_t> tagged = bytes;
    tagged.insert(tagged.end(), {'T', 'A', 'G'});
    tagged.resize(tagged.size() + 125, ' ');
    sp<IMediaExtractor> extractor = CreateFLACExtractor(MemorySource(tagged));
    extractor->setOutputFormatFlag(5);
    std::vector<Sample> got = ReadTrack(extractor);
    ASSERT_EQ(got.size(), frames.size());
    EXPECT_EQ(got.back().bytes, frames.back().bytes);

    // A damaged frame is skipped, never handed out; the rest keep their times.
    const size_t offset = FactInt("b1152.flac", "frame_offset");
    size_t fifth = offset;
    for (int i = 0; i < 5; ++i) fifth += frames[i].bytes.size();
    bytes[fifth + 100] ^= 0x10;
    extractor = CreateFLACExtractor(MemorySource(bytes));
    extractor->setOutputFormatFlag(5);
    got = ReadTrack(extractor);
    ASSERT_EQ(got.size(), frames.size() - 1);
    for (size_t i = 0; i < got.size(); ++i) {
        const size_t j = i < 5 ? i : i + 1;
        EXPECT_EQ(got[i].bytes, frames[j].bytes) << i;
        EXPECT_EQ(got[i].timeUs, frames[j].timeUs) << i;
    }
    // Decoding the same file reports the damage instead of passing it on.
    status_t end;
    got = ReadTrack(CreateFLACExtractor(MemorySource(bytes)), &end);
    EXPECT_EQ(end, ERROR_MALFORMED);
    EXPECT_EQ(got.size(), 5u);
}

TEST(FLACExtractorTest, RefusesUnusableStreamInfo) {
    const std::vector<uint8_t> good = ReadFile("b1152.flac");
    auto patched = [&](size_t at, uint8_t value) {
        std::vector<uint8_t> copy = good;
        copy[at] = value;
        return CreateFLACExtractor(MemorySource(copy));
    };
    EXPECT_EQ(patched(4, 0x01), nullptr);                     // first block is not STREAMINFO
    EXPECT_EQ(patched(7, 33), nullptr);                       // STREAMINFO of the wrong length
    EXPECT_EQ(patched(10, 0), nullptr);                       // largest block size 0
    EXPECT_EQ(CreateFLACExtractor(MemorySource(std::vector<uint8_t>(good.begin(), good.begin() + 20))), nullptr);
}

TEST(FLACExtractorTest, SurvivesTruncationAndCorruption) {
    const std::vector<uint8_t> bytes = ReadFile("items.flac");
    ExerciseHostileCopies(bytes, 200, 499, CreateFLACExtractor);
    ExerciseHostileCopies(bytes, 200, 499, CreateFLACExtractor,
                          [](IMediaExtractor* e) { e->setOutputFormatFlag(5); });
}

TEST(FLACExtractorTest, HeadersThatLeadNowhereCostBoundedWork) {
    // Metadata, then one frame header repeated over and over: every copy
    // parses, none is followed by a frame end. STREAMINFO claims the largest
    // blocks and no known frame size, so each candidate may be scanned far.
    std::vector<uint8_t> bytes = ReadFile("b1152.flac");
    const size_t frames = FactInt("b1152.flac", "frame_offset");
    bytes[8 + 2] = 0xFF;  // largest block size 65535
    bytes[8 + 3] = 0xFF;
    bytes[8 + 7] = bytes[8 + 8] = bytes[8 + 9] = 0;  // largest frame size unknown
    std::vector<uint8_t> hostile(bytes.begin(), bytes.begin() + frames);
    // Frame 0 of 65535 samples at 22050 Hz, mono, 16 bits, with its CRC-8.
    const uint8_t frameHeader[] = {0xFF, 0xF8, 0x76, 0x08, 0x00, 0xFF, 0xFE, 0x72};
    for (int i = 0; i < 50000; ++i) hostile.insert(hostile.end(), frameHeader, frameHeader + sizeof(frameHeader));
    sp<IMediaExtractor> extractor = CreateFLACExtractor(MemorySource(hostile));
    ASSERT_NE(extractor, nullptr);
    extractor->setOutputFormatFlag(5);
    status_t end;
    const std::vector<Sample> samples = ReadTrack(extractor, &end, nullptr, 10);
    EXPECT_NE(end, OK);
}
