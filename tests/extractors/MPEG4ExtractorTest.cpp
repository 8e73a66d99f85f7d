// The MP4 extractor against files made by ffmpeg (facts recorded by ffprobe)
// and against files built here to reach the cases encoders do not write.

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "MPEG4TestFacts.h"
#include "MPEG4TestRead.h"

using namespace android;
using namespace mp4test;
using namespace mp4test::facts;

namespace {

typedef MediaTrack::ReadOptions::SeekMode SeekMode;

std::string MimeOf(const std::string& codec) {
    static const std::map<std::string, std::string> kMimes = {
        {"h264", MEDIA_MIMETYPE_VIDEO_AVC}, {"hevc", MEDIA_MIMETYPE_VIDEO_HEVC},
        {"aac", MEDIA_MIMETYPE_AUDIO_AAC}, {"amr_nb", MEDIA_MIMETYPE_AUDIO_AMR_NB}};
    auto it = kMimes.find(codec);
    return it == kMimes.end() ? "?" : it->second;
}

// Where ffprobe reads a file otherwise than ISO/IEC 14496-12 does.
struct Divergence {
    const char* file;
    size_t stream;
    bool ptsDelayed;   // negative composition offsets and no edit list: ffprobe
                       // delays presentation times by the first frame's offset
    int64_t streamUs;  // what the extractor says instead, or -1
};
const Divergence kDivergences[] = {
    {"frag_hevc.mp4", 0, true, -1},
    {"frag_mediabunny.mp4", 0, true, -1},
    // An open-ended edit (duration 0, 8.6.6) from after the encoder delay:
    // ffprobe's duration counts the delay too.
    {"frag_mediabunny.mp4", 1, false, 2000000},
};

void ApplyDivergences(const std::string& file, Facts* facts) {
    for (const Divergence& d : kDivergences) {
        if (file != d.file || d.stream >= facts->streams.size()) continue;
        Stream& st = facts->streams[d.stream];
        if (d.streamUs >= 0) st.durationUs = d.streamUs;
        if (!d.ptsDelayed || st.packets.empty()) continue;
        const int64_t delay = st.packets.front().pts - st.packets.front().dts;
        for (Packet& p : st.packets) p.pts -= delay;
    }
}

// Annex-B: start codes only at unit boundaries (emulation prevention keeps
// them out of the payload), and each unit has its forbidden bit clear.
void ExpectAnnexB(const std::string& s) {
    ASSERT_GE(s.size(), 5u);
    ASSERT_EQ(std::string("\0\0\0\1", 4), s.substr(0, 4));
    for (size_t at = 0; at != std::string::npos; at = s.find(std::string("\0\0\0\1", 4), at + 4)) {
        ASSERT_LT(at + 4, s.size());
        EXPECT_EQ(0, s[at + 4] & 0x80);
    }
}

int32_t IntOf(const sp<MetaData>& meta, uint32_t key) {
    int32_t v = -1;
    meta->findInt32(key, &v);
    return v;
}

// -------------------------------------------------------------------------
// Files made by ffmpeg

class MPEG4FileTest : public ::testing::TestWithParam<const char*> {
protected:
    void SetUp() override {
        mFacts = LoadFacts(GetParam());
        ApplyDivergences(GetParam(), &mFacts);
        ASSERT_FALSE(mFacts.streams.empty()) << "no facts for " << GetParam();
        sp<DataSource> source = new FileSource(MediaPath(GetParam()).c_str());
        ASSERT_EQ(OK, source->initCheck());
        mExtractor = MediaExtractorFactory::Create(source, nullptr);
        ASSERT_NE(nullptr, mExtractor);
    }

