#include <gtest/gtest.h>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

#include "LogCapture.h"
#include "QNMediaFlacFrameConverter.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

using Bytes = std::vector<uint8_t>;
using Converter = QNMediaFlacFrameConverter;

// Bit-at-a-time sums, independent of the converter's tables.
uint8_t refCrc8(const uint8_t* p, size_t n) {
    unsigned crc = 0;
    for (size_t i = 0; i < n; ++i) {
        crc ^= p[i];
        for (int b = 0; b < 8; ++b) crc = (crc & 0x80) ? ((crc << 1) ^ 0x07) & 0xFF : (crc << 1) & 0xFF;
    }
    return static_cast<uint8_t>(crc);
}
uint16_t refCrc16(const uint8_t* p, size_t n) {
    unsigned crc = 0;
    for (size_t i = 0; i < n; ++i) {
        crc ^= static_cast<unsigned>(p[i]) << 8;
        for (int b = 0; b < 8; ++b) crc = (crc & 0x8000) ? ((crc << 1) ^ 0x8005) & 0xFFFF : (crc << 1) & 0xFFFF;
    }
    return static_cast<uint16_t>(crc);
}

// A frame: 4 fixed bytes, the given code, trailers, CRC-8, body, CRC-16.
Bytes makeFrame(uint8_t b1, uint8_t b2, const Bytes& code, const Bytes& trailers, const Bytes& body) {
    Bytes f = {0xFF, b1, b2, 0x18};
    f.insert(f.end(), code.begin(), code.end());
    f.insert(f.end(), trailers.begin(), trailers.end());
    f.push_back(refCrc8(f.data(), f.size()));
    f.insert(f.end(), body.begin(), body.end());
    const uint16_t c = refCrc16(f.data(), f.size());
    f.push_back(c >> 8);
    f.push_back(c & 0xFF);
    return f;
}

// An exactly sized buffer, so any read past the frame trips the address sanitizer.
sp<ABuffer> bufferOf(const Bytes& b, int64_t timeUs = 1234) {
    sp<ABuffer> buf = ABuffer::CreateAsCopy(b.data(), b.size());
    buf->meta()->setInt64("timeUs", timeUs);
    return buf;
}

Bytes bytesOf(const sp<ABuffer>& b) { return Bytes(b->data(), b->data() + b->size()); }

sp<AMessage> formatWithoutCsd() { return new AMessage; }

// Checks a converted frame on its own: coded number, CRC-8 and CRC-16.
void expectValidFrame(const Bytes& f, uint64_t number, size_t headerEnd) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);  // only for the decoder
    uint64_t v = 0;
    uint32_t n = 0;
    ASSERT_TRUE(conv->readUTF8UCS2(f.data() + 4, static_cast<uint32_t>(f.size() - 4), &v, &n, f[1] & 1));
    EXPECT_EQ(number, v);
    EXPECT_EQ(refCrc8(f.data(), headerEnd), f[headerEnd]);
    const uint16_t c = refCrc16(f.data(), f.size() - 2);
    EXPECT_EQ(c >> 8, f[f.size() - 2]);
    EXPECT_EQ(c & 0xFF, f[f.size() - 1]);
}

}  // namespace

