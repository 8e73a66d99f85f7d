#include <gtest/gtest.h>

#include <cerrno>

#include <media/stagefright/FLACWriter.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "LogCapture.h"
#include "QNMediaFlacFrameConverter.h"
#include "extractor/Sniffers.h"
#include "flac/FlacStreamHeader.h"
#include "writers/AudioWriterTestSupport.h"

using namespace android;
using namespace writertest;

namespace {

struct Block {
    uint8_t type;
    bool last;
    size_t offset;  // of the body
    size_t size;
};

// The metadata blocks of a FLAC file; `framesAt` receives where the frames
// start. Fails the test on a broken layout.
std::vector<Block> flacBlocks(const Bytes& f, size_t* framesAt = nullptr) {
    std::vector<Block> blocks;
    EXPECT_TRUE(f.size() >= 4 && memcmp(f.data(), "fLaC", 4) == 0);
    size_t pos = 4;
    while (pos + 4 <= f.size()) {
        Block b{uint8_t(f[pos] & 0x7F), (f[pos] & 0x80) != 0, pos + 4, be24(&f[pos + 1])};
        blocks.push_back(b);
        pos = b.offset + b.size;
        if (b.last) break;
    }
    EXPECT_TRUE(!blocks.empty() && blocks.back().last) << "no last-metadata-block flag";
    EXPECT_LE(pos, f.size());
    if (framesAt) *framesAt = pos;
    return blocks;
}

const Block* application(const Bytes& f, const std::vector<Block>& blocks, const char* id) {
    for (const Block& b : blocks) {
        if (b.type == 2 && b.size >= 4 && memcmp(&f[b.offset], id, 4) == 0) return &b;
    }
    return nullptr;
}

Bytes body(const Bytes& f, const Block& b, size_t skip = 0) {
    return Bytes(f.begin() + b.offset + skip, f.begin() + b.offset + b.size);
}

uint64_t totalSamples(const Bytes& f) {
    const uint8_t* s = &f[8];
    return (uint64_t(s[13] & 0x0F) << 32) | (uint64_t(s[14]) << 24) | (s[15] << 16) | (s[16] << 8) | s[17];
}

bool md5IsZero(const Bytes& f) {
    for (int i = 0; i < 16; ++i) {
        if (f[8 + 18 + i] != 0) return false;
    }
    return true;
}

sp<MetaData> pcmFormat(int channels, int rate, int encoding) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    meta->setInt32(kKeyChannelCount, channels);
    meta->setInt32(kKeySampleRate, rate);
    meta->setInt32(kKeyPcmEncoding, encoding);
    return meta;
}

bool flacTests(const std::string& path) { return run("flac -s -t " + path) == 0; }

Bytes flacDecode(const std::string& path) {
    std::string out;
    run("flac -s -d -c --force-raw-format --endian=little --sign=signed " + path, &out);
    return Bytes(out.begin(), out.end());
}

// A stream made by the flac tool, cut into its frames by the FLAC extractor.
struct ToolStream {
    Bytes pcm;
    Bytes header;  // "fLaC" and every metadata block
    std::vector<Bytes> frames;
};

bool makeToolStream(int frames16Stereo, ToolStream* out) {
    ScratchFile raw(".raw"), encoded(".flac");
    out->pcm = tone16(2, frames16Stereo);
    writeFile(raw.path(), out->pcm);
    if (run("flac -s -f --force-raw-format --endian=little --sign=signed --channels=2 --bps=16 "
            "--sample-rate=44100 --blocksize=1152 -o " + encoded.path() + " " + raw.path()) != 0) {
        return false;
    }
    const Bytes f = readFile(encoded.path());
    size_t framesAt = 0;
    flacBlocks(f, &framesAt);
    out->header.assign(f.begin(), f.begin() + framesAt);
    sp<IMediaExtractor> extractor = CreateFLACExtractor(new FileSource(encoded.path().c_str()));
    if (extractor == nullptr || extractor->setOutputFormatFlag(5) != OK) return false;
    for (audiotest::Sample& sample : readTrack(extractor)) out->frames.push_back(std::move(sample.bytes));
    return !out->frames.empty();
}

}  // namespace

