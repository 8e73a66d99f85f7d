// Placeholder until the writer lands.
#include <media/stagefright/AMRWriter.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
struct AMRWriter::Impl {};
AMRWriter::AMRWriter(int) {}
AMRWriter::~AMRWriter() {}
status_t AMRWriter::addSource(const sp<MediaSource>&) { return OK; }
status_t AMRWriter::start(MetaData*) { return ERROR_UNSUPPORTED; }
status_t AMRWriter::stop() { return OK; }
status_t AMRWriter::pause() { return OK; }
bool AMRWriter::reachedEOS() { return true; }
status_t AMRWriter::initCheck() const { return OK; }
}  // namespace android
