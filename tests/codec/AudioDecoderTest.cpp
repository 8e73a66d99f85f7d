// The decoding source against ffmpeg's decode of the same files (recorded by
// tests/media/gen/pcm_reference.sh) and the flac tool's, and on damaged samples.

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <sstream>

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "codec/DecodedAudio.h"
#include "extractors/AudioMediaFacts.h"

namespace codectest {
namespace {

std::string Path(const std::string& file) { return std::string(ME_TEST_MEDIA_DIR) + "/" + file; }

std::string DecodedFact(const std::string& file, const std::string& key) {
    std::ifstream in(Path("codec/decoded.txt"));
    std::string f, k, v;
    while (in >> f >> k >> v) {
        if (f == file && k == key) return v;
    }
    return "";
}

uint64_t PcmFnv(const std::vector<int16_t>& pcm) {
    std::vector<uint8_t> bytes(pcm.size() * 2);
    for (size_t i = 0; i < pcm.size(); ++i) {
        bytes[2 * i] = uint8_t(pcm[i]), bytes[2 * i + 1] = uint8_t(uint16_t(pcm[i]) >> 8);
    }
    return audiotest::Fnv(bytes);
}

// Our decode without the buffers that stand in for packets ffmpeg dropped;
// those must be silence.
std::vector<int16_t> WithoutConcealed(const Decoded& d, const std::string& concealed) {
    std::vector<int64_t> times;
    std::istringstream list(concealed == "-" ? "" : concealed);
    for (std::string t; std::getline(list, t, ',');) times.push_back(std::stoll(t));
    std::vector<int16_t> kept;
    for (size_t b = 0; b < d.offsets.size(); ++b) {
        const size_t end = b + 1 < d.offsets.size() ? d.offsets[b + 1] : d.pcm.size() / d.channels;
        auto first = d.pcm.begin() + d.offsets[b] * d.channels, last = d.pcm.begin() + end * d.channels;
        if (std::find(times.begin(), times.end(), d.timesUs[b]) != times.end()) {
            EXPECT_TRUE(std::all_of(first, last, [](int16_t s) { return s == 0; })) << "at " << d.timesUs[b];
        } else {
            kept.insert(kept.end(), first, last);
        }
    }
    return kept;
}

TEST(AudioDecoderSource, DecodesAsFfmpegDoes) {
    // AAC with an edit list's priming (also the audio of a video), AMR-NB in
    // 3GP and raw, AMR-WB with comfort-noise and lost frames, Vorbis mono and
    // stereo (cut at the last granule position), MP3 in MP4 and in MP3 files
    // (LAME's delay and padding dropped; tags at the end not decoded).
    for (const char* file : {"mp4/aac.m4a", "mp4/avc_aac.mp4", "mp4/amr_nb.3gp", "audio/nb.amr", "audio/wb.awb",
                             "audio/mono.ogg", "audio/stereo.ogg", "codec/mp3.mp4", "mp3/vbr_tags.mp3",
                             "mp3/cbr_mpeg2.mp3", "mp3/mpeg25_ape.mp3", "mp3/gst_cbr.mp3"}) {
        SCOPED_TRACE(file);
        const Decoded d = DecodeFile(Path(file));
        ASSERT_EQ(d.status, ERROR_END_OF_STREAM);
        ASSERT_GT(d.channels, 0);
        const std::vector<int16_t> pcm = WithoutConcealed(d, DecodedFact(file, "concealed"));
        EXPECT_EQ(pcm.size() / d.channels, std::stoull(DecodedFact(file, "frames")));
        char fnv[17];
        snprintf(fnv, sizeof(fnv), "%016llx", (unsigned long long)PcmFnv(pcm));
        EXPECT_EQ(fnv, DecodedFact(file, "pcm_fnv"));
        // Each buffer's time is where its first frame lies, within a frame.
        ASSERT_FALSE(d.timesUs.empty());
        EXPECT_EQ(d.timesUs[0], 0);
        for (size_t b = 0; b < d.timesUs.size(); ++b) {
            EXPECT_NEAR(d.timesUs[b], int64_t(d.offsets[b]) * 1000000 / d.rate, 1e6 / d.rate + 1) << "buffer " << b;
        }
    }
}

TEST(AudioDecoderSource, DecodesFlacAsTheFlacToolDoes) {
    for (const char* file : {"b4096.flac", "b1152.flac", "vbs.flac"}) {
        SCOPED_TRACE(file);
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(audiotest::MediaPath(file).c_str()));
        ASSERT_NE(extractor, nullptr);
        ASSERT_EQ(extractor->setOutputFormatFlag(5 /* FLAC frames as stored */), OK);
        const Decoded d = DecodeAll(extractor->getTrack(0));
        ASSERT_EQ(d.status, ERROR_END_OF_STREAM);
        EXPECT_EQ(int64_t(d.pcm.size() / d.channels), audiotest::FactInt(file, "frames"));
        char fnv[17];
        snprintf(fnv, sizeof(fnv), "%016llx", (unsigned long long)PcmFnv(d.pcm));
        EXPECT_EQ(fnv, audiotest::Fact(file, "pcm_fnv"));
    }
}

// Hands out a track's samples, damaging every third from the fourth on.
class DamagingSource : public MediaSource {
public:
    enum Damage { kFlipBytes, kTruncate, kEmpty, kGarbage };
    DamagingSource(const sp<IMediaSource>& track, Damage damage) : mTrack(track), mDamage(damage) {}
    status_t start(MetaData* params) override { return mTrack->start(params); }
    status_t stop() override { return mTrack->stop(); }
    sp<MetaData> getFormat() override { return mTrack->getFormat(); }
    status_t read(MediaBufferBase** buffer, const ReadOptions* options) override {
        const status_t err = mTrack->read(buffer, options);
        if (err != OK || ++mCount < 4 || mCount % 3 != 0) return err;
        uint8_t* p = static_cast<uint8_t*>((*buffer)->data()) + (*buffer)->range_offset();
        const size_t n = (*buffer)->range_length();
        switch (mDamage) {
            case kFlipBytes: for (size_t i = 1; i < n; i += 2) p[i] ^= 0xA5; break;
            case kTruncate: (*buffer)->set_range((*buffer)->range_offset(), n / 3); break;
            case kEmpty: (*buffer)->set_range((*buffer)->range_offset(), 0); break;
            case kGarbage: for (size_t i = 0; i < n; ++i) p[i] = uint8_t(i * 151 + mCount); break;
        }
        return OK;
    }

private:
    const sp<IMediaSource> mTrack;
    const Damage mDamage;
    int mCount = 0;
};

TEST(AudioDecoderSource, DamagedSamplesBecomeSilenceOfTheirLength) {
    LogCapture log;
    for (const char* file : {"mp4/aac.m4a", "audio/nb.amr", "audio/wb.awb", "audio/stereo.ogg", "codec/mp3.mp4"}) {
        const Decoded clean = DecodeFile(Path(file));
        for (DamagingSource::Damage damage : {DamagingSource::kFlipBytes, DamagingSource::kTruncate,
                                              DamagingSource::kEmpty, DamagingSource::kGarbage}) {
            SCOPED_TRACE(std::string(file) + " damage " + std::to_string(damage));
            const Decoded d = DecodeAll(new DamagingSource(FirstAudioTrack(new FileSource(Path(file).c_str())), damage));
            EXPECT_EQ(d.status, ERROR_END_OF_STREAM);
            EXPECT_EQ(d.channels, clean.channels);
            // Vorbis blocks vary in length, so its stand-ins may too.
            const size_t slack = strstr(file, ".ogg") != nullptr ? clean.pcm.size() / 4 : 0;
            EXPECT_NEAR(double(d.pcm.size()), double(clean.pcm.size()), double(slack));
        }
    }
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "frames of silence instead"));
}

