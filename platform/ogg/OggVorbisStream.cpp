#define LOG_TAG "OggExtractor"
#include "ogg/OggVorbisStream.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

namespace {
// A packet spanning pages is held whole; past this it is not Vorbis audio.
constexpr long kMaxBodyBytes = 1024 * 1024;
// Seeks halve the byte range down to this, then walk pages.
constexpr off64_t kLinearSpan = 64 * 1024;
// A probe gives up when no timed page follows within this span.
constexpr off64_t kProbeSpan = 256 * 1024;
}  // namespace

OggVorbisStream::OggVorbisStream(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
                                 const std::shared_ptr<const OggChain>& chain)
    : mHeaders(headers),
      mChain(chain),
      mLink(0),
      mReader(source),
      mPreviousBlock(0),
      mFresh(true),
      mLastEnd(-1),
      mEnded(false),
      mEndStatus(ERROR_END_OF_STREAM) {
    ogg_stream_init(&mStream, link().serial);
    restart(0, link().audioStart, true);
}

OggVorbisStream::~OggVorbisStream() { ogg_stream_clear(&mStream); }

void OggVorbisStream::restart(size_t index, off64_t offset, bool atLinkStart) {
    mLink = index;
    mReader.seek(offset);
    ogg_stream_reset_serialno(&mStream, link().serial);
    mReady.clear();
    mPreviousBlock = 0;
    mFresh = atLinkStart;
    mLastEnd = atLinkStart ? 0 : -1;
    mEnded = false;
    mEndStatus = ERROR_END_OF_STREAM;
}

bool OggVorbisStream::nextLink() {
    if (mLink + 1 >= mChain->links().size()) {
        mEnded = true;
        mEndStatus = mChain->endStatus();
        if (mEndStatus != ERROR_END_OF_STREAM) {
            ALOGE("the Ogg stream goes on with a link this track cannot carry");
        }
        return false;
    }
    // Packets already taken keep their times; the queue is not cleared.
    const size_t next = mLink + 1;
    mLink = next;
    mReader.seek(link().audioStart);
    ogg_stream_reset_serialno(&mStream, link().serial);
    mPreviousBlock = 0;
    mFresh = true;
    mLastEnd = 0;
    return true;
}

status_t OggVorbisStream::peek(const VorbisPacket** packet) {
    while (mReady.empty()) {
        if (mEnded) return mEndStatus;
        const status_t err = readPage();
        if (err != OK) return err;
    }
    *packet = &mReady.front();
    return OK;
}

void OggVorbisStream::takePackets(std::vector<Pending>* packets) {
    ogg_packet op;
    int got;
    while ((got = ogg_stream_packetout(&mStream, &op)) != 0) {
        if (got < 0) {
            ALOGW("gap in the packet sequence");
            mPreviousBlock = 0;
            mFresh = false;
            continue;
        }
        if (op.bytes == 0) continue;  // empty packets decode to nothing
        const long block = mHeaders->blockSize(&op);
        if (block <= 0 || static_cast<size_t>(op.bytes) > kMaxPacketBytes) {
            ALOGW("packet of %ld bytes is not Vorbis audio; dropped", op.bytes);
            mPreviousBlock = 0;
            mFresh = false;
            continue;
        }
        Pending p;
        p.data.assign(op.packet, op.packet + op.bytes);
        p.samples = mPreviousBlock > 0 ? mPreviousBlock / 4 + block / 4 : mFresh ? 0 : -1;
        mPreviousBlock = block;
        mFresh = false;
        packets->push_back(std::move(p));
    }
}

void OggVorbisStream::stamp(std::vector<Pending>* packets, int64_t granule, bool lastPage) {
    const size_t n = packets->size();
    std::vector<int64_t> ends(n, -1);
    bool allKnown = true;
    for (const Pending& p : *packets) allKnown = allKnown && p.samples >= 0;
    int64_t forward = mLastEnd;
    for (size_t i = 0; forward >= 0 && allKnown && i < n; ++i) forward += (*packets)[i].samples;
    // The last page may end the stream inside its last packet (Vorbis I,
    // A.2); otherwise the page's granule position is the end of its last
    // packet, and earlier packets end where the next one starts.
    const bool trimEnd = lastPage && granule >= 0 && forward > granule;
    if (trimEnd || (granule < 0 && forward >= 0)) {
        int64_t end = mLastEnd;
        for (size_t i = 0; i < n; ++i) ends[i] = end += (*packets)[i].samples;
    } else if (granule >= 0) {
        int64_t end = granule;
        for (size_t i = n; i-- > 0;) {
            ends[i] = end;
            if ((*packets)[i].samples < 0) break;
            end -= (*packets)[i].samples;
        }
    }
    for (size_t i = 0; i < n; ++i) {
        Pending& p = (*packets)[i];
        if (ends[i] < 0 || p.samples < 0) continue;  // no place on the time line
        VorbisPacket out;
        out.end = ends[i];
        out.start = ends[i] - p.samples;
        // Samples before 0 (a stream that starts with a trim) and past the
        // final granule position are not kept.
        const int64_t keepEnd = lastPage && granule >= 0 ? std::min(out.end, granule) : out.end;
        out.valid = static_cast<int32_t>(std::clamp<int64_t>(keepEnd - std::max<int64_t>(out.start, 0), 0, p.samples));
        out.start = std::max<int64_t>(out.start, 0) + link().base;
        out.end += link().base;
        out.data = std::move(p.data);
        mReady.push_back(std::move(out));
    }
    if (granule >= 0) {
        mLastEnd = granule;
    } else {
        mLastEnd = forward;
    }
}