TEST(FLACWriterTest, EncodedPcmPassesTheFlacToolAndDecodesBack) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    struct Case {
        int channels, encoding, bytesPerSample;
    };
    for (const Case& c : {Case{2, kAudioEncodingPcm16bit, 2}, Case{1, kAudioEncodingPcm24bitPacked, 3}}) {
        SCOPED_TRACE(c.encoding);
        Bytes pcm;
        if (c.bytesPerSample == 2) {
            pcm = tone16(c.channels, 3 * 44100 + 77);
        } else {
            for (int i = 0; i < 2 * 44100 + 5; ++i) {
                const int v = ((i % 300) - 150) * 50000;
                pcm.insert(pcm.end(), {uint8_t(v), uint8_t(v >> 8), uint8_t(v >> 16)});
            }
        }
        ScratchFile file(".flac");
        sp<FLACWriter> writer = new FLACWriter(file.fd);
        ASSERT_EQ(OK, writer->setUserMessage(reinterpret_cast<const uint8_t*>("message")));
        ASSERT_EQ(OK, writer->setAudioRecodingMeta(0, String8("vr")));
        sp<AMessage> params = new AMessage;
        params->setInt32("bookmark-size", 4096);
        ASSERT_EQ(OK, writer->setRecodingParams(params));
        const uint8_t waveform[] = {0, 1, 2, 3};
        writer->setWaveform(waveform, 2);
        sp<MediaAdapter> source = makeSource(pcmFormat(c.channels, 44100, c.encoding));
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        pushInPieces(source, pcm, 1001);  // pieces cut through sample frames
        ASSERT_EQ(OK, writer->stop());

        const Bytes f = file.bytes();
        const std::vector<Block> blocks = flacBlocks(f);
        ASSERT_GE(blocks.size(), 5u);
        EXPECT_EQ(0, blocks[0].type);
        EXPECT_EQ(1, blocks.back().type);  // padding closes the metadata
        EXPECT_EQ(pcm.size() / (c.channels * c.bytesPerSample), totalSamples(f));
        EXPECT_FALSE(md5IsZero(f));
        const Block* umsg = application(f, blocks, "umsg");
        const Block* rmod = application(f, blocks, "rmod");
        const Block* bksz = application(f, blocks, "bksz");
        const Block* wafm = application(f, blocks, "wafm");
        EXPECT_TRUE(umsg && rmod && bksz && wafm);

        EXPECT_TRUE(flacTests(file.path()));
        EXPECT_TRUE(flacDecode(file.path()) == pcm);
    }
}

TEST(FLACWriterTest, TheFlacExtractorReadsItBackAndItsRawFramesCopyLosslessly) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    const Bytes pcm = tone16(2, 44100);
    ScratchFile first(".flac"), copy(".flac");
    sp<FLACWriter> writer = new FLACWriter(first.fd);
    writer->setUserMessage(reinterpret_cast<const uint8_t*>("message"));
    writer->setAudioRecodingMeta(0, String8("vr"));
    sp<AMessage> params = new AMessage;
    params->setInt64("bookmark-size", -2);
    writer->setRecodingParams(params);
    const uint8_t waveform[] = {0, 1, 2, 3};
    writer->setWaveform(waveform, 2);
    sp<MediaAdapter> source = makeSource(pcmFormat(2, 44100, kAudioEncodingPcm16bit));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    pushInPieces(source, pcm, 4096);
    ASSERT_EQ(OK, writer->stop());

    sp<IMediaExtractor> extractor = CreateFLACExtractor(new FileSource(first.path().c_str()));
    ASSERT_NE(nullptr, extractor);
    const PublishedItems items = publishedItems(extractor);
    EXPECT_EQ("message", items.userMessage);
    EXPECT_EQ("vr", items.recMode);
    EXPECT_EQ(Bytes(waveform, waveform + 4), items.waveform);
    EXPECT_EQ(-2, items.bookmarkSize);
    EXPECT_TRUE(audiotest::Concat(readTrack(extractor)) == pcm);

    // The raw frames and their track format into a second writer.
    ASSERT_EQ(OK, extractor->setOutputFormatFlag(5));
    writer = new FLACWriter(copy.fd);
    source = makeSource(extractor->getTrackMetaData(0));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    for (const audiotest::Sample& s : readTrack(extractor)) push(source, s.bytes, s.timeUs);
    ASSERT_EQ(OK, writer->stop());
    EXPECT_TRUE(flacTests(copy.path()));
    EXPECT_TRUE(flacDecode(copy.path()) == pcm);
}