TEST(FlacCodedNumberTest, EncodesShortestFormAndRoundTrips) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);
    struct Case { uint64_t value; Bytes code; };
    const Case cases[] = {
        {0, {0x00}}, {127, {0x7F}}, {128, {0xC2, 0x80}}, {2048, {0xE0, 0xA0, 0x80}},
        {5000, {0xE1, 0x8E, 0x88}}, {65536, {0xF0, 0x90, 0x80, 0x80}},
    };
    for (const Case& c : cases) {
        uint8_t out[7];
        uint32_t size = 0;
        ASSERT_TRUE(conv->makeUTF8UCS2(c.value, out, &size, 0));
        EXPECT_EQ(c.code, Bytes(out, out + size)) << c.value;
    }
    // Every size boundary, both ways.
    for (int bits : {7, 11, 16, 21, 26, 31, 36}) {
        for (uint64_t v : {(1ULL << bits) - 1, 1ULL << (bits - 1)}) {
            const unsigned char allow36 = bits > 31;
            uint8_t out[7];
            uint32_t size = 0;
            ASSERT_TRUE(conv->makeUTF8UCS2(v, out, &size, allow36)) << v;
            uint64_t back = 0;
            uint32_t backSize = 0;
            ASSERT_TRUE(conv->readUTF8UCS2(out, &back, &backSize, allow36));
            EXPECT_EQ(v, back);
            EXPECT_EQ(size, backSize);
        }
    }
    uint8_t out[7];
    uint32_t size = 99;
    EXPECT_FALSE(conv->makeUTF8UCS2(1ULL << 31, out, &size, 0));
    EXPECT_EQ(99u, size);
}

TEST(FlacCodedNumberTest, RefusesUnreadableCodesWithTheirLogLines) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);
    LogCapture logs;
    uint64_t v = 0;
    uint32_t size = 0;

    uint8_t seven[7] = {0xFE, 0x80, 0x80, 0x80, 0x80, 0x80, 0x81};
    EXPECT_FALSE(conv->readUTF8UCS2(seven, &v, &size, 0));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 over 31 bit"));
    EXPECT_EQ(~0ULL, v);
    ASSERT_TRUE(conv->readUTF8UCS2(seven, &v, &size, 1));
    EXPECT_EQ(1u, v);
    EXPECT_EQ(7u, size);

    uint8_t all[7] = {0xFF, 0x80, 0x80, 0x80, 0x80, 0x80, 0x80};
    EXPECT_FALSE(conv->readUTF8UCS2(all, &v, &size, 1));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 over 36 bit"));

    uint8_t badTail[3] = {0xE1, 0x8E, 0x08};
    size = 0;
    EXPECT_FALSE(conv->readUTF8UCS2(badTail, &v, &size, 0));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 not 10xxxxxx"));
    EXPECT_EQ(3u, size);  // written before the tail is examined

    // Bit 6 of the lead is not examined: 100xxxxx leads a two-byte code.
    uint8_t odd[2] = {0x85, 0x81};
    ASSERT_TRUE(conv->readUTF8UCS2(odd, &v, &size, 0));
    EXPECT_EQ((5u << 6) | 1u, v);
    EXPECT_EQ(2u, size);

    // A code longer than the bytes that remain is refused without reading on.
    uint8_t cut[2] = {0xE1, 0x8E};
    EXPECT_FALSE(conv->readUTF8UCS2(cut, 2, &v, &size, 0));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 beyond the frame"));
}

TEST(FlacCrcTest, TablesMatchBitwiseSumsAndSlicedEqualsPlain) {
    const char* check = "123456789";
    const auto* p = reinterpret_cast<const uint8_t*>(check);
    EXPECT_EQ(0xF4, Converter::crc8(p, 9));
    EXPECT_EQ(0xFEE8, Converter::crc16(p, 9));
    EXPECT_EQ(0, Converter::crc8(p, 0));
    EXPECT_EQ(0, Converter::crc16(p, 0));

    std::mt19937 rng(7);
    Bytes data(16391 + 17);
    for (auto& b : data) b = static_cast<uint8_t>(rng());
    for (uint32_t offset : {0u, 1u, 3u}) {
        for (uint32_t len : {0u, 1u, 15u, 16u, 17u, 31u, 33u, 127u, 128u, 129u, 145u, 255u, 4096u, 16391u}) {
            const uint8_t* q = data.data() + offset;
            ASSERT_EQ(refCrc8(q, len), Converter::crc8(q, len));
            ASSERT_EQ(refCrc16(q, len), Converter::crc16(q, len));
            ASSERT_EQ(Converter::crc16(q, len), Converter::crc16Sliced(q, len)) << offset << " " << len;
        }
    }
}

