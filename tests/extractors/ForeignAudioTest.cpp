// Audio as other producers write it (tests/media/gen/foreign_audio.sh):
// RF64/BW64 and pipe-written WAVE, G.711 WAVE, ID3-tagged FLAC, chained Ogg
// Vorbis and real recordings, compared with what ffmpeg, flac and ffprobe
// make of them; and refusals that say why.
#include <gtest/gtest.h>

#include <cstring>

#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "extractor/Sniffers.h"
#include "extractors/AudioMediaFacts.h"
#include "wav/G711.h"

using namespace android;
using namespace audiotest;

namespace {

typedef MediaTrack::ReadOptions O;

std::vector<Sample> ReadAll(const sp<IMediaExtractor>& extractor, status_t* end = nullptr, const O* first = nullptr,
                            size_t limit = 1000000) {
    std::vector<Sample> samples;
    if (extractor == nullptr) return samples;
    sp<IMediaSource> track = extractor->getTrack(0);
    if (track == nullptr || track->start() != OK) return samples;
    const status_t err = ReadSamples(track, &samples, limit, first);
    if (end != nullptr) *end = err;
    return samples;
}

int64_t Duration(const sp<IMediaExtractor>& extractor) {
    int64_t d = -1;
    extractor->getTrackMetaData(0, 0)->findInt64(kKeyDuration, &d);
    return d;
}

// A copy of b4096.flac behind an ID3v2.4 tag with a footer.
std::vector<uint8_t> TaggedFlac(uint32_t tagBody) {
    std::vector<uint8_t> bytes = {'I', 'D', '3', 4, 0, 0x10,
                                  uint8_t((tagBody >> 21) & 0x7F), uint8_t((tagBody >> 14) & 0x7F),
                                  uint8_t((tagBody >> 7) & 0x7F), uint8_t(tagBody & 0x7F)};
    bytes.resize(bytes.size() + tagBody, 0);
    const uint8_t footer[10] = {'3', 'D', 'I', 4, 0, 0x10, bytes[6], bytes[7], bytes[8], bytes[9]};
    bytes.insert(bytes.end(), footer, footer + 10);
    const std::vector<uint8_t> flac = ReadFile("b4096.flac");
    bytes.insert(bytes.end(), flac.begin(), flac.end());
    return bytes;
}

}  // namespace

TEST(ForeignAudioTest, WaveVariantsDecodeAsFfmpegDoes) {
    // RF64 and BW64 take their sizes from ds64; the pipe-written file has
    // 0xFFFFFFFF sizes; G.711 comes out as 16-bit PCM from the table.
    for (const char* name : {"rf64.wav", "bw64.wav", "pipe.wav", "alaw.wav", "mulaw.wav", "alaw_sox.wav",
                             "mulaw_sox.wav", "mulaw_ext.wav"}) {
        const std::string file = std::string("foreign/") + name;
        SCOPED_TRACE(file);
        EXPECT_GT(SniffWAV(OpenMedia(file)), 0.0f);
        sp<IMediaExtractor> extractor = CreateWAVExtractor(OpenMedia(file));
        ASSERT_NE(extractor, nullptr);
        sp<MetaData> meta = extractor->getTrackMetaData(0, 0);
        int32_t bits = 0, encoding = 0, channels = 0, rate = 0, maxSize = 0;
        ASSERT_TRUE(meta->findInt32(kKeyBitsPerSample, &bits) && meta->findInt32(kKeyPcmEncoding, &encoding) &&
                    meta->findInt32(kKeyChannelCount, &channels) && meta->findInt32(kKeySampleRate, &rate) &&
                    meta->findInt32(kKeyMaxInputSize, &maxSize));
        EXPECT_EQ(bits, 16);
        EXPECT_EQ(encoding, kAudioEncodingPcm16bit);
        const int64_t frames = FactInt(file, "frames");
        EXPECT_EQ(Duration(extractor), frames * 1000000 / rate);
        status_t end;
        const std::vector<Sample> samples = ReadAll(extractor, &end);
        EXPECT_EQ(end, ERROR_END_OF_STREAM);
        int64_t at = 0;
        for (const Sample& s : samples) {
            ASSERT_EQ(s.timeUs, at * 1000000 / rate);
            ASSERT_LE(s.bytes.size(), static_cast<size_t>(maxSize));
            at += s.bytes.size() / (2 * channels);
        }
        const std::vector<uint8_t> pcm = Concat(samples);
        EXPECT_EQ(static_cast<int64_t>(pcm.size()), frames * 2 * channels);
        EXPECT_EQ(Hex64(Fnv(pcm)), Fact(file, "pcm_fnv"));
    }
}

