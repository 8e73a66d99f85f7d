#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"
#include "UtilsTestHelpers.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace {

struct Dims {
    int width = -1, height = -1, cropWidth = -1, cropHeight = -1, shownWidth = -1, shownHeight = -1;
};

Dims dimsOf(const Bytes& sps) {
    QNMediaEditorUtils utils;
    Dims d;
    utils.FindAVCDimensions(bufferOf(sps), &d.width, &d.height, &d.cropWidth, &d.cropHeight);
    utils.FindAVCDimensions(bufferOf(sps), &d.shownWidth, &d.shownHeight);
    return d;
}

struct SpsFields {
    int profile = 66;
    int chroma = 1;                // written only for the high profiles
    bool scalingLists = false;     // every list present, each one delta of -8
    int pocType = 0;
    std::vector<int> pocCycle;     // offset_for_ref_frame values
    int widthMbs = 40, heightMapUnits = 30;
    bool frameMbsOnly = true;
    bool crop = false;
    int left = 0, right = 0, top = 0, bottom = 0;
};

Bytes makeSps(const SpsFields& f) {
    BitWriter w;
    w.bits(f.profile, 8);
    w.bits(0, 8);
    w.bits(30, 8);
    w.ue(0);
    if (f.profile == 100 || f.profile == 244) {
        w.ue(f.chroma);
        if (f.chroma == 3) w.bits(0, 1);
        w.ue(0);
        w.ue(0);
        w.bits(0, 1);
        w.bits(f.scalingLists, 1);
        if (f.scalingLists) {
            for (int i = 0; i < (f.chroma == 3 ? 12 : 8); ++i) {
                w.bits(1, 1);
                w.se(-8);  // next scale 0: the list ends after one code
            }
        }
    }
    w.ue(0);
    w.ue(f.pocType);
    if (f.pocType == 0) w.ue(2);
    if (f.pocType == 1) {
        w.bits(0, 1);
        w.se(-3);
        w.se(5);
        w.ue(static_cast<uint32_t>(f.pocCycle.size()));
        for (int v : f.pocCycle) w.se(v);
    }
    w.ue(1);
    w.bits(0, 1);
    w.ue(f.widthMbs - 1);
    w.ue(f.heightMapUnits - 1);
    w.bits(f.frameMbsOnly, 1);
    if (!f.frameMbsOnly) w.bits(1, 1);
    w.bits(1, 1);
    w.bits(f.crop, 1);
    if (f.crop) {
        w.ue(f.left);
        w.ue(f.right);
        w.ue(f.top);
        w.ue(f.bottom);
    }
    w.bits(0, 1);  // vui_parameters_present_flag
    return w.unit({0x67});
}

const Bytes kSps640 = {0x67, 0x42, 0xC0, 0x1E, 0xDA, 0x02, 0x80, 0xF6, 0x40};
const Bytes kPps = {0x68, 0xCE, 0x3C, 0x80};
const Bytes kRecord640 = {0x01, 0x42, 0xC0, 0x1E, 0xFD, 0xE1, 0x00, 0x09, 0x67, 0x42, 0xC0, 0x1E,
                          0xDA, 0x02, 0x80, 0xF6, 0x40, 0x01, 0x00, 0x04, 0x68, 0xCE, 0x3C, 0x80};

struct Stored {
    status_t status;
    sp<MetaData> meta;
};

Stored store(Bytes input) {
    QNMediaEditorUtils utils;
    Stored s{OK, new MetaData};
    int size = static_cast<int>(input.size());
    s.status = utils.setAVCCSeqHeader(input.data(), size, s.meta);
    EXPECT_EQ(static_cast<int>(input.size()), size);
    return s;
}

int32_t intOf(const sp<MetaData>& meta, uint32_t key) {
    int32_t v = -1;
    meta->findInt32(key, &v);
    return v;
}

}  // namespace

TEST(AvcSpsTest, SampleParameterSetsGiveCodedAndDisplayedSizes) {
    Dims d = dimsOf(kSps640);
    EXPECT_EQ(640, d.width);
    EXPECT_EQ(480, d.height);
    EXPECT_EQ(640, d.cropWidth);
    EXPECT_EQ(480, d.cropHeight);
    EXPECT_EQ(640, d.shownWidth);
    EXPECT_EQ(480, d.shownHeight);

    d = dimsOf({0x67, 0x64, 0x00, 0x28, 0xAC, 0xB2, 0x80, 0xF0, 0x04, 0x4F, 0xCA, 0x80});
    EXPECT_EQ(1920, d.width);
    EXPECT_EQ(1088, d.height);
    EXPECT_EQ(1920, d.cropWidth);
    EXPECT_EQ(1080, d.cropHeight);
    EXPECT_EQ(1080, d.shownHeight);

    LogCapture log;
    d = dimsOf({0x67, 0x64, 0x00, 0x1F, 0xAD, 0x84, 0x40, 0x59, 0x40, 0x50, 0x05, 0xB9});
    EXPECT_EQ(1280, d.shownWidth);
    EXPECT_EQ(720, d.shownHeight);
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_WARN, "seq_scaling_matrix_present_flag != 0u"));
}