// A seek lands on the exact time and decodes there what a reading from the
// start decodes (the pre-roll refills the codec's state).
TEST(AudioDecoderSource, SeeksToTheExactTime) {
    for (const char* file : {"mp4/aac.m4a", "mp4/amr_nb.3gp", "audio/mono.ogg", "codec/mp3.mp4"}) {
        SCOPED_TRACE(file);
        const Decoded whole = DecodeFile(Path(file));
        sp<AudioDecoderSource> decoder = AudioDecoderSource::Create(FirstAudioTrack(new FileSource(Path(file).c_str())));
        ASSERT_NE(decoder, nullptr);
        ASSERT_EQ(decoder->start(), OK);
        for (int64_t seekUs : {int64_t(500000), int64_t(0), int64_t(230000)}) {
            MediaSource::ReadOptions seek;
            seek.setSeekTo(seekUs, MediaSource::ReadOptions::SEEK_CLOSEST);
            MediaBufferBase* buffer = nullptr;
            ASSERT_EQ(decoder->read(&buffer, &seek), OK);
            int64_t t = -1;
            buffer->meta_data().findInt64(kKeyTime, &t);
            EXPECT_EQ(t, seekUs);
            const size_t at = size_t((seekUs * whole.rate + 500000) / 1000000) * whole.channels;
            const int16_t* p = static_cast<const int16_t*>(buffer->data());
            const size_t n = std::min(buffer->range_length() / 2, whole.pcm.size() - at);
            int maxDiff = 0;
            for (size_t i = 0; i < n; ++i) maxDiff = std::max(maxDiff, std::abs(p[i] - whole.pcm[at + i]));
            // AMR's predictors take longer than the pre-roll to agree: only
            // its start over is compared.
            if (seekUs == 0 || strstr(file, "amr") == nullptr) EXPECT_LE(maxDiff, 1) << "at " << seekUs;
            buffer->release();
        }
        EXPECT_EQ(decoder->stop(), OK);
    }
}

