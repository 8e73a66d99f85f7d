#include "Input.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>

#include "Cli.h"
#include "OutputFile.h"
#include "QNMediaEditorDefs.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

std::string describeStatus(int status) {
    switch (status) {
        case ERROR_UNSUPPORTED: return "not a supported media file";
        case ERROR_MALFORMED: return "malformed data";
        case ERROR_IO: return "read error";
        case ERROR_END_OF_STREAM: return "no samples";
        case NO_MEMORY: return "out of memory";
        case NO_INIT: return "cannot be read";
        case BAD_VALUE: return "bad value";
        case INVALID_OPERATION: return "invalid operation";
        default:
            // The writers report a failed system call as its negated errno.
            if (status < 0 && status > -4096) return systemCause(-status);
            return "error " + std::to_string(status);
    }
}

std::string describeWriteStatus(int status) {
    return status == ERROR_IO ? "input/output error" : describeStatus(status);
}

int openRegularFile(const std::string& path) {
    // Non-blocking, so that a FIFO without a writer is refused instead of
    // waiting forever; regular files ignore the flag.
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (fd < 0) inputError(path + ": cannot open (" + systemCause(errno) + ")");
    struct stat st;
    if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        close(fd);
        inputError(path + ": not a regular file");
    }
    fcntl(fd, F_SETFL, fcntl(fd, F_GETFL) & ~O_NONBLOCK);
    return fd;
}

Input::Input(const std::string& path, bool flacRaw) : mPath(path) {
    mFd = openRegularFile(path);
    struct stat st;
    if (fstat(mFd, &st) != 0) inputError(path + ": cannot open (" + systemCause(errno) + ")");
    mFileSize = st.st_size;
    {
        // The wrapper does not hand out the file metadata; the platform does.
        // Its extractor goes before the wrapper's opens, so that the two
        // indexes of a long file are never held at once.
        sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(mFd, 0, mFileSize));
        if (extractor != nullptr) mPlatformMeta = extractor->getMetaData();
    }
    mWrapper = new QNMediaExtractorWrapper();
    const status_t err = mWrapper->setDataSource(mFd, 0, mFileSize);
    if (err != OK) {
        const std::string why = takeRefusalReason();
        inputError(path + ": " + describeStatus(err) + (why.empty() ? "" : " (" + why + ")"));
    }
    if (flacRaw) {
        mWrapper->setFlacRaw(true);
        mWrapper->setOutputFormatFlag(kEditorExtractorOutputFormat_FlacRaw);
    }
    if (mWrapper->getFileFormat(&mFileFormat) != OK || mFileFormat == nullptr) {
        inputError(path + ": cannot read the file format");
    }
    for (size_t i = 0; i < mWrapper->countTracks(); ++i) {
        sp<AMessage> format;
        const status_t e = mWrapper->getTrackFormat(i, &format);
        if (e != OK || format == nullptr) inputError(path + ": track " + std::to_string(i) + ": " + describeStatus(e));
        mTrackFormats.push_back(format);
    }
    if (mTrackFormats.empty()) inputError(path + ": no tracks");
}

Input::~Input() {
    mWrapper.clear();
    if (mFd >= 0) close(mFd);
}

int64_t Input::durationUs() const {
    int64_t longest = -1;
    for (const auto& f : mTrackFormats) {
        int64_t d;
        if (f->findInt64("durationUs", &d) && d > longest) longest = d;
    }
    return longest;
}

std::string Input::mimeOf(const sp<AMessage>& format) {
    AString mime;
    return format != nullptr && format->findString("mime", &mime) ? std::string(mime.c_str()) : std::string();
}

bool Input::isVideo(const sp<AMessage>& format) { return mimeOf(format).rfind("video/", 0) == 0; }
bool Input::isAudio(const sp<AMessage>& format) { return mimeOf(format).rfind("audio/", 0) == 0; }

}  // namespace qnedit
