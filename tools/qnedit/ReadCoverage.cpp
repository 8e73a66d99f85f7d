#include "ReadCoverage.h"

#include <algorithm>
#include <cstdio>

#include "Cli.h"

namespace qnedit {

namespace {

// Below this a shortfall is rounding in the container's durations, not damage.
constexpr int64_t kSlackUs = 100000;

}  // namespace

void ReadCoverage::saw(size_t track, int64_t timeUs) {
    Track& t = mTracks[track];
    if (t.prevUs >= 0 && timeUs > t.prevUs) {
        const int64_t step = timeUs - t.prevUs;
        if (t.even && t.stepUs > 0 && step > t.stepUs + t.stepUs / 2) {
            noteDamage(t.prevUs + t.stepUs, "unreadable frames up to " + formatSeconds(timeUs) + " were skipped");
        }
        if (t.stepUs == 0 || !t.even) t.stepUs = std::max(t.stepUs, step);
    }
    if (t.firstUs < 0) t.firstUs = timeUs;
    t.prevUs = timeUs;
    t.lastUs = std::max(t.lastUs, timeUs);
}

void ReadCoverage::reached(size_t track, int64_t endUs) {
    Track& t = mTracks[track];
    t.endUs = std::max(t.endUs, endUs);
}

void ReadCoverage::expectReach(size_t track, int64_t wantUs) {
    const Track& t = mTracks[track];
    // One sample of unknown length tells nothing about where the track ends.
    if (t.lastUs >= 0 && t.stepUs == 0 && t.endUs < 0) return;
    const int64_t reached = std::max(t.endUs, t.lastUs < 0 ? 0 : t.lastUs + t.stepUs);
    if (wantUs - reached > std::max(kSlackUs, 2 * t.stepUs)) {
        noteDamage(std::max<int64_t>(0, reached), "track " + std::to_string(track) + " ends there, " + formatSeconds(wantUs) +
                                                      " expected");
    }
}

void ReadCoverage::noteDamage(int64_t atUs, const std::string& cause) {
    if (mDamageUs >= 0 && mDamageUs <= atUs) return;
    mDamageUs = atUs;
    mCause = cause;
}

std::string ReadCoverage::describe(const std::string& path) const {
    if (mDamageUs < 0) return "";
    return path + ": input is damaged after " + formatSeconds(mDamageUs) + ": " + mCause;
}

void ReadCoverage::report(const std::string& path, bool salvage) const {
    if (mDamageUs < 0) return;
    const std::string line = describe(path);
    if (!salvage) inputError(line + " (--salvage keeps what could be read)");
    fprintf(stderr, "qnedit: warning: %s; keeping what could be read\n", line.c_str());
}

}  // namespace qnedit
