#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

sp<MetaData> withAvcc(const Bytes& record) {
    sp<MetaData> meta = new MetaData;
    meta->setData(kEditorKeyAVCC, 0, record.data(), record.size());
    return meta;
}

Bytes csdOf(const sp<AMessage>& msg, const char* name) {
    sp<ABuffer> b;
    if (!msg->findBuffer(name, &b)) return {};
    int32_t csd = 0;
    int64_t time = -1;
    EXPECT_TRUE(b->meta()->findInt32("csd", &csd));
    EXPECT_TRUE(b->meta()->findInt64("timeUs", &time));
    EXPECT_EQ(1, csd);
    EXPECT_EQ(0, time);
    return bytesOf(b);
}

const Bytes kRecord = {0x01, 0x42, 0x00, 0x1E, 0xFF, 0xE1, 0x00, 0x04, 0x67, 0x42,
                       0x00, 0x1E, 0x01, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80};

}  // namespace

TEST(AvcConfigTest, RecordBecomesTwoCodecBuffers) {
    QNMediaEditorUtils utils;
    sp<AMessage> format;
    ASSERT_EQ(OK, utils.convertMetaDataToMessageAVCCSD(withAvcc(kRecord), &format));
    ASSERT_NE(nullptr, format);
    EXPECT_EQ(2u, format->countEntries());
    EXPECT_EQ((Bytes{0, 0, 0, 1, 0x67, 0x42, 0x00, 0x1E}), csdOf(format, "csd-0"));
    EXPECT_EQ((Bytes{0, 0, 0, 1, 0x68, 0xCE, 0x3C, 0x80}), csdOf(format, "csd-1"));

    sp<AMessage> empty;
    ASSERT_EQ(OK, utils.convertMetaDataToMessageAVCCSD(new MetaData, &empty));
    ASSERT_NE(nullptr, empty);
    EXPECT_EQ(0u, empty->countEntries());
}

TEST(AvcConfigTest, BrokenRecordsFailAndKeepTheCallersMessage) {
    QNMediaEditorUtils utils;
    const sp<AMessage> previous = new AMessage;
    struct Case {
        Bytes record;
        bool logs;
    };
    Bytes twoSpsOneGiven = {0x01, 0x42, 0x00, 0x1E, 0xFF, 0xE2, 0x00, 0x04, 0x67, 0x42, 0x00, 0x1E};
    Bytes secondLengthTooLong = {0x01, 0x42, 0x00, 0x1E, 0xFF, 0xE2, 0x00, 0x04, 0x67,
                                 0x42, 0x00, 0x1E, 0x00, 0x09, 0x67, 0x42};
    Bytes noPpsCount(kRecord.begin(), kRecord.begin() + 12);
    const Case cases[] = {
        {Bytes(kRecord.begin(), kRecord.begin() + 6), true},
        {Bytes{0x02, 0x42, 0x00, 0x1E, 0xFF, 0xE1, 0x00}, true},
        {twoSpsOneGiven, true},
        {secondLengthTooLong, false},
        {noPpsCount, true},
    };
    for (const Case& c : cases) {
        LogCapture log;
        sp<AMessage> format = previous;
        EXPECT_EQ(ERROR_NOT_CONNECTED, utils.convertMetaDataToMessageAVCCSD(withAvcc(c.record), &format));
        EXPECT_EQ(previous, format);
        EXPECT_EQ(c.logs, log.contains("b/23680780", "QNMediaEditorUtils")) << c.record.size();
    }
}

TEST(AvcConfigTest, CodecBufferGrowsAndKeepsWhatItHeld) {
    QNMediaEditorUtils utils;
    sp<ABuffer> buffer = new ABuffer(16);
    buffer->setRange(2, 0);
    const Bytes unit = {0x67, 0x42, 0x00, 0x1E};
    ASSERT_EQ(OK, utils.copyNALUToABuffer(&buffer, unit.data(), unit.size()));
    const ABuffer* first = buffer.get();
    EXPECT_EQ(2u, buffer->offset());  // fits: same buffer, same offset
    EXPECT_EQ((Bytes{0, 0, 0, 1, 0x67, 0x42, 0x00, 0x1E}), bytesOf(buffer));

    const Bytes big(3000, 0xAB);
    ASSERT_EQ(OK, utils.copyNALUToABuffer(&buffer, big.data(), big.size()));
    EXPECT_NE(first, buffer.get());
    EXPECT_EQ(0u, buffer->offset());
    EXPECT_EQ(8u + 3000u + 1028u, buffer->capacity());
    ASSERT_EQ(8u + 4u + 3000u, buffer->size());
    EXPECT_EQ(0x1E, buffer->data()[7]);
    EXPECT_EQ(1, buffer->data()[11]);
    EXPECT_EQ(0xAB, buffer->data()[8 + 4 + 2999]);
}

TEST(AvcConfigTest, DescriptorSizeFieldLengthsAndBytes) {
    QNMediaEditorUtils utils;
    const std::pair<unsigned, int> lengths[] = {{0, 1},     {127, 1},     {128, 2},     {16383, 2},
                                                {16384, 3}, {2097151, 3}, {2097152, 4}, {268435455, 4}};
    for (const auto& l : lengths) EXPECT_EQ(l.second, utils.bytesForSize(l.first)) << l.first;

    auto store = [&](unsigned size) {
        uint8_t out[8] = {};
        unsigned offset = 1;
        utils.storeSize(out, offset, size);
        EXPECT_EQ(unsigned(1 + utils.bytesForSize(size)), offset);
        return Bytes(out + 1, out + offset);
    };
    EXPECT_EQ((Bytes{0x7F}), store(127));
    EXPECT_EQ((Bytes{0x81, 0x00}), store(128));
    EXPECT_EQ((Bytes{0x81, 0x48}), store(200));
    EXPECT_EQ((Bytes{0xFF, 0xFF, 0x7F}), store(2097151));
    EXPECT_EQ((Bytes{0x81, 0x80, 0x80, 0x00}), store(2097152));
}

TEST(AvcConfigTest, TrackFormatGetsBitsPerSampleFromTheDeviceKey) {
    sp<MetaData> meta = new MetaData;
    meta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    meta->setInt32(kEditorKeyBitsPerSample, 24);
    sp<AMessage> format;
    ASSERT_EQ(OK, QNMediaEditorUtils::ConvertMetaDataToMessage(meta, &format));
    int32_t bits = 0;
    EXPECT_TRUE(format->findInt32("bit-per-sample", &bits));
    EXPECT_TRUE(format->findInt32("bits-per-sample", &bits));
    EXPECT_EQ(24, bits);

    meta->setInt32(kEditorKeyBitsPerSample, 0);
    ASSERT_EQ(OK, QNMediaEditorUtils::ConvertMetaDataToMessage(meta, &format));
    EXPECT_FALSE(format->contains("bits-per-sample"));

    sp<AMessage> none;
    EXPECT_NE(OK, QNMediaEditorUtils::ConvertMetaDataToMessage(nullptr, &none));
    EXPECT_EQ(nullptr, none);
}
