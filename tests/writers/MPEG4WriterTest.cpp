// MP4 writer: files written from synthetic sources, checked with ffprobe and
// ffmpeg (skipped when they are missing) and by reading the boxes back.

#include <fcntl.h>
#include <unistd.h>

#include <gtest/gtest.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "writers/MPEG4TestSupport.h"

using namespace android;
using namespace mp4test;

namespace {

const uint8_t kSphereType[16] = {'Q', 'N', 'E', 'D', '-', 'S', 'P', 'H', 'E', 'R', 'E', 'V', 'I', 'E', 'W', '1'};

sp<MetaData> videoFormat(const char* mime, int32_t width, int32_t height) {
    sp<MetaData> m = new MetaData;
    m->setCString(kKeyMIMEType, mime);
    m->setInt32(kKeyWidth, width);
    m->setInt32(kKeyHeight, height);
    return m;
}

sp<MetaData> audioFormat(const char* mime, int32_t rate, int32_t channels) {
    sp<MetaData> m = new MetaData;
    m->setCString(kKeyMIMEType, mime);
    m->setInt32(kKeySampleRate, rate);
    m->setInt32(kKeyChannelCount, channels);
    return m;
}

class MPEG4WriterFileTest : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        if (!haveTool("ffmpeg") || !haveTool("ffprobe")) return;
        // One directory per process: ctest runs each test in its own process,
        // side by side, and a shared one would be rewritten under a reader.
        sDir = ::testing::TempDir() + "mp4w_sources_" + std::to_string(getpid());
        runCommand("mkdir -p '" + sDir + "'");
        const std::string common = "ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=160x120:rate=30 ";
        sHaveSources =
            runCommand(common + "-f lavfi -i sine=frequency=440:sample_rate=44100 -t 2 -pix_fmt yuv420p "
                                "-c:v libx264 -bf 2 -x264-params b-adapt=0 -g 15 -c:a aac -b:a 64k '" + sDir + "/avc.mp4'") == 0 &&
            runCommand(common + "-t 1 -pix_fmt yuv420p -c:v libx265 -x265-params log-level=none:bframes=2:b-adapt=0 "
                                "-tag:v hvc1 '" + sDir + "/hevc.mp4'") == 0;
    }

    static void TearDownTestSuite() {
        if (!sDir.empty()) runCommand("rm -rf '" + sDir + "'");
    }

    void SetUp() override {
        if (!sHaveSources) GTEST_SKIP() << "ffmpeg/ffprobe or their encoders are missing";
        mDir = tempDir();
    }

    // Writes `samples` to OUT through a new writer; returns its path.
    std::string write(const std::vector<sp<MetaData>>& formats, const std::vector<Pushed>& samples,
                      MetaData* params = nullptr, const std::function<void(MPEG4Writer*)>& setup = nullptr) {
        const std::string out = mDir + "/out.mp4";
        const int fd = open(out.c_str(), O_CREAT | O_TRUNC | O_RDWR, 0644);
        EXPECT_GE(fd, 0);
        sp<MPEG4Writer> writer = new MPEG4Writer(fd);
        if (setup) setup(writer.get());
        const WriteResult r = writeThroughAdapters(writer, formats, samples, params);
        EXPECT_EQ(OK, r.addSource);
        EXPECT_EQ(OK, r.start);
        EXPECT_EQ(OK, r.stop);
        close(fd);
        return out;
    }

    // Every stored packet has the size, times and key flag that were pushed
    // (times compared after removing one constant decoding shift per track).
    static void expectPackets(const std::string& path, const std::vector<Pushed>& pushed, bool exactDts) {
        std::map<int, std::vector<Pushed>> in;
        for (const Pushed& p : pushed) {
            if (!p.config) in[int(p.track)].push_back(p);
        }
        std::map<int, std::vector<Packet>> out;
        for (const Packet& p : packets(path)) out[p.stream].push_back(p);
        ASSERT_EQ(in.size(), out.size());
        for (auto& [track, list] : in) {
            ASSERT_EQ(list.size(), out[track].size()) << "track " << track;
            for (size_t i = 0; i < list.size(); ++i) {
                const Packet& p = out[track][i];
                SCOPED_TRACE("track " + std::to_string(track) + " sample " + std::to_string(i));
                EXPECT_EQ(list[i].ptsUs, p.ptsUs);
                EXPECT_EQ(list[i].sync, p.key);
                EXPECT_LE(p.dtsUs, p.ptsUs);
                if (exactDts) EXPECT_EQ(list[i].dtsUs, p.dtsUs);
                if (i > 0) EXPECT_LT(out[track][i - 1].dtsUs, p.dtsUs);
            }
        }
    }

    static std::string sDir;
    static bool sHaveSources;
    std::string mDir;
};

std::string MPEG4WriterFileTest::sDir;
bool MPEG4WriterFileTest::sHaveSources = false;

