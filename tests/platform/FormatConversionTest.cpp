#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/foundation/ABuffer.h>

#include <vector>

#include "LogCapture.h"
#include "media/CodecSpecificData.h"
#include "utils/UtilsTestHelpers.h"

using namespace android;

namespace {

Bytes csd(const sp<AMessage>& msg, const char* name) {
    sp<ABuffer> b;
    if (!msg->findBuffer(name, &b) || b == nullptr) return {};
    int32_t flag = 0;
    int64_t time = -1;
    EXPECT_TRUE(b->meta()->findInt32("csd", &flag) && flag == 1) << name;
    EXPECT_TRUE(b->meta()->findInt64("timeUs", &time) && time == 0) << name;
    return Bytes(b->data(), b->data() + b->size());
}

sp<AMessage> toMessage(const sp<MetaData>& meta) {
    sp<AMessage> msg;
    EXPECT_EQ(OK, convertMetaDataToMessage(meta, &msg));
    return msg;
}

void setBuffer(const sp<AMessage>& msg, const char* name, const Bytes& bytes) {
    msg->setBuffer(name, ABuffer::CreateAsCopy(bytes.data(), bytes.size()));
}

const Bytes kSps = {0x67, 0x42, 0xC0, 0x1E, 0xDA, 0x02, 0x80, 0xF6, 0x40};
const Bytes kPps = {0x68, 0xCE, 0x3C, 0x80};
// The 1080p HEVC parameter sets, with emulation prevention in the SPS.
const Bytes kHevcCsd = {0x00, 0x00, 0x00, 0x01, 0x40, 0x01, 0x0C, 0x01, 0x00, 0x00, 0x00, 0x01, 0x42, 0x01, 0x01,
                        0x01, 0x60, 0x00, 0x00, 0x03, 0x00, 0x90, 0x00, 0x00, 0x03, 0x00, 0x00, 0x03, 0x00, 0x78,
                        0xA0, 0x03, 0xC0, 0x80, 0x11, 0x07, 0xCB, 0x00, 0x00, 0x00, 0x01, 0x44, 0x01, 0xC1, 0x72};

Bytes annexB(std::initializer_list<const Bytes*> units) {
    Bytes out;
    for (const Bytes* u : units) {
        out.insert(out.end(), {0, 0, 0, 1});
        out.insert(out.end(), u->begin(), u->end());
    }
    return out;
}

}  // namespace

TEST(FormatConversionTest, PlainKeysSurviveTheRoundTrip) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    meta->setCString(kKeyMediaLanguage, "eng");
    meta->setInt64(kKeyDuration, 12345678);
    meta->setInt32(kKeyChannelCount, 2);
    meta->setInt32(kKeySampleRate, 48000);
    meta->setInt32(kKeyBitRate, 1536000);
    meta->setInt32(kKeyMaxInputSize, 8192);
    meta->setInt32(kKeyBitsPerSample, 24);
    meta->setInt32('bPsp', 32);
    meta->setInt32(kKeyPcmEncoding, kAudioEncodingPcm32bit);
    meta->setInt32(kKeyEncoderDelay, 1024);
    meta->setInt32(kKeyEncoderPadding, 7);
    meta->setInt32(kKeyRotation, 90);
    meta->setRect(kKeyCropRect, 0, 0, 1919, 1079);

    sp<AMessage> msg = toMessage(meta);
    AString mime;
    int32_t v;
    int64_t d;
    ASSERT_TRUE(msg->findString("mime", &mime));
    EXPECT_STREQ("audio/raw", mime.c_str());
    ASSERT_TRUE(msg->findInt64("durationUs", &d));
    EXPECT_EQ(12345678, d);
    EXPECT_TRUE(msg->findInt32("bits-per-sample", &v) && v == 24);
    EXPECT_TRUE(msg->findInt32("bit-per-sample", &v) && v == 32);
    EXPECT_TRUE(msg->findInt32("pcm-encoding", &v) && v == 101);
    EXPECT_TRUE(msg->findInt32("rotation-degrees", &v) && v == 90);
    EXPECT_FALSE(msg->contains("csd-0"));

    sp<MetaData> back;
    convertMessageToMetaData(msg, back);
    ASSERT_NE(nullptr, back);
    EXPECT_EQ(meta->toString(), back->toString());
}

