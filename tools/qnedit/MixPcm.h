#ifndef QNEDIT_MIX_PCM_H
#define QNEDIT_MIX_PCM_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <media/stagefright/foundation/AMessage.h>

#include "ReadCoverage.h"

namespace qnedit {

// Interleaved PCM as the mixer takes it: 8 (unsigned), 16 or 24-bit.
struct PcmLayout {
    int32_t rate = 0, channels = 0, bits = 16;
    int frameBytes() const { return channels * (bits / 8); }
    int64_t durationUs(size_t bytes) const { return pcmDurationUs(bytes, frameBytes(), rate); }
};

struct PcmChunk {
    std::vector<uint8_t> bytes;
    int64_t timeUs = 0;
};

// One audio track of a file as PCM, in order: read as stored when it is PCM
// (WAV, FLAC), decoded otherwise. What the reading showed of damage is kept
// in coverage().
class PcmReader {
public:
    virtual ~PcmReader() = default;
    // The next chunk; false at the end, or at damage (noted in coverage()).
    virtual bool next(PcmChunk* chunk) = 0;
    const PcmLayout& layout() const { return mLayout; }
    // The track's format as a PCM writer takes it.
    const android::sp<android::AMessage>& format() const { return mFormat; }
    bool decoded() const { return mDecoded; }
    int64_t durationUs() const { return mDurationUs; }
    const ReadCoverage& coverage() const { return mCoverage; }

protected:
    PcmLayout mLayout;
    android::sp<android::AMessage> mFormat;
    bool mDecoded = false;
    int64_t mDurationUs = -1;
    ReadCoverage mCoverage;
};

// The audio track `track` of `path` (its first audio track when negative).
// A file that cannot be read or mixed ends the command with an input error.
std::unique_ptr<PcmReader> openPcmReader(const std::string& path, long track = -1);

}  // namespace qnedit

#endif
