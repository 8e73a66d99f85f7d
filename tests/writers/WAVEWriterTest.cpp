#include <gtest/gtest.h>

#include <cerrno>
#include <cmath>
#include <map>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/QNWAVEWriter.h>

#include "LogCapture.h"
#include "extractor/Sniffers.h"
#include "writers/AudioWriterTestSupport.h"
#include "writers/WaveChunks.h"

using namespace android;
using namespace writertest;

namespace {

struct Chunk {
    std::string id;
    size_t offset;  // of the body
    uint32_t size;
};

// Walks the chunks of a RIFF/WAVE file; fails the test on a broken layout.
std::vector<Chunk> riffChunks(const Bytes& f) {
    std::vector<Chunk> chunks;
    EXPECT_GE(f.size(), 12u);
    if (f.size() < 12) return chunks;
    EXPECT_EQ(0, memcmp(f.data(), "RIFF", 4));
    EXPECT_EQ(0, memcmp(f.data() + 8, "WAVE", 4));
    EXPECT_EQ(le32(f.data() + 4), f.size() - 8) << "RIFF size";
    size_t pos = 12;
    while (pos + 8 <= f.size()) {
        Chunk c{std::string(reinterpret_cast<const char*>(f.data() + pos), 4), pos + 8, le32(f.data() + pos + 4)};
        chunks.push_back(c);
        pos = c.offset + c.size + (c.size & 1);
    }
    EXPECT_EQ(pos, f.size()) << "chunks must fill the file exactly";
    return chunks;
}

const Chunk* find(const std::vector<Chunk>& chunks, const char* id) {
    for (const Chunk& c : chunks) {
        if (c.id == id) return &c;
    }
    return nullptr;
}

sp<MetaData> pcmFormat(int channels, int rate, int encoding = -1, int editorBits = -1) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    meta->setInt32(kKeyChannelCount, channels);
    meta->setInt32(kKeySampleRate, rate);
    if (encoding >= 0) meta->setInt32(kKeyPcmEncoding, encoding);
    if (editorBits >= 0) meta->setInt32('bPsp', editorBits);
    return meta;
}

// Starts a writer on `file`, pushes `pcm` in pieces and stops.
status_t writeWave(const sp<QNWAVEWriter>& writer, const sp<MetaData>& format, const Bytes& pcm,
                   size_t piece = 4000) {
    sp<MediaAdapter> source = makeSource(format);
    status_t err = writer->addSource(source);
    if (err != OK) return err;
    if ((err = writer->start()) != OK) return err;
    pushInPieces(source, pcm, piece);
    return writer->stop();
}

std::string probe(const std::string& path, const char* entries) {
    std::string out;
    run("ffprobe -v error -show_entries " + std::string(entries) + " -of default=nw=1 " + path, &out);
    return out;
}

}  // namespace