TEST(FLACWriterTest, FramesWithTheHeaderOfTheTrackFormat) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    ToolStream tool;
    ASSERT_TRUE(makeToolStream(44100 + 300, &tool));
    ASSERT_GT(tool.frames.size(), 30u);

    // The track format as the muxer builds it from a message with "csd-0".
    sp<AMessage> message = new AMessage;
    message->setString("mime", MEDIA_MIMETYPE_AUDIO_FLAC);
    message->setInt32("channel-count", 2);
    message->setInt32("sample-rate", 44100);
    message->setBuffer("csd-0", ABuffer::CreateAsCopy(tool.header.data(), tool.header.size()));
    sp<MetaData> format = new MetaData;
    convertMessageToMetaData(message, format);

    ScratchFile file(".flac");
    sp<FLACWriter> writer = new FLACWriter(file.fd);
    sp<MediaAdapter> source = makeSource(format);
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    LogCapture logs;
    for (size_t i = 0; i < tool.frames.size(); ++i) {
        push(source, tool.frames[i], int64_t(i) * 26122);
        if (i == 3) push(source, Bytes(100, 0x55));  // not a frame: dropped
    }
    ASSERT_EQ(OK, writer->stop());
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_WARN, "not a FLAC frame"));

    const Bytes f = file.bytes();
    EXPECT_EQ(uint64_t(44100 + 300), totalSamples(f));
    EXPECT_TRUE(md5IsZero(f));
    // Block sizes: all frames 1152 but the short last one.
    EXPECT_EQ(Bytes({0x04, 0x80, 0x04, 0x80}), Bytes(f.begin() + 8, f.begin() + 12));
    EXPECT_TRUE(flacTests(file.path()));
    EXPECT_TRUE(flacDecode(file.path()) == tool.pcm);
}

TEST(FLACWriterTest, TrimmedFramesFromTheFrameConverterPassTheFlacTool) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    ToolStream tool;
    ASSERT_TRUE(makeToolStream(44100, &tool));
    const size_t first = 5, last = 20;  // the frames kept

    // The first 42 bytes (marker and STREAMINFO), as the extractor wrapper
    // hands them to the converter.
    sp<AMessage> trackFormat = new AMessage;
    trackFormat->setBuffer("csd-0", ABuffer::CreateAsCopy(tool.header.data(), 42));
    sp<qnmediaeditor::QNMediaFlacFrameConverter> converter = new qnmediaeditor::QNMediaFlacFrameConverter(trackFormat);
    sp<ABuffer> csd;
    ASSERT_TRUE(converter->getCSDBuffer(&csd, 0));

    sp<MetaData> format = new MetaData;
    format->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
    ScratchFile file(".flac");
    sp<FLACWriter> writer = new FLACWriter(file.fd);
    sp<MediaAdapter> source = makeSource(format);
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    push(source, csd->data(), csd->size(), 0, true);
    push(source, csd->data(), csd->size(), 0, true);  // a second header is not a frame either
    for (size_t i = first; i <= last; ++i) {
        sp<ABuffer> in = ABuffer::CreateAsCopy(tool.frames[i].data(), tool.frames[i].size());
        in->meta()->setInt64("timeUs", 0);
        sp<ABuffer> out;
        ASSERT_TRUE(converter->convert(in, &out));
        push(source, out->data(), out->size());
    }
    ASSERT_EQ(OK, writer->stop());

    const Bytes f = file.bytes();
    const std::vector<Block> blocks = flacBlocks(f);
    ASSERT_GE(blocks.size(), 3u);
    EXPECT_EQ(4, blocks[1].type);  // the converter's VORBIS_COMMENT is kept
    EXPECT_EQ((last - first + 1) * 1152, totalSamples(f));
    EXPECT_TRUE(flacTests(file.path()));
    const size_t frameBytes = 4 * 1152;
    EXPECT_TRUE(flacDecode(file.path()) ==
                Bytes(tool.pcm.begin() + first * frameBytes, tool.pcm.begin() + (last + 1) * frameBytes));
}

