#ifndef QNEDIT_PROGRESS_H
#define QNEDIT_PROGRESS_H

#include <cstdint>
#include <string>

namespace qnedit {

// A one-line bar on stderr, drawn only when stderr is a terminal and the
// user did not ask for quiet; redrawn at most a few times a second.
class Progress {
public:
    Progress(const std::string& label, int64_t total);
    ~Progress();
    void update(int64_t done);
    void finish();

private:
    std::string mLabel;
    int64_t mTotal;
    bool mEnabled;
    bool mFinished = false;
    int mLastPercent = -1;
    int64_t mLastDrawUs = 0;
};

}  // namespace qnedit

#endif