TEST(FormatConversionTest, ColourCodesMapBetweenContainerAndPlatform) {
    sp<MetaData> meta = new MetaData;
    meta->setInt32(kKeyColorRange, 0);
    meta->setInt32(kKeyColorPrimaries, 9);
    meta->setInt32(kKeyColorMatrix, 9);
    meta->setInt32(kKeyTransferFunction, 16);
    sp<AMessage> msg = toMessage(meta);
    int32_t range, standard, transfer;
    ASSERT_TRUE(msg->findInt32("color-range", &range));
    ASSERT_TRUE(msg->findInt32("color-standard", &standard));
    ASSERT_TRUE(msg->findInt32("color-transfer", &transfer));
    EXPECT_EQ(2, range);     // limited
    EXPECT_EQ(6, standard);  // BT.2020
    EXPECT_EQ(6, transfer);  // ST 2084
    sp<MetaData> back = new MetaData;
    convertMessageToMetaData(msg, back);
    EXPECT_EQ(meta->toString(), back->toString());

    sp<MetaData> unknown = new MetaData;
    unknown->setInt32(kKeyColorPrimaries, 77);
    EXPECT_FALSE(toMessage(unknown)->contains("color-standard"));
}

TEST(FormatConversionTest, AvcRecordBecomesAnnexBAndBack) {
    const Bytes record = {0x01, 0x42, 0xC0, 0x1E, 0xFF, 0xE1, 0x00, 0x09, 0x67, 0x42, 0xC0, 0x1E, 0xDA,
                          0x02, 0x80, 0xF6, 0x40, 0x01, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80};
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_AVC);
    meta->setData(kKeyAVCC, kTypeAVCC, record.data(), record.size());
    sp<AMessage> msg = toMessage(meta);
    EXPECT_EQ(annexB({&kSps}), csd(msg, "csd-0"));
    EXPECT_EQ(annexB({&kPps}), csd(msg, "csd-1"));

    sp<MetaData> back = new MetaData;
    convertMessageToMetaData(msg, back);
    EXPECT_EQ(record, blobOf(*back, kKeyAVCC));

    // Both kinds of parameter set in csd-0 alone give the same record.
    sp<AMessage> one = new AMessage;
    one->setString("mime", MEDIA_MIMETYPE_VIDEO_AVC);
    setBuffer(one, "csd-0", annexB({&kSps, &kPps}));
    sp<MetaData> fromOne = new MetaData;
    convertMessageToMetaData(one, fromOne);
    EXPECT_EQ(record, blobOf(*fromOne, kKeyAVCC));
}

TEST(FormatConversionTest, HevcRecordIsBuiltFromTheSequenceParameterSet) {
    sp<AMessage> msg = new AMessage;
    msg->setString("mime", MEDIA_MIMETYPE_VIDEO_HEVC);
    setBuffer(msg, "csd-0", kHevcCsd);
    sp<MetaData> meta = new MetaData;
    convertMessageToMetaData(msg, meta);
    const Bytes hvcc = blobOf(*meta, kKeyHVCC);
    ASSERT_GE(hvcc.size(), 23u);
    EXPECT_EQ(1, hvcc[0]);
    EXPECT_EQ(0x01, hvcc[1]);   // Main profile, main tier
    EXPECT_EQ(0x60, hvcc[2]);   // compatibility flags 1 and 2
    EXPECT_EQ(0x90, hvcc[6]);   // progressive, frame only
    EXPECT_EQ(0x78, hvcc[12]);  // level 4
    EXPECT_EQ(0xFD, hvcc[16]);  // 4:2:0
    EXPECT_EQ(0xF8, hvcc[17]);  // 8-bit
    EXPECT_EQ(0x0F, hvcc[21]);  // one temporal layer, nested, 4-byte lengths
    EXPECT_EQ(3, hvcc[22]);

    sp<AMessage> again = toMessage(meta);
    EXPECT_EQ(kHevcCsd, csd(again, "csd-0"));

    sp<AMessage> noSps = new AMessage;
    noSps->setString("mime", MEDIA_MIMETYPE_VIDEO_HEVC);
    setBuffer(noSps, "csd-0", Bytes(kHevcCsd.begin(), kHevcCsd.begin() + 8));
    sp<MetaData> none = new MetaData;
    LogCapture log;
    convertMessageToMetaData(noSps, none);
    EXPECT_FALSE(none->hasData(kKeyHVCC));
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "HEVC"));
}