TEST(FLACWriterTest, LateWaveformTakesThePaddingOrMovesTheFrames) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    const Bytes pcm = tone16(1, 2 * 44100);
    for (const int count : {100, 20000}) {  // fits the padding / does not
        SCOPED_TRACE(count);
        ScratchFile file(".flac");
        sp<FLACWriter> writer = new FLACWriter(file.fd);
        writer->setWaveform(reinterpret_cast<const uint8_t*>("\x11\x22"), 1);  // replaced below
        sp<MediaAdapter> source = makeSource(pcmFormat(1, 44100, kAudioEncodingPcm16bit));
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        pushInPieces(source, pcm, 4096);
        Bytes waveform(2 * count);
        for (size_t i = 0; i < waveform.size(); ++i) waveform[i] = uint8_t(i);
        writer->setWaveform(waveform.data(), count);
        ASSERT_EQ(OK, writer->stop());

        const Bytes f = file.bytes();
        const std::vector<Block> blocks = flacBlocks(f);
        const Block* wafm = application(f, blocks, "wafm");
        ASSERT_NE(nullptr, wafm);
        EXPECT_TRUE(body(f, *wafm, 4) == waveform);
        EXPECT_TRUE(flacTests(file.path()));
        EXPECT_TRUE(flacDecode(file.path()) == pcm);
    }
}

TEST(FLACWriterTest, HeaderlessFramesEmptyStreamsAndRefusals) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    ToolStream tool;
    ASSERT_TRUE(makeToolStream(5000, &tool));
    LogCapture logs;
    {
        // Frames without any stream header: one is built from the first frame.
        sp<MetaData> format = new MetaData;
        format->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
        ScratchFile file(".flac");
        sp<FLACWriter> writer = new FLACWriter(file.fd);
        sp<MediaAdapter> source = makeSource(format);
        ASSERT_EQ(OK, writer->addSource(source));
        ASSERT_EQ(OK, writer->start());
        for (const Bytes& frame : tool.frames) push(source, frame);
        ASSERT_EQ(OK, writer->stop());
        EXPECT_TRUE(flacTests(file.path()));
        EXPECT_TRUE(flacDecode(file.path()) == tool.pcm);
    }
    {
        // No samples: PCM gives an empty stream; frames need the track's
        // audio parameters or there is nothing to describe.
        ScratchFile pcmFile(".flac");
        sp<FLACWriter> writer = new FLACWriter(pcmFile.fd);
        ASSERT_EQ(OK, writer->addSource(makeSource(pcmFormat(2, 48000, kAudioEncodingPcm16bit))));
        ASSERT_EQ(OK, writer->start());
        ASSERT_EQ(OK, writer->stop());
        EXPECT_TRUE(flacTests(pcmFile.path()));

        sp<MetaData> bare = new MetaData;
        bare->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
        ScratchFile framesFile(".flac");
        writer = new FLACWriter(framesFile.fd);
        ASSERT_EQ(OK, writer->addSource(makeSource(bare)));
        ASSERT_EQ(OK, writer->start());
        EXPECT_EQ(ERROR_MALFORMED, writer->stop());
    }
    {
        ScratchFile file(".flac");
        const int readOnly = open(file.path().c_str(), O_RDONLY);
        sp<FLACWriter> writer = new FLACWriter(readOnly);
        ASSERT_EQ(OK, writer->addSource(makeSource(pcmFormat(2, 44100, kAudioEncodingPcm16bit))));
        EXPECT_EQ(-EBADF, writer->start());
        EXPECT_EQ(-EBADF, writer->stop());
        close(readOnly);

        writer = new FLACWriter(file.fd);
        EXPECT_EQ(ERROR_UNSUPPORTED, writer->addSource(makeSource(pcmFormat(2, 44100, kAudioEncodingPcmFloat))));
        EXPECT_EQ(ERROR_UNSUPPORTED, writer->addSource(makeSource(pcmFormat(2, 44100, kAudioEncodingPcm32bit))));
        ASSERT_EQ(OK, writer->addSource(makeSource(pcmFormat(2, 44100, kAudioEncodingPcm16bit))));
        ASSERT_EQ(OK, writer->start());
        EXPECT_EQ(INVALID_OPERATION, writer->setUserMessage(reinterpret_cast<const uint8_t*>("late")));
        EXPECT_EQ(OK, writer->stop());
    }
}