TEST(AvcSpsTest, CropUnitsFollowChromaFormatAndFieldCoding) {
    SpsFields interlaced;
    interlaced.frameMbsOnly = false;
    interlaced.widthMbs = 120;
    interlaced.heightMapUnits = 34;
    interlaced.crop = true;
    interlaced.bottom = 2;
    Dims d = dimsOf(makeSps(interlaced));
    EXPECT_EQ(1088, d.height);
    EXPECT_EQ(1080, d.cropHeight);  // 4 lines per step

    SpsFields mono;
    mono.profile = 100;
    mono.chroma = 0;
    mono.crop = true;
    mono.left = 1;
    mono.right = 2;
    mono.top = 3;
    mono.bottom = 4;
    d = dimsOf(makeSps(mono));
    EXPECT_EQ(640 - 3, d.cropWidth);
    EXPECT_EQ(480 - 7, d.cropHeight);

    // 4:4:4 with all twelve scaling lists and a picture order count cycle:
    // every field before the size must be walked.
    SpsFields full = mono;
    full.profile = 244;
    full.chroma = 3;
    full.scalingLists = true;
    full.pocType = 1;
    full.pocCycle = {1, -2, 300};
    d = dimsOf(makeSps(full));
    EXPECT_EQ(640 - 3, d.cropWidth);
    EXPECT_EQ(480 - 7, d.cropHeight);
}

TEST(AvcSpsTest, ConfigurationRecordFromEitherInputForm) {
    Bytes annexB = {0x00, 0x00, 0x00, 0x01};
    annexB.insert(annexB.end(), kSps640.begin(), kSps640.end());
    annexB.insert(annexB.end(), {0x00, 0x00, 0x00, 0x01});
    annexB.insert(annexB.end(), kPps.begin(), kPps.end());
    Bytes prefixed = {0x00, 0x09};
    prefixed.insert(prefixed.end(), kSps640.begin(), kSps640.end());
    prefixed.insert(prefixed.end(), {0x00, 0x04});
    prefixed.insert(prefixed.end(), kPps.begin(), kPps.end());

    for (const Bytes& input : {annexB, prefixed}) {
        LogCapture log;
        Stored s = store(input);
        ASSERT_EQ(OK, s.status);
        EXPECT_EQ(kRecord640, blobOf(*s.meta, kEditorKeyAVCC));
        uint32_t type = 0;
        const void* data;
        size_t size;
        ASSERT_TRUE(s.meta->findData(kEditorKeyAVCC, &type, &data, &size));
        EXPECT_EQ(kEditorTypeAVCC, type);
        EXPECT_EQ(640, intOf(s.meta, kEditorKeyWidth));
        EXPECT_EQ(640, intOf(s.meta, kEditorKeyStride));
        EXPECT_EQ(480, intOf(s.meta, kEditorKeyHeight));
        EXPECT_EQ(480, intOf(s.meta, kEditorKeySliceHeight));
        EXPECT_TRUE(log.contains("found AVC codec config (640 x 480, 66-profile level 3.0)", "QNMediaEditorUtils"));
    }
}

TEST(AvcSpsTest, AnythingElseIsStoredAsTheRecordItself) {
    Stored s = store({0x01, 0x42, 0xC0});
    ASSERT_EQ(OK, s.status);
    EXPECT_EQ((Bytes{0x01, 0x42, 0xC0}), blobOf(*s.meta, kEditorKeyAVCC));
    EXPECT_EQ(1u, s.meta->countEntries());

    // A finished record: its first length field is not followed by 0x67.
    s = store(kRecord640);
    ASSERT_EQ(OK, s.status);
    EXPECT_EQ(kRecord640, blobOf(*s.meta, kEditorKeyAVCC));
    EXPECT_EQ(1u, s.meta->countEntries());
}

TEST(AvcSpsTest, UnusableParameterSetsWriteNothing) {
    LogCapture log;
    Bytes empty;
    QNMediaEditorUtils utils;
    sp<MetaData> meta = new MetaData;
    int zero = 0;
    EXPECT_EQ(ERROR_NOT_CONNECTED, utils.setAVCCSeqHeader(empty.data(), zero, meta));
    EXPECT_TRUE(log.contains("setAVCCSeqHeader size <= 0"));

    Bytes spsOnly = {0x00, 0x00, 0x00, 0x01};
    spsOnly.insert(spsOnly.end(), kSps640.begin(), kSps640.end());
    Bytes ppsOverruns = {0x00, 0x09};
    ppsOverruns.insert(ppsOverruns.end(), kSps640.begin(), kSps640.end());
    ppsOverruns.insert(ppsOverruns.end(), {0x00, 0x05, 0x68, 0xCE, 0x3C, 0x80});
    const Bytes shortSps = {0x00, 0x00, 0x01, 0x67, 0x42, 0x00, 0x00, 0x01, 0x68, 0xCE};
    const Bytes shortPrefixedSps = {0x00, 0x02, 0x67, 0x42, 0x00, 0x01, 0x68};
    for (const Bytes& input : {spsOnly, ppsOverruns, shortSps, shortPrefixedSps}) {
        Stored s = store(input);
        EXPECT_EQ(ERROR_NOT_CONNECTED, s.status) << input.size();
        EXPECT_EQ(0u, s.meta->countEntries()) << input.size();
    }
}