TEST_F(MPEG4WriterFileTest, AnnexBH264AndAacFromConfigBuffers) {
    const std::string src = sDir + "/avc.mp4";
    const std::vector<Pushed> samples = samplesOf(src, /*annexB=*/true, /*configBuffers=*/true);
    sp<MetaData> params = new MetaData;
    params->setInt32(kKeyRotation, 90);
    const std::string out = write({videoFormat(MEDIA_MIMETYPE_VIDEO_AVC, 160, 120),
                                   audioFormat(MEDIA_MIMETYPE_AUDIO_AAC, 44100, 1)},
                                  samples, params.get(), [](MPEG4Writer* w) {
                                      EXPECT_EQ(OK, w->setGeoData(375000, -1222000));
                                  });
    expectPackets(out, samples, /*exactDts=*/true);
    // Stored samples are the source's length-prefixed ones, byte for byte.
    std::vector<Packet> srcPackets = packets(src), outPackets = packets(out);
    ASSERT_EQ(srcPackets.size(), outPackets.size());
    std::string errors;
    EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;
    Flat f;
    ASSERT_TRUE(probe(out, "-show_streams -show_format", &f));
    EXPECT_EQ("-90", f["streams.stream.0.side_data_list.side_data.0.rotation"]);
    EXPECT_EQ("+37.5000-122.2000/", f["format.tags.location"]);
    EXPECT_EQ("h264", f["streams.stream.0.codec_name"]);
    EXPECT_EQ("aac", f["streams.stream.1.codec_name"]);
    // The avcC built from the Annex-B parameter sets equals the encoder's.
    const std::vector<uint8_t> built = extradata(out, 0);
    EXPECT_EQ(extradata(src, 0), built);
}

std::vector<Pushed> shifted(std::vector<Pushed> samples, int64_t byUs) {
    for (Pushed& s : samples) {
        s.ptsUs += byUs;
        s.dtsUs += byUs;
    }
    return samples;
}

std::vector<Pushed> videoOnly(const std::vector<Pushed>& samples) {
    std::vector<Pushed> out;
    for (const Pushed& s : samples) {
        if (s.track == 0) out.push_back(s);
    }
    return out;
}

TEST_F(MPEG4WriterFileTest, RecordFromFormatWithGeneratedDecodingTimes) {
    const std::string src = sDir + "/avc.mp4";
    sp<MetaData> format = videoFormat(MEDIA_MIMETYPE_VIDEO_AVC, 160, 120);
    const std::vector<uint8_t> avcc = extradata(src, 0);
    format->setData(kKeyAVCC, kTypeAVCC, avcc.data(), avcc.size());
    // The muxer's generated decoding times: first time plus a fixed step per
    // sample, running ahead of the B-frames' presentation times.
    for (int64_t step : {33333, 3333333, 0}) {
        SCOPED_TRACE("step " + std::to_string(step));
        std::vector<Pushed> samples = videoOnly(samplesOf(src, /*annexB=*/false, /*configBuffers=*/false));
        for (size_t i = 0; i < samples.size(); ++i) samples[i].dtsUs = samples[0].ptsUs + int64_t(i) * step;
        const std::string out = write({format}, samples);
        expectPackets(out, samples, /*exactDts=*/false);
        std::string errors;
        EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;
        Flat f;
        ASSERT_TRUE(probe(out, "-show_format", &f));
        EXPECT_EQ(2000000, parseSecondsToUs(f["format.duration"]));
    }
}

TEST_F(MPEG4WriterFileTest, EditListPresentsLateStartAndHidesPreroll) {
    const std::string src = sDir + "/avc.mp4";
    const std::vector<Pushed> base = samplesOf(src, /*annexB=*/true, /*configBuffers=*/true);
    const std::vector<sp<MetaData>> formats = {videoFormat(MEDIA_MIMETYPE_VIDEO_AVC, 160, 120),
                                               audioFormat(MEDIA_MIMETYPE_AUDIO_AAC, 44100, 1)};
    {
        // A track starting at 0.5 s is presented from 0.5 s.
        const std::vector<Pushed> late = shifted(base, 500000);
        const std::string out = write(formats, late);
        expectPackets(out, late, /*exactDts=*/true);
        Flat f;
        ASSERT_TRUE(probe(out, "-show_streams", &f));
        EXPECT_EQ(500000, parseSecondsToUs(f["streams.stream.0.start_time"]));
    }
    {
        // A trim at 0.2 s that kept the frames from the sync sample at 0:
        // those six frames are decoded but never shown.
        const std::vector<Pushed> trimmed = shifted(base, -200000);
        const std::string out = write(formats, trimmed);
        Flat f;
        ASSERT_TRUE(probe(out, "-select_streams v -show_frames -show_entries frame=pts_time", &f));
        EXPECT_EQ(0, parseSecondsToUs(f["frames.frame.0.pts_time"]));
        EXPECT_EQ(0u, f.count("frames.frame.54.pts_time"));
        EXPECT_EQ(1u, f.count("frames.frame.53.pts_time"));
        std::string errors;
        EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;
    }
}

