#define LOG_TAG "FLACRawSource"
#include "flac/FLACRawSource.h"

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

namespace {
// Below this span a seek walks frame by frame instead of halving.
constexpr off64_t kLinearSpan = 64 * 1024;
}

FLACRawSource::FLACRawSource(const sp<DataSource>& source, const FLACMetadata& meta, const sp<MetaData>& format)
    : TrackSource(format),
      mScanner(source, meta.streamInfo, meta.firstFrameOffset),
      mSampleRate(meta.streamInfo.sampleRate),
      mNext(meta.firstFrameOffset) {}

int64_t FLACRawSource::timeOf(const FLACFrame& frame) const { return TicksToUs(frame.firstSample, mSampleRate); }

status_t FLACRawSource::readNext(MediaBufferBase** out) {
    FLACFrame frame;
    status_t err = mScanner.findFrame(mNext, &frame);
    if (err != OK) return err;
    MediaBuffer* buffer = NewSampleBuffer(frame.size, timeOf(frame));
    if (buffer == nullptr) return NO_MEMORY;
    *out = buffer;
    err = mScanner.copyFrame(frame, static_cast<uint8_t*>(buffer->data()));
    if (err != OK) return err;
    mNext = frame.offset + static_cast<off64_t>(frame.size);
    return OK;
}

status_t FLACRawSource::seekTo(int64_t timeUs, SeekMode mode) {
    const uint64_t target = SeekUnitIndex(timeUs, mSampleRate, 1, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC);
    // Halve the byte range while keeping a frame that starts at or before the
    // target at `low`.
    off64_t low = mScanner.firstFrameOffset(), high = mScanner.endOffset();
    FLACFrame frame;
    while (high - low > kLinearSpan) {
        const off64_t mid = low + (high - low) / 2;
        const status_t err = mScanner.findFrame(mid, &frame);
        if (err == OK && frame.firstSample <= target) {
            low = frame.offset;
        } else if (err == OK || err == ERROR_END_OF_STREAM) {
            high = mid;
        } else {
            return err;
        }
    }
    FLACFrame current;
    status_t err = mScanner.findFrame(low, &current);
    if (err == ERROR_END_OF_STREAM) {
        mNext = mScanner.endOffset();
        return OK;
    }
    if (err != OK) return err;
    FLACFrame next;
    for (;;) {
        err = mScanner.findFrame(current.offset + static_cast<off64_t>(current.size), &next);
        if (err != OK && err != ERROR_END_OF_STREAM) return err;
        if (err != OK || next.firstSample > target) break;
        current = next;
    }
    const bool haveNext = err == OK;
    const bool pastEnd = !haveNext && target >= current.firstSample + current.blockSize;
    const bool later = pastEnd || SeekPrefersLater(timeUs, timeOf(current), haveNext ? timeOf(next) : INT64_MAX, mode);
    if (!later) {
        mNext = current.offset;
    } else {
        mNext = haveNext ? next.offset : mScanner.endOffset();
    }
    return OK;
}

}  // namespace android
