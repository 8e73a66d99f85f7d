#include <gtest/gtest.h>

#include <media/stagefright/AMRWriter.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "amr/AMRFrames.h"
#include "extractor/Sniffers.h"
#include "writers/AudioWriterTestSupport.h"

using namespace android;
using namespace writertest;

namespace {

sp<MetaData> amrFormat(const char* mime) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, mime);
    meta->setInt32(kKeyChannelCount, 1);
    meta->setInt32(kKeySampleRate, std::strcmp(mime, MEDIA_MIMETYPE_AUDIO_AMR_WB) == 0 ? 16000 : 8000);
    return meta;
}

// One stored frame of a type: its header byte (quality bit set) and payload.
Bytes frame(bool wideband, unsigned type, uint8_t fill) {
    const uint8_t header = uint8_t((type << 3) | 0x04);
    Bytes f(AMRFrameSize(wideband, header), fill);
    f[0] = header;
    return f;
}

std::string probe(const std::string& path) {
    std::string out;
    run("ffprobe -v error -count_packets -show_entries stream=codec_name,sample_rate,nb_read_packets -of "
        "default=nw=1 " + path, &out);
    return out;
}

}  // namespace

TEST(AMRWriterTest, FramesFollowTheMagicOfTheirKindAndDecode) {
    struct Case {
        const char* mime;
        bool wideband;
        const char* magic;
        const char* codec;
        const char* rate;
    };
    for (const Case& c : {Case{MEDIA_MIMETYPE_AUDIO_AMR_NB, false, "#!AMR\n", "amr_nb", "8000"},
                          Case{MEDIA_MIMETYPE_AUDIO_AMR_WB, true, "#!AMR-WB\n", "amr_wb", "16000"}}) {
        SCOPED_TRACE(c.mime);
        ScratchFile file(c.wideband ? ".awb" : ".amr");
        sp<AMRWriter> writer = new AMRWriter(file.fd);
        ASSERT_EQ(OK, writer->initCheck());
        sp<MediaAdapter> source = makeSource(amrFormat(c.mime));
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        Bytes expected(c.magic, c.magic + strlen(c.magic));
        const unsigned modes = c.wideband ? 9 : 8;
        int frames = 0;
        for (int i = 0; i < 100; ++i) {
            // Mostly speech frames of every mode, some samples with two frames.
            Bytes sample = frame(c.wideband, i % modes, uint8_t(i));
            ++frames;
            if (i % 7 == 0) {
                const Bytes second = frame(c.wideband, 15, 0);  // NO_DATA: the header byte alone
                sample.insert(sample.end(), second.begin(), second.end());
                ++frames;
            }
            push(source, sample, i * 20000);
            expected.insert(expected.end(), sample.begin(), sample.end());
        }
        ASSERT_EQ(OK, writer->stop());
        EXPECT_TRUE(file.bytes() == expected);

        if (!haveTool("ffprobe")) continue;
        EXPECT_EQ("codec_name=" + std::string(c.codec) + "\nsample_rate=" + c.rate +
                      "\nnb_read_packets=" + std::to_string(frames) + "\n",
                  probe(file.path()));
    }
}

TEST(AMRWriterTest, MalformedAndEmptySamplesAreLeftOut) {
    ScratchFile file(".amr");
    sp<AMRWriter> writer = new AMRWriter(file.fd);
    sp<MediaAdapter> source = makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AMR_NB));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    LogCapture logs;
    const Bytes good = frame(false, 7, 0x55);
    Bytes truncated = good;
    truncated.pop_back();
    Bytes trailing = good;
    trailing.push_back(0x3C);           // a second frame cut short
    const Bytes reserved = {0x4C, 1};   // frame type 9 is not stored
    push(source, good);
    push(source, truncated);
    push(source, trailing);
    push(source, reserved);
    push(source, Bytes());
    push(source, good);
    ASSERT_EQ(OK, writer->stop());
    Bytes expected = {'#', '!', 'A', 'M', 'R', '\n'};
    expected.insert(expected.end(), good.begin(), good.end());
    expected.insert(expected.end(), good.begin(), good.end());
    EXPECT_TRUE(file.bytes() == expected);
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_WARN, "3 malformed samples were dropped"));
}

TEST(AMRWriterTest, RefusalsAndTheEmptyFile) {
    LogCapture logs;
    sp<AMRWriter> bad = new AMRWriter(-1);
    EXPECT_EQ(NO_INIT, bad->initCheck());
    ASSERT_EQ(OK, bad->addSource(makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AMR_NB))));
    EXPECT_EQ(BAD_VALUE, bad->start());
    EXPECT_EQ(BAD_VALUE, bad->stop());

    ScratchFile file(".awb");
    sp<AMRWriter> writer = new AMRWriter(file.fd);
    EXPECT_EQ(ERROR_UNSUPPORTED, writer->addSource(makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AAC))));
    EXPECT_EQ(BAD_VALUE, writer->addSource(nullptr));
    ASSERT_EQ(OK, writer->addSource(makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AMR_WB))));
    EXPECT_EQ(INVALID_OPERATION, writer->addSource(makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AMR_WB))));
    EXPECT_EQ(ERROR_UNSUPPORTED, writer->pause());
    EXPECT_FALSE(writer->reachedEOS());
    ASSERT_EQ(OK, writer->start());
    EXPECT_EQ(OK, writer->stop());
    EXPECT_TRUE(writer->reachedEOS());
    EXPECT_EQ(OK, writer->stop());
    const Bytes f = file.bytes();
    EXPECT_EQ("#!AMR-WB\n", std::string(f.begin(), f.end()));
}

TEST(AMRWriterTest, TheAmrExtractorReadsBackEveryFrame) {
    ScratchFile file(".amr");
    sp<AMRWriter> writer = new AMRWriter(file.fd);
    sp<MediaAdapter> source = makeSource(amrFormat(MEDIA_MIMETYPE_AUDIO_AMR_NB));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    Bytes frames;
    for (int i = 0; i < 60; ++i) {
        const Bytes f = frame(false, i % 9, uint8_t(i));  // speech modes and SID
        push(source, f, i * 20000);
        frames.insert(frames.end(), f.begin(), f.end());
    }
    ASSERT_EQ(OK, writer->stop());

    sp<IMediaExtractor> extractor = CreateAMRExtractor(new FileSource(file.path().c_str()));
    ASSERT_NE(nullptr, extractor);
    const std::vector<audiotest::Sample> samples = readTrack(extractor);
    EXPECT_EQ(60u, samples.size());
    EXPECT_TRUE(audiotest::Concat(samples) == frames);
}