TEST(AudioDecoderSource, RefusesWhatItCannotDecode) {
    for (const char* mime : {MEDIA_MIMETYPE_AUDIO_AAC, MEDIA_MIMETYPE_AUDIO_AMR_NB, MEDIA_MIMETYPE_AUDIO_AMR_WB,
                             MEDIA_MIMETYPE_AUDIO_VORBIS, MEDIA_MIMETYPE_AUDIO_MPEG, MEDIA_MIMETYPE_AUDIO_FLAC}) {
        EXPECT_TRUE(AudioDecoderSource::CanDecode(mime)) << mime;
    }
    for (const char* mime : std::initializer_list<const char*>{MEDIA_MIMETYPE_AUDIO_RAW, MEDIA_MIMETYPE_AUDIO_OPUS,
                                                               MEDIA_MIMETYPE_VIDEO_AVC, "", nullptr}) {
        EXPECT_FALSE(AudioDecoderSource::CanDecode(mime)) << (mime ? mime : "null");
    }
    // A PCM track, and AAC and Vorbis tracks without their configuration.
    EXPECT_EQ(AudioDecoderSource::Create(FirstAudioTrack(new FileSource(Path("audio/s16_stereo.wav").c_str()))), nullptr);
    for (const char* mime : {MEDIA_MIMETYPE_AUDIO_AAC, MEDIA_MIMETYPE_AUDIO_VORBIS}) {
        sp<MetaData> format = new MetaData;
        format->setCString(kKeyMIMEType, mime);
        format->setInt32(kKeySampleRate, 44100);
        format->setInt32(kKeyChannelCount, 2);
        class Empty : public MediaSource {
        public:
            explicit Empty(const sp<MetaData>& f) : mF(f) {}
            status_t start(MetaData*) override { return OK; }
            status_t stop() override { return OK; }
            sp<MetaData> getFormat() override { return mF; }
            status_t read(MediaBufferBase** b, const ReadOptions*) override { *b = nullptr; return ERROR_END_OF_STREAM; }
            sp<MetaData> mF;
        };
        EXPECT_EQ(AudioDecoderSource::Create(new Empty(format)), nullptr) << mime;
    }
}

}  // namespace
}  // namespace codectest
