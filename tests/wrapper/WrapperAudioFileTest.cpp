#include <gtest/gtest.h>

#include "QNMediaEditorDefs.h"
#include "WrapperMedia.h"

using namespace android;
using namespace android::qnmediaeditor;
using namespace audiotest;
using namespace wrappertest;

TEST(WrapperAudioFileTest, PcmFilesReadBackWholeAndInOrder) {
    for (const char* name : {"u8_mono.wav", "s16_stereo.wav", "s24_mono.wav", "s24_ext_6ch.wav", "s32_stereo.wav",
                             "f32_mono.wav", "b4096.flac", "s24.flac"}) {
        SCOPED_TRACE(name);
        sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(MediaPath(name));
        ASSERT_NE(nullptr, wrapper);
        ASSERT_EQ(1u, wrapper->countTracks());
        ASSERT_EQ(OK, wrapper->selectTrack(0));
        const std::vector<Delivered> samples = ReadAll(wrapper);
        ASSERT_FALSE(samples.empty());
        EXPECT_EQ(0, samples[0].timeUs);
        for (size_t i = 1; i < samples.size(); ++i) EXPECT_LT(samples[i - 1].timeUs, samples[i].timeUs);
        // No format asked, so no track is re-packed.
        const std::vector<uint8_t> pcm = Concat(samples);
        EXPECT_EQ(Fact(name, "pcm_fnv"), Hex64(Fnv(pcm)));
        EXPECT_EQ(static_cast<size_t>(FactInt(name, "frames") * FactInt(name, "channels") * FactInt(name, "bits") / 8),
                  pcm.size());
        EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->advance());
        ASSERT_EQ(OK, wrapper->seekTo(0));
        EXPECT_EQ(pcm, Concat(ReadAll(wrapper)));
    }
}

TEST(WrapperAudioFileTest, ThirtyTwoBitTracksArePackedOnceTheirFormatIsAsked) {
    sp<QNMediaExtractorWrapper> plain = OpenWrapper(MediaPath("s32_stereo.wav"));
    sp<QNMediaExtractorWrapper> packed = OpenWrapper(MediaPath("s32_stereo.wav"));
    ASSERT_NE(nullptr, plain);
    ASSERT_NE(nullptr, packed);
    sp<AMessage> format;
    ASSERT_EQ(OK, packed->getTrackFormat(0, &format));
    int32_t encoding = 0, bits = 0;
    EXPECT_TRUE(format->findInt32("pcm-encoding", &encoding));
    EXPECT_EQ(kEditorAudioEncodingPcm24bitPacked, encoding);
    EXPECT_TRUE(format->findInt32("bits-per-sample", &bits));
    EXPECT_EQ(24, bits);
    ASSERT_EQ(OK, plain->selectTrack(0));
    ASSERT_EQ(OK, packed->selectTrack(0));
    const std::vector<uint8_t> words = Concat(ReadAll(plain)), triples = Concat(ReadAll(packed));
    ASSERT_EQ(words.size() / 4 * 3, triples.size());
    for (size_t i = 0; i < triples.size() / 3; ++i) {
        ASSERT_EQ(0, memcmp(&words[4 * i + 1], &triples[3 * i], 3)) << "sample " << i;
    }
}

TEST(WrapperAudioFileTest, DeviceItemsOfAWaveFile) {
    sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(MediaPath("items.wav"));
    ASSERT_NE(nullptr, wrapper);
    sp<AMessage> file, track;
    ASSERT_EQ(OK, wrapper->getFileFormat(&file));
    sp<ABuffer> wave;
    AString text;
    ASSERT_TRUE(file->findBuffer("AM-waveform1", &wave));
    EXPECT_EQ((std::vector<uint8_t>{0x00, 0x01, 0xFF, 0xFE, 0x7F, 0xFF}),
              std::vector<uint8_t>(wave->data(), wave->data() + wave->size()));
    EXPECT_TRUE(file->findString("qn-usermessage", &text) && text == "hello-device");
    EXPECT_TRUE(file->findString("qn-vrmeta", &text) && text == "vr180");
    ASSERT_EQ(OK, wrapper->getTrackFormat(0, &track));
    int32_t bookmark = 0;
    EXPECT_TRUE(track->findInt32("AM-bookmarksize", &bookmark));
    EXPECT_EQ(4660, bookmark);
}