TEST(WAVEWriterTest, Pcm16StereoWithItemsReadsBackThroughFfmpegAndTheExtractor) {
    ScratchFile file(".wav");
    sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
    const uint8_t waveform[] = {0x01, 0x02, 0x7F, 0xFF, 0x00, 0x10};
    writer->setWaveform(waveform, 3);
    ASSERT_EQ(OK, writer->setUserMessage(reinterpret_cast<const uint8_t*>("hello there")));
    ASSERT_EQ(OK, writer->setAudioRecodingMeta(0, String8("vr:1")));
    sp<AMessage> params = new AMessage;
    params->setInt64("bookmark-size", 123456789012LL);
    ASSERT_EQ(OK, writer->setRecodingParams(params));

    const Bytes pcm = tone16(2, 44100);
    ASSERT_EQ(OK, writeWave(writer, pcmFormat(2, 44100, kAudioEncodingPcm16bit), pcm));
    EXPECT_TRUE(writer->reachedEOS());

    const Bytes f = file.bytes();
    const std::vector<Chunk> chunks = riffChunks(f);
    ASSERT_EQ(6u, chunks.size());
    EXPECT_EQ("fmt ", chunks[0].id);
    EXPECT_EQ(16u, chunks[0].size);
    EXPECT_EQ(1, le16(f.data() + chunks[0].offset));  // plain PCM
    EXPECT_EQ("data", chunks[1].id);
    EXPECT_EQ(pcm.size(), chunks[1].size);
    const Chunk* bksz = find(chunks, "bksz");
    ASSERT_TRUE(bksz != nullptr && bksz->size == 8);
    EXPECT_EQ(0x1CBE991A14ull, le32(f.data() + bksz->offset) | uint64_t(le32(f.data() + bksz->offset + 4)) << 32);

    sp<IMediaExtractor> extractor = CreateWAVExtractor(new FileSource(file.path().c_str()));
    ASSERT_NE(nullptr, extractor);
    const PublishedItems items = publishedItems(extractor);
    EXPECT_EQ(Bytes(waveform, waveform + 6), items.waveform);
    EXPECT_EQ("hello there", items.userMessage);
    EXPECT_EQ("vr:1", items.recMode);
    EXPECT_EQ(123456789012LL, items.bookmarkSize);
    EXPECT_TRUE(audiotest::Concat(readTrack(extractor)) == pcm);

    if (!haveTool("ffprobe") || !haveTool("ffmpeg")) GTEST_SKIP() << "ffmpeg tools missing";
    EXPECT_EQ("codec_name=pcm_s16le\nsample_rate=44100\nchannels=2\n",
              probe(file.path(), "stream=codec_name,sample_rate,channels"));
    std::string decoded;
    ASSERT_EQ(0, run("ffmpeg -v error -i " + file.path() + " -f s16le -", &decoded));
    EXPECT_TRUE(Bytes(decoded.begin(), decoded.end()) == pcm);
}

TEST(WAVEWriterTest, EverySampleFormatIsStoredAsFfmpegReadsIt) {
    struct Case {
        int encoding, editorBits, channels;
        const char* codec;
        const char* rawFormat;
        bool extensible;
    };
    const Case cases[] = {
        {kAudioEncodingPcm8bit, -1, 1, "pcm_u8", "u8", false},
        {kAudioEncodingPcm24bitPacked, -1, 2, "pcm_s24le", "s24le", true},
        {-1, 24, 1, "pcm_s24le", "s24le", true},  // the muxer's bits-per-sample alone
        {kAudioEncodingPcm32bit, -1, 2, "pcm_s32le", "s32le", true},
        {kAudioEncodingPcmFloat, -1, 2, "pcm_f32le", "f32le", true},
        {kAudioEncodingPcm16bit, -1, 6, "pcm_s16le", "s16le", true},
    };
    const bool tools = haveTool("ffprobe") && haveTool("ffmpeg");
    for (const Case& c : cases) {
        SCOPED_TRACE(c.codec + std::string(" x") + std::to_string(c.channels));
        const int bytesPerSample = c.encoding == kAudioEncodingPcm8bit ? 1
                                   : c.encoding == kAudioEncodingPcm16bit ? 2
                                   : (c.encoding == kAudioEncodingPcm24bitPacked || c.editorBits == 24) ? 3
                                   : 4;
        const size_t frames = 12345;
        Bytes pcm(frames * c.channels * bytesPerSample);
        for (size_t i = 0; i < pcm.size(); ++i) pcm[i] = uint8_t(i * 37 + (i >> 7));
        if (c.encoding == kAudioEncodingPcmFloat) {
            for (size_t i = 0; i < pcm.size() / 4; ++i) {
                const float v = std::sin(float(i) * 0.01f) * 0.8f;
                memcpy(&pcm[4 * i], &v, 4);
            }
        }
        ScratchFile file(".wav");
        sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
        ASSERT_EQ(OK, writeWave(writer, pcmFormat(c.channels, 48000, c.encoding, c.editorBits), pcm, 999));
        const Bytes f = file.bytes();
        const std::vector<Chunk> chunks = riffChunks(f);
        ASSERT_FALSE(chunks.empty());
        const Chunk& fmt = chunks[0];
        EXPECT_EQ(c.extensible ? 0xFFFE : 1, le16(f.data() + fmt.offset));
        EXPECT_EQ(c.extensible ? 40u : 16u, fmt.size);
        EXPECT_EQ(unsigned(c.channels * bytesPerSample), le16(f.data() + fmt.offset + 12));  // block align
        if (c.channels == 6) EXPECT_EQ(0x3Fu, le32(f.data() + fmt.offset + 20));            // 5.1 mask
        const Chunk* fact = find(chunks, "fact");
        EXPECT_EQ(c.encoding == kAudioEncodingPcmFloat, fact != nullptr);
        if (fact) EXPECT_EQ(frames, le32(f.data() + fact->offset));
        const Chunk* data = find(chunks, "data");
        ASSERT_NE(nullptr, data);
        EXPECT_EQ(pcm.size(), data->size);

        if (!tools) continue;
        EXPECT_EQ("codec_name=" + std::string(c.codec) + "\nchannels=" + std::to_string(c.channels) + "\n",
                  probe(file.path(), "stream=codec_name,channels"));
        std::string decoded;
        ASSERT_EQ(0, run("ffmpeg -v error -i " + file.path() + " -f " + c.rawFormat + " -", &decoded));
        EXPECT_TRUE(Bytes(decoded.begin(), decoded.end()) == pcm);
    }
    if (!tools) GTEST_SKIP() << "ffmpeg tools missing; layout checked only";
}