TEST(ForeignAudioTest, G711TableMatchesTheRecommendation) {
    // G.711 tables 1 and 2 at their ends and around zero; then the shape:
    // odd symmetry and one step per code within each sign.
    EXPECT_EQ(ALawToLinear(0xD5), 8);
    EXPECT_EQ(ALawToLinear(0x55), -8);
    EXPECT_EQ(ALawToLinear(0xAA), 32256);
    EXPECT_EQ(ALawToLinear(0x2A), -32256);
    EXPECT_EQ(MuLawToLinear(0xFF), 0);
    EXPECT_EQ(MuLawToLinear(0x7F), 0);
    EXPECT_EQ(MuLawToLinear(0x80), 32124);
    EXPECT_EQ(MuLawToLinear(0x00), -32124);
    EXPECT_EQ(MuLawToLinear(0xFE), 8);
    for (int c = 0; c < 128; ++c) {
        EXPECT_EQ(ALawToLinear(uint8_t(c | 0x80)), -ALawToLinear(uint8_t(c))) << c;
        EXPECT_EQ(MuLawToLinear(uint8_t(c)), -MuLawToLinear(uint8_t(c | 0x80))) << c;
    }
    for (int c = 1; c < 128; ++c) {
        // Positive codes, in the order of their magnitude.
        EXPECT_GT(ALawToLinear(uint8_t((c ^ 0x55) | 0x80)), ALawToLinear(uint8_t(((c - 1) ^ 0x55) | 0x80))) << c;
        EXPECT_GT(MuLawToLinear(uint8_t(0xFF - c)), MuLawToLinear(uint8_t(0xFF - c + 1))) << c;
    }
}

TEST(ForeignAudioTest, WaveSizesThatRunOnAreCutToWholeFrames) {
    // A pipe-written file cut anywhere, and an RF64 whose ds64 claims more
    // than the file holds, give the whole frames that are there.
    const std::vector<uint8_t> pipe = ReadFile("foreign/pipe.wav");
    const std::vector<uint8_t> pcm = Concat(ReadAll(CreateWAVExtractor(OpenMedia("foreign/pipe.wav"))));
    const size_t dataOffset = pipe.size() - pcm.size();
    for (size_t cut : {dataOffset, dataOffset + 1, dataOffset + 2, dataOffset + 4095, pipe.size() - 1}) {
        SCOPED_TRACE(cut);
        const std::vector<uint8_t> bytes(pipe.begin(), pipe.begin() + cut);
        const std::vector<uint8_t> got = Concat(ReadAll(CreateWAVExtractor(MemorySource(bytes))));
        EXPECT_EQ(got.size(), (cut - dataOffset) / 2 * 2);
        EXPECT_TRUE(std::equal(got.begin(), got.end(), pcm.begin()));
    }
    std::vector<uint8_t> rf64 = ReadFile("foreign/rf64.wav");
    ASSERT_EQ(memcmp(&rf64[12], "ds64", 4), 0);
    rf64[20 + 8 + 4] = 0x01;  // data size of 2^32 + what was there
    const size_t stored = Concat(ReadAll(CreateWAVExtractor(OpenMedia("foreign/rf64.wav")))).size();
    EXPECT_EQ(Concat(ReadAll(CreateWAVExtractor(MemorySource(rf64)))).size(), stored);
    // RF64 without its ds64 chunk first is not a file to guess at.
    rf64 = ReadFile("foreign/rf64.wav");
    memcpy(&rf64[12], "JUNK", 4);
    EXPECT_EQ(CreateWAVExtractor(MemorySource(rf64)), nullptr);
}

