#include "OutputFile.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <unistd.h>

#include "Cli.h"

namespace qnedit {

OutputFile::OutputFile(const std::string& path) : mPath(path) {
    mFd = open(path.c_str(), O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (mFd < 0) inputError(path + ": cannot create (" + strerror(errno) + ")");
}

OutputFile::~OutputFile() {
    if (mCommitted) return;
    if (mFd >= 0) close(mFd);
    unlink(mPath.c_str());
}

void OutputFile::commit() {
    const int fd = mFd;
    mFd = -1;
    if (fd >= 0 && close(fd) != 0) inputError(mPath + ": write failed (" + strerror(errno) + ")");
    mCommitted = true;
}

}  // namespace qnedit
