#ifndef MPEG4_EDITOR_KEYS_H_
#define MPEG4_EDITOR_KEYS_H_

#include <cstdint>

#include <utils/Errors.h>

namespace android {
namespace mpeg4 {

// The media editor's own metadata keys and read status. The editor library
// exports them; the platform does not include its headers, so the codes are
// repeated here and must stay equal to the editor's.
enum : uint32_t {
    kEditorKeyVideoRecordType = 'vrty',  // string
    kEditorKeySphereView = 'svdt',       // data
    kEditorKeyWaveForm = 'wafm',         // data
    kEditorKeyWaveForm2 = 'waf2',        // data
    kEditorKeyUserMessage = 'umsg',      // string
    kEditorKeyRecMode = 'rmod',          // string
    kEditorKeyBookmarkSize = 'bkSz',     // int64, audio track metadata
};

// A read that met a corrupt NAL unit; the editor skips to the next sample.
constexpr status_t kEditorErrorCorruptNal = -1099;

}  // namespace mpeg4
}  // namespace android

#endif
