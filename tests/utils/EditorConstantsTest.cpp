#include <gtest/gtest.h>

#include <media/stagefright/MediaDefs.h>

#include "QNMediaEditorDefs.h"

using namespace android::qnmediaeditor;

namespace {
uint32_t fourcc(const char* s) {
    return uint32_t(uint8_t(s[0])) << 24 | uint32_t(uint8_t(s[1])) << 16 | uint32_t(uint8_t(s[2])) << 8 |
           uint8_t(s[3]);
}
}  // namespace

TEST(EditorConstantsTest, KeysAreTheirCharactersFirstInTheTopByte) {
    const std::pair<uint32_t, const char*> keys[] = {
        {kEditorKeyVideoRecordType, "vrty"}, {kEditorKeySphereView, "svdt"},   {kEditorKeyWaveForm, "wafm"},
        {kEditorKeyWaveForm2, "waf2"},       {kEditorKeyUserMessage, "umsg"},  {kEditorKeyRecMode, "rmod"},
        {kEditorKeyMediaEditorMode, "medt"}, {kEditorKeyFPS100, "FPS1"},       {kEditorKeyAVCC, "avcc"},
        {kEditorKeyHVCC, "hvcc"},            {kEditorKeyESDS, "esds"},         {kEditorKeyWidth, "widt"},
        {kEditorKeyHeight, "heig"},          {kEditorKeyStride, "strd"},       {kEditorKeySliceHeight, "slht"},
        {kEditorKeySyncSampleNum, "SncN"},   {kEditorKeySyncSampleTable, "SncT"},
        {kEditorKeySampleBits, "sbit"},      {kEditorKeyBitsPerSample, "bPsp"}, {kEditorKeyPcmEncoding, "PCMe"},
        {kEditorKeyBookmarkSize, "bkSz"},    {kEditorTypeAVCC, "avcc"},        {kEditorTypeESDS, "esds"},
    };
    for (const auto& k : keys) EXPECT_EQ(fourcc(k.second), k.first) << k.second;
    EXPECT_EQ(0x7761666Du, kEditorKeyWaveForm);
    EXPECT_EQ(0x62507370u, kEditorKeyBitsPerSample);
}

TEST(EditorConstantsTest, CodesAndStrings) {
    EXPECT_EQ(2, kEditorAudioEncodingPcm16bit);
    EXPECT_EQ(4, kEditorAudioEncodingPcmFloat);
    EXPECT_EQ(100, kEditorAudioEncodingPcm24bitPacked);
    EXPECT_EQ(101, kEditorAudioEncodingPcm32bit);
    EXPECT_EQ(-1099, EDITOR_ERROR_CORRUPT_NAL);
    EXPECT_EQ(1, kEditorExtractorOutputFormat_AudioRaw);
    EXPECT_EQ(5, kEditorExtractorOutputFormat_FlacRaw);
    EXPECT_STREQ("bookmark-size", MEDIAEDITOR_RECORDINGPARAM_BOOKMARKSIZE);
    // Set by the library's load-time initialiser.
    ASSERT_NE(nullptr, MEDIAEDITOR_MIMETYPE_FLAC_QNSW);
    EXPECT_EQ(android::KVU_MEDIA_MIMETYPE_AUDIO_FLAC_QNSW, MEDIAEDITOR_MIMETYPE_FLAC_QNSW);
}
