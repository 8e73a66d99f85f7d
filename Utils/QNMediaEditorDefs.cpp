#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

#define FOURCC(a, b, c, d) \
    ((uint32_t(uint8_t(a)) << 24) | (uint32_t(uint8_t(b)) << 16) | (uint32_t(uint8_t(c)) << 8) | uint32_t(uint8_t(d)))

const uint32_t kEditorKeyVideoRecordType = FOURCC('v', 'r', 't', 'y');
const uint32_t kEditorKeySphereView = FOURCC('s', 'v', 'd', 't');
const uint32_t kEditorKeyWaveForm = FOURCC('w', 'a', 'f', 'm');
const uint32_t kEditorKeyWaveForm2 = FOURCC('w', 'a', 'f', '2');
const uint32_t kEditorKeyUserMessage = FOURCC('u', 'm', 's', 'g');
const uint32_t kEditorKeyRecMode = FOURCC('r', 'm', 'o', 'd');
const uint32_t kEditorKeyMediaEditorMode = FOURCC('m', 'e', 'd', 't');
const uint32_t kEditorKeyFPS100 = FOURCC('F', 'P', 'S', '1');
const uint32_t kEditorKeyAVCC = FOURCC('a', 'v', 'c', 'c');
const uint32_t kEditorKeyHVCC = FOURCC('h', 'v', 'c', 'c');
const uint32_t kEditorKeyESDS = FOURCC('e', 's', 'd', 's');
const uint32_t kEditorKeyWidth = FOURCC('w', 'i', 'd', 't');
const uint32_t kEditorKeyHeight = FOURCC('h', 'e', 'i', 'g');
const uint32_t kEditorKeyStride = FOURCC('s', 't', 'r', 'd');
const uint32_t kEditorKeySliceHeight = FOURCC('s', 'l', 'h', 't');
const uint32_t kEditorKeySyncSampleNum = FOURCC('S', 'n', 'c', 'N');
const uint32_t kEditorKeySyncSampleTable = FOURCC('S', 'n', 'c', 'T');
const uint32_t kEditorKeySampleBits = FOURCC('s', 'b', 'i', 't');
const uint32_t kEditorKeyBitsPerSample = FOURCC('b', 'P', 's', 'p');
const uint32_t kEditorKeyPcmEncoding = FOURCC('P', 'C', 'M', 'e');
const uint32_t kEditorKeyBookmarkSize = FOURCC('b', 'k', 'S', 'z');

const uint32_t kEditorTypeAVCC = FOURCC('a', 'v', 'c', 'c');
const uint32_t kEditorTypeESDS = FOURCC('e', 's', 'd', 's');

#undef FOURCC

const int32_t kEditorAudioEncodingPcm16bit = 2;
const int32_t kEditorAudioEncodingPcmFloat = 4;
const int32_t kEditorAudioEncodingPcm24bitPacked = 100;
const int32_t kEditorAudioEncodingPcm32bit = 101;

const status_t EDITOR_ERROR_CORRUPT_NAL = -1099;

const int32_t kEditorExtractorOutputFormat_AudioRaw = 1;
const int32_t kEditorExtractorOutputFormat_FlacRaw = 5;

const char* MEDIAEDITOR_RECORDINGPARAM_BOOKMARKSIZE = "bookmark-size";
// Null until the load-time initialiser in QNMediaEditorAdapter.cpp has run.
const char* MEDIAEDITOR_MIMETYPE_FLAC_QNSW = nullptr;

}  // namespace qnmediaeditor
}  // namespace android
