#ifndef QNEDIT_OUTPUT_FILE_H
#define QNEDIT_OUTPUT_FILE_H

#include <string>

namespace qnedit {

// An output being written: removed again unless commit() is called, so a
// failed run never leaves a half-written file behind.
class OutputFile {
public:
    explicit OutputFile(const std::string& path);
    ~OutputFile();
    int fd() const { return mFd; }
    const std::string& path() const { return mPath; }
    // Closes the descriptor (reporting a failed close) and keeps the file.
    void commit();

private:
    std::string mPath;
    int mFd;
    bool mCommitted = false;
};

}  // namespace qnedit

#endif
