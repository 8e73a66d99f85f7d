#ifndef PLATFORM_OGG_OGG_CHAIN_H_
#define PLATFORM_OGG_OGG_CHAIN_H_

#include <cstdint>
#include <memory>
#include <vector>

#include <media/stagefright/DataSource.h>

#include "ogg/VorbisHeaders.h"

namespace android {

// One Vorbis stream of a chained Ogg file: streams joined end to end, each
// with its own serial number and headers (RFC 3533, section 4), as `cat` of
// two files or an internet radio dump gives.
struct OggLink {
    int serial = 0;
    off64_t audioStart = 0;  // first page after the link's headers
    off64_t end = 0;         // first byte after the link
    int64_t base = 0;        // samples of the links before this one
    int64_t samples = -1;    // the link's last granule position; -1: none found
};

// The links of an Ogg file that one track can carry: the first and those
// after it whose packets decode alike. Found on open by walking the pages
// (their headers and CRCs), with memory for the links only.
class OggChain {
public:
    // At most this many links are read; the rest is refused.
    static constexpr size_t kMaxLinks = 4096;

    static std::shared_ptr<const OggChain> Scan(const sp<DataSource>& source, const VorbisHeaders& first);

    const std::vector<OggLink>& links() const { return mLinks; }
    // Samples of every link together; -1 when the first has no timed page.
    int64_t totalSamples() const;
    // The link that holds output sample `sample` (the last for one past the end).
    size_t linkAt(int64_t sample) const;
    // What reading past the last link gives: ERROR_END_OF_STREAM, or
    // ERROR_UNSUPPORTED when a link follows that this track cannot carry.
    status_t endStatus() const { return mEndStatus; }
    // How long the Vorbis links after the last one carried last: the file's
    // duration counts them, so a reader that stops early can tell.
    int64_t unreadUs() const { return mUnreadUs; }

private:
    OggChain() = default;
    std::vector<OggLink> mLinks;
    status_t mEndStatus = 0;
    int64_t mUnreadUs = 0;
};

}  // namespace android

#endif
