#define LOG_TAG "MPEG4EditList"
#include "mpeg4/MPEG4EditList.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/ExtractorRefusal.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/MPEG4Box.h"
#include "mpeg4/MPEG4Track.h"

namespace android {
namespace mpeg4 {

namespace {

constexpr int64_t kMaxTime = INT64_MAX / 4;
// Editors cut a recording into a handful of pieces; thousands of segments
// are a hostile file asking for its samples to be read over and over.
constexpr size_t kMaxSegments = 1024;
constexpr uint32_t kRateOne = 0x10000;  // 16.16 fixed point

status_t Malformed(const char* what) {
    ALOGW("malformed edit list: %s", what);
    return ERROR_MALFORMED;
}

// Movie ticks in media ticks, rounded up so that rounding never cuts a sample.
int64_t MediaTicks(uint64_t movieTicks, uint32_t movieTimescale, uint32_t mediaTimescale) {
    const __int128 t = (static_cast<__int128>(movieTicks) * mediaTimescale + movieTimescale - 1) / movieTimescale;
    return t > kMaxTime ? kMaxTime : static_cast<int64_t>(t);
}

// The first sample a segment from `mediaStart` hands out.
uint32_t SegmentBegin(const SampleTable& table, int64_t mediaStart, bool isAudio) {
    if (isAudio) {
        // The sample the edit starts in, and the one before it for the
        // decoder's overlap.
        const uint32_t after = table.firstAtOrAfterDts(mediaStart + 1);
        return after >= 2 ? after - 2 : 0;
    }
    // No sample decoded before this is presented at or after the start.
    const uint32_t first = table.firstAtOrAfterDts(mediaStart - table.maxCtsOffset());
    return first < table.count() ? table.syncAtOrBefore(first) : first;
}

}  // namespace

status_t ReadEditList(ByteReader r, std::vector<Edit>* edits) {
    uint8_t version;
    uint32_t flags, count;
    if (!ReadFullBoxHeader(&r, &version, &flags) || !r.be32(&count)) return Malformed("short elst");
    const uint64_t entryBytes = version == 1 ? 20 : 12;
    if (!r.has(uint64_t(count) * entryBytes)) return Malformed("more edits than the box holds");
    edits->clear();
    edits->reserve(count);
    uint64_t total = 0;
    for (uint32_t i = 0; i < count; ++i) {
        Edit e;
        if (version == 1) {
            uint64_t t = 0;
            r.be64(&e.duration);
            r.be64(&t);
            e.mediaTime = static_cast<int64_t>(t);
        } else {
            uint32_t d = 0, t = 0;
            r.be32(&d);
            r.be32(&t);
            e.duration = d;
            e.mediaTime = static_cast<int32_t>(t);
        }
        r.be32(&e.rate);
        if (e.duration > uint64_t(kMaxTime) || total + e.duration > uint64_t(kMaxTime)) {
            return Malformed("edit durations overflow");
        }
        total += e.duration;
        edits->push_back(e);
    }
    return OK;
}

status_t LayOutEdits(const std::vector<Edit>& edits, uint32_t movieTimescale, uint32_t mediaTimescale,
                     const SampleTable& table, bool isAudio, EditLayout* layout) {
    layout->segments.clear();
    layout->durationUs = -1;
    uint64_t at = 0;  // movie ticks before the current edit
    int64_t openEndUs = -1;
    uint32_t ignored = 0;
    for (size_t i = 0; i < edits.size(); ++i) {
        const Edit& e = edits[i];
        const uint64_t start = at;
        at += e.duration;
        if (e.mediaTime == -1) continue;
        const bool last = i + 1 == edits.size();
        if (e.duration == 0 && !last) continue;  // plays nothing
        if (e.mediaTime < 0 || e.mediaTime > kMaxTime || movieTimescale == 0) {
            // Not a time in the media: waited for like an empty edit.
            ++ignored;
            continue;
        }
        // An empty edit's rate means nothing; writers leave any value there.
        if (e.rate != kRateOne) {
            ALOGE("edit %zu plays at rate %d/65536; only rate 1 is supported", i, int32_t(e.rate));
            setRefusalReason("MP4 edit list with a media rate other than 1 is not supported");
            return ERROR_UNSUPPORTED;
        }
        if (layout->segments.size() == kMaxSegments) return Malformed("too many segments");
        Segment s;
        s.mediaStartTicks = e.mediaTime;
        s.startUs = SignedTicksToUs(static_cast<int64_t>(start), movieTimescale);
        s.begin = SegmentBegin(table, e.mediaTime, isAudio);
        if (e.duration == 0) {
            // Open-ended: the rest of the media.
            s.end = table.count();
            openEndUs = s.startUs + SignedTicksToUs(std::max<int64_t>(0, table.endDts() - e.mediaTime), mediaTimescale);
        } else {
            const int64_t mediaEnd = e.mediaTime + MediaTicks(e.duration, movieTimescale, mediaTimescale);
            // Frames presented before the end may be decoded after it when
            // composition offsets are negative.
            s.end = table.firstAtOrAfterDts(std::min(kMaxTime, mediaEnd - int64_t(table.minCtsOffset())));
        }
        if (s.begin < s.end) layout->segments.push_back(s);
    }
    if (ignored > 0) ALOGW("%u edits with no valid media time ignored", ignored);

    if (edits.size() == size_t(ignored) + size_t(std::count_if(edits.begin(), edits.end(),
                                                                [](const Edit& e) { return e.mediaTime == -1; }))) {
        // Nothing but empty edits (or none): the whole track, after them.
        const int64_t emptyUs = movieTimescale > 0 ? SignedTicksToUs(static_cast<int64_t>(at), movieTimescale) : 0;
        layout->segments.push_back({0, table.count(), 0, emptyUs});
    }
    if (openEndUs >= 0) {
        layout->durationUs = openEndUs;
    } else if (at > 0 && movieTimescale > 0) {
        layout->durationUs = SignedTicksToUs(static_cast<int64_t>(at), movieTimescale);
    }
    return OK;
}

}  // namespace mpeg4
}  // namespace android