TEST(FlacStreamHeaderTest, BuildsHeaderCutsCallersCsdAndHandsOutCopies) {
    Bytes csd = {'f', 'L', 'a', 'C', 0x80, 0x00, 0x00, 0x22};
    for (int i = 0; i < 34; ++i) csd.push_back(static_cast<uint8_t>(i + 1));
    const Bytes seekTable = {0x03, 0, 0, 4, 9, 9, 9, 9};
    Bytes full = csd;
    full.insert(full.end(), seekTable.begin(), seekTable.end());
    sp<ABuffer> csdBuf = ABuffer::CreateAsCopy(full.data(), full.size());
    sp<AMessage> format = new AMessage;
    format->setBuffer("csd-0", csdBuf);

    sp<Converter> conv = new Converter(format);
    EXPECT_EQ(0u, csdBuf->offset());
    EXPECT_EQ(42u, csdBuf->size());

    sp<ABuffer> a, b;
    ASSERT_TRUE(conv->getCSDBuffer(&a, 777));
    ASSERT_TRUE(conv->getCSDBuffer(&b, 888));
    ASSERT_NE(a.get(), b.get());
    const Bytes header = bytesOf(a);
    ASSERT_EQ(86u, header.size());
    EXPECT_EQ(header, bytesOf(b));
    Bytes expectHead = csd;
    expectHead[4] = 0;
    EXPECT_EQ(expectHead, Bytes(header.begin(), header.begin() + 42));
    const Bytes comment = {0x84, 0, 0, 0x28, 0x20, 0, 0, 0};
    EXPECT_EQ(comment, Bytes(header.begin() + 42, header.begin() + 50));
    EXPECT_EQ("reference libFLAC 1.3.2 20170101", std::string(header.begin() + 50, header.begin() + 82));
    EXPECT_EQ(Bytes(4, 0), Bytes(header.begin() + 82, header.end()));

    int64_t t = 0;
    int32_t flag = 0;
    EXPECT_TRUE(a->meta()->findInt64("timeUs", &t));
    EXPECT_EQ(777, t);
    EXPECT_TRUE(a->meta()->findInt32("AM-flacCSD", &flag));
    EXPECT_EQ(1, flag);
    EXPECT_EQ(2u, a->meta()->countEntries());
}

TEST(FlacStreamHeaderTest, MissingOrShortCsdGivesNoHeaderButFramesStillConvert) {
    LogCapture logs;
    sp<AMessage> format = formatWithoutCsd();
    sp<Converter> conv = new Converter(format);
    sp<ABuffer> out;
    EXPECT_FALSE(conv->getCSDBuffer(&out, 0));
    EXPECT_TRUE(logs.contains("mCSDBuffer == NULL"));
    sp<ABuffer> in = bufferOf(makeFrame(0xF8, 0x19, {0x00}, {}, {1, 2, 3}));
    EXPECT_TRUE(conv->convert(in, &out));

    const Bytes shortCsd = {'f', 'L', 'a', 'C', 0x80, 0, 0, 0x22, 1, 2};
    sp<ABuffer> shortBuf = ABuffer::CreateAsCopy(shortCsd.data(), shortCsd.size());
    format->setBuffer("csd-0", shortBuf);
    sp<Converter> conv2 = new Converter(format);
    EXPECT_FALSE(conv2->getCSDBuffer(&out, 0));
    EXPECT_EQ(shortCsd.size(), shortBuf->size());
}

