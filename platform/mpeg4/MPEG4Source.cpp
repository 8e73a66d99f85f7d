#define LOG_TAG "MPEG4Source"
#include "mpeg4/MPEG4Source.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/NalLengthConverter.h"

namespace android {

using mpeg4::SampleInfo;

MPEG4Source::MPEG4Source(const sp<DataSource>& source, const std::shared_ptr<const mpeg4::Track>& track,
                         off64_t fileSize)
    : TrackSource(track->meta), mDataSource(source), mTrack(track), mFileSize(fileSize), mCursor(track->table) {
    const mpeg4::SampleTable& table = track->table;
    mSyncBase.reserve(track->segments.size() + 1);
    mSyncBase.push_back(0);
    for (const mpeg4::Segment& seg : track->segments) {
        mSyncBase.push_back(mSyncBase.back() + table.syncPositionFrom(seg.end) - table.syncPositionFrom(seg.begin));
    }
}

status_t MPEG4Source::onStart() {
    startSegment(0, mTrack->segments.empty() ? 0 : mTrack->segments[0].begin);
    mTargetTimeUs = -1;
    return OK;
}

void MPEG4Source::startSegment(size_t segment, uint32_t sample) {
    mSegment = segment;
    mCursor.seek(sample);
}

void MPEG4Source::syncAt(uint64_t position, size_t* segment, uint32_t* sample) const {
    const size_t s = static_cast<size_t>(std::upper_bound(mSyncBase.begin(), mSyncBase.end(), position) -
                                         mSyncBase.begin()) - 1;
    const mpeg4::SampleTable& table = mTrack->table;
    *segment = s;
    *sample = table.syncSample(static_cast<uint32_t>(table.syncPositionFrom(mTrack->segments[s].begin) +
                                                     (position - mSyncBase[s])));
}

int64_t MPEG4Source::syncTimeUs(uint64_t position) const {
    size_t segment;
    uint32_t sample;
    syncAt(position, &segment, &sample);
    mpeg4::SampleCursor probe(mTrack->table);
    probe.seek(sample);
    return mTrack->presentationUs(probe.info(), mTrack->segments[segment]);
}

// Sync samples are taken to be presented in decoding order, which holds for
// the closed groups of pictures that encoders write, and segments one after
// another.
status_t MPEG4Source::seekTo(int64_t timeUs, SeekMode mode) {
    const uint64_t syncs = syncCount();
    mTargetTimeUs = mode == MediaTrack::ReadOptions::SEEK_CLOSEST ? timeUs : -1;
    // The first sync sample presented after the time.
    uint64_t after = 0, hi = syncs;
    while (after < hi) {
        const uint64_t mid = after + (hi - after) / 2;
        if (syncTimeUs(mid) <= timeUs) {
            after = mid + 1;
        } else {
            hi = mid;
        }
    }
    uint64_t chosen = 0;
    if (after == syncs && syncs > 0) {
        chosen = syncs - 1;
        if (mode == MediaTrack::ReadOptions::SEEK_NEXT_SYNC && syncTimeUs(chosen) < timeUs) {
            startSegment(mTrack->segments.size(), 0);  // nothing at or after the time
            return OK;
        }
    } else if (after > 0) {
        const SeekMode rule = mode == MediaTrack::ReadOptions::SEEK_CLOSEST ? MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC
                                                                            : mode;
        chosen = SeekPrefersLater(timeUs, syncTimeUs(after - 1), syncTimeUs(after), rule) ? after : after - 1;
    }
    if (syncs == 0) {
        // A track without sync samples starts over from its first sample.
        startSegment(0, mTrack->segments.empty() ? 0 : mTrack->segments[0].begin);
        return OK;
    }
    size_t segment;
    uint32_t sample;
    syncAt(chosen, &segment, &sample);
    startSegment(segment, sample);
    return OK;
}

status_t MPEG4Source::readNext(MediaBufferBase** buffer) {
    const std::vector<mpeg4::Segment>& segments = mTrack->segments;
    while (mSegment < segments.size() && mCursor.index() >= segments[mSegment].end) {
        if (++mSegment < segments.size()) mCursor.seek(segments[mSegment].begin);
    }
    if (mSegment >= segments.size() || !mCursor.valid()) return ERROR_END_OF_STREAM;
    const mpeg4::Segment& segment = segments[mSegment];
    // The sample is used up whatever happens, so a bad one is skipped by the
    // next read.
    const SampleInfo sample = mCursor.info();
    mCursor.advance();
    MediaBuffer* out = nullptr;
    const status_t err = readSample(sample, mTrack->presentationUs(sample, segment), &out);
    if (err != OK) return err;

    MetaDataBase& meta = out->meta_data();
    meta.setInt64(kKeyDecodingTime, mTrack->decodingUs(sample, segment));
    meta.setInt32(kKeyIsSyncFrame, sample.sync ? 1 : 0);
    if (mTargetTimeUs >= 0) {
        meta.setInt64(kKeyTargetTime, mTargetTimeUs);
        mTargetTimeUs = -1;
    }
    *buffer = out;
    return OK;
}

status_t MPEG4Source::readSample(const SampleInfo& sample, int64_t timeUs, MediaBuffer** buffer) {
    if (sample.offset > uint64_t(mFileSize) || sample.size > uint64_t(mFileSize) - sample.offset) {
        ALOGW("sample at %llu (%u bytes) lies past the end of the file", (unsigned long long)sample.offset,
              sample.size);
        return ERROR_MALFORMED;
    }
    status_t err = OK;
    MediaBuffer* out = mDataSource->readBuffer(static_cast<off64_t>(sample.offset), sample.size, &err);
    if (out == nullptr) {
        ALOGW("cannot read a sample of %u bytes at %llu (%d)", sample.size, (unsigned long long)sample.offset, err);
        return err;
    }
    out->meta_data().setInt64(kKeyTime, timeUs);
    const size_t lengthSize = mTrack->nalLengthSize;
    if (lengthSize == 0) {
        *buffer = out;
        return OK;
    }
    uint8_t* raw = static_cast<uint8_t*>(out->data());
    size_t annexBSize;
    if (!mpeg4::AnnexBSize(raw, sample.size, lengthSize, &annexBSize)) {
        ALOGW("NAL unit length overruns a %u-byte sample", sample.size);
        out->release();
        return kErrorCorruptNal;
    }
    if (lengthSize == 4) {
        // A 4-byte prefix turns into a start code in place.
        mpeg4::ToAnnexB(raw, sample.size, lengthSize, raw);
        *buffer = out;
        return OK;
    }
    // Shorter prefixes grow the sample, which is rebuilt in a buffer of its own.
    MediaBuffer* grown = NewSampleBuffer(annexBSize, timeUs);
    if (grown == nullptr) {
        out->release();
        return NO_MEMORY;
    }
    mpeg4::ToAnnexB(raw, sample.size, lengthSize, static_cast<uint8_t*>(grown->data()));
    out->release();
    *buffer = grown;
    return OK;
}

}  // namespace android
