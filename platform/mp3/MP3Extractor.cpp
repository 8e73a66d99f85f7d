#define LOG_TAG "MP3Extractor"
#include "mp3/MP3Extractor.h"

#include <vector>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

#include "extractor/ID3v2Tag.h"
#include "extractor/SeekPolicy.h"
#include "extractor/Sniffers.h"
#include "mp3/MP3Source.h"
#include "mp3/MP3Tags.h"

namespace android {

namespace {

// How far past the tags in front the first frame may start: encoders and
// taggers leave a little padding, not more.
constexpr off64_t kSyncSearchBytes = 64 * 1024;
// The decoder's own delay, which LAME's stated delay leaves out.
constexpr int32_t kDecoderDelay = 529;
// The largest layer III frame: 320 kbit/s at 32 kHz (MPEG-1), padded.
constexpr int32_t kMaxFrameBytes = 1441;

bool FindFirstFrame(const sp<DataSource>& source, off64_t searchBytes, MP3Layout* layout, MP3StreamInfo* info) {
    off64_t size = 0;
    if (source->getSize(&size) != OK) return false;
    const off64_t start = SkipID3v2Tags(source, 0);
    layout->end = MP3AudioEnd(source, size);
    if (start >= layout->end) return false;
    const off64_t first =
        FindMP3Frame(source, start, std::min(layout->end, start + searchBytes), layout->end, &layout->header);
    if (first < 0) return false;
    layout->firstFrame = first;
    std::vector<uint8_t> frame(layout->header.frameBytes);
    const ssize_t n = source->readAt(first, frame.data(), frame.size());
    if (n > 0 && ReadMP3InfoFrame(frame.data(), size_t(n), layout->header, info)) {
        layout->firstFrame = first + layout->header.frameBytes;
    }
    return true;
}

}  // namespace

sp<MP3Extractor> MP3Extractor::Create(const sp<DataSource>& source) {
    MP3Layout layout;
    MP3StreamInfo info;
    if (!FindFirstFrame(source, kSyncSearchBytes, &layout, &info)) {
        ALOGW("no MPEG audio layer III frames");
        return nullptr;
    }
    layout.frames = info.frames;
    if (info.frames > 0 && info.padding > kDecoderDelay) layout.trailingSamples = info.padding - kDecoderDelay;
    sp<MP3Extractor> extractor = new MP3Extractor(source, layout);
    const MP3FrameHeader& h = layout.header;
    MetaData* t = extractor->mTrackMeta.get();
    int64_t durationUs;
    if (info.frames > 0) {
        durationUs = TicksToUs(info.frames * h.samples, h.sampleRate);
    } else {
        // A constant bitrate is all there is to go by.
        durationUs = static_cast<int64_t>((layout.end - layout.firstFrame) * 8000000.0 / h.bitrate);
    }
    t->setInt64(kKeyDuration, durationUs);
    if (info.delay >= 0) t->setInt32(kKeyEncoderDelay, info.delay + kDecoderDelay);
    if (info.padding >= 0) t->setInt32(kKeyEncoderPadding, std::max(0, info.padding - kDecoderDelay));
    return extractor;
}

MP3Extractor::MP3Extractor(const sp<DataSource>& source, const MP3Layout& layout)
    : SingleTrackExtractor(MEDIA_MIMETYPE_AUDIO_MPEG), mSource(source), mLayout(layout) {
    mTrackMeta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_MPEG);
    mTrackMeta->setInt32(kKeySampleRate, static_cast<int32_t>(layout.header.sampleRate));
    mTrackMeta->setInt32(kKeyChannelCount, static_cast<int32_t>(layout.header.channels));
    mTrackMeta->setInt32(kKeyBitRate, static_cast<int32_t>(layout.header.bitrate));
    mTrackMeta->setInt32(kKeyMaxInputSize, kMaxFrameBytes);
}

sp<IMediaSource> MP3Extractor::createTrack() { return new MP3Source(mSource, mLayout, mTrackMeta); }

float SniffMP3(const sp<DataSource>& source) {
    MP3Layout layout;
    MP3StreamInfo info;
    // Frames at once (after any tags), so that other formats' data is not
    // searched for a stray sync word.
    return FindFirstFrame(source, 4, &layout, &info) ? 0.5f : 0.0f;
}

sp<IMediaExtractor> CreateMP3Extractor(const sp<DataSource>& source) { return MP3Extractor::Create(source); }

}  // namespace android
