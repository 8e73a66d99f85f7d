#define LOG_TAG "QNMediaEditorAdapter"

#include <media/stagefright/MediaDefs.h>

#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {
// The library's one load-time initialiser.
struct FlacQnswMimeInitializer {
    FlacQnswMimeInitializer() { MEDIAEDITOR_MIMETYPE_FLAC_QNSW = KVU_MEDIA_MIMETYPE_AUDIO_FLAC_QNSW; }
} gFlacQnswMimeInitializer;
}  // namespace

}  // namespace qnmediaeditor
}  // namespace android
