#include <gtest/gtest.h>

#include <media/stagefright/SupportResolution.h>

using android::isSupportResolution;

TEST(SupportResolutionTest, LimitsByTypeDirectionAndOrientation) {
    EXPECT_TRUE(isSupportResolution("video/avc", nullptr, 4096, 2304, false));
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, 4096, 2304, true));
    EXPECT_TRUE(isSupportResolution("video/avc", "any", 3840, 2160, true));
    EXPECT_TRUE(isSupportResolution("VIDEO/AVC", nullptr, 2160, 3840, true));  // portrait
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, 4098, 2160, false));
    EXPECT_TRUE(isSupportResolution("video/hevc", nullptr, 7680, 4320, false));
    EXPECT_FALSE(isSupportResolution("video/hevc", nullptr, 7680, 4320, true));
    EXPECT_FALSE(isSupportResolution("video/mpeg2", nullptr, 1280, 720, true));  // no encoder
    EXPECT_TRUE(isSupportResolution("video/mpeg2", nullptr, 1280, 720, false));
}

TEST(SupportResolutionTest, RefusesBadSizesAndUnknownTypes) {
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, 0, 720, false));
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, -1280, 720, false));
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, 1281, 720, false));
    EXPECT_FALSE(isSupportResolution("video/avc", nullptr, 1280, 719, false));
    EXPECT_FALSE(isSupportResolution("audio/flac", nullptr, 1280, 720, false));
    EXPECT_FALSE(isSupportResolution(nullptr, nullptr, 1280, 720, false));
}
