#include "ReadCoverage.h"

#include <algorithm>
#include <cstdio>

#include "Cli.h"

namespace qnedit {

namespace {

// Below this a shortfall is rounding in the container's durations, not damage.
constexpr int64_t kSlackUs = 100000;

std::string seconds(int64_t us) {
    char text[32];
    snprintf(text, sizeof(text), "%.2f s", us / 1e6);
    return text;
}

}  // namespace

void ReadCoverage::saw(size_t track, int64_t timeUs) {
    Track& t = mTracks[track];
    if (t.prevUs >= 0 && timeUs > t.prevUs) {
        const int64_t step = timeUs - t.prevUs;
        if (t.even && t.stepUs > 0 && step > t.stepUs + t.stepUs / 2) {
            noteDamage(t.prevUs + t.stepUs, "unreadable frames up to " + seconds(timeUs) + " were skipped");
        }
        if (t.stepUs == 0 || !t.even) t.stepUs = std::max(t.stepUs, step);
    }
    if (t.firstUs < 0) t.firstUs = timeUs;
    t.prevUs = timeUs;
    t.lastUs = std::max(t.lastUs, timeUs);
}

void ReadCoverage::expectReach(size_t track, int64_t wantUs) {
    const Track& t = mTracks[track];
    const int64_t reached = t.lastUs < 0 ? 0 : t.lastUs + t.stepUs;
    if (wantUs - reached > std::max(kSlackUs, 2 * t.stepUs)) {
        noteDamage(std::max<int64_t>(0, reached), "track " + std::to_string(track) + " ends there, " + seconds(wantUs) +
                                                      " expected");
    }
}

void ReadCoverage::noteDamage(int64_t atUs, const std::string& cause) {
    if (mDamageUs >= 0 && mDamageUs <= atUs) return;
    mDamageUs = atUs;
    mCause = cause;
}

void ReadCoverage::report(const std::string& path, bool salvage) const {
    if (mDamageUs < 0) return;
    const std::string line = path + ": input is damaged after " + seconds(mDamageUs) + ": " + mCause;
    if (!salvage) inputError(line + " (--salvage keeps what could be read)");
    fprintf(stderr, "qnedit: warning: %s; keeping what could be read\n", line.c_str());
}

}  // namespace qnedit
