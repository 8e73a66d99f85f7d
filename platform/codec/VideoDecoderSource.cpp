#define LOG_TAG "VideoDecoderSource"
#include <media/stagefright/VideoDecoderSource.h>

#include <algorithm>
#include <limits>
#include <new>
#include <vector>

#include <kvucmm/FrameConverter.h>
#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "codec/CodecConfig.h"
#include "codec/VideoDecoder.h"
#include "mpeg4/MPEG4Source.h"

namespace android {

namespace {

constexpr int64_t kNoTime = std::numeric_limits<int64_t>::min();
// Held pictures wait for the decoder to pass their time, and samples for
// their pictures; a stream that gives nothing but damage must not keep either
// growing.
constexpr size_t kMaxQueued = 16;
constexpr size_t kMaxAwaited = 64;
// A track refuses a broken sample and goes on to the next; one that refuses
// this many in a row has nothing left to give.
constexpr int kMaxRefusedInARow = 256;
constexpr int32_t kUnsaid = 2;  // ISO/IEC 23001-8 "unspecified"

// The primaries that go with a matrix, for streams that name only the
// matrix: the platform's colour standard is looked up by primaries.
int32_t PrimariesForMatrix(int32_t matrix) {
    switch (matrix) {
        case 1: return 1;             // BT.709
        case 5: return 5;             // BT.601 625
        case 6: return 6;             // BT.601 525
        case 9: case 10: return 9;    // BT.2020
        case 4: return 4;             // BT.470 M
        default: return kUnsaid;
    }
}

void SetColour(const MetaData& track, const VideoPicture& picture, MetaData* format) {
    int32_t range = picture.range, primaries = picture.primaries, transfer = picture.transfer,
            matrix = picture.matrix;
    // What the stream leaves unsaid, the track's 'colr' box may say.
    if (range < 0) track.findInt32(kKeyColorRange, &range);
    if (primaries == kUnsaid) track.findInt32(kKeyColorPrimaries, &primaries);
    if (transfer == kUnsaid) track.findInt32(kKeyTransferFunction, &transfer);
    if (matrix == kUnsaid) track.findInt32(kKeyColorMatrix, &matrix);
    if (primaries == kUnsaid) primaries = PrimariesForMatrix(matrix);
    if (range >= 0) format->setInt32(kKeyColorRange, range != 0);
    if (primaries != kUnsaid) format->setInt32(kKeyColorPrimaries, primaries);
    if (transfer != kUnsaid) format->setInt32(kKeyTransferFunction, transfer);
    if (matrix != kUnsaid) format->setInt32(kKeyColorMatrix, matrix);
}

void CopyInt32(const MetaData& from, uint32_t key, MetaData* to) {
    int32_t value;
    if (from.findInt32(key, &value)) to->setInt32(key, value);
}

sp<MetaData> BaseFormat(const MetaData& track) {
    sp<MetaData> format = new MetaData;
    format->setCString(kKeyMIMEType, MEDIA_MIMETYPE_VIDEO_RAW);
    format->setInt32(kKeyColorFormat, KVUCMM::kColorFormatYUV420Planar);
    for (uint32_t key : {kKeyWidth, kKeyHeight, kKeyRotation, kKeyTrackID}) CopyInt32(track, key, format.get());
    int64_t durationUs;
    if (track.findInt64(kKeyDuration, &durationUs)) format->setInt64(kKeyDuration, durationUs);
    return format;
}

sp<MetaData> PictureFormat(const MetaData& track, const VideoPicture& picture) {
    sp<MetaData> format = BaseFormat(track);
    format->setInt32(kKeyWidth, picture.stride);
    format->setInt32(kKeyHeight, picture.sliceHeight);
    format->setInt32(kKeyStride, picture.stride);
    format->setInt32(kKeySliceHeight, picture.sliceHeight);
    format->setRect(kKeyCropRect, picture.cropLeft, picture.cropTop, picture.cropRight, picture.cropBottom);
    SetColour(track, picture, format.get());
    return format;
}

bool SameFormat(const MetaData& a, const MetaData& b) {
    for (uint32_t key : {kKeyStride, kKeySliceHeight, kKeyColorRange, kKeyColorPrimaries, kKeyTransferFunction,
                         kKeyColorMatrix}) {
        int32_t x = -1, y = -1;
        if (a.findInt32(key, &x) != b.findInt32(key, &y) || x != y) return false;
    }
    int32_t r1[4] = {}, r2[4] = {};
    a.findRect(kKeyCropRect, &r1[0], &r1[1], &r1[2], &r1[3]);
    b.findRect(kKeyCropRect, &r2[0], &r2[1], &r2[2], &r2[3]);
    return std::equal(r1, r1 + 4, r2);
}

}  // namespace

struct VideoDecoderSource::Entry {
    int64_t timeUs;
    std::shared_ptr<VideoPicture> picture;
    bool held;  // stands in for a rejected sample
};

bool VideoDecoderSource::CanDecode(const char* mime) { return VideoCodecForMime(mime) != VideoCodec::kNone; }

sp<VideoDecoderSource> VideoDecoderSource::Create(const sp<IMediaSource>& track, const Limits& limits) {
    if (track == nullptr) return nullptr;
    const sp<MetaData> format = track->getFormat();
    if (format == nullptr) return nullptr;
    sp<VideoDecoderSource> source = new (std::nothrow) VideoDecoderSource(track, format, limits);
    if (source == nullptr || source->mDecoder == nullptr) return nullptr;
    return source;
}

VideoDecoderSource::VideoDecoderSource(const sp<IMediaSource>& track, const sp<MetaData>& trackFormat,
                                       const Limits& limits)
    : mTrack(track),
      mTrackFormat(trackFormat),
      mLimits(limits),
      mFormat(BaseFormat(*trackFormat)),
      mDecoder(VideoDecoder::Create(*trackFormat, limits.maxPixels, limits.threads)),
      mStarted(false),
      mInputEnded(false),
      mStartUs(0),
      mNewestUs(kNoTime),
      mLastOutUs(kNoTime),
      mRefusedInARow(0) {}

VideoDecoderSource::~VideoDecoderSource() {
    if (mStarted) stop();
}

status_t VideoDecoderSource::start(MetaData* params) {
    if (mStarted) return INVALID_OPERATION;
    status_t err = mTrack->start(params);
    if (err != OK) return err;
    mStarted = true;
    // Pictures an edit list hides (before time 0) are not shown.
    seekTo(0);
    err = fill(nullptr);
    if (err != OK && err != ERROR_END_OF_STREAM) {
        stop();
        return err;
    }
    if (!mQueue.empty()) mFormat = PictureFormat(*mTrackFormat, *mQueue.front().picture);
    return OK;
}

status_t VideoDecoderSource::stop() {
    if (!mStarted) return INVALID_OPERATION;
    mQueue.clear();
    mAwaited.clear();
    mLast.reset();
    mDecoder->flush();
    mStarted = false;
    return mTrack->stop();
}

sp<MetaData> VideoDecoderSource::getFormat() { return new MetaData(*mFormat); }

void VideoDecoderSource::seekTo(int64_t timeUs) {
    mQueue.clear();
    mAwaited.clear();
    mLast.reset();
    mDecoder->flush();
    mStartUs = timeUs;
    mDecoder->setSkipBefore(timeUs);
    mInputEnded = false;
    mNewestUs = kNoTime;
    mLastOutUs = kNoTime;
    mRefusedInARow = 0;
}

status_t VideoDecoderSource::read(MediaBufferBase** buffer, const ReadOptions* options) {
    *buffer = nullptr;
    if (!mStarted) return INVALID_OPERATION;
    int64_t seekUs;
    ReadOptions::SeekMode mode;
    ReadOptions fromSync;
    const ReadOptions* trackOptions = nullptr;
    if (options != nullptr && options->getSeekTo(&seekUs, &mode)) {
        seekTo(std::max<int64_t>(seekUs, 0));
        fromSync.setSeekTo(mStartUs, ReadOptions::SEEK_PREVIOUS_SYNC);
        trackOptions = &fromSync;
    }
    const status_t err = fill(trackOptions);
    if (err != OK) return err;
    const Entry& head = mQueue.front();
    sp<MetaData> format = PictureFormat(*mTrackFormat, *head.picture);
    if (!SameFormat(*format, *mFormat)) {
        mFormat = format;
        return INFO_FORMAT_CHANGED;
    }
    MediaBuffer* out = new (std::nothrow) MediaBuffer(head.picture->yuv);
    if (out == nullptr) return NO_MEMORY;
    out->add_ref();
    out->meta_data().setInt64(kKeyTime, head.timeUs);
    mLastOutUs = head.timeUs;
    mQueue.pop_front();
    *buffer = out;
    return OK;
}

bool VideoDecoderSource::headReady() const {
    return !mQueue.empty() && (mInputEnded || mQueue.front().timeUs <= mNewestUs || mQueue.size() > kMaxQueued);
}

void VideoDecoderSource::queue(Entry entry) {
    auto at = std::lower_bound(mQueue.begin(), mQueue.end(), entry.timeUs,
                               [](const Entry& e, int64_t t) { return e.timeUs < t; });
    if (at != mQueue.end() && at->timeUs == entry.timeUs) {
        // A picture the decoder made after all beats a held one.
        if (at->held && !entry.held) *at = std::move(entry);
        return;
    }
    mQueue.insert(at, std::move(entry));
}

void VideoDecoderSource::holdBefore(int64_t timeUs) {
    while (!mAwaited.empty() && *mAwaited.begin() < timeUs) {
        const int64_t missing = *mAwaited.begin();
        mAwaited.erase(mAwaited.begin());
        ALOGW("no picture for the video sample at %lld us: %s", (long long)missing,
              mLast != nullptr ? "the picture before is held" : "skipped");
        if (mLast != nullptr && missing > mLastOutUs) queue({missing, mLast, true});
    }
}

status_t VideoDecoderSource::fill(const ReadOptions* options) {
    std::vector<VideoPicture> pictures;
    for (;;) {
        if (headReady()) return OK;
        if (mInputEnded) return ERROR_END_OF_STREAM;
        MediaBufferBase* in = nullptr;
        status_t err = mTrack->read(&in, options);
        options = nullptr;
        pictures.clear();
        int64_t timeUs = kNoTime;
        if (err == ERROR_END_OF_STREAM) {
            mInputEnded = true;
            err = mDecoder->drain(&pictures);
        } else if (err == ERROR_MALFORMED || err == MPEG4Source::kErrorCorruptNal) {
            if (++mRefusedInARow > kMaxRefusedInARow) return err;
            ALOGW("the track refuses a video sample (%d): skipped", err);
            continue;
        } else if (err != OK) {
            return err;
        } else {
            mRefusedInARow = 0;
            in->meta_data().findInt64(kKeyTime, &timeUs);
            if (timeUs >= mStartUs) {
                mAwaited.insert(timeUs);
                if (mAwaited.size() > kMaxAwaited) holdBefore(*mAwaited.begin() + 1);
            }
            err = mDecoder->decode(static_cast<const uint8_t*>(in->data()) + in->range_offset(), in->range_length(),
                                   timeUs, &pictures);
            in->release();
        }
        // Pictures come in presentation order: a sample presented before one
        // that is still waiting will never give its own.
        for (VideoPicture& picture : pictures) {
            holdBefore(picture.timeUs);
            mAwaited.erase(picture.timeUs);
            mNewestUs = std::max(mNewestUs, picture.timeUs);
            mLast = std::make_shared<VideoPicture>(std::move(picture));
            if (mLast->timeUs > mLastOutUs) queue({mLast->timeUs, mLast, false});
        }
        if (mInputEnded) holdBefore(std::numeric_limits<int64_t>::max());
        if (err == ERROR_MALFORMED) {
            ALOGW("the codec rejects the video sample at %lld us", (long long)timeUs);
        } else if (err != OK) {
            // A layout with no 4:2:0 form, or no memory: no later picture will do better.
            return err;
        }
    }
}

}  // namespace android