TEST(FlacConvertTest, RenumbersFramesChangingOnlyCodeAndSums) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);
    const Bytes body = {0x10, 0x20, 0x30, 0x40, 0x50};

    // Number 5000 converted first: two bytes shorter, number 0.
    const Bytes in5000 = makeFrame(0xF8, 0x19, {0xE1, 0x8E, 0x88}, {}, body);
    sp<ABuffer> in = bufferOf(in5000, 42);
    in->meta()->setInt32("other", 1);
    sp<ABuffer> out;
    ASSERT_TRUE(conv->convert(in, &out));
    Bytes o = bytesOf(out);
    ASSERT_EQ(in5000.size() - 2, o.size());
    EXPECT_EQ(Bytes(in5000.begin(), in5000.begin() + 4), Bytes(o.begin(), o.begin() + 4));
    EXPECT_EQ(0x00, o[4]);
    EXPECT_EQ(body, Bytes(o.begin() + 6, o.end() - 2));
    expectValidFrame(o, 0, 5);
    EXPECT_EQ(in5000, bytesOf(in));  // input untouched
    int64_t t = 0;
    EXPECT_TRUE(out->meta()->findInt64("timeUs", &t));
    EXPECT_EQ(42, t);
    EXPECT_EQ(1u, out->meta()->countEntries());

    // Frames 1..127 keep one byte; number 128 takes two.
    const Bytes one = makeFrame(0xF8, 0x19, {0x05}, {}, body);
    for (int i = 1; i <= 128; ++i) {
        sp<ABuffer> b = bufferOf(one);
        ASSERT_TRUE(conv->convert(b, &out));
    }
    o = bytesOf(out);
    EXPECT_EQ(one.size() + 1, o.size());
    EXPECT_EQ(0xC2, o[4]);
    EXPECT_EQ(0x80, o[5]);
    expectValidFrame(o, 128, 6);
}

TEST(FlacConvertTest, TrailersAreCopiedAndBlockingBitStillGetsFrameNumber) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);
    // Block size 16-bit trailer, sample rate in tens of Hz: four trailer bytes.
    const Bytes trailers = {0x0F, 0xFF, 0x11, 0x22};
    const Bytes in = makeFrame(0xF8, 0x7E, {0xC2, 0x80}, trailers, {9, 9});
    sp<ABuffer> b = bufferOf(in);
    Converter::ConvertInfo info{};
    ASSERT_TRUE(conv->getFrameHeaderInfo(b, info));
    EXPECT_EQ(4u, info.extraSize);
    EXPECT_EQ(2u, info.utf8Size);
    EXPECT_EQ(10u, info.crc8Pos);
    EXPECT_EQ(in.size() - 2, info.crc16Pos);
    sp<ABuffer> out;
    ASSERT_TRUE(conv->convert(b, &out));
    Bytes o = bytesOf(out);
    EXPECT_EQ(trailers, Bytes(o.begin() + 5, o.begin() + 9));
    expectValidFrame(o, 0, 9);

    // Variable block size: a sample number of 36 bits is replaced by the frame number.
    const Bytes var = makeFrame(0xF9, 0x19, {0xFE, 0x80, 0x80, 0x80, 0x80, 0x80, 0x81}, {}, {1});
    b = bufferOf(var);
    ASSERT_TRUE(conv->convert(b, &out));
    o = bytesOf(out);
    EXPECT_EQ(var.size() - 6, o.size());
    expectValidFrame(o, 1, 5);
}

