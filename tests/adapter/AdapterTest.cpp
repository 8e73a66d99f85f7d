#include <gtest/gtest.h>

#include <kestro/Kestro.h>
#include <media/stagefright/MediaErrors.h>

#include "LogCapture.h"
#include "QNMediaEditorAdapter.h"
#include "muxer/MuxerTestSupport.h"

using namespace android;
using android::qnmediaeditor::Adapter;

namespace {

const uint8_t* text(const char* s) { return reinterpret_cast<const uint8_t*>(s); }

TEST(AdapterTest, MissingWriterOrExtractorIsNotConnected) {
    LogCapture log;
    const sp<MediaWriter> none;
    const uint8_t data[] = {1, 2};
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetLocation(none, 1, 2));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetUuidData(none, data, 2));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetRecordingType(none, String8("t")));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetWaveform(none, data, 1));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetUserMessage(none, 13, text("m")));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetVRMeta(none, 13, text("v")));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetRecodingParams(none, 2, new AMessage));
    EXPECT_EQ(ERROR_NOT_CONNECTED, Adapter::SetOutputFormatFlag(nullptr, 5));
    int writerLines = 0, extractorLines = 0;
    for (const auto& l : log.lines()) {
        EXPECT_EQ("QNMediaEditorAdapter", l.tag);
        EXPECT_EQ(ANDROID_LOG_DEBUG, l.priority);
        writerLines += l.message == "writer is null";
        extractorLines += l.message == "extractor is null";
    }
    EXPECT_EQ(7, writerLines);
    EXPECT_EQ(1, extractorLines);
}

TEST(AdapterTest, PerFormatItemsAreNoOpsOutsideTheAudioWriters) {
    // Not one of the audio writers: any call through a cast would be wrong
    // (the sanitizer build reports it).
    sp<muxertest::RecordingWriter> writer = new muxertest::RecordingWriter;
    for (int format : {2, 11, 12, 0, 16}) {
        EXPECT_EQ(OK, Adapter::SetUserMessage(writer, format, text("m")));
        EXPECT_EQ(OK, Adapter::SetVRMeta(writer, format, text("v")));
        EXPECT_EQ(OK, Adapter::SetRecodingParams(writer, format, new AMessage));
    }
    const uint8_t waveform[] = {0, 1, 0, 2, 0, 3};
    EXPECT_EQ(OK, Adapter::SetWaveform(writer, waveform, 3));
    EXPECT_EQ(3, writer->waveformCount);  // the count, not the byte size
}

struct FlagRecorder : public IMediaExtractor {
    size_t countTracks() override { return 0; }
    sp<IMediaSource> getTrack(size_t) override { return nullptr; }
    sp<MetaData> getTrackMetaData(size_t, uint32_t) override { return nullptr; }
    sp<MetaData> getMetaData() override { return new MetaData; }
    uint32_t flags() const override { return 0; }
    const char* name() override { return "FlagRecorder"; }
    status_t setOutputFormatFlag(uint32_t f) override {
        flag = f;
        return ERROR_UNSUPPORTED;
    }
    uint32_t flag = 0;
};

TEST(AdapterTest, OutputFormatFlagReachesTheExtractorUnchanged) {
    sp<FlagRecorder> extractor = new FlagRecorder;
    EXPECT_EQ(ERROR_UNSUPPORTED, Adapter::SetOutputFormatFlag(extractor, 0xABCD));
    EXPECT_EQ(0xABCDu, extractor->flag);
}

class AdapterSettingsTest : public ::testing::Test {
protected:
    void SetUp() override { clearKeys(); }
    void TearDown() override { clearKeys(); }
    void clearKeys() {
        info()->removeFeatureValue("NewFeatures", SETTING_MEDIAEDITOR_AUDIO_BGMSYNC);
        info()->removeFeatureValue("NewFeatures", SETTING_MEDIAEDITOR_USE_DITHER_TYPE);
    }
    static KestroFeatureInfo* info() { return Kestro::getInstance()->getFeatureInfo(2); }
};

TEST_F(AdapterSettingsTest, BgmSyncOffsetDefaultsToZeroWhenUnset) {
    LogCapture log;
    EXPECT_FALSE(Adapter::GetBGMSyncFromKestro(nullptr));
    EXPECT_TRUE(log.lines().empty());

    int offset = 99;
    EXPECT_TRUE(Adapter::GetBGMSyncFromKestro(&offset));
    EXPECT_EQ(0, offset);
    EXPECT_TRUE(log.containsAt(ANDROID_LOG_DEBUG, "can not find SETTING_MEDIAEDITOR_AUDIO_BGMSYNC"));

    info()->setFeatureValue("NewFeatures", SETTING_MEDIAEDITOR_AUDIO_BGMSYNC, "-40");
    EXPECT_TRUE(Adapter::GetBGMSyncFromKestro(&offset));
    EXPECT_EQ(-40, offset);
    EXPECT_TRUE(log.contains("getDefaultBGMSyncOffset = -40", "QNMediaEditorAdapter"));
}

TEST_F(AdapterSettingsTest, DitherTypeIsLeftAloneWhenUnset) {
    int type = 7;
    EXPECT_FALSE(Adapter::GetUseDitherTypeFromKestro(&type));
    EXPECT_EQ(7, type);
    EXPECT_FALSE(Adapter::GetUseDitherTypeFromKestro(nullptr));

    LogCapture log;
    for (auto [value, expected] : {std::pair<const char*, int>{"2", 2}, {"  -3x", -3}, {"abc", 0}}) {
        info()->setFeatureValue("NewFeatures", SETTING_MEDIAEDITOR_USE_DITHER_TYPE, value);
        EXPECT_TRUE(Adapter::GetUseDitherTypeFromKestro(&type));
        EXPECT_EQ(expected, type) << value;
    }
    EXPECT_TRUE(log.contains("get useDitherType = 2", "QNMediaEditorAdapter"));
}

}  // namespace
