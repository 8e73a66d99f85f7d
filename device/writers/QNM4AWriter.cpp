// Placeholder until the M4A writer lands.
#include <media/stagefright/QNM4AWriter.h>

namespace android {
QNM4AWriter::QNM4AWriter(int fd) : MPEG4Writer(fd) {}
QNM4AWriter::~QNM4AWriter() {}
status_t QNM4AWriter::setUserMessage(const uint8_t*) { return OK; }
status_t QNM4AWriter::setAudioRecodingMeta(int, const String8&) { return OK; }
status_t QNM4AWriter::setRecodingParams(const sp<AMessage>&) { return OK; }
}  // namespace android