TEST(FlacConvertTest, BadFramesFailWithTheirLogAndDoNotUseANumber) {
    sp<AMessage> none;
    sp<Converter> conv = new Converter(none);
    LogCapture logs;
    sp<ABuffer> out = nullptr;

    sp<ABuffer> tiny = bufferOf({0xFF, 0xF8, 0x19, 0x18, 0x00, 0x00, 0x00});
    EXPECT_FALSE(conv->convert(tiny, &out));
    EXPECT_TRUE(logs.contains("input buffer size error 7"));

    // Eight bytes, one-byte number, no trailers: an empty body is fine.
    sp<ABuffer> eight = bufferOf(makeFrame(0xF8, 0x19, {0x33}, {}, {}));
    ASSERT_EQ(8u, eight->size());
    Converter::ConvertInfo info{};
    EXPECT_TRUE(conv->getFrameHeaderInfo(eight, info));
    // The same with a trailer byte leaves no room.
    Bytes withTrailer = makeFrame(0xF8, 0x1C, {0x33}, {}, {});
    sp<ABuffer> t = bufferOf(withTrailer);
    EXPECT_FALSE(conv->convert(t, &out));
    EXPECT_TRUE(logs.contains("size error"));

    // A seven-byte code in an eight-byte frame would run past its end.
    logs.clear();
    sp<ABuffer> longCode = bufferOf({0xFF, 0xF9, 0x19, 0x18, 0xFE, 0x80, 0x80, 0x80});
    EXPECT_FALSE(conv->convert(longCode, &out));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 beyond the frame"));
    EXPECT_TRUE(logs.contains("readUTF8UCS2 failed"));

    sp<ABuffer> garbage = bufferOf({0x12, 0x34, 0x56, 0x78, 0xFF, 0x9A, 0xBC, 0xDE, 0xF0, 0x00});
    EXPECT_FALSE(conv->convert(garbage, &out));
    EXPECT_TRUE(logs.contains(" readUTF8UCS2 over 31 bit"));

    sp<ABuffer> noTime = ABuffer::CreateAsCopy(eight->data(), eight->size());
    EXPECT_FALSE(conv->convert(noTime, &out));
    EXPECT_EQ(nullptr, out.get());

    // None of the failures took a number.
    ASSERT_TRUE(conv->convert(eight, &out));
    EXPECT_EQ(0x00, out->data()[4]);
}

// Real streams from the reference encoder, trimmed and checked by its decoder.
namespace {

struct TempDir {
    std::string path;
    TempDir() {
        char tmpl[] = "/tmp/flacconvXXXXXX";
        const char* p = mkdtemp(tmpl);
        path = p ? p : "";
    }
    ~TempDir() {
        if (!path.empty()) std::system(("rm -rf '" + path + "'").c_str());
    }
};

Bytes readFile(const std::string& path) {
    std::ifstream f(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(f), std::istreambuf_iterator<char>());
}
void writeFile(const std::string& path, const Bytes& b) {
    std::ofstream f(path, std::ios::binary);
    f.write(reinterpret_cast<const char*>(b.data()), static_cast<std::streamsize>(b.size()));
}

// Where a fixed-block frame header with a good CRC-8 starts at i, its header length; else 0.
size_t headerAt(const Bytes& d, size_t i) {
    if (i + 6 > d.size() || d[i] != 0xFF || d[i + 1] != 0xF8) return 0;
    const uint8_t lead = d[i + 4];
    size_t n = 1;
    if (lead & 0x80) {
        n = 0;
        for (uint8_t m = 0x80; lead & m; m >>= 1) ++n;
        if (n < 2 || n > 6) return 0;
    }
    const uint8_t bs = d[i + 2] >> 4, sr = d[i + 2] & 0x0F;
    size_t len = 4 + n + (bs == 6 ? 1 : bs == 7 ? 2 : 0) + (sr == 12 ? 1 : (sr == 13 || sr == 14) ? 2 : 0);
    if (i + len + 1 > d.size() || refCrc8(&d[i], len) != d[i + len]) return 0;
    return len;
}

// Splits the frames after the metadata: each ends where its CRC-16 matches before the next header.
std::vector<Bytes> splitFrames(const Bytes& d, size_t start) {
    std::vector<size_t> starts;
    for (size_t i = start; i < d.size(); ++i) {
        if (headerAt(d, i)) starts.push_back(i);
    }
    std::vector<Bytes> frames;
    size_t cur = start;
    for (size_t k = 0; k <= starts.size(); ++k) {
        const size_t end = k < starts.size() ? starts[k] : d.size();
        if (end <= cur + 2) continue;
        const uint16_t c = refCrc16(&d[cur], end - cur - 2);
        if (d[end - 2] == (c >> 8) && d[end - 1] == (c & 0xFF)) {
            frames.emplace_back(d.begin() + cur, d.begin() + end);
            cur = end;
        }
    }
    return frames;
}

}  // namespace

