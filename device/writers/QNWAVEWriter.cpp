// Placeholder until the writer lands.
#include <media/stagefright/QNWAVEWriter.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
struct QNWAVEWriter::Impl {};
QNWAVEWriter::QNWAVEWriter(int) {}
QNWAVEWriter::~QNWAVEWriter() {}
status_t QNWAVEWriter::addSource(const sp<MediaSource>&) { return OK; }
status_t QNWAVEWriter::start(MetaData*) { return ERROR_UNSUPPORTED; }
status_t QNWAVEWriter::stop() { return OK; }
status_t QNWAVEWriter::pause() { return OK; }
bool QNWAVEWriter::reachedEOS() { return true; }
void QNWAVEWriter::setWaveform(const uint8_t*, int) {}
status_t QNWAVEWriter::setUserMessage(const uint8_t*) { return OK; }
status_t QNWAVEWriter::setAudioRecodingMeta(int, const String8&) { return OK; }
status_t QNWAVEWriter::setRecodingParams(const sp<AMessage>&) { return OK; }
}  // namespace android
