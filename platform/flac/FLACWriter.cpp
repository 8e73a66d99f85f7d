// Placeholder until the writer lands.
#include <media/stagefright/FLACWriter.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
struct FLACWriter::Impl {};
FLACWriter::FLACWriter(int) {}
FLACWriter::~FLACWriter() {}
status_t FLACWriter::addSource(const sp<MediaSource>&) { return OK; }
status_t FLACWriter::start(MetaData*) { return ERROR_UNSUPPORTED; }
status_t FLACWriter::stop() { return OK; }
status_t FLACWriter::pause() { return OK; }
bool FLACWriter::reachedEOS() { return true; }
void FLACWriter::setWaveform(const uint8_t*, int) {}
status_t FLACWriter::setUserMessage(const uint8_t*) { return OK; }
status_t FLACWriter::setAudioRecodingMeta(int, const String8&) { return OK; }
status_t FLACWriter::setRecodingParams(const sp<AMessage>&) { return OK; }
}  // namespace android
