#include <gtest/gtest.h>

#include "WrapperMedia.h"

using namespace android;
using namespace wrappertest;

namespace {

std::string Mp4Path(const std::string& name) { return std::string(ME_TEST_MEDIA_DIR) + "/mp4/" + name; }

class WrapperMp4FileTest : public ::testing::TestWithParam<const char*> {};

}  // namespace

TEST_P(WrapperMp4FileTest, MergedSamplesMatchTheProbe) {
    const auto streams = Mp4Packets(GetParam());
    ASSERT_FALSE(streams.empty());
    sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(Mp4Path(GetParam()));
    ASSERT_NE(nullptr, wrapper);
    ASSERT_EQ(streams.size(), wrapper->countTracks());
    // Last track first, so that ties go against the extractor's order.
    std::vector<size_t> selection;
    for (size_t i = streams.size(); i-- > 0;) {
        ASSERT_EQ(OK, wrapper->selectTrack(i));
        selection.push_back(i);
    }
    ExpectDeliveredInOrder(MergeOrder(streams, selection), ReadAll(wrapper));

    sp<AMessage> format;
    AString mime;
    ASSERT_EQ(OK, wrapper->getFileFormat(&format));
    EXPECT_TRUE(format->findString("mime", &mime));
    int64_t bitrate = 0;
    EXPECT_TRUE(wrapper->getTotalBitrate(&bitrate));
    EXPECT_GT(bitrate, 0);
}

INSTANTIATE_TEST_SUITE_P(Files, WrapperMp4FileTest,
                         ::testing::Values("avc_aac.mp4", "avc_aac_faststart.mp4", "hevc.mp4", "aac.m4a",
                                           "amr_nb.3gp", "avc_rotated.mp4"));

TEST(WrapperMp4SeekTest, SeekModesReachTheTrack) {
    sp<QNMediaExtractorWrapper> wrapper = OpenWrapper(Mp4Path("avc_aac.mp4"));
    ASSERT_NE(nullptr, wrapper);
    ASSERT_EQ(OK, wrapper->selectTrack(0));
    const int64_t target = 500000;  // key frames at 0 and 1 s
    int64_t timeUs = -1;
    sp<MetaData> meta;
    int32_t sync = 0;
    ASSERT_EQ(OK, wrapper->seekTo(target, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC));
    ASSERT_EQ(OK, wrapper->getSampleTime(&timeUs));
    EXPECT_EQ(0, timeUs);
    ASSERT_EQ(OK, wrapper->getSampleMeta(&meta));
    EXPECT_TRUE(meta->findInt32(kKeyIsSyncFrame, &sync) && sync);
    ASSERT_EQ(OK, wrapper->seekTo(target, MediaTrack::ReadOptions::SEEK_NEXT_SYNC));
    ASSERT_EQ(OK, wrapper->getSampleTime(&timeUs));
    EXPECT_NEAR(1000000, timeUs, 1);
    EXPECT_EQ(ERROR_END_OF_STREAM, wrapper->seekTo(1100000, MediaTrack::ReadOptions::SEEK_NEXT_SYNC));
}