    Facts mFacts;
    sp<IMediaExtractor> mExtractor;
};

TEST_P(MPEG4FileTest, FormatsMatchTheProbe) {
    sp<MetaData> file = mExtractor->getMetaData();
    const char* mime = nullptr;
    int64_t durationUs = 0;
    ASSERT_TRUE(file->findCString(kKeyMIMEType, &mime));
    EXPECT_STREQ(MEDIA_MIMETYPE_CONTAINER_MPEG4, mime);
    ASSERT_TRUE(file->findInt64(kKeyDuration, &durationUs));
    // The file lasts as long as its longest track; ffprobe's format duration
    // also counts a video track whose first frame is presented late (B-frames
    // without an edit list).
    int64_t longestUs = 0;
    for (const Stream& st : mFacts.streams) longestUs = std::max(longestUs, st.durationUs);
    EXPECT_NEAR(longestUs, durationUs, 1);
    const char* location = nullptr;
    EXPECT_EQ(mFacts.location != "-", file->findCString(kKeyLocation, &location));
    if (location != nullptr) EXPECT_EQ(mFacts.location, location);

    ASSERT_EQ(mFacts.streams.size(), mExtractor->countTracks());
    for (size_t i = 0; i < mFacts.streams.size(); ++i) {
        SCOPED_TRACE(i);
        const Stream& st = mFacts.streams[i];
        sp<MetaData> meta = mExtractor->getTrackMetaData(i);
        ASSERT_TRUE(meta->findCString(kKeyMIMEType, &mime));
        EXPECT_EQ(MimeOf(st.codec), mime);
        ASSERT_TRUE(meta->findInt64(kKeyDuration, &durationUs));
        EXPECT_NEAR(st.durationUs, durationUs, 1);
        EXPECT_EQ(int32_t(i + 1), IntOf(meta, kKeyTrackID));
        EXPECT_GT(IntOf(meta, kKeyBitRate), 0);
        uint32_t maxSize = 0;
        for (const Packet& p : st.packets) maxSize = std::max(maxSize, p.size);
        EXPECT_GE(IntOf(meta, kKeyMaxInputSize), int32_t(maxSize));
        const char* language = nullptr;
        EXPECT_TRUE(meta->findCString(kKeyMediaLanguage, &language));
        uint32_t type = 0;
        const void* data = nullptr;
        size_t size = 0;
        if (st.width > 0) {
            EXPECT_EQ(st.width, IntOf(meta, kKeyWidth));
            EXPECT_EQ(st.height, IntOf(meta, kKeyHeight));
            int32_t rotation = 0;
            meta->findInt32(kKeyRotation, &rotation);
            EXPECT_EQ((360 - st.rotationCcw) % 360, rotation);
            const uint32_t key = st.codec == "hevc" ? kKeyHVCC : kKeyAVCC;
            ASSERT_TRUE(meta->findData(key, &type, &data, &size));
            EXPECT_EQ(st.codec == "hevc" ? uint32_t(kTypeHVCC) : uint32_t(kTypeAVCC), type);
            EXPECT_EQ(1, static_cast<const uint8_t*>(data)[0]);
        } else {
            EXPECT_EQ(st.rate, IntOf(meta, kKeySampleRate));
            EXPECT_EQ(st.channels, IntOf(meta, kKeyChannelCount));
            if (st.codec == "aac") {
                ASSERT_TRUE(meta->findData(kKeyESDS, &type, &data, &size));
                EXPECT_EQ(uint32_t(kTypeESDS), type);
                EXPECT_EQ(0x03, static_cast<const uint8_t*>(data)[0]);
            }
        }
    }
}

TEST_P(MPEG4FileTest, EverySampleMatchesTheProbe) {
    for (size_t i = 0; i < mFacts.streams.size(); ++i) {
        SCOPED_TRACE(i);
        const Stream& st = mFacts.streams[i];
        sp<IMediaSource> source = mExtractor->getTrack(i);
        ASSERT_EQ(OK, source->start());
        std::vector<Read> samples;
        EXPECT_EQ(ERROR_END_OF_STREAM, ReadAll(source, &samples));
        ASSERT_EQ(st.packets.size(), samples.size());
        for (size_t k = 0; k < samples.size(); ++k) {
            SCOPED_TRACE(k);
            const Packet& p = st.packets[k];
            EXPECT_EQ(p.size, samples[k].bytes.size());
            EXPECT_NEAR(p.pts, samples[k].timeUs, 1);
            EXPECT_NEAR(p.dts, samples[k].decodingUs, 1);
            EXPECT_EQ(p.key, samples[k].sync);
            if (st.width > 0) ExpectAnnexB(samples[k].bytes);
        }
        EXPECT_EQ(OK, source->stop());
    }
}

// Expected landing sample of a seek, worked out from the probe's key frames.
size_t ExpectedSeek(const std::vector<Packet>& packets, int64_t t, SeekMode mode) {
    std::vector<size_t> keys;
    for (size_t i = 0; i < packets.size(); ++i) {
        if (packets[i].key) keys.push_back(i);
    }
    size_t before = keys.front(), after = SIZE_MAX;
    for (size_t k : keys) {
        if (packets[k].pts <= t) before = k;
        if (packets[k].pts >= t && after == SIZE_MAX) after = k;
    }
    switch (mode) {
        case MediaTrack::ReadOptions::SEEK_NEXT_SYNC:
            return after;
        case MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC:
            if (after == SIZE_MAX || packets[before].pts > t) return before;
            return packets[after].pts - t < t - packets[before].pts ? after : before;
        default:
            return before;
    }
}

TEST_P(MPEG4FileTest, SeekModesLandOnTheRightSyncSample) {
    for (size_t i = 0; i < mFacts.streams.size(); ++i) {
        const std::vector<Packet>& packets = mFacts.streams[i].packets;
        sp<IMediaSource> source = mExtractor->getTrack(i);
        ASSERT_EQ(OK, source->start());
        std::vector<int64_t> targets = {0, packets.back().pts + 1000000};
        for (const Packet& p : packets) {
            if (!p.key) continue;
            targets.push_back(p.pts);
            targets.push_back(p.pts - 1);
            targets.push_back(p.pts + 30000);
            targets.push_back(p.pts + 600000);
        }
        for (int64_t t : targets) {
            if (t < 0) continue;
            for (SeekMode mode : {MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC, MediaTrack::ReadOptions::SEEK_NEXT_SYNC,
                                  MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC, MediaTrack::ReadOptions::SEEK_CLOSEST}) {
                SCOPED_TRACE(testing::Message() << "track " << i << " time " << t << " mode " << int(mode));
                MediaTrack::ReadOptions options;
                options.setSeekTo(t, mode);
                Read r;
                const size_t want = ExpectedSeek(packets, t, mode);
                if (want == SIZE_MAX) {
                    EXPECT_EQ(ERROR_END_OF_STREAM, ReadOne(source, &r, &options));
                    continue;
                }
                ASSERT_EQ(OK, ReadOne(source, &r, &options));
                EXPECT_NEAR(packets[want].pts, r.timeUs, 1);
                EXPECT_TRUE(r.sync);
                EXPECT_EQ(mode == MediaTrack::ReadOptions::SEEK_CLOSEST ? t : -1, r.targetUs);
                // Reading goes on from there in file order.
                if (want + 1 == packets.size()) {
                    EXPECT_EQ(ERROR_END_OF_STREAM, ReadOne(source, &r));
                } else {
                    ASSERT_EQ(OK, ReadOne(source, &r));
                    EXPECT_NEAR(packets[want + 1].pts, r.timeUs, 1);
                }
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Files, MPEG4FileTest,
                         ::testing::Values("avc_aac.mp4", "avc_aac_faststart.mp4", "avc_aac_tagged.mp4", "avc_aac.mov", "hevc.mp4", "aac.m4a",
                                           "avc_rotated.mp4", "amr_nb.3gp", "frag_empty_moov.mp4",
                                           "frag_base_moof.mp4", "frag_dash.mp4", "frag_hevc.mp4", "frag_gst.mp4",
                                           "frag_mediabunny.mp4"),
                         [](const ::testing::TestParamInfo<const char*>& info) {
                             std::string name = info.param;
                             for (char& c : name) {
                                 if (!isalnum(static_cast<unsigned char>(c))) c = '_';
                             }
                             return name;
                         });

}  // namespace