TEST(WrapperAudioFileTest, AmrFramesMatchThePacketList) {
    for (const char* name : {"nb.amr", "wb.awb"}) {
        SCOPED_TRACE(name);
        sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(MediaPath(name));
        ASSERT_NE(nullptr, wrapper);
        sp<AMessage> format;
        int32_t rate = 0;
        ASSERT_EQ(OK, wrapper->getTrackFormat(0, &format));
        ASSERT_TRUE(format->findInt32("sample-rate", &rate));
        ASSERT_EQ(OK, wrapper->selectTrack(0));
        const std::vector<Delivered> samples = ReadAll(wrapper);
        const std::vector<Packet> packets = Packets(name);
        ASSERT_EQ(packets.size(), samples.size());
        for (size_t i = 0; i < packets.size(); ++i) {
            EXPECT_EQ(packets[i].size, samples[i].bytes.size()) << i;
            EXPECT_EQ(packets[i].pts * 1000000 / rate, samples[i].timeUs) << i;
        }
        int64_t bitrate = 0;
        EXPECT_TRUE(wrapper->getTotalBitrate(&bitrate));
        EXPECT_GT(bitrate, 0);
    }
}

TEST(WrapperAudioFileTest, RawFlacFramesComeWithAStreamHeader) {
    for (const char* name : {"b4096.flac", "b1152.flac"}) {
        SCOPED_TRACE(name);
        sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(MediaPath(name));
        ASSERT_NE(nullptr, wrapper);
        ASSERT_EQ(OK, wrapper->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw));
        ASSERT_EQ(OK, wrapper->setFlacRaw(true));
        sp<AMessage> format;
        ASSERT_EQ(OK, wrapper->getTrackFormat(0, &format));
        sp<ABuffer> csd;
        int32_t trim = 0, rate = 0;
        ASSERT_TRUE(format->findBuffer("csd-0", &csd));
        EXPECT_TRUE(format->findInt32("editor-flactrim", &trim) && trim == 1);
        ASSERT_TRUE(format->findInt32("sample-rate", &rate));
        // "fLaC" and STREAMINFO as stored, marked as the only metadata block.
        std::vector<uint8_t> header = ReadFile(name);
        header.resize(42);
        header[4] = 0;
        EXPECT_EQ(header, std::vector<uint8_t>(csd->data(), csd->data() + csd->size()));

        ASSERT_EQ(OK, wrapper->selectTrack(0));
        const std::vector<Delivered> frames = ReadAll(wrapper);
        const std::vector<Packet> packets = Packets(name);
        ASSERT_EQ(packets.size(), frames.size());
        for (size_t i = 0; i < packets.size(); ++i) {
            EXPECT_EQ(packets[i].size, frames[i].bytes.size()) << i;
            EXPECT_EQ(packets[i].pts * 1000000 / rate, frames[i].timeUs) << i;
        }
    }
}

TEST(WrapperAudioFileTest, VorbisPacketsCarryTheirValidCountBehindThem) {
    sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(MediaPath("stereo.ogg"));
    ASSERT_NE(nullptr, wrapper);
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    const std::vector<Delivered> samples = ReadAll(wrapper);
    const std::vector<Packet> packets = Packets("stereo.ogg");
    ASSERT_EQ(packets.size(), samples.size());
    int64_t kept = 0;
    for (size_t i = 0; i < packets.size(); ++i) {
        ASSERT_EQ(packets[i].size + 4, samples[i].bytes.size()) << i;
        int32_t valid;
        memcpy(&valid, samples[i].bytes.data() + packets[i].size, sizeof(valid));
        kept += valid;
    }
    // The last granule position trims the stream to its frame count.
    EXPECT_EQ(FactInt("stereo.ogg", "frames"), kept);
}
