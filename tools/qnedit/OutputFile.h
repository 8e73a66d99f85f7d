#ifndef QNEDIT_OUTPUT_FILE_H
#define QNEDIT_OUTPUT_FILE_H

#include <string>
#include <vector>

namespace qnedit {

// An output written the way careful editors save: into a temporary file in
// the output's directory, which replaces OUT only when commit() is called
// (after an fsync, by rename). A failed or interrupted run removes only that
// temporary; OUT and everything else on disk stay as they were.
//
// Refused before anything is opened for writing: OUT that is the same file as
// one of `inputs` (same device and inode, links followed), and OUT that exists
// but is not a regular file. A symbolic link as OUT is followed: the file it
// points to is replaced and the link stays. An existing OUT keeps its mode.
class OutputFile {
public:
    OutputFile(const std::string& path, const std::vector<std::string>& inputs);
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    int fd() const { return mFd; }
    // The name given by the user, for messages.
    const std::string& path() const { return mPath; }
    // Flushes the temporary to disk and renames it over OUT; a failure (or an
    // interruption that arrived meanwhile) ends the command and removes it.
    void commit();

private:
    std::string mPath;
    std::string mTarget;  // OUT with links resolved
    std::string mTemp;
    int mFd = -1;
    bool mCommitted = false;
};

// Refuses OUT (a usage error) when it names one of the inputs or exists and is
// not a regular file. OutputFile does this itself; commands call it early so a
// mistake is reported before any long work.
void checkOutputPath(const std::string& path, const std::vector<std::string>& inputs);

// strerror, lower case, for the "(cause)" of an error line.
std::string systemCause(int error);

}  // namespace qnedit

#endif
