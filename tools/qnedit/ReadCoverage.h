#ifndef QNEDIT_READ_COVERAGE_H
#define QNEDIT_READ_COVERAGE_H

#include <cstdint>
#include <map>
#include <string>

namespace qnedit {

// How far the samples read from an input reached, per track, against how far
// they should have. The wrapper ends a track quietly when a read fails (a
// truncated file, a damaged frame), so a short or interrupted track is the
// only sign of damage a command sees; this turns it into an error instead of
// a shorter output passed off as success.
class ReadCoverage {
public:
    // A sample of `track` presented at `timeUs` was read.
    void saw(size_t track, int64_t timeUs);
    // A sample read lasts up to `endUs` (known for PCM and fixed-size frames).
    void reached(size_t track, int64_t endUs);
    // Tracks of evenly spaced frames (FLAC): a jump means frames were skipped.
    void expectEvenSpacing(size_t track) { mTracks[track].even = true; }
    // The track's samples should reach `wantUs` (the requested end, or the
    // track's duration); a shortfall beyond a couple of frames is damage.
    void expectReach(size_t track, int64_t wantUs);
    // A read failed at `atUs`; the command stops reading there.
    void fail(int64_t atUs, const std::string& cause) { noteDamage(atUs, cause); }
    // Where the damage starts, or -1 if none was seen.
    int64_t damageUs() const { return mDamageUs; }
    // The one line naming the input and where the damage starts; empty if none.
    std::string describe(const std::string& path) const;
    // Fails the command with one line naming the input and where the damage
    // starts, or, when salvaging, prints a warning and lets it go on.
    void report(const std::string& path, bool salvage) const;

private:
    struct Track {
        int64_t firstUs = -1;
        int64_t lastUs = -1;   // latest presentation time read
        int64_t prevUs = -1;   // the previous sample's time, in read order
        int64_t stepUs = 0;    // the usual spacing
        int64_t endUs = -1;    // the furthest known end of a sample
        bool even = false;
    };
    void noteDamage(int64_t atUs, const std::string& cause);

    std::map<size_t, Track> mTracks;
    int64_t mDamageUs = -1;
    std::string mCause;
};

// How long `bytes` of PCM with `frameBytes` per sample frame last.
inline int64_t pcmDurationUs(size_t bytes, int frameBytes, int sampleRate) {
    return static_cast<int64_t>(bytes / frameBytes) * 1000000 / sampleRate;
}

}  // namespace qnedit

#endif
