#define LOG_TAG "QNM4AWriter"
#include <media/stagefright/QNM4AWriter.h>

#include "writer/WriterDeviceItems.h"

namespace android {

QNM4AWriter::QNM4AWriter(int fd) : MPEG4Writer(fd, FileBrand::kM4a) {}

QNM4AWriter::~QNM4AWriter() {}

status_t QNM4AWriter::setUserMessage(const uint8_t* message) { return deviceItems().setUserMessage(message); }

status_t QNM4AWriter::setAudioRecodingMeta(int kind, const String8& text) {
    return deviceItems().setRecMode(kind, text);
}

status_t QNM4AWriter::setRecodingParams(const sp<AMessage>& params) {
    return deviceItems().setRecordingParams(params);
}

}  // namespace android
