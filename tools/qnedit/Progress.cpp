#include "Progress.h"

#include <chrono>
#include <cstdio>
#include <unistd.h>

#include "Cli.h"

namespace qnedit {

namespace {
int64_t nowUs() {
    return std::chrono::duration_cast<std::chrono::microseconds>(
               std::chrono::steady_clock::now().time_since_epoch()).count();
}
}  // namespace

Progress::Progress(const std::string& label, int64_t total)
    : mLabel(label), mTotal(total > 0 ? total : 1), mEnabled(!gCommon.quiet && isatty(STDERR_FILENO)) {}

Progress::~Progress() { finish(); }

void Progress::update(int64_t done) {
    if (!mEnabled || mFinished) return;
    int percent = static_cast<int>(done * 100 / mTotal);
    percent = percent < 0 ? 0 : (percent > 100 ? 100 : percent);
    const int64_t now = nowUs();
    if (percent == mLastPercent || (now - mLastDrawUs < 100000 && percent != 100)) return;
    mLastPercent = percent;
    mLastDrawUs = now;
    const int width = 30;
    const int filled = percent * width / 100;
    fprintf(stderr, "\r%-10s [%.*s%*s] %3d%%", mLabel.c_str(), filled, "##############################",
            width - filled, "", percent);
    fflush(stderr);
}

void Progress::finish() {
    if (!mEnabled || mFinished) return;
    mFinished = true;
    if (mLastPercent >= 0) {
        fprintf(stderr, "\r%*s\r", 60, "");
        fflush(stderr);
    }
}

}  // namespace qnedit
