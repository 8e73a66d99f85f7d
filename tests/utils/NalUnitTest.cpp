#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

struct Walk {
    std::vector<Bytes> units;
    status_t last = OK;
    const uint8_t* position = nullptr;
    size_t remaining = 0;
};

Walk walk(const Bytes& stream, bool endTerminatesUnit) {
    Walk w;
    const uint8_t* data = stream.data();
    size_t size = stream.size();
    for (;;) {
        const uint8_t* unit = reinterpret_cast<const uint8_t*>(1);
        size_t unitSize = 99;
        w.last = QNMediaEditorUtils::getNextNALUnit(&data, &size, &unit, &unitSize, endTerminatesUnit);
        if (w.last != OK) {
            EXPECT_EQ(nullptr, unit);
            EXPECT_EQ(0u, unitSize);
            break;
        }
        w.units.emplace_back(unit, unit + unitSize);
    }
    w.position = data;
    w.remaining = size;
    return w;
}

sp<MediaCodecBuffer> accessUnit(const Bytes& bytes) {
    return new MediaCodecBuffer(new AMessage, bufferOf(bytes));
}

}  // namespace

TEST(NalUnitTest, UnitsEndAtTheNextStartCodeOrAtTheEndWhenAllowed) {
    const Bytes s = {0x00, 0x00, 0x01, 0x65, 0x88, 0x00, 0x00, 0x01, 0x41, 0x9A};
    LogCapture log;
    Walk w = walk(s, true);
    ASSERT_EQ(2u, w.units.size());
    EXPECT_EQ((Bytes{0x65, 0x88}), w.units[0]);
    EXPECT_EQ((Bytes{0x41, 0x9A}), w.units[1]);
    EXPECT_EQ(ERROR_NOT_CONNECTED, w.last);
    EXPECT_EQ(nullptr, w.position);
    EXPECT_EQ(0u, w.remaining);
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_ERROR, "Next NAL Unit size is zero"));

    log.clear();
    w = walk(s, false);
    ASSERT_EQ(1u, w.units.size());
    EXPECT_EQ(ERROR_NOT_CONNECTED, w.last);
    EXPECT_TRUE(log.contains("Next NAL Unit size is zero in while", "QNMediaEditorUtils"));
    EXPECT_EQ(s.data() + 5, w.position);  // still at 00 00 01 41 9A
    EXPECT_EQ(5u, w.remaining);
}

TEST(NalUnitTest, StartCodeVariantsTrailingZerosAndShortTails) {
    // A final unit of one byte goes with the used-up data.
    Walk w = walk({0x00, 0x00, 0x01, 0x65, 0x88, 0x00, 0x00, 0x01, 0x41}, true);
    ASSERT_EQ(1u, w.units.size());
    EXPECT_EQ((Bytes{0x65, 0x88}), w.units[0]);

    w = walk({0x00, 0x00, 0x00, 0x01, 0x67, 0x42, 0x00, 0x00, 0x00, 0x01, 0x68, 0xCE}, true);
    ASSERT_EQ(2u, w.units.size());
    EXPECT_EQ((Bytes{0x67, 0x42}), w.units[0]);
    EXPECT_EQ((Bytes{0x68, 0xCE}), w.units[1]);

    w = walk({0x00, 0x00, 0x01, 0x09, 0x00, 0x00, 0x00, 0x00, 0x01, 0x06, 0x05}, true);
    ASSERT_EQ(2u, w.units.size());
    EXPECT_EQ((Bytes{0x09}), w.units[0]);

    w = walk({0x00, 0x00, 0x01, 0x00, 0x00, 0x01, 0x65, 0x88}, true);
    ASSERT_EQ(2u, w.units.size());
    EXPECT_TRUE(w.units[0].empty());
    EXPECT_EQ((Bytes{0x65, 0x88}), w.units[1]);

    // A unit keeps one byte even when it is zero.
    w = walk({0x00, 0x00, 0x01, 0x00, 0x00, 0x00, 0x00, 0x01, 0x41, 0x9A}, true);
    ASSERT_EQ(2u, w.units.size());
    EXPECT_EQ((Bytes{0x00}), w.units[0]);
}

