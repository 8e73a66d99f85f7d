#define LOG_TAG "MPEG4Source"
#include "mpeg4/MPEG4Source.h"

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>

#include "mpeg4/MPEG4EditorKeys.h"
#include "mpeg4/NalLengthConverter.h"

namespace android {

using mpeg4::SampleInfo;
typedef MediaTrack::ReadOptions::SeekMode SeekMode;

MPEG4Source::MPEG4Source(const sp<DataSource>& source, const std::shared_ptr<const mpeg4::Track>& track,
                         off64_t fileSize)
    : mDataSource(source), mTrack(track), mFileSize(fileSize), mCursor(track->table) {
    mCursor.seek(0);
}

status_t MPEG4Source::start(MetaData*) {
    std::lock_guard<std::mutex> lock(mLock);
    mCursor.seek(0);
    mTargetTimeUs = -1;
    return OK;
}

status_t MPEG4Source::stop() {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<uint8_t>().swap(mScratch);
    return OK;
}

sp<MetaData> MPEG4Source::getFormat() { return mTrack->meta; }

int64_t MPEG4Source::syncTimeUs(uint32_t k) {
    mpeg4::SampleCursor probe(mTrack->table);
    probe.seek(mTrack->table.syncSample(k));
    return mTrack->presentationUs(probe.info());
}

// Sync samples are taken to be presented in decoding order, which holds for
// the closed groups of pictures that encoders write.
void MPEG4Source::seekLocked(int64_t timeUs, SeekMode mode) {
    const uint32_t syncs = mTrack->table.syncCount();
    mTargetTimeUs = -1;
    if (syncs == 0) {
        mCursor.seek(0);
        return;
    }
    // First sync sample presented after `timeUs`.
    uint32_t lo = 0, hi = syncs;
    while (lo < hi) {
        const uint32_t mid = lo + (hi - lo) / 2;
        if (syncTimeUs(mid) <= timeUs) {
            lo = mid + 1;
        } else {
            hi = mid;
        }
    }
    const uint32_t after = lo;
    uint32_t chosen = after > 0 ? after - 1 : 0;
    if (mode == MediaTrack::ReadOptions::SEEK_NEXT_SYNC) {
        chosen = (after > 0 && syncTimeUs(after - 1) == timeUs) ? after - 1 : after;
        if (chosen >= syncs) {
            mCursor.seek(mTrack->table.count());  // nothing at or after the time
            return;
        }
    } else if (mode == MediaTrack::ReadOptions::SEEK_CLOSEST_SYNC && after > 0 && after < syncs) {
        if (syncTimeUs(after) - timeUs < timeUs - syncTimeUs(after - 1)) chosen = after;
    } else if (mode == MediaTrack::ReadOptions::SEEK_CLOSEST) {
        mTargetTimeUs = timeUs;
    }
    mCursor.seek(mTrack->table.syncSample(chosen));
}

status_t MPEG4Source::read(MediaBufferBase** buffer, const MediaTrack::ReadOptions* options) {
    std::lock_guard<std::mutex> lock(mLock);
    *buffer = nullptr;
    int64_t seekTimeUs;
    SeekMode mode;
    if (options != nullptr && options->getSeekTo(&seekTimeUs, &mode)) seekLocked(seekTimeUs, mode);
    if (!mCursor.valid()) return ERROR_END_OF_STREAM;

    // The sample is used up whatever happens, so a bad one is skipped by the
    // next read.
    const SampleInfo sample = mCursor.info();
    mCursor.advance();
    MediaBufferBase* out = nullptr;
    const status_t err = readSampleLocked(sample, &out);
    if (err != OK) return err;

    MetaDataBase& meta = out->meta_data();
    meta.setInt64(kKeyTime, mTrack->presentationUs(sample));
    meta.setInt64(kKeyDecodingTime, mTrack->decodingUs(sample));
    meta.setInt32(kKeyIsSyncFrame, sample.sync ? 1 : 0);
    if (mTargetTimeUs >= 0) {
        meta.setInt64(kKeyTargetTime, mTargetTimeUs);
        mTargetTimeUs = -1;
    }
    *buffer = out;
    return OK;
}

status_t MPEG4Source::readSampleLocked(const SampleInfo& sample, MediaBufferBase** buffer) {
    if (sample.offset > uint64_t(mFileSize) || sample.size > uint64_t(mFileSize) - sample.offset) {
        ALOGW("sample at %llu (%u bytes) lies past the end of the file", (unsigned long long)sample.offset,
              sample.size);
        return ERROR_MALFORMED;
    }
    const size_t lengthSize = mTrack->nalLengthSize;
    const bool inPlace = lengthSize == 0 || lengthSize == 4;
    uint8_t* raw;
    MediaBuffer* out = nullptr;
    if (inPlace) {
        out = new MediaBuffer(sample.size);
        if (sample.size > 0 && out->data() == nullptr) {
            out->release();
            return NO_MEMORY;
        }
        raw = static_cast<uint8_t*>(out->data());
    } else {
        mScratch.resize(sample.size);
        raw = mScratch.data();
    }
    const ssize_t n = sample.size > 0 ? mDataSource->readAt(sample.offset, raw, sample.size) : 0;
    if (n != static_cast<ssize_t>(sample.size)) {
        ALOGW("short read of a sample (%zd of %u bytes)", n, sample.size);
        if (out != nullptr) out->release();
        return n < 0 ? static_cast<status_t>(n) : ERROR_IO;
    }
    if (lengthSize == 0) {
        *buffer = out;
        return OK;
    }
    size_t annexBSize;
    if (!mpeg4::AnnexBSize(raw, sample.size, lengthSize, &annexBSize)) {
        ALOGW("NAL unit length overruns a %u-byte sample", sample.size);
        if (out != nullptr) out->release();
        return mpeg4::kEditorErrorCorruptNal;
    }
    if (!inPlace) {
        out = new MediaBuffer(annexBSize);
        if (annexBSize > 0 && out->data() == nullptr) {
            out->release();
            return NO_MEMORY;
        }
    }
    mpeg4::ToAnnexB(raw, sample.size, lengthSize, static_cast<uint8_t*>(out->data()));
    *buffer = out;
    return OK;
}

}  // namespace android