TEST(ForeignAudioTest, FlacBehindAnId3TagReadsAsWithout) {
    const std::string file = "foreign/id3.flac";
    EXPECT_GT(SniffFLAC(OpenMedia(file)), 0.0f);
    sp<IMediaExtractor> extractor = CreateFLACExtractor(OpenMedia(file));
    ASSERT_NE(extractor, nullptr);
    EXPECT_EQ(Duration(extractor), FactInt(file, "frames") * 1000000 / 44100);
    status_t end;
    EXPECT_EQ(Hex64(Fnv(Concat(ReadAll(extractor, &end)))), Fact(file, "pcm_fnv"));
    EXPECT_EQ(end, ERROR_END_OF_STREAM);
    // Raw frames: exactly the file's bytes from the first frame on.
    extractor = CreateFLACExtractor(OpenMedia(file));
    extractor->setOutputFormatFlag(5);
    const std::vector<Sample> frames = ReadAll(extractor);
    const std::vector<Packet> packets = Packets(file);
    ASSERT_EQ(frames.size(), packets.size());
    for (size_t i = 0; i < frames.size(); ++i) ASSERT_EQ(frames[i].bytes.size(), packets[i].size) << i;
    const std::vector<uint8_t> bytes = ReadFile(file);
    const std::vector<uint8_t> all = Concat(frames);
    EXPECT_TRUE(std::equal(all.begin(), all.end(), bytes.begin() + FactInt(file, "frame_offset")));

    // An ID3v2.4 tag with a footer; the decoded PCM is that of the untagged file.
    const std::vector<uint8_t> untagged = Concat(ReadAll(CreateFLACExtractor(OpenMedia("b4096.flac"))));
    const std::vector<uint8_t> tagged = TaggedFlac(300);
    EXPECT_GT(SniffFLAC(MemorySource(tagged)), 0.0f);
    EXPECT_EQ(Concat(ReadAll(CreateFLACExtractor(MemorySource(tagged)))), untagged);
    // A tag whose size runs past the data leaves nothing to read.
    std::vector<uint8_t> runaway = tagged;
    runaway[6] = 0x7F;
    EXPECT_EQ(SniffFLAC(MemorySource(runaway)), 0.0f);
    EXPECT_EQ(CreateFLACExtractor(MemorySource(runaway)), nullptr);
}

TEST(ForeignAudioTest, ChainedOggLinksFollowOnOneTimeLine) {
    struct Case {
        const char* file;
        std::vector<const char*> links;  // those that are read
        status_t end;
    };
    const Case cases[] = {
        {"foreign/chain_same.ogg", {"foreign/link_a.ogg", "foreign/link_b.ogg"}, ERROR_END_OF_STREAM},
        // One file twice: the second link repeats the serial number.
        {"foreign/chain_twice.ogg", {"foreign/link_a.ogg", "foreign/link_a.ogg"}, ERROR_END_OF_STREAM},
        // The rate changes: the track ends with the first link, not quietly.
        {"foreign/chain_rate.ogg", {"foreign/link_a.ogg"}, ERROR_UNSUPPORTED},
        // Real recordings, one link each.
        {"foreign/bell.oga", {"foreign/bell.oga"}, ERROR_END_OF_STREAM},
        {"foreign/dialog-information.oga", {"foreign/dialog-information.oga"}, ERROR_END_OF_STREAM},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.file);
        sp<IMediaExtractor> extractor = CreateOggExtractor(OpenMedia(c.file));
        ASSERT_NE(extractor, nullptr);
        int32_t rate;
        ASSERT_TRUE(extractor->getTrackMetaData(0, 0)->findInt32(kKeySampleRate, &rate));
        status_t end;
        const std::vector<Sample> samples = ReadAll(extractor, &end);
        EXPECT_EQ(end, c.end);
        // Each link's packets as ffprobe lists them for the link alone, its
        // times moved on by the samples of the links before it.
        size_t i = 0;
        int64_t base = 0, kept = 0;
        for (const char* link : c.links) {
            const std::vector<Packet> packets = Packets(link);
            ASSERT_LE(i + packets.size(), samples.size());
            for (size_t k = 0; k < packets.size(); ++k, ++i) {
                ASSERT_EQ(samples[i].bytes.size(), packets[k].size) << i;
                // ffprobe estimates a packet's time where block sizes change
                // and its list does not add up; those are not compared.
                const bool listed = k < 2 || packets[k - 1].pts + packets[k - 1].duration == packets[k].pts;
                const int64_t start = k == 0 ? 0 : packets[k].pts - packets[1].pts;
                if (listed) ASSERT_EQ(samples[i].timeUs, (base + start) * 1000000 / rate) << i;
                if (i > 0) ASSERT_GE(samples[i].timeUs, samples[i - 1].timeUs) << i;
                kept += samples[i].valid;
            }
            base += FactInt(link, "frames");
        }
        EXPECT_EQ(i, samples.size());
        EXPECT_EQ(kept, base);
        // A link the track cannot carry still counts in the file's duration,
        // so a reader stopping before it can tell that something is missing.
        const int64_t unreadUs = c.end == ERROR_UNSUPPORTED ? FactInt("foreign/link_c.ogg", "frames") * 1000000 / 16000 : 0;
        EXPECT_NEAR(Duration(extractor), base * 1000000 / rate + unreadUs, 1000);
    }
}