TEST_F(MPEG4WriterFileTest, HevcFromAnnexBConfigBuffers) {
    const std::string src = sDir + "/hevc.mp4";
    const std::vector<Pushed> samples = samplesOf(src, /*annexB=*/true, /*configBuffers=*/true);
    const std::string out = write({videoFormat(MEDIA_MIMETYPE_VIDEO_HEVC, 160, 120)}, samples);
    expectPackets(out, samples, /*exactDts=*/true);
    std::string errors;
    EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;
    Flat f;
    ASSERT_TRUE(probe(out, "-show_streams", &f));
    EXPECT_EQ("hevc", f["streams.stream.0.codec_name"]);
    EXPECT_EQ("hvc1", f["streams.stream.0.codec_tag_string"]);
    EXPECT_EQ("160", f["streams.stream.0.width"]);
}

TEST_F(MPEG4WriterFileTest, AmrNarrowband) {
    // 12.2 kbit/s frames (type 7): a header byte and 31 bytes of payload.
    std::vector<Pushed> samples;
    for (int i = 0; i < 50; ++i) {
        std::vector<uint8_t> frame(32, uint8_t(i * 7));
        frame[0] = (7 << 3) | 0x04;
        samples.push_back({0, frame, i * 20000, i * 20000, true, false});
    }
    const std::string out = write({audioFormat(MEDIA_MIMETYPE_AUDIO_AMR_NB, 8000, 1)}, samples);
    expectPackets(out, samples, /*exactDts=*/true);
    std::string errors;
    EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;
    Flat f;
    ASSERT_TRUE(probe(out, "-show_streams", &f));
    EXPECT_EQ("amr_nb", f["streams.stream.0.codec_name"]);
    EXPECT_EQ("8000", f["streams.stream.0.sample_rate"]);
}

TEST_F(MPEG4WriterFileTest, DeviceItemsStored) {
    const std::vector<Pushed> samples = samplesOf(sDir + "/avc.mp4", /*annexB=*/true, /*configBuffers=*/true);
    const uint8_t sphere[] = {1, 2, 3, 0, 5};
    const uint8_t wave[] = {0x12, 0x34, 0x00, 0x7F};
    const std::string out = write({videoFormat(MEDIA_MIMETYPE_VIDEO_AVC, 160, 120),
                                   audioFormat(MEDIA_MIMETYPE_AUDIO_AAC, 44100, 1)},
                                  samples, nullptr, [&](MPEG4Writer* w) {
                                      EXPECT_EQ(OK, w->setUuidData(sphere, sizeof(sphere)));
                                      EXPECT_EQ(OK, w->setQNVideoFourCC(String8("slow")));
                                      EXPECT_EQ(OK, w->setGeoData(-335000, 1512099));
                                      w->setWaveform(wave, 2);
                                  });
    const std::vector<uint8_t> file = readFile(out);
    const auto udta = childBoxes(file, "moov/udta");
    EXPECT_EQ(std::vector<uint8_t>({'s', 'l', 'o', 'w'}), udta.at("qnrt"));
    EXPECT_EQ(std::vector<uint8_t>(wave, wave + 4), udta.at("wafm"));
    const std::vector<uint8_t> xyz = udta.at("\xA9xyz");
    EXPECT_EQ("-33.5000+151.2099/", std::string(xyz.begin() + 4, xyz.end()));
    const auto top = childBoxes(file, "");
    std::vector<uint8_t> uuid(kSphereType, kSphereType + 16);
    uuid.insert(uuid.end(), sphere, sphere + sizeof(sphere));
    EXPECT_EQ(uuid, top.at("uuid"));
    std::string errors;
    EXPECT_TRUE(decodesCleanly(out, &errors)) << errors;

    // Our extractor publishes what was set.
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(out.c_str()));
    ASSERT_NE(nullptr, extractor);
    ASSERT_EQ(2u, extractor->countTracks());
    sp<MetaData> meta = extractor->getMetaData();
    const char* text = nullptr;
    ASSERT_TRUE(meta->findCString(kKeyLocation, &text));
    EXPECT_STREQ("-33.5000+151.2099/", text);
    ASSERT_TRUE(meta->findCString('vrty', &text));
    EXPECT_STREQ("slow", text);
    uint32_t type = 0;
    const void* data = nullptr;
    size_t size = 0;
    ASSERT_TRUE(meta->findData('svdt', &type, &data, &size));
    // One zero byte behind the payload, which readers drop.
    ASSERT_EQ(sizeof(sphere) + 1, size);
    EXPECT_EQ(0, memcmp(sphere, data, sizeof(sphere)));
    ASSERT_TRUE(meta->findData('wafm', &type, &data, &size));
    EXPECT_EQ(std::vector<uint8_t>(wave, wave + 4),
              std::vector<uint8_t>(static_cast<const uint8_t*>(data), static_cast<const uint8_t*>(data) + size));
}

}  // namespace