TEST(FlacConvertFileTest, TrimmedStreamDecodesToTheKeptSamples) {
    if (std::system("flac --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "no flac tool";
    TempDir dir;
    ASSERT_FALSE(dir.path.empty());
    const int kFrames = 150, kBlock = 1152, kChannels = 2;
    std::vector<int16_t> pcm(static_cast<size_t>(kFrames) * kBlock * kChannels);
    std::mt19937 rng(3);
    for (size_t i = 0; i < pcm.size(); ++i) {
        pcm[i] = static_cast<int16_t>(8000.0 * std::sin(i * 0.01) + static_cast<int>(rng() % 512) - 256);
    }
    const std::string raw = dir.path + "/in.raw", src = dir.path + "/in.flac";
    writeFile(raw, Bytes(reinterpret_cast<uint8_t*>(pcm.data()), reinterpret_cast<uint8_t*>(pcm.data() + pcm.size())));
    ASSERT_EQ(0, std::system(("flac -s -f --force-raw-format --endian=little --sign=signed --channels=2 --bps=16 "
                              "--sample-rate=44100 --blocksize=1152 -o '" + src + "' '" + raw + "'").c_str()));

    const Bytes file = readFile(src);
    ASSERT_GT(file.size(), 42u);
    // Metadata blocks: keep them all as "csd-0", as the extractor hands them over.
    size_t pos = 4;
    bool last = false;
    while (!last) {
        ASSERT_LT(pos + 4, file.size());
        last = file[pos] & 0x80;
        pos += 4 + ((file[pos + 1] << 16) | (file[pos + 2] << 8) | file[pos + 3]);
    }
    Bytes csd(file.begin(), file.begin() + pos);
    // Total samples and MD5 no longer describe the trimmed stream: mark them unknown.
    csd[21] &= 0xF0;
    std::fill(csd.begin() + 22, csd.begin() + 26, 0);
    std::fill(csd.begin() + 26, csd.begin() + 42, 0);
    const std::vector<Bytes> frames = splitFrames(file, pos);
    ASSERT_EQ(static_cast<size_t>(kFrames), frames.size());

    sp<AMessage> format = new AMessage;
    format->setBuffer("csd-0", ABuffer::CreateAsCopy(csd.data(), csd.size()));
    sp<Converter> conv = new Converter(format);
    sp<ABuffer> header;
    ASSERT_TRUE(conv->getCSDBuffer(&header, 0));
    Bytes outFile = bytesOf(header);
    const int kDrop = 130;  // numbers 130..149 take two bytes, the new ones one
    for (int i = kDrop; i < kFrames; ++i) {
        sp<ABuffer> in = bufferOf(frames[i], i);
        sp<ABuffer> out;
        ASSERT_TRUE(conv->convert(in, &out));
        const Bytes o = bytesOf(out);
        expectValidFrame(o, static_cast<uint64_t>(i - kDrop), headerAt(o, 0));
        outFile.insert(outFile.end(), o.begin(), o.end());
    }
    const std::string trimmed = dir.path + "/trim.flac", decoded = dir.path + "/out.raw";
    writeFile(trimmed, outFile);
    EXPECT_EQ(0, std::system(("flac -s -t '" + trimmed + "' 2> /dev/null").c_str()));
    ASSERT_EQ(0, std::system(("flac -s -d -f --force-raw-format --endian=little --sign=signed -o '" + decoded +
                              "' '" + trimmed + "' 2> /dev/null").c_str()));
    const Bytes got = readFile(decoded);
    const auto* keep = reinterpret_cast<const uint8_t*>(pcm.data() + static_cast<size_t>(kDrop) * kBlock * kChannels);
    const Bytes want(keep, reinterpret_cast<const uint8_t*>(pcm.data() + pcm.size()));
    EXPECT_EQ(want.size(), got.size());
    EXPECT_TRUE(want == got);
}
