#define LOG_TAG "OggExtractor"
#include "ogg/OggChain.h"

#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "ogg/OggPageReader.h"

namespace android {

namespace {

// Walks the pages of `link` from its audio on: sets link->end to the start
// of the next link (or the end of the data) and link->samples to the link's
// last granule position. Returns whether a page that opens a new stream
// follows. Every link starts with such a page, and streams grouped with a
// link open before its audio starts, so the first one after is a new link;
// that holds even where `cat` of one file twice repeats the serial number.
bool FindLinkEnd(OggPageReader* reader, OggLink* link) {
    reader->seek(link->audioStart);
    ogg_page page;
    off64_t offset;
    bool ended = false;
    while (reader->nextPage(&page, &offset) == OK) {
        if (ogg_page_bos(&page)) {
            link->end = offset;
            return true;
        }
        if (ended || ogg_page_serialno(&page) != link->serial) continue;
        if (ogg_page_granulepos(&page) >= 0) link->samples = ogg_page_granulepos(&page);
        ended = ogg_page_eos(&page) != 0;
    }
    link->end = reader->size();
    return false;
}

// How long the Vorbis links from `start` on last, each at its own rate: what
// a file holds beyond the links one track can carry. Links that are not
// Vorbis count for nothing.
int64_t UnreadUs(OggPageReader* reader, const sp<DataSource>& source, off64_t start) {
    int64_t us = 0;
    for (size_t n = 0; n < OggChain::kMaxLinks; ++n) {
        VorbisHeaders headers;
        if (headers.read(source, start) != OK || headers.sampleRate() == 0) return us;
        OggLink link;
        link.serial = headers.serial();
        link.audioStart = headers.audioStart();
        const bool more = FindLinkEnd(reader, &link);
        if (link.samples > 0) us += link.samples * 1000000 / headers.sampleRate();
        if (!more) return us;
        start = link.end;
    }
    return us;
}

}  // namespace

std::shared_ptr<const OggChain> OggChain::Scan(const sp<DataSource>& source, const VorbisHeaders& first) {
    std::shared_ptr<OggChain> chain(new (std::nothrow) OggChain);
    if (chain == nullptr) return nullptr;
    chain->mEndStatus = ERROR_END_OF_STREAM;
    OggPageReader reader(source);
    OggLink link;
    link.serial = first.serial();
    link.audioStart = first.audioStart();
    for (;;) {
        const bool more = FindLinkEnd(&reader, &link);
        chain->mLinks.push_back(link);
        if (!more) break;
        OggLink next;
        next.base = link.base + (link.samples > 0 ? link.samples : 0);
        VorbisHeaders headers;
        if (headers.read(source, link.end) != OK) {
            ALOGW("Ogg link %zu at %lld is not Vorbis", chain->mLinks.size() + 1, (long long)link.end);
            chain->mEndStatus = ERROR_UNSUPPORTED;
            break;
        }
        if (!headers.decodesLike(first)) {
            // One track has one set of codec headers: packets decoded with
            // the first link's would come out wrong.
            ALOGW("Ogg link %zu changes the Vorbis stream (%u Hz, %d channels; first %u Hz, %d channels)",
                  chain->mLinks.size() + 1, headers.sampleRate(), headers.channels(), first.sampleRate(),
                  first.channels());
            chain->mEndStatus = ERROR_UNSUPPORTED;
            chain->mUnreadUs = UnreadUs(&reader, source, link.end);
            break;
        }
        if (chain->mLinks.size() == kMaxLinks) {
            ALOGW("more than %zu Ogg links; the rest is not read", kMaxLinks);
            chain->mEndStatus = ERROR_UNSUPPORTED;
            break;
        }
        next.serial = headers.serial();
        next.audioStart = headers.audioStart();
        link = next;
    }
    return chain;
}

int64_t OggChain::totalSamples() const {
    const OggLink& last = mLinks.back();
    if (mLinks.size() == 1) return last.samples;
    return last.base + (last.samples > 0 ? last.samples : 0);
}

size_t OggChain::linkAt(int64_t sample) const {
    size_t i = 0;
    while (i + 1 < mLinks.size() && mLinks[i + 1].base <= sample) ++i;
    return i;
}

}  // namespace android
