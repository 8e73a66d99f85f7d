#ifndef QNEDIT_INPUT_H
#define QNEDIT_INPUT_H

#include <string>
#include <vector>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/AMessage.h>

#include "QNMediaExtractorWrapper.h"

namespace qnedit {

// A source file opened through the extractor wrapper, with its file format
// and its track formats read once.
class Input {
public:
    // flacRaw: FLAC tracks deliver their compressed frames and get codec data.
    explicit Input(const std::string& path, bool flacRaw = false);
    ~Input();

    const std::string& path() const { return mPath; }
    android::qnmediaeditor::QNMediaExtractorWrapper& wrapper() { return *mWrapper; }
    const android::sp<android::AMessage>& fileFormat() const { return mFileFormat; }
    size_t trackCount() const { return mTrackFormats.size(); }
    const android::sp<android::AMessage>& trackFormat(size_t i) const { return mTrackFormats[i]; }
    // The platform's file metadata (location and other keys the file format
    // message does not carry).
    android::sp<android::MetaData> platformFileMeta() const { return mPlatformMeta; }
    int64_t fileSize() const { return mFileSize; }
    // Longest track duration in microseconds, or -1.
    int64_t durationUs() const;

    static std::string mimeOf(const android::sp<android::AMessage>& format);
    static bool isVideo(const android::sp<android::AMessage>& format);
    static bool isAudio(const android::sp<android::AMessage>& format);

private:
    std::string mPath;
    int mFd = -1;
    int64_t mFileSize = 0;
    android::sp<android::qnmediaeditor::QNMediaExtractorWrapper> mWrapper;
    android::sp<android::AMessage> mFileFormat;
    std::vector<android::sp<android::AMessage>> mTrackFormats;
    android::sp<android::MetaData> mPlatformMeta;
};

// A status as a short cause for an error line.
std::string describeStatus(int status);
// The same for a writer's status, where a plain I/O error is not a read error.
std::string describeWriteStatus(int status);
// Opens a regular file for reading; anything else (FIFO, device, directory)
// is refused without blocking.
int openRegularFile(const std::string& path);

}  // namespace qnedit

#endif