TEST(WAVEWriterTest, EmptyStreamsEmptySamplesAndOddSizesLeaveValidFiles) {
    {
        // No samples at all: a complete file with an empty data chunk.
        ScratchFile file(".wav");
        sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
        ASSERT_EQ(OK, writeWave(writer, pcmFormat(1, 8000, kAudioEncodingPcm16bit), Bytes()));
        const std::vector<Chunk> chunks = riffChunks(file.bytes());
        ASSERT_EQ(2u, chunks.size());
        EXPECT_EQ(0u, chunks[1].size);
        if (haveTool("ffprobe")) EXPECT_EQ(0, run("ffprobe -v error " + file.path()));
    }
    {
        // 8-bit mono, 3 bytes of data and an empty buffer: the pad byte keeps
        // the items that follow on even offsets.
        ScratchFile file(".wav");
        sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
        writer->setUserMessage(reinterpret_cast<const uint8_t*>("odd"));
        sp<MediaAdapter> source = makeSource(pcmFormat(1, 8000, kAudioEncodingPcm8bit));
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        const uint8_t a[] = {0x80, 0x81}, b[] = {0x7F};
        push(source, a, 2);
        push(source, a, 0);
        push(source, b, 1);
        ASSERT_EQ(OK, writer->stop());
        const Bytes f = file.bytes();
        const std::vector<Chunk> chunks = riffChunks(f);
        const Chunk* data = find(chunks, "data");
        ASSERT_NE(nullptr, data);
        EXPECT_EQ(3u, data->size);
        EXPECT_EQ(Bytes({0x80, 0x81, 0x7F}), Bytes(f.begin() + data->offset, f.begin() + data->offset + 3));
        EXPECT_NE(nullptr, find(chunks, "umsg"));
    }
}

TEST(WAVEWriterTest, RefusesWhatItCannotWrite) {
    LogCapture logs;
    // A descriptor open for reading only: start fails, stop repeats it.
    ScratchFile file(".wav");
    const int readOnly = open(file.path().c_str(), O_RDONLY);
    ASSERT_GE(readOnly, 0);
    sp<QNWAVEWriter> writer = new QNWAVEWriter(readOnly);
    ASSERT_EQ(OK, writer->addSource(makeSource(pcmFormat(2, 44100, kAudioEncodingPcm16bit))));
    const status_t err = writer->start();
    EXPECT_NE(OK, err);
    EXPECT_EQ(err, writer->stop());
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_ERROR, "is not writable"));
    close(readOnly);

    sp<QNWAVEWriter> other = new QNWAVEWriter(file.fd);
    sp<MetaData> flac = new MetaData;
    flac->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
    EXPECT_EQ(ERROR_UNSUPPORTED, other->addSource(makeSource(flac)));
    EXPECT_EQ(ERROR_UNSUPPORTED, other->addSource(makeSource(pcmFormat(2, 44100, 7))));
    sp<MetaData> noChannels = pcmFormat(2, 44100);
    noChannels->remove(kKeyChannelCount);
    EXPECT_EQ(BAD_VALUE, other->addSource(makeSource(noChannels)));
    EXPECT_EQ(BAD_VALUE, other->setUserMessage(nullptr));
    EXPECT_EQ(INVALID_OPERATION, other->start());  // no track

    ASSERT_EQ(OK, other->addSource(makeSource(pcmFormat(2, 44100))));
    EXPECT_EQ(INVALID_OPERATION, other->addSource(makeSource(pcmFormat(2, 44100))));
    ASSERT_EQ(OK, other->start());
    EXPECT_EQ(INVALID_OPERATION, other->setUserMessage(reinterpret_cast<const uint8_t*>("late")));
    EXPECT_EQ(INVALID_OPERATION, other->setAudioRecodingMeta(0, String8("late")));
    EXPECT_EQ(INVALID_OPERATION, other->setRecodingParams(new AMessage));
    EXPECT_EQ(INVALID_OPERATION, other->start());
    EXPECT_EQ(OK, other->stop());
}