TEST(ForeignAudioTest, SeeksReachEveryLinkOfAChain) {
    const std::vector<Sample> all = ReadAll(CreateOggExtractor(OpenMedia("foreign/chain_same.ogg")));
    ASSERT_FALSE(all.empty());
    const int64_t secondLinkUs = FactInt("foreign/link_a.ogg", "frames") * 1000000 / 22050;
    for (int64_t target : {int64_t(500000), secondLinkUs - 1000, secondLinkUs, secondLinkUs + 1, secondLinkUs + 900000}) {
        SCOPED_TRACE(target);
        O options;
        options.setSeekTo(target, O::SEEK_PREVIOUS_SYNC);
        const std::vector<Sample> got = ReadAll(CreateOggExtractor(OpenMedia("foreign/chain_same.ogg")), nullptr,
                                                &options, 5);
        ASSERT_EQ(got.size(), 5u);
        // The packet that holds the target (the link's priming packet at its
        // very start), and the ones after it in order.
        size_t i = 0;
        while (i + 1 < all.size() && all[i + 1].timeUs <= target) ++i;
        if (i > 0 && all[i - 1].timeUs == all[i].timeUs) --i;
        for (size_t k = 0; k < got.size(); ++k) {
            EXPECT_EQ(got[k].timeUs, all[i + k].timeUs) << k;
            EXPECT_EQ(got[k].bytes, all[i + k].bytes) << k;
        }
    }
}

TEST(ForeignAudioTest, RefusalsSayWhy) {
    const struct {
        const char* file;
        const char* reason;
    } cases[] = {
        {"refused/ima_adpcm.wav", "WAVE encoding 17 (IMA ADPCM) is not supported"},
        {"refused/flac_in.ogg", "Ogg stream holds FLAC, which is not supported"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.file);
        EXPECT_EQ(MediaExtractorFactory::Create(OpenMedia(c.file)), nullptr);
        EXPECT_EQ(takeRefusalReason(), c.reason);
        EXPECT_EQ(takeRefusalReason(), "");  // taken once
    }
    // A reason left from a refusal does not outlive a file that opens.
    EXPECT_EQ(MediaExtractorFactory::Create(OpenMedia("refused/ima_adpcm.wav")), nullptr);
    EXPECT_NE(MediaExtractorFactory::Create(OpenMedia("foreign/mulaw.wav")), nullptr);
    EXPECT_EQ(takeRefusalReason(), "");
    // Formats nobody reads are named from their first bytes.
    const struct {
        std::vector<uint8_t> head;
        const char* reason;
    } named[] = {
        {{0x1A, 0x45, 0xDF, 0xA3, 1, 2, 3, 4}, "Matroska/WebM is not supported"},
        {{0xFF, 0xF1, 0x50, 0x80, 0, 0x1F, 0xFC}, "AAC in ADTS is not supported"},
        {{0xFF, 0xFB, 0x00, 0xC4, 0, 0, 0, 0}, "MP3 without whole frames (free format or damaged) is not supported"},
        {{'F', 'O', 'R', 'M', 0, 0, 0, 4, 'A', 'I', 'F', 'F'}, "AIFF is not supported"},
        {{'R', 'I', 'F', 'F', 4, 0, 0, 0, 'A', 'V', 'I', ' '}, "AVI is not supported"},
    };
    for (const auto& n : named) {
        EXPECT_EQ(MediaExtractorFactory::Create(MemorySource(n.head)), nullptr);
        EXPECT_EQ(takeRefusalReason(), n.reason);
    }
}

TEST(ForeignAudioTest, NewReadersSurviveTruncationAndCorruption) {
    // The wrapper sweeps take RF64, pipe-written and A-law WAVE, id3.flac and
    // the chains; these are the forms they do not.
    ExerciseHostileCopies(ReadFile("foreign/mulaw_ext.wav"), 100, 499, CreateWAVExtractor);
    ExerciseHostileCopies(TaggedFlac(20), 60, 997, CreateFLACExtractor);
}
