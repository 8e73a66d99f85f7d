// Placeholder until the MP4 writer lands.
#include <media/stagefright/MPEG4Writer.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
struct MPEG4Writer::Impl {};
MPEG4Writer::MPEG4Writer(int) {}
MPEG4Writer::~MPEG4Writer() {}
status_t MPEG4Writer::addSource(const sp<MediaSource>&) { return OK; }
status_t MPEG4Writer::start(MetaData*) { return ERROR_UNSUPPORTED; }
status_t MPEG4Writer::stop() { return OK; }
status_t MPEG4Writer::pause() { return OK; }
bool MPEG4Writer::reachedEOS() { return true; }
void MPEG4Writer::setWaveform(const uint8_t*, int) {}
status_t MPEG4Writer::setGeoData(int, int) { return OK; }
status_t MPEG4Writer::setUuidData(const uint8_t*, int) { return OK; }
status_t MPEG4Writer::setQNVideoFourCC(String8) { return OK; }
}  // namespace android