TEST(FormatConversionTest, EsdsCarriesTheDecoderSpecificInfo) {
    const Bytes asc = {0x12, 0x10};  // AAC LC, 44.1 kHz, stereo
    sp<AMessage> msg = new AMessage;
    msg->setString("mime", MEDIA_MIMETYPE_AUDIO_AAC);
    msg->setInt32("bitrate", 128000);
    setBuffer(msg, "csd-0", asc);
    sp<MetaData> meta = new MetaData;
    convertMessageToMetaData(msg, meta);
    const Bytes esds = blobOf(*meta, kKeyESDS);
    const Bytes expected = {0x03, 0x19, 0x00, 0x00, 0x00, 0x04, 0x11, 0x40, 0x15, 0x00, 0x00, 0x00, 0x00, 0x00,
                            0x00, 0x00, 0x00, 0x01, 0xF4, 0x00, 0x05, 0x02, 0x12, 0x10, 0x06, 0x01, 0x02};
    EXPECT_EQ(expected, esds);
    EXPECT_EQ(asc, csd(toMessage(meta), "csd-0"));

    // A descriptor with every optional ES field, 4-byte sizes, inside the
    // box's version and flags.
    const Bytes full = {0x00, 0x00, 0x00, 0x00, 0x03, 0x80, 0x80, 0x80, 0x20, 0x00, 0x01, 0xE0, 0x00, 0x02,
                        0x02, 'a',  'b',  0x00, 0x03, 0x04, 0x80, 0x80, 0x80, 0x11, 0x40, 0x15, 0x00, 0x00,
                        0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x05, 0x02, 0x11, 0x90};
    const uint8_t* dsi;
    size_t size;
    ASSERT_TRUE(esdsDecoderSpecificInfo(full.data(), full.size(), &dsi, &size));
    EXPECT_EQ((Bytes{0x11, 0x90}), Bytes(dsi, dsi + size));
}

TEST(FormatConversionTest, VorbisAndFlacHeadersAreCopied) {
    const Bytes info = {1, 'v', 'o', 'r', 'b', 'i', 's'}, books = {5, 'v', 'o', 'r', 'b', 'i', 's', 9};
    sp<MetaData> vorbis = new MetaData;
    vorbis->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_VORBIS);
    vorbis->setData(kKeyVorbisInfo, 0, info.data(), info.size());
    vorbis->setData(kKeyVorbisBooks, 0, books.data(), books.size());
    sp<AMessage> msg = toMessage(vorbis);
    EXPECT_EQ(info, csd(msg, "csd-0"));
    EXPECT_EQ(books, csd(msg, "csd-1"));
    sp<MetaData> back = new MetaData;
    convertMessageToMetaData(msg, back);
    EXPECT_EQ(books, blobOf(*back, kKeyVorbisBooks));

    const Bytes flac = {'f', 'L', 'a', 'C', 0x80, 0x00, 0x00, 0x22};
    sp<MetaData> f = new MetaData;
    f->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
    f->setData(kKeyFlacMetadata, 0, flac.data(), flac.size());
    sp<MetaData> fback = new MetaData;
    convertMessageToMetaData(toMessage(f), fback);
    EXPECT_EQ(flac, blobOf(*fback, kKeyFlacMetadata));
}

TEST(FormatConversionTest, MalformedRecordsAreSkippedAndTheRestConverted) {
    const Bytes avcc = {0x01, 0x42, 0xC0, 0x1E, 0xFF, 0xE1, 0x00, 0x09, 0x67, 0x42, 0xC0, 0x1E, 0xDA,
                        0x02, 0x80, 0xF6, 0x40, 0x01, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80};
    // Every proper prefix of a valid record is refused without reading past it.
    for (size_t n = 0; n < avcc.size(); ++n) {
        sp<MetaData> meta = new MetaData;
        meta->setInt32(kKeyWidth, 640);
        const Bytes cut(avcc.begin(), avcc.begin() + n);
        meta->setData(kKeyAVCC, kTypeAVCC, cut.data(), cut.size());
        LogCapture log;
        sp<AMessage> msg = toMessage(meta);
        EXPECT_FALSE(msg->contains("csd-0")) << n;
        EXPECT_TRUE(msg->contains("width")) << n;
        EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "avcC")) << n;
    }
    const Bytes hvcc = {1, 1, 0x60, 0, 0, 0, 0x90, 0, 0, 0, 0, 0, 0x78, 0xF0, 0, 0xFC, 0xFD, 0xF8, 0xF8,
                        0, 0, 0x0F, 1, 0xA0, 0, 1, 0, 4, 0x40, 0x01, 0x0C, 0x01};
    for (size_t n = 0; n < hvcc.size(); ++n) {
        Bytes out;
        EXPECT_FALSE(hvccToAnnexB(hvcc.data(), n, &out)) << n;
    }
    Bytes out;
    ASSERT_TRUE(hvccToAnnexB(hvcc.data(), hvcc.size(), &out));
    EXPECT_EQ((Bytes{0, 0, 0, 1, 0x40, 0x01, 0x0C, 0x01}), out);

    const Bytes esds = {0x03, 0x19, 0x00, 0x00, 0x00, 0x04, 0x11, 0x40, 0x15, 0x00, 0x00, 0x00, 0x00, 0x00,
                        0x00, 0x00, 0x00, 0x01, 0xF4, 0x00, 0x05, 0x02, 0x12, 0x10, 0x06, 0x01, 0x02};
    for (size_t n = 0; n < 24; ++n) {
        const uint8_t* dsi;
        size_t size;
        EXPECT_FALSE(esdsDecoderSpecificInfo(esds.data(), n, &dsi, &size)) << n;
    }
}
