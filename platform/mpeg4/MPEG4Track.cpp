#define LOG_TAG "MPEG4Track"
#include "mpeg4/MPEG4Track.h"

#include <algorithm>
#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/MPEG4Box.h"
#include "mpeg4/MPEG4SampleEntry.h"

namespace android {
namespace mpeg4 {

namespace {

constexpr int64_t kMaxTime = INT64_MAX / 4;
constexpr uint32_t kMaxSampleSize = 64 * 1024 * 1024;

status_t Malformed(const char* what) {
    ALOGW("malformed track: %s", what);
    return ERROR_MALFORMED;
}

struct TrackHeader {
    uint32_t trackId = 0;
    int32_t rotation = 0;
};

// Degrees clockwise from the matrix {a b u; c d v; x y w} (ISO/IEC 14496-12,
// 8.3.2); anything but a quarter-turn multiple counts as no rotation.
int32_t RotationOf(int32_t a, int32_t b, int32_t c, int32_t d) {
    if (a == 0 && d == 0) {
        if (b > 0 && c < 0) return 90;
        if (b < 0 && c > 0) return 270;
    } else if (b == 0 && c == 0 && a < 0 && d < 0) {
        return 180;
    }
    return 0;
}

bool ReadTrackHeader(ByteReader r, TrackHeader* h) {
    uint8_t version;
    uint32_t flags;
    if (!ReadFullBoxHeader(&r, &version, &flags)) return false;
    if (!r.skip(version == 1 ? 16 : 8) || !r.be32(&h->trackId) || !r.skip(4) ||
        !r.skip(version == 1 ? 8 : 4) || !r.skip(16)) {
        return false;
    }
    uint32_t m[9];
    for (uint32_t& v : m) {
        if (!r.be32(&v)) return false;
    }
    h->rotation = RotationOf(int32_t(m[0]), int32_t(m[1]), int32_t(m[3]), int32_t(m[4]));
    return true;
}

struct MediaHeader {
    uint32_t timescale = 0;
    uint64_t duration = 0;  // 0 when unknown
    char language[4] = "und";
};

bool ReadMediaHeader(ByteReader r, MediaHeader* h) {
    uint8_t version;
    uint32_t flags;
    uint16_t language;
    if (!ReadFullBoxHeader(&r, &version, &flags) || !r.skip(version == 1 ? 16 : 8) || !r.be32(&h->timescale)) {
        return false;
    }
    if (version == 1) {
        if (!r.be64(&h->duration)) return false;
        if (h->duration == UINT64_MAX) h->duration = 0;
    } else {
        uint32_t duration;
        if (!r.be32(&duration)) return false;
        h->duration = duration == UINT32_MAX ? 0 : duration;
    }
    if (!r.be16(&language)) return false;
    // ISO 639-2/T code, three 5-bit letters offset by 0x60.
    char code[4] = {char(((language >> 10) & 0x1F) + 0x60), char(((language >> 5) & 0x1F) + 0x60),
                    char((language & 0x1F) + 0x60), 0};
    if (code[0] >= 'a' && code[0] <= 'z' && code[1] >= 'a' && code[1] <= 'z' && code[2] >= 'a' && code[2] <= 'z') {
        memcpy(h->language, code, sizeof(code));
    }
    return true;
}

status_t ReadSampleTables(const ByteReader& stbl, SampleTable* table) {
    struct {
        uint32_t type;
        status_t (SampleTable::*set)(ByteReader);
    } const kTables[] = {
        {FourCC('s', 't', 's', 'c'), &SampleTable::setSampleToChunk},
        {FourCC('s', 't', 't', 's'), &SampleTable::setTimeToSample},
        {FourCC('c', 't', 't', 's'), &SampleTable::setCompositionOffsets},
        {FourCC('s', 't', 's', 's'), &SampleTable::setSyncSamples},
    };
    ByteReader box(nullptr, 0);
    status_t err = OK;
    for (const auto& t : kTables) {
        if (FindChild(stbl, t.type, &box) && (err = (table->*t.set)(box)) != OK) return err;
    }
    for (uint32_t type : {FourCC('s', 't', 's', 'z'), FourCC('s', 't', 'z', '2')}) {
        if (FindChild(stbl, type, &box)) {
            if ((err = table->setSampleSizes(type, box)) != OK) return err;
            break;
        }
    }
    for (uint32_t type : {FourCC('s', 't', 'c', 'o'), FourCC('c', 'o', '6', '4')}) {
        if (FindChild(stbl, type, &box)) {
            if ((err = table->setChunkOffsets(type, box)) != OK) return err;
            break;
        }
    }
    return table->finish();
}

int32_t ClampToInt32(uint64_t v) { return v > INT32_MAX ? INT32_MAX : static_cast<int32_t>(v); }

// Counts what the source will hand out, in play order, and finds the first
// sample whose bytes lie past the end of the file: from the index alone, so
// that a probe need not read the media data.
void SetIndexFacts(uint64_t fileSize, Track* track) {
    const SampleTable& table = track->table;
    int64_t samples = 0, syncs = 0;
    SampleCursor cursor(table);
    bool truncated = false;
    for (const Segment& seg : track->segments) {
        samples += seg.end - seg.begin;
        syncs += table.syncPositionFrom(seg.end) - table.syncPositionFrom(seg.begin);
        if (truncated) continue;
        for (cursor.seek(seg.begin); cursor.valid() && cursor.index() < seg.end; cursor.advance()) {
            const SampleInfo& s = cursor.info();
            if (s.offset > fileSize || s.size > fileSize - s.offset) {
                track->meta->setInt64(kKeyTruncatedAtUs, std::max<int64_t>(0, track->decodingUs(s, seg)));
                truncated = true;
                break;
            }
        }
    }
    track->meta->setInt64(kKeySampleCount, samples);
    track->meta->setInt64(kKeySyncSampleCount, syncs);
}

}  // namespace

int64_t SignedTicksToUs(int64_t ticks, uint32_t timescale) {
    if (timescale == 0) return 0;
    __int128 scaled = static_cast<__int128>(ticks) * 1000000;
    scaled += ticks < 0 ? -static_cast<__int128>(timescale / 2) : static_cast<__int128>(timescale / 2);
    const __int128 us = scaled / timescale;
    if (us > kMaxTime) return kMaxTime;
    if (us < -kMaxTime) return -kMaxTime;
    return static_cast<int64_t>(us);
}

status_t ParseTrack(const ByteReader& trak, Track* track) {
    ByteReader box(nullptr, 0), mdia(nullptr, 0), minf(nullptr, 0), stbl(nullptr, 0);
    TrackHeader tkhd;
    if (!FindChild(trak, FourCC('t', 'k', 'h', 'd'), &box) || !ReadTrackHeader(box, &tkhd)) {
        return Malformed("no usable tkhd");
    }
    if (!FindChild(trak, FourCC('m', 'd', 'i', 'a'), &mdia)) return Malformed("no mdia");
    uint8_t version;
    uint32_t flags, predefined, handler;
    if (!FindChild(mdia, FourCC('h', 'd', 'l', 'r'), &box) || !ReadFullBoxHeader(&box, &version, &flags) ||
        !box.be32(&predefined) || !box.be32(&handler)) {
        return Malformed("no usable hdlr");
    }
    if (handler != FourCC('v', 'i', 'd', 'e') && handler != FourCC('s', 'o', 'u', 'n')) return ERROR_UNSUPPORTED;

    MediaHeader mdhd;
    if (!FindChild(mdia, FourCC('m', 'd', 'h', 'd'), &box) || !ReadMediaHeader(box, &mdhd) || mdhd.timescale == 0) {
        return Malformed("no usable mdhd");
    }
    if (!FindChild(mdia, FourCC('m', 'i', 'n', 'f'), &minf) || !FindChild(minf, FourCC('s', 't', 'b', 'l'), &stbl) ||
        !FindChild(stbl, FourCC('s', 't', 's', 'd'), &box)) {
        return Malformed("no sample description");
    }
    MetaData* meta = track->meta.get();
    CodecInfo codec;
    status_t err = ParseSampleDescription(box, meta, &codec);
    if (err != OK) return err;
    if ((err = ReadSampleTables(stbl, &track->table)) != OK) return err;

    ByteReader edts(nullptr, 0);
    if (FindChild(trak, FourCC('e', 'd', 't', 's'), &edts) && FindChild(edts, FourCC('e', 'l', 's', 't'), &box) &&
        (err = ReadEditList(box, &track->edits)) != OK) {
        return err;
    }
    track->trackId = tkhd.trackId;
    track->timescale = mdhd.timescale;
    track->nalLengthSize = codec.nalLengthSize;
    track->isAudio = codec.isAudio;
    track->mediaDuration = mdhd.duration <= uint64_t(kMaxTime) ? mdhd.duration : 0;
    track->avgBitrate = codec.avgBitrate;
    meta->setInt32(kKeyTrackID, static_cast<int32_t>(tkhd.trackId));
    meta->setCString(kKeyMediaLanguage, mdhd.language);
    if (codec.isVideo && tkhd.rotation != 0) meta->setInt32(kKeyRotation, tkhd.rotation);
    return OK;
}

status_t FinishTrack(uint32_t movieTimescale, uint64_t fileSize, Track* track) {
    const SampleTable& table = track->table;
    if (table.maxSampleSize() > kMaxSampleSize) return Malformed("sample larger than 64 MB");
    EditLayout layout;
    const status_t err =
        LayOutEdits(track->edits, movieTimescale, track->timescale, table, track->isAudio, &layout);
    if (err != OK) return err;
    track->segments = std::move(layout.segments);
    std::vector<Edit>().swap(track->edits);

    int64_t durationUs = layout.durationUs;
    if (durationUs < 0) {
        // The media header of a fragmented file covers the movie box's samples only.
        const int64_t ticks = track->mediaDuration > 0 && !track->fragmented
                                  ? static_cast<int64_t>(track->mediaDuration)
                                  : std::max(static_cast<int64_t>(track->mediaDuration), table.endDts());
        durationUs = SignedTicksToUs(ticks, track->timescale);
    }
    MetaData* meta = track->meta.get();
    meta->setInt64(kKeyDuration, durationUs);
    SetIndexFacts(fileSize, track);

    // A start code is 4 bytes, so shorter length prefixes grow the sample.
    uint64_t maxInput = table.maxSampleSize();
    const uint32_t lengthSize = track->nalLengthSize;
    if (lengthSize > 0) maxInput = (maxInput * 4 + lengthSize - 1) / lengthSize;
    meta->setInt32(kKeyMaxInputSize, ClampToInt32(maxInput));

    const int64_t mediaUs = SignedTicksToUs(table.endDts(), track->timescale);
    if (track->avgBitrate > 0) {
        meta->setInt32(kKeyBitRate, ClampToInt32(track->avgBitrate));
    } else if (mediaUs > 0) {
        const __int128 bits = static_cast<__int128>(table.totalBytes()) * 8 * 1000000 / mediaUs;
        meta->setInt32(kKeyBitRate, bits > INT32_MAX ? INT32_MAX : static_cast<int32_t>(bits));
    }
    return OK;
}

}  // namespace mpeg4
}  // namespace android
