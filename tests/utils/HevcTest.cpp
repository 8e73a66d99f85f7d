#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

const Bytes kVps = {0x40, 0x01, 0x0C, 0x01};
// 1920x1088, 4:2:0, bottom conformance offset 4; three emulation-prevention bytes.
const Bytes kSps = {0x42, 0x01, 0x01, 0x01, 0x60, 0x00, 0x00, 0x03, 0x00, 0x90, 0x00, 0x00, 0x03,
                    0x00, 0x00, 0x03, 0x00, 0x78, 0xA0, 0x03, 0xC0, 0x80, 0x11, 0x07, 0xCB};
const Bytes kPps = {0x44, 0x01, 0xC1, 0x72};

Bytes join(std::initializer_list<const Bytes*> units, const Bytes& startCode = {0, 0, 0, 1}) {
    Bytes out;
    for (const Bytes* u : units) {
        out.insert(out.end(), startCode.begin(), startCode.end());
        out.insert(out.end(), u->begin(), u->end());
    }
    return out;
}

struct Result {
    status_t status;
    int width = -1, height = -1, cropWidth = -1, cropHeight = -1;
};

Result dims(const Bytes& csd) {
    Result r;
    r.status = QNMediaEditorUtils::FindHEVCDimensions(bufferOf(csd), &r.width, &r.height, &r.cropWidth, &r.cropHeight);
    return r;
}

}  // namespace

TEST(HevcTest, FindsTheSequenceParameterSetAndItsSizes) {
    const Bytes csd = join({&kVps, &kSps, &kPps});
    size_t offset = 0, length = 0;
    ASSERT_EQ(OK, QNMediaEditorUtils::getHEVCSPSPosition(bufferOf(csd), &offset, &length));
    EXPECT_EQ(12u, offset);
    EXPECT_EQ(25u, length);
    Result r = dims(csd);
    ASSERT_EQ(OK, r.status);
    EXPECT_EQ(1920, r.width);
    EXPECT_EQ(1088, r.height);
    EXPECT_EQ(1920, r.cropWidth);
    EXPECT_EQ(1080, r.cropHeight);

    // The set as the last unit runs to the end of the data.
    const Bytes last = join({&kVps, &kSps});
    ASSERT_EQ(OK, QNMediaEditorUtils::getHEVCSPSPosition(bufferOf(last), &offset, &length));
    EXPECT_EQ(25u, length);
}

TEST(HevcTest, BadBuffersAreRefusedAndOutputsUntouched) {
    LogCapture log;
    EXPECT_EQ(ERROR_MALFORMED, dims({0x00, 0x00, 0x01}).status);
    EXPECT_TRUE(log.contains("csd0 too small"));
    Result r = dims(join({&kVps, &kSps, &kPps}, {0, 0, 1}));
    EXPECT_EQ(ERROR_MALFORMED, r.status);
    EXPECT_TRUE(log.contains("csd0 doesn't start with a start code"));
    EXPECT_EQ(-1, r.width);

    // Three-byte start codes do not split units: one unit, not an SPS.
    Bytes threeByte = {0x00, 0x00, 0x00, 0x01};
    threeByte.insert(threeByte.end(), kVps.begin(), kVps.end());
    for (const Bytes* u : {&kSps, &kPps}) {
        threeByte.insert(threeByte.end(), {0x00, 0x00, 0x01});
        threeByte.insert(threeByte.end(), u->begin(), u->end());
    }
    log.clear();
    EXPECT_EQ(ERROR_MALFORMED, dims(threeByte).status);
    EXPECT_TRUE(log.contains("FindHEVCDimensions error -1007"));

    log.clear();
    const Bytes emptyUnit = {0, 0, 0, 1, 0, 0, 0, 1, 0x42, 0x01, 0x01};
    size_t offset, length;
    EXPECT_EQ(ERROR_MALFORMED, QNMediaEditorUtils::getHEVCSPSPosition(bufferOf(emptyUnit), &offset, &length));
    EXPECT_TRUE(log.lines().empty());

    r = dims({0x00, 0x00, 0x00, 0x01, 0x42});
    EXPECT_EQ(ERROR_MALFORMED, r.status);
    EXPECT_TRUE(log.contains("FindHEVCDimensions size 1, error"));
    EXPECT_EQ(-1, r.cropWidth);
}

TEST(HevcTest, SubLayerProfileAndLevelFieldsAreSkipped) {
    BitWriter w;
    w.bits(0, 4);  // sps_video_parameter_set_id
    w.bits(2, 3);  // sps_max_sub_layers_minus1
    w.bits(1, 1);
    w.bits(0, 96);  // zeros: emulation prevention is needed inside
    w.bits(0xF, 4);  // both sub-layers: profile and level present
    w.bits(0, 12);
    for (int j = 0; j < 2; ++j) {
        w.bits(0, 88);
        w.bits(0, 8);
    }
    w.ue(0);
    w.ue(2);  // 4:2:2
    w.ue(1280);
    w.ue(720);
    w.bits(1, 1);
    for (uint32_t offset : {1u, 2u, 3u, 4u}) w.ue(offset);
    const Bytes sps = w.unit({0x42, 0x01});
    Result r = dims(join({&kVps, &sps, &kPps}));
    ASSERT_EQ(OK, r.status);
    EXPECT_EQ(1280, r.width);
    EXPECT_EQ(720, r.height);
    EXPECT_EQ(1280 - 2 * 3, r.cropWidth);
    EXPECT_EQ(720 - 1 * 7, r.cropHeight);
}

TEST(HevcTest, TruncatedSetReadsMissingFieldsAsZero) {
    const Bytes csd = join({&kVps, &kSps});
    for (size_t n = 12 + 2; n <= csd.size(); ++n) {
        ASSERT_EQ(OK, dims(Bytes(csd.begin(), csd.begin() + n)).status) << n;
    }
    // Cut after the width's code: the height and the window read as 0.
    Result r = dims(Bytes(csd.begin(), csd.begin() + 12 + 22));
    EXPECT_EQ(1920, r.width);
    EXPECT_EQ(0, r.height);
    EXPECT_EQ(0, r.cropHeight);
}