TEST(WAVEWriterTest, WaveformComputedDuringTheWriteIsStored) {
    ScratchFile file(".wav");
    sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
    sp<AMessage> params = new AMessage;
    params->setInt32("bookmark-size", -5);
    writer->setRecodingParams(params);
    sp<MediaAdapter> source = makeSource(pcmFormat(1, 16000, kAudioEncodingPcm16bit));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    pushInPieces(source, tone16(1, 16000), 640);
    const uint8_t waveform[] = {0x12, 0x34};
    writer->setWaveform(waveform, 1);
    ASSERT_EQ(OK, writer->stop());
    LogCapture logs;
    writer->setWaveform(waveform, 1);  // after the file is done: ignored
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_WARN, "waveform after the file was finished"));

    const Bytes f = file.bytes();
    const std::vector<Chunk> chunks = riffChunks(f);
    const Chunk* wafm = find(chunks, "wafm");
    ASSERT_NE(nullptr, wafm);
    EXPECT_EQ(2u, wafm->size);
    const Chunk* bksz = find(chunks, "bksz");
    ASSERT_NE(nullptr, bksz);
    EXPECT_EQ(0xFFFFFFFBu, le32(f.data() + bksz->offset));
    EXPECT_EQ(0xFFFFFFFFu, le32(f.data() + bksz->offset + 4));
}

TEST(WAVEWriterTest, DataIsCappedSoTheRiffSizeFits) {
    // 44-byte header, 100 bytes of items, 4-byte frames.
    const uint64_t max = WaveChunks::maxDataBytes(44, 100, 4);
    EXPECT_EQ(0u, max % 4);
    EXPECT_LE(36 + max + 1 + 100, 0xFFFFFFFFull);
    EXPECT_GT(36 + max + 4 + 1 + 100, 0xFFFFFFFFull);
    EXPECT_EQ(0u, WaveChunks::maxDataBytes(44, 0xFFFFFFFFull, 4));
}

TEST(WAVEWriterTest, AWriteFailureMidStreamIsReportedAndNeverBlocksTheProducer) {
    ScratchFile file(".wav");
    status_t err;
    {
        FileSizeCap cap(64 * 1024);
        ASSERT_TRUE(cap.active());
        sp<QNWAVEWriter> writer = new QNWAVEWriter(file.fd);
        sp<MediaAdapter> source = makeSource(pcmFormat(2, 44100, kAudioEncodingPcm16bit));
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        LogCapture logs;
        // Far more buffers than the adapter queues: the writer keeps taking them.
        for (int i = 0; i < 300; ++i) push(source, Bytes(4096, uint8_t(i)));
        err = writer->stop();
        EXPECT_TRUE(logs.containsAt(ANDROID_LOG_ERROR, "dropping the rest"));
    }
    EXPECT_EQ(-EFBIG, err);
    // The header describes the samples that were written in full (a
    // partly written one may follow them).
    const Bytes f = file.bytes();
    ASSERT_GE(f.size(), 44u);
    EXPECT_EQ(0, memcmp(f.data(), "RIFF", 4));
    const uint32_t data = le32(f.data() + 40);
    EXPECT_GT(data, 0u);
    EXPECT_EQ(0u, data % 4096);
    EXPECT_LE(44u + data, f.size());
    EXPECT_EQ(36u + data, le32(f.data() + 4));
}
