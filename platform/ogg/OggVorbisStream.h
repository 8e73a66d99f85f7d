#ifndef PLATFORM_OGG_OGG_VORBIS_STREAM_H_
#define PLATFORM_OGG_OGG_VORBIS_STREAM_H_

#include <cstdint>
#include <deque>
#include <memory>
#include <vector>

#include <ogg/ogg.h>

#include "extractor/SeekPolicy.h"
#include "ogg/OggChain.h"
#include "ogg/OggPageReader.h"
#include "ogg/VorbisHeaders.h"

namespace android {

// An audio packet with the samples its decoding yields (Vorbis I, section
// 4.3.8: a quarter of the previous block plus a quarter of this one).
struct VorbisPacket {
    std::vector<uint8_t> data;
    int64_t start = 0;  // first output sample, from the granule positions
    int64_t end = 0;
    int32_t valid = 0;  // samples to keep: fewer where the granule position trims the stream
};

// The audio packets of the Vorbis stream, page by page, stamped from the
// granule positions; the links of a chained file follow one another on one
// time line. Packets whose place cannot be worked out (right after a seek or
// a gap) are dropped. Holds one page of packets at a time.
class OggVorbisStream {
public:
    // Largest audio packet handed out.
    static constexpr size_t kMaxPacketBytes = 64 * 1024;

    OggVorbisStream(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
                    const std::shared_ptr<const OggChain>& chain);
    ~OggVorbisStream();

    // ERROR_END_OF_STREAM after the last packet, or the chain's end status.
    status_t peek(const VorbisPacket** packet);
    void pop() { mReady.pop_front(); }
    // Positions the stream so that the next packet is the one the mode picks.
    status_t seek(int64_t timeUs, SeekMode mode);

private:
    struct Pending {
        std::vector<uint8_t> data;
        int64_t samples;  // -1: not known
    };

    void restart(size_t link, off64_t offset, bool atLinkStart);
    // Moves on to the next link; false after the last.
    bool nextLink();
    status_t readPage();
    void takePackets(std::vector<Pending>* packets);
    void stamp(std::vector<Pending>* packets, int64_t granule, bool lastPage);
    // The last page of the current link whose granule position is at most
    // `target` (counted within the link).
    bool findPageBefore(int64_t target, off64_t* offset);
    const OggLink& link() const { return mChain->links()[mLink]; }

    const std::shared_ptr<const VorbisHeaders> mHeaders;
    const std::shared_ptr<const OggChain> mChain;
    size_t mLink;
    OggPageReader mReader;
    ogg_stream_state mStream;
    std::deque<VorbisPacket> mReady;
    long mPreviousBlock;  // 0: not known
    bool mFresh;          // nothing read since the start of the stream
    int64_t mLastEnd;     // where the packets read so far end in the link; -1: not known
    bool mEnded;
    status_t mEndStatus;
};

}  // namespace android

#endif
