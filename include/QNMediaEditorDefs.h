#ifndef QN_MEDIA_EDITOR_DEFS_H
#define QN_MEDIA_EDITOR_DEFS_H

#include <cstdint>

#include <utils/Errors.h>

namespace android {
namespace qnmediaeditor {

// Metadata keys under which the editor's own fields travel in MetaData.
extern const uint32_t kEditorKeyVideoRecordType;   // 'vrty' string
extern const uint32_t kEditorKeySphereView;        // 'svdt' data
extern const uint32_t kEditorKeyWaveForm;          // 'wafm' data
extern const uint32_t kEditorKeyWaveForm2;         // 'waf2' data
extern const uint32_t kEditorKeyUserMessage;       // 'umsg' string
extern const uint32_t kEditorKeyRecMode;           // 'rmod' string
extern const uint32_t kEditorKeyMediaEditorMode;   // 'medt'
extern const uint32_t kEditorKeyFPS100;            // 'FPS1'
extern const uint32_t kEditorKeyAVCC;              // 'avcc' data
extern const uint32_t kEditorKeyHVCC;              // 'hvcc'
extern const uint32_t kEditorKeyESDS;              // 'esds'
extern const uint32_t kEditorKeyWidth;             // 'widt' int32
extern const uint32_t kEditorKeyHeight;            // 'heig' int32
extern const uint32_t kEditorKeyStride;            // 'strd' int32
extern const uint32_t kEditorKeySliceHeight;       // 'slht' int32
extern const uint32_t kEditorKeySyncSampleNum;     // 'SncN'
extern const uint32_t kEditorKeySyncSampleTable;   // 'SncT'
extern const uint32_t kEditorKeySampleBits;        // 'sbit' int32
extern const uint32_t kEditorKeyBitsPerSample;     // 'bPsp' int32
extern const uint32_t kEditorKeyPcmEncoding;       // 'PCMe' int32
extern const uint32_t kEditorKeyBookmarkSize;      // 'bkSz' int64

// Type tags of MetaData blobs.
extern const uint32_t kEditorTypeAVCC;  // 'avcc'
extern const uint32_t kEditorTypeESDS;  // 'esds'

// PCM encodings carried under kEditorKeyPcmEncoding.
extern const int32_t kEditorAudioEncodingPcm16bit;        // 2
extern const int32_t kEditorAudioEncodingPcmFloat;        // 4
extern const int32_t kEditorAudioEncodingPcm24bitPacked;  // 100
extern const int32_t kEditorAudioEncodingPcm32bit;        // 101

// A track source's read hit a corrupt NAL unit.
extern const status_t EDITOR_ERROR_CORRUPT_NAL;  // -1099

// Extractor output modes, handed to the extractor's output-format flag.
extern const int32_t kEditorExtractorOutputFormat_AudioRaw;  // 1
extern const int32_t kEditorExtractorOutputFormat_FlacRaw;   // 5

// Message key of the bookmark size among recording parameters.
extern const char* MEDIAEDITOR_RECORDINGPARAM_BOOKMARKSIZE;
// MIME type of the device's FLAC variant; set when the library is loaded.
extern const char* MEDIAEDITOR_MIMETYPE_FLAC_QNSW;

}  // namespace qnmediaeditor
}  // namespace android

#endif
