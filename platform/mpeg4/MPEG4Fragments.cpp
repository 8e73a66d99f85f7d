#define LOG_TAG "MPEG4Fragments"
#include "mpeg4/MPEG4Fragments.h"

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/MPEG4Box.h"

namespace android {
namespace mpeg4 {

namespace {

// 'tfhd' flags (ISO/IEC 14496-12, 8.8.7.1).
constexpr uint32_t kBaseDataOffset = 0x000001;
constexpr uint32_t kDescriptionIndex = 0x000002;
constexpr uint32_t kDefaultDuration = 0x000008;
constexpr uint32_t kDefaultSize = 0x000010;
constexpr uint32_t kDefaultFlags = 0x000020;
constexpr uint32_t kDurationIsEmpty = 0x010000;
constexpr uint32_t kDefaultBaseIsMoof = 0x020000;
// 'trun' flags (8.8.8.1).
constexpr uint32_t kDataOffset = 0x000001;
constexpr uint32_t kFirstSampleFlags = 0x000004;
constexpr uint32_t kSampleDuration = 0x000100;
constexpr uint32_t kSampleSize = 0x000200;
constexpr uint32_t kSampleFlags = 0x000400;
constexpr uint32_t kSampleCtsOffset = 0x000800;

status_t Malformed(const char* what) {
    ALOGW("malformed movie fragment: %s", what);
    return ERROR_MALFORMED;
}

// Sample flags (8.8.3.1): sample_depends_on in bits 24-25, where 1 means it
// depends on others, and sample_is_non_sync_sample in bit 16.
bool IsSync(uint32_t flags) { return ((flags >> 16) & 1) == 0 && ((flags >> 24) & 3) != 1; }

}  // namespace

bool ReadMovieExtends(const ByteReader& mvex, std::vector<TrackExtends>* defaults) {
    BoxIterator it(mvex);
    while (it.next()) {
        if (it.header().type != FourCC('t', 'r', 'e', 'x')) continue;
        ByteReader r = it.payload();
        uint8_t version;
        uint32_t flags, descriptionIndex;
        TrackExtends t;
        if (!ReadFullBoxHeader(&r, &version, &flags) || !r.be32(&t.trackId) || !r.be32(&descriptionIndex) ||
            !r.be32(&t.duration) || !r.be32(&t.size) || !r.be32(&t.flags)) {
            return false;
        }
        defaults->push_back(t);
    }
    return !it.malformed();
}

// What a 'tfhd' (and 'trex') says about one track fragment.
struct FragmentReader::TrackFragment {
    uint32_t trackId = 0;
    uint64_t base = 0;
    uint32_t duration = 0;
    uint32_t size = 0;
    uint32_t flags = 0;
};

status_t FragmentReader::addFragment(const ByteReader& moof, uint64_t moofOffset,
                                     const std::vector<std::shared_ptr<Track>>& tracks) {
    BoxIterator it(moof);
    bool first = true;
    uint64_t dataEnd = moofOffset;
    while (it.next()) {
        if (it.header().type != FourCC('t', 'r', 'a', 'f')) continue;
        const status_t err = addTrackFragment(it.payload(), moofOffset, first, &dataEnd, tracks);
        if (err != OK) return err;
        first = false;
    }
    return it.malformed() ? Malformed("a box does not fit in its 'moof'") : OK;
}

status_t FragmentReader::addTrackFragment(const ByteReader& traf, uint64_t moofOffset, bool first,
                                          uint64_t* dataEnd, const std::vector<std::shared_ptr<Track>>& tracks) {
    ByteReader r(nullptr, 0);
    uint8_t version;
    uint32_t flags, ignored;
    TrackFragment tf;
    if (!FindChild(traf, FourCC('t', 'f', 'h', 'd'), &r) || !ReadFullBoxHeader(&r, &version, &flags) ||
        !r.be32(&tf.trackId)) {
        return Malformed("no usable 'tfhd'");
    }
    for (const TrackExtends& d : mDefaults) {
        if (d.trackId != tf.trackId) continue;
        tf.duration = d.duration;
        tf.size = d.size;
        tf.flags = d.flags;
    }
    // Where offsets count from when the header does not say: the 'moof' for
    // the first track fragment, else where the previous one's data ended.
    tf.base = (flags & kDefaultBaseIsMoof) || first ? moofOffset : *dataEnd;
    if (((flags & kBaseDataOffset) && !r.be64(&tf.base)) || ((flags & kDescriptionIndex) && !r.be32(&ignored)) ||
        ((flags & kDefaultDuration) && !r.be32(&tf.duration)) || ((flags & kDefaultSize) && !r.be32(&tf.size)) ||
        ((flags & kDefaultFlags) && !r.be32(&tf.flags))) {
        return Malformed("short 'tfhd'");
    }
    if (flags & kDurationIsEmpty) return OK;

    Track* track = nullptr;
    for (const auto& t : tracks) {
        if (t->trackId == tf.trackId) track = t.get();
    }
    int64_t dts = track != nullptr ? track->table.endDts() : 0;
    if (FindChild(traf, FourCC('t', 'f', 'd', 't'), &r)) {
        uint64_t decodeTime = 0;
        uint32_t time32 = 0;
        if (!ReadFullBoxHeader(&r, &version, &flags)) return Malformed("short 'tfdt'");
        if (version == 1 ? !r.be64(&decodeTime) : !r.be32(&time32)) return Malformed("short 'tfdt'");
        if (version != 1) decodeTime = time32;
        if (decodeTime > uint64_t(INT64_MAX / 4)) return Malformed("'tfdt' out of range");
        dts = static_cast<int64_t>(decodeTime);
    }

    uint64_t dataAt = tf.base;
    BoxIterator it(traf);
    while (it.next()) {
        if (it.header().type != FourCC('t', 'r', 'u', 'n')) continue;
        const status_t err = addRun(it.payload(), tf, &dataAt, &dts, track);
        *dataEnd = dataAt;
        if (err != OK) return err;
    }
    return it.malformed() ? Malformed("a box does not fit in its 'traf'") : OK;
}

status_t FragmentReader::addRun(ByteReader r, const TrackFragment& tf, uint64_t* dataAt, int64_t* dts,
                                Track* track) {
    uint8_t version;
    uint32_t flags, count, firstFlags = 0;
    uint32_t dataOffset = 0;
    if (!ReadFullBoxHeader(&r, &version, &flags) || !r.be32(&count)) return Malformed("short 'trun'");
    if ((flags & kDataOffset) && !r.be32(&dataOffset)) return Malformed("short 'trun'");
    if ((flags & kFirstSampleFlags) && !r.be32(&firstFlags)) return Malformed("short 'trun'");
    const uint32_t fields = !!(flags & kSampleDuration) + !!(flags & kSampleSize) + !!(flags & kSampleFlags) +
                            !!(flags & kSampleCtsOffset);
    // Samples given wholly by defaults take no bytes here, so bound them by
    // what the file could hold.
    if (fields > 0 ? !r.has(uint64_t(count) * fields * 4) : count > mFileSize) {
        return Malformed("more samples than the 'trun' or the file holds");
    }
    if (count > SampleTable::kMaxSamples) return Malformed("more samples than are held in memory");
    if (flags & kDataOffset) {
        const int64_t at = static_cast<int64_t>(tf.base) + static_cast<int32_t>(dataOffset);
        if (tf.base > uint64_t(INT64_MAX / 2) || at < 0) return Malformed("data offset before the file");
        *dataAt = static_cast<uint64_t>(at);
    }

    const uint64_t start = *dataAt;
    uint64_t at = start;
    bool truncated = false;
    mRun.clear();
    mRun.reserve(count);
    for (uint32_t i = 0; i < count; ++i) {
        FragmentSample s;
        uint32_t sampleFlags = i == 0 && (flags & kFirstSampleFlags) ? firstFlags : tf.flags;
        uint32_t cto = 0;
        s.duration = tf.duration;
        s.size = tf.size;
        if (flags & kSampleDuration) r.be32(&s.duration);
        if (flags & kSampleSize) r.be32(&s.size);
        if (flags & kSampleFlags) r.be32(&sampleFlags);
        if (flags & kSampleCtsOffset) r.be32(&cto);
        // Version 0 declares the offset unsigned; as with 'ctts', writers
        // store negative ones there too.
        s.ctsOffset = static_cast<int32_t>(cto);
        s.sync = IsSync(sampleFlags);
        if (at > mFileSize || s.size > mFileSize - at) {
            truncated = true;
            break;
        }
        at += s.size;
        mRun.push_back(s);
    }
    *dataAt = at;
    if (truncated) ALOGW("fragment data at %llu runs past the end of the file", (unsigned long long)at);
    if (track != nullptr && !mRun.empty()) {
        const status_t err = track->table.appendRun(start, *dts, mRun);
        if (err != OK) return err;
        track->fragmented = true;
        *dts = track->table.endDts();
    }
    if (truncated) return ERROR_END_OF_STREAM;
    return OK;
}

}  // namespace mpeg4
}  // namespace android