TEST(FLACWriterTest, StreamHeaderFormsAndDamagedHeaders) {
    // STREAMINFO: blocks 4096, 44100 Hz, 2 channels, 16 bits.
    Bytes info(34, 0);
    info[0] = 0x10, info[2] = 0x10;
    info[10] = 0x0A, info[11] = 0xC4, info[12] = 0x42, info[13] = 0xF0;
    Bytes block = {0x00, 0x00, 0x00, 0x22};
    block.insert(block.end(), info.begin(), info.end());
    Bytes full = {'f', 'L', 'a', 'C'};
    full.insert(full.end(), block.begin(), block.end());  // last flag clear, nothing after
    const Bytes comment = {0x84, 0, 0, 8, 0, 0, 0, 0, 0, 0, 0, 0};
    Bytes withComment = full;
    withComment.insert(withComment.end(), comment.begin(), comment.end());

    for (const Bytes* form : {&info, &block, &full, &withComment}) {
        FlacStreamHeader h;
        ASSERT_TRUE(FlacStreamHeader::parse(form->data(), form->size(), &h));
        EXPECT_EQ(44100u, h.info.sampleRate);
        EXPECT_EQ(2u, h.info.channels);
        EXPECT_EQ(16u, h.info.bitsPerSample);
        EXPECT_EQ(form == &withComment ? 1u : 0u, h.kept.size());
    }
    // A block running past the end, a first block that is not STREAMINFO.
    FlacStreamHeader h;
    for (size_t cut = 1; cut < withComment.size(); ++cut) {
        const bool ok = FlacStreamHeader::parse(withComment.data(), cut, &h);
        EXPECT_EQ(cut == full.size() || cut == 34, ok) << cut;
    }
    Bytes wrongFirst = full;
    wrongFirst[4] = 0x04;
    EXPECT_FALSE(FlacStreamHeader::parse(wrongFirst.data(), wrongFirst.size(), &h));
}

TEST(FLACWriterTest, LateWaveformWithoutRoomOnAWriteOnlyDescriptor) {
    if (!haveTool("flac")) GTEST_SKIP() << "flac missing";
    ScratchFile file(".flac");
    const int writeOnly = open(file.path().c_str(), O_WRONLY);
    ASSERT_GE(writeOnly, 0);
    sp<FLACWriter> writer = new FLACWriter(writeOnly);
    sp<MediaAdapter> source = makeSource(pcmFormat(1, 44100, kAudioEncodingPcm16bit));
    ASSERT_EQ(OK, writer->addSource(source));
    ASSERT_EQ(OK, writer->start());
    pushInPieces(source, tone16(1, 44100), 4096);
    const Bytes waveform(40000, 0x5A);
    writer->setWaveform(waveform.data(), 20000);
    LogCapture logs;
    // The frames cannot be moved: the waveform is reported lost, the file stays whole.
    EXPECT_EQ(ERROR_IO, writer->stop());
    close(writeOnly);
    EXPECT_TRUE(logs.containsAt(ANDROID_LOG_ERROR, "no room for the waveform"));
    const Bytes f = file.bytes();
    EXPECT_EQ(nullptr, application(f, flacBlocks(f), "wafm"));
    EXPECT_TRUE(flacTests(file.path()));
}
