#include "OutputFile.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "Cli.h"
#include "Interrupt.h"

namespace qnedit {

namespace {

std::string dirOf(const std::string& path) {
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

std::string baseOf(const std::string& path) {
    const size_t slash = path.rfind('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

// OUT with a symbolic link followed to the file it names. A dangling link is
// refused: writing "through" it would create a file somewhere the user did not
// name.
std::string resolveTarget(const std::string& path) {
    struct stat st;
    if (lstat(path.c_str(), &st) != 0 || !S_ISLNK(st.st_mode)) return path;
    char resolved[PATH_MAX];
    if (realpath(path.c_str(), resolved) == nullptr) {
        usageError(path + ": a symbolic link to nothing (" + systemCause(errno) + ")");
    }
    return resolved;
}

}  // namespace

std::string systemCause(int error) {
    std::string text = strerror(error);
    if (!text.empty() && text[0] >= 'A' && text[0] <= 'Z' && (text.size() < 2 || !(text[1] >= 'A' && text[1] <= 'Z'))) {
        text[0] = static_cast<char>(text[0] - 'A' + 'a');
    }
    return text;
}

void checkOutputPath(const std::string& path, const std::vector<std::string>& inputs) {
    const std::string target = resolveTarget(path);
    struct stat out;
    if (stat(target.c_str(), &out) != 0) {
        if (errno == ENOENT) return;
        usageError(path + ": cannot be written (" + systemCause(errno) + ")");
    }
    if (!S_ISREG(out.st_mode)) usageError(path + ": exists and is not a regular file; choose another output");
    for (const std::string& input : inputs) {
        struct stat in;
        if (stat(input.c_str(), &in) == 0 && in.st_dev == out.st_dev && in.st_ino == out.st_ino) {
            usageError(path + ": is the same file as the input " + input + "; write to another file");
        }
    }
}

OutputFile::OutputFile(const std::string& path, const std::vector<std::string>& inputs) : mPath(path) {
    checkOutputPath(path, inputs);
    mTarget = resolveTarget(path);
    struct stat existing;
    const bool exists = stat(mTarget.c_str(), &existing) == 0;
    catchInterrupts();
    std::string pattern = dirOf(mTarget) + "/." + baseOf(mTarget) + ".qnedit-XXXXXX";
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    mFd = mkostemp(name.data(), O_CLOEXEC);
    if (mFd < 0) inputError(path + ": cannot create (" + systemCause(errno) + ")");
    mTemp = name.data();
    setInterruptCleanupPath(mTemp.c_str());
    // mkostemp makes the file private; give it the mode OUT has, or the usual one.
    mode_t mode = 0666;
    if (exists) {
        mode = existing.st_mode & 07777;
    } else {
        const mode_t mask = umask(0);
        umask(mask);
        mode &= ~mask;
    }
    fchmod(mFd, mode);
}

OutputFile::~OutputFile() {
    if (mCommitted) return;
    if (mFd >= 0) close(mFd);
    // Only the temporary: this run created it, nothing else.
    unlink(mTemp.c_str());
    setInterruptCleanupPath(nullptr);
}

void OutputFile::commit() {
    checkInterrupted();
    if (fsync(mFd) != 0 && errno != EINVAL) inputError(mPath + ": write failed (" + systemCause(errno) + ")");
    const int fd = mFd;
    mFd = -1;
    if (close(fd) != 0) inputError(mPath + ": write failed (" + systemCause(errno) + ")");
    checkInterrupted();
    if (rename(mTemp.c_str(), mTarget.c_str()) != 0) inputError(mPath + ": cannot be replaced (" + systemCause(errno) + ")");
    mCommitted = true;
    setInterruptCleanupPath(nullptr);
    // The rename itself survives a crash only once the directory is on disk.
    const int dir = open(dirOf(mTarget).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (dir >= 0) {
        fsync(dir);
        close(dir);
    }
}

}  // namespace qnedit
