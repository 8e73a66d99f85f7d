#define LOG_TAG "QNM4AWriter"
#include <media/stagefright/QNM4AWriter.h>

#include <log/log.h>

namespace android {

QNM4AWriter::QNM4AWriter(int fd) : MPEG4Writer(fd, FileBrand::kM4a) {}

QNM4AWriter::~QNM4AWriter() {}

status_t QNM4AWriter::setUserMessage(const uint8_t* message) {
    if (message == nullptr) return BAD_VALUE;
    return setUserMessageItem(reinterpret_cast<const char*>(message));
}

status_t QNM4AWriter::setAudioRecodingMeta(int /*kind*/, const String8& text) {
    return setRecModeItem(text.std_string());
}

status_t QNM4AWriter::setRecodingParams(const sp<AMessage>& params) {
    if (params == nullptr) return BAD_VALUE;
    int64_t size64 = 0;
    int32_t size32 = 0;
    if (params->findInt64("bookmark-size", &size64)) return setBookmarkSizeItem(&size64);
    if (params->findInt32("bookmark-size", &size32)) {
        size64 = size32;
        return setBookmarkSizeItem(&size64);
    }
    return setBookmarkSizeItem(nullptr);
}

}  // namespace android