status_t OggVorbisStream::readPage() {
    for (;;) {
        ogg_page page;
        off64_t offset;
        const status_t err = mReader.nextPage(&page, &offset);
        if (err == ERROR_END_OF_STREAM || (err == OK && offset >= link().end)) {
            nextLink();
            return OK;
        }
        if (err != OK) return err;
        if (ogg_page_serialno(&page) != link().serial) continue;
        if (ogg_stream_pagein(&mStream, &page) != 0) continue;
        if (mStream.body_fill - mStream.body_returned > kMaxBodyBytes) {
            ALOGW("packet spans more than %ld bytes", kMaxBodyBytes);
            return ERROR_MALFORMED;
        }
        std::vector<Pending> packets;
        takePackets(&packets);
        stamp(&packets, ogg_page_granulepos(&page), ogg_page_eos(&page) != 0);
        if (ogg_page_eos(&page)) nextLink();
        return OK;
    }
}

bool OggVorbisStream::findPageBefore(int64_t target, off64_t* found) {
    // The first timed page of the stream at or after `from`.
    auto probe = [&](off64_t from, off64_t* offset, int64_t* granule) {
        mReader.seek(from);
        ogg_page page;
        while (mReader.nextPage(&page, offset) == OK && *offset - from < kProbeSpan) {
            if (ogg_page_serialno(&page) != link().serial) continue;
            *granule = ogg_page_granulepos(&page);
            if (*granule >= 0) return true;
        }
        return false;
    };
    off64_t low = link().audioStart, high = link().end;
    bool have = false;
    while (high - low > kLinearSpan) {
        const off64_t mid = low + (high - low) / 2;
        off64_t offset;
        int64_t granule;
        if (probe(mid, &offset, &granule) && granule <= target) {
            low = offset;
            *found = offset;
            have = true;
        } else {
            high = mid;
        }
    }
    mReader.seek(low);
    ogg_page page;
    off64_t offset;
    while (mReader.nextPage(&page, &offset) == OK && offset < link().end) {
        if (ogg_page_serialno(&page) != link().serial) continue;
        const int64_t granule = ogg_page_granulepos(&page);
        if (granule > target) break;
        if (granule >= 0) {
            *found = offset;
            have = true;
        }
        if (ogg_page_eos(&page)) break;
    }
    return have;
}

status_t OggVorbisStream::seek(int64_t timeUs, SeekMode mode) {
    const int64_t target = static_cast<int64_t>(
        SeekUnitIndex(timeUs, mHeaders->sampleRate(), 1, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC));
    const size_t index = mChain->linkAt(target);
    const OggLink& at = mChain->links()[index];
    mLink = index;  // the link findPageBefore searches
    off64_t page;
    // Packets that complete on the page found end at or before the target,
    // and they give the block size that the next packet's count needs.
    if (target > at.base && findPageBefore(target - at.base, &page)) {
        restart(index, page, false);
    } else {
        restart(index, at.audioStart, true);
        // From the link's start: its priming packet comes first.
        if (target == at.base) return OK;
    }
    const uint32_t rate = mHeaders->sampleRate();
    for (;;) {
        const VorbisPacket* packet;
        const status_t err = peek(&packet);
        if (err != OK) return err == ERROR_END_OF_STREAM ? OK : err;
        if (packet->end <= target) {
            pop();
            continue;
        }
        if (packet->start >= target) return OK;
        // The packet holds the target: it, or the one that starts at its end.
        if (SeekPrefersLater(timeUs, TicksToUs(packet->start, rate), TicksToUs(packet->end, rate), mode)) pop();
        return OK;
    }
}

}  // namespace android