TEST(NalUnitTest, DataWithoutALeadingStartCodeIsRefused) {
    LogCapture log;
    EXPECT_EQ(ERROR_MALFORMED, walk({0x00, 0x01, 0x65}, true).last);
    EXPECT_EQ(ERROR_MALFORMED, walk({0x67, 0x42, 0x00}, true).last);
    EXPECT_TRUE(log.lines().empty());
    EXPECT_EQ(ERROR_NOT_CONNECTED, walk({0x00, 0x00, 0x00}, true).last);
    EXPECT_TRUE(log.contains("Next NAL Unit size and offset is same"));
}

TEST(NalUnitTest, FindNALCopiesTheFirstUnitOfTheType) {
    QNMediaEditorUtils utils;
    const Bytes s = {0x00, 0x00, 0x00, 0x01, 0x09, 0xF0, 0x00, 0x00, 0x01, 0x67, 0x42,
                     0x00, 0x00, 0x00, 0x01, 0x68, 0xCE, 0x00, 0x00, 0x01, 0x67, 0x99};
    EXPECT_EQ((Bytes{0x67, 0x42}), bytesOf(utils.FindNAL(s.data(), s.size(), 7)));
    EXPECT_EQ((Bytes{0x68, 0xCE}), bytesOf(utils.FindNAL(s.data(), s.size(), 8)));
    EXPECT_EQ(nullptr, utils.FindNAL(s.data(), s.size(), 5));
    EXPECT_EQ(nullptr, utils.FindNAL(s.data() + 4, s.size() - 4, 9));  // no start code first
    // A stream ending in a start code has an empty last unit that never matches.
    const Bytes tail = {0x00, 0x00, 0x01, 0x09, 0xF0, 0x00, 0x00, 0x01};
    EXPECT_EQ(nullptr, utils.FindNAL(tail.data(), tail.size(), 0));
}

TEST(NalUnitTest, ReferenceFramesAreToldFromTheFirstSlice) {
    EXPECT_TRUE(QNMediaEditorUtils::IsAVCReferenceFrame(
        accessUnit({0x00, 0x00, 0x00, 0x01, 0x09, 0xF0, 0x00, 0x00, 0x00, 0x01, 0x41, 0x9A})));
    EXPECT_FALSE(QNMediaEditorUtils::IsAVCReferenceFrame(accessUnit({0x00, 0x00, 0x00, 0x01, 0x01, 0x9A})));
    EXPECT_TRUE(QNMediaEditorUtils::IsAVCReferenceFrame(accessUnit({0x00, 0x00, 0x00, 0x01, 0x65, 0x88})));
    EXPECT_TRUE(QNMediaEditorUtils::IsAVCReferenceFrame(accessUnit({0x67, 0x42, 0x00})));  // not Annex-B
    {
        LogCapture log;
        EXPECT_TRUE(QNMediaEditorUtils::IsAVCReferenceFrame(accessUnit({0x00, 0x00, 0x00, 0x01, 0x09, 0xF0})));
        EXPECT_TRUE(log.contains("Next NAL Unit size is zero"));
    }
    {
        LogCapture log;
        sp<MediaCodecBuffer> au = accessUnit({0x00, 0x00, 0x01, 0x00, 0x00, 0x01, 0x65, 0x88});
        EXPECT_FALSE(QNMediaEditorUtils::IsAVCReferenceFrame(au));
        char expected[96];
        snprintf(expected, sizeof(expected), "IsAVCReferenceFrame: invalid nalSize: 0 (%p, 5)", au.get());
        EXPECT_TRUE(log.contains(expected));
    }
    {
        LogCapture log;
        sp<MediaCodecBuffer> empty = new MediaCodecBuffer(new AMessage, new ABuffer(size_t(0)));
        EXPECT_FALSE(QNMediaEditorUtils::IsAVCReferenceFrame(empty));
        char expected[96];
        snprintf(expected, sizeof(expected), "IsAVCReferenceFrame: called on NULL data (%p, 0)", empty.get());
        EXPECT_TRUE(log.contains(expected));
    }
}
